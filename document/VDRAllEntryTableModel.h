#pragma once

#include "document/VDRSqlTableModel.h"

#include <QDate>
#include <QList>

// All reports of the diary; tells listeners (the calendar) when report dates change.
class VDRAllEntryTableModel : public VDRSqlTableModel
{
    Q_OBJECT
public:
    VDRAllEntryTableModel(VDRDocument* document, QSqlDatabase db);

public slots:
    void updateDates();

signals:
    void reportDatesChanged(QList<QDate> dates);

private slots:
    void slotDataChanged(const QModelIndex& topLeft, const QModelIndex& bottomRight);

private:
    bool m_updateScheduled = false;
};
