#include "document/VDRDocument.h"

#include "document/CVdShared.h"
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDatabaseSchema.h"
#include "document/VDRDocumentsDb.h"
#include "document/VDRFileOps.h"
#include "document/VDRPrompt.h"

#include <QCoreApplication>
#include <QDate>
#include <QDebug>
#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QHostInfo>
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

QString nativePath(const QString& path)
{
    return QDir::toNativeSeparators(path);
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
