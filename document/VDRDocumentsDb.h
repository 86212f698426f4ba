#pragma once

#include <QByteArray>
#include <QSqlDatabase>
#include <QString>

class VDRDocument;

// The documents database beside a diary (X.vdd): attached plans and delivery papers with their
// pending changes, committed on save and rolled back on close.
//
// documents.status: 0 saved, 1 added since the last save, 2 saved and removed since, 3 added and
// removed again. Save: 1 -> 0, 2 and 3 deleted. Reset: 2 -> 0, 1 and 3 deleted.
//
// Functions taking a QSqlDatabase work on a connection the caller opened; the others open
// "DOCUMENTS" themselves and remove it before returning.
class VDRDocumentsDb
{
public:
    static QString connectionName() { return QStringLiteral("DOCUMENTS"); }
    static QString fileVersion() { return QStringLiteral("0.1"); }
    static QString createScriptPath()
    {
        return QStringLiteral(":/VDRDatabase/Resources/documentDB_create.sql");
    }
    // Files of this size or more are not stored (51 x 1,024,000 bytes).
    static qint64 maxDocumentBytes() { return 52224000; }
    // The diary tables whose `document` column names an attached document.
    static bool isDocumentTable(const QString& table);

    // Creates X.vdd from its script unless a non-empty file is there already.
    static bool createDocumentsDb(const QString& diaryPath);
    static bool setFileVersionOnDocumentsDb(QSqlDatabase db);

    // Record ids of the documents database: the next id (counter + 1), -1 on failure; storing the counter.
    static int getNewRecordId4TableOnDocumentsDb(QSqlDatabase db, const QString& table);
    static bool setNewRecordId4TableOnDocumentsDb(QSqlDatabase db, const QString& table, int id);

    // Marks the documents of one diary row as removed: 2 or 3 are accepted, and each row gets 2
    // when it was saved and 3 when it was added since, so a reset never revives an unsaved document.
    static bool setStatus4DocumentRecord(QSqlDatabase db, const QString& table, int recordId, int status);
    // Deletes the current (status 0 and 1) documents of one diary row at once.
    static bool deleteRecordsOnDocumentsDb4RecordId(QSqlDatabase db, const QString& table, int recordId);
    // A report removed in the diary: its documents become pending removals (status 1 -> 3, 0 -> 2).
    static bool removeRecordsOnDocumentsDb4Entry(VDRDocument* document, int entryId);

    // On save: pending changes become the saved state.
    static bool storeChangesOnDocumentsDb(const QString& diaryPath);
    // Rolls back the pending changes of the diary's documents database, if it has one.
    static bool resetChangesOnDocumentsDb(const QString& diaryPath);

    // Removes documents whose diary row is gone. 'diary' is an open connection to the diary; when it
    // is the open document's working copy, saved documents are only marked removed (status 2) so
    // that discarding the working copy still gets them back. Returns the rows touched, -1 on failure.
    static int removeDeadRecordsInDocumentDB(QSqlDatabase db, QSqlDatabase diary);

    // Reads a whole file.
    static bool importDocumentFile(const QString& path, QByteArray& content);

    // After closing: offers compaction when much space could be freed.
    static void checkDocumentDBsFreeSpace(const QString& diaryPath);
    // Removes dead records and VACUUMs. Without 'showMessages' (inside the diary's compaction, which
    // shows its own box) a missing file is nothing to do; with it the box, a missing file and the
    // sizes are shown. True when done or nothing to do.
    static bool compactDocumentDB(const QString& diaryPath, bool showMessages = false);

    // One-time move of the external files named in the `document` columns into the database, then
    // "documentImport" = "done" in the working copy. False, with "documentImport" unchanged, when the
    // database cannot be created or written.
    static bool importExternalDocuments(VDRDocument* document);

    // Attaches a file to a row of entry_constructionmaterial or entry_scheduleddelivery as a pending
    // addition (status 1), replacing the row's current document. Returns the stored document name,
    // which the caller writes into the row's `document` column; empty when refused (the user has
    // been told, except for a diary without a file name, which has no documents database yet).
    static QString addDocument(VDRDocument* document, const QString& table, int recordId, int entryId,
                               const QString& filePath);
    // The current document of a row written to a temporary file of the document (deleted on close),
    // so that the user can open it; empty when there is none or it cannot be written.
    static QString getDocumentTempPath(VDRDocument* document, const QString& table, int recordId);
};
