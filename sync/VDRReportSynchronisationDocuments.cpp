// The attached documents of replaced reports follow the reports' new rows.
#include "sync/VDRReportSynchronisation.h"

#include "document/VDRDocument.h"
#include "document/VDRDocumentsDb.h"
#include "document/VDRPrompt.h"
#include "document/VDRScopedConnection.h"

#include <QFileInfo>
#include <QSqlError>
#include <QSqlQuery>

// ---- Documents ----

void VDRReportSynchronisation::importDocuments(const QHash<int, QList<ReplacedDocument>>& replaced)
{
    const QString diaryPath = m_document->getFilepath();
    if (replaced.isEmpty() || diaryPath.isEmpty())
        return;
    const QString documentsPath = VDRDocument::documentsDbPathFor(diaryPath);
    if (!QFileInfo::exists(documentsPath))
        return;
    VDRScopedConnection connection(VDRDocumentsDb::connectionName(), documentsPath);
    if (!connection.isOpen()) {
        message(VDRPrompt::Critical, tr("SQL Error"), connection.lastError().text());
        return;
    }
    QSqlDatabase db = connection.db();
    QSqlDatabase diary = m_document->database();
    const auto sqlError = [&](const QSqlQuery& q) {
        message(VDRPrompt::Critical, tr("SQL Error"), q.lastError().text());
    };
    // A replaced report's documents follow its new rows of the same document name; a document
    // whose row did not come back is a pending removal, undone if the diary is not saved.
    for (auto it = replaced.constBegin(); it != replaced.constEnd(); ++it) {
        const int entryId = it.key();
        for (const ReplacedDocument& d : it.value()) {
            QSqlQuery find(diary);
            find.prepare(
                QStringLiteral("SELECT id FROM %1 WHERE entry_id = :entry AND document = :name ORDER BY id")
                    .arg(d.table));
            find.bindValue(QStringLiteral(":entry"), entryId);
            find.bindValue(QStringLiteral(":name"), d.name);
            if (!find.exec()) {
                sqlError(find);
                continue;
            }
            if (!find.next()) {
                VDRDocumentsDb::setStatus4DocumentRecord(db, d.table, d.recordId, 2);
                continue;
            }
            const int newRecord = find.value(0).toInt();
            QSqlQuery q(db);
            q.prepare(QStringLiteral(
                "UPDATE documents SET orig_record_id = record_id, orig_entry_id = entry_id WHERE "
                "tablename = :table AND record_id = :record AND documentname = :name AND "
                "orig_record_id = -1 AND orig_entry_id = -1 AND (status = 0 OR status = 1)"));
            q.bindValue(QStringLiteral(":table"), d.table);
            q.bindValue(QStringLiteral(":record"), d.recordId);
            q.bindValue(QStringLiteral(":name"), d.name);
            if (!q.exec()) {
                sqlError(q);
                continue;
            }
            q.prepare(QStringLiteral(
                "UPDATE documents SET record_id = :newRecord, entry_id = :entry WHERE tablename = "
                ":table AND record_id = :record AND documentname = :name AND (status = 0 OR "
                "status = 1)"));
            q.bindValue(QStringLiteral(":newRecord"), newRecord);
            q.bindValue(QStringLiteral(":entry"), entryId);
            q.bindValue(QStringLiteral(":table"), d.table);
            q.bindValue(QStringLiteral(":record"), d.recordId);
            q.bindValue(QStringLiteral(":name"), d.name);
            if (!q.exec())
                sqlError(q);
        }
    }
}
