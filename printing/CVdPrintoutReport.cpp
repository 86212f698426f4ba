#include "printing/CVdPrintoutReport.h"

#include "document/CVdShared.h"
#include "document/VDRDocument.h"
#include "printing/CVdTexts.h"

#include <QFontMetrics>
#include <QLocale>
#include <QPainter>
#include <QSqlError>
#include <QSqlQuery>
#include <QTextDocument>
#include <QTime>

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

// "hh:mm", or empty for a missing time or 00:00, which the form stores for "no time".
QString reformat_time(const QString& stored)
{
    QTime t = QTime::fromString(stored.trimmed(), QStringLiteral("HH:mm:ss"));
    if (!t.isValid())
        t = QTime::fromString(stored.trimmed(), QStringLiteral("HH:mm"));
    if (!t.isValid() || (t.hour() == 0 && t.minute() == 0))
        return QString();
    return t.toString(QStringLiteral("hh:mm"));
}

// Equipment durations are stored in minutes.
QString hours(const QVariant& minutes)
{
    const int m = minutes.toInt();
    return QStringLiteral("%1%2:%3")
        .arg(m < 0 ? QStringLiteral("-") : QString())
        .arg(qAbs(m) / 60)
        .arg(qAbs(m) % 60, 2, 10, QLatin1Char('0'));
}

QString plain(const QString& stored)
{
    if (!Qt::mightBeRichText(stored))
        return stored.trimmed();
    QTextDocument doc;
    doc.setHtml(stored);
    return doc.toPlainText().trimmed();
}

QString joinNonEmpty(const QStringList& parts, const QString& sep)
{
    QStringList kept;
    for (const QString& p : parts)
        if (!p.trimmed().isEmpty())
            kept << p.trimmed();
    return kept.join(sep);
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

// Rows with an existing company first, in pos order, then the rows without one.
QStringList CVdPrintoutReport::company_rows(const QString& table, const QString& condition,
                                            const std::function<QString(const QSqlQuery&)>& rowText) const
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
    QStringList rows;
    while (q.next()) {
        const QString company = CVdShared::getCompanyFormat1(val(q, "c_company"), val(q, "c_lastname"),
                                                             val(q, "c_type"), QStringLiteral(" "))
                                    .trimmed();
        const QString content = rowText(q).trimmed();
        rows << joinNonEmpty({company, content}, QStringLiteral("\n"));
    }
    return rows;
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

QList<CVdPrintoutReport::Section> CVdPrintoutReport::read_sections(int id) const
{
    const auto caption = [&](int textId, int photoType = 0) {
        const QString note = photoType ? getImagesCountText(id, photoType) : QString();
        // The note goes on its own line so that it never splits inside the caption column.
        return note.isEmpty() ? text(textId) : text(textId) + QLatin1Char('\n') + note;
    };
    const auto richText = [&](const char* column) {
        const QString t = plain(entry_text(id, column));
        return t.isEmpty() ? QStringList() : QStringList{t};
    };
    const auto described = [](const QSqlQuery& q) { return val(q, "description"); };
    const auto dated = [](const QSqlQuery& q) {
        return joinNonEmpty({val(q, "description"), reformat_date(val(q, "date"))}, QStringLiteral(" - "));
    };
    const QString ofType = QStringLiteral("AND t.type=%1");

    QList<Section> s;
    const QString weather = get_weather(id);
    s << Section{caption(0), weather.isEmpty() ? QStringList() : QStringList{weather}, true};
    s << Section{caption(6),
                 company_rows(QStringLiteral("entry_attendee"), QString(),
                              [](const QSqlQuery& q) { return val(q, "comment"); }),
                 false};
    s << Section{
        caption(7),
        company_rows(QStringLiteral("entry_workforce"), QString(),
                     [](const QSqlQuery& q) {
                         QStringList parts{text(8).arg(q.value("person_count").toInt())};
                         if (!q.value("man_hours").isNull())
                             parts << text(50).arg(QLocale().toString(q.value("man_hours").toDouble()));
                         return joinNonEmpty(parts + QStringList{val(q, "comment")}, QStringLiteral(", "));
                     }),
        true};
    s << Section{caption(9, 1), richText("progress"), false};
    s << Section{caption(24), richText("special_incidents"), false};
    s << Section{caption(13), company_rows(QStringLiteral("entry_progress"), ofType.arg(3), described), true};
    s << Section{caption(15, 2),
                 company_rows(QStringLiteral("entry_progress"), ofType.arg(4),
                              [](const QSqlQuery& q) {
                                  QString room = val(q, "roomname");
                                  if (!val(q, "roombook_number").isEmpty())
                                      room +=
                                          QStringLiteral(" (") + val(q, "roombook_number") + QLatin1Char(')');
                                  return joinNonEmpty(
                                      {room.trimmed(), val(q, "description"), reformat_date(val(q, "date"))},
                                      QStringLiteral(" - "));
                              }),
                 false};
    s << Section{caption(11), company_rows(QStringLiteral("entry_progress"), ofType.arg(1), dated), false};
    s << Section{caption(12, 3), company_rows(QStringLiteral("entry_progress"), ofType.arg(2), dated), true};
    s << Section{
        caption(21, 4),
        company_rows(
            QStringLiteral("entry_constructionmeasure"), QString(),
            [](const QSqlQuery& q) {
                const QString times =
                    joinNonEmpty({reformat_time(val(q, "timefrom")), reformat_time(val(q, "timeto"))},
                                 QStringLiteral(" - "));
                return joinNonEmpty({val(q, "description"), val(q, "location"), times}, QStringLiteral(", "));
            }),
        false};
    s << Section{caption(18), company_rows(QStringLiteral("entry_task"), ofType.arg(1), described), false};
    s << Section{caption(23), richText("interventions"), true};
    s << Section{caption(19), company_rows(QStringLiteral("entry_task"), ofType.arg(2), described), false};
    s << Section{caption(49), company_rows(QStringLiteral("entry_concern"), QString(), described), false};
    s << Section{caption(22), richText("tests"), false};
    const bool printPhone = entry_text(id, "print_telephone_notice").toInt() != 0;
    s << Section{caption(48),
                 printPhone ? company_rows(QStringLiteral("entry_telephone_notice"), QString(),
                                           [](const QSqlQuery& q) {
                                               return joinNonEmpty(
                                                   {reformat_time(val(q, "time")), val(q, "description")},
                                                   QStringLiteral(" - "));
                                           })
                            : QStringList(),
                 false};
    const bool printNotice = entry_text(id, "print_notice").toInt() != 0;
    s << Section{caption(47), printNotice ? richText("notice") : QStringList(), true};
    s << Section{
        caption(25, 5),
        company_rows(QStringLiteral("entry_constructionmaterial"), QString(),
                     [](const QSqlQuery& q) {
                         const QString amount = q.value("quantity").isNull()
                                                    ? QString()
                                                    : QLocale().toString(q.value("quantity").toDouble()) +
                                                          QLatin1Char(' ') + val(q, "unit");
                         return joinNonEmpty({val(q, "material"), amount.trimmed(), val(q, "process")},
                                             QStringLiteral(", "));
                     }),
        false};
    s << Section{caption(30),
                 entry_text(id, "construction_material_sample").toInt() != 0 ? QStringList{text(31)}
                                                                             : QStringList(),
                 true};
    s << Section{caption(32),
                 company_rows(QStringLiteral("entry_scheduleddelivery"), QString(),
                              [](const QSqlQuery& q) {
                                  return joinNonEmpty(
                                      {val(q, "deliverynumber"), val(q, "deliveryindex"), val(q, "document"),
                                       reformat_date(val(q, "deliverydate")), val(q, "comment")},
                                      QStringLiteral(" - "));
                              }),
                 true};
    s << Section{caption(59),
                 company_rows(QStringLiteral("entry_equipment"), QString(),
                              [](const QSqlQuery& q) {
                                  QStringList parts{val(q, "equipment"), val(q, "operating_zone")};
                                  if (!q.value("operating_time").isNull())
                                      parts << text(63) + hours(q.value("operating_time")) +
                                                   QLatin1Char(' ') + tr("Stunden");
                                  if (!q.value("downtime").isNull() && q.value("downtime").toInt() != 0)
                                      parts << text(62) + hours(q.value("downtime")) + QLatin1Char(' ') +
                                                   tr("Stunden");
                                  return joinNonEmpty(parts, QStringLiteral(", "));
                              }),
                 false};
    return s;
}

bool CVdPrintoutReport::is_empty(const QStringList& rows)
{
    for (const QString& r : rows)
        if (!r.trimmed().isEmpty())
            return false;
    return true;
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

bool CVdPrintoutReport::draw_table(QPainter& painter, const Section& section)
{
    const bool empty = is_empty(section.rows);
    if (empty && !displayEmptyCategories)
        return false;
    const int line = QFontMetrics(contentsFont, paintDevice()).lineSpacing();
    const int contentX = leftMargin + m_captionWidth + m_columnGap;
    const int contentWidth = qMax(1, printWidth - m_captionWidth - m_columnGap);
    painter.setFont(m_captionFont);
    const QStringList captionLines =
        break_line(painter, m_captionWidth, section.caption).split(QLatin1Char('\n'));
    painter.setFont(contentsFont);
    QList<QStringList> rows;
    for (const QString& row : section.rows)
        if (!row.trimmed().isEmpty())
            rows << break_line(painter, contentWidth, row).split(QLatin1Char('\n'));

    // The caption never stands alone at the foot of a page: it needs its first lines beside it.
    const int firstLines = rows.isEmpty() ? 1 : qMin(2, rows.first().size());
    const int needed = qMax(captionLines.size(), firstLines) * line;
    if (m_y + needed > contentBottom && m_y > contentTop)
        next_page(painter);
    if (m_drawing) {
        painter.setFont(m_captionFont);
        for (int i = 0; i < captionLines.size(); ++i)
            draw_text_sl(painter, QRect(leftMargin, m_y + i * line, m_captionWidth, line),
                         captionLines.at(i));
    }
    const int captionBottom = m_y + captionLines.size() * line;
    painter.setFont(contentsFont);
    for (int r = 0; r < rows.size(); ++r) {
        const QStringList& lines = rows.at(r);
        // A row that begins at the foot of a page keeps at least two lines together.
        const int keep = qMin(2, lines.size()) * line;
        if (r > 0 && m_y + keep > contentBottom)
            next_page(painter);
        for (const QString& l : lines) {
            if (m_y + line > contentBottom)
                next_page(painter);
            if (m_drawing)
                draw_text_sl(painter, QRect(contentX, m_y, contentWidth, line), l);
            m_y += line;
        }
        m_y += m_rowStep / 2;
    }
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
    const QList<Section> sections = read_sections(m_entryId);
    for (const Section& section : sections) {
        draw_table(painter, section);
        if (section.separatorAfter)
            draw_separator(painter);
    }
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
    }
    painter.end();
    return after_print();
}
