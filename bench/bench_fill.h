#pragma once

#include "document/VDRDatabaseSchema.h"
#include "document/VDRDocument.h"

// Three rows in every list of one report, through the document's own operations, submitted.
inline void fillEveryList(VDRDocument& doc, int id)
{
    for (int i = 0; i < 3; ++i) {
        doc.appendEntryAttendee(id);
        doc.appendEntryWorkforce(id);
        doc.appendEntryDelay(id);
        doc.appendEntryObstruction(id);
        doc.appendEntryDfcy(id);
        doc.appendEntryAcceptance(id);
        doc.appendEntryDirective(id);
        doc.appendEntryAuxiliaryservice(id);
        doc.appendEntryConstructionmeasure(id);
        doc.appendEntryConstructionmaterial(id);
        doc.appendEntryScheduleddelivery(id);
        doc.appendEntryTelephoneNotice(id);
        doc.appendEntryConcern(id);
        doc.appendEntryEquipment(id);
    }
    for (VDRSqlTableModel* m : doc.entryModels(id))
        m->submitAll();
}

// The report's sub-tables the benchmarks copy and read row by row: all but time records and photos.
inline QStringList benchSubTables()
{
    QStringList tables = VDRDatabaseSchema::reportTables();
    tables.removeOne(QStringLiteral("entry_time_recording"));
    tables.removeOne(QStringLiteral("entry_photo"));
    return tables;
}
