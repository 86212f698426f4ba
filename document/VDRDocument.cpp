#include "document/VDRDocument.h"

#include "document/CVdShared.h"
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDatabaseSchema.h"
#include "document/VDRDiaryCheck.h"
#include "document/VDRDocumentsDb.h"
#include "document/VDRFileOps.h"
#include "document/VDRPrompt.h"
#include "document/VDRScopedConnection.h"

#include <QCoreApplication>
#include <QDate>
#include <QDebug>
#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QHostInfo>
#include <QLocale>
#include <QSettings>
#include <QSqlError>
#include <QSqlQuery>
#include <QSqlRecord>
#include <QStorageInfo>
#include <QTextStream>
#include <QThread>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <pwd.h>
#include <sys/stat.h>
#include <unistd.h>

namespace {
bool g_globalModified = false;
std::function<bool(const QString&)> g_syncListQuery;

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

VDRDocument::VDRDocument(QObject* parent) : QObject(parent) {}

VDRDocument::~VDRDocument()
{
    // Destroyed without being closed (the program ends some other way): unsaved changes stay in
    // the working copy, which the next opening offers to resume.
    if (m_valid && isStateModified())
        closeKeepingWorkingCopy();
    else if (m_valid)
        closeDocument();
}

QSqlDatabase VDRDocument::database() const
{
    return QSqlDatabase::database(connectionName(), false);
}

void VDRDocument::setGlobalModified(bool modified)
{
    g_globalModified = modified;
}

bool VDRDocument::globalModified()
{
    return g_globalModified;
}

void VDRDocument::setSyncListQuery(std::function<bool(const QString&)> query)
{
    g_syncListQuery = std::move(query);
}

bool VDRDocument::isOnSyncList(const QString& path)
{
    return g_syncListQuery && !path.isEmpty() && g_syncListQuery(path);
}

QString VDRDocument::workingCopyPathFor(const QString& diaryPath)
{
    return diaryPath + QStringLiteral(".workingcopy");
}

QString VDRDocument::lockInfoPathFor(const QString& diaryPath)
{
    const QFileInfo fi(diaryPath);
    return fi.path() + QLatin1Char('/') + fi.completeBaseName() + QStringLiteral(".udf");
}

QString VDRDocument::documentsDbPathFor(const QString& diaryPath)
{
    const QFileInfo fi(diaryPath);
    return fi.path() + QLatin1Char('/') + fi.completeBaseName() + QStringLiteral(".vdd");
}

QString VDRDocument::currentUserName()
{
    QString user = qEnvironmentVariable("USER");
    if (user.isEmpty()) {
        // Services and some terminals start programs without USER; the login name still exists.
        if (const passwd* entry = ::getpwuid(::getuid()))
            user = QString::fromLocal8Bit(entry->pw_name);
    }
    return user.isEmpty() ? QStringLiteral("unbekannt") : user;
}

QString VDRDocument::currentComputerName()
{
    QString name = qEnvironmentVariable("COMPUTERNAME");
    if (name.isEmpty())
        name = QHostInfo::localHostName();
    return name.isEmpty() ? QStringLiteral("unbekannt") : name;
}

QStringList VDRDocument::readLockInfo(const QString& lockInfoPath)
{
    QFile f(lockInfoPath);
    if (!f.open(QIODevice::ReadOnly | QIODevice::Text))
        return {};
    QStringList lines;
    QTextStream in(&f);
    in.setCodec("UTF-8");
    while (!in.atEnd() && lines.size() < 4)
        lines << in.readLine();
    return lines;
}

bool VDRDocument::writeLockInfo(const QString& lockInfoPath)
{
    const QString text = currentUserName() + QLatin1Char('\n') + currentComputerName() + QLatin1Char('\n') +
                         QDate::currentDate().toString() + QLatin1Char('\n') +
                         QTime::currentTime().toString(QStringLiteral("hh:mm")) + QLatin1Char('\n');
    return VDRFileOps::writeFileAtomically(lockInfoPath, text.toUtf8());
}

QString VDRDocument::createPrivateTempFolder()
{
    // The name can be guessed: a folder someone else made under it first is never used, and ours
    // is for this user alone (it holds the diary's pictures, previews and PDFs).
    for (int attempt = 0; attempt < 100; ++attempt) {
        const QString name = findFreeTempFile(QString());
        if (::mkdir(QFile::encodeName(name).constData(), 0700) == 0)
            return name;
        if (errno != EEXIST)
            break;
    }
    qDebug() << "no temporary folder:" << std::strerror(errno);
    return QString();
}

QString VDRDocument::findFreeTempFile(const QString& suffix)
{
    static bool seeded = false;
    if (!seeded) {
        // Two instances started in the same second must not draw the same names.
        std::srand(static_cast<unsigned>(std::time(nullptr)) ^ static_cast<unsigned>(getpid() << 16));
        seeded = true;
    }
    for (;;) {
        qint64 uptime = 0;
        QFile f(QStringLiteral("/proc/uptime"));
        if (f.open(QIODevice::ReadOnly))
            uptime = static_cast<qint64>(
                QString::fromLatin1(f.readAll()).section(QLatin1Char(' '), 0, 0).toDouble());
        QString name = QDir::tempPath() + QStringLiteral("/vdn_temp.") + QString::number(uptime) +
                       QLatin1Char('.') + QString::number(std::rand());
        if (!suffix.isEmpty())
            name += QLatin1Char('.') + (suffix.startsWith(QLatin1Char('.')) ? suffix.mid(1) : suffix);
        if (!QFileInfo::exists(name))
            return name;
        QThread::msleep(500);
    }
}

QString VDRDocument::getFreeTempFile(const QString& suffix)
{
    const QString name = findFreeTempFile(suffix);
    m_filesToRemove << name;
    return name;
}

QString VDRDocument::checkDbIntegrity(QSqlDatabase db, bool ownFreshFile)
{
    // Only reads: the connection may be one on the diary file itself, which only saving changes.
    return integrityOf(db, nullptr, ownFreshFile);
}

QString VDRDocument::lockDateText(const QString& stored)
{
    // The file keeps the date in Qt's fixed text form; the user reads it in the interface's form.
    const QDate parsed = QDate::fromString(stored, Qt::TextDate);
    return parsed.isValid() ? parsed.toString(QStringLiteral("dd.MM.yyyy")) : stored;
}

QString VDRDocument::lockHolderText(const QStringList& holder)
{
    if (holder.size() < 4)
        return tr("Die Datei konnte nicht geöffnet werden, da sie in Bearbeitung ist.");
    const QString date = lockDateText(holder[2]);
    return tr("Die Datei konnte nicht geöffnet werden, da sie in Bearbeitung ist von\nUser: %1\nComputer: "
              "%2\nseit dem %3 %4 Uhr.")
        .arg(holder[0], holder[1], date, holder[3]);
}

void VDRDocument::beginTransaction()
{
    if (m_transactionDepth == 0) {
        m_transactionFailed = false;
        QSqlQuery q(database());
        if (!q.exec(QStringLiteral("BEGIN EXCLUSIVE TRANSACTION")))
            qDebug() << "BEGIN failed:" << q.lastError().text();
    }
    ++m_transactionDepth;
}

bool VDRDocument::endTransaction(bool stepsSucceeded)
{
    if (m_transactionDepth <= 0)
        return stepsSucceeded;
    m_transactionFailed = m_transactionFailed || !stepsSucceeded;
    if (--m_transactionDepth > 0)
        return stepsSucceeded;
    QString reason;
    if (m_transactionFailed) {
        // Half an operation (a copy without some of its rows, rows removed from a report that
        // stays) must not reach the file.
        reason =
            tr("Ein Schritt des Vorgangs ist fehlgeschlagen; der ganze Vorgang wurde rückgängig gemacht.");
    } else {
        QSqlQuery q(database());
        if (q.exec(QStringLiteral("COMMIT TRANSACTION")))
            return true;
        // A full disk or an I/O error: SQLite may keep the transaction open; it must not stay half-done.
        reason = CVdShared::sqlErrorText(q.lastError());
        if (reason.contains(QLatin1String("no transaction is active"))) {
            // SQLite already rolled back after a failed write inside the transaction; say why it failed.
            const QStorageInfo disk(QFileInfo(m_workingCopyPath).absolutePath());
            reason =
                disk.isValid() && disk.bytesAvailable() < 1024 * 1024
                    ? VDRFileOps::reasonText(ENOSPC)
                    : tr("Ein Schreibfehler hat den Vorgang abgebrochen; nichts davon wurde gespeichert.");
        }
    }
    m_transactionFailed = false;
    QSqlQuery(database()).exec(QStringLiteral("ROLLBACK TRANSACTION"));
    reselectModelsAfterRollback();
    VDRPrompt::critical(
        tr("Datenbankfehler"),
        tr("Die Änderungen konnten nicht in die Working Copy Datei\n%1\ngeschrieben werden:\n%2")
            .arg(nativePath(m_workingCopyPath), reason));
    return false;
}

void VDRDocument::clearState()
{
    m_valid = false;
    m_new = false;
    m_modified = false;
    m_saved = false;
    m_structureExtended = false;
    m_currentFormatAccepted = false;
    m_demo = false;
    m_filePath.clear();
    m_workingCopyPath.clear();
    m_lockInfoPath.clear();
    m_fileVersion.clear();
    m_inspecting = false;
    m_transactionDepth = 0;
    m_transactionFailed = false;
    m_masterDataModified = false;
    m_deletedImages = 0;
    m_deletedAudio = 0;
}

bool VDRDocument::openWorkingCopyConnection(bool showErrors)
{
    QSqlDatabase db = QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), connectionName());
    db.setDatabaseName(m_workingCopyPath);
    if (!db.open()) {
        if (showErrors)
            VDRPrompt::critical(tr("Datenbankfehler"), CVdShared::sqlErrorText(db.lastError()));
        return false;
    }
    QSqlQuery q(db);
    q.exec(QStringLiteral("PRAGMA locking_mode = EXCLUSIVE"));
    return true;
}

void VDRDocument::closeConnection()
{
    {
        QSqlDatabase db = QSqlDatabase::database(connectionName(), false);
        if (db.isOpen())
            db.close();
    }
    if (QSqlDatabase::contains(connectionName()))
        QSqlDatabase::removeDatabase(connectionName());
    m_transactionDepth = 0;
}

bool VDRDocument::createDocument(bool hideSyncButton)
{
    if (m_valid)
        return false;
    clearState();
    VDRBusyCursor busy;

    m_workingCopyPath = findFreeTempFile(QString());
    if (!openWorkingCopyConnection(true)) {
        closeConnection();
        VDRFileOps::removeDatabase(m_workingCopyPath);
        clearState();
        return false;
    }

    beginTransaction();
    if (!VDRDatabaseSchema::createStructure(database())) {
        endTransaction();
        closeConnection();
        VDRFileOps::removeDatabase(m_workingCopyPath);
        clearState();
        return false;
    }

    VDRDatabaseSchema::createEntryIndexes(database());
    initModels();
    m_fileVersion = VDRDatabaseSchema::currentVersion();
    bool ok = true;
    ok &= m_modelMeta->appendRow({{"key", "fileversion"}, {"value", m_fileVersion}});
    ok &= m_modelMeta->appendRow({{"key", "documentImport"}, {"value", "noAction"}});
    ok &= m_modelMeta->submitAll();

    const QString name = tr("Neues Varduna");
    ok &= m_modelVdr->appendRow({{"id", 1},
                                 {"name", name},
                                 {"logo_image_id", QVariant()},
                                 {"logo_align", 2},
                                 {"logo2_image_id", 0},
                                 {"logo2_align", 0},
                                 {"headline_left", name},
                                 {"headline_center", ""},
                                 {"headline_right", ""},
                                 {"footer_left", tr("Korvant")},
                                 {"footer_center", tr("Varduna")},
                                 {"footer_right", tr("www.korvant-software.de")},
                                 {"createdate", QDateTime::currentDateTime()},
                                 {"entrycounter", 0},
                                 {"email_subject", ""},
                                 {"email_body", ""},
                                 {"display_empty_categories", 0}});
    ok &= m_modelVdr->submitAll();

    ok &= appendCompany1(tr("Bauherr"));
    ok &= appendCompany1(tr("Bauleitung"));
    ok &= appendCompany1(tr("Architekt"));
    ok &= m_modelCompany1->submitAll();

    ok &= appendEntry() == 1;
    ok &= m_modelEntryAll->submitAll();
    endTransaction();

    if (!ok) {
        VDRPrompt::critical(tr("interner Fehler"), tr("Datenbank-Initialisierung fehlgeschlagen."));
        destroyModels();
        closeConnection();
        VDRFileOps::removeDatabase(m_workingCopyPath);
        clearState();
        return false;
    }

    m_valid = true;
    m_new = true;
    m_modified = false;
    m_filePath.clear();
    m_tempFolder = createPrivateTempFolder();
    emit documentOpened(this);

    setGlobalModified(false);
    if (hideSyncButton)
        emit syncButtonVisibilityChanged(false);
    return true;
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

bool VDRDocument::openDocument(const QString& path, bool& showError)
{
    // One problem, one message: a refusal explained on the way needs no general one after it.
    const int shown = VDRPrompt::messagesShown();
    const bool opened = openDocumentImpl(path, showError);
    if (!opened && VDRPrompt::messagesShown() != shown)
        showError = false;
    return opened;
}

bool VDRDocument::openDocumentImpl(const QString& path, bool& showError)
{
    showError = true;
    if (m_valid)
        return false;
    VDRBusyCursor busy;

    const QFileInfo info(path);
    if (!info.exists()) {
        VDRPrompt::critical(tr("Dateifehler"), tr("Die Datei\n%1\nexistiert nicht.").arg(nativePath(path)));
        emit recentFileMissing(info.absoluteFilePath());
        showError = false;
        return false;
    }
    if (!info.isFile()) {
        VDRPrompt::critical(tr("Dateifehler"), tr("%1\nist keine Datei.").arg(nativePath(path)));
        showError = false;
        return false;
    }
    const bool inspecting = m_inspecting;
    clearState();
    m_inspecting = inspecting;
    const QString diaryPath = info.absoluteFilePath();
    const QString lockInfo = lockInfoPathFor(diaryPath);
    const QString workingCopy = workingCopyPathFor(diaryPath);

    // 3: a working copy is already there. An inspection probes a private copy of it, so that
    // neither the copy nor its lock information changes.
    bool resume = false;
    QString resumedCopy = workingCopy;
    {
        QString probed = workingCopy;
        if (m_inspecting && QFileInfo::exists(workingCopy)) {
            if (VDRDiaryCheck::isHeld(workingCopy)) {
                probed.clear();
            } else {
                probed = getFreeTempFile(QStringLiteral(".vd2"));
                m_filesToRemove << probed + QStringLiteral("-journal");
                if (!VDRFileOps::copy(workingCopy, probed)) {
                    VDRPrompt::critical(
                        tr("Dateifehler"),
                        VDRFileOps::withReason(
                            tr("Kopieren der Datei\n%1\n fehlgeschlagen.").arg(nativePath(workingCopy))));
                    abandonOpening(false);
                    showError = false;
                    return false;
                }
                // An interrupted transaction is rolled back from its journal, as resuming would.
                const QString journal = workingCopy + QStringLiteral("-journal");
                if (QFileInfo::exists(journal))
                    VDRFileOps::copy(journal, probed + QStringLiteral("-journal"));
            }
        }
        bool failed = false;
        const LockState state = probed.isEmpty() ? WorkingCopyLocked : probeWorkingCopy(probed, failed);
        if (failed) {
            abandonOpening(false);
            showError = false;
            return false;
        }
        switch (state) {
        case WorkingCopyAbsent:
            break;
        case WorkingCopyCorrupt:
            if (!m_inspecting && !discardWorkingCopy(workingCopy, QString(), diaryPath))
                return false;
            break;
        case WorkingCopyLocked:
            VDRPrompt::warning(tr("Datenbank in Bearbeitung"), lockHolderText(readLockInfo(lockInfo)));
            abandonOpening(false);
            showError = false;
            return false;
        case WorkingCopyFree: {
            const QStringList holder = readLockInfo(lockInfo);
            if (holder.size() >= 2 && holder[0] == currentUserName() && holder[1] == currentComputerName()) {
                resume = true;
                resumedCopy = probed;
            } else if (!m_inspecting && !discardWorkingCopy(workingCopy, lockInfo, diaryPath)) {
                return false;
            }
            break;
        }
        }
    }
    // Nobody holds the diary: what an interrupted save left beside it can go.
    if (!m_inspecting)
        cleanUpInterruptedSave(diaryPath);
    if (resume)
        VDRPrompt::information(
            tr("Datei öffnen"),
            tr("Die letzte Bearbeitung der Varduna-Datei wurde nicht ordnungsgemäß abgeschlossen.\n"
               "Der letzte Bearbeitungsstand wird geöffnet. Speichern Sie die Datei, wenn Sie diesen "
               "Stand behalten wollen."));

    // 4: demo project?
    const bool isDatabase = hasSqliteHeader(diaryPath);
    if (isDatabase) {
        const auto demo = VDRScopedConnection::readOnlyLook(QString::fromLatin1(kDemoConnection), diaryPath);
        if (!demo->isOpen()) {
            VDRPrompt::critical(tr("Datenbankfehler"), CVdShared::sqlErrorText(demo->lastError()));
            abandonOpening(false);
            return false;
        }
        QSqlQuery q(demo->db());
        if (q.exec(QStringLiteral("SELECT value FROM meta WHERE key = '%1'").arg(QStringLiteral("isdp"))) &&
            q.next())
            m_demo = q.value(0).toInt() == 42;
    }

    // 6: the working copy. It is made before the checks of step 5, which then read the fresh copy
    // (still in memory) instead of reading the diary from disk twice.
    m_filePath = diaryPath;
    m_workingCopyPath = resume ? resumedCopy : workingCopy;
    bool madeWorkingCopy = false;
    auto makeWorkingCopy = [&]() {
        if (m_inspecting) {
            m_workingCopyPath = getFreeTempFile(QStringLiteral(".vd2"));
            madeWorkingCopy = VDRFileOps::copy(diaryPath, m_workingCopyPath);
        } else {
            // A journal left without its copy (deleted by hand or by a sync client) would be rolled
            // into the fresh copy as if it were its own.
            m_workingCopyPath = workingCopy;
            for (const char* companion : {"-journal", "-wal", "-shm"})
                QFile::remove(workingCopy + QLatin1String(companion));
            if (VDRFileOps::copy(diaryPath, workingCopy)) {
                madeWorkingCopy = true;
            } else if (m_demo) {
                m_workingCopyPath = getFreeTempFile(QStringLiteral(".vd2"));
                madeWorkingCopy = VDRFileOps::copy(diaryPath, m_workingCopyPath);
            }
        }
        if (!madeWorkingCopy) {
            VDRPrompt::critical(
                tr("Dateifehler"),
                VDRFileOps::withReason(tr("Die Working Copy Datei konnte nicht erstellt werden.")));
            abandonOpening(m_demo || m_inspecting);
            showError = false;
        }
        return madeWorkingCopy;
    };
    if (!resume && isDatabase && !makeWorkingCopy())
        return false;

    // 5: version and integrity; when resuming, of the diary itself, read without touching it.
    QString fileVersion;
    QString integrity = QStringLiteral("not a database");
    if (isDatabase) {
        const auto version =
            resume ? VDRScopedConnection::readOnlyLook(QString::fromLatin1(kVersionConnection), diaryPath)
                   : std::make_unique<VDRScopedConnection>(QString::fromLatin1(kVersionConnection),
                                                           m_workingCopyPath);
        if (!version->isOpen()) {
            VDRPrompt::critical(tr("Datenbankfehler"), CVdShared::sqlErrorText(version->lastError()));
            abandonOpening(madeWorkingCopy);
            return false;
        }
        QSqlQuery q(version->db());
        if (q.exec(QStringLiteral("SELECT value FROM meta WHERE key = 'fileversion'")) && q.next())
            fileVersion = q.value(0).toString();
        q.finish();
        integrity = integrityOf(version->db(), nullptr, !resume);
    }
    if (integrity != QLatin1String("ok")) {
        qWarning().noquote() << "integrity of" << diaryPath << ":" << integrity;
        // The copy of a damaged file is made again should the user open it anyway.
        if (madeWorkingCopy) {
            VDRFileOps::removeDatabase(m_workingCopyPath);
            madeWorkingCopy = false;
        }
        int count = 0;
        const QString backup = getBackupFile4Restore(diaryPath, count);
        if (count == 0 && !isDatabase) {
            // Not a database at all and nothing to restore from: nothing the user could open.
            VDRPrompt::critical(tr("Dateifehler"),
                                tr("Die Datei\n%1\nist keine Varduna-Datei.").arg(nativePath(path)));
            abandonOpening(false);
            showError = false;
            return false;
        }
        const QString head =
            tr("Die interne Struktur der Datenbank ist beschädigt.\nWenn Sie mit dieser Datenbank "
               "weiterarbeiten, drohen Datenverluste!\n");
        if (!backup.isEmpty()) {
            const QString text =
                head +
                tr("Das neueste unbeschädigte Backup stammt vom %1.\nSoll dieses Backup wiederhergestellt "
                   "werden (empfohlen)?")
                    .arg(QLocale().toString(QFileInfo(backup).lastModified(), QLocale::ShortFormat));
            const int choice = VDRPrompt::instance()->choose(
                VDRPrompt::Warning, tr("Beschädigte Datenbank-Datei"), text,
                {tr("Backup wiederherstellen"), tr("Beschädigte Datei öffnen")}, 0, 1);
            if (choice == 0) {
                const bool inspection = m_inspecting;
                abandonOpening(false);
                if (inspection) {
                    // An inspection changes no file; it shows what the backup holds instead.
                    m_inspecting = true;
                    return openDocumentImpl(backup, showError);
                }
                QString newName;
                QString error;
                if (restoreBackupFile(diaryPath, backup, newName, error)) {
                    VDRPrompt::information(tr("Backup wiederherstellen"),
                                           tr("Die Datei wurde erfolgreich wiederhergestellt und wird jetzt "
                                              "geöffnet.\nDie beschädigte Datei wurde umbenannt in %2.")
                                               .arg(nativePath(newName)));
                    return openDocumentImpl(diaryPath, showError);
                }
                VDRPrompt::critical(tr("Backup wiederherstellen"),
                                    tr("Die Datei konnte nicht wiederhegestellt werden.\n") + error);
                showError = false;
                return false;
            }
        } else {
            const QString middle = count > 0 ? tr("Die Backup-Dateien sind ebenfalls beschädigt.")
                                             : tr("Es existieren keine Backup-Dateien.");
            const QString text =
                head + middle +
                tr(" Wenn sie über Sicherungskopien dieser Datei verfügen, stellen Sie diese wieder "
                   "her.\nAnsonsten öffnen Sie die beschädigte Datei, kopieren die Stammdaten in eine "
                   "neue Datei und arbeiten mit dieser Datei weiter.");
            const int choice =
                VDRPrompt::instance()->choose(VDRPrompt::Warning, tr("Beschädigte Datenbank-Datei"), text,
                                              {tr("Abbrechen"), tr("Beschädigte Datei öffnen")}, 1, 0);
            if (choice != 1) {
                abandonOpening(false);
                showError = false;
                return false;
            }
        }
        if (!resume && !makeWorkingCopy())
            return false;
    } else if (VDRDatabaseSchema::isNewerThanCurrent(fileVersion)) {
        VDRPrompt::warning(tr("Datei öffnen"),
                           tr("Die Datei kann nicht geöffnet werden, da sie mit einer neueren "
                              "Programmversion erstellt wurde."));
        abandonOpening(madeWorkingCopy);
        showError = false;
        return false;
    }

    // The lock-information file belongs beside a working copy beside the diary, not to a temporary one.
    if (m_workingCopyPath == workingCopy)
        m_lockInfoPath = lockInfo;

    // 7: write permission. The demo is never saved, so its shipped read-only mode stays; an
    // inspection neither saves nor changes modes.
    if (!m_demo && !m_inspecting && !VDRFileOps::isWritable(diaryPath)) {
        QFile::setPermissions(diaryPath, QFile::permissions(diaryPath) | QFile::ReadOwner |
                                             QFile::WriteOwner | QFile::ReadUser | QFile::WriteUser);
        if (!VDRFileOps::isWritable(diaryPath) && !m_demo)
            VDRPrompt::warning(
                tr("Datei-Warnung"),
                tr("Sie haben keine Schreibrechte für die Datei %1.\nWenn Sie die Datei speichern "
                   "wollen, können Sie dies nur unter einem anderen Namen oder in einen anderen "
                   "Ordner.\nWählen Sie hierzu im Menü 'Datei' den Menüpunkt 'Speichern unter'.")
                    .arg(nativePath(diaryPath)));
    }

    // 8: take the exclusive lock.
    if (!openWorkingCopyConnection(true)) {
        abandonOpening(madeWorkingCopy);
        return false;
    }
    {
        QSqlQuery q(database());
        // The dummy write only takes the lock. Synced, it would force the whole fresh copy to disk
        // here; the user's first edit syncs it anyway, and a copy broken before that holds no edits.
        // A resumed copy holds exactly the unsaved edits and stays synced.
        if (!resume)
            q.exec(QStringLiteral("PRAGMA synchronous = OFF"));
        QSqlError error;
        const bool locked = writeDummyRow(database(), error);
        q.exec(QStringLiteral("PRAGMA synchronous = FULL"));
        q.finish();
        if (!locked) {
            VDRPrompt::warning(QStringLiteral("SQL Error"), CVdShared::sqlErrorText(error));
            abandonOpening(madeWorkingCopy);
            showError = false;
            return false;
        }
    }

    // 9
    if (!m_lockInfoPath.isEmpty() && !writeLockInfo(m_lockInfoPath))
        qWarning().noquote() << "lock information not written:" << m_lockInfoPath;

    // 10
    for (const char* table : {"vdr", "entry_photo", "entry_scheduleddelivery"}) {
        if (!VDRDatabaseSchema::tableExists(database(), QLatin1String(table))) {
            VDRPrompt::critical(tr("Datenbankfehler"), tr("Tabelle %1 fehlt").arg(QLatin1String(table)));
            abandonOpening(madeWorkingCopy);
            return false;
        }
    }

    // 11, 12
    // Trigger of the photo-assignment repair: entry_photo lacks relation_id before the upgrade
    // adds it. The repaired working copy has the column, so once saved the repair never runs again.
    const bool photoAssignmentsMissing =
        !VDRDatabaseSchema::columns(database(), QStringLiteral("entry_photo"))
             .contains(QStringLiteral("relation_id"), Qt::CaseInsensitive);
    bool extended = false;
    if (!VDRDatabaseSchema::upgrade(database(), extended)) {
        abandonOpening(madeWorkingCopy);
        return false;
    }
    m_structureExtended = extended;
    VDRDatabaseSchema::createEntryIndexes(database());
    if (extended) {
        QString text =
            tr("Sie öffnen ein Dokument, das mit einer früheren Programmversion erstellt wurde.\nDie "
               "Struktur des Dokuments wird jetzt erweitert.\n\nWenn Sie das Dokument speichern, wird es im "
               "aktuellen Dateiformat gespeichert.\nSie können das Dokument dann nicht mehr mit früheren "
               "Programmversionen bearbeiten.\n\n");
        if (isOnSyncList(diaryPath))
            text += tr("Für dieses Dokument ist die Synchronisation mit einem mobilen Endgerät "
                       "eingeschaltet.\nUm eine "
                       "fehlerfreie Synchronisation zu gewährleisten, müssen Sie auf dem mobilen Endgerät "
                       "die neueste "
                       "Version der Varduna-App installieren!\n");
        else
            text += tr(
                "Wenn Sie das Dokument mit einem mobilen Endgerät synchronisieren wollen, müssen Sie auf dem "
                "mobilen Endgerät die neueste Version der Varduna-App installieren!\n");
        VDRPrompt::warning(tr("Datei-Warnung"), text);
    }

    // 13: moves files into the documents database beside the diary, which an inspection leaves alone.
    if (!m_inspecting) {
        QSqlQuery q(database());
        QString state;
        if (q.exec(QStringLiteral("SELECT value FROM meta WHERE key = 'documentImport'")) && q.next())
            state = q.value(0).toString();
        q.finish();
        if (state != QLatin1String("done") && state != QLatin1String("noAction"))
            importExternalDocuments();
    }

    // 14
    initModels();
    m_fileVersion = metaValue(QStringLiteral("fileversion"));
    if (photoAssignmentsMissing)
        repairPhotoAssignments();
    if (m_fileVersion == QLatin1String("0.1") || m_fileVersion == QLatin1String("0.0"))
        repairOldVersion();

    // 15
    m_valid = true;
    m_new = false;
    m_modified = resume;
    m_tempFolder = createPrivateTempFolder();
    emit syncButtonVisibilityChanged(isOnSyncList(diaryPath));
    emit documentOpened(this);
    return true;
}

void VDRDocument::removeTemporaryFiles()
{
    m_imageTempPaths.clear();
    m_thumbnailTempPaths.clear();
    m_uploadImages.clear();
    for (const QString& file : qAsConst(m_filesToRemove))
        QFile::remove(file);
    m_filesToRemove.clear();
    if (!m_tempFolder.isEmpty())
        QDir(m_tempFolder).removeRecursively();
    m_tempFolder.clear();
}

bool VDRDocument::closeDocument()
{
    if (!m_valid)
        return true;
    emit documentClosed(this);
    const QString workingCopy = m_workingCopyPath;
    const QString lockInfo = m_lockInfoPath;
    const QString diaryPath = m_filePath;

    // The connection goes first: a temporary working copy is among the files handed out.
    destroyModels();
    closeConnection();

    bool ok = true;
    if (!workingCopy.isEmpty() && !VDRFileOps::removeDatabase(workingCopy)) {
        VDRPrompt::critical(tr("Dateifehler"),
                            tr("Löschen der Datei\n%1\n fehlgeschlagen.").arg(nativePath(workingCopy)));
        ok = false;
    }
    removeTemporaryFiles();
    if (!lockInfo.isEmpty())
        QFile::remove(lockInfo);
    if (!diaryPath.isEmpty() && !m_inspecting) {
        VDRDocumentsDb::resetChangesOnDocumentsDb(diaryPath);
        VDRDocumentsDb::checkDocumentDBsFreeSpace(diaryPath);
    }
    clearState();
    return ok;
}

void VDRDocument::closeKeepingWorkingCopy()
{
    if (!m_valid)
        return;
    emit documentClosed(this);
    destroyModels();
    while (m_transactionDepth > 0)
        endTransaction();
    closeConnection();
    // A temporary working copy (new diary, demo) cannot be resumed: nothing would find it.
    if (m_filesToRemove.contains(m_workingCopyPath) || m_filePath.isEmpty())
        VDRFileOps::removeDatabase(m_workingCopyPath);
    m_workingCopyPath.clear();
    removeTemporaryFiles();
    clearState();
}

bool VDRDocument::reopenWorkingCopyAfterError()
{
    destroyModels();
    closeConnection();
    // SQLite would make an empty database of a missing file, and the document would seem valid.
    if (!QFileInfo(m_workingCopyPath).isFile()) {
        VDRPrompt::critical(
            tr("Dateifehler"),
            tr("Die Working Copy Datei\n%1\nexistiert nicht mehr.").arg(nativePath(m_workingCopyPath)));
        return false;
    }
    if (!openWorkingCopyConnection(true))
        return false;
    QSqlError error;
    {
        // An empty exclusive transaction takes the same lock as the dummy row's write, and in
        // exclusive locking mode keeps it, without writing: the copy needs no second flush, and a
        // full disk cannot stop the user from going on with the open diary.
        QSqlQuery q(database());
        const bool locked = q.exec(QStringLiteral("BEGIN EXCLUSIVE TRANSACTION")) &&
                            q.exec(QStringLiteral("COMMIT TRANSACTION"));
        if (!locked) {
            error = q.lastError();
            q.finish();
            VDRPrompt::critical(tr("Datenbankfehler"),
                                tr("Die Working Copy Datei\n%1\nkann nicht wieder gesperrt werden:\n%2")
                                    .arg(nativePath(m_workingCopyPath), CVdShared::sqlErrorText(error)));
            closeConnection();
            return false;
        }
    }
    initModels();
    m_valid = true;
    return true;
}

bool VDRDocument::writeWorkingCopyTo(const QString& target)
{
    if (!m_valid)
        return false;
    destroyModels();
    closeConnection();
    const bool ok = VDRFileOps::copyDurably(m_workingCopyPath, target);
    if (!reopenWorkingCopyAfterError())
        return false;
    return ok;
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
