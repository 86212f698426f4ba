#include "document/VDRDiaryCheck.h"

#include "document/VDRDatabaseSchema.h"
#include "document/VDRDocument.h"
#include "document/VDRFileOps.h"
#include "document/VDRPrompt.h"
#include "document/VDRScopedConnection.h"

#include <QDir>
#include <QFileInfo>
#include <QRegularExpression>
#include <QSqlDatabase>
#include <QSqlError>
#include <QSqlQuery>

#include <cerrno>
#include <unistd.h>

namespace {

const char* const kCheckConnection = "VDRCHECK";

struct ReadOnlyLook
{
    bool opened = false;
    bool busy = false;
    QString integrity;
    QString version;
};

// A working copy is looked at with SQLite's locking, to see a holder; a diary without it, so that
// not even a WAL file's companions appear beside it.
ReadOnlyLook look(const QString& path, bool integrity)
{
    ReadOnlyLook result;
    const auto connection = integrity
                                ? VDRScopedConnection::readOnlyLook(QLatin1String(kCheckConnection), path)
                                : std::make_unique<VDRScopedConnection>(
                                      QLatin1String(kCheckConnection), path,
                                      QStringLiteral("QSQLITE_OPEN_READONLY;QSQLITE_BUSY_TIMEOUT=0"), false);
    result.opened = connection->isOpen();
    if (!result.opened)
        return result;
    QSqlQuery q(connection->db());
    if (!q.exec(QStringLiteral("SELECT count(*) FROM sqlite_master"))) {
        // SQLITE_BUSY or SQLITE_LOCKED, extended codes included, as the opening's probe reads them.
        const int code = VDRScopedConnection::sqliteCode(q.lastError());
        result.busy = code == 5 || code == 6;
        result.integrity = q.lastError().databaseText();
        return result;
    }
    q.finish();
    if (q.exec(QStringLiteral("SELECT value FROM meta WHERE key = 'fileversion'")) && q.next())
        result.version = q.value(0).toString();
    q.finish();
    if (integrity)
        result.integrity = VDRDocument::checkDbIntegrity(connection->db());
    return result;
}

// Answers a trial opening's questions with their cancelling choice and keeps what it was told.
class RecordingPrompt : public VDRPrompt
{
public:
    QStringList problems;

    void message(Kind kind, const QString& title, const QString& text) override
    {
        if (kind != Information)
            problems << title + QStringLiteral(": ") + text;
    }
    StandardButton question(Kind, const QString&, const QString&, StandardButtons, StandardButton,
                            StandardButton escape) override
    {
        return escape;
    }
    int choose(Kind, const QString&, const QString&, const QStringList&, int, int escapeIndex, const QString&,
               bool*) override
    {
        return escapeIndex;
    }
    QString openFileName(const QString&, const QString&, const QString&) override { return QString(); }
    QString saveFileName(const QString&, const QString&, const QString&) override { return QString(); }
    QString existingDirectory(const QString&, const QString&) override { return QString(); }
    void beginNotice(const QString&, const QString&) override {}
    void endNotice() override {}
    void setBusy(bool) override {}
};

// Opens the diary as the application would, on private copies, and says why that failed.
QString trialOpening(const QString& diary)
{
    VDRPrompt* previous = VDRPrompt::instance();
    RecordingPrompt recorder;
    VDRPrompt::setInstance(&recorder);
    bool opened;
    {
        VDRDocument doc;
        doc.setInspecting(true);
        bool showError = true;
        opened = doc.openDocument(diary, showError);
        if (opened)
            doc.closeDocument();
    }
    VDRPrompt::setInstance(previous);
    if (opened)
        return QString();
    return recorder.problems.isEmpty()
               ? QStringLiteral("Fehler: Beim Öffnen des gewählten Dokuments ist ein Fehler aufgetreten!")
               : recorder.problems.join(QLatin1Char('\n'));
}

// Opening needs to create the working copy beside the diary (or, resuming, to write to it).
QString workingCopyProblem(const QString& diary, bool resumable, bool demo)
{
    const QString workingCopy = VDRDocument::workingCopyPathFor(diary);
    const QString target = resumable ? workingCopy : QFileInfo(diary).absolutePath();
    if (::access(QFile::encodeName(target).constData(), W_OK) == 0 || demo)
        return QString();
    const QString reason = VDRFileOps::reasonText(errno);
    return (resumable ? QObject::tr("Die Working Copy Datei\n%1\nkann nicht geöffnet werden:\n%2")
                            .arg(QDir::toNativeSeparators(workingCopy), reason)
                      : QObject::tr("Die Working Copy Datei konnte nicht erstellt werden.") +
                            QLatin1Char('\n') + reason);
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
    if (r.status != CanBeOpened)
        return r;

    // What only an opening finds out: tables and columns it needs, rows it writes, the upgrades.
    bool demo = false;
    {
        const auto connection = VDRScopedConnection::readOnlyLook(QLatin1String(kCheckConnection), diary);
        QSqlQuery q(connection->db());
        demo = q.exec(QStringLiteral("SELECT value FROM meta WHERE key = 'isdp'")) && q.next() &&
               q.value(0).toInt() == 42;
    }
    const bool resumable = r.workingCopyExists && r.lockInfo.size() >= 2 &&
                           r.lockInfo[0] == VDRDocument::currentUserName() &&
                           r.lockInfo[1] == VDRDocument::currentComputerName();
    r.reason = workingCopyProblem(diary, resumable, demo);
    if (r.reason.isEmpty())
        r.reason = trialOpening(diary);
    if (!r.reason.isEmpty())
        r.status = Refused;
    return r;
}
