#include "editing/reportlist/VDREntryDateWidget.h"

#include <QTextCharFormat>

VDREntryDateWidget::VDREntryDateWidget(QWidget* parent) : QCalendarWidget(parent)
{
    setObjectName(QStringLiteral("VDREntryDateWidget"));
    setGridVisible(true);
    connect(this, &QCalendarWidget::clicked, this, &VDREntryDateWidget::slotDateChosen);
    connect(this, &QCalendarWidget::activated, this, &VDREntryDateWidget::slotDateChosen);
}

void VDREntryDateWidget::setAvailableDates(const QList<QDate>& dates)
{
    setDateTextFormat(QDate(), QTextCharFormat());
    m_dates = dates;
    QTextCharFormat marked;
    marked.setFontWeight(QFont::Bold);
    marked.setBackground(QColor(255, 230, 150));
    for (const QDate& date : qAsConst(m_dates))
        setDateTextFormat(date, marked);
}

void VDREntryDateWidget::showReportDate(const QDate& date)
{
    if (!date.isValid())
        return;
    m_remembered = date;
    setSelectedDate(date);
    setCurrentPage(date.year(), date.month());
}

void VDREntryDateWidget::slotDateChosen(const QDate& date)
{
    bool found = false;
    emit dateSelected(date, found);
    if (found) {
        m_remembered = date;
        return;
    }
    // The form still shows the report of the remembered date: the selection goes back to it when
    // it is on the page now shown, else the clicked date stays selected.
    if (m_remembered.isValid() && m_remembered.year() == yearShown() && m_remembered.month() == monthShown())
        setSelectedDate(m_remembered);
}
