#include "printing/CVdPrintoutFormblatt.h"

#include "printing/CVdTexts.h"

#include <QFontMetrics>
#include <QPainter>

CVdPrintoutFormblatt::CVdPrintoutFormblatt(QObject* parent) : CVdPrintout(parent, QString()) {}

const QVector<int>& CVdPrintoutFormblatt::captionIds()
{
    static const QVector<int> ids{0,  6,  7,  9,  24, 13, 15, 11, 12, 21, 18,
                                  23, 20, 49, 22, 48, 47, 25, 30, 32, 59};
    return ids;
}

bool CVdPrintoutFormblatt::print(bool pdf)
{
    return run(pdf ? Pdf : Printer, tr("Formblatt.pdf"), true);
}

int CVdPrintoutFormblatt::compute_info_dy() const
{
    // The heading line and a line of air below it.
    return 2 * QFontMetrics(titleFont, const_cast<CVdPrintoutFormblatt*>(this)->paintDevice()).height();
}

int CVdPrintoutFormblatt::compute_block_dy(int infoDy) const
{
    const int n = captionIds().size();
    return qMax(0, (contentBottom - contentTop - infoDy) / n);
}

bool CVdPrintoutFormblatt::run(Output target, const QString& fileName, bool ask)
{
    const bool ready =
        target == Pdf ? setOutput4PDF(fileName, ask, 0, QString()) : init(target, fileName, ask);
    if (!ready)
        return false;
    QPainter painter;
    if (!begin_painter(painter)) {
        after_print();
        return false;
    }
    pageCount = 1;
    before_print(painter);
    before_print_page(painter);

    const int infoDy = compute_info_dy();
    const int blockDy = compute_block_dy(infoDy);
    const int headingLine = QFontMetrics(titleFont, paintDevice()).height();
    painter.setFont(titleFont);
    QString label = CVdTexts::self()->text(40);
    label.replace(QStringLiteral("${page.cur}"), QString::number(currentPage));
    label.replace(QStringLiteral("${page.count}"), QString::number(pageCount));
    const int third = printWidth / 3;
    draw_text_sl(painter, QRect(leftMargin, contentTop, third, headingLine), CVdTexts::self()->text(42));
    draw_text_sl(painter, QRect(leftMargin + third, contentTop, third, headingLine),
                 CVdTexts::self()->text(44));
    const int labelWidth = qMin(text_area_sl(painter, label).width(), third);
    draw_text_sl(painter, QRect(leftMargin + printWidth - labelWidth, contentTop, labelWidth, headingLine),
                 label);

    QFont caption = contentsFont;
    caption.setBold(true);
    painter.setFont(caption);
    const int captionLine = QFontMetrics(caption, paintDevice()).height();
    int y = contentTop + infoDy;
    painter.setPen(QPen(Qt::gray, 0));
    for (int id : captionIds()) {
        painter.setPen(Qt::black);
        draw_text_sl(painter, QRect(leftMargin, y, printWidth, captionLine), CVdTexts::self()->text(id));
        painter.setPen(QPen(Qt::gray, 0));
        // The room for handwriting, framed so that it reads as a field.
        const QRect field(leftMargin, y + captionLine, printWidth - 1, qMax(0, blockDy - captionLine - 2));
        if (field.height() > 0)
            painter.drawRect(field);
        y += blockDy;
    }
    painter.setPen(Qt::black);
    after_print_page(painter);
    painter.end();
    return after_print();
}
