#pragma once

#include "sync/VDRReportSynchronisationResult.h"

#include <QDateTime>
#include <QHash>
#include <QList>
#include <QObject>
#include <QSet>
#include <QSqlDatabase>
#include <QStringList>
#include <QVariant>

#include <memory>

class VDRDocument;
class VDRScopedConnection;

// Merges the reports of exchange files written by the mobile app into the open diary, and
// exchanges master data with the app. One object per import run.
//
// Exchange files are foreign input: each is opened read-only (the file itself is never written),
// every value is checked against its column before it is bound, and every report is
// written inside one savepoint, so that a failure at any row leaves the diary as it was.
class VDRReportSynchronisation : public QObject
{
    Q_OBJECT
public:
    // Results of one file.
    enum FileResult
    {
        FileImported = 0,
        FileOpenFailed = 1,
        FileProjectDataFaulty = 2,
        FileRefused = 3,
    };

    explicit VDRReportSynchronisation(VDRDocument* document, QObject* parent = nullptr);
    ~VDRReportSynchronisation() override;

    static QString connectionName() { return QStringLiteral("REPORT_EXCHANGE_DB"); }
    static QString masterDataConnectionName() { return QStringLiteral("MD_EXCHANGE_DB"); }
    static QString supportedFileVersion() { return QStringLiteral("0.2"); }
    static QString createScriptPath()
    {
        return QStringLiteral(":/VDRDatabase/Resources/exchangeDB_create.sql");
    }
    static QString masterDataCreateScriptPath()
    {
        return QStringLiteral(":/VDRDatabase/Resources/masterdataDB_create.sql");
    }
    static QString stampPattern()
    {
        return QStringLiteral("[0-9]{4}[-][0-1][0-9][-][0-3][0-9][T][0-2][0-9][-][0-5][0-9][-][0-5][0-9]");
    }
    // Exchange files larger than this are refused before they are copied or read.
    static qint64 maxExchangeFileBytes() { return qint64(2) * 1024 * 1024 * 1024; }
    // Longest text and largest picture, dictation or document a row may carry.
    static int maxTextChars() { return 1000000; }
    static int maxBlobBytes() { return 52224000; }

    // ---- The format (VDRReportSynchronisationFile.cpp) ----
    bool checkFileVersion(QSqlDatabase database, const QString& path);
    bool checkDatabaseName(QSqlDatabase database, const QString& path, const QString& diaryFileName);
    bool getImportVersion(QSqlDatabase database, QDateTime& dateTime);
    // -1 the file has no valid creationDateTime; 0 the diary holds newer master data; 1 import.
    int checkMasterDataVersion(QSqlDatabase database, QDateTime& fileTime);
    // The exchange files of a diary in a cloud folder, sorted by their time stamp.
    static QStringList getCloudReportExchangeFiles(const QString& diaryPath, const QString& cloudFolder);
    // Whether a file name is the diary's base name, a valid stamp and ".vdx".
    static bool isExchangeFileNameOf(const QString& fileName, const QString& diaryPath);

    // ---- Import runs ----
    // The exchange files in a cloud folder, in list order; one summary; imported files are deleted.
    int importCloudReportExchangeFiles(const QString& cloudFolder, const QStringList& fileNames,
                                       bool& imported, bool& projectDataChanged);
    // Files anywhere, in list order, with the summary of a cloud run; imported files are deleted when
    // asked to. Returns the number of files that failed.
    int importReportExchangeFiles(const QStringList& paths, bool deleteImported, bool& projectDataChanged);
    // One file chosen by the user, with the manual summary (delete check box, save buttons).
    int importManualReportExchangeFile(const QString& path, bool& projectDataChanged);
    // One file of a run: 0 imported, 1 could not be opened, 2 faulty project data, 3 refused or a
    // report failed.
    int importReportExchangeFile(const QString& path, int totalReports, int reportsBefore, int& importedCount,
                                 bool& masterDataImported, bool& projectDataChanged);
    int importReports(QSqlDatabase exchangeFile, const QString& path, int totalReports, int reportsBefore,
                      int& count, const QDateTime& importVersion);

    // ---- Master data (VDRReportSynchronisationMasterData.cpp) ----
    // 0 success, 3 faulty project data, other values another failure; all or nothing.
    int importMasterData(QSqlDatabase exchangeFile, const QString& path, bool& companiesChanged,
                         bool& projectDataChanged);
    // Fills an open, empty master-data file for the app.
    bool exportMasterData4Synch(QSqlDatabase target);

    // ---- Results ----
    const QList<VDRReportSynchronisationResult*>& results() const { return m_results; }
    void clearResultList();
    // The text of the last summary, also when it was not shown.
    QString lastSummary() const { return m_lastSummary; }
    // The command line prints the summary itself instead of showing a box.
    void setShowSummary(bool show) { m_showSummary = show; }
    // The manual summary's "Jetzt speichern" was chosen; the caller saves.
    bool saveNowRequested() const { return m_saveNow; }
    // With "Jetzt speichern" the ticked deletion waits for the save: the caller deletes the file
    // once the diary holds its reports.
    bool deleteRequested() const { return m_deleteRequested; }
    bool deleteRequestedFile();
    QStringList importedFiles() const { return m_importedFiles; }
    QStringList failedFiles() const { return m_failedFiles; }

public slots:
    void slotRenameCheckboxStateChanged(int state);

private:
    struct ReplacedDocument
    {
        QString table;
        int recordId;
        QString name;
    };

    // ---- The exchange file (VDRReportSynchronisationFile.cpp) ----
    // Opens 'path' read-only on the exchange connection; false (the user told) when refused.
    bool openExchangeFile(const QString& path);
    void closeExchangeFile();
    static int countReports(const QString& path);

    // ---- Runs ----
    int importOpenedFile(QSqlDatabase db, const QString& path, int totalReports, int reportsBefore,
                         int& importedCount, bool& masterDataImported, bool& projectDataChanged);
    QString buildSummary(bool manual) const;
    void runFiles(const QStringList& paths, bool deleteImported, bool& projectDataChanged, bool manual);

    // ---- One report (VDRReportSynchronisationReport.cpp, VDRReportSynchronisationRows.cpp) ----
    struct ReportImport;
    // One report; the result status.
    int importReport(QSqlDatabase exchangeFile, const QString& path, const QVariantHash& row,
                     const QDateTime& importVersion, VDRReportSynchronisationResult* result);
    // The steps of one report return 0 to go on, else the report's status.
    int readReport(const QVariantHash& raw, const QString& path, ReportImport& report);
    int locateReport(const QDateTime& importVersion, ReportImport& report);
    bool deletedInDiary(const ReportImport& report);
    // Replaces or adds the report in one savepoint; false with the reason in the report's error.
    bool writeReport(QSqlDatabase exchangeFile, const QString& path, const QDateTime& importVersion,
                     ReportImport& report);
    bool removeReplacedRows(ReportImport& report);
    bool writeEntryRow(const QString& path, const QDateTime& importVersion, ReportImport& report);
    bool updateEntryCounter(ReportImport& report);
    bool removeUnusedMedia(const ReportImport& report);
    // Tells the user; the status of a report refused for a database error.
    int reportFailed(const QString& text);
    int entryBySynchId(int id, const QString& userId, const QDateTime& creationDate, int& row);
    bool checkReportVersion(int id, const QDateTime& importVersion);
    bool checkImportedReportNumber(const QString& number, const QDate& date, const QTime& time,
                                   int& highestNumber, int& highestId);
    bool writeReportRows(QSqlDatabase exchangeFile, const QString& path, int appEntryId, int entryId,
                         const QVariantHash& entry, int& audioId, QString& error);
    int nextId(const QString& table);
    bool storeIdCounters();
    void renumber(int entryId, int highestNumber, int highestId, VDRReportSynchronisationResult* result);
    void refreshModels();
    // VDRReportSynchronisationDocuments.cpp
    void importDocuments(const QHash<int, QList<ReplacedDocument>>& replaced);

    // ---- The steps of importMasterData: false or a result other than 0 ends it ----
    struct MasterDataRow;
    bool masterDataImportable(QSqlDatabase exchangeFile, const QString& path, bool& keepCompanies);
    int readProjectData(QSqlDatabase exchangeFile, const QString& path, QList<MasterDataRow>& projects);
    int readCompanies(QSqlDatabase exchangeFile, const QString& path, QList<MasterDataRow>& companies);
    int writeMasterData(const QString& path, const QList<MasterDataRow>& projects,
                        const QList<MasterDataRow>& companies, bool keepCompanies);
    int writeProjectData(const QString& path, const QList<MasterDataRow>& projects);
    int replaceCompanies(const QString& path, const QList<MasterDataRow>& companies);

    void message(int kind, const QString& title, const QString& text);

    VDRDocument* m_document;
    QList<VDRReportSynchronisationResult*> m_results;
    QStringList m_importedFiles;
    QStringList m_failedFiles;
    QString m_lastSummary;
    bool m_showSummary = true;
    bool m_saveNow = false;
    bool m_deleteRequested = false;
    bool m_renameForAll = false;
    bool m_renameAnswer = false;
    int m_busy = 0;
    std::unique_ptr<VDRScopedConnection> m_connection;
    QString m_currentPath;
    // Set during a cloud run: files must lie in this folder (no links out of it).
    QString m_confineTo;
    QSet<int> m_touchedReports;
    // Id counters of the report being written, stored with it.
    QHash<QString, int> m_idCounters;
    // Documents of the reports replaced in the current file, by report id.
    QHash<int, QList<ReplacedDocument>> m_replacedDocuments;
};
