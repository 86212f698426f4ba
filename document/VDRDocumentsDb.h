#pragma once

#include <QString>

class VDRDocument;

// The documents database beside a diary (X.vdd): attached plans and delivery papers with their
// pending changes, committed on save and rolled back on close.
class VDRDocumentsDb
{
public:
    static QString connectionName() { return QStringLiteral("DOCUMENTS"); }

    // Rolls back the pending changes of the diary's documents database, if it has one.
    static bool resetChangesOnDocumentsDb(const QString& diaryPath);
    // On save: pending changes become the saved state.
    static bool storeChangesOnDocumentsDb(const QString& diaryPath);
    // Removes records whose rows are gone and VACUUMs; part of the diary's compaction.
    static bool compactDocumentDB(const QString& diaryPath);
    // After closing: offers compaction when much space could be freed.
    static void checkDocumentDBsFreeSpace(const QString& diaryPath);
    // Reports removed in the diary: their documents become pending removals (status 1 -> 3, 0 -> 2).
    static bool removeRecordsOnDocumentsDb4Entry(VDRDocument* document, int entryId);
    // One-time move of external document files into the database; leaves "documentImport" alone
    // while nothing was moved.
    static bool importExternalDocuments(VDRDocument* document);
};
