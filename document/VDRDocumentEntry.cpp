// Report numbers, report creation, copying, locking and removal.
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "document/VDRDocumentsDb.h"
#include "document/VDREntryNumber.h"
#include "document/VDRPrompt.h"

#include <QDate>
#include <QDebug>
#include <QSet>
#include <QSettings>
#include <QSqlError>
#include <QSqlQuery>
#include <QSqlRecord>
#include <QTime>

#include <algorithm>
#include <climits>

VDREntryNumber VDRDocument::entryNumber(int row) const
{
    return VDREntryNumber(m_modelEntryAll->data(row, QStringLiteral("number"), Qt::EditRole).toString(),
                          m_modelEntryAll->data(row, QStringLiteral("user_id"), Qt::EditRole).toString());
}

int VDRDocument::entryNumberDigits(int row) const
{
    return entryNumber(row).digits();
}

QString VDRDocument::entryNumberString(int row) const
{
    return entryNumber(row).withoutDraft();
}

QChar VDRDocument::entryNumberLetter(int row) const
{
    return entryNumber(row).letter();
}

int VDRDocument::entryNumberInt(int row) const
{
    return entryNumber(row).number();
}

QString VDRDocument::entryNumberWithUserId(int row) const
{
    return entryNumber(row).withUserId();
}

QString VDRDocument::externalEntryNumberString(int row) const
{
    return VDREntryNumber(
               m_modelExternalEntryNumber->data(row, QStringLiteral("number"), Qt::EditRole).toString())
        .withoutDraft();
}

int VDRDocument::maxEntryNumber() const
{
    // Unsubmitted edits count, as the report form shows them; only the model knows them.
    if (m_modelEntryAll->isDirty()) {
        m_modelEntryAll->fetch_all();
        int result = 0;
        for (int row = 0; row < m_modelEntryAll->rowCount(); ++row)
            result = std::max(result, entryNumberInt(row));
        return result;
    }
    // SQLite reads ASCII digits only, and would also accept a sign or blanks in front: numbers that
    // begin with an ASCII digit are its part, those that begin with other characters (rare) ours.
    qint64 result = 0;
    QSqlQuery q(database());
    if (q.exec(QStringLiteral("SELECT max(CAST(number AS INTEGER)) FROM entry WHERE number GLOB '[0-9]*'")) &&
        q.next())
        result = std::max<qint64>(0, q.value(0).toLongLong());
    if (q.exec(QStringLiteral("SELECT number FROM entry WHERE unicode(number) > 127")))
        result = std::max<qint64>(result, VDREntryNumber::highestNumber(q));
    return static_cast<int>(std::min<qint64>(result, INT_MAX));
}

int VDRDocument::maxEntryID() const
{
    if (m_modelEntryAll->isDirty())
        return m_modelEntryAll->last_id();
    QSqlQuery q(database());
    return q.exec(QStringLiteral("SELECT max(id) FROM entry")) && q.next() ? q.value(0).toInt() : 0;
}

void VDRDocument::entrySetNumberText(int row)
{
    const VDREntryNumber number(
        m_modelEntryAll->data(row, QStringLiteral("number"), Qt::EditRole).toString());
    const bool locked = m_modelEntryAll->data(row, QStringLiteral("locked"), Qt::EditRole).toInt() != 0;
    if (locked) {
        const QString cut = number.withoutDraft();
        if (cut != number.text())
            m_modelEntryAll->setData(row, QStringLiteral("number"), cut);
    } else if (!number.isDraft()) {
        m_modelEntryAll->setData(row, QStringLiteral("number"),
                                 VDREntryNumber::compose(number.withoutDraft(), {}, true));
    }
}

void VDRDocument::entryNumbersAddDigit(int digits)
{
    if (digits != 4 && digits != 5)
        return;
    m_modelEntryAll->fetch_all();
    if (m_modelEntryAll->rowCount() == 0 || entryNumberDigits(0) >= digits)
        return;
    VDRPrompt::instance()->beginNotice(
        tr("Umstellung der Datenbank"),
        tr("Der Baubericht Nr. %1 wird angelegt. Die Datenbank wird jetzt auf %2-stellige Berichtsnummern "
           "umgestellt.\nDieser Vorgang kann einige Minuten dauern.")
            .arg(digits == 4 ? QStringLiteral("1000") : QStringLiteral("10000"))
            .arg(digits));
    // One transaction: thousands of single updates would each be committed to disk.
    beginTransaction();
    for (int row = 0; row < m_modelEntryAll->rowCount(); ++row) {
        const QString number = m_modelEntryAll->data(row, QStringLiteral("number"), Qt::EditRole).toString();
        m_modelEntryAll->setData(row, QStringLiteral("number"), QLatin1Char('0') + number);
    }
    endTransaction(m_modelEntryAll->submitAll());
    VDRPrompt::instance()->endNotice();
}

int VDRDocument::appendEntry()
{
    const int n = maxEntryNumber();
    if (n >= 99999) {
        VDRPrompt::warning(
            tr("Bauberichtnummer ungültig "),
            tr("Sie können keinen Baubericht mit einer Bauberichtnummer größer 99999 anlegen.\n"
               "Reduzieren Sie die höchste Bauberichtnummer oder legen Sie eine neue Datei an."));
        return -1;
    }
    if (n == 9999)
        entryNumbersAddDigit(5);
    else if (n == 999)
        entryNumbersAddDigit(4);

    m_modelEntryAll->fetch_all();
    const int digits = m_modelEntryAll->rowCount() > 0 ? std::max(3, entryNumberDigits(0)) : 3;
    const QString number = VDREntryNumber::padded(n + 1, digits);

    m_modelExternalEntryNumber->fetch_all();
    for (int row = 0; row < m_modelExternalEntryNumber->rowCount(); ++row) {
        // The letter stays: "12a" was a report inserted after 12 and does not collide with "012".
        const QString external = externalEntryNumberString(row);
        if (external.isEmpty())
            continue;
        if (VDREntryNumber::sameNumber(external, number)) {
            const QString file =
                m_modelExternalEntryNumber->data(row, QStringLiteral("filepath"), Qt::EditRole).toString();
            const VDRPrompt::StandardButton answer = VDRPrompt::instance()->question(
                VDRPrompt::Warning, tr("Warnung"),
                tr("Die Nummer %1 ist bereits in der Vorgänger-Datei %2 vergeben!\nNummer trotzdem vergeben?")
                    .arg(number, file),
                VDRPrompt::Yes | VDRPrompt::No, VDRPrompt::Yes, VDRPrompt::No);
            if (answer != VDRPrompt::Yes)
                return -1;
            break;
        }
    }

    // The counter, the new id and whatever the caller adds before it ends its own transaction go
    // to disk in one commit.
    beginTransaction();
    if (m_modelVdr->rowCount() > 0) {
        const int counter = m_modelVdr->dataById(1, QStringLiteral("entrycounter"), Qt::EditRole).toInt();
        m_modelVdr->setDataById(1, QStringLiteral("entrycounter"), counter + 1);
        m_modelVdr->submitAll();
    }

    const QTime now = QTime::currentTime();
    const QString empty = QStringLiteral("");
    bool ok = m_modelEntryAll->appendRow({
        {"locked", 0},
        {"persistent_document", QVariant(QVariant::ByteArray)},
        {"persistent_document_ct", QVariant(QVariant::String)},
        {"number", VDREntryNumber::compose(number, {}, true)},
        {"inspection_date", QDate::currentDate()},
        {"inspection_time_from", now},
        {"inspection_time_to", now},
        {"env_time", now},
        {"env_weather1", empty},
        {"env_weather2", empty},
        {"env_weather3", empty},
        {"env_temperature", empty},
        {"env_humidity", empty},
        {"progress", empty},
        {"deficiencies", empty},
        {"tests", empty},
        {"interventions", empty},
        {"special_incidents", empty},
        {"notice", empty},
        {"construction_material_sample", 0},
        {"print_notice", 1},
        {"print_telephone_notice", 1},
        {"progress_audio_id", 0},
        {"user_id",
         QSettings().value(QStringLiteral("entry/UID"), QStringLiteral("")).toString() + QStringLiteral("")},
        {"creation_date", QVariant(QVariant::DateTime)},
        {"exported_by_app", 0},
        {"import_version", QVariant(QVariant::DateTime)},
    });
    ok = endTransaction(ok);
    return ok ? 1 : 0;
}

bool VDRDocument::appendCompany1(const QString& type)
{
    const QString empty = QStringLiteral("");
    return m_modelCompany1->appendRow({{"category", 1},
                                       {"type", type},
                                       {"firstname", empty},
                                       {"lastname", empty},
                                       {"company", empty},
                                       {"street", empty},
                                       {"plz", empty},
                                       {"city", empty},
                                       {"telephone", empty},
                                       {"telefax", empty},
                                       {"mobile", empty},
                                       {"email", empty},
                                       {"pos", m_modelCompany1->maxPos() + 1}});
}

bool VDRDocument::appendCompany2()
{
    const QString empty = QStringLiteral("");
    return m_modelCompany2->appendRow({{"category", 2},
                                       {"type", empty},
                                       {"firstname", empty},
                                       {"lastname", empty},
                                       {"company", empty},
                                       {"street", empty},
                                       {"plz", empty},
                                       {"city", empty},
                                       {"telephone", empty},
                                       {"telefax", empty},
                                       {"mobile", empty},
                                       {"email", empty},
                                       {"pos", m_modelCompany2->maxPos() + 1}});
}

// ---- Sub-table rows ----

namespace {
const QString kEmpty = QStringLiteral("");

bool appendReportRow(VDRSqlTableModel* model, int entryId, QHash<QString, QVariant> values)
{
    if (!model)
        return false;
    values.insert(QStringLiteral("entry_id"), entryId);
    values.insert(QStringLiteral("pos"), model->maxPos() + 1);
    return model->appendRow(values);
}

QHash<QString, QVariant> progressValues(int type)
{
    return {{"type", type},
            {"roomname", kEmpty},
            {"roombook_number", kEmpty},
            {"description", kEmpty},
            {"image_cnt", 0}};
}

bool appendPhoto(VDRSqlTableModel* model, int entryId, int type, const QDate& date, const QString& caption,
                 int imageId)
{
    // A null caption would reach the NOT NULL column as NULL and fail the submit.
    return appendReportRow(model, entryId,
                           {{"type", type},
                            {"photo_image_id", imageId},
                            {"caption", caption.isNull() ? kEmpty : caption},
                            {"comment", kEmpty},
                            {"date", date},
                            {"relation_id", -1}});
}

// Copies the fields of one row into another, leaving out those named in 'skip'.
void copyFields(const QSqlRecord& from, VDRSqlTableModel* to, int toRow, const QStringList& skip)
{
    for (int i = 0; i < from.count(); ++i) {
        const QString name = from.fieldName(i);
        if (!skip.contains(name))
            to->setData(toRow, name, from.value(i));
    }
}

int companyKey(const QVariant& companyId)
{
    return companyId.isNull() || companyId.toInt() <= 0 ? 0 : companyId.toInt();
}
} // namespace

bool VDRDocument::appendEntryAttendee(int entryId)
{
    return appendReportRow(modelEntryAttendee(entryId), entryId, {{"comment", kEmpty}});
}

bool VDRDocument::appendEntryWorkforce(int entryId)
{
    return appendReportRow(modelEntryWorkforce(entryId), entryId,
                           {{"comment", kEmpty}, {"person_count", 0}, {"person_type", kEmpty}});
}

bool VDRDocument::appendEntryTimeRecording(int entryId, int workforceId)
{
    return appendReportRow(modelEntryTimeRecording(entryId), entryId,
                           {{"workforce_id", workforceId}, {"person_count", 0}, {"person_type", kEmpty}});
}

bool VDRDocument::appendEntryDelay(int entryId)
{
    return appendReportRow(modelEntryDelay(entryId), entryId, progressValues(1));
}

bool VDRDocument::appendEntryObstruction(int entryId)
{
    return appendReportRow(modelEntryObstruction(entryId), entryId, progressValues(2));
}

bool VDRDocument::appendEntryDfcy(int entryId)
{
    return appendReportRow(modelEntryDfcy(entryId), entryId, progressValues(4));
}

bool VDRDocument::appendEntryAcceptance(int entryId)
{
    return appendReportRow(modelEntryAcceptance(entryId), entryId, progressValues(3));
}

bool VDRDocument::appendEntryPhoto1(int entryId, const QDate& date, const QString& caption, int imageId)
{
    return appendPhoto(modelEntryPhoto1(entryId), entryId, 1, date, caption, imageId);
}

bool VDRDocument::appendEntryPhoto2(int entryId, const QDate& date, const QString& caption, int imageId)
{
    return appendPhoto(modelEntryPhoto2(entryId), entryId, 2, date, caption, imageId);
}

bool VDRDocument::appendEntryPhoto3(int entryId, const QDate& date, const QString& caption, int imageId)
{
    return appendPhoto(modelEntryPhoto3(entryId), entryId, 3, date, caption, imageId);
}

bool VDRDocument::appendEntryPhoto4(int entryId, const QDate& date, const QString& caption, int imageId)
{
    return appendPhoto(modelEntryPhoto4(entryId), entryId, 4, date, caption, imageId);
}

bool VDRDocument::appendEntryPhoto5(int entryId, const QDate& date, const QString& caption, int imageId)
{
    return appendPhoto(modelEntryPhoto5(entryId), entryId, 5, date, caption, imageId);
}

bool VDRDocument::appendEntryDirective(int entryId)
{
    return appendReportRow(modelEntryDirective(entryId), entryId, {{"type", 1}, {"description", kEmpty}});
}

bool VDRDocument::appendEntryAuxiliaryservice(int entryId)
{
    return appendReportRow(modelEntryAuxiliaryservice(entryId), entryId,
                           {{"type", 2}, {"description", kEmpty}});
}

bool VDRDocument::appendEntryConstructionmeasure(int entryId)
{
    const QTime now = QTime::currentTime();
    // location and kks may be NULL and stay so until the user names one.
    return appendReportRow(modelEntryConstructionmeasure(entryId), entryId,
                           {{"description", kEmpty}, {"timefrom", now}, {"timeto", now}});
}

bool VDRDocument::appendEntryConstructionmaterial(int entryId)
{
    return appendReportRow(modelEntryConstructionmaterial(entryId), entryId,
                           {{"material", kEmpty},
                            {"unit", kEmpty},
                            {"process", kEmpty},
                            {"note", kEmpty},
                            {"conditions", kEmpty},
                            {"workflow", kEmpty},
                            {"document", kEmpty},
                            {"material_temperature", 0}});
}

bool VDRDocument::appendEntryScheduleddelivery(int entryId)
{
    return appendReportRow(modelEntryScheduleddelivery(entryId), entryId,
                           {{"deliverynumber", kEmpty},
                            {"deliveryindex", kEmpty},
                            {"deliverydate", QDate::currentDate()},
                            {"comment", kEmpty},
                            {"document", kEmpty}});
}

bool VDRDocument::appendEntryTelephoneNotice(int entryId)
{
    return appendReportRow(modelEntryTelephoneNotice(entryId), entryId,
                           {{"description", kEmpty}, {"time", QTime::currentTime()}});
}

bool VDRDocument::appendEntryConcern(int entryId)
{
    return appendReportRow(modelEntryConcern(entryId), entryId, {{"description", kEmpty}});
}

bool VDRDocument::appendEntryEquipment(int entryId)
{
    return appendReportRow(modelEntryEquipment(entryId), entryId,
                           {{"equipment", kEmpty},
                            {"operating_zone", kEmpty},
                            {"downtime_reasons", kEmpty},
                            {"comment", kEmpty}});
}

// ---- Whole reports ----

bool VDRDocument::copyEntryAll(int row)
{
    m_modelEntryAll->fetch_all();
    if (row < 0 || row >= m_modelEntryAll->rowCount())
        return false;
    // Read before appending: widening the numbers re-selects the model.
    const QSqlRecord source = m_modelEntryAll->record(row);
    const int sourceId = source.value(QStringLiteral("id")).toInt();

    beginTransaction();
    const int appended = appendEntry();
    if (appended != 1) {
        // -1: the user declined the number; nothing was written.
        endTransaction(appended != 0);
        return false;
    }
    const int newRow = m_modelEntryAll->rowCount() - 1;
    copyFields(source, m_modelEntryAll, newRow,
               {"id", "number", "progress_audio_id", "user_id", "creation_date", "exported_by_app",
                "import_version", "locked"});
    // The new row holds the highest id (ids only grow); no need to look through every report.
    const int newId = m_modelEntryAll->data(newRow, QStringLiteral("id"), Qt::EditRole).toInt();
    bool ok = m_modelEntryAll->submitAll();
    // Both reports' models are used throughout.
    const EntryModelsPin sourcePin(this, sourceId);
    const EntryModelsPin copyPin(this, newId);

    using Append = bool (VDRDocument::*)(int);
    static const std::pair<VDRSqlTableModel::TABLE_NAMES, Append> tables[] = {
        {VDRSqlTableModel::TN_ATTENDEE, &VDRDocument::appendEntryAttendee},
        {VDRSqlTableModel::TN_DELAY, &VDRDocument::appendEntryDelay},
        {VDRSqlTableModel::TN_OBSTRUCTION, &VDRDocument::appendEntryObstruction},
        {VDRSqlTableModel::TN_DEFICIENCY, &VDRDocument::appendEntryDfcy},
        {VDRSqlTableModel::TN_ACCEPTANCE, &VDRDocument::appendEntryAcceptance},
        {VDRSqlTableModel::TN_DIRECTIVE, &VDRDocument::appendEntryDirective},
        {VDRSqlTableModel::TN_AUXILIARY_SERVICE, &VDRDocument::appendEntryAuxiliaryservice},
        {VDRSqlTableModel::TN_CONSTRUCTION_MEASURE, &VDRDocument::appendEntryConstructionmeasure},
        {VDRSqlTableModel::TN_CONSTRUCTION_MATERIAL, &VDRDocument::appendEntryConstructionmaterial},
        {VDRSqlTableModel::TN_SCHEDULED_DELIVERY, &VDRDocument::appendEntryScheduleddelivery},
        {VDRSqlTableModel::TN_TELEPHONE_NOTICE, &VDRDocument::appendEntryTelephoneNotice},
        {VDRSqlTableModel::TN_CONCERN, &VDRDocument::appendEntryConcern},
        {VDRSqlTableModel::TN_EQUIPMENT, &VDRDocument::appendEntryEquipment},
        {VDRSqlTableModel::TN_WORKFORCE, &VDRDocument::appendEntryWorkforce},
    };
    // Documents live in the documents database under the old row, and photos are not copied,
    // so a copied row names no document and counts no photos.
    const QStringList skip = {"id", "entry_id", "document", "image_cnt"};
    for (const auto& table : tables) {
        VDRSqlTableModel* from = modelEntry(sourceId, table.first);
        VDRSqlTableModel* to = modelEntry(newId, table.first);
        if (!from || !to) {
            ok = false;
            continue;
        }
        from->fetch_all();
        QList<QPair<int, int>> workforceIds; // source id -> copy id
        for (int r = 0; r < from->rowCount(); ++r) {
            if (!(this->*table.second)(newId)) {
                ok = false;
                continue;
            }
            const int copyRow = to->rowCount() - 1;
            copyFields(from->record(r), to, copyRow, skip);
            if (table.first == VDRSqlTableModel::TN_WORKFORCE)
                workforceIds.append({from->data(r, QStringLiteral("id"), Qt::EditRole).toInt(),
                                     to->data(copyRow, QStringLiteral("id"), Qt::EditRole).toInt()});
        }
        ok &= to->submitAll();

        if (!workforceIds.isEmpty()) {
            VDRSqlTableModel* times = modelEntryTimeRecording(sourceId);
            VDRSqlTableModel* timesCopy = modelEntryTimeRecording(newId);
            times->fetch_all();
            for (const auto& ids : qAsConst(workforceIds)) {
                for (int r = 0; r < times->rowCount(); ++r) {
                    if (times->data(r, QStringLiteral("workforce_id"), Qt::EditRole).toInt() != ids.first)
                        continue;
                    if (!appendEntryTimeRecording(newId, ids.second)) {
                        ok = false;
                        continue;
                    }
                    copyFields(times->record(r), timesCopy, timesCopy->rowCount() - 1,
                               {"id", "entry_id", "workforce_id"});
                }
            }
            ok &= timesCopy->submitAll();
        }
    }
    ok = endTransaction(ok);
    return ok;
}

namespace {
bool execLogged(QSqlQuery& q)
{
    if (q.exec())
        return true;
    qDebug().noquote() << "SQL-Error:" << q.lastError().text();
    return false;
}
} // namespace

bool VDRDocument::removeEntryAll(int row)
{
    m_modelEntryAll->fetch_all();
    if (row < 0 || row >= m_modelEntryAll->rowCount())
        return false;
    const int entryId = m_modelEntryAll->data(row, QStringLiteral("id"), Qt::EditRole).toInt();
    const int audioId = m_modelEntryAll->data(row, QStringLiteral("progress_audio_id"), Qt::EditRole).toInt();

    beginTransaction();
    bool ok = true;
    QSet<int> imageIds;
    if (hasEntryModels(entryId)) {
        // Models in use may hold unsubmitted rows, which must go with the report.
        const EntryModelsPin pin(this, entryId);
        for (VDRSqlTableModel* model : entryModels(entryId)) {
            model->fetch_all();
            const int rows = model->rowCount();
            if (rows == 0)
                continue;
            if (model->fieldIndex(QStringLiteral("photo_image_id")) >= 0) {
                for (int r = 0; r < rows; ++r) {
                    const QVariant image = model->data(r, QStringLiteral("photo_image_id"), Qt::EditRole);
                    if (!image.isNull() && image.toInt() > 0)
                        imageIds.insert(image.toInt());
                }
            }
            model->removeRows(0, rows);
            ok &= model->submitAll();
        }
    } else {
        // Building the report's models only to empty them costs more than the removal itself.
        QSqlQuery photos(database());
        photos.prepare(QStringLiteral("SELECT photo_image_id FROM entry_photo WHERE entry_id = :id"));
        photos.bindValue(QStringLiteral(":id"), entryId);
        ok &= execLogged(photos);
        while (photos.next()) {
            if (!photos.value(0).isNull() && photos.value(0).toInt() > 0)
                imageIds.insert(photos.value(0).toInt());
        }
        QStringList tables;
        for (VDRSqlTableModel::TABLE_NAMES table : entryTables()) {
            const QString name = VDRSqlTableModel::sqlTableName(table);
            if (!tables.contains(name))
                tables << name;
        }
        for (const QString& table : qAsConst(tables)) {
            QSqlQuery q(database());
            q.prepare(QStringLiteral("DELETE FROM ") + table + QStringLiteral(" WHERE entry_id = :id"));
            q.bindValue(QStringLiteral(":id"), entryId);
            ok &= execLogged(q);
        }
    }
    // An image goes only when no photo row refers to it any more (-1: the count failed).
    for (const int imageId : qAsConst(imageIds)) {
        if (countImageAccess(imageId) == 0 && deleteImage(imageId))
            decrementCompactDbImageCnt();
    }
    if (audioId > 0)
        deleteAudioRecord(audioId);
    VDRDocumentsDb::removeRecordsOnDocumentsDb4Entry(this, entryId);

    if (m_modelEntryAll->canDropDeletedRow(row)) {
        // The report list drops the row instead of reading every report again.
        QSqlQuery q(database());
        q.prepare(QStringLiteral("DELETE FROM entry WHERE id = :id"));
        q.bindValue(QStringLiteral(":id"), entryId);
        const bool deleted = execLogged(q);
        ok &= deleted && m_modelEntryAll->dropDeletedRow(row);
    } else {
        m_modelEntryAll->removeRows(row, 1);
        ok &= m_modelEntryAll->submitAll();
    }
    ok = endTransaction(ok);
    return ok;
}

bool VDRDocument::deleteAudioRecord(int audioId)
{
    if (audioId <= 0)
        return false;
    QSqlQuery q(database());
    q.prepare(QStringLiteral("DELETE FROM audio WHERE id = :id"));
    q.bindValue(QStringLiteral(":id"), audioId);
    if (!q.exec()) {
        qDebug().noquote() << "SQL-Error:" << q.lastError().text();
        return false;
    }
    if (q.numRowsAffected() > 0)
        decrementCompactDbAudioCnt();
    return true;
}

bool VDRDocument::lockEntry(int row, bool locked)
{
    m_modelEntryAll->fetch_all();
    if (row < 0 || row >= m_modelEntryAll->rowCount())
        return false;
    beginTransaction();
    m_modelEntryAll->setData(row, QStringLiteral("locked"), locked ? 1 : 0);
    entrySetNumberText(row);
    // Only locking freezes: a report opened again for editing should follow the master data it
    // is edited with, and its frozen copies are never copied twice anyway.
    if (locked)
        lockCompanyRecords4lockedEntry(row);
    bool ok = m_modelEntryAll->submitAll();
    ok = endTransaction(ok);
    return ok;
}

void VDRDocument::lockCompanyRecords4lockedEntry(int row)
{
    m_modelEntryAll->fetch_all();
    if (row < 0 || row >= m_modelEntryAll->rowCount())
        return;
    const int entryId = m_modelEntryAll->data(row, QStringLiteral("id"), Qt::EditRole).toInt();
    const QList<VDRSqlTableModel*> models = entryModels(entryId);
    QMap<int, int> used;
    for (VDRSqlTableModel* model : models)
        model->getCompanyIds(&used);
    if (used.isEmpty())
        return;

    QMap<int, int> copies; // company id -> frozen copy
    const std::pair<VDRSqlTableModel*, int> lists[] = {{m_modelCompany2, 2}, {m_modelCompany1, 1}};
    for (const auto& list : lists) {
        VDRSqlTableModel* companies = list.first;
        companies->fetch_all();
        const int rows = companies->rowCount();
        for (int r = 0; r < rows; ++r) {
            const int id = companies->data(r, QStringLiteral("id"), Qt::EditRole).toInt();
            if (!used.contains(id) || copies.contains(id) ||
                companies->data(r, QStringLiteral("category"), Qt::EditRole).toInt() < 0)
                continue;
            const QSqlRecord original = companies->record(r);
            QHash<QString, QVariant> values;
            for (int i = 0; i < original.count(); ++i) {
                const QString name = original.fieldName(i);
                if (name != QLatin1String("id") && name != QLatin1String("pos"))
                    values.insert(name, original.value(i));
            }
            values.insert(QStringLiteral("category"), -list.second);
            values.insert(QStringLiteral("pos"), companies->maxPos() + 1);
            if (!companies->appendRow(values))
                continue;
            copies.insert(
                id, companies->data(companies->rowCount() - 1, QStringLiteral("id"), Qt::EditRole).toInt());
        }
    }
    if (copies.isEmpty())
        return;

    // The copies and the rows pointing at them are committed together: a report form that later
    // reverts its models must not lose one half.
    beginTransaction();
    bool ok = m_modelCompany2->submitAll();
    ok &= m_modelCompany1->submitAll();
    for (VDRSqlTableModel* model : models) {
        model->updateCompanyIds(&copies);
        if (model->isDirty())
            ok &= model->submitAll();
    }
    endTransaction(ok);
    setMasterDataModified(true);
}

// Files from before photos could be assigned to a deficiency kept the assignment as the photo's
// comment (the deficiency's description) and a report-wide deficiency text.
void VDRDocument::repairPhotoAssignments()
{
    QList<int> entryIds;
    {
        QSqlQuery q(database());
        for (const char* sql :
             {"SELECT DISTINCT entry_id FROM entry_photo WHERE type = 2 AND trim(comment) <> ''",
              "SELECT id FROM entry WHERE trim(deficiencies) <> ''"}) {
            if (!q.exec(QLatin1String(sql)))
                qDebug().noquote() << "SQL-Error:" << q.lastError().text();
            while (q.next()) {
                if (!entryIds.contains(q.value(0).toInt()))
                    entryIds << q.value(0).toInt();
            }
        }
    }
    if (entryIds.isEmpty())
        return;
    std::sort(entryIds.begin(), entryIds.end());

    beginTransaction();
    bool entriesChanged = false;
    for (const int entryId : qAsConst(entryIds)) {
        const int entryRow = m_modelEntryAll->rowById(entryId);
        if (entryRow < 0)
            continue; // photos of a report that no longer exists
        VDRSqlTableModel* deficiencies = modelEntryDfcy(entryId);
        VDRSqlTableModel* photos = modelEntryPhoto2(entryId);
        deficiencies->fetch_all();
        const auto deficiencyRow = [&](const QString& description, int company) {
            for (int r = 0; r < deficiencies->rowCount(); ++r) {
                if (deficiencies->data(r, QStringLiteral("description"), Qt::EditRole).toString().trimmed() ==
                        description &&
                    companyKey(deficiencies->data(r, QStringLiteral("company_id"), Qt::EditRole)) == company)
                    return r;
            }
            if (!appendEntryDfcy(entryId))
                return -1;
            const int r = deficiencies->rowCount() - 1;
            deficiencies->setData(r, QStringLiteral("description"), description);
            if (company > 0)
                deficiencies->setData(r, QStringLiteral("company_id"), company);
            return r;
        };

        const QString text = m_modelEntryAll->data(entryRow, QStringLiteral("deficiencies"), Qt::EditRole)
                                 .toString()
                                 .trimmed();
        if (!text.isEmpty() && deficiencyRow(text, 0) >= 0) {
            m_modelEntryAll->setData(entryRow, QStringLiteral("deficiencies"), kEmpty);
            entriesChanged = true;
        }

        photos->fetch_all();
        for (int r = 0; r < photos->rowCount(); ++r) {
            const QString comment =
                photos->data(r, QStringLiteral("comment"), Qt::EditRole).toString().trimmed();
            if (comment.isEmpty())
                continue;
            const int d = deficiencyRow(
                comment, companyKey(photos->data(r, QStringLiteral("company_id"), Qt::EditRole)));
            if (d < 0)
                continue;
            deficiencies->setData(d, QStringLiteral("image_cnt"),
                                  deficiencies->data(d, QStringLiteral("image_cnt"), Qt::EditRole).toInt() +
                                      1);
            photos->setData(r, QStringLiteral("relation_id"),
                            deficiencies->data(d, QStringLiteral("id"), Qt::EditRole).toInt());
            photos->setData(r, QStringLiteral("comment"), kEmpty);
        }
        deficiencies->submitAll();
        photos->submitAll();
    }
    if (entriesChanged)
        m_modelEntryAll->submitAll();
    endTransaction();
}
