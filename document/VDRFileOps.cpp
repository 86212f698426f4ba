#include "document/VDRFileOps.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QRegularExpression>
#include <QSaveFile>
#include <QTemporaryFile>

#include <cstdio>
#include <fcntl.h>
#include <unistd.h>

namespace {
VDRFileOps::FailurePredicate g_failure;

const char* const kTemporaryInfix = ".save-";

// After a rename the directory entry must reach the disk too, or a power cut can undo it.
void syncDirectory(const QString& path)
{
    const int fd = ::open(QFile::encodeName(QFileInfo(path).absolutePath()).constData(), O_RDONLY | O_DIRECTORY);
    if (fd >= 0) {
        ::fsync(fd);
        ::close(fd);
    }
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
    if (shouldFail(Copy, target))
        return false;
    return QFile::copy(source, target);
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
    QFile in(source);
    if (!in.open(QIODevice::ReadOnly))
        return QString();
    const QFileInfo targetInfo(target);
    QTemporaryFile out(targetInfo.absolutePath() + QLatin1Char('/') + targetInfo.fileName() +
                       QLatin1String(kTemporaryInfix) + QStringLiteral("XXXXXX.tmp"));
    if (!out.open())
        return QString();
    QByteArray buffer;
    for (;;) {
        buffer = in.read(4 * 1024 * 1024);
        if (buffer.isEmpty())
            break;
        if (out.write(buffer) != buffer.size())
            return QString();
    }
    if (in.error() != QFileDevice::NoError || !out.flush() || ::fsync(out.handle()) != 0)
        return QString();
    out.setPermissions(in.permissions() | QFileDevice::WriteOwner | QFileDevice::ReadOwner);
    out.setAutoRemove(false);
    return out.fileName();
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
