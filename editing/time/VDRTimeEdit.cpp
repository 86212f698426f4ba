#include "editing/time/VDRTimeEdit.h"

#include "editing/time/CVdTimeValidator.h"
#include "editing/time/VDRTimePickerWidget.h"

#include <QCursor>
#include <QStyle>
#include <QToolButton>

VDRTimeEdit::VDRTimeEdit(QWidget* parent) : QLineEdit(parent), m_button(new QToolButton(this))
{
    setValidator(new CVdTimeValidator(this));
    m_button->setText(QStringLiteral("…"));
    m_button->setToolTip(tr("Uhrzeit auswählen"));
    m_button->setCursor(Qt::ArrowCursor);
    m_button->setFocusPolicy(Qt::NoFocus);
    connect(m_button, &QToolButton::clicked, this, &VDRTimeEdit::slotOpenPicker);
}

QTime VDRTimeEdit::time2() const
{
    int hours = 0;
    int minutes = 0;
    if (!CVdTimeValidator::parse(text(), &hours, &minutes))
        return QTime();
    return QTime(hours, minutes);
}

QTime VDRTimeEdit::time()
{
    const QTime result = time2();
    if (result.isValid()) {
        const QString formatted = result.toString(QStringLiteral("hh:mm"));
        if (formatted != text())
            setText(formatted);
    }
    return result;
}

void VDRTimeEdit::setTime(const QTime& time)
{
    setText(time.isValid() ? time.toString(QStringLiteral("hh:mm")) : QString());
}

void VDRTimeEdit::resizeEvent(QResizeEvent* event)
{
    QLineEdit::resizeEvent(event);
    const int side = height();
    m_button->setGeometry(width() - side, 0, side, side);
    setTextMargins(0, 0, side, 0);
}

void VDRTimeEdit::slotOpenPicker()
{
    VDRTimePickerWidget picker(this);
    picker.setTime(time2());
    picker.move(QCursor::pos());
    connect(&picker, &VDRTimePickerWidget::okClicked, this, [this](const QTime& picked) {
        setTime(picked);
        setModified(true);
        emit editingFinished();
    });
    picker.exec();
}
