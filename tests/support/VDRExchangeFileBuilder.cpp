#include "VDRExchangeFileBuilder.h"

#include "document/VDRDatabaseSchema.h"

#include <QBuffer>
#include <QColor>
#include <QDebug>
#include <QImage>
#include <QSqlError>
#include <QSqlQuery>
#include <QStringList>

namespace {
int g_builders = 0;

// Values for the NOT NULL columns a test did not name.
QVariantHash defaults(const QString& table)
{
    const QString e = QStringLiteral("");
    static const QHash<QString, QVariantHash> all = {
        {"entry",
         {{"locked", 0},
          {"inspection_date", "2026-03-07"},
          {"inspection_time_from", "07:00:00"},
          {"inspection_time_to", "16:00:00"},
          {"env_time", "08:00:00"},
          {"env_weather1", e},
          {"env_weather2", e},
          {"env_weather3", e},
          {"env_temperature", e},
          {"env_humidity", e},
          {"progress", e},
          {"deficiencies", e},
          {"construction_material_sample", 0},
          {"print_notice", 1},
          {"print_telephone_notice", 1},
          {"progress_audio_id", 0},
          {"exported_by_app", 1}}},
        {"entry_attendee", {{"comment", e}}},
        {"entry_workforce", {{"comment", e}, {"person_count", 0}, {"person_type", e}}},
        {"entry_time_recording", {{"person_count", 0}, {"person_type", e}}},
        {"entry_progress", {{"type", 1}, {"description", e}, {"roomname", e}, {"roombook_number", e}}},
        {"entry_photo", {{"type", 1}, {"caption", e}, {"comment", e}, {"date", "2026-03-07"}}},
        {"entry_task", {{"type", 1}, {"description", e}}},
        {"entry_constructionmeasure", {{"description", e}, {"timefrom", "08:00:00"}, {"timeto", "09:00:00"}}},
        {"entry_constructionmaterial",
         {{"material", e},
          {"process", e},
          {"material_temperature", 0},
          {"conditions", e},
          {"workflow", e},
          {"note", e}}},
        {"entry_scheduleddelivery",
         {{"deliverynumber", e}, {"deliveryindex", e}, {"deliverydate", "2026-03-07"}, {"comment", e}}},
        {"entry_telephone_notice", {{"description", e}, {"time", "10:00:00"}}},
        {"entry_concern", {{"description", e}}},
        {"entry_equipment",
         {{"equipment", e}, {"operating_zone", e}, {"downtime_reasons", e}, {"comment", e}}},
        {"audio",
         {{"recording", QByteArray("RIFF-audio")},
          {"recording_date", "2026-03-07"},
          {"recording_time", "09:00:00"},
          {"recording_status", 1}}},
        {"vdr",
         {{"name", "Projekt"},
          {"createdate", "2026-01-01T08:00:00"},
          {"headline_left", e},
          {"headline_center", e},
          {"headline_right", e},
          {"footer_left", e},
          {"footer_center", e},
          {"footer_right", e}}},
        {"company",
         {{"category", 1},
          {"type", e},
          {"firstname", e},
          {"lastname", e},
          {"company", e},
          {"street", e},
          {"plz", e},
          {"city", e},
          {"telephone", e},
          {"telefax", e},
          {"mobile", e},
          {"email", e}}},
    };
    return all.value(table);
}

bool isReportTable(const QString& table)
{
    return table.startsWith(QLatin1String("entry_"));
}
} // namespace

VDRExchangeFileBuilder::VDRExchangeFileBuilder(const QString& path, const QString& diaryFileName,
                                               const QDateTime& created)
    : m_name(QStringLiteral("EXCHANGE_BUILDER_%1").arg(++g_builders))
{
    QSqlDatabase db = QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), m_name);
    db.setDatabaseName(path);
    if (!db.open())
        return;
    QSqlQuery(db).exec(QStringLiteral("BEGIN"));
    m_ok = VDRDatabaseSchema::runScript(db, QStringLiteral(":/VDRDatabase/Resources/exchangeDB_create.sql"),
                                        QStringLiteral("Datenbankfehler"));
    m_ok = m_ok && setMeta(QStringLiteral("fileversion"), QStringLiteral("0.2")) &&
           setMeta(QStringLiteral("database"), diaryFileName) &&
           setMeta(QStringLiteral("creationDateTime"), created.toString(Qt::ISODate));
}

VDRExchangeFileBuilder::VDRExchangeFileBuilder(const QString& existingPath)
    : m_name(QStringLiteral("EXCHANGE_BUILDER_%1").arg(++g_builders))
{
    QSqlDatabase db = QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), m_name);
    db.setDatabaseName(existingPath);
    m_ok = db.open() && QSqlQuery(db).exec(QStringLiteral("BEGIN"));
}

VDRExchangeFileBuilder::~VDRExchangeFileBuilder()
{
    close();
}

QSqlDatabase VDRExchangeFileBuilder::db() const
{
    return QSqlDatabase::database(m_name, false);
}

void VDRExchangeFileBuilder::close()
{
    if (!QSqlDatabase::contains(m_name))
        return;
    {
        QSqlDatabase d = db();
        QSqlQuery(d).exec(QStringLiteral("COMMIT"));
        d.close();
    }
    QSqlDatabase::removeDatabase(m_name);
}

bool VDRExchangeFileBuilder::setMeta(const QString& key, const QVariant& value)
{
    QSqlQuery q(db());
    if (value.isNull()) {
        q.prepare(QStringLiteral("DELETE FROM meta WHERE key = :key"));
    } else {
        q.prepare(QStringLiteral("INSERT OR REPLACE INTO meta (key, value) VALUES (:key, :value)"));
        q.bindValue(QStringLiteral(":value"), value);
    }
    q.bindValue(QStringLiteral(":key"), key);
    return q.exec();
}

bool VDRExchangeFileBuilder::exec(const QString& sql)
{
    QSqlQuery q(db());
    if (q.exec(sql))
        return true;
    qWarning().noquote() << "builder:" << sql << q.lastError().text();
    return false;
}

int VDRExchangeFileBuilder::addRow(const QString& table, const QVariantHash& values)
{
    QVariantHash row = defaults(table);
    for (auto it = values.constBegin(); it != values.constEnd(); ++it)
        row.insert(it.key(), it.value());
    if (!row.contains(QStringLiteral("id"))) {
        // The app counts on its own; its ids are never the diary's.
        int& next = m_nextId[table];
        if (next == 0)
            next = 700;
        row.insert(QStringLiteral("id"), ++next);
    }
    if (isReportTable(table) && !row.contains(QStringLiteral("pos")))
        row.insert(QStringLiteral("pos"), row.value(QStringLiteral("id")));
    if (table == QLatin1String("company") && !row.contains(QStringLiteral("pos")))
        row.insert(QStringLiteral("pos"), row.value(QStringLiteral("id")));
    const QStringList columns = row.keys();
    QStringList marks;
    for (int i = 0; i < columns.size(); ++i)
        marks << QStringLiteral("?");
    QSqlQuery q(db());
    q.prepare(QStringLiteral("INSERT INTO %1 (%2) VALUES (%3)")
                  .arg(table, columns.join(QLatin1Char(',')), marks.join(QLatin1Char(','))));
    for (const QString& column : columns)
        q.addBindValue(row.value(column));
    if (!q.exec()) {
        qWarning().noquote() << "builder:" << table << q.lastError().text();
        return -1;
    }
    return q.lastInsertId().toInt();
}

int VDRExchangeFileBuilder::addReport(const QString& number, const QDate& date, const QDateTime& created,
                                      const QVariantHash& values)
{
    QVariantHash row = {{"number", number},
                        {"inspection_date", date.toString(Qt::ISODate)},
                        {"user_id", "AB"},
                        {"creation_date", created.toString(Qt::ISODate)}};
    for (auto it = values.constBegin(); it != values.constEnd(); ++it)
        row.insert(it.key(), it.value());
    return addRow(QStringLiteral("entry"), row);
}

QByteArray VDRExchangeFileBuilder::jpeg(const QColor& colour, int width, int height)
{
    QImage image(width, height, QImage::Format_RGB32);
    image.fill(colour);
    QByteArray bytes;
    QBuffer buffer(&bytes);
    buffer.open(QIODevice::WriteOnly);
    image.save(&buffer, "JPG", 90);
    return bytes;
}

int VDRExchangeFileBuilder::addImage(const QColor& colour)
{
    return addRow(QStringLiteral("image"), {{"image", jpeg(colour)},
                                            {"image_ct", "image/jpeg"},
                                            {"image_width", 64},
                                            {"image_height", 48},
                                            {"thumbnail", jpeg(colour, 32, 24)},
                                            {"thumbnail_ct", "image/jpeg"},
                                            {"thumbnail_width", 32},
                                            {"thumbnail_height", 24}});
}

bool VDRExchangeFileBuilder::addFullReportContent(int entryId)
{
    const QVariant e = entryId;
    bool ok = addRow("entry_attendee", {{"entry_id", e}, {"comment", "Bauleiter"}}) > 0;
    const int workforce =
        addRow("entry_workforce", {{"entry_id", e}, {"person_count", 3}, {"person_type", "Maurer"}});
    ok &= workforce > 0;
    ok &= addRow("entry_time_recording", {{"entry_id", e},
                                          {"workforce_id", workforce},
                                          {"person_count", 3},
                                          {"person_type", "Maurer"},
                                          {"time_from", "07:00:00"},
                                          {"time_to", "15:30:00"},
                                          {"breaks", 30},
                                          {"hours", 8.0}}) > 0;
    int deficiency = -1;
    for (int type = 1; type <= 4; ++type) {
        const int id = addRow("entry_progress", {{"entry_id", e},
                                                 {"type", type},
                                                 {"description", QStringLiteral("Fortschritt %1").arg(type)},
                                                 {"date", "2026-03-08"},
                                                 {"image_cnt", type == 4 ? 1 : 0}});
        ok &= id > 0;
        if (type == 4)
            deficiency = id;
    }
    const int image1 = addImage(Qt::red);
    const int image2 = addImage(Qt::green);
    ok &= addRow("entry_photo",
                 {{"entry_id", e}, {"type", 1}, {"photo_image_id", image1}, {"caption", "Rohbau"}}) > 0;
    ok &= addRow("entry_photo", {{"entry_id", e},
                                 {"type", 2},
                                 {"photo_image_id", image2},
                                 {"caption", "Riss"},
                                 {"relation_id", deficiency}}) > 0;
    ok &= addRow("entry_photo",
                 {{"entry_id", e}, {"type", 5}, {"photo_image_id", image1}, {"caption", "Beton"}}) > 0;
    ok &= addRow("entry_task", {{"entry_id", e}, {"type", 1}, {"description", "Weisung"}}) > 0;
    ok &= addRow("entry_task", {{"entry_id", e}, {"type", 2}, {"description", "Zusatz"}}) > 0;
    ok &= addRow("entry_constructionmeasure",
                 {{"entry_id", e}, {"description", "Betonage"}, {"location", "Achse 4"}}) > 0;
    ok &=
        addRow(
            "entry_constructionmaterial",
            {{"entry_id", e}, {"material", "Beton"}, {"quantity", 12.5}, {"unit", "m3"}, {"document", ""}}) >
        0;
    ok &= addRow("entry_scheduleddelivery",
                 {{"entry_id", e}, {"deliverynumber", "P-17"}, {"deliveryindex", "b"}}) > 0;
    ok &= addRow("entry_telephone_notice", {{"entry_id", e}, {"description", "Anruf Statiker"}}) > 0;
    ok &= addRow("entry_concern", {{"entry_id", e}, {"description", "Bedenken"}}) > 0;
    ok &= addRow("entry_equipment", {{"entry_id", e}, {"equipment", "Kran"}, {"operating_time", 6}}) > 0;
    const int audio = addRow("audio");
    ok &= audio > 0;
    QSqlQuery q(db());
    q.prepare(QStringLiteral("UPDATE entry SET progress_audio_id = ? WHERE id = ?"));
    q.addBindValue(audio);
    q.addBindValue(entryId);
    return ok && q.exec();
}
