#pragma once

#include <QCalendarWidget>
#include <QDate>
#include <QList>

// The report calendar: the dates with reports stand out; clicking a date asks for its report.
class VDREntryDateWidget : public QCalendarWidget
{
    Q_OBJECT
public:
    explicit VDREntryDateWidget(QWidget* parent = nullptr);

    QList<QDate> availableDates() const { return m_dates; }
    // The date of the report shown last; a click on a date without a report returns to it.
    QDate rememberedDate() const { return m_remembered; }

public slots:
    void setAvailableDates(const QList<QDate>& dates);
    // A report is shown: its month and date become the calendar's.
    void showReportDate(const QDate& date);

signals:
    // The receiver sets 'found' when it showed a report of that date.
    void dateSelected(QDate date, bool& found);

private:
    void slotDateChosen(const QDate& date);

    QList<QDate> m_dates;
    QDate m_remembered;
};
