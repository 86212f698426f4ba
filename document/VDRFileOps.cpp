#include "document/VDRFileOps.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QRegularExpression>
#include <QSaveFile>
#include <QTemporaryFile>
#include <QThreadPool>

#include <cstdio>
#include <fcntl.h>
#include <unistd.h>

namespace {
VDRFileOps::FailurePredicate g_failure;

const char* const kTemporaryInfix = ".save-";

// After a rename the directory entry must reach the disk too, or a power cut can undo it.
void syncDirectory(const QString& path)
{
    const int fd =
        ::open(QFile::encodeName(QFileInfo(path).absolutePath()).constData(), O_RDONLY | O_DIRECTORY);
    if (fd >= 0) {
        ::fsync(fd);
        ::close(fd);
    }
}
// The kernel copies without the data passing through this process where it can (copy_file_range);
// elsewhere, or when that fails at the start, a plain read and write loop does it.
bool copyContents(QFile& in, QFile& out)
{
    const qint64 size = in.size();
    qint64 done = 0;
    while (done < size) {
        const ssize_t n =
            ::copy_file_range(in.handle(), nullptr, out.handle(), nullptr, size_t(size - done), 0);
        if (n <= 0)
            break;
        done += n;
    }
    if (done == size)
        return true;
    if (!in.seek(done) || !out.seek(done))
        return false;
    QByteArray buffer;
    for (;;) {
        buffer = in.read(4 * 1024 * 1024);
        if (buffer.isEmpty())
            break;
        if (out.write(buffer) != buffer.size())
            return false;
    }
    return in.error() == QFileDevice::NoError && out.flush() && out.size() == size;
}

} // namespace

void VDRFileOps::setFailurePredicate(FailurePredicate predicate)
{
    g_failure = std::move(predicate);
}

bool VDRFileOps::shouldFail(Op op, const QString& path)
{
    return g_failure && g_failure(op, QFileInfo(path).absoluteFilePath());
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
    if (!QFile::rename(source, target))
        return false;
    syncDirectory(target);
    return true;
}

bool VDRFileOps::remove(const QString& path)
{
    if (shouldFail(Remove, path))
        return false;
    return QFile::remove(path);
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
    if (::link(QFile::encodeName(existing).constData(), QFile::encodeName(newName).constData()) != 0)
        return false;
    syncDirectory(newName);
    return true;
}

bool VDRFileOps::move(const QString& source, const QString& target)
{
    if (shouldFail(Rename, target))
        return false;
    if (QFile::rename(source, target)) {
        syncDirectory(target);
        return true;
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
    if (!file.open(QIODevice::WriteOnly))
        return false;
    if (file.write(bytes) != bytes.size()) {
        file.cancelWriting();
        return false;
    }
    return file.commit();
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

QString VDRFileOps::copyToTemporary(const QString& source, const QString& target, bool flush)
{
    QFile in(source);
    if (!in.open(QIODevice::ReadOnly))
        return QString();
    const QFileInfo targetInfo(target);
    QTemporaryFile out(targetInfo.absolutePath() + QLatin1Char('/') + targetInfo.fileName() +
                       QLatin1String(kTemporaryInfix) + QStringLiteral("XXXXXX.tmp"));
    if (!out.open())
        return QString();
    if (!copyContents(in, out) || (flush && ::fsync(out.handle()) != 0))
        return QString();
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
    if (!file.open())
        return QString();
    file.setAutoRemove(false);
    return file.fileName();
}

bool VDRFileOps::flush(const QString& path)
{
    QFile file(path);
    return file.open(QIODevice::ReadWrite) && ::fsync(file.handle()) == 0;
}

bool VDRFileOps::replaceFile(const QString& temporary, const QString& target)
{
    if (shouldFail(Rename, target))
        return false;
    // rename(2) replaces the target atomically; QFile::rename would refuse an existing one.
    if (std::rename(QFile::encodeName(temporary).constData(), QFile::encodeName(target).constData()) != 0)
        return false;
    syncDirectory(target);
    return true;
}

bool VDRFileOps::copyDurably(const QString& source, const QString& target)
{
    const QString temporary = writeDurableCopy(source, target);
    if (temporary.isEmpty())
        return false;
    if (!replaceFile(temporary, target)) {
        QFile::remove(temporary);
        return false;
    }
    return true;
}

void VDRFileOps::removeInBackground(const QString& path, const QString& neighbour)
{
    const QFileInfo fi(neighbour);
    QTemporaryFile name(fi.absolutePath() + QLatin1Char('/') + fi.fileName() +
                        QLatin1String(kTemporaryInfix) + QStringLiteral("XXXXXX.tmp"));
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
    QThreadPool::globalInstance()->start([doomed] { QFile::remove(doomed); });
}

QStringList VDRFileOps::leftoverTemporaries(const QString& target)
{
    const QFileInfo fi(target);
    const QRegularExpression pattern(QStringLiteral("^%1%2[A-Za-z0-9]{6}\\.tmp$")
                                         .arg(QRegularExpression::escape(fi.fileName()),
                                              QRegularExpression::escape(QLatin1String(kTemporaryInfix))));
    QStringList result;
    const QDir dir = fi.absoluteDir();
    for (const QString& name : dir.entryList(QDir::Files | QDir::Hidden)) {
        if (pattern.match(name).hasMatch())
            result << dir.filePath(name);
    }
    return result;
}
