#include "document/VDRDiaryCheck.h"

#include "document/VDRDatabaseSchema.h"
#include "document/VDRDocument.h"
#include "document/VDRScopedConnection.h"

#include <QDir>
#include <QFileInfo>
#include <QRegularExpression>
#include <QSqlDatabase>
#include <QSqlError>
#include <QSqlQuery>

namespace {

const char* const kCheckConnection = "VDRCHECK";

struct ReadOnlyLook
{
    bool opened = false;
    bool busy = false;
    QString integrity;
    QString version;
};

ReadOnlyLook look(const QString& path, bool integrity)
{
    ReadOnlyLook result;
    VDRScopedConnection connection(QLatin1String(kCheckConnection), path,
                                   QStringLiteral("QSQLITE_OPEN_READONLY;QSQLITE_BUSY_TIMEOUT=0"), false);
    result.opened = connection.isOpen();
    if (!result.opened)
        return result;
    QSqlQuery q(connection.db());
    if (!q.exec(QStringLiteral("SELECT count(*) FROM sqlite_master"))) {
        const QString code = q.lastError().nativeErrorCode();
        result.busy = code == QLatin1String("5") || code == QLatin1String("6");
        result.integrity = q.lastError().databaseText();
        return result;
    }
    q.finish();
    if (q.exec(QStringLiteral("SELECT value FROM meta WHERE key = 'fileversion'")) && q.next())
        result.version = q.value(0).toString();
    q.finish();
    if (integrity)
        result.integrity = VDRDocument::checkDbIntegrity(connection.db());
    return result;
}

} // namespace

QStringList VDRDiaryCheck::existingBackups(const QString& path)
{
    const QFileInfo fi(path);
    const QDir dir = fi.dir();
    const QRegularExpression pattern(
        QStringLiteral("^%1(\\.(\\d+))?\\.bak$").arg(QRegularExpression::escape(fi.fileName())));
    QList<QPair<int, QString>> found;
    for (const QString& name : dir.entryList(QDir::Files)) {
        const QRegularExpressionMatch m = pattern.match(name);
        if (m.hasMatch())
            found.append({m.captured(2).isEmpty() ? 0 : m.captured(2).toInt(), dir.filePath(name)});
    }
    std::sort(found.begin(), found.end());
    QStringList result;
    for (const auto& f : found)
        result << f.second;
    return result;
}

bool VDRDiaryCheck::isHeld(const QString& workingCopy)
{
    return QFileInfo::exists(workingCopy) && look(workingCopy, false).busy;
}

VDRDiaryCheck::Result VDRDiaryCheck::inspect(const QString& path)
{
    Result r;
    const QFileInfo fi(path);
    if (!fi.exists() || !fi.isFile()) {
        r.status = Missing;
        return r;
    }
    const QString diary = fi.absoluteFilePath();
    r.backups = existingBackups(diary);

    const QString workingCopy = VDRDocument::workingCopyPathFor(diary);
    r.workingCopyExists = QFileInfo::exists(workingCopy);
    if (r.workingCopyExists) {
        r.workingCopyHeld = isHeld(workingCopy);
        r.lockInfo = VDRDocument::readLockInfo(VDRDocument::lockInfoPathFor(diary));
    }

    QFile f(diary);
    const bool header = f.open(QIODevice::ReadOnly) && f.read(16) == QByteArray("SQLite format 3\0", 16);
    f.close();
    if (header) {
        const ReadOnlyLook l = look(diary, true);
        r.integrity = l.integrity;
        r.version = l.version;
    } else {
        r.integrity = QStringLiteral("not a database");
    }

    if (r.workingCopyHeld)
        r.status = Held;
    else if (r.integrity != QLatin1String("ok"))
        r.status = Damaged;
    else if (VDRDatabaseSchema::isNewerThanCurrent(r.version))
        r.status = Newer;
    else
        r.status = CanBeOpened;
    return r;
}
