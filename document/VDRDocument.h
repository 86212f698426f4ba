#pragma once

#include "document/VDREntryNumber.h"
#include "document/VDRSqlTableModel.h"

#include <QDateTime>
#include <QImage>
#include <QMap>
#include <QObject>
#include <QPixmap>
#include <QPointer>
#include <QSqlDatabase>
#include <QStringList>
#include <QVector>

#include <functional>

class VDRAllEntryTableModel;

// The one open diary. It never edits the diary file itself: it works on a locked working copy
// beside it and writes that back only on save.
class VDRDocument : public QObject
{
    Q_OBJECT
public:
    explicit VDRDocument(QObject* parent = nullptr);
    ~VDRDocument() override;

    static QString connectionName() { return QStringLiteral("VDNDOC"); }

    bool createDocument(bool hideSyncButton);
    // The next opening only looks: it works on private temporary copies, so that the diary, a
    // working copy left by a crash, its lock information and everything beside the diary stay
    // exactly as they are. Cleared by closing.
    void setInspecting(bool inspecting) { m_inspecting = inspecting; }
    bool isInspecting() const { return m_inspecting; }
    bool openDocument(const QString& path, bool& showError);
    bool closeDocument();
    // Ends without closing properly, as a crash would: the working copy and the lock information
    // stay, so the next opening resumes the unsaved state. Used when the session ends under us.
    void closeKeepingWorkingCopy();

    bool isStateValid() const { return m_valid; }
    bool isStateNew() const { return m_new; }
    bool isStateModified() const { return m_modified || globalModified(); }
    bool isStateSaved() const { return m_saved; }
    bool isStructureExtended() const { return m_structureExtended; }
    // The user has already agreed to store an older diary in the current format: saving asks no more.
    void acceptCurrentFormat() { m_currentFormatAccepted = true; }
    bool isDemoProject() const { return m_demo; }
    QString getFilepath() const { return m_filePath; }
    QString getFilepathWorkingCopy() const { return m_workingCopyPath; }
    QString fileVersion() const { return m_fileVersion; }
    QString temporaryFolder() const { return m_tempFolder; }
    QSqlDatabase database() const;
    void setModified(bool modified) { m_modified = modified; }

    // The process-wide modified flag, set by edits and every key press.
    static void setGlobalModified(bool modified);
    static bool globalModified();

    // Names beside a diary X.vd2.
    static QString workingCopyPathFor(const QString& diaryPath);
    static QString lockInfoPathFor(const QString& diaryPath);
    static QString documentsDbPathFor(const QString& diaryPath);
    static QString currentUserName();
    static QString currentComputerName();

    // Lock information: user, computer, date, time. Empty list when the file cannot be read.
    static QStringList readLockInfo(const QString& lockInfoPath);
    static bool writeLockInfo(const QString& lockInfoPath);

    static QString findFreeTempFile(const QString& suffix);
    static QString createPrivateTempFolder();
    // Like findFreeTempFile, and the file is deleted when the document closes.
    QString getFreeTempFile(const QString& suffix);

    // "ok" for an intact database, "NoResult" when the check yields nothing, else the first problem.
    // ownFreshFile: a file this process has just written, read through a memory map.
    static QString checkDbIntegrity(QSqlDatabase db, bool ownFreshFile = false);
    // The message about a diary held by someone else, from its lock information.
    static QString lockHolderText(const QStringList& holder);
    static QString lockDateText(const QString& stored);
    bool reopenWorkingCopyAfterError();
    // Writes the committed working copy to 'target' (closing and reopening the connection around
    // the copy so the lock is never dropped by a stray file handle).
    bool writeWorkingCopyTo(const QString& target);

    // Nesting transactions; only the outermost pair reaches the database. A caller whose steps
    // failed passes false: the whole outermost transaction is then rolled back, so an operation
    // is stored whole or not at all. endTransaction returns false (and has told the user) when
    // nothing of the outermost transaction was stored; the models then show the file again.
    void beginTransaction();
    bool endTransaction(bool stepsSucceeded = true);
    int transactionDepth() const { return m_transactionDepth; }

    // Models of the diary as a whole.
    void initModels();
    void destroyModels();
    VDRSqlTableModel* modelMeta() const { return m_modelMeta; }
    VDRSqlTableModel* modelVdr() const { return m_modelVdr; }
    VDRSqlTableModel* modelAddresslist() const { return m_modelAddresslist; }
    VDRSqlTableModel* modelCompany1() const { return m_modelCompany1; }
    VDRSqlTableModel* modelCompany2() const { return m_modelCompany2; }
    VDRAllEntryTableModel* modelEntryAll() const { return m_modelEntryAll; }
    VDRSqlTableModel* modelExternalEntryNumber() const { return m_modelExternalEntryNumber; }

    // Models of one report, built on first access. Only the models of the few reports used last
    // are kept: building another report's models drops the oldest ones, unless they hold
    // unsubmitted edits or are pinned (EntryModelsPin) by an operation or the report on show.
    static constexpr int keptEntryModelSets() { return 6; }
    void initEntryModels(int entryId);
    bool hasEntryModels(int entryId) const { return m_entryModels.contains(entryId); }
    int entryModelSetCount() const { return m_entryModels.size(); }
    // The tables of a report's models, in the order they are built.
    static const QVector<VDRSqlTableModel::TABLE_NAMES>& entryTables();

    // Keeps the models of one report alive while it exists.
    class EntryModelsPin
    {
    public:
        EntryModelsPin(VDRDocument* document, int entryId);
        ~EntryModelsPin();
        EntryModelsPin(const EntryModelsPin&) = delete;
        EntryModelsPin& operator=(const EntryModelsPin&) = delete;

    private:
        QPointer<VDRDocument> m_document;
        int m_entryId;
    };
    void pinEntryModels(int entryId);
    void unpinEntryModels(int entryId);

    VDRSqlTableModel* modelEntry(int entryId, VDRSqlTableModel::TABLE_NAMES table);
    QList<VDRSqlTableModel*> entryModels(int entryId);
    VDRSqlTableModel* modelEntryAttendee(int entryId)
    {
        return modelEntry(entryId, VDRSqlTableModel::TN_ATTENDEE);
    }
    VDRSqlTableModel* modelEntryWorkforce(int entryId)
    {
        return modelEntry(entryId, VDRSqlTableModel::TN_WORKFORCE);
    }
    VDRSqlTableModel* modelEntryTimeRecording(int entryId)
    {
        return modelEntry(entryId, VDRSqlTableModel::TN_TIME_RECORDING);
    }
    VDRSqlTableModel* modelEntryDelay(int entryId) { return modelEntry(entryId, VDRSqlTableModel::TN_DELAY); }
    VDRSqlTableModel* modelEntryObstruction(int entryId)
    {
        return modelEntry(entryId, VDRSqlTableModel::TN_OBSTRUCTION);
    }
    VDRSqlTableModel* modelEntryDfcy(int entryId)
    {
        return modelEntry(entryId, VDRSqlTableModel::TN_DEFICIENCY);
    }
    VDRSqlTableModel* modelEntryAcceptance(int entryId)
    {
        return modelEntry(entryId, VDRSqlTableModel::TN_ACCEPTANCE);
    }
    VDRSqlTableModel* modelEntryPhoto1(int entryId)
    {
        return modelEntry(entryId, VDRSqlTableModel::TN_PHOTO_PROGRESS);
    }
    VDRSqlTableModel* modelEntryPhoto2(int entryId)
    {
        return modelEntry(entryId, VDRSqlTableModel::TN_PHOTO_DEFICIENCY);
    }
    VDRSqlTableModel* modelEntryPhoto3(int entryId)
    {
        return modelEntry(entryId, VDRSqlTableModel::TN_PHOTO_OBSTRUCTION);
    }
    VDRSqlTableModel* modelEntryPhoto4(int entryId)
    {
        return modelEntry(entryId, VDRSqlTableModel::TN_PHOTO_MEASURE);
    }
    VDRSqlTableModel* modelEntryPhoto5(int entryId)
    {
        return modelEntry(entryId, VDRSqlTableModel::TN_PHOTO_MATERIAL);
    }
    VDRSqlTableModel* modelEntryDirective(int entryId)
    {
        return modelEntry(entryId, VDRSqlTableModel::TN_DIRECTIVE);
    }
    VDRSqlTableModel* modelEntryAuxiliaryservice(int entryId)
    {
        return modelEntry(entryId, VDRSqlTableModel::TN_AUXILIARY_SERVICE);
    }
    VDRSqlTableModel* modelEntryConstructionmeasure(int entryId)
    {
        return modelEntry(entryId, VDRSqlTableModel::TN_CONSTRUCTION_MEASURE);
    }
    VDRSqlTableModel* modelEntryConstructionmaterial(int entryId)
    {
        return modelEntry(entryId, VDRSqlTableModel::TN_CONSTRUCTION_MATERIAL);
    }
    VDRSqlTableModel* modelEntryScheduleddelivery(int entryId)
    {
        return modelEntry(entryId, VDRSqlTableModel::TN_SCHEDULED_DELIVERY);
    }
    VDRSqlTableModel* modelEntryTelephoneNotice(int entryId)
    {
        return modelEntry(entryId, VDRSqlTableModel::TN_TELEPHONE_NOTICE);
    }
    VDRSqlTableModel* modelEntryConcern(int entryId)
    {
        return modelEntry(entryId, VDRSqlTableModel::TN_CONCERN);
    }
    VDRSqlTableModel* modelEntryEquipment(int entryId)
    {
        return modelEntry(entryId, VDRSqlTableModel::TN_EQUIPMENT);
    }

    void initAddresslistModels(int listId);
    VDRSqlTableModel* modelAddresslistItem(int listId);

    // Meta keys.
    QString metaValue(const QString& key) const;
    bool hasMetaKey(const QString& key) const;
    bool setMetaValue(const QString& key, const QString& value);
    int metaFlag(const QString& key) const;
    bool setMetaFlag(const QString& key);
    bool noFileSizeWarning() const { return metaFlag(QStringLiteral("NoFileSizeWarning")) != 0; }
    bool setNoFileSizeWarning() { return setMetaFlag(QStringLiteral("NoFileSizeWarning")); }
    bool isExportedTo() const { return hasMetaKey(QStringLiteral("exportedTo")); }
    bool setExportedTo() { return setMetaFlag(QStringLiteral("exportedTo")); }
    bool isExportedFrom() const { return hasMetaKey(QStringLiteral("exportedFrom")); }
    bool setExportedFrom() { return setMetaFlag(QStringLiteral("exportedFrom")); }
    bool imageUploadAdvertisingMessage1Shown() const
    {
        return metaFlag(QStringLiteral("ImageUploadAdvertisingMessage1Shown")) != 0;
    }
    bool setImageUploadAdvertisingMessage1Shown()
    {
        return setMetaFlag(QStringLiteral("ImageUploadAdvertisingMessage1Shown"));
    }
    bool imageUploadAdvertisingMessage2Shown() const
    {
        return metaFlag(QStringLiteral("ImageUploadAdvertisingMessage2Shown")) != 0;
    }
    bool setImageUploadAdvertisingMessage2Shown()
    {
        return setMetaFlag(QStringLiteral("ImageUploadAdvertisingMessage2Shown"));
    }
    QDateTime masterDataImportVersion() const;
    bool setMasterDataImportVersion(const QDateTime& version);
    QString projectName() const;

    // Report numbers (rows of modelEntryAll()).
    int appendEntry();
    VDREntryNumber entryNumber(int row) const;
    int entryNumberDigits(int row) const;
    QString entryNumberString(int row) const;
    QChar entryNumberLetter(int row) const;
    int entryNumberInt(int row) const;
    QString entryNumberWithUserId(int row) const;
    QString externalEntryNumberString(int row) const;
    int maxEntryNumber() const;
    int maxEntryID() const;
    void entrySetNumberText(int row);
    void entryNumbersAddDigit(int digits);

    bool appendCompany1(const QString& type);
    bool appendCompany2();

    // ---- Report operations (VDRDocumentEntry.cpp) ----
    // New sub-table rows with the default values of their table; the report's models are built
    // when needed. Nothing is submitted.
    bool appendEntryAttendee(int entryId);
    bool appendEntryWorkforce(int entryId);
    bool appendEntryTimeRecording(int entryId, int workforceId);
    bool appendEntryDelay(int entryId);
    bool appendEntryObstruction(int entryId);
    bool appendEntryDfcy(int entryId);
    bool appendEntryAcceptance(int entryId);
    bool appendEntryPhoto1(int entryId, const QDate& date, const QString& caption, int imageId);
    bool appendEntryPhoto2(int entryId, const QDate& date, const QString& caption, int imageId);
    bool appendEntryPhoto3(int entryId, const QDate& date, const QString& caption, int imageId);
    bool appendEntryPhoto4(int entryId, const QDate& date, const QString& caption, int imageId);
    bool appendEntryPhoto5(int entryId, const QDate& date, const QString& caption, int imageId);
    bool appendEntryDirective(int entryId);
    bool appendEntryAuxiliaryservice(int entryId);
    bool appendEntryConstructionmeasure(int entryId);
    bool appendEntryConstructionmaterial(int entryId);
    bool appendEntryScheduleddelivery(int entryId);
    bool appendEntryTelephoneNotice(int entryId);
    bool appendEntryConcern(int entryId);
    bool appendEntryEquipment(int entryId);
    // Whole reports, addressed by their row in modelEntryAll().
    bool copyEntryAll(int row);
    bool removeEntryAll(int row);
    bool lockEntry(int row, bool locked);
    bool deleteAudioRecord(int audioId);
    // Locking a report freezes copies of the companies it names (negative categories).
    void lockCompanyRecords4lockedEntry(int row);
    // Set when frozen company copies were added; the master-data windows clear it.
    bool isMasterDataModified() const { return m_masterDataModified; }
    void setMasterDataModified(bool modified) { m_masterDataModified = modified; }

    // ---- Image store (VDRDocumentImage.cpp) ----
    static QString imageSizeSettingsKey() { return QStringLiteral("foto/imagesize"); }
    // New image rows: from a file (turned upright by its EXIF orientation and fitted to the
    // configured size) or from a picture (kept at its size). -1 when nothing could be stored.
    int createImage(const QString& path);
    int createImage(const QImage& image);
    int createImage(const QPixmap& pixmap);
    bool exchangeImage(int id, const QImage& image, bool fit);
    bool exchangeImage(int id, const QPixmap& pixmap, bool fit);
    QByteArray getImageData(int id);
    QByteArray getImageThumbnailData(int id);
    QImage getImage(int id);
    QImage getImageThumbnail(int id);
    QPixmap getImagePixmap(int id);
    QPixmap getImageThumbnailPixmap(int id);
    bool getImageMetadata(int id, QMap<QString, QVariant>& metadata);
    bool exportImage(int id, const QString& path);
    QString getImageTempPath(int id);
    QString getImageThumbnailTempPath(int id);
    QString getImageTempPath4Upload(int id);
    QString getImageThumbnailTempPath4Upload(int id);
    QStringList getListOfUploadImages() const { return m_uploadImages; }
    void clearListOfUploadImages() { m_uploadImages.clear(); }
    QList<int> getImageIds();
    int countImageAccess(int id);
    bool deleteImage(int id);

    // Saving: 0 saved, 1 refused or cancelled before anything was touched, 2 failed. An empty path
    // saves over the current file.
    int saveDocument(const QString& path = QString());
    // Backup generation 1 is X.vd2.bak, 2 to 10 are X.vd2.01.bak to X.vd2.09.bak, then X.vd2.10.bak ...
    static QString backupName(const QString& path, int generation);
    static int numberOfBackups();
    static QString numberOfBackupsSettingsKey() { return QStringLiteral("file/NumberOfBackups"); }
    static QString dontShowCompactDbMsgSettingsKey()
    {
        return QStringLiteral("Messages/dontShowCompactDbMsg");
    }

    // Restoring a damaged diary from its backups.
    static QString getBackupFile4Restore(const QString& path, int& count);
    static bool restoreBackupFile(const QString& path, const QString& backup, QString& newName,
                                  QString& error);

    // Compaction: removes unreferenced images, VACUUMs and saves. 0 done, 1 refused, 2 failed.
    int compactDB(bool showReport);
    bool removeObsoleteImages();
    static QString formatFileSize(qint64 bytes);
    qint64 lastCompactionSizeBefore() const { return m_compactSizeBefore; }
    qint64 lastCompactionSizeAfter() const { return m_compactSizeAfter; }
    // Deleted images and dictations since the last compaction; many of them make saving offer one.
    void decrementCompactDbImageCnt() { ++m_deletedImages; }
    void decrementCompactDbAudioCnt() { ++m_deletedAudio; }
    void resetCompactDbAudioCnt() { m_deletedAudio = 0; }
    void resetCompactDbImageCnt() { m_deletedImages = 0; }

    // Asked whether a diary is on the cloud synchronisation list; installed by the synchronisation.
    static void setSyncListQuery(std::function<bool(const QString&)> query);
    static bool isOnSyncList(const QString& path);

    // The id of a new row of 'model' from the diary's counter table.
    void sqlTableIdGenerator(VDRSqlTableModel* model, int row, QSqlRecord& record);

public slots:
    // For models connected from outside; the document's own models call the overload above.
    void sqlTableIdGenerator(int row, QSqlRecord& record);

signals:
    void documentOpened(VDRDocument* document);
    void documentClosed(VDRDocument* document);
    void syncButtonVisibilityChanged(bool visible);
    // Opening found no file under this path; the recent-files list should forget it.
    void recentFileMissing(const QString& path);

private:
    enum LockState
    {
        WorkingCopyAbsent,
        WorkingCopyLocked,
        WorkingCopyCorrupt,
        WorkingCopyFree
    };
    LockState probeWorkingCopy(const QString& workingCopy, bool& failed);
    bool discardWorkingCopy(const QString& workingCopy, const QString& lockInfo, const QString& diaryPath);
    bool openWorkingCopyConnection(bool showErrors);
    void closeConnection();
    void abandonOpening(bool removeWorkingCopy);

    // What an opening step tells the sequence: go on with the next step, refuse (the caller adds
    // its general message), refuse quietly (the step has explained why), or start again with the
    // file in Opening::reopenPath.
    enum class OpenStep
    {
        GoOn,
        Refused,
        RefusedQuietly,
        Reopen
    };
    struct Opening;
    OpenStep runOpeningSteps(Opening& o);
    OpenStep checkDiaryFile(Opening& o);
    OpenStep inspectExistingWorkingCopy(Opening& o);
    OpenStep copyWorkingCopyForInspection(const Opening& o, QString& probed);
    OpenStep detectDemo(Opening& o);
    OpenStep prepareWorkingCopy(Opening& o);
    OpenStep makeWorkingCopy(Opening& o);
    OpenStep readVersionAndIntegrity(Opening& o);
    OpenStep offerBackupIfDamaged(Opening& o);
    OpenStep offerRestoringBackup(Opening& o, const QString& head, const QString& backup);
    OpenStep askToOpenDamaged(const QString& head, int backups);
    OpenStep refuseNewerVersion(Opening& o);
    OpenStep ensureWritable(Opening& o);
    OpenStep takeLock(Opening& o);
    OpenStep requireCoreTables(Opening& o);
    OpenStep upgradeAndWarn(Opening& o);
    OpenStep importPendingDocuments(Opening& o);
    OpenStep finishOpening(Opening& o);

    VDRSqlTableModel* createModel(VDRSqlTableModel::TABLE_NAMES table, const QString& filter);
    void releaseEntryModels();
    bool entryModelsDirty(int entryId) const;
    void reselectModelsAfterRollback();
    bool importExternalDocuments();
    void repairOldVersion();
    void freezeCompaniesOfLockedEntries();
    void repairPhotoAssignments();
    void renumberPositions();
    void clearState();
    void removeTemporaryFiles();
    void cleanUpInterruptedSave(const QString& diaryPath);
    bool compactWorkingCopy();
    int saveDocumentImpl(const QString& path, bool compacted);
    bool compactIfManyDeletions();
    bool diaryWritable(bool sameFile);
    bool currentFormatConfirmed();
    void closeForSaving();
    bool writeOverDiary(bool compacted);
    void finishSave();
    QString vacuumInto(const QString& target);
    int reopenAfterSave(int result);
    bool replaceDiaryKeepingBackups(const QString& temporary);
    bool saveAs(const QString& target);
    QString copyCheckedWorkingCopy(const QString& target, const QString& failureText);

    bool m_valid = false;
    bool m_new = false;
    bool m_modified = false;
    bool m_saved = false;
    bool m_structureExtended = false;
    bool m_currentFormatAccepted = false;
    bool m_demo = false;
    bool m_inspecting = false;
    QString m_filePath;
    QString m_workingCopyPath;
    QString m_lockInfoPath;
    QString m_tempFolder;
    QStringList m_filesToRemove;
    QString m_fileVersion;
    int m_transactionDepth = 0;
    bool m_transactionFailed = false;
    int m_deletedImages = 0;
    int m_deletedAudio = 0;
    qint64 m_compactSizeBefore = 0;
    qint64 m_compactSizeAfter = 0;

    VDRSqlTableModel* m_modelMeta = nullptr;
    VDRSqlTableModel* m_modelVdr = nullptr;
    VDRSqlTableModel* m_modelAddresslist = nullptr;
    VDRSqlTableModel* m_modelCompany1 = nullptr;
    VDRSqlTableModel* m_modelCompany2 = nullptr;
    VDRAllEntryTableModel* m_modelEntryAll = nullptr;
    VDRSqlTableModel* m_modelExternalEntryNumber = nullptr;
    QMap<int, QMap<int, VDRSqlTableModel*>> m_entryModels;
    QList<int> m_entryModelsUsed; // report ids, the one used last at the end
    QHash<int, int> m_entryModelPins;
    QMap<int, VDRSqlTableModel*> m_addresslistModels;
    bool m_masterDataModified = false;
    // Temporary files of images, written once per opening.
    QMap<int, QString> m_imageTempPaths;
    QMap<int, QString> m_thumbnailTempPaths;
    QStringList m_uploadImages;
    // Declared column types per table, read once per opening for the models' value types.
    QHash<QString, QHash<QString, QString>> m_declaredTypes;
};
