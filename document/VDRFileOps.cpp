#include "document/VDRFileOps.h"

#include <QCoreApplication>
#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QRegularExpression>
#include <QSaveFile>
#include <QTemporaryFile>
#include <QThreadPool>

#include <atomic>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <fcntl.h>
#include <unistd.h>

namespace {
VDRFileOps::FailurePredicate g_failure;
int g_failureErrno = EIO;
// Copies run on a worker thread while the caller waits, so the reason is kept process-wide.
std::atomic<int> g_lastError{0};

const char* const kTemporaryInfix = ".save-";
// Its own name, so that a removal still running is never taken for a save's temporary file.
const char* const kRemovalInfix = ".removing-";

QThreadPool& removalPool()
{
    static QThreadPool pool;
    return pool;
}

// The kernel copies without the data passing through this process where it can (copy_file_range);
// elsewhere, or when that fails at the start, a plain read and write loop does it. Returns 0 or
// the errno of the failure.
int copyContents(int in, int out, qint64 size)
{
    qint64 done = 0;
    while (done < size) {
        const ssize_t n = ::copy_file_range(in, nullptr, out, nullptr, size_t(size - done), 0);
        if (n < 0 && errno != ENOSYS && errno != EXDEV && errno != EINVAL && errno != EOPNOTSUPP)
            return errno;
        if (n <= 0)
            break;
        done += n;
    }
    if (done == size)
        return 0;
    if (::lseek(in, done, SEEK_SET) < 0 || ::lseek(out, done, SEEK_SET) < 0)
        return errno;
    std::vector<char> buffer(4 * 1024 * 1024);
    for (;;) {
        const ssize_t n = ::read(in, buffer.data(), buffer.size());
        if (n < 0) {
            if (errno == EINTR)
                continue;
            return errno;
        }
        if (n == 0)
            break;
        for (ssize_t written = 0; written < n;) {
            const ssize_t w = ::write(out, buffer.data() + written, size_t(n - written));
            if (w < 0) {
                if (errno == EINTR)
                    continue;
                return errno;
            }
            written += w;
        }
        done += n;
    }
    return done == size ? 0 : EIO;
}

} // namespace

void VDRFileOps::setFailurePredicate(FailurePredicate predicate)
{
    g_failure = std::move(predicate);
    g_failureErrno = EIO;
}

void VDRFileOps::setFailureErrno(int errorNumber)
{
    g_failureErrno = errorNumber;
}

bool VDRFileOps::shouldFail(Op op, const QString& path)
{
    if (!g_failure || !g_failure(op, QFileInfo(path).absoluteFilePath()))
        return false;
    setLastError(g_failureErrno);
    return true;
}

void VDRFileOps::setLastError(int errorNumber)
{
    g_lastError = errorNumber;
}

QString VDRFileOps::reasonText(int errorNumber)
{
    // The C library speaks the process's locale, which need not be the interface's language.
    switch (errorNumber) {
    case 0:
        return QString();
    case ENOSPC:
        return QCoreApplication::translate("VDRFileOps",
                                           "Auf dem Gerät ist kein Speicherplatz mehr verfügbar.");
    case EDQUOT:
        return QCoreApplication::translate("VDRFileOps",
                                           "Der zugewiesene Plattenplatz (Quota) ist überschritten.");
    case EACCES:
    case EPERM:
        return QCoreApplication::translate("VDRFileOps", "Keine Berechtigung.");
    case EROFS:
        return QCoreApplication::translate("VDRFileOps", "Das Dateisystem ist nur lesbar.");
    case EIO:
        return QCoreApplication::translate("VDRFileOps", "Eingabe-/Ausgabefehler.");
    case ENOENT:
        return QCoreApplication::translate("VDRFileOps", "Datei oder Verzeichnis nicht gefunden.");
    case EFBIG:
        return QCoreApplication::translate("VDRFileOps", "Die Datei ist zu groß.");
    case ENAMETOOLONG:
        return QCoreApplication::translate("VDRFileOps", "Der Dateiname ist zu lang.");
    case EBUSY:
        return QCoreApplication::translate("VDRFileOps", "Das Gerät oder die Ressource ist belegt.");
    default:
        return QString::fromLocal8Bit(std::strerror(errorNumber));
    }
}

QString VDRFileOps::lastErrorText()
{
    return reasonText(g_lastError);
}

QString VDRFileOps::withReason(const QString& text)
{
    const QString reason = lastErrorText();
    if (reason.isEmpty())
        return text;
    return text.endsWith(QLatin1Char('\n')) ? text + reason : text + QLatin1Char('\n') + reason;
}

// After a rename the directory entry must reach the disk too, or a power cut can undo it.
bool VDRFileOps::syncFolderOf(const QString& path)
{
    const QString folder = QFileInfo(path).absolutePath();
    if (shouldFail(SyncFolder, folder))
        return false;
    const int fd = ::open(QFile::encodeName(folder).constData(), O_RDONLY | O_DIRECTORY);
    if (fd < 0) {
        setLastError(errno);
        return false;
    }
    const bool ok = ::fsync(fd) == 0;
    if (!ok)
        setLastError(errno);
    ::close(fd);
    return ok;
}

bool VDRFileOps::copy(const QString& source, const QString& target)
{
    if (shouldFail(Copy, target) || QFileInfo::exists(target))
        return false;
    const QString temporary = copyToTemporary(source, target, false);
    if (temporary.isEmpty())
        return false;
    if (!QFile::rename(temporary, target)) {
        QFile::remove(temporary);
        return false;
    }
    return true;
}

bool VDRFileOps::rename(const QString& source, const QString& target)
{
    if (shouldFail(Rename, target))
        return false;
    // Like QFile::rename, never over an existing file.
    if (QFileInfo::exists(target)) {
        setLastError(EEXIST);
        return false;
    }
    if (std::rename(QFile::encodeName(source).constData(), QFile::encodeName(target).constData()) != 0) {
        const int error = errno;
        if (error != EXDEV || !QFile::rename(source, target)) {
            setLastError(error);
            return false;
        }
    }
    if (syncFolderOf(target))
        return true;
    // Not durable is not done: the caller undoes what it did before and reports the failure.
    std::rename(QFile::encodeName(target).constData(), QFile::encodeName(source).constData());
    return false;
}

bool VDRFileOps::remove(const QString& path)
{
    if (shouldFail(Remove, path))
        return false;
    if (::unlink(QFile::encodeName(path).constData()) == 0)
        return true;
    setLastError(errno);
    return false;
}

bool VDRFileOps::removeDatabase(const QString& path)
{
    if (QFileInfo::exists(path) && !remove(path))
        return false;
    for (const char* companion : {"-journal", "-wal", "-shm"})
        QFile::remove(path + QLatin1String(companion));
    return true;
}

bool VDRFileOps::link(const QString& existing, const QString& newName)
{
    if (shouldFail(Link, newName))
        return false;
    if (::link(QFile::encodeName(existing).constData(), QFile::encodeName(newName).constData()) != 0) {
        setLastError(errno);
        return false;
    }
    if (syncFolderOf(newName))
        return true;
    QFile::remove(newName);
    return false;
}

bool VDRFileOps::move(const QString& source, const QString& target)
{
    if (shouldFail(Rename, target))
        return false;
    if (QFile::rename(source, target)) {
        if (syncFolderOf(target))
            return true;
        QFile::rename(target, source);
        return false;
    }
    if (!copyDurably(source, target))
        return false;
    QFile::remove(source);
    return true;
}

bool VDRFileOps::writeFileAtomically(const QString& path, const QByteArray& bytes)
{
    if (shouldFail(Write, path))
        return false;
    QSaveFile file(path);
    if (!file.open(QIODevice::WriteOnly)) {
        setLastError(errno);
        return false;
    }
    if (file.write(bytes) != bytes.size()) {
        setLastError(errno);
        file.cancelWriting();
        return false;
    }
    if (!file.commit()) {
        setLastError(errno);
        return false;
    }
    return true;
}

bool VDRFileOps::isWritable(const QString& path)
{
    if (shouldFail(CheckWritable, path))
        return false;
    return QFileInfo(path).isWritable();
}

QString VDRFileOps::writeDurableCopy(const QString& source, const QString& target)
{
    if (shouldFail(Copy, target))
        return QString();
    return copyToTemporary(source, target, true);
}

QString VDRFileOps::writeCopy(const QString& source, const QString& target)
{
    if (shouldFail(Copy, target))
        return QString();
    return copyToTemporary(source, target, false);
}

QString VDRFileOps::copyToTemporary(const QString& source, const QString& target, bool flush)
{
    QFile in(source);
    if (!in.open(QIODevice::ReadOnly)) {
        setLastError(errno);
        return QString();
    }
    const QFileInfo targetInfo(target);
    QTemporaryFile out(targetInfo.absolutePath() + QLatin1Char('/') + targetInfo.fileName() +
                       QLatin1String(kTemporaryInfix) + QStringLiteral("XXXXXX.tmp"));
    if (!out.open()) {
        setLastError(errno);
        return QString();
    }
    int error = copyContents(in.handle(), out.handle(), in.size());
    if (!error && flush && ::fsync(out.handle()) != 0)
        error = errno;
    if (error) {
        setLastError(error);
        return QString();
    }
    out.setPermissions(in.permissions() | QFileDevice::WriteOwner | QFileDevice::ReadOwner);
    out.setAutoRemove(false);
    return out.fileName();
}

QString VDRFileOps::emptyTemporaryBeside(const QString& target)
{
    if (shouldFail(Copy, target))
        return QString();
    const QFileInfo fi(target);
    QTemporaryFile file(fi.absolutePath() + QLatin1Char('/') + fi.fileName() +
                        QLatin1String(kTemporaryInfix) + QStringLiteral("XXXXXX.tmp"));
    if (!file.open()) {
        setLastError(errno);
        return QString();
    }
    file.setAutoRemove(false);
    return file.fileName();
}

bool VDRFileOps::flush(const QString& path)
{
    QFile file(path);
    if (file.open(QIODevice::ReadWrite) && ::fsync(file.handle()) == 0)
        return true;
    setLastError(errno);
    return false;
}

QFileDevice::Permissions VDRFileOps::newFilePermissions()
{
    // Read, not set: umask(2) would change it for every thread while it is asked.
    int mask = 022;
    QFile status(QStringLiteral("/proc/self/status"));
    if (status.open(QIODevice::ReadOnly)) {
        for (const QByteArray& line : status.readAll().split('\n')) {
            if (line.startsWith("Umask:")) {
                bool ok = false;
                const int value = line.mid(6).trimmed().toInt(&ok, 8);
                if (ok)
                    mask = value;
                break;
            }
        }
    }
    QFileDevice::Permissions permissions;
    const std::pair<int, QFileDevice::Permission> bits[] = {
        {0400, QFileDevice::ReadOwner},  {0200, QFileDevice::WriteOwner}, {0040, QFileDevice::ReadGroup},
        {0020, QFileDevice::WriteGroup}, {0004, QFileDevice::ReadOther},  {0002, QFileDevice::WriteOther}};
    for (const auto& bit : bits)
        if (!(mask & bit.first))
            permissions |= bit.second;
    // QFile reports the owner's bits also as the user's.
    if (permissions & QFileDevice::ReadOwner)
        permissions |= QFileDevice::ReadUser;
    if (permissions & QFileDevice::WriteOwner)
        permissions |= QFileDevice::WriteUser;
    return permissions;
}

bool VDRFileOps::replaceFile(const QString& temporary, const QString& target, bool* renamed)
{
    if (renamed)
        *renamed = false;
    if (shouldFail(Rename, target))
        return false;
    // The new file keeps what the user set on the old one.
    if (QFileInfo::exists(target))
        QFile::setPermissions(temporary, QFile::permissions(target));
    // rename(2) replaces the target atomically; QFile::rename would refuse an existing one.
    if (std::rename(QFile::encodeName(temporary).constData(), QFile::encodeName(target).constData()) != 0) {
        setLastError(errno);
        return false;
    }
    if (renamed)
        *renamed = true;
    return syncFolderOf(target);
}

bool VDRFileOps::copyDurably(const QString& source, const QString& target)
{
    const QString temporary = writeDurableCopy(source, target);
    if (temporary.isEmpty())
        return false;
    bool renamed = false;
    if (!replaceFile(temporary, target, &renamed)) {
        if (!renamed)
            QFile::remove(temporary);
        return false;
    }
    return true;
}

void VDRFileOps::removeInBackground(const QString& path, const QString& neighbour)
{
    const QFileInfo fi(neighbour);
    QTemporaryFile name(fi.absolutePath() + QLatin1Char('/') + fi.fileName() + QLatin1String(kRemovalInfix) +
                        QStringLiteral("XXXXXX.tmp"));
    if (!name.open()) {
        QFile::remove(path);
        return;
    }
    name.close();
    const QString doomed = name.fileName();
    name.setAutoRemove(false);
    if (std::rename(QFile::encodeName(path).constData(), QFile::encodeName(doomed).constData()) != 0) {
        QFile::remove(doomed);
        QFile::remove(path);
        return;
    }
    removalPool().start([doomed] { QFile::remove(doomed); });
}

void VDRFileOps::waitForBackgroundRemovals()
{
    removalPool().waitForDone();
}

QStringList VDRFileOps::leftoverTemporaries(const QString& target)
{
    const QFileInfo fi(target);
    const QRegularExpression pattern(QStringLiteral("^%1(%2|%3)[A-Za-z0-9]{6}\\.tmp$")
                                         .arg(QRegularExpression::escape(fi.fileName()),
                                              QRegularExpression::escape(QLatin1String(kTemporaryInfix)),
                                              QRegularExpression::escape(QLatin1String(kRemovalInfix))));
    QStringList result;
    const QDir dir = fi.absoluteDir();
    for (const QString& name : dir.entryList(QDir::Files | QDir::Hidden)) {
        if (pattern.match(name).hasMatch())
            result << dir.filePath(name);
    }
    return result;
}
