#pragma once

#include "printing/CPhoto.h"
#include "printing/CVdPrintout.h"

#include <QList>
#include <QMap>
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
    struct Section
    {
        QString caption;
        QStringList rows;
        bool separatorAfter = false;
    };
    QList<Section> read_sections(int entryId) const;
    QStringList company_rows(const QString& table, const QString& condition,
                             const std::function<QString(const QSqlQuery&)>& text) const;
    QString entry_text(int entryId, const char* column) const;
    QString getImagesCountText(int entryId, int type) const;
    void read_entry(int entryId);

    void print_document(QPainter& painter);
    void draw_info(QPainter& painter);
    bool draw_table(QPainter& painter, const Section& section);
    void draw_separator(QPainter& painter);
    void next_page(QPainter& painter);
    static bool is_empty(const QStringList& rows);

    QList<int> m_entryIds;
    int m_entryId = -1;
    QString m_number, m_userId, m_date, m_timeFrom, m_timeTo;
    int m_columnGap = 0, m_rowStep = 0, m_captionWidth = 0;
    QFont m_captionFont;
    bool m_drawing = false;
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
