// Opening a diary: a sequence of named steps over a locked working copy, and the repairs older
// diaries get on the way.
#include "document/CVdShared.h"
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDatabaseSchema.h"
#include "document/VDRDiaryCheck.h"
#include "document/VDRDocument.h"
#include "document/VDRDocumentsDb.h"
#include "document/VDRFileOps.h"
#include "document/VDRPrompt.h"
#include "document/VDRScopedConnection.h"

#include <QDebug>
#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QLocale>
#include <QSqlError>
#include <QSqlQuery>

#include <memory>

namespace {

// Opening starts again only with a backup the user chose to restore or look at; the bound ends a
// chain of files that never stop failing.
const int kMostOpeningStarts = 10;

const char* const kLockConnection = "VDNLOCK";
const char* const kDemoConnection = "DEMOTEST";
const char* const kVersionConnection = "VERSIONTEST";

QString nativePath(const QString& path)
{
    return QDir::toNativeSeparators(path);
}

bool hasSqliteHeader(const QString& path)
{
    QFile f(path);
    if (!f.open(QIODevice::ReadOnly))
        return false;
    return f.read(16) == QByteArray("SQLite format 3\0", 16);
}

enum SqliteCode
{
    SqliteBusy = 5,
    SqliteLocked = 6,
    SqliteCorrupt = 11,
    SqliteConstraint = 19,
    SqliteNotADb = 26
};

bool provesDamage(const QSqlError& error)
{
    const int code = VDRScopedConnection::sqliteCode(error);
    return code == SqliteCorrupt || code == SqliteNotADb;
}

// The write that makes SQLite take the lock: insert and delete the dummy row of meta. A dummy row
// left by a process killed between the two statements is removed first.
bool writeDummyRow(const QSqlDatabase& db, QSqlError& error)
{
    QSqlQuery q(db);
    const QString insert = QStringLiteral("INSERT INTO meta (KEY, VALUE) VALUES('dummy', 'dummy');");
    const QString remove = QStringLiteral("DELETE FROM meta WHERE KEY='dummy';");
    bool ok = q.exec(insert);
    if (!ok && VDRScopedConnection::sqliteCode(q.lastError()) == SqliteConstraint)
        ok = q.exec(remove) && q.exec(insert);
    ok = ok && q.exec(remove);
    if (!ok)
        error = q.lastError();
    return ok;
}

// "ok", the first problem quick_check found, or "NoResult" with the reason the check could not run.
// 'mapped' reads the file through a memory map: several times faster on pages already in memory,
// so only for files this process has just written and nobody else can shorten under it.
QString integrityOf(const QSqlDatabase& db, QSqlError* failure = nullptr, bool mapped = false)
{
    QSqlQuery q(db);
    if (mapped)
        q.exec(QStringLiteral("PRAGMA mmap_size = 2147418112"));
    if (q.exec(QStringLiteral("PRAGMA quick_check;")) && q.next())
        return q.value(0).toString();
    const QSqlError error = q.lastError();
    if (failure)
        *failure = error;
    qDebug() << "integrity check without result:" << error.text();
    // A file SQLite cannot read at all has no result row; say why when SQLite told us.
    const QString text = CVdShared::sqlErrorText(error).trimmed();
    return text.isEmpty() ? QStringLiteral("NoResult") : QStringLiteral("NoResult: ") + text;
}

} // namespace

QString VDRDocument::checkDbIntegrity(QSqlDatabase db, bool ownFreshFile)
{
    // Only reads: the connection may be one on the diary file itself, which only saving changes.
    return integrityOf(db, nullptr, ownFreshFile);
}

// The state one opening carries from step to step.
struct VDRDocument::Opening
{
    QString path; // as the caller named it, for messages
    QString diaryPath;
    QString lockInfo;
    QString workingCopy; // the working copy's place beside the diary
    // This user's unfinished session left a working copy: it is opened instead of a fresh one.
    bool resume = false;
    QString resumedCopy;
    bool isDatabase = false;
    // The working copy was made by this opening, so a refusal removes it again.
    bool madeWorkingCopy = false;
    QString fileVersion;
    QString integrity;
    bool photoAssignmentsMissing = false;
    // With OpenStep::Reopen: the file the next start opens.
    QString reopenPath;

    bool intact() const { return integrity == QLatin1String("ok"); }
};

bool VDRDocument::openDocument(const QString& path, bool& showError)
{
    // One problem, one message: a refusal explained on the way needs no general one after it.
    const int shown = VDRPrompt::messagesShown();
    OpenStep outcome = OpenStep::Reopen;
    QString next = path;
    for (int start = 0; start < kMostOpeningStarts && outcome == OpenStep::Reopen; ++start) {
        Opening opening;
        opening.path = next;
        outcome = runOpeningSteps(opening);
        next = opening.reopenPath;
    }
    if (outcome == OpenStep::Reopen) {
        qWarning().noquote() << "opening given up after" << kMostOpeningStarts << "starts:" << path;
        clearState();
        outcome = OpenStep::Refused;
    }
    const bool opened = outcome == OpenStep::GoOn;
    showError = outcome != OpenStep::RefusedQuietly;
    if (!opened && VDRPrompt::messagesShown() != shown)
        showError = false;
    return opened;
}

VDRDocument::OpenStep VDRDocument::runOpeningSteps(Opening& opening)
{
    if (m_valid)
        return OpenStep::Refused;
    VDRBusyCursor busy;
    using Step = OpenStep (VDRDocument::*)(Opening&);
    static const Step steps[] = {
        &VDRDocument::checkDiaryFile,
        &VDRDocument::inspectExistingWorkingCopy,
        &VDRDocument::detectDemo,
        &VDRDocument::prepareWorkingCopy,
        &VDRDocument::readVersionAndIntegrity,
        &VDRDocument::offerBackupIfDamaged,
        &VDRDocument::refuseNewerVersion,
        &VDRDocument::ensureWritable,
        &VDRDocument::takeLock,
        &VDRDocument::requireCoreTables,
        &VDRDocument::upgradeAndWarn,
        &VDRDocument::importPendingDocuments,
        &VDRDocument::finishOpening,
    };
    for (const Step step : steps) {
        const OpenStep outcome = (this->*step)(opening);
        if (outcome != OpenStep::GoOn)
            return outcome;
    }
    return OpenStep::GoOn;
}

VDRDocument::OpenStep VDRDocument::checkDiaryFile(Opening& o)
{
    const QFileInfo info(o.path);
    if (!info.exists()) {
        VDRPrompt::critical(tr("Dateifehler"), tr("Die Datei\n%1\nexistiert nicht.").arg(nativePath(o.path)));
        emit recentFileMissing(info.absoluteFilePath());
        return OpenStep::RefusedQuietly;
    }
    if (!info.isFile()) {
        VDRPrompt::critical(tr("Dateifehler"), tr("%1\nist keine Datei.").arg(nativePath(o.path)));
        return OpenStep::RefusedQuietly;
    }
    // Whether to inspect was set before this opening; nothing else of an earlier one stays.
    const bool inspecting = m_inspecting;
    clearState();
    m_inspecting = inspecting;
    o.diaryPath = info.absoluteFilePath();
    o.lockInfo = lockInfoPathFor(o.diaryPath);
    o.workingCopy = workingCopyPathFor(o.diaryPath);
    return OpenStep::GoOn;
}

// A working copy already beside the diary is another instance's (refused), this user's unfinished
// session (resumed) or a leftover (discarded).
VDRDocument::OpenStep VDRDocument::inspectExistingWorkingCopy(Opening& o)
{
    QString probed = o.workingCopy;
    if (m_inspecting && QFileInfo::exists(o.workingCopy)) {
        const OpenStep copied = copyWorkingCopyForInspection(o, probed);
        if (copied != OpenStep::GoOn)
            return copied;
    }
    bool failed = false;
    const LockState state = probed.isEmpty() ? WorkingCopyLocked : probeWorkingCopy(probed, failed);
    if (failed) {
        abandonOpening(false);
        return OpenStep::RefusedQuietly;
    }
    switch (state) {
    case WorkingCopyAbsent:
        break;
    case WorkingCopyCorrupt:
        if (!m_inspecting && !discardWorkingCopy(o.workingCopy, QString(), o.diaryPath))
            return OpenStep::Refused;
        break;
    case WorkingCopyLocked:
        VDRPrompt::warning(tr("Datenbank in Bearbeitung"), lockHolderText(readLockInfo(o.lockInfo)));
        abandonOpening(false);
        return OpenStep::RefusedQuietly;
    case WorkingCopyFree: {
        const QStringList holder = readLockInfo(o.lockInfo);
        if (holder.size() >= 2 && holder[0] == currentUserName() && holder[1] == currentComputerName()) {
            o.resume = true;
            o.resumedCopy = probed;
        } else if (!m_inspecting && !discardWorkingCopy(o.workingCopy, o.lockInfo, o.diaryPath)) {
            return OpenStep::Refused;
        }
        break;
    }
    }
    // Nobody holds the diary: what an interrupted save left beside it can go.
    if (!m_inspecting)
        cleanUpInterruptedSave(o.diaryPath);
    if (o.resume)
        VDRPrompt::information(
            tr("Datei öffnen"),
            tr("Die letzte Bearbeitung der Varduna-Datei wurde nicht ordnungsgemäß abgeschlossen.\n"
               "Der letzte Bearbeitungsstand wird geöffnet. Speichern Sie die Datei, wenn Sie diesen "
               "Stand behalten wollen."));
    return OpenStep::GoOn;
}

// An inspection probes a private copy of the working copy, so that neither the copy nor its lock
// information changes. A copy held by a running instance is not copied: 'probed' is left empty.
VDRDocument::OpenStep VDRDocument::copyWorkingCopyForInspection(const Opening& o, QString& probed)
{
    if (VDRDiaryCheck::isHeld(o.workingCopy)) {
        probed.clear();
        return OpenStep::GoOn;
    }
    probed = getFreeTempFile(QStringLiteral(".vd2"));
    m_filesToRemove << probed + QStringLiteral("-journal");
    if (!VDRFileOps::copy(o.workingCopy, probed)) {
        VDRPrompt::critical(
            tr("Dateifehler"),
            VDRFileOps::withReason(
                tr("Kopieren der Datei\n%1\n fehlgeschlagen.").arg(nativePath(o.workingCopy))));
        abandonOpening(false);
        return OpenStep::RefusedQuietly;
    }
    // An interrupted transaction is rolled back from its journal, as resuming would.
    const QString journal = o.workingCopy + QStringLiteral("-journal");
    if (QFileInfo::exists(journal))
        VDRFileOps::copy(journal, probed + QStringLiteral("-journal"));
    return OpenStep::GoOn;
}

VDRDocument::OpenStep VDRDocument::detectDemo(Opening& o)
{
    o.isDatabase = hasSqliteHeader(o.diaryPath);
    if (!o.isDatabase)
        return OpenStep::GoOn;
    const auto demo = VDRScopedConnection::readOnlyLook(QString::fromLatin1(kDemoConnection), o.diaryPath);
    if (!demo->isOpen()) {
        VDRPrompt::critical(tr("Datenbankfehler"), CVdShared::sqlErrorText(demo->lastError()));
        abandonOpening(false);
        return OpenStep::Refused;
    }
    QSqlQuery q(demo->db());
    if (q.exec(QStringLiteral("SELECT value FROM meta WHERE key = '%1'").arg(QStringLiteral("isdp"))) &&
        q.next())
        m_demo = q.value(0).toInt() == 42;
    return OpenStep::GoOn;
}

// The working copy is made before the version and integrity checks, which then read the fresh copy
// (still in memory) instead of reading the diary from disk twice.
VDRDocument::OpenStep VDRDocument::prepareWorkingCopy(Opening& o)
{
    m_filePath = o.diaryPath;
    m_workingCopyPath = o.resume ? o.resumedCopy : o.workingCopy;
    if (o.resume || !o.isDatabase)
        return OpenStep::GoOn;
    return makeWorkingCopy(o);
}

VDRDocument::OpenStep VDRDocument::makeWorkingCopy(Opening& o)
{
    if (m_inspecting) {
        m_workingCopyPath = getFreeTempFile(QStringLiteral(".vd2"));
        o.madeWorkingCopy = VDRFileOps::copy(o.diaryPath, m_workingCopyPath);
    } else {
        // A journal left without its copy (deleted by hand or by a sync client) would be rolled
        // into the fresh copy as if it were its own.
        m_workingCopyPath = o.workingCopy;
        for (const char* companion : {"-journal", "-wal", "-shm"})
            QFile::remove(o.workingCopy + QLatin1String(companion));
        if (VDRFileOps::copy(o.diaryPath, o.workingCopy)) {
            o.madeWorkingCopy = true;
        } else if (m_demo) {
            m_workingCopyPath = getFreeTempFile(QStringLiteral(".vd2"));
            o.madeWorkingCopy = VDRFileOps::copy(o.diaryPath, m_workingCopyPath);
        }
    }
    if (o.madeWorkingCopy)
        return OpenStep::GoOn;
    VDRPrompt::critical(tr("Dateifehler"),
                        VDRFileOps::withReason(tr("Die Working Copy Datei konnte nicht erstellt werden.")));
    abandonOpening(m_demo || m_inspecting);
    return OpenStep::RefusedQuietly;
}

// When resuming, of the diary itself, read without touching it.
VDRDocument::OpenStep VDRDocument::readVersionAndIntegrity(Opening& o)
{
    o.integrity = QStringLiteral("not a database");
    if (!o.isDatabase)
        return OpenStep::GoOn;
    const auto version =
        o.resume ? VDRScopedConnection::readOnlyLook(QString::fromLatin1(kVersionConnection), o.diaryPath)
                 : std::make_unique<VDRScopedConnection>(QString::fromLatin1(kVersionConnection),
                                                         m_workingCopyPath);
    if (!version->isOpen()) {
        VDRPrompt::critical(tr("Datenbankfehler"), CVdShared::sqlErrorText(version->lastError()));
        abandonOpening(o.madeWorkingCopy);
        return OpenStep::Refused;
    }
    QSqlQuery q(version->db());
    if (q.exec(QStringLiteral("SELECT value FROM meta WHERE key = 'fileversion'")) && q.next())
        o.fileVersion = q.value(0).toString();
    q.finish();
    o.integrity = integrityOf(version->db(), nullptr, !o.resume);
    return OpenStep::GoOn;
}

// A damaged file: the user restores the newest intact backup or opens the damaged file anyway.
VDRDocument::OpenStep VDRDocument::offerBackupIfDamaged(Opening& o)
{
    if (o.intact())
        return OpenStep::GoOn;
    qWarning().noquote() << "integrity of" << o.diaryPath << ":" << o.integrity;
    // The copy of a damaged file is made again should the user open it anyway.
    if (o.madeWorkingCopy) {
        VDRFileOps::removeDatabase(m_workingCopyPath);
        o.madeWorkingCopy = false;
    }
    int count = 0;
    const QString backup = getBackupFile4Restore(o.diaryPath, count);
    if (count == 0 && !o.isDatabase) {
        // Not a database at all and nothing to restore from: nothing the user could open.
        VDRPrompt::critical(tr("Dateifehler"),
                            tr("Die Datei\n%1\nist keine Varduna-Datei.").arg(nativePath(o.path)));
        abandonOpening(false);
        return OpenStep::RefusedQuietly;
    }
    const QString head =
        tr("Die interne Struktur der Datenbank ist beschädigt.\nWenn Sie mit dieser Datenbank "
           "weiterarbeiten, drohen Datenverluste!\n");
    const OpenStep answer =
        backup.isEmpty() ? askToOpenDamaged(head, count) : offerRestoringBackup(o, head, backup);
    if (answer != OpenStep::GoOn || o.resume)
        return answer;
    return makeWorkingCopy(o);
}

// Goes on when the user opens the damaged file instead.
VDRDocument::OpenStep VDRDocument::offerRestoringBackup(Opening& o, const QString& head,
                                                        const QString& backup)
{
    const QString text =
        head + tr("Das neueste unbeschädigte Backup stammt vom %1.\nSoll dieses Backup wiederhergestellt "
                  "werden (empfohlen)?")
                   .arg(QLocale().toString(QFileInfo(backup).lastModified(), QLocale::ShortFormat));
    const int choice =
        VDRPrompt::instance()->choose(VDRPrompt::Warning, tr("Beschädigte Datenbank-Datei"), text,
                                      {tr("Backup wiederherstellen"), tr("Beschädigte Datei öffnen")}, 0, 1);
    if (choice != 0)
        return OpenStep::GoOn;
    const bool inspection = m_inspecting;
    abandonOpening(false);
    if (inspection) {
        // An inspection changes no file; it shows what the backup holds instead.
        m_inspecting = true;
        o.reopenPath = backup;
        return OpenStep::Reopen;
    }
    QString newName;
    QString error;
    if (restoreBackupFile(o.diaryPath, backup, newName, error)) {
        VDRPrompt::information(tr("Backup wiederherstellen"),
                               tr("Die Datei wurde erfolgreich wiederhergestellt und wird jetzt "
                                  "geöffnet.\nDie beschädigte Datei wurde umbenannt in %2.")
                                   .arg(nativePath(newName)));
        o.reopenPath = o.diaryPath;
        return OpenStep::Reopen;
    }
    VDRPrompt::critical(tr("Backup wiederherstellen"),
                        tr("Die Datei konnte nicht wiederhegestellt werden.\n") + error);
    return OpenStep::RefusedQuietly;
}

// Without an intact backup: goes on when the user opens the damaged file anyway.
VDRDocument::OpenStep VDRDocument::askToOpenDamaged(const QString& head, int backups)
{
    const QString middle = backups > 0 ? tr("Die Backup-Dateien sind ebenfalls beschädigt.")
                                       : tr("Es existieren keine Backup-Dateien.");
    const QString text =
        head + middle +
        tr(" Wenn sie über Sicherungskopien dieser Datei verfügen, stellen Sie diese wieder "
           "her.\nAnsonsten öffnen Sie die beschädigte Datei, kopieren die Stammdaten in eine "
           "neue Datei und arbeiten mit dieser Datei weiter.");
    const int choice =
        VDRPrompt::instance()->choose(VDRPrompt::Warning, tr("Beschädigte Datenbank-Datei"), text,
                                      {tr("Abbrechen"), tr("Beschädigte Datei öffnen")}, 1, 0);
    if (choice == 1)
        return OpenStep::GoOn;
    abandonOpening(false);
    return OpenStep::RefusedQuietly;
}

// A damaged file the user opens anyway is opened whatever version it names.
VDRDocument::OpenStep VDRDocument::refuseNewerVersion(Opening& o)
{
    if (!o.intact() || !VDRDatabaseSchema::isNewerThanCurrent(o.fileVersion))
        return OpenStep::GoOn;
    VDRPrompt::warning(tr("Datei öffnen"),
                       tr("Die Datei kann nicht geöffnet werden, da sie mit einer neueren "
                          "Programmversion erstellt wurde."));
    abandonOpening(o.madeWorkingCopy);
    return OpenStep::RefusedQuietly;
}

// The demo is never saved, so its shipped read-only mode stays; an inspection neither saves nor
// changes modes.
VDRDocument::OpenStep VDRDocument::ensureWritable(Opening& o)
{
    if (m_demo || m_inspecting || VDRFileOps::isWritable(o.diaryPath))
        return OpenStep::GoOn;
    QFile::setPermissions(o.diaryPath, QFile::permissions(o.diaryPath) | QFile::ReadOwner |
                                           QFile::WriteOwner | QFile::ReadUser | QFile::WriteUser);
    if (!VDRFileOps::isWritable(o.diaryPath))
        VDRPrompt::warning(tr("Datei-Warnung"),
                           tr("Sie haben keine Schreibrechte für die Datei %1.\nWenn Sie die Datei speichern "
                              "wollen, können Sie dies nur unter einem anderen Namen oder in einen anderen "
                              "Ordner.\nWählen Sie hierzu im Menü 'Datei' den Menüpunkt 'Speichern unter'.")
                               .arg(nativePath(o.diaryPath)));
    return OpenStep::GoOn;
}

// The exclusive lock on the working copy keeps every other instance out; the lock information
// beside the diary tells them who holds it.
VDRDocument::OpenStep VDRDocument::takeLock(Opening& o)
{
    // The lock-information file belongs beside a working copy beside the diary, not to a temporary one.
    if (m_workingCopyPath == o.workingCopy)
        m_lockInfoPath = o.lockInfo;
    if (!openWorkingCopyConnection(true)) {
        abandonOpening(o.madeWorkingCopy);
        return OpenStep::Refused;
    }
    {
        QSqlQuery q(database());
        // The dummy write only takes the lock. Synced, it would force the whole fresh copy to disk
        // here; the user's first edit syncs it anyway, and a copy broken before that holds no edits.
        // A resumed copy holds exactly the unsaved edits and stays synced.
        if (!o.resume)
            q.exec(QStringLiteral("PRAGMA synchronous = OFF"));
        QSqlError error;
        const bool locked = writeDummyRow(database(), error);
        q.exec(QStringLiteral("PRAGMA synchronous = FULL"));
        q.finish();
        if (!locked) {
            VDRPrompt::warning(QStringLiteral("SQL Error"), CVdShared::sqlErrorText(error));
            abandonOpening(o.madeWorkingCopy);
            return OpenStep::RefusedQuietly;
        }
    }
    if (!m_lockInfoPath.isEmpty() && !writeLockInfo(m_lockInfoPath))
        qWarning().noquote() << "lock information not written:" << m_lockInfoPath;
    return OpenStep::GoOn;
}

// The upgrade extends these tables but cannot make them.
VDRDocument::OpenStep VDRDocument::requireCoreTables(Opening& o)
{
    for (const char* table : {"vdr", "entry_photo", "entry_scheduleddelivery"}) {
        if (!VDRDatabaseSchema::tableExists(database(), QLatin1String(table))) {
            VDRPrompt::critical(tr("Datenbankfehler"), tr("Tabelle %1 fehlt").arg(QLatin1String(table)));
            abandonOpening(o.madeWorkingCopy);
            return OpenStep::Refused;
        }
    }
    return OpenStep::GoOn;
}

VDRDocument::OpenStep VDRDocument::upgradeAndWarn(Opening& o)
{
    // Trigger of the photo-assignment repair: entry_photo lacks relation_id before the upgrade
    // adds it. The repaired working copy has the column, so once saved the repair never runs again.
    o.photoAssignmentsMissing = !VDRDatabaseSchema::columns(database(), QStringLiteral("entry_photo"))
                                     .contains(QStringLiteral("relation_id"), Qt::CaseInsensitive);
    bool extended = false;
    if (!VDRDatabaseSchema::upgrade(database(), extended)) {
        abandonOpening(o.madeWorkingCopy);
        return OpenStep::Refused;
    }
    m_structureExtended = extended;
    VDRDatabaseSchema::createEntryIndexes(database());
    if (!extended)
        return OpenStep::GoOn;
    QString text =
        tr("Sie öffnen ein Dokument, das mit einer früheren Programmversion erstellt wurde.\nDie "
           "Struktur des Dokuments wird jetzt erweitert.\n\nWenn Sie das Dokument speichern, wird es im "
           "aktuellen Dateiformat gespeichert.\nSie können das Dokument dann nicht mehr mit früheren "
           "Programmversionen bearbeiten.\n\n");
    if (isOnSyncList(o.diaryPath))
        text += tr("Für dieses Dokument ist die Synchronisation mit einem mobilen Endgerät "
                   "eingeschaltet.\nUm eine "
                   "fehlerfreie Synchronisation zu gewährleisten, müssen Sie auf dem mobilen Endgerät "
                   "die neueste "
                   "Version der Varduna-App installieren!\n");
    else
        text +=
            tr("Wenn Sie das Dokument mit einem mobilen Endgerät synchronisieren wollen, müssen Sie auf dem "
               "mobilen Endgerät die neueste Version der Varduna-App installieren!\n");
    VDRPrompt::warning(tr("Datei-Warnung"), text);
    return OpenStep::GoOn;
}

// Moves files into the documents database beside the diary, which an inspection leaves alone.
VDRDocument::OpenStep VDRDocument::importPendingDocuments(Opening&)
{
    if (m_inspecting)
        return OpenStep::GoOn;
    QSqlQuery q(database());
    QString state;
    if (q.exec(QStringLiteral("SELECT value FROM meta WHERE key = 'documentImport'")) && q.next())
        state = q.value(0).toString();
    q.finish();
    if (state != QLatin1String("done") && state != QLatin1String("noAction"))
        importExternalDocuments();
    return OpenStep::GoOn;
}

VDRDocument::OpenStep VDRDocument::finishOpening(Opening& o)
{
    // The repairs of older diaries work through the models.
    initModels();
    m_fileVersion = metaValue(QStringLiteral("fileversion"));
    if (o.photoAssignmentsMissing)
        repairPhotoAssignments();
    if (m_fileVersion == QLatin1String("0.1") || m_fileVersion == QLatin1String("0.0"))
        repairOldVersion();

    m_valid = true;
    m_new = false;
    m_modified = o.resume;
    m_tempFolder = createPrivateTempFolder();
    emit syncButtonVisibilityChanged(isOnSyncList(o.diaryPath));
    emit documentOpened(this);
    return OpenStep::GoOn;
}

VDRDocument::LockState VDRDocument::probeWorkingCopy(const QString& workingCopy, bool& failed)
{
    failed = false;
    if (!QFileInfo::exists(workingCopy))
        return WorkingCopyAbsent;
    // Whatever else goes wrong here, the copy may hold the only state of unsaved work: it is
    // discarded only when SQLite proves it damaged.
    auto refuse = [&](const QSqlError& error) {
        VDRPrompt::critical(tr("Datenbankfehler"),
                            tr("Die Working Copy Datei\n%1\nkann nicht geöffnet werden:\n%2\nDie Datei "
                               "bleibt erhalten, damit keine ungespeicherten Änderungen verloren gehen.")
                                .arg(nativePath(workingCopy), CVdShared::sqlErrorText(error)));
        failed = true;
        return WorkingCopyAbsent;
    };
    // A short wait covers another instance's momentary read; a held lock is held for good.
    VDRScopedConnection lock(QString::fromLatin1(kLockConnection), workingCopy,
                             QStringLiteral("QSQLITE_BUSY_TIMEOUT=1000"), false);
    if (!lock.isOpen())
        return refuse(lock.lastError());
    QSqlError error;
    if (!writeDummyRow(lock.db(), error)) {
        const int code = VDRScopedConnection::sqliteCode(error);
        if (code == SqliteBusy || code == SqliteLocked)
            return WorkingCopyLocked;
        if (provesDamage(error))
            return WorkingCopyCorrupt;
        return refuse(error);
    }
    const QString integrity = integrityOf(lock.db(), &error);
    if (integrity == QLatin1String("ok"))
        return WorkingCopyFree;
    if (!integrity.startsWith(QLatin1String("NoResult")) || provesDamage(error))
        return WorkingCopyCorrupt;
    return refuse(error);
}

bool VDRDocument::discardWorkingCopy(const QString& workingCopy, const QString& lockInfo,
                                     const QString& diaryPath)
{
    VDRDocumentsDb::resetChangesOnDocumentsDb(diaryPath);
    if (!VDRFileOps::removeDatabase(workingCopy)) {
        VDRPrompt::critical(tr("Dateifehler"),
                            tr("Löschen der Datei\n%1\n fehlgeschlagen.").arg(nativePath(workingCopy)));
        return false;
    }
    if (!lockInfo.isEmpty() && QFileInfo::exists(lockInfo))
        VDRFileOps::remove(lockInfo);
    return true;
}

void VDRDocument::abandonOpening(bool removeWorkingCopy)
{
    destroyModels();
    closeConnection();
    // A working copy made by this opening holds nothing of the user's; left behind it would be
    // taken for an unfinished edit next time. A resumed one holds unsaved work and stays.
    if (removeWorkingCopy && !m_workingCopyPath.isEmpty()) {
        VDRFileOps::removeDatabase(m_workingCopyPath);
        if (!m_lockInfoPath.isEmpty())
            QFile::remove(m_lockInfoPath);
    }
    removeTemporaryFiles();
    clearState();
}

bool VDRDocument::importExternalDocuments()
{
    return VDRDocumentsDb::importExternalDocuments(this);
}

void VDRDocument::repairOldVersion()
{
    freezeCompaniesOfLockedEntries();
    renumberPositions();
}

void VDRDocument::freezeCompaniesOfLockedEntries()
{
    // These versions locked reports without freezing their companies.
    beginTransaction();
    m_modelEntryAll->fetch_all();
    for (int row = 0; row < m_modelEntryAll->rowCount(); ++row) {
        if (m_modelEntryAll->data(row, QStringLiteral("locked"), Qt::EditRole).toInt() != 0)
            lockCompanyRecords4lockedEntry(row); // submits the copies and the report's rows
    }
    endTransaction();
}

void VDRDocument::renumberPositions()
{
    m_modelEntryAll->fetch_all();
    for (int row = 0; row < m_modelEntryAll->rowCount(); ++row) {
        const int entryId = m_modelEntryAll->data(row, QStringLiteral("id"), Qt::EditRole).toInt();
        for (VDRSqlTableModel* model : entryModels(entryId)) {
            model->fetch_all();
            bool changed = false;
            for (int r = 0; r < model->rowCount(); ++r) {
                if (model->data(r, QStringLiteral("pos"), Qt::EditRole).toInt() != r) {
                    model->setData(r, QStringLiteral("pos"), r);
                    changed = true;
                }
            }
            if (changed)
                model->submitAll();
        }
    }
}
