// Saving with backups, restoring from backups, and compaction.
#include "document/CVdShared.h"
#include "document/CopyThread.h"
#include "document/VDRDatabaseSchema.h"
#include "document/VDRDiaryCheck.h"
#include "document/VDRDocument.h"
#include "document/VDRDocumentsDb.h"
#include "document/VDRFileOps.h"
#include "document/VDRPrompt.h"
#include "document/VDRScopedConnection.h"

#include <QCoreApplication>
#include <QDebug>
#include <QDir>
#include <QEventLoop>
#include <QFileInfo>
#include <QRegularExpression>
#include <QSettings>
#include <QSqlDatabase>
#include <QSqlError>
#include <QSqlQuery>
#include <QThread>
#include <QTimer>

namespace {

QString nativePath(const QString& path)
{
    return QDir::toNativeSeparators(path);
}

// A backup that a rotation drops is first put aside under this suffix and deleted only once the
// new diary is in place, so that a failure can put everything back.
const char* const kDropSuffix = ".drop";

struct Rename
{
    QString from;
    QString to;
};

// Undoes renames in reverse order.
void undo(QList<Rename>& done)
{
    while (!done.isEmpty()) {
        const Rename r = done.takeLast();
        if (!QFile::rename(r.to, r.from))
            qWarning().noquote() << "could not undo rename" << r.to << "->" << r.from;
    }
}

} // namespace

QString VDRDocument::backupName(const QString& path, int generation)
{
    if (generation <= 1)
        return QStringLiteral("%1.bak").arg(path);
    if (generation <= 10)
        return QStringLiteral("%1.0%2.bak").arg(path).arg(generation - 1);
    return QStringLiteral("%1.%2.bak").arg(path).arg(generation - 1);
}

int VDRDocument::numberOfBackups()
{
    return QSettings().value(numberOfBackupsSettingsKey(), 5).toInt();
}

QString VDRDocument::formatFileSize(qint64 bytes)
{
    if (bytes < 1024000)
        return QStringLiteral("%1 KB").arg(bytes / 1024);
    return QStringLiteral("%1 MB").arg(bytes / 1024000);
}

void VDRDocument::cleanUpInterruptedSave(const QString& diaryPath)
{
    for (const QString& leftover : VDRFileOps::leftoverTemporaries(diaryPath)) {
        qWarning().noquote() << "removing the leftover of an interrupted save:" << leftover;
        QFile::remove(leftover);
    }
    // A backup put aside by an interrupted rotation goes back where it was, if that place is free.
    const QFileInfo fi(diaryPath);
    const QDir dir = fi.absoluteDir();
    for (const QString& name :
         dir.entryList({fi.fileName() + QStringLiteral("*.bak") + QLatin1String(kDropSuffix)}, QDir::Files)) {
        const QString dropped = dir.filePath(name);
        const QString original = dropped.left(dropped.size() - int(qstrlen(kDropSuffix)));
        if (QFileInfo::exists(original))
            QFile::remove(dropped);
        else
            QFile::rename(dropped, original);
    }
}

// Puts the complete new diary (already flushed under a temporary name) in place and turns the
// previous one into the newest backup. At every instant the diary's name holds either the complete
// old or the complete new diary; on failure everything is put back and false is returned.
bool VDRDocument::replaceDiaryKeepingBackups(const QString& temporary)
{
    const QString diary = m_filePath;
    const int n = numberOfBackups();
    if (n < 1 || !QFileInfo::exists(diary)) {
        if (VDRFileOps::replaceFile(temporary, diary))
            return true;
        VDRPrompt::critical(
            tr("Dateifehler"),
            VDRFileOps::withReason(tr("Kopieren der Datei\n%1\n fehlgeschlagen.").arg(nativePath(diary))));
        return false;
    }

    QList<Rename> done;
    QString dropped;
    auto putAside = [&](const QString& backup) {
        if (!QFileInfo::exists(backup))
            return true;
        dropped = backup + QLatin1String(kDropSuffix);
        QFile::remove(dropped);
        if (!VDRFileOps::rename(backup, dropped)) {
            VDRPrompt::critical(
                tr("Dateifehler"),
                VDRFileOps::withReason(
                    tr("Löschen der Backup-Datei\n%1\n fehlgeschlagen.").arg(nativePath(backup))));
            dropped.clear();
            return false;
        }
        done.append({backup, dropped});
        return true;
    };

    if (!m_saved) {
        // First save of this opening: every generation moves one up, the oldest is dropped.
        if (!putAside(backupName(diary, n)))
            return false;
        for (int k = n - 1; k >= 1; --k) {
            const QString from = backupName(diary, k);
            if (!QFileInfo::exists(from))
                continue;
            const QString to = backupName(diary, k + 1);
            if (!VDRFileOps::rename(from, to)) {
                VDRPrompt::critical(
                    tr("Dateifehler"),
                    VDRFileOps::withReason(
                        tr("Umbenennen der Backup-Datei\n%1\n fehlgeschlagen.").arg(nativePath(from))));
                undo(done);
                return false;
            }
            done.append({from, to});
        }
    } else if (!putAside(backupName(diary, 1))) {
        // Later saves of the same opening replace only the newest backup.
        return false;
    }

    // The old diary becomes the newest backup: a second name first, so the diary's own name is
    // never empty. File systems without hard links get a rename, and a moment without the name.
    const QString newest = backupName(diary, 1);
    bool linked = VDRFileOps::link(diary, newest);
    bool renamed = false;
    if (!linked) {
        renamed = VDRFileOps::rename(diary, newest);
        if (!renamed) {
            VDRPrompt::critical(
                tr("Dateifehler"),
                VDRFileOps::withReason(
                    tr("Umbenennen der Backup-Datei\n%1\n fehlgeschlagen.").arg(nativePath(diary))));
            undo(done);
            return false;
        }
    }
    bool replaced = false;
    if (!VDRFileOps::replaceFile(temporary, diary, &replaced)) {
        VDRPrompt::critical(
            tr("Dateifehler"),
            VDRFileOps::withReason(tr("Kopieren der Datei\n%1\n fehlgeschlagen.").arg(nativePath(diary))));
        if (replaced) {
            // The new diary is in place but its folder could not be flushed: the save failed and
            // says so, and every backup stays where the rotation put it.
            if (!dropped.isEmpty())
                VDRFileOps::removeInBackground(dropped, diary);
            return false;
        }
        if (renamed)
            QFile::rename(newest, diary);
        else
            QFile::remove(newest);
        undo(done);
        return false;
    }
    if (!dropped.isEmpty())
        VDRFileOps::removeInBackground(dropped, diary);
    return true;
}

// Copies the closed working copy to a flushed temporary file beside 'target' and checks the copy's
// integrity while it is flushed (its pages are still in memory): a damaged working copy is never
// saved over a diary. Returns the temporary file, empty after a failure (explained to the user).
QString VDRDocument::copyCheckedWorkingCopy(const QString& target, const QString& failureText)
{
    CopyThread copy(m_workingCopyPath, target);
    copy.setReplaceTarget(false);
    QString integrity;
    const bool copied = copy.copyAndWait([&](const QString& written) {
        const auto check = VDRScopedConnection::readOnlyLook(QStringLiteral("SAVECHECK"), written);
        integrity = check->isOpen() ? checkDbIntegrity(check->db(), true)
                                    : CVdShared::sqlErrorText(check->lastError());
    });
    if (!copied) {
        VDRPrompt::critical(tr("Dateifehler"), VDRFileOps::withReason(failureText));
        return QString();
    }
    if (integrity != QLatin1String("ok")) {
        QFile::remove(copy.temporaryFile());
        VDRPrompt::critical(tr("Dateifehler"),
                            tr("Die Working Copy Datei\n%1\nist beschädigt und wird nicht gespeichert:\n%2\n"
                               "Die Datei %3 bleibt unverändert.")
                                .arg(nativePath(m_workingCopyPath), integrity, nativePath(target)));
        return QString();
    }
    return copy.temporaryFile();
}

bool VDRDocument::saveAs(const QString& target)
{
    const QString targetWorkingCopy = workingCopyPathFor(target);
    const QString targetLockInfo = lockInfoPathFor(target);
    if (QFileInfo::exists(target) && !VDRFileOps::isWritable(target)) {
        VDRPrompt::critical(tr("Dateifehler"),
                            tr("Die Datei\n%1\nkonnte nicht gelöscht werden.").arg(nativePath(target)));
        return false;
    }
    // Never overwrite a diary that another running instance has open.
    if (VDRDiaryCheck::isHeld(targetWorkingCopy)) {
        VDRPrompt::warning(tr("Datenbank in Bearbeitung"),
                           tr("Die Datei\n%1\nist in Bearbeitung und kann nicht überschrieben werden.")
                               .arg(nativePath(target)));
        return false;
    }

    const QString copied = copyCheckedWorkingCopy(target, tr("Fehler beim Kopieren der Working Copy Datei."));
    if (copied.isEmpty())
        return false;
    if (!VDRFileOps::replaceFile(copied, target)) {
        QFile::remove(copied);
        VDRPrompt::critical(tr("Dateifehler"),
                            VDRFileOps::withReason(tr("Fehler beim Kopieren der Working Copy Datei.")));
        return false;
    }
    const QString documents = m_filePath.isEmpty() ? QString() : documentsDbPathFor(m_filePath);
    if (!documents.isEmpty() && QFileInfo::exists(documents)) {
        if (!VDRFileOps::copyDurably(documents, documentsDbPathFor(target))) {
            VDRPrompt::critical(tr("Dateifehler"),
                                VDRFileOps::withReason(tr("Fehler beim Kopieren der Dokumente Datenbank.")));
            return false;
        }
    } else {
        // The overwritten diary's documents do not belong to this one.
        VDRFileOps::removeDatabase(documentsDbPathFor(target));
    }
    if (!writeLockInfo(targetLockInfo)) {
        VDRPrompt::critical(tr("Dateifehler"),
                            VDRFileOps::withReason(tr("Fehler beim Kopieren der User Data Datei.")));
        return false;
    }
    VDRFileOps::removeDatabase(targetWorkingCopy);
    if (!VDRFileOps::move(m_workingCopyPath, targetWorkingCopy)) {
        QFile::remove(targetLockInfo);
        VDRPrompt::critical(tr("Dateifehler"),
                            VDRFileOps::withReason(tr("Fehler beim Kopieren der Working Copy Datei.")));
        return false;
    }
    VDRFileOps::removeDatabase(m_workingCopyPath);
    if (!m_lockInfoPath.isEmpty() && m_lockInfoPath != targetLockInfo)
        QFile::remove(m_lockInfoPath);
    if (!m_filePath.isEmpty())
        VDRDocumentsDb::resetChangesOnDocumentsDb(m_filePath);

    m_filePath = target;
    m_workingCopyPath = targetWorkingCopy;
    m_lockInfoPath = targetLockInfo;
    return true;
}

int VDRDocument::reopenAfterSave(int result)
{
    if (!reopenWorkingCopyAfterError()) {
        qWarning().noquote() << "working copy could not be reopened:" << m_workingCopyPath;
        return 2;
    }
    if (result == 0) {
        if (!m_lockInfoPath.isEmpty())
            writeLockInfo(m_lockInfoPath);
        m_new = false;
        m_saved = true;
        m_modified = false;
        setGlobalModified(false);
    }
    // Views dropped their models when the document closed for the save; they take the new ones.
    emit documentOpened(this);
    return result;
}

int VDRDocument::saveDocument(const QString& path)
{
    return saveDocumentImpl(path, false);
}

// Writes a compacted copy of the closed working copy beside 'target' in one pass over the data,
// instead of rebuilding the working copy in place and copying it afterwards.
QString VDRDocument::vacuumInto(const QString& target)
{
    const QString temporary = VDRFileOps::emptyTemporaryBeside(target);
    if (temporary.isEmpty())
        return QString();
    bool ok = false;
    QSqlError error;
    QString integrity;
    // The rebuild runs on a thread of its own (with its own connection) so that the window keeps
    // painting and shows how far it has come: the new file grows towards the size of the old one.
    const QString source = m_workingCopyPath;
    std::unique_ptr<QThread> worker(QThread::create([&] {
        VDRScopedConnection connection(QStringLiteral("COMPACT"), source, QString(), false);
        ok = connection.isOpen();
        if (!ok) {
            error = connection.lastError();
            return;
        }
        // A damaged copy is never compacted into a diary.
        integrity = checkDbIntegrity(connection.db());
        if (integrity != QLatin1String("ok")) {
            ok = false;
            return;
        }
        QSqlQuery q(connection.db());
        q.prepare(QStringLiteral("VACUUM INTO ?"));
        q.addBindValue(temporary);
        ok = q.exec();
        error = q.lastError();
    }));
    const qint64 sourceSize = std::max<qint64>(1, QFileInfo(source).size());
    QEventLoop loop;
    QTimer progress;
    QObject::connect(&progress, &QTimer::timeout, [&] {
        VDRPrompt::instance()->noticeProgress(
            int(std::min<qint64>(99, QFileInfo(temporary).size() * 100 / sourceSize)));
    });
    QObject::connect(worker.get(), &QThread::finished, &loop, &QEventLoop::quit);
    progress.start(200);
    worker->start();
    if (!worker->isFinished())
        loop.exec(QEventLoop::ExcludeUserInputEvents);
    worker->wait();
    progress.stop();
    VDRPrompt::instance()->noticeProgress(100);
    if (!integrity.isEmpty() && integrity != QLatin1String("ok")) {
        QFile::remove(temporary);
        VDRPrompt::critical(tr("Dateifehler"),
                            tr("Die Working Copy Datei\n%1\nist beschädigt und wird nicht gespeichert:\n%2\n"
                               "Die Datei %3 bleibt unverändert.")
                                .arg(nativePath(source), integrity, nativePath(target)));
        return QString();
    }
    if (ok && !VDRFileOps::flush(temporary)) {
        QFile::remove(temporary);
        VDRPrompt::critical(
            tr("Dateifehler"),
            VDRFileOps::withReason(tr("Kopieren der Datei\n%1\n fehlgeschlagen.").arg(nativePath(target))));
        return QString();
    }
    if (!ok) {
        QFile::remove(temporary);
        if (error.type() != QSqlError::NoError)
            VDRPrompt::warning(QStringLiteral("SQL Error"), CVdShared::sqlErrorText(error));
        VDRPrompt::warning(tr("Datenbank bereinigen"),
                           tr("Aufgrund eines SQL-Fehlers konnte die Datenbank nicht bereinigt werden."));
        return QString();
    }
    return temporary;
}

int VDRDocument::saveDocumentImpl(const QString& path, bool compacted)
{
    if (!m_valid)
        return 2;
    if (m_demo) {
        VDRPrompt::information(tr("Speichern"), tr("Das Musterprojekt kann nicht gespeichert werden."));
        return 1;
    }
    const QString target = path.isEmpty() ? m_filePath : QFileInfo(path).absoluteFilePath();
    const bool sameFile = path.isEmpty() || target == m_filePath;

    if (!compactIfManyDeletions())
        return 2;
    if (!diaryWritable(sameFile) || !currentFormatConfirmed())
        return 1;
    VDRBusyCursor busy;

    closeForSaving();
    if (sameFile) {
        if (!writeOverDiary(compacted))
            return reopenAfterSave(2);
    } else {
        if (!saveAs(target))
            return reopenAfterSave(2);
        m_saved = false; // the new file's next save keeps this state as its backup
    }
    finishSave();
    return reopenAfterSave(0);
}

// Many deletions fragment the file; saving offers to compact it on the way. False only when the
// compaction the user chose failed.
bool VDRDocument::compactIfManyDeletions()
{
    QSettings settings;
    if ((m_deletedImages <= 4 && m_deletedAudio <= 2) ||
        settings.value(dontShowCompactDbMsgSettingsKey(), false).toBool())
        return true;
    const QString first = m_deletedImages > 4 ? tr("Es wurden mehrere Bilder gelöscht.\n")
                                              : tr("Es wurden mehrere Diktate gelöscht.\n");
    const QString text =
        first +
        tr("\nDas Löschen von Daten führt zur Fragmentierung der Datenbank-Datei.\nDurch das Bereinigen "
           "der "
           "Datenbank werden die Tabellendaten zusammenhängend angeordnet und die "
           "Datenbankdatei-Struktur wird neu organisiert.\nDieser Vorgang kann zu einer z.T. erheblichen "
           "Reduzierung der Dateigröße führen.\n");
    bool dontShow = false;
    const int choice = VDRPrompt::instance()->choose(VDRPrompt::Question, tr("Speichern"), text,
                                                     {tr("Datenbank bereinigen"), tr("Abbrechen")}, 0, 1,
                                                     tr("Diese Meldung nicht mehr anzeigen"), &dontShow);
    if (dontShow)
        settings.setValue(dontShowCompactDbMsgSettingsKey(), true);
    return choice != 0 || compactWorkingCopy();
}

// A diary without write permission is saved only under another name.
bool VDRDocument::diaryWritable(bool sameFile)
{
    if (!sameFile || m_filePath.isEmpty() || !QFileInfo::exists(m_filePath) ||
        VDRFileOps::isWritable(m_filePath))
        return true;
    VDRPrompt::critical(
        tr("Speicher-Fehler"),
        tr("Sie können die Datei %1 nicht speichern, da sie keine Schreibrechte besitzen.\nWählen "
           "Sie im Menü 'Datei' den Menüpunkt 'Speichern unter',\num die Datei unter einem anderen "
           "Namen oder in einen anderen Ordner zu speichern.\n")
            .arg(nativePath(m_filePath)));
    return false;
}

// An upgraded older diary, once saved, no longer opens in earlier versions: the user agrees first.
bool VDRDocument::currentFormatConfirmed()
{
    if (!m_structureExtended || m_currentFormatAccepted)
        return true;
    const VDRPrompt::StandardButton answer = VDRPrompt::instance()->question(
        VDRPrompt::Warning, tr("Datei-Warnung"),
        tr("Das Dokument wurde mit einer früheren Programmversion erstellt.\nWenn Sie das Dokument jetzt "
           "speichern, wird es im aktuellen Dateiformat gespeichert.\nSie können das Dokument dann nicht "
           "mehr mit "
           "früheren Programmversionen bearbeiten.\n\nVorgang fortsetzen?"),
        VDRPrompt::Ok | VDRPrompt::Cancel, VDRPrompt::Ok, VDRPrompt::Cancel);
    return answer == VDRPrompt::Ok;
}

// The working copy is copied closed: the models give up their statements and every transaction
// ends first. reopenAfterSave() brings it all back.
void VDRDocument::closeForSaving()
{
    setMetaValue(QStringLiteral("fileversion"), VDRDatabaseSchema::currentVersion());
    emit documentClosed(this);
    m_valid = false;
    destroyModels();
    while (m_transactionDepth > 0)
        endTransaction();
    closeConnection();
}

// Saves the closed working copy over the diary, the previous diary becoming the newest backup.
// False after a failure, explained to the user.
bool VDRDocument::writeOverDiary(bool compacted)
{
    if (m_filePath.isEmpty()) {
        VDRPrompt::critical(tr("interner Fehler"), tr("Dateiname fehlt."));
        return false;
    }
    const QString temporary =
        compacted
            ? vacuumInto(m_filePath)
            : copyCheckedWorkingCopy(
                  m_filePath, tr("Kopieren der Datei\n%1\n fehlgeschlagen.").arg(nativePath(m_filePath)));
    if (temporary.isEmpty())
        return false;
    if (!replaceDiaryKeepingBackups(temporary)) {
        QFile::remove(temporary);
        return false;
    }
    // Edits go on from the compacted state. Should this copy fail, the old working copy stays:
    // it holds the same data, only larger.
    if (compacted) {
        QFile::remove(m_workingCopyPath + QStringLiteral("-journal"));
        if (!VDRFileOps::copyDurably(m_filePath, m_workingCopyPath))
            qWarning().noquote() << "working copy not replaced by the compacted diary:" << m_workingCopyPath;
    }
    return true;
}

// The diary is saved: its documents database follows, and the temporary files of the saved state go.
void VDRDocument::finishSave()
{
    VDRDocumentsDb::storeChangesOnDocumentsDb(m_filePath);
    QStringList stillInUse;
    for (const QString& file : qAsConst(m_filesToRemove)) {
        if (file == m_workingCopyPath)
            stillInUse << file;
        else
            QFile::remove(file);
    }
    m_filesToRemove = stillInUse;
    m_fileVersion = VDRDatabaseSchema::currentVersion();
    m_structureExtended = false;
}

QString VDRDocument::getBackupFile4Restore(const QString& path, int& count)
{
    count = 0;
    const int generations = std::max(8, QSettings().value(numberOfBackupsSettingsKey(), 8).toInt());
    QString found;
    for (int generation = 1; generation <= generations; ++generation) {
        const QString backup = backupName(path, generation);
        if (!QFileInfo(backup).isFile())
            continue;
        ++count;
        if (!found.isEmpty())
            continue;
        QString integrity;
        {
            VDRScopedConnection connection(QStringLiteral("BCKTEST"), backup,
                                           QStringLiteral("QSQLITE_OPEN_READONLY"));
            if (connection.isOpen())
                integrity = checkDbIntegrity(connection.db());
        }
        if (integrity == QLatin1String("ok"))
            found = backup;
    }
    return found;
}

bool VDRDocument::restoreBackupFile(const QString& path, const QString& backup, QString& newName,
                                    QString& error)
{
    const QFileInfo fi(path);
    const QString stem = fi.absolutePath() + QLatin1Char('/') + fi.completeBaseName();
    for (int n = 1;; ++n) {
        newName = (n < 10 ? QStringLiteral("%1ERROR.0%2.%3") : QStringLiteral("%1ERROR.%2.%3"))
                      .arg(stem)
                      .arg(n)
                      .arg(fi.suffix());
        if (!QFileInfo::exists(newName))
            break;
    }
    const QString temporary = VDRFileOps::writeDurableCopy(backup, path);
    if (temporary.isEmpty()) {
        error = tr("Fehler beim Kopieren der Backup-Datei %1.").arg(nativePath(backup));
        return false;
    }
    // As with saving: the damaged file gets its second name before the restored one takes its place.
    const bool linked = VDRFileOps::link(path, newName);
    if (!linked && !VDRFileOps::rename(path, newName)) {
        QFile::remove(temporary);
        error = tr("Die Datei %1 konnte nicht in %2 umbenannt werden.")
                    .arg(nativePath(path), nativePath(newName));
        return false;
    }
    if (!VDRFileOps::replaceFile(temporary, path)) {
        if (linked)
            QFile::remove(newName);
        else
            QFile::rename(newName, path);
        QFile::remove(temporary);
        error = tr("Fehler beim Kopieren der Backup-Datei %1.").arg(nativePath(backup));
        return false;
    }
    return true;
}

bool VDRDocument::removeObsoleteImages()
{
    QSet<qint64> used;
    QSqlQuery q(database());
    bool ok = q.exec(QStringLiteral("SELECT logo_image_id, logo2_image_id FROM vdr"));
    while (ok && q.next()) {
        used.insert(q.value(0).toLongLong());
        used.insert(q.value(1).toLongLong());
    }
    ok = ok && q.exec(QStringLiteral("SELECT photo_image_id FROM entry_photo"));
    while (ok && q.next())
        used.insert(q.value(0).toLongLong());
    QList<qint64> obsolete;
    ok = ok && q.exec(QStringLiteral("SELECT id FROM image"));
    while (ok && q.next()) {
        if (!used.contains(q.value(0).toLongLong()))
            obsolete << q.value(0).toLongLong();
    }
    if (ok) {
        beginTransaction();
        QSqlQuery del(database());
        del.prepare(QStringLiteral("DELETE FROM image WHERE id = :id"));
        for (qint64 id : qAsConst(obsolete)) {
            del.bindValue(QStringLiteral(":id"), id);
            if (!del.exec()) {
                q = del;
                ok = false;
                break;
            }
        }
        // Asked of the file, not of the meta model, which does not see rows written past it.
        bool marked = false;
        if (ok && q.exec(QStringLiteral("SELECT 1 FROM meta WHERE key = 'imageDeletion'")))
            marked = q.next();
        if (ok && !marked)
            ok = q.exec(QStringLiteral("INSERT INTO meta (key, value) VALUES ( 'imageDeletion', 'done' )"));
        endTransaction();
        if (ok && m_modelMeta)
            m_modelMeta->select();
    }
    if (!ok) {
        VDRPrompt::warning(QStringLiteral("SQL Error"), CVdShared::sqlErrorText(q.lastError()));
        VDRPrompt::warning(tr("Datenbank bereinigen"),
                           tr("Aufgrund eines SQL-Fehlers konnte die Datenbank nicht bereinigt werden."));
    }
    return ok;
}

bool VDRDocument::compactWorkingCopy()
{
    if (!removeObsoleteImages())
        return false;
    // VACUUM needs every statement finished: the models give theirs up and come back afterwards.
    emit documentClosed(this);
    destroyModels();
    while (m_transactionDepth > 0)
        endTransaction();
    bool ok;
    {
        QSqlQuery q(database());
        ok = q.exec(QStringLiteral("VACUUM"));
        if (!ok) {
            VDRPrompt::warning(QStringLiteral("SQL Error"), CVdShared::sqlErrorText(q.lastError()));
            VDRPrompt::warning(tr("Datenbank bereinigen"),
                               tr("Aufgrund eines SQL-Fehlers konnte die Datenbank nicht bereinigt werden."));
        }
    }
    initModels();
    emit documentOpened(this);
    if (ok)
        VDRDocumentsDb::compactDocumentDB(m_filePath);
    m_deletedImages = 0;
    m_deletedAudio = 0;
    return ok;
}

int VDRDocument::compactDB(bool showReport)
{
    if (!m_valid)
        return 2;
    if (m_demo) {
        VDRPrompt::information(tr("Datenbank bereinigen"),
                               tr("Eine Bereinigung der Datenbank ist für das Musterprojekt nicht möglich."));
        return 1;
    }
    VDRPrompt::instance()->beginNotice(
        tr("Datenbank bereinigen"),
        tr("Die Datenbank wird jetzt bereinigt.\nDieser Vorgang kann für größere Datenbanken mehrere Minuten "
           "dauern.\n\nUnterbrechen Sie diesen Vorgang nicht und schalten Sie den Computer nicht aus.\n"));
    m_compactSizeBefore = QFileInfo(m_workingCopyPath).size();
    if (!removeObsoleteImages()) {
        VDRPrompt::instance()->endNotice();
        return 2;
    }
    VDRDocumentsDb::compactDocumentDB(m_filePath);
    m_deletedImages = 0;
    m_deletedAudio = 0;
    const int shown = VDRPrompt::messagesShown();
    const int saved = saveDocumentImpl(QString(), true);
    VDRPrompt::instance()->endNotice();
    if (saved == 1)
        return 1; // a question was answered with "cancel": nothing failed
    if (saved != 0 && VDRPrompt::messagesShown() != shown)
        return 2; // already explained
    if (saved != 0) {
        VDRPrompt::warning(tr("Datenbank bereinigen"),
                           tr("Beim Speichern der bereinigten Datenbank ist ein Fehler aufgetreten!"));
        return 2;
    }
    m_compactSizeAfter = QFileInfo(m_filePath).size();
    if (showReport) {
        if (m_compactSizeAfter < m_compactSizeBefore)
            VDRPrompt::information(
                tr("Datenbank bereinigen"),
                tr("Die Datenbank wurde erfolgreich bereinigt.\nDie Dateigröße wurde von %1 auf %2 "
                   "reduziert.")
                    .arg(formatFileSize(m_compactSizeBefore), formatFileSize(m_compactSizeAfter)));
        else
            VDRPrompt::information(tr("Datenbank bereinigen"),
                                   tr("Die Datenbank wurde erfolgreich bereinigt.\n"));
    }
    return 0;
}
