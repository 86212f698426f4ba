#include "document/VDRDocumentsDb.h"

#include "document/CVdShared.h"
#include "document/VDRDatabaseSchema.h"
#include "document/VDRDocument.h"
#include "document/VDRPrompt.h"
#include "document/VDRScopedConnection.h"

#include <QCoreApplication>
#include <QDebug>
#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QHash>
#include <QSet>
#include <QSqlError>
#include <QSqlQuery>

#include <algorithm>

namespace {

QString tr(const char* text)
{
    return QCoreApplication::translate("VDRDocumentsDb", text);
}

const char* const kDiaryConnection = "DOCUMENTSDIARY";
const char* const kDocumentTables[] = {"entry_constructionmaterial", "entry_scheduleddelivery"};

// Compaction rewrites the whole file: worth offering only when it frees a noticeable amount (10 MB)
// that is also a good share (over a quarter) of the file, so small or busy databases are left alone.
constexpr qint64 kMinFreeBytesForCompactionOffer = 10 * 1024000;
constexpr qint64 kMinFreeShareForCompactionOfferPercent = 25;

QString nativePath(const QString& path)
{
    return QDir::toNativeSeparators(path);
}

// The connection "DOCUMENTS" on an existing documents database.
class DocumentsConnection : public VDRScopedConnection
{
public:
    explicit DocumentsConnection(const QString& diaryPath)
        : VDRScopedConnection(VDRDocumentsDb::connectionName(), VDRDocument::documentsDbPathFor(diaryPath))
    {
    }
};

bool documentsDbExists(const QString& diaryPath)
{
    const QFileInfo fi(VDRDocument::documentsDbPathFor(diaryPath));
    return fi.isFile() && fi.size() > 0;
}

void showOpenFailure(const QSqlError& error)
{
    VDRPrompt::critical(tr("Datenbankfehler Dokumente-Datenbank"), CVdShared::sqlErrorText(error));
}

void logSqlError(const QSqlQuery& q)
{
    qDebug().noquote() << "SQL Error: " << q.lastError().text();
}

void showSizeRefusal(const QString& name, qint64 bytes)
{
    VDRPrompt::warning(
        tr("Dokument importieren"),
        tr("Die Dokument-Datei %1 kann aufgrund der Dateigröße (%2 MB) nicht importiert werden.\nDie "
           "maximale Dateigröße für den Import von Dokumenten beträgt %3 MB.\n")
            .arg(name, QString::number(bytes / 1024000), QString::number(50)));
}

void showReadFailure(const QString& name)
{
    VDRPrompt::critical(tr("Dateifehler"),
                        tr("Die externe Dokumentendatei %1 konnte aufgrund eines Lesefehlers nicht "
                           "importiert werden.\n")
                            .arg(name));
}

// Creates the documents database when missing; tells the user when that fails.
bool ensureDocumentsDb(const QString& diaryPath)
{
    if (documentsDbExists(diaryPath))
        return true;
    if (VDRDocumentsDb::createDocumentsDb(diaryPath))
        return true;
    VDRPrompt::critical(tr("Datenbankfehler Dokumente-Datenbank"),
                        tr("Dokumente-Datenbank konnte nicht angelegt werden."));
    return false;
}

// A new documents row with status 1.
bool insertDocument(QSqlDatabase db, qint64 entryId, const QString& table, const QString& name,
                    const QByteArray& content, qint64 recordId)
{
    const int id = VDRDocumentsDb::getNewRecordId4TableOnDocumentsDb(db, QStringLiteral("documents"));
    if (id < 1 || !VDRDocumentsDb::setNewRecordId4TableOnDocumentsDb(db, QStringLiteral("documents"), id))
        return false;
    QSqlQuery q(db);
    q.prepare(
        QStringLiteral("INSERT INTO documents (id, entry_id, tablename, documentname, document_content, "
                       "record_id, status) VALUES (:id, :entry_id, :tablename, :documentname, :content, "
                       ":record_id, 1)"));
    q.bindValue(QStringLiteral(":id"), id);
    q.bindValue(QStringLiteral(":entry_id"), entryId);
    q.bindValue(QStringLiteral(":tablename"), table);
    q.bindValue(QStringLiteral(":documentname"), name);
    q.bindValue(QStringLiteral(":content"), content);
    q.bindValue(QStringLiteral(":record_id"), recordId);
    if (!q.exec()) {
        VDRPrompt::critical(tr("Datenbankfehler Dokumente-Datenbank"),
                            CVdShared::sqlErrorText(q.lastError()));
        return false;
    }
    return true;
}

// Runs the statements in one exclusive transaction; failures go to the debug log.
bool runPendingChangeStatements(QSqlDatabase db, const QList<QPair<QString, QVariantMap>>& statements)
{
    bool ok = true;
    QSqlQuery q(db);
    q.exec(QStringLiteral("BEGIN EXCLUSIVE TRANSACTION"));
    for (const auto& statement : statements) {
        q.prepare(statement.first);
        for (auto it = statement.second.cbegin(); it != statement.second.cend(); ++it)
            q.bindValue(it.key(), it.value());
        if (!q.exec()) {
            logSqlError(q);
            ok = false;
        }
    }
    q.exec(QStringLiteral("COMMIT TRANSACTION"));
    return ok;
}

} // namespace

bool VDRDocumentsDb::isDocumentTable(const QString& table)
{
    for (const char* name : kDocumentTables) {
        if (table == QLatin1String(name))
            return true;
    }
    return false;
}

bool VDRDocumentsDb::createDocumentsDb(const QString& diaryPath)
{
    if (diaryPath.isEmpty())
        return false;
    if (documentsDbExists(diaryPath))
        return true;
    const QString path = VDRDocument::documentsDbPathFor(diaryPath);
    QFile::remove(path); // an empty leftover of an interrupted creation
    const QString errorTitle = tr("Datenbankfehler Dokumente-DB");
    bool ok = false;
    {
        VDRScopedConnection connection(connectionName(), path);
        if (!connection.isOpen()) {
            VDRPrompt::critical(errorTitle, CVdShared::sqlErrorText(connection.lastError()));
        } else {
            QSqlDatabase db = connection.db();
            QSqlQuery q(db);
            if (!q.exec(QStringLiteral("BEGIN EXCLUSIVE TRANSACTION"))) {
                VDRPrompt::critical(errorTitle, CVdShared::sqlErrorText(q.lastError()));
            } else {
                ok = VDRDatabaseSchema::runScript(db, createScriptPath(), errorTitle);
                if (ok && !setFileVersionOnDocumentsDb(db)) {
                    VDRPrompt::critical(tr("interner Fehler"),
                                        tr("Datenbank-Initialisierung fehlgeschlagen."));
                    ok = false;
                }
                if (ok && !q.exec(QStringLiteral("COMMIT TRANSACTION"))) {
                    VDRPrompt::critical(errorTitle, CVdShared::sqlErrorText(q.lastError()));
                    ok = false;
                }
                if (!ok)
                    q.exec(QStringLiteral("ROLLBACK TRANSACTION"));
            }
        }
    }
    if (!ok)
        QFile::remove(path);
    return ok;
}

bool VDRDocumentsDb::setFileVersionOnDocumentsDb(QSqlDatabase db)
{
    QSqlQuery q(db);
    q.prepare(QStringLiteral("INSERT INTO meta (KEY, VALUE) VALUES('fileversion', :actVersion);"));
    q.bindValue(QStringLiteral(":actVersion"), fileVersion());
    if (!q.exec()) {
        logSqlError(q);
        return false;
    }
    return true;
}

int VDRDocumentsDb::getNewRecordId4TableOnDocumentsDb(QSqlDatabase db, const QString& table)
{
    QSqlQuery q(db);
    // Inside a caller's transaction BEGIN fails harmlessly and the caller's transaction covers us.
    const bool own = q.exec(QStringLiteral("BEGIN EXCLUSIVE TRANSACTION"));
    int id = -1;
    q.prepare(QStringLiteral("SELECT id_counter FROM id_generator WHERE id_table = :tablename"));
    q.bindValue(QStringLiteral(":tablename"), table);
    if (!q.exec())
        logSqlError(q);
    else
        id = q.next() ? q.value(0).toInt() + 1 : 1;
    q.finish();
    // A counter behind the rows (a file written by other means) must not hand out a used id.
    if (id > 0 && table == QLatin1String("documents") &&
        q.exec(QStringLiteral("SELECT MAX(id) FROM documents")) && q.next())
        id = std::max(id, q.value(0).toInt() + 1);
    q.finish();
    if (own)
        q.exec(QStringLiteral("COMMIT TRANSACTION"));
    return id;
}

bool VDRDocumentsDb::setNewRecordId4TableOnDocumentsDb(QSqlDatabase db, const QString& table, int id)
{
    QSqlQuery q(db);
    const bool own = q.exec(QStringLiteral("BEGIN EXCLUSIVE TRANSACTION"));
    q.prepare(QStringLiteral("UPDATE id_generator SET id_counter = :newid WHERE id_table = :tablename"));
    q.bindValue(QStringLiteral(":newid"), id);
    q.bindValue(QStringLiteral(":tablename"), table);
    bool ok = q.exec();
    if (ok && q.numRowsAffected() == 0) {
        q.prepare(QStringLiteral("INSERT INTO id_generator (id_table, id_counter) VALUES (:tablename, 1)"));
        q.bindValue(QStringLiteral(":tablename"), table);
        ok = q.exec();
        // The new counter row starts at 1; any other id must still be stored, or ids would repeat.
        if (ok && id != 1) {
            q.prepare(
                QStringLiteral("UPDATE id_generator SET id_counter = :newid WHERE id_table = :tablename"));
            q.bindValue(QStringLiteral(":newid"), id);
            q.bindValue(QStringLiteral(":tablename"), table);
            ok = q.exec();
        }
    }
    if (!ok)
        logSqlError(q);
    if (own)
        q.exec(ok ? QStringLiteral("COMMIT TRANSACTION") : QStringLiteral("ROLLBACK TRANSACTION"));
    return ok;
}

bool VDRDocumentsDb::setStatus4DocumentRecord(QSqlDatabase db, const QString& table, int recordId, int status)
{
    if (status != 2 && status != 3) {
        qWarning() << "setStatus4DocumentRecord: only removals (2, 3) are recorded, not" << status;
        return false;
    }
    QSqlQuery q(db);
    q.prepare(QStringLiteral(
        "SELECT status FROM documents WHERE tableName = :tablename AND record_id = :record_id AND "
        "(status = :status1 OR status = :status2);"));
    q.bindValue(QStringLiteral(":tablename"), table);
    q.bindValue(QStringLiteral(":record_id"), recordId);
    q.bindValue(QStringLiteral(":status1"), 0);
    q.bindValue(QStringLiteral(":status2"), 1);
    if (!q.exec()) {
        logSqlError(q);
        return false;
    }
    const bool any = q.next();
    q.finish();
    if (!any)
        return true;
    // Saved rows become 2 (back to 0 on reset), rows added since become 3 (gone either way).
    for (const auto& change : {qMakePair(0, 2), qMakePair(1, 3)}) {
        q.prepare(QStringLiteral(
            "UPDATE documents SET status = :status WHERE tableName = :tablename AND record_id = "
            ":record_id AND (status = :status1 OR status = :status2)"));
        q.bindValue(QStringLiteral(":status"), change.second);
        q.bindValue(QStringLiteral(":tablename"), table);
        q.bindValue(QStringLiteral(":record_id"), recordId);
        q.bindValue(QStringLiteral(":status1"), change.first);
        q.bindValue(QStringLiteral(":status2"), change.first);
        if (!q.exec()) {
            logSqlError(q);
            return false;
        }
    }
    return true;
}

bool VDRDocumentsDb::deleteRecordsOnDocumentsDb4RecordId(QSqlDatabase db, const QString& table, int recordId)
{
    QSqlQuery q(db);
    q.prepare(
        QStringLiteral("DELETE FROM documents WHERE tableName = :tablename AND record_id = :record_id AND "
                       "(status = :status1 OR status = :status2)"));
    q.bindValue(QStringLiteral(":tablename"), table);
    q.bindValue(QStringLiteral(":record_id"), recordId);
    q.bindValue(QStringLiteral(":status1"), 0);
    q.bindValue(QStringLiteral(":status2"), 1);
    if (!q.exec()) {
        logSqlError(q);
        return false;
    }
    return true;
}

bool VDRDocumentsDb::removeRecordsOnDocumentsDb4Entry(VDRDocument* document, int entryId)
{
    if (!document || document->getFilepath().isEmpty() || !documentsDbExists(document->getFilepath()))
        return true;
    DocumentsConnection connection(document->getFilepath());
    if (!connection.isOpen()) {
        showOpenFailure(connection.lastError());
        return false;
    }
    const QString sql = QStringLiteral(
        "UPDATE documents SET status = :newStatus WHERE entry_id = :entryId AND status = :oldStatus;");
    return runPendingChangeStatements(connection.db(),
                                      {{sql, {{":newStatus", 3}, {":entryId", entryId}, {":oldStatus", 1}}},
                                       {sql, {{":newStatus", 2}, {":entryId", entryId}, {":oldStatus", 0}}}});
}

bool VDRDocumentsDb::storeChangesOnDocumentsDb(const QString& diaryPath)
{
    if (diaryPath.isEmpty() || !documentsDbExists(diaryPath))
        return true;
    DocumentsConnection connection(diaryPath);
    if (!connection.isOpen()) {
        showOpenFailure(connection.lastError());
        return false;
    }
    return runPendingChangeStatements(
        connection.db(),
        {{QStringLiteral("UPDATE documents SET status = :newSstatus WHERE status = :oldStatus;"),
          {{":newSstatus", 0}, {":oldStatus", 1}}},
         {QStringLiteral("DELETE FROM documents WHERE status = :status1 OR status = :status2;"),
          {{":status1", 2}, {":status2", 3}}},
         {QStringLiteral(
              "UPDATE documents SET orig_record_id = -1, orig_entry_id = -1 WHERE orig_record_id > -1"),
          {}}});
}

bool VDRDocumentsDb::resetChangesOnDocumentsDb(const QString& diaryPath)
{
    if (diaryPath.isEmpty() || !documentsDbExists(diaryPath))
        return true;
    DocumentsConnection connection(diaryPath);
    if (!connection.isOpen()) {
        showOpenFailure(connection.lastError());
        return false;
    }
    return runPendingChangeStatements(
        connection.db(),
        {{QStringLiteral("UPDATE documents SET status = 0 WHERE status = 2"), {}},
         {QStringLiteral("DELETE FROM documents WHERE status = 1 OR status = 3"), {}},
         {QStringLiteral("UPDATE documents SET record_id = orig_record_id, entry_id = orig_entry_id WHERE "
                         "orig_record_id > -1 AND orig_entry_id > -1"),
          {}},
         {QStringLiteral(
              "UPDATE documents SET orig_record_id = -1, orig_entry_id = -1 WHERE orig_record_id > -1"),
          {}}});
}

int VDRDocumentsDb::removeDeadRecordsInDocumentDB(QSqlDatabase db, QSqlDatabase diary)
{
    // A diary that cannot be read must not make every document look dead.
    QHash<QString, QSet<qint64>> liveRows;
    for (const char* table : kDocumentTables) {
        QSqlQuery rows(diary);
        if (!rows.exec(QStringLiteral("SELECT id FROM %1").arg(QLatin1String(table)))) {
            logSqlError(rows);
            return -1;
        }
        QSet<qint64>& ids = liveRows[QLatin1String(table)];
        while (rows.next())
            ids.insert(rows.value(0).toLongLong());
    }
    const bool workingCopy = diary.connectionName() == VDRDocument::connectionName();

    QList<qint64> dead;
    {
        QSqlQuery q(db);
        if (!q.exec(QStringLiteral("SELECT id, entry_id, tablename, record_id FROM documents;"))) {
            logSqlError(q);
            return -1;
        }
        while (q.next()) {
            const QString table = q.value(2).toString();
            if (q.value(3).isNull() || !liveRows.value(table).contains(q.value(3).toLongLong()))
                dead << q.value(0).toLongLong();
        }
    }
    QStringList statements;
    if (workingCopy)
        statements << QStringLiteral("DELETE FROM documents WHERE id = :id AND (status = 1 OR status = 3)")
                   << QStringLiteral("UPDATE documents SET status = 2 WHERE id = :id AND status = 0");
    else
        statements << QStringLiteral("DELETE FROM documents WHERE id = :id");
    int touched = 0;
    QSqlQuery q(db);
    q.exec(QStringLiteral("BEGIN EXCLUSIVE TRANSACTION"));
    for (qint64 id : qAsConst(dead)) {
        for (const QString& sql : qAsConst(statements)) {
            q.prepare(sql);
            q.bindValue(QStringLiteral(":id"), id);
            if (!q.exec()) {
                logSqlError(q);
                q.exec(QStringLiteral("ROLLBACK TRANSACTION"));
                return -1;
            }
            touched += q.numRowsAffected();
        }
    }
    q.exec(QStringLiteral("COMMIT TRANSACTION"));
    return touched;
}

bool VDRDocumentsDb::importDocumentFile(const QString& path, QByteArray& content)
{
    content.clear();
    QFile file(path);
    if (!file.open(QIODevice::ReadOnly))
        return false;
    const qint64 expected = file.size();
    content = file.readAll();
    if (file.error() != QFileDevice::NoError || content.size() != expected) {
        content.clear();
        return false;
    }
    return true;
}

void VDRDocumentsDb::checkDocumentDBsFreeSpace(const QString& diaryPath)
{
    if (diaryPath.isEmpty() || !documentsDbExists(diaryPath))
        return;
    const qint64 fileSize = QFileInfo(VDRDocument::documentsDbPathFor(diaryPath)).size();
    qint64 documentsSize = 0;
    {
        DocumentsConnection connection(diaryPath);
        if (!connection.isOpen()) {
            showOpenFailure(connection.lastError());
            return;
        }
        QSqlQuery q(connection.db());
        if (!q.exec(QStringLiteral("SELECT SUM(Length(document_content)) FROM documents ;"))) {
            logSqlError(q);
            return;
        }
        if (q.next())
            documentsSize = q.value(0).toLongLong();
    }
    const qint64 freeBytes = fileSize - documentsSize;
    qDebug().noquote() << "Dokumente: " << documentsSize / 1024000 << "Dateigröße: " << fileSize / 1024000
                       << "Datei - DB: " << freeBytes / 1024000;
    if (freeBytes < kMinFreeBytesForCompactionOffer ||
        freeBytes * 100 <= fileSize * kMinFreeShareForCompactionOfferPercent)
        return;
    const int choice =
        VDRPrompt::instance()->choose(VDRPrompt::Question, tr("Dokumente-Datenbank bereinigen"),
                                      tr("Sie können jetzt die Dokumente-Datenbank komprimieren, um "
                                         "Speicherplatz zu sparen.\nDadurch werden ca. %1 MB freigegeben.")
                                          .arg(freeBytes / 1024000),
                                      {tr("Datenbank komprimieren"), tr("Abbrechen")}, 0, 1);
    if (choice == 0)
        compactDocumentDB(diaryPath, true);
}

bool VDRDocumentsDb::compactDocumentDB(const QString& diaryPath, bool showMessages)
{
    const QString title = tr("Dokumente-Datenbank komprimieren");
    const QString path = VDRDocument::documentsDbPathFor(diaryPath);
    if (diaryPath.isEmpty() || !documentsDbExists(diaryPath)) {
        if (showMessages)
            VDRPrompt::warning(title,
                               tr("Die Dokumente-Datenbank %1 existiert nicht.").arg(nativePath(path)));
        return true;
    }
    if (showMessages)
        VDRPrompt::instance()->beginNotice(
            title,
            tr("Die Dokumente-Datenbank wird jetzt komprimiert.\nDieser Vorgang kann für größere Datenbanken "
               "mehrere Minuten dauern.\n\nUnterbrechen Sie diesen Vorgang nicht und schalten Sie den "
               "Computer nicht aus.\n"));
    const qint64 sizeBefore = QFileInfo(path).size();
    bool ok = false;
    {
        DocumentsConnection connection(diaryPath);
        if (!connection.isOpen()) {
            if (showMessages)
                VDRPrompt::instance()->endNotice();
            VDRPrompt::critical(
                title, tr("Die Dokumente-Datenbank %1 konnte nicht geöffnet werden.").arg(nativePath(path)));
            return false;
        }
        // While the diary is open its working copy is the state to compare with, else the diary file.
        QSqlDatabase workingCopy = QSqlDatabase::database(VDRDocument::connectionName(), false);
        if (workingCopy.isOpen() &&
            QFileInfo(workingCopy.databaseName()) == QFileInfo(VDRDocument::workingCopyPathFor(diaryPath))) {
            removeDeadRecordsInDocumentDB(connection.db(), workingCopy);
        } else if (QFileInfo::exists(diaryPath)) {
            VDRScopedConnection diary(QString::fromLatin1(kDiaryConnection), diaryPath,
                                      QStringLiteral("QSQLITE_OPEN_READONLY"));
            if (diary.isOpen())
                removeDeadRecordsInDocumentDB(connection.db(), diary.db());
        }
        workingCopy = QSqlDatabase();
        QSqlQuery q(connection.db());
        ok = q.exec(QStringLiteral("VACUUM"));
        if (!ok)
            logSqlError(q);
    }
    const qint64 sizeAfter = QFileInfo(path).size();
    qDebug().noquote() << "Dokumente-Datenbank: " << VDRDocument::formatFileSize(sizeBefore) << "->"
                       << VDRDocument::formatFileSize(sizeAfter);
    if (showMessages) {
        VDRPrompt::instance()->endNotice();
        if (!ok)
            VDRPrompt::critical(
                title,
                tr("Die Dokumente-Datenbank %1 konnte nicht komprimiert werden.").arg(nativePath(path)));
        else if (sizeAfter < sizeBefore)
            VDRPrompt::information(
                title,
                tr("Die Dokumente-Datenbank wurde erfolgreich komprimiert.\nDie Dateigröße "
                   "wurde von %1 auf %2 reduziert.")
                    .arg(VDRDocument::formatFileSize(sizeBefore), VDRDocument::formatFileSize(sizeAfter)));
        else
            VDRPrompt::information(title, tr("Die Dokumente-Datenbank wurde erfolgreich komprimiert.\n"));
    }
    return ok;
}

bool VDRDocumentsDb::importExternalDocuments(VDRDocument* document)
{
    if (!document)
        return false;
    const QString diaryPath = document->getFilepath();
    QSqlDatabase diary = document->database();

    struct Candidate
    {
        QString table;
        qint64 recordId;
        qint64 entryId;
        QString name;
    };
    QList<Candidate> candidates;
    for (const char* table : kDocumentTables) {
        QSqlQuery q(diary);
        if (!q.exec(QStringLiteral("SELECT id, entry_id, document FROM %1 ORDER BY id")
                        .arg(QLatin1String(table)))) {
            logSqlError(q);
            return false;
        }
        while (q.next()) {
            const QString name = q.value(2).toString().trimmed();
            if (!name.isEmpty())
                candidates.append(
                    {QLatin1String(table), q.value(0).toLongLong(), q.value(1).toLongLong(), name});
        }
    }

    const QFileInfo diaryInfo(diaryPath);
    const QDir folder(diaryInfo.absolutePath() + QLatin1Char('/') + diaryInfo.completeBaseName() +
                      QStringLiteral("_files"));
    QStringList missing;
    QList<QPair<Candidate, QString>> importable;
    for (const Candidate& c : qAsConst(candidates)) {
        // Only the file name counts: a name with a path must not reach files outside the folder.
        const QString fileName = QFileInfo(c.name).fileName();
        const QFileInfo file(folder.filePath(fileName));
        if (fileName.isEmpty() || !file.isFile())
            missing << c.name;
        else if (file.size() >= maxDocumentBytes())
            showSizeRefusal(c.name, file.size());
        else
            importable.append({c, file.absoluteFilePath()});
    }

    bool ok = true;
    int stored = 0;
    if (!importable.isEmpty()) {
        if (!ensureDocumentsDb(diaryPath))
            return false;
        DocumentsConnection connection(diaryPath);
        if (!connection.isOpen()) {
            VDRPrompt::critical(tr("Datenbankfehler Dokumente-Datenbank"),
                                tr("Dokumente-Datenbank konnte nicht geöffnet werden."));
            return false;
        }
        QSqlDatabase db = connection.db();
        document->beginTransaction();
        for (const auto& item : qAsConst(importable)) {
            const Candidate& c = item.first;
            // A row imported by an earlier, unfinished run is not imported twice.
            QSqlQuery existing(db);
            existing.prepare(QStringLiteral("SELECT count(*) FROM documents WHERE tablename = :tablename AND "
                                            "record_id = :record_id AND (status = 0 OR status = 1)"));
            existing.bindValue(QStringLiteral(":tablename"), c.table);
            existing.bindValue(QStringLiteral(":record_id"), c.recordId);
            if (existing.exec() && existing.next() && existing.value(0).toInt() > 0)
                continue;
            existing.finish();

            QByteArray content;
            if (!importDocumentFile(item.second, content)) {
                showReadFailure(c.name);
                continue;
            }
            const QString storedName = QFileInfo(item.second).fileName();
            if (!insertDocument(db, c.entryId, c.table, storedName, content, c.recordId)) {
                ok = false;
                break;
            }
            QSqlQuery update(diary);
            update.prepare(
                QStringLiteral("UPDATE %1 SET document = :documentName WHERE id = :recId").arg(c.table));
            update.bindValue(QStringLiteral(":documentName"), storedName);
            update.bindValue(QStringLiteral(":recId"), c.recordId);
            if (!update.exec()) {
                logSqlError(update);
                ok = false;
                break;
            }
            ++stored;
        }
        document->endTransaction();
    }
    if (!missing.isEmpty())
        VDRPrompt::warning(tr("Dateifehler"),
                           tr("Folgende externe Dokumente konnten nicht importiert werden, da sie nicht "
                              "existieren:\n\n") +
                               missing.join(QLatin1Char('\n')));
    if (!ok)
        return false;

    QSqlQuery q(diary);
    q.prepare(QStringLiteral("UPDATE meta SET value = :value WHERE key = :key"));
    q.bindValue(QStringLiteral(":value"), QStringLiteral("done"));
    q.bindValue(QStringLiteral(":key"), QStringLiteral("documentImport"));
    bool marked = q.exec();
    if (marked && q.numRowsAffected() == 0)
        marked = q.exec(QStringLiteral("INSERT INTO meta (KEY, VALUE) VALUES('%1', '%2');")
                            .arg(QStringLiteral("documentImport"), QStringLiteral("done")));
    if (!marked)
        logSqlError(q);
    // The working copy now differs from the diary file; closing must ask before throwing that away.
    if (stored > 0)
        VDRDocument::setGlobalModified(true);
    return marked;
}

QString VDRDocumentsDb::addDocument(VDRDocument* document, const QString& table, int recordId, int entryId,
                                    const QString& filePath)
{
    if (!document || document->getFilepath().isEmpty() || !isDocumentTable(table)) {
        qWarning() << "addDocument: no diary file or no document table" << table;
        return QString();
    }
    const QString diaryPath = document->getFilepath();
    const QFileInfo file(filePath);
    if (!file.isFile()) {
        VDRPrompt::critical(tr("Dateifehler"),
                            tr("Die Datei\n%1\nexistiert nicht.").arg(nativePath(filePath)));
        return QString();
    }
    if (file.size() >= maxDocumentBytes()) {
        showSizeRefusal(nativePath(filePath), file.size());
        return QString();
    }
    QByteArray content;
    if (!importDocumentFile(filePath, content)) {
        showReadFailure(nativePath(filePath));
        return QString();
    }
    if (!ensureDocumentsDb(diaryPath))
        return QString();
    DocumentsConnection connection(diaryPath);
    if (!connection.isOpen()) {
        VDRPrompt::critical(tr("Datenbankfehler Dokumente-Datenbank"),
                            tr("Dokumente-Datenbank konnte nicht geöffnet werden."));
        return QString();
    }
    const QString name = file.fileName();
    if (!setStatus4DocumentRecord(connection.db(), table, recordId, 2) ||
        !insertDocument(connection.db(), entryId, table, name, content, recordId))
        return QString();
    return name;
}

QString VDRDocumentsDb::getDocumentTempPath(VDRDocument* document, const QString& table, int recordId)
{
    if (!document || document->getFilepath().isEmpty() || !documentsDbExists(document->getFilepath()))
        return QString();
    QString name;
    QByteArray content;
    {
        DocumentsConnection connection(document->getFilepath());
        if (!connection.isOpen()) {
            showOpenFailure(connection.lastError());
            return QString();
        }
        QSqlQuery q(connection.db());
        q.prepare(QStringLiteral(
            "SELECT documentname, document_content FROM documents WHERE tablename = :tablename "
            "AND record_id = :record_id AND (status = 0 OR status = 1) ORDER BY id DESC"));
        q.bindValue(QStringLiteral(":tablename"), table);
        q.bindValue(QStringLiteral(":record_id"), recordId);
        if (!q.exec()) {
            logSqlError(q);
            return QString();
        }
        if (!q.next())
            return QString();
        name = q.value(0).toString();
        content = q.value(1).toByteArray();
    }
    // The suffix lets the system pick the program that opens it.
    const QString path = document->getFreeTempFile(QFileInfo(name).suffix());
    QFile out(path);
    if (!out.open(QIODevice::WriteOnly) || out.write(content) != content.size() || !out.flush()) {
        qWarning().noquote() << "document not written:" << path << out.errorString();
        out.close();
        QFile::remove(path);
        return QString();
    }
    return path;
}
