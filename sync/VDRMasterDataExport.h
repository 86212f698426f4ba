#pragma once

#include <QCoreApplication>
#include <QSqlDatabase>
#include <QString>

class VDRDocument;

// The diary's master data written out: the master-data file for the app, and the follow-up diary
// that starts with the same project data, companies and address lists and knows the predecessor's
// report numbers. Files are written under a temporary name beside the target, flushed and renamed.
class VDRMasterDataExport
{
    Q_DECLARE_TR_FUNCTIONS(VDRMasterDataExport)
public:
    static QString exportConnectionName() { return QStringLiteral("EXPORTDOC"); }
    static QString masterDataFileVersion() { return QStringLiteral("0.1"); }

    // Copies the rows of 'table' (optionally restricted by 'where', SQL from this program only) from
    // 'source' into the same columns of 'target', every value bound with its own type.
    static bool insertMasterData(QSqlDatabase source, QSqlDatabase target, const QString& table,
                                 const QString& where);

    // Writes the master-data file for the app to 'path'. False (the user told) on failure.
    static bool writeMasterDataFile(VDRDocument* document, const QString& path);

    // Whether the diary's master data were exported before, and where to.
    static bool check4ExportedMasterData(VDRDocument* document, bool& exported, QString& target);
    // Fills an empty, open new diary from the open one.
    static bool ExportMasterData(VDRDocument* document, QSqlDatabase newDiary, const QString& path);
    // The follow-up diary at 'newPath', and "exportedTo" in the open diary (unsaved). 0 done,
    // 1 refused, 2 failed; the user has been told.
    static int createFollowUpDiary(VDRDocument* document, const QString& newPath);
};
