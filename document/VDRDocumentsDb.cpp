#include "document/VDRDocumentsDb.h"

#include "document/VDRDocument.h"
#include "document/CVdShared.h"
#include "document/VDRPrompt.h"

#include <QCoreApplication>
#include <QDebug>
#include <QFileInfo>
#include <QSqlDatabase>
#include <QSqlError>
#include <QSqlQuery>

bool VDRDocumentsDb::resetChangesOnDocumentsDb(const QString& diaryPath)
{
    const QString path = VDRDocument::documentsDbPathFor(diaryPath);
    if (!QFileInfo::exists(path))
        return true;
    bool ok = true;
    {
        QSqlDatabase db = QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), connectionName());
        db.setDatabaseName(path);
        if (!db.open()) {
            VDRPrompt::critical(QCoreApplication::translate("VDRDocumentsDb", "Datenbankfehler Dokumente-Datenbank"),
                                CVdShared::sqlErrorText(db.lastError()));
            ok = false;
        } else {
            QSqlQuery q(db);
            q.exec(QStringLiteral("PRAGMA locking_mode = EXCLUSIVE"));
            const QStringList statements = {
                QStringLiteral("UPDATE documents SET status = 0 WHERE status = 2"),
                QStringLiteral("DELETE FROM documents WHERE status = 1 OR status = 3"),
                QStringLiteral("UPDATE documents SET record_id = orig_record_id, entry_id = orig_entry_id WHERE "
                               "orig_record_id > -1 AND orig_entry_id > -1"),
                QStringLiteral("UPDATE documents SET orig_record_id = -1, orig_entry_id = -1 WHERE orig_record_id > -1"),
            };
            q.exec(QStringLiteral("BEGIN EXCLUSIVE TRANSACTION"));
            for (const QString& sql : statements) {
                if (!q.exec(sql)) {
                    qDebug().noquote() << "SQL Error: " << q.lastError().text();
                    ok = false;
                }
            }
            q.exec(QStringLiteral("COMMIT TRANSACTION"));
        }
        db.close();
    }
    QSqlDatabase::removeDatabase(connectionName());
    return ok;
}

bool VDRDocumentsDb::storeChangesOnDocumentsDb(const QString& diaryPath)
{
    const QString path = VDRDocument::documentsDbPathFor(diaryPath);
    if (diaryPath.isEmpty() || !QFileInfo::exists(path))
        return true;
    bool ok = true;
    {
        QSqlDatabase db = QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), connectionName());
        db.setDatabaseName(path);
        if (!db.open()) {
            VDRPrompt::critical(QCoreApplication::translate("VDRDocumentsDb", "Datenbankfehler Dokumente-Datenbank"),
                                CVdShared::sqlErrorText(db.lastError()));
            ok = false;
        } else {
            QSqlQuery q(db);
            q.exec(QStringLiteral("PRAGMA locking_mode = EXCLUSIVE"));
            q.exec(QStringLiteral("BEGIN EXCLUSIVE TRANSACTION"));
            for (const char* sql : {"UPDATE documents SET status = 0 WHERE status = 1",
                                    "DELETE FROM documents WHERE status = 2 OR status = 3",
                                    "UPDATE documents SET orig_record_id = -1, orig_entry_id = -1 WHERE orig_record_id > -1"}) {
                if (!q.exec(QLatin1String(sql))) {
                    qDebug().noquote() << "SQL Error: " << q.lastError().text();
                    ok = false;
                }
            }
            q.exec(QStringLiteral("COMMIT TRANSACTION"));
        }
        db.close();
    }
    QSqlDatabase::removeDatabase(connectionName());
    return ok;
}

bool VDRDocumentsDb::compactDocumentDB(const QString& diaryPath)
{
    // Filled in with the documents database itself; a diary without one has nothing to compact.
    Q_UNUSED(diaryPath)
    return true;
}

void VDRDocumentsDb::checkDocumentDBsFreeSpace(const QString& diaryPath)
{
    Q_UNUSED(diaryPath)
}

bool VDRDocumentsDb::removeRecordsOnDocumentsDb4Entry(VDRDocument* document, int entryId)
{
    Q_UNUSED(document)
    Q_UNUSED(entryId)
    return true;
}

bool VDRDocumentsDb::importExternalDocuments(VDRDocument* document)
{
    Q_UNUSED(document)
    return true;
}
