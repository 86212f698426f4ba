#pragma once

#include <QPicture>
#include <QWidget>

// One recorded page on a white sheet of A4 proportions, as large as the widget allows.
class VDRPrintPreviewA4PageWidget : public QWidget
{
    Q_OBJECT
public:
    explicit VDRPrintPreviewA4PageWidget(QWidget* parent = nullptr);

    void setPicture(const QPicture& picture);
    // The sheet within the widget: A4 proportions, centred.
    QRect pageRect() const;

protected:
    void paintEvent(QPaintEvent* event) override;

private:
    QPicture m_picture;
};
