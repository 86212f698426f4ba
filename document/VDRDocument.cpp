#include "document/VDRDocument.h"

#include "document/CVdShared.h"
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDatabaseSchema.h"
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
#include <QTextStream>
#include <QThread>

#include <cstdlib>
#include <ctime>
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

} // namespace

VDRDocument::VDRDocument(QObject* parent) : QObject(parent) {}

VDRDocument::~VDRDocument()
{
    if (m_valid)
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
    const QString user = qEnvironmentVariable("USER");
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

QString VDRDocument::checkDbIntegrity(QSqlDatabase db)
{
    QSqlQuery q(db);
    if (q.exec(QStringLiteral("PRAGMA quick_check;")) && q.next())
        return q.value(0).toString();
    const QString error = q.lastError().text();
    qDebug() << "integrity check without result:" << error;
    QSqlQuery probe(db);
    if (probe.exec(QStringLiteral("INSERT INTO meta (KEY, VALUE) VALUES('dummy', 'dummy');")))
        probe.exec(QStringLiteral("DELETE FROM meta WHERE KEY='dummy';"));
    qDebug() << "dummy row test:" << probe.lastError().text();
    // A file SQLite cannot read at all has no result row; say why when SQLite told us.
    return error.trimmed().isEmpty() ? QStringLiteral("NoResult") : QStringLiteral("NoResult: ") + error;
}

void VDRDocument::beginTransaction()
{
    if (m_transactionDepth == 0) {
        QSqlQuery q(database());
        if (!q.exec(QStringLiteral("BEGIN EXCLUSIVE TRANSACTION")))
            qDebug() << "BEGIN failed:" << q.lastError().text();
    }
    ++m_transactionDepth;
}

void VDRDocument::endTransaction()
{
    if (m_transactionDepth <= 0)
        return;
    if (--m_transactionDepth == 0) {
        QSqlQuery q(database());
        if (!q.exec(QStringLiteral("COMMIT TRANSACTION")))
            qDebug() << "COMMIT failed:" << q.lastError().text();
    }
}

void VDRDocument::clearState()
{
    m_valid = false;
    m_new = false;
    m_modified = false;
    m_saved = false;
    m_structureExtended = false;
    m_demo = false;
    m_filePath.clear();
    m_workingCopyPath.clear();
    m_lockInfoPath.clear();
    m_fileVersion.clear();
    m_transactionDepth = 0;
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
    m_tempFolder = findFreeTempFile(QString());
    QDir().mkpath(m_tempFolder);
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
    // A short wait covers another instance's momentary read; a held lock is held for good.
    VDRScopedConnection lock(QString::fromLatin1(kLockConnection), workingCopy,
                             QStringLiteral("QSQLITE_BUSY_TIMEOUT=1000"), false);
    if (!lock.isOpen()) {
        VDRPrompt::critical(tr("Datenbankfehler"), CVdShared::sqlErrorText(lock.lastError()));
        failed = true;
        return WorkingCopyAbsent;
    }
    QSqlQuery insert(lock.db());
    if (!insert.exec(QStringLiteral("INSERT INTO meta (KEY, VALUE) VALUES('dummy', 'dummy');"))) {
        const QSqlError error = insert.lastError();
        insert.finish();
        // Only a busy database (SQLITE_BUSY, SQLITE_LOCKED) means a running instance holds it;
        // any other failure means the copy itself is broken.
        if (error.nativeErrorCode() == QLatin1String("5") || error.nativeErrorCode() == QLatin1String("6"))
            return WorkingCopyLocked;
        return WorkingCopyCorrupt;
    }
    QSqlQuery remove(lock.db());
    if (!remove.exec(QStringLiteral("DELETE FROM meta WHERE KEY='dummy';"))) {
        VDRPrompt::critical(tr("Datenbankfehler"), CVdShared::sqlErrorText(remove.lastError()));
        failed = true;
        return WorkingCopyAbsent;
    }
    const QString integrity = checkDbIntegrity(lock.db());
    return integrity == QLatin1String("ok") ? WorkingCopyFree : WorkingCopyCorrupt;
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
    clearState();
    const QString diaryPath = info.absoluteFilePath();
    const QString lockInfo = lockInfoPathFor(diaryPath);
    const QString workingCopy = workingCopyPathFor(diaryPath);

    // 3: a working copy is already there.
    bool resume = false;
    {
        bool failed = false;
        const LockState state = probeWorkingCopy(workingCopy, failed);
        if (failed)
            return false;
        switch (state) {
        case WorkingCopyAbsent:
            break;
        case WorkingCopyCorrupt:
            if (!discardWorkingCopy(workingCopy, QString(), diaryPath))
                return false;
            break;
        case WorkingCopyLocked: {
            const QStringList holder = readLockInfo(lockInfo);
            QString text;
            if (holder.size() >= 4)
                text = tr("Die Datei konnte nicht geöffnet werden, da sie in Bearbeitung ist von\nUser: "
                          "%1\nComputer: "
                          "%2\nseit dem %3 %4 Uhr.")
                           .arg(holder[0], holder[1], holder[2], holder[3]);
            else
                text = tr("Die Datei konnte nicht geöffnet werden, da sie in Bearbeitung ist.");
            VDRPrompt::warning(tr("Datenbank in Bearbeitung"), text);
            showError = false;
            return false;
        }
        case WorkingCopyFree: {
            const QStringList holder = readLockInfo(lockInfo);
            if (holder.size() >= 2 && holder[0] == currentUserName() && holder[1] == currentComputerName()) {
                resume = true;
            } else if (!discardWorkingCopy(workingCopy, lockInfo, diaryPath)) {
                return false;
            }
            break;
        }
        }
    }
    // Nobody holds the diary: what an interrupted save left beside it can go.
    cleanUpInterruptedSave(diaryPath);
    if (resume)
        VDRPrompt::information(
            tr("Datei öffnen"),
            tr("Die letzte Bearbeitung der Varduna-Datei wurde nicht ordnungsgemäß abgeschlossen.\n"
               "Der letzte Bearbeitungsstand wird geöffnet. Speichern Sie die Datei, wenn Sie diesen "
               "Stand behalten wollen."));

    // 4: demo project?
    {
        VDRScopedConnection demo(QString::fromLatin1(kDemoConnection), diaryPath);
        if (!demo.isOpen()) {
            VDRPrompt::critical(tr("Datenbankfehler"), CVdShared::sqlErrorText(demo.lastError()));
            return false;
        }
        QSqlQuery q(demo.db());
        if (q.exec(QStringLiteral("SELECT value FROM meta WHERE key = '%1'").arg(QStringLiteral("isdp"))) &&
            q.next())
            m_demo = q.value(0).toInt() == 42;
    }

    // 5: version and integrity.
    QString fileVersion;
    QString integrity;
    if (!hasSqliteHeader(diaryPath)) {
        integrity = QStringLiteral("not a database");
    } else {
        VDRScopedConnection version(QString::fromLatin1(kVersionConnection), diaryPath);
        if (!version.isOpen()) {
            VDRPrompt::critical(tr("Datenbankfehler"), CVdShared::sqlErrorText(version.lastError()));
            return false;
        }
        QSqlQuery q(version.db());
        if (q.exec(QStringLiteral("SELECT value FROM meta WHERE key = 'fileversion'")) && q.next())
            fileVersion = q.value(0).toString();
        q.finish();
        integrity = checkDbIntegrity(version.db());
    }
    if (integrity != QLatin1String("ok")) {
        qWarning().noquote() << "integrity of" << diaryPath << ":" << integrity;
        int count = 0;
        const QString backup = getBackupFile4Restore(diaryPath, count);
        if (count == 0 && !hasSqliteHeader(diaryPath)) {
            // Not a database at all and nothing to restore from: nothing the user could open.
            VDRPrompt::critical(tr("Dateifehler"),
                                tr("Die Datei\n%1\nist keine Varduna-Datei.").arg(nativePath(path)));
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
                QString newName;
                QString error;
                if (restoreBackupFile(diaryPath, backup, newName, error)) {
                    VDRPrompt::information(tr("Backup wiederherstellen"),
                                           tr("Die Datei wurde erfolgreich wiederhergestellt und wird jetzt "
                                              "geöffnet.\nDie beschädigte Datei wurde umbenannt in %2.")
                                               .arg(nativePath(newName)));
                    return openDocument(diaryPath, showError);
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
                showError = false;
                return false;
            }
        }
    } else if (VDRDatabaseSchema::isNewerThanCurrent(fileVersion)) {
        VDRPrompt::warning(tr("Datei öffnen"),
                           tr("Die Datei kann nicht geöffnet werden, da sie mit einer neueren "
                              "Programmversion erstellt wurde."));
        showError = false;
        return false;
    }

    // 6: the working copy.
    m_filePath = diaryPath;
    m_lockInfoPath = lockInfo;
    m_workingCopyPath = workingCopy;
    bool madeWorkingCopy = false;
    if (!resume) {
        if (VDRFileOps::copy(diaryPath, workingCopy)) {
            madeWorkingCopy = true;
        } else if (m_demo) {
            m_workingCopyPath = getFreeTempFile(QStringLiteral(".vd2"));
            madeWorkingCopy = VDRFileOps::copy(diaryPath, m_workingCopyPath);
        }
        if (!madeWorkingCopy) {
            VDRPrompt::critical(tr("Dateifehler"),
                                tr("Die Working Copy Datei konnte nicht erstellt werden."));
            const bool isDemo = m_demo;
            abandonOpening(isDemo);
            showError = false;
            return false;
        }
    }
    // The lock-information file belongs beside a working copy beside the diary, not to a temporary one.
    if (m_workingCopyPath != workingCopy)
        m_lockInfoPath.clear();

    // 7: write permission. The demo is never saved, so its shipped read-only mode stays.
    if (!m_demo && !VDRFileOps::isWritable(diaryPath)) {
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
        q.exec(QStringLiteral("PRAGMA synchronous = OFF"));
        const bool locked =
            q.exec(QStringLiteral("INSERT INTO meta (KEY, VALUE) VALUES('dummy', 'dummy');")) &&
            q.exec(QStringLiteral("DELETE FROM meta WHERE KEY='dummy';"));
        const QSqlError error = q.lastError();
        q.exec(QStringLiteral("PRAGMA synchronous = FULL"));
        if (!locked) {
            VDRPrompt::warning(QStringLiteral("SQL Error"), CVdShared::sqlErrorText(error));
            q.finish();
            abandonOpening(madeWorkingCopy);
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

    // 13
    {
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
    m_tempFolder = findFreeTempFile(QString());
    QDir().mkpath(m_tempFolder);
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
    if (!diaryPath.isEmpty()) {
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
    if (!openWorkingCopyConnection(true))
        return false;
    QSqlQuery q(database());
    if (q.exec(QStringLiteral("INSERT INTO meta (KEY, VALUE) VALUES('dummy', 'dummy');")))
        q.exec(QStringLiteral("DELETE FROM meta WHERE KEY='dummy';"));
    q.finish();
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
