#pragma once

#include "printing/CVdPrintout.h"

#include <QList>
#include <QStringList>

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
};
