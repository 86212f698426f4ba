#pragma once

#include "printing/CPhoto.h"
#include "printing/CVdPrintout.h"

#include <QHash>
#include <QList>
#include <QMap>
#include <QPair>
#include <QRect>
#include <QSet>
#include <QStringList>
#include <QVector>

#include <functional>

class QSqlQuery;

// The daily report: its sections in a fixed order, captions left and content right, one or more
// reports per job with page numbers restarting for each.
class CVdPrintoutReport : public CVdPrintout
{
    Q_OBJECT
public:
    CVdPrintoutReport(QObject* parent, const QList<int>& entryIds);

    // False when nothing was written (cancelled, target not usable, or no reports).
    bool print(Output output, const QString& fileName, bool askForFileName, const QString& defaultDir);

    QString get_report_number() const;
    QString get_inspection_datime() const;
    QString get_page_number() const;
    QString get_weather(int entryId) const;

private:
    using Cells = QList<QList<CText>>;
    // One column of a section: a cell per row, its share of the content width and its alignment.
    struct Column
    {
        Cells cells;
        double factor = 1.0;
        int alignment = Qt::AlignLeft;
    };
    // One wrapped line of a cell, in the font it is drawn with.
    struct Line
    {
        QString text;
        QFont font;
        int height = 0;
        int descent = 0;
    };
    // A row laid out: per column its x, width, alignment and lines.
    struct RowLayout
    {
        QVector<int> x, width, alignment;
        QVector<QVector<Line>> lines;
    };

    void read_entry(int entryId);
    QString entry_text(int entryId, const char* column) const;
    QString getImagesCountText(int entryId, int type) const;
    // Rows with an existing company first, in pos order, then those without; 'row' gets the
    // company's text and the query positioned on the row.
    void company_rows(const QString& table, const QString& condition,
                      const std::function<void(const QString&, const QSqlQuery&)>& row) const;

    void get_attendee(int entryId, Cells& companies, Cells& comments) const;
    void get_workforce(int entryId, Cells& companies, Cells& persons, Cells& manHours, qint64& personSum,
                       double& manHourSum, bool& anyManHours) const;
    QString get_progress(int entryId) const;
    QString get_incidents(int entryId) const;
    void get_acceptance(int entryId, Cells& companies, Cells& texts) const;
    void get_defects(int entryId, Cells& companies, Cells& texts, Cells& dates) const;
    void get_advantage(int entryId, Cells& companies, Cells& texts, Cells& dates) const;
    void get_invalidities(int entryId, Cells& companies, Cells& texts, Cells& dates) const;
    void get_delay_rows(int entryId, int type, Cells& companies, Cells& texts, Cells& dates) const;
    void get_measures(int entryId, Cells& companies, Cells& texts, Cells& times) const;
    void get_tasks(int entryId, int type, Cells& companies, Cells& texts) const;
    QString get_interventions(int entryId) const;
    void get_concerns(int entryId, Cells& companies, Cells& texts) const;
    QString get_tests(int entryId) const;
    bool get_printStatus4TelephoneNotice(int entryId) const;
    void get_telephone_notice(int entryId, Cells& times, Cells& companies, Cells& texts) const;
    bool get_printStatus4Notice(int entryId) const;
    QString get_notice(int entryId) const;
    void get_materials(int entryId, Cells& companies, Cells& materials, Cells& amounts) const;
    void get_sample(int entryId, Cells& rows) const;
    void get_documents(int entryId, Cells& companies, Cells& texts, Cells& dates) const;
    void get_equipment(int entryId, Cells& equipment, Cells& zones, Cells& operating, Cells& down,
                       qint64& operatingSum, qint64& downSum) const;
    static QString reformatDate4Deficiencies(const QString& isoDate);
    static QString reformatDate4Delays(const QString& isoDate);
    static QString reformat_time(const QString& stored);

    void print_document(QPainter& painter);
    void draw_info(QPainter& painter);
    bool draw_table(QPainter& painter, const QString& caption, const QString& note, const Cells& rows);
    bool draw_table(QPainter& painter, const QString& caption, const QString& note, const Cells& companies,
                    const Cells& texts, int alignment = Qt::AlignLeft);
    bool draw_table(QPainter& painter, const QString& caption, const QString& note, const Cells& companies,
                    const Cells& texts, const Cells& third);
    bool drawTable4ThreeColumns(QPainter& painter, const QString& caption, const QString& note,
                                const Cells& first, const Cells& second, const Cells& third, double f1,
                                double f2, double f3);
    bool draw_table4Workforce(QPainter& painter, int entryId);
    bool draw_table4Equipment(QPainter& painter, int entryId);
    bool drawRichText(QPainter& painter, const QString& caption, const QString& note, const QString& stored);
    // The common frame of every table section: caption, emptiness rule, page breaks.
    int draw_caption(QPainter& painter, const QVector<Line>& captionLines);
    bool draw_section(QPainter& painter, const QString& caption, const QString& note,
                      const QList<Column>& columns);
    void draw_separator(QPainter& painter);
    void next_page(QPainter& painter);

    QRect cell_rect(const RowLayout& row, int column, int y, int height) const;
    QVector<Line> cell_lines(QPainter& painter, const QList<CText>& cell, const QFont& font, int width);
    RowLayout layout_row(QPainter& painter, const QList<Column>& columns, int row, const QVector<int>& x,
                         const QVector<int>& widths);
    QVector<Line> caption_lines(QPainter& painter, const QString& caption, const QString& note);
    void draw_cell(QPainter& painter, const RowLayout& row, int column, int from, int to, int y);
    void draw_row(QPainter& painter, const RowLayout& row);
    static int lines_height(const QVector<Line>& lines, int from, int to);
    bool checkCell4OrphanLines(const QVector<Line>& caption, const RowLayout* first) const;
    int checkCell4WidowLines(const QVector<Line>& lines, int from, int available) const;
    bool checkRow4OrphanLines(const RowLayout& row, int available) const;
    QVector<int> checkRow4WidowLines(const RowLayout& row, const QVector<int>& from, int available) const;
    bool checkRow4FormFeed(const RowLayout& row) const;
    qreal checkRichTextBlock4DrawOnPage(const QVector<QPair<qreal, qreal>>& lines, qreal end, qreal from,
                                        int available, bool pageTop) const;
    static bool is_empty(const Cells& cells);
    static bool is_empty(const QList<Column>& columns);

    QList<int> m_entryIds;
    int m_entryId = -1;
    QString m_number, m_userId, m_date, m_timeFrom, m_timeTo;
    int m_columnGap = 0, m_rowStep = 0, m_captionWidth = 0;
    QFont m_captionFont;
    bool m_drawing = false;
    // Wrapped lines per font, width and text: the drawing pass reuses what the measuring pass
    // laid out, which also keeps both passes' breaks identical.
    QHash<QString, QStringList> m_wrapped;
    int m_y = 0;
    bool m_drawnSinceSeparator = false;

    // Photo albums
public:
    static constexpr double ImagePageVerticalSpacingFactor = 0.3;
    // The layout code of each album page for photos in list order (true: portrait), and how many
    // photos a page of that code takes.
    static QList<int> album_layouts(const QList<bool>& portrait);
    static int album_page_photos(int code);
    // The photo slots of a page of that code inside 'area', in the order of the page's photos.
    static QVector<QRect> album_slots(int code, const QRect& area, int gap);
    void get_photos_info(int entryId, QMap<int, QList<CPhoto>>& progress, QMap<int, QList<CPhoto>>& defects,
                         QMap<int, QList<CPhoto>>& obstructions, QMap<int, QList<CPhoto>>& measures,
                         QMap<int, QList<CPhoto>>& materials);

private:
    struct AlbumPhoto
    {
        int pos = 0;
        int type = 0;
        QString caption, date, comment, company;
        QByteArray blob;
    };
    void drawAlbums(QPainter& painter);
    void drawAlbum(QPainter& painter, const QMap<int, QList<CPhoto>>& map, const QString& title);
    void drawAlbumTitle(QPainter& painter, const QString& title);
    void draw_photo_page1(QPainter& painter, int code, const QList<CPhoto>& photos, int first, int count);
    void draw_photo_page10(QPainter& painter, int code, const QList<CPhoto>& photos, int first, int count);
    void draw_photo_page(QPainter& painter, int code, const QList<CPhoto>& photos, int first, int count);
    void draw_photo(QPainter& painter, const QRect& slot, const CPhoto& photo, int number, int count);
    bool get_photo(int photoId, AlbumPhoto& photo) const;

    QMap<int, QList<CPhoto>> m_albumPhotos[5];
    QSet<int> m_albumPhotoIds[5];
};
