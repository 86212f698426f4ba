#include "editing/time/VDRTimePickerWidget.h"

#include "document/VDRDocument.h"

#include <QButtonGroup>
#include <QDialogButtonBox>
#include <QGridLayout>
#include <QGroupBox>
#include <QPushButton>
#include <QVBoxLayout>

VDRTimePickerWidget::VDRTimePickerWidget(QWidget* parent)
    : QDialog(parent), m_time(QTime::currentTime()), m_hours(new QButtonGroup(this)),
      m_minutes(new QButtonGroup(this))
{
    setWindowTitle(tr("Uhrzeit auswählen"));
    auto* layout = new QVBoxLayout(this);
    auto* hourBox = new QGroupBox(tr("Stunde"), this);
    auto* hourGrid = new QGridLayout(hourBox);
    for (int hour = 0; hour < 24; ++hour) {
        auto* button = new QPushButton(QString::number(hour), hourBox);
        button->setCheckable(true);
        m_hours->addButton(button, hour);
        hourGrid->addWidget(button, hour / 6, hour % 6);
    }
    auto* minuteBox = new QGroupBox(tr("Minute"), this);
    auto* minuteGrid = new QGridLayout(minuteBox);
    for (int i = 0; i < 12; ++i) {
        auto* button = new QPushButton(QString::asprintf("%02d", i * 5), minuteBox);
        button->setCheckable(true);
        m_minutes->addButton(button, i * 5);
        minuteGrid->addWidget(button, i / 6, i % 6);
    }
    layout->addWidget(hourBox);
    layout->addWidget(minuteBox);
    auto* buttons = new QDialogButtonBox(QDialogButtonBox::Ok | QDialogButtonBox::Cancel, this);
    layout->addWidget(buttons);
    connect(buttons, &QDialogButtonBox::accepted, this, &VDRTimePickerWidget::slotOk);
    connect(buttons, &QDialogButtonBox::rejected, this, &QDialog::reject);
    connect(m_hours, &QButtonGroup::idClicked, this, &VDRTimePickerWidget::slotHourClicked);
    connect(m_minutes, &QButtonGroup::idClicked, this, &VDRTimePickerWidget::slotMinuteClicked);
}

QAbstractButton* VDRTimePickerWidget::hourButton(int hour) const
{
    return m_hours->button(hour);
}

QAbstractButton* VDRTimePickerWidget::minuteButton(int minute) const
{
    return m_minutes->button(minute);
}

void VDRTimePickerWidget::setTime(const QTime& time)
{
    m_time = time.isValid() ? QTime(time.hour(), time.minute()) : QTime(QTime::currentTime().hour(), 0);
    updateButtons();
}

void VDRTimePickerWidget::showEvent(QShowEvent* event)
{
    updateButtons();
    QDialog::showEvent(event);
}

void VDRTimePickerWidget::updateButtons()
{
    if (QAbstractButton* hour = m_hours->button(m_time.hour()))
        hour->setChecked(true);
    // Snapped to the nearest five; 58 and 59 would round into the next hour, so no button then.
    const int minute = m_time.minute();
    m_minutes->setExclusive(false);
    for (QAbstractButton* button : m_minutes->buttons())
        button->setChecked(false);
    m_minutes->setExclusive(true);
    if (minute <= 57) {
        const int snapped = (minute + 2) / 5 * 5;
        m_time.setHMS(m_time.hour(), snapped, 0);
        if (QAbstractButton* button = m_minutes->button(snapped))
            button->setChecked(true);
    }
}

void VDRTimePickerWidget::slotHourClicked(int hour)
{
    m_time.setHMS(hour, m_time.minute(), 0);
}

void VDRTimePickerWidget::slotMinuteClicked(int minute)
{
    m_time.setHMS(m_time.hour(), minute, 0);
    slotOk();
}

void VDRTimePickerWidget::slotOk()
{
    VDRDocument::setGlobalModified(true);
    emit okClicked(m_time);
    accept();
}
