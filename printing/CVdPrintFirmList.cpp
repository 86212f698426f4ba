#include "printing/CVdPrintFirmList.h"

#include "document/CVdShared.h"
#include "document/VDRDocument.h"

#include <QFontMetrics>
#include <QPainter>
#include <QSqlQuery>
#include <QSqlRecord>

namespace {
const char* const kSortField = "pos";

QString field(const QSqlQuery& query, const char* name)
{
    // Empty text columns hold a single blank.
    return query.value(QLatin1String(name)).toString().trimmed();
}
} // namespace

CVdPrintFirmList::CVdPrintFirmList(QObject* parent) : CVdPrintout(parent, tr("Firmenliste")) {}

bool CVdPrintFirmList::print(bool pdf, bool separateByPageBreak, QString fileName, const QString& defaultDir)
{
    return run(pdf ? Pdf : Printer, separateByPageBreak, fileName, true, defaultDir);
}

void CVdPrintFirmList::read_data(bool separateByPageBreak)
{
    m_blocks.clear();
    const struct
    {
        int category;
        QString heading;
    } lists[] = {{1, tr("Am Bau beteiligte Personen")}, {2, tr("Gewerke / Baufirmen")}};
    for (const auto& list : lists) {
        Block heading;
        heading.heading = true;
        heading.lines << list.heading;
        heading.pageBreakBefore = separateByPageBreak && list.category == 2;
        m_blocks << heading;
        QSqlQuery query(QSqlDatabase::database(VDRDocument::connectionName(), false));
        query.exec(QStringLiteral("SELECT * FROM company WHERE category==%1 ORDER BY ").arg(list.category) +
                   QLatin1String(kSortField) + QStringLiteral(" ASC, id ASC"));
        CVdShared::check_sql_error(query.lastError(), QStringLiteral("CVdPrintFirmList"),
                                   QStringLiteral("read_data"), __LINE__);
        int n = 0;
        while (query.next()) {
            Block block;
            block.shaded = n++ % 2 == 1;
            const QString company = field(query, "company");
            const QString person = QStringList{field(query, "firstname"), field(query, "lastname")}
                                       .join(QLatin1Char(' '))
                                       .trimmed();
            block.lines << (company.isEmpty() ? person : company);
            if (!company.isEmpty() && !person.isEmpty())
                block.lines << person;
            const QString type = field(query, "type");
            if (!type.isEmpty())
                block.lines << type;
            const QString street = field(query, "street");
            if (!street.isEmpty())
                block.lines << street;
            const QString city =
                QStringList{field(query, "plz"), field(query, "city")}.join(QLatin1Char(' ')).trimmed();
            if (!city.isEmpty())
                block.lines << city;
            const struct
            {
                QString label;
                const char* column;
            } labelled[] = {{tr("Telefon:"), "telephone"},
                            {tr("Telefax:"), "telefax"},
                            {tr("Handy:"), "mobile"},
                            {tr("E-mail:"), "email"}};
            for (const auto& l : labelled) {
                const QString value = field(query, l.column);
                if (!value.isEmpty())
                    block.lines << l.label + QLatin1Char(' ') + value;
            }
            m_blocks << block;
        }
    }
}

int CVdPrintFirmList::compute_block_height(const Block& block) const
{
    if (block.heading)
        return m_headingLine + m_line / 2;
    // Half a line of air above and below the text of a shaded block.
    return block.lines.size() * m_line + m_line;
}

void CVdPrintFirmList::compute_block_metrics()
{
    int page = 1;
    int y = contentTop;
    for (int i = 0; i < m_blocks.size(); ++i) {
        Block& block = m_blocks[i];
        block.height = compute_block_height(block);
        // A heading stays with the first block of its list.
        int needed = block.height;
        if (block.heading && i + 1 < m_blocks.size() && !m_blocks[i + 1].heading)
            needed += compute_block_height(m_blocks[i + 1]);
        const bool full = y + needed > contentBottom && y > contentTop;
        if ((block.pageBreakBefore && y > contentTop) || full) {
            ++page;
            y = contentTop;
        }
        block.page = page;
        block.y = y;
        y += block.height;
    }
    pageCount = page;
}

void CVdPrintFirmList::draw_block(QPainter& painter, const Block& block)
{
    const QRect area(leftMargin, block.y, printWidth, block.height);
    if (block.heading) {
        painter.setFont(headerFont);
        draw_text_sl(painter, QRect(leftMargin, block.y, printWidth, m_headingLine), block.lines.value(0));
        return;
    }
    if (block.shaded)
        painter.fillRect(area, QColor(235, 235, 235));
    const int indent = m_line / 2;
    int y = block.y + m_line / 2;
    for (int i = 0; i < block.lines.size(); ++i) {
        QFont font = contentsFont;
        font.setBold(i == 0);
        painter.setFont(font);
        draw_text_sl(painter, QRect(leftMargin + indent, y, printWidth - 2 * indent, m_line),
                     block.lines.at(i));
        y += m_line;
    }
}

bool CVdPrintFirmList::run(Output target, bool separateByPageBreak, const QString& fileName, bool ask,
                           const QString& defaultDir)
{
    bool ready = false;
    if (target == Pdf)
        ready = setOutput4PDF(fileName, ask, 1, defaultDir);
    else
        ready = init(target, fileName, ask);
    if (!ready)
        return false;
    QPainter painter;
    if (!begin_painter(painter)) {
        after_print();
        return false;
    }
    before_print(painter);
    m_line = QFontMetrics(contentsFont, paintDevice()).height();
    m_headingLine = QFontMetrics(headerFont, paintDevice()).height();
    read_data(separateByPageBreak);
    compute_block_metrics();
    int page = 1;
    before_print_page(painter);
    for (const Block& block : qAsConst(m_blocks)) {
        if (block.page != page) {
            after_print_page(painter);
            new_page(painter);
            page = block.page;
            before_print_page(painter);
        }
        draw_block(painter, block);
    }
    after_print_page(painter);
    painter.end();
    return after_print();
}
