#include "sync/VDRExchangeTables.h"
#include "sync/VDRReportSynchronisation.h"

#include <QHash>
#include <QSet>
#include <QSqlQuery>
#include <QStringList>

#include <algorithm>

namespace VDRExchangeTables {

using namespace VDRExchangeValues;

const std::vector<Column>& entryColumns()
{
    static const std::vector<Column> columns = {
        {"locked", KInt, true},
        {"persistent_document", KBlob, false},
        {"persistent_document_ct", KTextOrNull, false},
        {"number", KText, true},
        {"inspection_date", KDate, true},
        {"inspection_time_from", KTime, true},
        {"inspection_time_to", KTime, true},
        {"env_time", KTime, true},
        {"env_weather1", KText, true},
        {"env_weather2", KText, true},
        {"env_weather3", KText, true},
        {"env_temperature", KText, true},
        {"env_humidity", KText, true},
        {"progress", KText, true},
        {"deficiencies", KText, true},
        {"tests", KText, false},
        {"interventions", KText, false},
        {"special_incidents", KText, false},
        {"construction_material_sample", KInt, true},
        {"notice", KText, false},
        {"print_notice", KInt, true},
        {"print_telephone_notice", KInt, true},
        {"progress_audio_id", KInt, true},
        {"user_id", KText, false},
        {"creation_date", KDateTime, false},
        {"exported_by_app", KInt, false},
    };
    return columns;
}

const Table kAttendee = {"entry_attendee",
                         {{"company_id", KInt, false}, {"comment", KText, true}, {"pos", KInt, true}}};
const Table kWorkforce = {"entry_workforce",
                          {{"company_id", KInt, false},
                           {"comment", KText, true},
                           {"person_count", KInt, true},
                           {"person_type", KText, true},
                           {"man_hours", KReal, false},
                           {"pos", KInt, true}}};
const Table kTimeRecording = {"entry_time_recording",
                              {{"workforce_id", KInt, true},
                               {"person_count", KInt, true},
                               {"person_type", KText, true},
                               {"time_from", KTime, false},
                               {"time_to", KTime, false},
                               {"breaks", KInt, false},
                               {"hours", KReal, false},
                               {"pos", KInt, true}}};
const Table kProgress = {"entry_progress",
                         {{"type", KInt, true},
                          {"description", KText, true},
                          {"company_id", KInt, false},
                          {"date", KDate, false},
                          {"roomname", KText, true},
                          {"roombook_number", KText, true},
                          {"pos", KInt, true},
                          {"image_cnt", KInt, false}}};
const Table kPhoto = {"entry_photo",
                      {{"pos", KInt, true},
                       {"type", KInt, true},
                       {"photo_image_id", KInt, false},
                       {"company_id", KInt, false},
                       {"caption", KText, true},
                       {"comment", KText, true},
                       {"date", KDate, true},
                       {"relation_id", KInt, false}}};
const Table kTask = {
    "entry_task",
    {{"type", KInt, true}, {"description", KText, true}, {"company_id", KInt, false}, {"pos", KInt, true}}};
const Table kMeasure = {"entry_constructionmeasure",
                        {{"description", KText, true},
                         {"timefrom", KTime, true},
                         {"timeto", KTime, true},
                         {"company_id", KInt, false},
                         {"location", KText, false},
                         {"kks", KText, false},
                         {"pos", KInt, true}}};
const Table kMaterial = {"entry_constructionmaterial",
                         {{"material", KText, true},
                          {"quantity", KReal, false},
                          {"unit", KText, false},
                          {"process", KText, true},
                          {"company_id", KInt, false},
                          {"material_temperature", KInt, true},
                          {"conditions", KText, true},
                          {"workflow", KText, true},
                          {"note", KText, true},
                          {"document", KText, false},
                          {"pos", KInt, true}}};
const Table kDelivery = {"entry_scheduleddelivery",
                         {{"deliverynumber", KText, true},
                          {"deliveryindex", KText, true},
                          {"deliverydate", KDate, true},
                          {"company_id", KInt, false},
                          {"comment", KText, true},
                          {"document", KText, false},
                          {"pos", KInt, true}}};
const Table kTelephone = {
    "entry_telephone_notice",
    {{"description", KText, true}, {"company_id", KInt, false}, {"time", KTime, true}, {"pos", KInt, true}}};
const Table kConcern = {"entry_concern",
                        {{"description", KText, true}, {"company_id", KInt, false}, {"pos", KInt, true}}};
const Table kEquipment = {"entry_equipment",
                          {{"equipment", KText, true},
                           {"operating_zone", KText, true},
                           {"company_id", KInt, false},
                           {"entry_time", KTime, false},
                           {"exit_time", KTime, false},
                           {"operating_time", KInt, false},
                           {"downtime", KInt, false},
                           {"downtime_reasons", KText, true},
                           {"comment", KText, true},
                           {"pos", KInt, true}}};
const Table kImage = {"image",
                      {{"image", KBlob, true},
                       {"image_ct", KText, true},
                       {"image_width", KInt, true},
                       {"image_height", KInt, true},
                       {"thumbnail", KBlob, true},
                       {"thumbnail_ct", KText, true},
                       {"thumbnail_width", KInt, true},
                       {"thumbnail_height", KInt, true}}};
const Table kAudio = {"audio",
                      {{"recording", KBlob, true},
                       {"recording_date", KDate, true},
                       {"recording_time", KTime, true},
                       {"recording_status", KInt, true}}};

QString missingStructure(QSqlDatabase db)
{
    const QList<const Table*> tables = {&kAttendee, &kWorkforce, &kTimeRecording, &kProgress, &kPhoto,
                                        &kTask,     &kMeasure,   &kMaterial,      &kDelivery, &kTelephone,
                                        &kConcern,  &kEquipment, &kImage,         &kAudio};
    QHash<QString, QStringList> expected;
    for (const Table* t : tables) {
        QStringList columns = {QStringLiteral("id")};
        if (QLatin1String(t->name).startsWith(QLatin1String("entry_")))
            columns << QStringLiteral("entry_id");
        for (const Column& c : t->columns)
            columns << QLatin1String(c.name);
        expected.insert(QLatin1String(t->name), columns);
    }
    QStringList entry = {QStringLiteral("id")};
    for (const Column& c : entryColumns())
        entry << QLatin1String(c.name);
    expected.insert(QStringLiteral("entry"), entry);
    expected.insert(QStringLiteral("meta"), {QStringLiteral("key"), QStringLiteral("value")});
    expected.insert(QStringLiteral("vdr"), {QStringLiteral("id")});
    expected.insert(QStringLiteral("company"), {QStringLiteral("id"), QStringLiteral("category")});

    QStringList keys = expected.keys();
    std::sort(keys.begin(), keys.end());
    for (const QString& table : keys) {
        QSet<QString> present;
        QSqlQuery q(db);
        if (q.exec(QStringLiteral("PRAGMA table_info(\"%1\")").arg(table))) {
            while (q.next())
                present.insert(q.value(1).toString());
        }
        if (present.isEmpty())
            return VDRReportSynchronisation::tr("Die Tabelle '%1' fehlt.").arg(table);
        for (const QString& column : expected.value(table)) {
            if (!present.contains(column))
                return VDRReportSynchronisation::tr("Die Spalte '%1' der Tabelle '%2' fehlt.")
                    .arg(column, table);
        }
    }
    return QString();
}

} // namespace VDRExchangeTables
