// The rows of one imported report: copied from the exchange file into the diary under new ids.
#include "sync/VDRExchangeTables.h"
#include "sync/VDRReportSynchronisation.h"

#include "document/VDRDocument.h"

#include <QHash>
#include <QSqlError>
#include <QSqlQuery>
#include <QStringList>

#include <algorithm>
#include <functional>

using namespace VDRExchangeValues;
using namespace VDRExchangeTables;

namespace {

QString columnList(const Table& table, bool withEntryId)
{
    QStringList names = {QStringLiteral("id")};
    if (withEntryId)
        names << QStringLiteral("entry_id");
    for (const Column& c : table.columns)
        names << QLatin1String(c.name);
    return names.join(QStringLiteral(", "));
}

// The checked values of one row of 'table', by column name.
bool convertRow(const QSqlQuery& q, const Table& table, QVariantHash& values, QString& error)
{
    for (const Column& c : table.columns) {
        QVariant v;
        if (!convertValue(q.value(QLatin1String(c.name)), c, v, error))
            return false;
        values.insert(QLatin1String(c.name), v);
    }
    return true;
}

int rowId(const QSqlQuery& q, bool* ok)
{
    QVariant v;
    QString error;
    *ok = convertValue(q.value(0), {"id", KInt, true}, v, error);
    return v.toInt();
}

// May map a row's values, skip the row (returns 0) or fail (returns -1); 1 copies it.
using Adjust = std::function<int(QVariantHash&)>;

// Copies the rows of one report; the first failure is described in 'error'.
class ReportRowsCopy
{
public:
    ReportRowsCopy(QSqlDatabase exchangeFile, QSqlDatabase diary, const QString& path, int appEntryId,
                   int entryId, std::function<int(const QString&)> nextId, QString& error)
        : m_exchangeFile(exchangeFile), m_diary(diary), m_path(path), m_appEntryId(appEntryId),
          m_entryId(entryId), m_nextId(std::move(nextId)), m_error(error)
    {
    }

    bool dictation(int appAudio, int& audioId);
    // The report's rows of 'table'; 'mapped' collects app id -> diary id.
    bool rows(const Table& table, const Adjust& adjust = nullptr, QHash<int, int>* mapped = nullptr);
    // Time recordings hang on a workforce row and follow its new id.
    bool timeRecordings(const QHash<int, int>& workforce);
    // 'images' collects app id -> diary id.
    bool images(QHash<int, int>& images);

private:
    bool tableError(const char* table, const QString& reason);
    bool copyRows(const Table& table, QSqlQuery& select, const Adjust& adjust, QHash<int, int>* mapped);
    bool selectRows(QSqlQuery& q, const Table& table, const QString& where);

    QSqlDatabase m_exchangeFile;
    QSqlDatabase m_diary;
    const QString& m_path;
    const int m_appEntryId;
    const int m_entryId;
    const std::function<int(const QString&)> m_nextId;
    QString& m_error;
};

bool ReportRowsCopy::tableError(const char* table, const QString& reason)
{
    m_error =
        VDRReportSynchronisation::tr("Die Tabelle '%1' der Datei\n%2\n konnte nicht importiert werden.\n%3")
            .arg(QLatin1String(table), m_path, reason);
    return false;
}

// Copies the rows 'select' yields into the diary's table.
bool ReportRowsCopy::copyRows(const Table& table, QSqlQuery& select, const Adjust& adjust,
                              QHash<int, int>* mapped)
{
    QStringList columns = {QStringLiteral("id"), QStringLiteral("entry_id")};
    for (const Column& c : table.columns)
        columns << QLatin1String(c.name);
    QStringList marks;
    for (int i = 0; i < columns.size(); ++i)
        marks << QStringLiteral("?");
    QSqlQuery insert(m_diary);
    if (!insert.prepare(QStringLiteral("INSERT INTO %1 (%2) VALUES (%3)")
                            .arg(QLatin1String(table.name), columns.join(QStringLiteral(", ")),
                                 marks.join(QLatin1Char(',')))))
        return tableError(table.name, insert.lastError().text());
    while (select.next()) {
        bool idOk = false;
        const int appRowId = rowId(select, &idOk);
        QVariantHash values;
        QString rowError;
        if (!idOk || !convertRow(select, table, values, rowError))
            return tableError(table.name, idOk ? rowError
                                               : VDRReportSynchronisation::tr(
                                                     "Die Spalte 'id' enthält einen ungültigen Wert."));
        if (adjust) {
            const int verdict = adjust(values);
            if (verdict < 0)
                return tableError(
                    table.name,
                    VDRReportSynchronisation::tr("Ungültiger Verweis in Zeile %1.").arg(appRowId));
            if (verdict == 0)
                continue;
        }
        const int newId = m_nextId(QLatin1String(table.name));
        insert.addBindValue(newId);
        insert.addBindValue(m_entryId);
        for (const Column& c : table.columns)
            insert.addBindValue(values.value(QLatin1String(c.name)));
        if (!insert.exec())
            return tableError(table.name, insert.lastError().text());
        if (mapped)
            mapped->insert(appRowId, newId);
    }
    if (select.lastError().isValid())
        return tableError(table.name, select.lastError().text());
    return true;
}

bool ReportRowsCopy::selectRows(QSqlQuery& q, const Table& table, const QString& where)
{
    q.setForwardOnly(true);
    q.prepare(QStringLiteral("SELECT %1 FROM %2 WHERE %3")
                  .arg(columnList(table, false), QLatin1String(table.name), where));
    q.bindValue(QStringLiteral(":entryId"), m_appEntryId);
    return q.exec();
}

bool ReportRowsCopy::dictation(int appAudio, int& audioId)
{
    if (appAudio <= 0)
        return true;
    QSqlQuery q(m_exchangeFile);
    q.prepare(
        QStringLiteral("SELECT id, recording, recording_date, recording_time, recording_status FROM audio "
                       "WHERE id = :audioId;"));
    q.bindValue(QStringLiteral(":audioId"), appAudio);
    if (!q.exec())
        return tableError("audio", q.lastError().text());
    if (q.next()) {
        QVariantHash values;
        QString rowError;
        if (!convertRow(q, kAudio, values, rowError))
            return tableError("audio", rowError);
        QSqlQuery insert(m_diary);
        insert.prepare(QStringLiteral("INSERT INTO audio (recording, recording_date, recording_time, "
                                      "recording_status) VALUES (?, ?, ?, ?)"));
        for (const Column& c : kAudio.columns)
            insert.addBindValue(values.value(QLatin1String(c.name)));
        if (!insert.exec())
            return tableError("audio", insert.lastError().text());
        audioId = insert.lastInsertId().toInt();
    }
    return true;
}

bool ReportRowsCopy::rows(const Table& table, const Adjust& adjust, QHash<int, int>* mapped)
{
    QSqlQuery q(m_exchangeFile);
    if (!selectRows(q, table, QStringLiteral("entry_id = :entryId")) || !copyRows(table, q, adjust, mapped))
        return m_error.isEmpty() ? tableError(table.name, q.lastError().text()) : false;
    return true;
}

bool ReportRowsCopy::timeRecordings(const QHash<int, int>& workforce)
{
    QList<int> appWorkforce = workforce.keys();
    std::sort(appWorkforce.begin(), appWorkforce.end());
    for (const int appWorkforceId : qAsConst(appWorkforce)) {
        QSqlQuery q(m_exchangeFile);
        q.setForwardOnly(true);
        q.prepare(QStringLiteral("SELECT %1 FROM entry_time_recording WHERE workforce_id = :workforceId AND "
                                 "entry_id = :entryId")
                      .arg(columnList(kTimeRecording, false)));
        q.bindValue(QStringLiteral(":workforceId"), appWorkforceId);
        q.bindValue(QStringLiteral(":entryId"), m_appEntryId);
        const int newWorkforce = workforce.value(appWorkforceId);
        const auto mapWorkforce = [newWorkforce](QVariantHash& v) {
            v.insert(QStringLiteral("workforce_id"), newWorkforce);
            return 1;
        };
        if (!q.exec() || !copyRows(kTimeRecording, q, mapWorkforce, nullptr))
            return m_error.isEmpty() ? tableError("entry_time_recording", q.lastError().text()) : false;
    }
    return true;
}

bool ReportRowsCopy::images(QHash<int, int>& images)
{
    // Only pictures that a photo of one of the five registers shows travel along.
    QSqlQuery ids(m_exchangeFile);
    ids.prepare(
        QStringLiteral("SELECT DISTINCT entry_photo.photo_image_id FROM image JOIN entry_photo ON "
                       "image.id = entry_photo.photo_image_id WHERE entry_photo.entry_id = :entryId AND "
                       "entry_photo.type BETWEEN 1 AND 5 ORDER BY entry_photo.photo_image_id"));
    ids.bindValue(QStringLiteral(":entryId"), m_appEntryId);
    if (!ids.exec())
        return tableError("image", ids.lastError().text());
    QList<int> appImages;
    while (ids.next())
        appImages << ids.value(0).toInt();
    QSqlQuery insert(m_diary);
    insert.prepare(
        QStringLiteral("INSERT INTO image (image, image_ct, image_width, image_height, thumbnail, "
                       "thumbnail_ct, thumbnail_width, thumbnail_height) VALUES (:image, :image_ct, "
                       ":image_width, :image_height, :thumbnail, :thumbnail_ct, :thumbnail_width, "
                       ":thumbnail_height)"));
    for (const int appImage : qAsConst(appImages)) {
        QSqlQuery q(m_exchangeFile);
        q.prepare(QStringLiteral("SELECT %1 FROM image WHERE id = :id").arg(columnList(kImage, false)));
        q.bindValue(QStringLiteral(":id"), appImage);
        if (!q.exec() || !q.next())
            return tableError("image", q.lastError().text());
        QVariantHash values;
        QString rowError;
        if (!convertRow(q, kImage, values, rowError))
            return tableError("image", rowError);
        for (const Column& c : kImage.columns)
            insert.bindValue(QLatin1Char(':') + QLatin1String(c.name), values.value(QLatin1String(c.name)));
        if (!insert.exec())
            return tableError("image", insert.lastError().text());
        images.insert(appImage, insert.lastInsertId().toInt());
    }
    return true;
}

} // namespace

bool VDRReportSynchronisation::writeReportRows(QSqlDatabase exchangeFile, const QString& path, int appEntryId,
                                               int entryId, const QVariantHash& entry, int& audioId,
                                               QString& error)
{
    ReportRowsCopy copy(
        exchangeFile, m_document->database(), path, appEntryId, entryId,
        [this](const QString& table) { return nextId(table); }, error);
    audioId = 0;
    if (!copy.dictation(entry.value(QStringLiteral("progress_audio_id")).toInt(), audioId))
        return false;
    QHash<int, int> workforce;
    if (!copy.rows(kAttendee) || !copy.rows(kWorkforce, nullptr, &workforce) ||
        !copy.timeRecordings(workforce))
        return false;
    QHash<int, int> progress;
    const auto knownProgressType = [](QVariantHash& v) {
        const int type = v.value(QStringLiteral("type")).toInt();
        return type >= 1 && type <= 4 ? 1 : 0;
    };
    if (!copy.rows(kProgress, knownProgressType, &progress))
        return false;
    QHash<int, int> images;
    if (!copy.images(images))
        return false;
    const auto mapPhoto = [&](QVariantHash& v) {
        const int type = v.value(QStringLiteral("type")).toInt();
        if (type < 1 || type > 5)
            return 0;
        v.insert(QStringLiteral("photo_image_id"),
                 images.value(v.value(QStringLiteral("photo_image_id")).toInt(), 0));
        v.insert(QStringLiteral("relation_id"),
                 progress.value(v.value(QStringLiteral("relation_id")).toInt(), 0));
        return 1;
    };
    if (!copy.rows(kPhoto, mapPhoto))
        return false;
    const auto knownTaskType = [](QVariantHash& v) {
        const int type = v.value(QStringLiteral("type")).toInt();
        return type == 1 || type == 2 ? 1 : 0;
    };
    if (!copy.rows(kTask, knownTaskType))
        return false;
    for (const Table* table : {&kMeasure, &kMaterial, &kDelivery, &kTelephone, &kConcern, &kEquipment}) {
        if (!copy.rows(*table))
            return false;
    }
    return true;
}
