#include "printing/CVdPrintoutReport.h"

#include "document/CVdShared.h"
#include "document/VDRDocument.h"
#include "document/VDRRichTextResources.h"
#include "printing/CVdTexts.h"

#include <QAbstractTextDocumentLayout>
#include <QFontMetrics>
#include <QLocale>
#include <QPainter>
#include <QPixmap>
#include <QRegularExpression>
#include <QSqlError>
#include <QSqlQuery>
#include <QTextBlock>
#include <QTextCursor>
#include <QTextDocument>
#include <QTextLayout>
#include <QTextObjectInterface>
#include <QTime>

#include <QUrl>
#include <limits>

#include <algorithm>
#include <cmath>

namespace {
QSqlDatabase db()
{
    return QSqlDatabase::database(VDRDocument::connectionName(), false);
}

QString text(int id)
{
    return CVdTexts::self()->text(id);
}

QString val(const QSqlQuery& q, const char* name)
{
    // Empty text columns hold a single blank.
    return q.value(QLatin1String(name)).toString().trimmed();
}

// Equipment durations are stored in minutes; any stored number prints, however absurd.
QString hours(qint64 minutes)
{
    const quint64 magnitude = minutes < 0 ? 0 - quint64(minutes) : quint64(minutes);
    return QStringLiteral("%1%2:%3")
        .arg(minutes < 0 ? QStringLiteral("-") : QString())
        .arg(magnitude / 60)
        .arg(magnitude % 60, 2, 10, QLatin1Char('0'));
}

// Sums of stored numbers stop at the ends of the range instead of wrapping.
void addTo(qint64& sum, qint64 value)
{
    if (__builtin_add_overflow(sum, value, &sum))
        sum = value > 0 ? std::numeric_limits<qint64>::max() : std::numeric_limits<qint64>::min();
}

QString joinNonEmpty(const QStringList& parts, const QString& sep)
{
    QStringList kept;
    for (const QString& p : parts)
        if (!p.trimmed().isEmpty())
            kept << p.trimmed();
    return kept.join(sep);
}

// The print texts of the section captions.
const int kCaptionIds[] = {0, 6, 7, 9, 24, 13, 15, 11, 12, 21, 18, 23, 19, 49, 22, 48, 47, 25, 30, 32, 59};

// A cell of one run, or an empty cell for a blank text.
QList<CText> cell(const QString& t)
{
    return t.trimmed().isEmpty() ? QList<CText>() : QList<CText>{CText(t.trimmed())};
}

void addRun(QList<CText>& c, const QString& t)
{
    if (!t.trimmed().isEmpty())
        c << CText(t.trimmed());
}

// Images wider than the column or taller than the body are scaled down so that they fit.
void fit_images(QTextDocument& doc, qreal maxWidth, qreal maxHeight)
{
    QTextObjectInterface* handler = doc.documentLayout()->handlerForObject(QTextFormat::ImageObject);
    if (!handler)
        return;
    QList<QPair<int, QTextImageFormat>> changes;
    for (QTextBlock block = doc.begin(); block.isValid(); block = block.next()) {
        for (auto it = block.begin(); !it.atEnd(); ++it) {
            const QTextFragment fragment = it.fragment();
            if (!fragment.isValid() || !fragment.charFormat().isImageFormat())
                continue;
            QTextImageFormat image = fragment.charFormat().toImageFormat();
            const QSizeF size = handler->intrinsicSize(&doc, fragment.position(), image);
            if (size.isEmpty())
                continue;
            const qreal factor = qMin(1.0, qMin(maxWidth / size.width(), maxHeight / size.height()));
            if (factor >= 1.0)
                continue;
            // Explicit sizes map linearly onto the laid-out size, which depends on the device.
            QTextImageFormat unit = image;
            unit.setWidth(100);
            unit.setHeight(100);
            const QSizeF perUnit = handler->intrinsicSize(&doc, fragment.position(), unit) / 100;
            if (perUnit.isEmpty())
                continue;
            image.setWidth(qMax(1.0, size.width() * factor / perUnit.width()));
            image.setHeight(qMax(1.0, size.height() * factor / perUnit.height()));
            for (int i = 0; i < fragment.length(); ++i)
                changes << qMakePair(fragment.position() + i, image);
        }
    }
    for (const auto& change : changes) {
        QTextCursor cursor(&doc);
        cursor.setPosition(change.first);
        cursor.setPosition(change.first + 1, QTextCursor::KeepAnchor);
        cursor.setCharFormat(change.second);
    }
}

// The vertical extent of every laid-out line, merged where lines overlap (table cells side by
// side, images): a page may only be cut between two of these.
QVector<QPair<qreal, qreal>> line_bands(const QTextDocument& doc)
{
    QVector<QPair<qreal, qreal>> lines;
    QAbstractTextDocumentLayout* layout = doc.documentLayout();
    for (QTextBlock block = doc.begin(); block.isValid(); block = block.next()) {
        const QTextLayout* text = block.layout();
        if (!text)
            continue;
        const QRectF rect = layout->blockBoundingRect(block);
        for (int i = 0; i < text->lineCount(); ++i) {
            const QTextLine line = text->lineAt(i);
            const qreal top = rect.top() + line.y();
            lines << qMakePair(top, top + line.height());
        }
    }
    std::sort(lines.begin(), lines.end());
    QVector<QPair<qreal, qreal>> bands;
    for (const auto& line : lines) {
        if (!bands.isEmpty() && line.first < bands.last().second - 0.01)
            bands.last().second = qMax(bands.last().second, line.second);
        else
            bands << line;
    }
    return bands;
}
} // namespace

CVdPrintoutReport::CVdPrintoutReport(QObject* parent, const QList<int>& entryIds)
    : CVdPrintout(parent, tr("Bautagesbericht")), m_entryIds(entryIds)
{
    printSignatureLine = true;
}

void CVdPrintoutReport::read_entry(int entryId)
{
    m_entryId = entryId;
    QSqlQuery q(db());
    q.prepare(QStringLiteral("SELECT number, user_id, inspection_date, inspection_time_from, "
                             "inspection_time_to FROM entry WHERE id=?"));
    q.addBindValue(entryId);
    q.exec();
    CVdShared::check_sql_error(q.lastError(), QStringLiteral("CVdPrintoutReport"),
                               QStringLiteral("read_entry"), __LINE__);
    const bool found = q.next();
    m_number = found ? val(q, "number") : QString();
    m_userId = found ? val(q, "user_id") : QString();
    m_date = found ? val(q, "inspection_date") : QString();
    m_timeFrom = found ? reformat_time(val(q, "inspection_time_from")) : QString();
    m_timeTo = found ? reformat_time(val(q, "inspection_time_to")) : QString();
}

QString CVdPrintoutReport::get_report_number() const
{
    const int bracket = m_number.indexOf(QLatin1Char('('));
    QString first = (bracket < 0 ? m_number : m_number.left(bracket)).trimmed();
    if (!m_userId.isEmpty())
        first += QLatin1Char('-') + m_userId;
    const QString rest = bracket < 0 ? QString() : m_number.mid(bracket);
    const QString format = text(39);
    if (!format.contains(QLatin1String("%2")))
        return format.arg(first);
    return format.arg(first, rest).trimmed();
}

QString CVdPrintoutReport::get_inspection_datime() const
{
    QString line = reformat_date(m_date);
    const QString times = joinNonEmpty({m_timeFrom, m_timeTo}, QStringLiteral(" - "));
    if (!times.isEmpty())
        line += QLatin1Char(' ') + times + QLatin1Char(' ') + text(4);
    return line;
}

QString CVdPrintoutReport::get_page_number() const
{
    QString label = text(40);
    label.replace(QStringLiteral("${page.cur}"), QString::number(currentPage));
    label.replace(QStringLiteral("${page.count}"), QString::number(pageCount));
    return label;
}

QString CVdPrintoutReport::get_weather(int entryId) const
{
    QSqlQuery q(db());
    q.prepare(QStringLiteral("SELECT env_time, env_weather1, env_weather2, env_weather3, env_temperature, "
                             "env_humidity FROM entry WHERE id=?"));
    q.addBindValue(entryId);
    q.exec();
    CVdShared::check_sql_error(q.lastError(), QStringLiteral("CVdPrintoutReport"),
                               QStringLiteral("get_weather"), __LINE__);
    if (!q.next())
        return QString();
    QString line = joinNonEmpty({val(q, "env_weather1"), val(q, "env_weather2"), val(q, "env_weather3")},
                                QStringLiteral(", "));
    const auto append = [&line](const QString& part) {
        if (!line.isEmpty())
            line += QStringLiteral(", ");
        line += part;
    };
    if (!val(q, "env_temperature").isEmpty())
        append(text(1).arg(val(q, "env_temperature")));
    if (!val(q, "env_humidity").isEmpty())
        append(text(2).arg(val(q, "env_humidity")));
    const QString time = reformat_time(val(q, "env_time"));
    if (!time.isEmpty() && !line.isEmpty())
        line += text(3).arg(time);
    return line;
}

QString CVdPrintoutReport::entry_text(int entryId, const char* column) const
{
    QSqlQuery q(db());
    q.prepare(QStringLiteral("SELECT %1 FROM entry WHERE id=?").arg(QLatin1String(column)));
    q.addBindValue(entryId);
    q.exec();
    CVdShared::check_sql_error(q.lastError(), QStringLiteral("CVdPrintoutReport"),
                               QStringLiteral("entry_text"), __LINE__);
    return q.next() ? q.value(0).toString() : QString();
}

QString CVdPrintoutReport::getImagesCountText(int entryId, int type) const
{
    QSqlQuery q(db());
    q.prepare(QStringLiteral("SELECT COUNT(*) FROM entry_photo WHERE entry_id=? AND type=?"));
    q.addBindValue(entryId);
    q.addBindValue(type);
    q.exec();
    CVdShared::check_sql_error(q.lastError(), QStringLiteral("CVdPrintoutReport"),
                               QStringLiteral("getImagesCountText"), __LINE__);
    const int n = q.next() ? q.value(0).toInt() : 0;
    if (n == 0)
        return QString();
    return n == 1 ? text(87) : text(88).arg(n);
}

void CVdPrintoutReport::company_rows(const QString& table, const QString& condition,
                                     const std::function<void(const QString&, const QSqlQuery&)>& row) const
{
    QSqlQuery q(db());
    q.prepare(QStringLiteral("SELECT t.*, c.company AS c_company, c.lastname AS c_lastname, c.type AS c_type "
                             "FROM %1 t LEFT JOIN company c ON c.id=t.company_id WHERE t.entry_id=? %2 "
                             "ORDER BY (c.id IS NULL), t.pos, t.id")
                  .arg(table, condition));
    q.addBindValue(m_entryId);
    q.exec();
    CVdShared::check_sql_error(q.lastError(), QStringLiteral("CVdPrintoutReport"),
                               QStringLiteral("company_rows"), __LINE__);
    while (q.next()) {
        const QString company = CVdShared::getCompanyFormat1(val(q, "c_company"), val(q, "c_lastname"),
                                                             val(q, "c_type"), QStringLiteral(" "))
                                    .trimmed();
        row(company, q);
    }
}

QString CVdPrintoutReport::reformat_time(const QString& stored)
{
    // "hh:mm", or empty for a missing time or 00:00, which the form stores for "no time".
    QTime t = QTime::fromString(stored.trimmed(), QStringLiteral("HH:mm:ss"));
    if (!t.isValid())
        t = QTime::fromString(stored.trimmed(), QStringLiteral("HH:mm"));
    if (!t.isValid() || (t.hour() == 0 && t.minute() == 0))
        return QString();
    return t.toString(QStringLiteral("hh:mm"));
}

QString CVdPrintoutReport::reformatDate4Deficiencies(const QString& isoDate)
{
    const QDate date = QDate::fromString(isoDate.trimmed(), Qt::ISODate);
    return date.isValid() ? getDate4Language(date) : QString();
}

QString CVdPrintoutReport::reformatDate4Delays(const QString& isoDate)
{
    return reformat_date(isoDate.trimmed());
}

void CVdPrintoutReport::get_attendee(int, Cells& companies, Cells& comments) const
{
    company_rows(QStringLiteral("entry_attendee"), QString(),
                 [&](const QString& company, const QSqlQuery& q) {
                     companies << cell(company);
                     comments << cell(val(q, "comment"));
                 });
}

void CVdPrintoutReport::get_workforce(int, Cells& companies, Cells& persons, Cells& manHours,
                                      qint64& personSum, double& manHourSum, bool& anyManHours) const
{
    personSum = 0;
    manHourSum = 0;
    anyManHours = false;
    company_rows(QStringLiteral("entry_workforce"), QString(),
                 [&](const QString& company, const QSqlQuery& q) {
                     QList<CText> who = cell(company);
                     addRun(who, val(q, "comment"));
                     companies << who;
                     const qint64 count = q.value(QStringLiteral("person_count")).toLongLong();
                     addTo(personSum, count);
                     QList<CText> people = cell(text(8).arg(count));
                     addRun(people, val(q, "person_type"));
                     persons << people;
                     const QVariant hours = q.value(QStringLiteral("man_hours"));
                     if (hours.isNull()) {
                         manHours << QList<CText>();
                     } else {
                         anyManHours = true;
                         manHourSum += hours.toDouble();
                         manHours << cell(text(50).arg(QLocale().toString(hours.toDouble())));
                     }
                 });
}

QString CVdPrintoutReport::get_progress(int entryId) const
{
    return entry_text(entryId, "progress");
}

QString CVdPrintoutReport::get_incidents(int entryId) const
{
    return entry_text(entryId, "special_incidents");
}

QString CVdPrintoutReport::get_interventions(int entryId) const
{
    return entry_text(entryId, "interventions");
}

QString CVdPrintoutReport::get_tests(int entryId) const
{
    return entry_text(entryId, "tests");
}

QString CVdPrintoutReport::get_notice(int entryId) const
{
    return entry_text(entryId, "notice");
}

bool CVdPrintoutReport::get_printStatus4TelephoneNotice(int entryId) const
{
    return entry_text(entryId, "print_telephone_notice").toInt() != 0;
}

bool CVdPrintoutReport::get_printStatus4Notice(int entryId) const
{
    return entry_text(entryId, "print_notice").toInt() != 0;
}

void CVdPrintoutReport::get_acceptance(int, Cells& companies, Cells& texts) const
{
    company_rows(QStringLiteral("entry_progress"), QStringLiteral("AND t.type=3"),
                 [&](const QString& company, const QSqlQuery& q) {
                     companies << cell(company);
                     texts << cell(val(q, "description"));
                 });
}

void CVdPrintoutReport::get_defects(int, Cells& companies, Cells& texts, Cells& dates) const
{
    company_rows(QStringLiteral("entry_progress"), QStringLiteral("AND t.type=4"),
                 [&](const QString& company, const QSqlQuery& q) {
                     QString room = val(q, "roomname");
                     if (!val(q, "roombook_number").isEmpty())
                         room += QStringLiteral(" (") + val(q, "roombook_number") + QLatin1Char(')');
                     QList<CText> where = cell(company);
                     addRun(where, room);
                     companies << where;
                     texts << cell(val(q, "description"));
                     dates << cell(reformatDate4Deficiencies(val(q, "date")));
                 });
}

void CVdPrintoutReport::get_advantage(int entryId, Cells& companies, Cells& texts, Cells& dates) const
{
    get_delay_rows(entryId, 1, companies, texts, dates);
}

void CVdPrintoutReport::get_invalidities(int entryId, Cells& companies, Cells& texts, Cells& dates) const
{
    get_delay_rows(entryId, 2, companies, texts, dates);
}

// Delays (type 1) and obstructions (type 2) print alike.
void CVdPrintoutReport::get_delay_rows(int, int type, Cells& companies, Cells& texts, Cells& dates) const
{
    company_rows(QStringLiteral("entry_progress"), QStringLiteral("AND t.type=%1").arg(type),
                 [&](const QString& company, const QSqlQuery& q) {
                     companies << cell(company);
                     texts << cell(val(q, "description"));
                     dates << cell(reformatDate4Delays(val(q, "date")));
                 });
}

void CVdPrintoutReport::get_measures(int, Cells& companies, Cells& texts, Cells& times) const
{
    company_rows(QStringLiteral("entry_constructionmeasure"), QString(),
                 [&](const QString& company, const QSqlQuery& q) {
                     companies << cell(company);
                     QList<CText> what = cell(val(q, "description"));
                     addRun(what, val(q, "location"));
                     texts << what;
                     const QString span =
                         joinNonEmpty({reformat_time(val(q, "timefrom")), reformat_time(val(q, "timeto"))},
                                      QStringLiteral(" - "));
                     times << cell(span.isEmpty() ? span : span + QLatin1Char(' ') + text(4));
                 });
}

void CVdPrintoutReport::get_tasks(int, int type, Cells& companies, Cells& texts) const
{
    company_rows(QStringLiteral("entry_task"), QStringLiteral("AND t.type=%1").arg(type),
                 [&](const QString& company, const QSqlQuery& q) {
                     companies << cell(company);
                     texts << cell(val(q, "description"));
                 });
}

void CVdPrintoutReport::get_concerns(int, Cells& companies, Cells& texts) const
{
    company_rows(QStringLiteral("entry_concern"), QString(), [&](const QString& company, const QSqlQuery& q) {
        companies << cell(company);
        texts << cell(val(q, "description"));
    });
}

void CVdPrintoutReport::get_telephone_notice(int, Cells& times, Cells& companies, Cells& texts) const
{
    company_rows(QStringLiteral("entry_telephone_notice"), QString(),
                 [&](const QString& company, const QSqlQuery& q) {
                     const QString time = reformat_time(val(q, "time"));
                     times << cell(time.isEmpty() ? time : time + QLatin1Char(' ') + text(4));
                     companies << cell(company);
                     texts << cell(val(q, "description"));
                 });
}

void CVdPrintoutReport::get_materials(int, Cells& companies, Cells& materials, Cells& amounts) const
{
    company_rows(QStringLiteral("entry_constructionmaterial"), QString(),
                 [&](const QString& company, const QSqlQuery& q) {
                     companies << cell(company);
                     QList<CText> what =
                         cell(joinNonEmpty({val(q, "material"), val(q, "process")}, QStringLiteral(", ")));
                     if (!val(q, "conditions").isEmpty())
                         addRun(what, text(28).arg(val(q, "conditions")));
                     if (!val(q, "workflow").isEmpty())
                         addRun(what, text(29).arg(val(q, "workflow")));
                     addRun(what, val(q, "note"));
                     materials << what;
                     amounts << cell(
                         q.value(QStringLiteral("quantity")).isNull()
                             ? QString()
                             : QLocale().toString(q.value(QStringLiteral("quantity")).toDouble()) +
                                   QLatin1Char(' ') + val(q, "unit"));
                 });
}

void CVdPrintoutReport::get_sample(int entryId, Cells& rows) const
{
    if (entry_text(entryId, "construction_material_sample").toInt() != 0)
        rows << cell(text(31));
}

void CVdPrintoutReport::get_documents(int, Cells& companies, Cells& texts, Cells& dates) const
{
    company_rows(QStringLiteral("entry_scheduleddelivery"), QString(),
                 [&](const QString& company, const QSqlQuery& q) {
                     companies << cell(company);
                     QList<CText> what = cell(
                         joinNonEmpty({val(q, "deliverynumber"), val(q, "deliveryindex"), val(q, "document")},
                                      QStringLiteral(" - ")));
                     addRun(what, val(q, "comment"));
                     texts << what;
                     dates << cell(reformatDate4Deficiencies(val(q, "deliverydate")));
                 });
}

void CVdPrintoutReport::get_equipment(int, Cells& equipment, Cells& zones, Cells& operating, Cells& down,
                                      qint64& operatingSum, qint64& downSum) const
{
    operatingSum = 0;
    downSum = 0;
    company_rows(
        QStringLiteral("entry_equipment"), QString(), [&](const QString& company, const QSqlQuery& q) {
            QList<CText> what = cell(company);
            addRun(what, val(q, "equipment"));
            addRun(what, val(q, "comment"));
            equipment << what;
            QList<CText> where = cell(val(q, "operating_zone"));
            const QString in = reformat_time(val(q, "entry_time")), out = reformat_time(val(q, "exit_time"));
            if (!in.isEmpty())
                addRun(where, text(60).arg(in));
            if (!out.isEmpty())
                addRun(where, text(61).arg(out));
            zones << where;
            const QVariant op = q.value(QStringLiteral("operating_time"));
            addTo(operatingSum, op.toLongLong());
            operating << (op.isNull()
                              ? QList<CText>()
                              : cell(text(65) + hours(op.toLongLong()) + QLatin1Char(' ') + tr("Stunden")));
            const QVariant stop = q.value(QStringLiteral("downtime"));
            addTo(downSum, stop.toLongLong());
            QList<CText> stopped;
            if (!stop.isNull() && stop.toLongLong() != 0)
                stopped = cell(text(66) + hours(stop.toLongLong()) + QLatin1Char(' ') + tr("Stunden"));
            if (!val(q, "downtime_reasons").isEmpty())
                addRun(stopped, text(64).arg(val(q, "downtime_reasons")));
            down << stopped;
        });
}

void CVdPrintoutReport::next_page(QPainter& painter)
{
    if (m_drawing) {
        after_print_page(painter);
        new_page(painter);
        before_print_page(painter);
    } else {
        ++currentPage;
    }
    m_y = contentTop;
}

void CVdPrintoutReport::draw_info(QPainter& painter)
{
    const int line = QFontMetrics(m_captionFont, paintDevice()).height();
    if (m_drawing) {
        painter.setFont(m_captionFont);
        draw_text_sl(painter, QRect(leftMargin, m_y, printWidth, line), get_report_number());
        const QString page = get_page_number();
        const int w = qMin(textWidth(contentsFont, page), printWidth / 3);
        painter.setFont(contentsFont);
        draw_text_sl(painter, QRect(leftMargin + printWidth - w, m_y, w, line), page);
        draw_text_sl(painter, QRect(leftMargin, m_y + line, printWidth, line), get_inspection_datime());
    }
    m_y += 2 * line + m_rowStep;
}

void CVdPrintoutReport::draw_separator(QPainter& painter)
{
    const int y = m_y - m_rowStep / 2;
    if (!m_drawnSinceSeparator || y <= contentTop || y >= contentBottom)
        return;
    if (m_drawing)
        painter.drawLine(leftMargin, y, leftMargin + printWidth, y);
    m_drawnSinceSeparator = false;
}

bool CVdPrintoutReport::is_empty(const Cells& cells)
{
    for (const QList<CText>& c : cells)
        for (const CText& run : c)
            if (!run.text.trimmed().isEmpty())
                return false;
    return true;
}

bool CVdPrintoutReport::is_empty(const QList<Column>& columns)
{
    for (const Column& column : columns)
        if (!is_empty(column.cells))
            return false;
    return true;
}

int CVdPrintoutReport::lines_height(const QVector<Line>& lines, int from, int to)
{
    int height = 0;
    for (int i = qMax(0, from); i < qMin(to, lines.size()); ++i)
        height += lines.at(i).height;
    return height;
}

QVector<CVdPrintoutReport::Line> CVdPrintoutReport::cell_lines(QPainter& painter, const QList<CText>& cell,
                                                               const QFont& font, int width)
{
    QVector<Line> lines;
    for (const CText& run : cell) {
        const QString t = run.text.trimmed();
        if (t.isEmpty())
            continue;
        const QFont f = run.hasFont ? run.font : font;
        const QFontMetrics metrics(f, painter.device());
        const int height = metrics.lineSpacing();
        const int descent = metrics.descent();
        const QString key = f.key() + QLatin1Char('|') + QString::number(width) + QLatin1Char('|') + t;
        auto it = m_wrapped.constFind(key);
        if (it == m_wrapped.constEnd()) {
            painter.setFont(f);
            it = m_wrapped.insert(key, break_line(painter, width, t).split(QLatin1Char('\n')));
        }
        for (const QString& l : it.value())
            lines << Line{l, f, height, descent};
    }
    return lines;
}

QVector<CVdPrintoutReport::Line> CVdPrintoutReport::caption_lines(QPainter& painter, const QString& caption,
                                                                  const QString& note)
{
    // The photo note goes on its own line so that it never splits inside the caption column.
    QList<CText> c{CText(caption, m_captionFont)};
    if (!note.isEmpty())
        c << CText(note, contentsFont);
    return cell_lines(painter, c, m_captionFont, m_captionWidth);
}

CVdPrintoutReport::RowLayout CVdPrintoutReport::layout_row(QPainter& painter, const QList<Column>& columns,
                                                           int row, const QVector<int>& x,
                                                           const QVector<int>& widths)
{
    RowLayout layout;
    layout.x = x;
    layout.width = widths;
    for (const Column& column : columns) {
        layout.alignment << column.alignment;
        layout.lines << (row < column.cells.size() ? cell_lines(painter, column.cells.at(row), contentsFont,
                                                                widths.at(layout.lines.size()))
                                                   : QVector<Line>());
    }
    return layout;
}

QRect CVdPrintoutReport::cell_rect(const RowLayout& row, int column, int y, int height) const
{
    return QRect(row.x.at(column), y, row.width.at(column), height);
}

void CVdPrintoutReport::draw_cell(QPainter& painter, const RowLayout& row, int column, int from, int to,
                                  int y)
{
    const QVector<Line>& lines = row.lines.at(column);
    for (int i = from; i < qMin(to, lines.size()); ++i) {
        const Line& line = lines.at(i);
        if (m_drawing) {
            // Lines are wrapped to the cell's width, so they need no clipping (which costs a
            // graphics state per line in a PDF).
            const QRect rect = cell_rect(row, column, y, line.height);
            painter.setFont(line.font);
            const int alignment = row.alignment.at(column);
            if ((alignment & Qt::AlignHorizontal_Mask) == Qt::AlignLeft)
                // On its baseline: the same place as bottom-aligned in the rectangle, without laying
                // the line out again.
                painter.drawText(QPoint(rect.left(), rect.top() + rect.height() - line.descent), line.text);
            else
                painter.drawText(rect, alignment | Qt::AlignBottom | Qt::TextSingleLine, line.text);
        }
        y += line.height;
    }
}

// The first lines of a cell that must not stand alone at the foot of a page.
static int orphan_lines(int count)
{
    return qMin(2, count);
}

bool CVdPrintoutReport::checkCell4OrphanLines(const QVector<Line>& caption, const RowLayout* first) const
{
    int needed = lines_height(caption, 0, caption.size());
    if (first)
        for (const QVector<Line>& lines : first->lines)
            needed = qMax(needed, lines_height(lines, 0, orphan_lines(lines.size())));
    return m_y + needed <= contentBottom;
}

int CVdPrintoutReport::checkCell4WidowLines(const QVector<Line>& lines, int from, int available) const
{
    int count = 0, used = 0;
    while (from + count < lines.size() && used + lines.at(from + count).height <= available)
        used += lines.at(from + count++).height;
    // A single last line is not left alone on the next page when two can go there together.
    if (from + count == lines.size() - 1 && count >= 3)
        --count;
    return count;
}

bool CVdPrintoutReport::checkRow4OrphanLines(const RowLayout& row, int available) const
{
    for (const QVector<Line>& lines : row.lines)
        if (lines_height(lines, 0, orphan_lines(lines.size())) > available)
            return false;
    return true;
}

QVector<int> CVdPrintoutReport::checkRow4WidowLines(const RowLayout& row, const QVector<int>& from,
                                                    int available) const
{
    QVector<int> counts;
    for (int c = 0; c < row.lines.size(); ++c)
        counts << checkCell4WidowLines(row.lines.at(c), from.at(c), available);
    return counts;
}

bool CVdPrintoutReport::checkRow4FormFeed(const RowLayout& row) const
{
    return m_y > contentTop && !checkRow4OrphanLines(row, contentBottom - m_y);
}

void CVdPrintoutReport::draw_row(QPainter& painter, const RowLayout& row)
{
    QVector<int> from(row.lines.size(), 0);
    forever
    {
        QVector<int> counts = checkRow4WidowLines(row, from, contentBottom - m_y);
        int used = 0;
        bool rest = false;
        for (int c = 0; c < row.lines.size(); ++c) {
            const QVector<Line>& lines = row.lines.at(c);
            // A line taller than the whole body is drawn clipped rather than pushed on forever.
            if (counts.at(c) == 0 && from.at(c) < lines.size() && m_y <= contentTop)
                counts[c] = 1;
            const int to = from.at(c) + counts.at(c);
            draw_cell(painter, row, c, from.at(c), to, m_y);
            used = qMax(used, lines_height(lines, from.at(c), to));
            from[c] = to;
            rest = rest || to < lines.size();
        }
        if (!rest) {
            m_y += used;
            return;
        }
        next_page(painter);
    }
}

// Draws a section's caption in the caption column at the current y; returns where it ends.
int CVdPrintoutReport::draw_caption(QPainter& painter, const QVector<Line>& captionLines)
{
    RowLayout captionRow;
    captionRow.x << leftMargin;
    captionRow.width << m_captionWidth;
    captionRow.alignment << Qt::AlignLeft;
    captionRow.lines << captionLines;
    draw_cell(painter, captionRow, 0, 0, captionLines.size(), m_y);
    return m_y + lines_height(captionLines, 0, captionLines.size());
}

bool CVdPrintoutReport::draw_section(QPainter& painter, const QString& caption, const QString& note,
                                     const QList<Column>& columns)
{
    if (is_empty(columns) && !displayEmptyCategories)
        return false;
    // Columns empty in every row give their width to the others.
    QList<Column> shown;
    double factors = 0;
    int rowCount = 0;
    for (const Column& column : columns)
        if (!is_empty(column.cells)) {
            shown << column;
            factors += column.factor;
            rowCount = qMax(rowCount, column.cells.size());
        }
    const int contentX = leftMargin + m_captionWidth + m_columnGap;
    const int contentWidth = qMax(1, printWidth - m_captionWidth - m_columnGap);
    const int spread = qMax(shown.size(), 1);
    const int usable = qMax(spread, contentWidth - (spread - 1) * m_columnGap);
    QVector<int> x, widths;
    int left = contentX;
    for (int c = 0; c < shown.size(); ++c) {
        const int width = c == shown.size() - 1 ? contentX + contentWidth - left
                                                : qMax(1, int(usable * shown.at(c).factor / factors));
        x << left;
        widths << qMax(1, width);
        left += width + m_columnGap;
    }
    QList<RowLayout> rows;
    for (int r = 0; r < rowCount; ++r) {
        RowLayout row = layout_row(painter, shown, r, x, widths);
        bool any = false;
        for (const QVector<Line>& lines : row.lines)
            any = any || !lines.isEmpty();
        if (any)
            rows << row;
    }

    // The caption never stands alone at the foot of a page: it needs its first lines beside it.
    const QVector<Line> captionLines = caption_lines(painter, caption, note);
    if (m_y > contentTop && !checkCell4OrphanLines(captionLines, rows.isEmpty() ? nullptr : &rows.first()))
        next_page(painter);
    const int captionPage = currentPage;
    const int captionBottom = draw_caption(painter, captionLines);

    for (int r = 0; r < rows.size(); ++r) {
        if (r > 0 && checkRow4FormFeed(rows.at(r)))
            next_page(painter);
        draw_row(painter, rows.at(r));
        m_y += m_rowStep / 2;
    }
    if (currentPage == captionPage)
        m_y = qMax(m_y, captionBottom);
    m_y += m_rowStep;
    m_drawnSinceSeparator = true;
    return true;
}

bool CVdPrintoutReport::draw_table(QPainter& painter, const QString& caption, const QString& note,
                                   const Cells& rows)
{
    return draw_section(painter, caption, note, {Column{rows, 1.0, Qt::AlignLeft}});
}

bool CVdPrintoutReport::draw_table(QPainter& painter, const QString& caption, const QString& note,
                                   const Cells& companies, const Cells& texts, int alignment)
{
    return draw_section(painter, caption, note,
                        {Column{companies, 0.35, Qt::AlignLeft}, Column{texts, 0.65, alignment}});
}

bool CVdPrintoutReport::draw_table(QPainter& painter, const QString& caption, const QString& note,
                                   const Cells& companies, const Cells& texts, const Cells& third)
{
    return draw_section(painter, caption, note,
                        {Column{companies, 0.3, Qt::AlignLeft}, Column{texts, 0.5, Qt::AlignLeft},
                         Column{third, 0.2, Qt::AlignLeft}});
}

bool CVdPrintoutReport::drawTable4ThreeColumns(QPainter& painter, const QString& caption, const QString& note,
                                               const Cells& first, const Cells& second, const Cells& third,
                                               double f1, double f2, double f3)
{
    return draw_section(painter, caption, note,
                        {Column{first, f1, Qt::AlignLeft}, Column{second, f2, Qt::AlignLeft},
                         Column{third, f3, Qt::AlignLeft}});
}

bool CVdPrintoutReport::draw_table4Workforce(QPainter& painter, int entryId)
{
    Cells companies, persons, manHours;
    qint64 personSum = 0;
    double manHourSum = 0;
    bool anyManHours = false;
    get_workforce(entryId, companies, persons, manHours, personSum, manHourSum, anyManHours);
    if (!companies.isEmpty()) {
        companies << QList<CText>{CText(text(69), m_captionFont)};
        persons << QList<CText>{CText(text(8).arg(personSum), m_captionFont)};
        manHours << (anyManHours
                         ? QList<CText>{CText(text(50).arg(QLocale().toString(manHourSum)), m_captionFont)}
                         : QList<CText>());
    }
    return draw_section(painter, text(7), QString(),
                        {Column{companies, 0.5, Qt::AlignLeft}, Column{persons, 0.25, Qt::AlignLeft},
                         Column{manHours, 0.25, Qt::AlignLeft}});
}

bool CVdPrintoutReport::draw_table4Equipment(QPainter& painter, int entryId)
{
    Cells equipment, zones, operating, down;
    qint64 operatingSum = 0, downSum = 0;
    get_equipment(entryId, equipment, zones, operating, down, operatingSum, downSum);
    if (!equipment.isEmpty()) {
        const auto sum = [](int id, qint64 minutes) {
            return cell(text(id) + hours(minutes) + QLatin1Char(' ') + tr("Stunden"));
        };
        equipment << QList<CText>{CText(text(69), m_captionFont)};
        zones << QList<CText>();
        operating << (is_empty(operating) ? QList<CText>() : sum(65, operatingSum));
        down << (downSum == 0 ? QList<CText>() : sum(66, downSum));
    }
    return draw_section(painter, text(59), QString(),
                        {Column{equipment, 0.3, Qt::AlignLeft}, Column{zones, 0.2, Qt::AlignLeft},
                         Column{operating, 0.25, Qt::AlignLeft}, Column{down, 0.25, Qt::AlignLeft}});
}

qreal CVdPrintoutReport::checkRichTextBlock4DrawOnPage(const QVector<QPair<qreal, qreal>>& lines, qreal end,
                                                       qreal from, int available, bool pageTop) const
{
    const qreal limit = from + qMax(0, available);
    if (end <= limit)
        return end;
    qreal cut = from;
    for (const auto& band : lines)
        if (band.second > from + 0.01 && band.second <= limit)
            cut = band.second;
    // Nothing whole fits even on an empty page: cut it at the body's foot.
    if (cut <= from && pageTop)
        cut = limit;
    return cut;
}

bool CVdPrintoutReport::drawRichText(QPainter& painter, const QString& caption, const QString& note,
                                     const QString& stored)
{
    if (!Qt::mightBeRichText(stored))
        return draw_table(painter, caption, note, Cells{cell(stored)});
    const int contentX = leftMargin + m_captionWidth + m_columnGap;
    const int contentWidth = qMax(1, printWidth - m_captionWidth - m_columnGap);
    QTextDocument doc;
    doc.documentLayout()->setPaintDevice(painter.device());
    doc.setDefaultFont(contentsFont);
    doc.setDocumentMargin(0);
    // The editor's own font on <body> gives way to the printout's body font; formatting inside stays.
    QString html = stored;
    html.replace(QRegularExpression(QStringLiteral("(<body[^>]*?)\\s+style=\"[^\"]*\""),
                                    QRegularExpression::CaseInsensitiveOption),
                 QStringLiteral("\\1"));
    VDRRichTextResources::guard(&doc, html);
    doc.setHtml(html);
    if (doc.toPlainText().trimmed().isEmpty())
        return draw_table(painter, caption, note, Cells());
    // Slightly below the limits, so that rounding never leaves an image a pixel too large.
    fit_images(doc, 0.98 * contentWidth, 0.98 * (contentBottom - contentTop));
    doc.setTextWidth(contentWidth);
    const QVector<QPair<qreal, qreal>> bands = line_bands(doc);
    const qreal end = doc.documentLayout()->documentSize().height();

    const QVector<Line> captionLines = caption_lines(painter, caption, note);
    // The first two lines go with the caption, unless they could not share even an empty page (a
    // page-high image as the second line).
    int firstLines = 0;
    if (!bands.isEmpty()) {
        firstLines = int(std::ceil(bands.at(qMin(1, bands.size() - 1)).second));
        if (firstLines > contentBottom - contentTop)
            firstLines = int(std::ceil(bands.first().second));
    }
    if (m_y > contentTop &&
        m_y + qMax(lines_height(captionLines, 0, captionLines.size()), firstLines) > contentBottom)
        next_page(painter);
    const int captionPage = currentPage;
    const int captionBottom = draw_caption(painter, captionLines);

    qreal from = 0;
    while (from < end - 0.5) {
        const qreal cut =
            checkRichTextBlock4DrawOnPage(bands, end, from, contentBottom - m_y, m_y <= contentTop);
        if (cut <= from) {
            next_page(painter);
            continue;
        }
        if (m_drawing) {
            // Each page shows one slice of the document, clipped to the body.
            painter.save();
            painter.translate(contentX, m_y - from);
            const QRectF slice(0, from, contentWidth, cut - from);
            painter.setClipRect(slice);
            // The layout draws every line that touches its clip: a hair inside the slice, the lines on
            // its edges are drawn on one page only, so the PDF holds each text once.
            doc.drawContents(&painter, slice.adjusted(0, 0.01, 0, -0.01));
            painter.restore();
        }
        m_y += int(std::ceil(cut - from));
        from = cut;
        if (from < end - 0.5)
            next_page(painter);
    }
    if (currentPage == captionPage)
        m_y = qMax(m_y, captionBottom);
    m_y += m_rowStep;
    m_drawnSinceSeparator = true;
    return true;
}

void CVdPrintoutReport::print_document(QPainter& painter)
{
    if (m_drawing)
        before_print_page(painter);
    m_y = contentTop;
    m_drawnSinceSeparator = false;
    draw_info(painter);
    const int id = m_entryId;
    const auto note = [&](int type) { return getImagesCountText(id, type); };
    Cells a, b, c;
    const auto reset = [&]() {
        a.clear();
        b.clear();
        c.clear();
    };

    const QString weather = get_weather(id);
    draw_table(painter, text(0), QString(), weather.isEmpty() ? Cells() : Cells{cell(weather)});
    draw_separator(painter);
    get_attendee(id, a, b);
    draw_table(painter, text(6), QString(), a, b);
    draw_table4Workforce(painter, id);
    draw_separator(painter);
    drawRichText(painter, text(9), note(1), get_progress(id));
    drawRichText(painter, text(24), QString(), get_incidents(id));
    reset();
    get_acceptance(id, a, b);
    draw_table(painter, text(13), QString(), a, b);
    draw_separator(painter);
    reset();
    get_defects(id, a, b, c);
    drawTable4ThreeColumns(painter, text(15), note(2), a, b, c, 0.3, 0.5, 0.2);
    reset();
    get_advantage(id, a, b, c);
    drawTable4ThreeColumns(painter, text(11), QString(), a, b, c, 0.3, 0.45, 0.25);
    reset();
    get_invalidities(id, a, b, c);
    drawTable4ThreeColumns(painter, text(12), note(3), a, b, c, 0.3, 0.45, 0.25);
    draw_separator(painter);
    reset();
    get_measures(id, a, b, c);
    draw_table(painter, text(21), note(4), a, b, c);
    reset();
    get_tasks(id, 1, a, b);
    draw_table(painter, text(18), QString(), a, b);
    drawRichText(painter, text(23), QString(), get_interventions(id));
    draw_separator(painter);
    reset();
    get_tasks(id, 2, a, b);
    draw_table(painter, text(19), QString(), a, b);
    reset();
    get_concerns(id, a, b);
    draw_table(painter, text(49), QString(), a, b);
    drawRichText(painter, text(22), QString(), get_tests(id));
    reset();
    if (get_printStatus4TelephoneNotice(id))
        get_telephone_notice(id, a, b, c);
    drawTable4ThreeColumns(painter, text(48), QString(), a, b, c, 0.15, 0.3, 0.55);
    drawRichText(painter, text(47), QString(), get_printStatus4Notice(id) ? get_notice(id) : QString());
    draw_separator(painter);
    reset();
    get_materials(id, a, b, c);
    draw_table(painter, text(25), note(5), a, b, c);
    reset();
    get_sample(id, a);
    draw_table(painter, text(30), QString(), a);
    draw_separator(painter);
    reset();
    get_documents(id, a, b, c);
    drawTable4ThreeColumns(painter, text(32), QString(), a, b, c, 0.3, 0.5, 0.2);
    draw_separator(painter);
    draw_table4Equipment(painter, id);
    drawAlbums(painter);
    if (m_drawing)
        after_print_page(painter);
}

bool CVdPrintoutReport::print(Output target, const QString& fileName, bool askForFileName,
                              const QString& defaultDir)
{
    if (m_entryIds.isEmpty())
        return false;
    bool ready = false;
    if (target == Printer)
        ready = setOutput4Viewer(); // the user prints from the system's viewer
    else if (target == Pdf)
        ready = setOutput4PDF(fileName, askForFileName, 3, defaultDir);
    else
        ready = init(target, fileName, askForFileName);
    if (!ready)
        return false;
    QPainter painter;
    if (!begin_painter(painter)) {
        after_print();
        return false;
    }
    painter.setRenderHints(QPainter::Antialiasing | QPainter::TextAntialiasing);
    painter.setPen(QPen(Qt::black, 2));
    before_print(painter);
    m_captionFont = contentsFont;
    m_captionFont.setWeight(75);
    const QFontMetrics fm(contentsFont, paintDevice());
    m_columnGap = fm.horizontalAdvance(QStringLiteral("Xy"));
    m_rowStep = fm.height();
    m_captionWidth = int(0.2 * printWidth);
    // A caption word is never split: the column widens to the longest one, within limits.
    const QFontMetrics captionMetrics(m_captionFont, paintDevice());
    for (int id : kCaptionIds)
        for (const QString& word : text(id).split(QLatin1Char(' '), Qt::SkipEmptyParts))
            m_captionWidth =
                qMin(int(0.3 * printWidth), qMax(m_captionWidth, captionMetrics.horizontalAdvance(word) + 1));
    for (int i = 0; i < m_entryIds.size(); ++i) {
        read_entry(m_entryIds.at(i));
        // Measuring pass: the same decisions as the drawing pass, nothing painted.
        m_drawing = false;
        currentPage = 1;
        pageCount = 1;
        print_document(painter);
        pageCount = currentPage;
        if (i > 0)
            new_page(painter);
        currentPage = 1;
        m_drawing = true;
        print_document(painter);
        m_wrapped.clear();
    }
    painter.end();
    return after_print();
}
