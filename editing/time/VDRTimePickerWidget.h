#pragma once

#include <QDialog>
#include <QTime>

class QAbstractButton;
class QButtonGroup;

// Picks a time with 24 hour buttons and 12 minute buttons (00, 05, ... 55).
class VDRTimePickerWidget : public QDialog
{
    Q_OBJECT
public:
    explicit VDRTimePickerWidget(QWidget* parent = nullptr);

    void setTime(const QTime& time);
    QTime time() const { return m_time; }
    QAbstractButton* hourButton(int hour) const;
    QAbstractButton* minuteButton(int minute) const;

signals:
    void okClicked(const QTime& time);

protected:
    void showEvent(QShowEvent* event) override;

private slots:
    void slotHourClicked(int hour);
    void slotMinuteClicked(int minute);
    void slotOk();

private:
    void updateButtons();

    QTime m_time;
    QButtonGroup* m_hours;
    QButtonGroup* m_minutes;
};
