#include "document/VDRAllEntryTableModel.h"

#include <QTimer>

VDRAllEntryTableModel::VDRAllEntryTableModel(VDRDocument* document, QSqlDatabase db)
    : VDRSqlTableModel(TN_ENTRY, document, db)
{
    connect(this, &QAbstractItemModel::dataChanged, this, &VDRAllEntryTableModel::slotDataChanged);
}

void VDRAllEntryTableModel::slotDataChanged(const QModelIndex& topLeft, const QModelIndex& bottomRight)
{
    const int column = fieldIndex(QStringLiteral("inspection_date"));
    if (column < topLeft.column() || column > bottomRight.column() || m_updateScheduled)
        return;
    // Several cells change in a row when a report is edited; collect the dates once afterwards.
    m_updateScheduled = true;
    QTimer::singleShot(0, this, &VDRAllEntryTableModel::updateDates);
}

void VDRAllEntryTableModel::updateDates()
{
    m_updateScheduled = false;
    fetch_all();
    const int column = fieldIndex(QStringLiteral("inspection_date"));
    QList<QDate> dates;
    if (column >= 0) {
        for (int row = 0; row < rowCount(); ++row)
            dates << QSqlTableModel::data(QSqlTableModel::index(row, column), Qt::EditRole).toDate();
    }
    emit reportDatesChanged(dates);
}
