#include "document/VDRFileOps.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QSaveFile>
#include <QTemporaryFile>

#include <cstdio>
#include <unistd.h>

namespace {
VDRFileOps::FailurePredicate g_failure;
}

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
    return QFile::rename(source, target);
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

bool VDRFileOps::copyDurably(const QString& source, const QString& target)
{
    if (shouldFail(Copy, target))
        return false;
    QFile in(source);
    if (!in.open(QIODevice::ReadOnly))
        return false;
    const QFileInfo targetInfo(target);
    QTemporaryFile out(targetInfo.absolutePath() + QLatin1Char('/') + targetInfo.fileName() + QStringLiteral(".XXXXXX.tmp"));
    if (!out.open())
        return false;
    QByteArray buffer;
    for (;;) {
        buffer = in.read(4 * 1024 * 1024);
        if (buffer.isEmpty())
            break;
        if (out.write(buffer) != buffer.size())
            return false;
    }
    if (in.error() != QFileDevice::NoError || !out.flush() || ::fsync(out.handle()) != 0)
        return false;
    out.setPermissions(in.permissions() | QFileDevice::WriteOwner);
    // rename(2) replaces the target atomically; QFile::rename would refuse an existing one.
    if (std::rename(QFile::encodeName(out.fileName()).constData(), QFile::encodeName(target).constData()) != 0)
        return false;
    out.setAutoRemove(false);
    return true;
}
