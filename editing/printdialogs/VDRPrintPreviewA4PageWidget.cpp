#include "editing/printdialogs/VDRPrintPreviewA4PageWidget.h"

#include <QPainter>

namespace {
const double kA4WidthMm = 210.0;
const double kA4HeightMm = 297.0;
} // namespace

VDRPrintPreviewA4PageWidget::VDRPrintPreviewA4PageWidget(QWidget* parent) : QWidget(parent)
{
    setMinimumSize(105, 149);
}

void VDRPrintPreviewA4PageWidget::setPicture(const QPicture& picture)
{
    m_picture = picture;
    update();
}

QRect VDRPrintPreviewA4PageWidget::pageRect() const
{
    int w = width();
    int h = qRound(w * kA4HeightMm / kA4WidthMm);
    if (h > height()) {
        h = height();
        w = qRound(h * kA4WidthMm / kA4HeightMm);
    }
    return QRect((width() - w) / 2, (height() - h) / 2, w, h);
}

void VDRPrintPreviewA4PageWidget::paintEvent(QPaintEvent*)
{
    QPainter painter(this);
    const QRect page = pageRect();
    painter.fillRect(page, Qt::white);
    if (m_picture.isNull())
        return;
    // The page in the units it was recorded in: an A4 sheet at the picture's resolution, widened
    // to whatever the recording drew beyond it.
    const QRect drawn = m_picture.boundingRect();
    int windowWidth = qRound(kA4WidthMm / 25.4 * m_picture.logicalDpiX());
    windowWidth = qMax(windowWidth, drawn.right() + 1);
    windowWidth = qMax(windowWidth, qRound((drawn.bottom() + 1) * kA4WidthMm / kA4HeightMm));
    const int windowHeight = qRound(windowWidth * kA4HeightMm / kA4WidthMm);
    painter.setClipRect(page);
    painter.setViewport(page);
    painter.setWindow(0, 0, windowWidth, windowHeight);
    painter.drawPicture(0, 0, m_picture);
}
