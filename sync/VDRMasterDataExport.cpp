#include "sync/VDRMasterDataExport.h"

#include "document/VDRDatabaseSchema.h"
#include "document/VDRDocument.h"
#include "document/VDREntryNumber.h"
#include "document/VDRFileOps.h"
#include "document/VDRPrompt.h"
#include "document/VDRScopedConnection.h"
#include "sync/VDRReportSynchronisation.h"

#include <QDate>
#include <QDebug>
#include <QFile>
#include <QFileInfo>
#include <QSettings>
#include <QSqlError>
#include <QSqlQuery>
#include <QSqlRecord>
#include <QTime>

#include <sys/stat.h>

namespace {

bool exec(QSqlQuery& q, QString& error)
{
    if (q.exec())
        return true;
    error = q.lastError().text();
    return false;
}

bool runScript(QSqlDatabase db, const QString& resource, QString& error)
{
    QFile file(resource);
    if (!file.open(QIODevice::ReadOnly | QIODevice::Text)) {
        error = file.errorString();
        return false;
    }
    const QStringList statements = QString::fromUtf8(file.readAll()).split(QLatin1Char(';'));
    for (const QString& piece : statements) {
        if (piece.trimmed().isEmpty())
            continue;
        QSqlQuery q(db);
        if (!q.exec(piece.trimmed())) {
            error = q.lastError().text();
            return false;
        }
    }
    return true;
}

// Writes a new SQLite file through 'fill' under a temporary name beside 'path', then puts it in place.
bool writeDatabaseFile(const QString& connection, const QString& path,
                       const std::function<bool(QSqlDatabase, QString&)>& fill, QString& error)
{
    const QString temporary = VDRFileOps::emptyTemporaryBeside(path);
    if (temporary.isEmpty()) {
        error = VDRFileOps::withReason(QString()).trimmed();
        return false;
    }
    bool ok = false;
    {
        VDRScopedConnection target(connection, temporary);
        if (!target.isOpen()) {
            error = target.lastError().text();
        } else {
            QSqlDatabase db = target.db();
            QSqlQuery(db).exec(QStringLiteral("BEGIN EXCLUSIVE TRANSACTION"));
            ok = fill(db, error);
            QSqlQuery end(db);
            if (!end.exec(ok ? QStringLiteral("COMMIT TRANSACTION")
                             : QStringLiteral("ROLLBACK TRANSACTION")) &&
                ok) {
                ok = false;
                error = end.lastError().text();
            }
        }
    }
    if (ok && !VDRFileOps::flush(temporary)) {
        ok = false;
        error = VDRFileOps::withReason(QString()).trimmed();
    }
    // A new file gets the usual permissions, not those of a private temporary file.
    if (ok && !QFileInfo::exists(path)) {
        const mode_t mask = ::umask(0);
        ::umask(mask);
        ::chmod(QFile::encodeName(temporary).constData(), 0666 & ~mask);
    }
    if (ok && !VDRFileOps::replaceFile(temporary, path)) {
        ok = false;
        error = VDRFileOps::withReason(QString()).trimmed();
    }
    if (!ok)
        VDRFileOps::removeDatabase(temporary);
    return ok;
}

} // namespace

bool VDRMasterDataExport::insertMasterData(QSqlDatabase source, QSqlDatabase target, const QString& table,
                                           const QString& where)
{
    QSqlQuery select(source);
    select.setForwardOnly(true);
    if (!select.exec(QStringLiteral("SELECT * FROM ") + table + QLatin1Char(' ') + where)) {
        VDRPrompt::critical(tr("SQL Error"), select.lastError().text());
        return false;
    }
    const QSqlRecord record = select.record();
    QStringList columns;
    QStringList marks;
    for (int i = 0; i < record.count(); ++i) {
        columns << record.fieldName(i);
        marks << QStringLiteral("?");
    }
    QSqlQuery insert(target);
    if (!insert.prepare(QStringLiteral("INSERT INTO %1 (%2) VALUES (%3)")
                            .arg(table, columns.join(QStringLiteral(", ")), marks.join(QLatin1Char(','))))) {
        VDRPrompt::critical(tr("SQL Error"), insert.lastError().text());
        return false;
    }
    while (select.next()) {
        // Bound, never pasted: NULLs stay NULL, numbers numbers, pictures bytes, quotes quotes.
        for (int i = 0; i < record.count(); ++i)
            insert.addBindValue(select.value(i));
        if (!insert.exec()) {
            VDRPrompt::critical(tr("SQL Error"), insert.lastError().text());
            return false;
        }
    }
    return true;
}

bool VDRMasterDataExport::writeMasterDataFile(VDRDocument* document, const QString& path)
{
    VDRReportSynchronisation sync(document);
    QString error;
    const bool ok = writeDatabaseFile(
        VDRReportSynchronisation::masterDataConnectionName(), path,
        [&](QSqlDatabase db, QString&) { return sync.exportMasterData4Synch(db); }, error);
    if (!ok && !error.isEmpty())
        VDRPrompt::critical(tr("Fehler"),
                            tr("Export-Datenbank konnte nicht erstellt werden!") + QLatin1Char('\n') + error);
    return ok;
}

bool VDRReportSynchronisation::exportMasterData4Synch(QSqlDatabase target)
{
    QSqlDatabase diary = m_document->database();
    QString error;
    if (!runScript(target, masterDataCreateScriptPath(), error)) {
        message(VDRPrompt::Critical, tr("Fehler"), tr("Export-Datenbank konnte nicht erstellt werden!"));
        return false;
    }
    const auto dbError = [&](const QSqlQuery& q) {
        message(VDRPrompt::Critical, tr("Datenbankfehler"), q.lastError().text());
        return false;
    };
    QSqlQuery q(target);
    q.prepare(QStringLiteral("INSERT INTO meta (KEY, VALUE) VALUES('fileversion', :actVersion);"));
    q.bindValue(QStringLiteral(":actVersion"), VDRMasterDataExport::masterDataFileVersion());
    if (!q.exec())
        return dbError(q);
    q.prepare(QStringLiteral("INSERT INTO meta (KEY, VALUE) VALUES('database', :databasename);"));
    q.bindValue(QStringLiteral(":databasename"), QFileInfo(m_document->getFilepath()).fileName());
    if (!q.exec())
        return dbError(q);
    if (!VDRMasterDataExport::insertMasterData(diary, target, QStringLiteral("company"), QString()))
        return false;

    QSqlQuery vdr(diary);
    if (!vdr.exec(
            QStringLiteral("SELECT id, name, headline_left, headline_center, headline_right, footer_left, "
                           "footer_center, footer_right, createdate FROM vdr"))) {
        message(VDRPrompt::Critical, tr("SQL Error"), vdr.lastError().text());
        return false;
    }
    QSqlQuery insert(target);
    insert.prepare(
        QStringLiteral("INSERT INTO vdr (id, name, headline_left, headline_center, headline_right, "
                       "footer_left, footer_center, footer_right, createdate) VALUES (:id, :name, "
                       ":headline_left, :headline_center, :headline_right, :footer_left, :footer_center, "
                       ":footer_right, :createdate)"));
    while (vdr.next()) {
        const QSqlRecord r = vdr.record();
        for (int i = 0; i < r.count(); ++i)
            insert.bindValue(QLatin1Char(':') + r.fieldName(i), r.value(i));
        if (!insert.exec()) {
            message(VDRPrompt::Critical, tr("SQL Error"), insert.lastError().text());
            return false;
        }
    }

    QSqlQuery locked(diary);
    if (!locked.exec(QStringLiteral("SELECT id, user_id, creation_date FROM entry WHERE locked != 0"))) {
        message(VDRPrompt::Critical, tr("SQL Error"), locked.lastError().text());
        return false;
    }
    QSqlQuery lockedInsert(target);
    lockedInsert.prepare(QStringLiteral(
        "INSERT INTO locked_reports (id, user_id, creation_date ) VALUES (:id, :user_id, :creation_date)"));
    while (locked.next()) {
        lockedInsert.bindValue(QStringLiteral(":id"), locked.value(0));
        lockedInsert.bindValue(QStringLiteral(":user_id"), locked.value(1));
        lockedInsert.bindValue(QStringLiteral(":creation_date"), locked.value(2));
        if (!lockedInsert.exec()) {
            message(VDRPrompt::Critical, tr("SQL Error"), lockedInsert.lastError().text());
            return false;
        }
    }
    return true;
}

bool VDRMasterDataExport::check4ExportedMasterData(VDRDocument* document, bool& exported, QString& target)
{
    exported = false;
    target.clear();
    QSqlQuery q(document->database());
    q.prepare(QStringLiteral("SELECT key, value FROM meta WHERE key=:key"));
    q.bindValue(QStringLiteral(":key"), QStringLiteral("exportedTo"));
    if (!q.exec())
        return false;
    if (q.next()) {
        exported = true;
        target = q.value(1).toString();
    }
    return true;
}

// The steps of a follow-up diary; each tells the user when it fails.
namespace {

bool sqlFailed(const QString& text)
{
    VDRPrompt::critical(VDRMasterDataExport::tr("SQL Error"), text);
    return false;
}

// The predecessor's meta data, but not where it was exported to or from; the file version is this
// program's.
bool copyMeta(QSqlDatabase old, QSqlDatabase newDiary)
{
    QString error;
    QSqlQuery meta(old);
    meta.prepare(QStringLiteral("SELECT key, value FROM meta WHERE key <> :key1 AND key <> :key2"));
    meta.bindValue(QStringLiteral(":key1"), QStringLiteral("exportedTo"));
    meta.bindValue(QStringLiteral(":key2"), QStringLiteral("exportedFrom"));
    if (!exec(meta, error))
        return sqlFailed(error);
    QSqlQuery insert(newDiary);
    insert.prepare(QStringLiteral("INSERT INTO meta (key, value) VALUES (:key, :value)"));
    while (meta.next()) {
        const QString key = meta.value(0).toString();
        insert.bindValue(QStringLiteral(":key"), key);
        insert.bindValue(QStringLiteral(":value"), key == QLatin1String("fileversion")
                                                       ? QVariant(VDRDatabaseSchema::currentVersion())
                                                       : meta.value(1));
        if (!exec(insert, error))
            return sqlFailed(error);
    }
    return true;
}

bool copyMasterData(QSqlDatabase old, QSqlDatabase newDiary)
{
    for (const char* table : {"addresslist", "addresslist_item", "vdr"}) {
        if (!VDRMasterDataExport::insertMasterData(old, newDiary, QLatin1String(table), QString()))
            return false;
    }
    // The frozen copies of locked reports stay behind with their reports.
    if (!VDRMasterDataExport::insertMasterData(old, newDiary, QStringLiteral("company"),
                                               QStringLiteral("WHERE category > 0")))
        return false;
    // The two logos keep their ids, which vdr names.
    return VDRMasterDataExport::insertMasterData(
        old, newDiary, QStringLiteral("image"),
        QStringLiteral("WHERE id IN (SELECT logo_image_id FROM vdr UNION SELECT logo2_image_id FROM "
                       "vdr)"));
}

// The new diary knows the predecessor's report numbers and where it came from.
bool copyReportNumbers(QSqlDatabase old, QSqlDatabase newDiary, const QString& oldPath)
{
    QString error;
    QSqlQuery numbers(old);
    if (!numbers.exec(QStringLiteral("SELECT number FROM entry")))
        return sqlFailed(numbers.lastError().text());
    QSqlQuery insert(newDiary);
    insert.prepare(
        QStringLiteral("INSERT INTO external_entry_number (number, filepath) VALUES (:number, :filepath)"));
    while (numbers.next()) {
        insert.bindValue(QStringLiteral(":number"), numbers.value(0));
        insert.bindValue(QStringLiteral(":filepath"), oldPath);
        if (!exec(insert, error))
            return sqlFailed(error);
    }
    insert.prepare(QStringLiteral("INSERT INTO meta (key, value) VALUES (:key, :value)"));
    insert.bindValue(QStringLiteral(":key"), QStringLiteral("exportedFrom"));
    insert.bindValue(QStringLiteral(":value"), oldPath);
    if (!exec(insert, error))
        return sqlFailed(error);
    return true;
}

// The first report takes the next id of the copied counter.
bool takeFirstEntryId(QSqlDatabase newDiary, int& newId)
{
    QString error;
    newId = 1;
    QSqlQuery counter(newDiary);
    counter.prepare(
        QStringLiteral("SELECT id_table, id_counter FROM id_generator WHERE id_table = :tablename"));
    counter.bindValue(QStringLiteral(":tablename"), QStringLiteral("entry"));
    if (!exec(counter, error))
        return sqlFailed(error);
    if (counter.next()) {
        newId = counter.value(1).toInt() + 1;
        counter.finish();
        QSqlQuery update(newDiary);
        update.prepare(
            QStringLiteral("UPDATE id_generator SET id_counter = :newid WHERE id_table = :tablename"));
        update.bindValue(QStringLiteral(":newid"), newId);
        update.bindValue(QStringLiteral(":tablename"), QStringLiteral("entry"));
        if (!exec(update, error))
            return sqlFailed(error);
    } else {
        QSqlQuery add(newDiary);
        add.prepare(QStringLiteral("INSERT INTO id_generator (id_table, id_counter) VALUES (:tablename, 1)"));
        add.bindValue(QStringLiteral(":tablename"), QStringLiteral("entry"));
        if (!exec(add, error))
            return sqlFailed(error);
    }
    return true;
}

// An empty draft, numbered after the predecessor's highest report.
bool addFirstReport(QSqlDatabase old, QSqlDatabase newDiary, int newId)
{
    QString error;
    const QString number = VDREntryNumber::newDraft(VDREntryNumber::highestNumber(old) + 1, 3);
    const QTime now = QTime::currentTime();
    QSqlQuery entry(newDiary);
    entry.prepare(QStringLiteral(
        "INSERT INTO entry (id, locked, persistent_document, persistent_document_ct, number, "
        "inspection_date, "
        "inspection_time_from, inspection_time_to, env_time, env_weather1, env_weather2, env_weather3, "
        "env_temperature, env_humidity, progress, deficiencies, tests, interventions, special_incidents, "
        "construction_material_sample, notice, print_notice, print_telephone_notice, progress_audio_id, "
        "user_id, "
        "creation_date, exported_by_app, import_version) VALUES (:id, 0, NULL, NULL, :number, :date, :from, "
        ":to, "
        ":env, '', '', '', '', '', '', '', '', '', '', 0, '', 1, 1, 0, :user, NULL, 0, NULL)"));
    entry.bindValue(QStringLiteral(":id"), newId);
    entry.bindValue(QStringLiteral(":number"), number);
    entry.bindValue(QStringLiteral(":date"), QDate::currentDate());
    entry.bindValue(QStringLiteral(":from"), now);
    entry.bindValue(QStringLiteral(":to"), now);
    entry.bindValue(QStringLiteral(":env"), now);
    entry.bindValue(QStringLiteral(":user"),
                    QSettings().value(QStringLiteral("entry/UID"), QString()).toString() +
                        QStringLiteral(""));
    if (!exec(entry, error))
        return sqlFailed(error);
    QSqlQuery counterText(newDiary);
    counterText.prepare(QStringLiteral("UPDATE vdr SET entrycounter = :id WHERE id = 1"));
    counterText.bindValue(QStringLiteral(":id"), newId);
    if (!exec(counterText, error))
        return sqlFailed(error);
    return true;
}

} // namespace

bool VDRMasterDataExport::ExportMasterData(VDRDocument* document, QSqlDatabase newDiary, const QString& path)
{
    Q_UNUSED(path)
    QSqlDatabase old = document->database();
    QString error;
    if (!runScript(newDiary, VDRDatabaseSchema::createScriptPath(), error)) {
        VDRPrompt::critical(tr("Fehler"), tr("Export-Datenbank konnte nicht erstellt werden!"));
        return false;
    }
    VDRDatabaseSchema::createEntryIndexes(newDiary);
    if (!insertMasterData(old, newDiary, QStringLiteral("id_generator"), QString()))
        return false;
    int newId = 1;
    return copyMeta(old, newDiary) && copyMasterData(old, newDiary) &&
           copyReportNumbers(old, newDiary, document->getFilepath()) && takeFirstEntryId(newDiary, newId) &&
           addFirstReport(old, newDiary, newId);
}

int VDRMasterDataExport::createFollowUpDiary(VDRDocument* document, const QString& newPath)
{
    const QString title = tr("Stammdaten Export");
    const QFileInfo target(newPath);
    const QFileInfo own(document->getFilepath());
    if (target.absoluteFilePath() == own.absoluteFilePath() ||
        (target.exists() && target.canonicalFilePath() == own.canonicalFilePath())) {
        VDRPrompt::warning(title, tr("Sie können nicht in die Originaldatei exportieren!"));
        return 1;
    }
    QString error;
    const bool ok = writeDatabaseFile(
        exportConnectionName(), target.absoluteFilePath(),
        [&](QSqlDatabase db, QString&) { return ExportMasterData(document, db, target.absoluteFilePath()); },
        error);
    if (!ok) {
        if (!error.isEmpty())
            VDRPrompt::critical(tr("Fehler"), tr("Export-Datenbank konnte nicht erstellt werden!") +
                                                  QLatin1Char('\n') + error);
        return 2;
    }
    // A documents database of an earlier file of that name belongs to no diary now.
    const QString documents = VDRDocument::documentsDbPathFor(target.absoluteFilePath());
    if (QFileInfo::exists(documents))
        VDRFileOps::removeDatabase(documents);
    if (!document->setMetaValue(QStringLiteral("exportedTo"), target.absoluteFilePath()))
        return 2;
    document->setModified(true);
    return 0;
}
