#pragma once

#include "sync/VDRExchangeValues.h"

#include <QSqlDatabase>
#include <QString>

#include <vector>

// The tables of the app's exchange file that the report import reads, and their columns.
namespace VDRExchangeTables {

struct Table
{
    const char* name;
    std::vector<VDRExchangeValues::Column> columns; // without id and entry_id
};

// The columns of the report itself, without id.
const std::vector<VDRExchangeValues::Column>& entryColumns();

extern const Table kAttendee;
extern const Table kWorkforce;
extern const Table kTimeRecording;
extern const Table kProgress;
extern const Table kPhoto;
extern const Table kTask;
extern const Table kMeasure;
extern const Table kMaterial;
extern const Table kDelivery;
extern const Table kTelephone;
extern const Table kConcern;
extern const Table kEquipment;
extern const Table kImage;
extern const Table kAudio;

// The names of the reference schema's tables and columns missing in an exchange file.
QString missingStructure(QSqlDatabase db);

} // namespace VDRExchangeTables
