// The exchange file: its format, finding it in a cloud folder, opening and counting its reports.
#include "sync/VDRExchangeValues.h"
#include "sync/VDRReportSynchronisation.h"

#include "document/VDRDocument.h"
#include "document/VDRPrompt.h"
#include "document/VDRScopedConnection.h"

#include <QDir>
#include <QFileInfo>
#include <QRegularExpression>
#include <QSqlError>
#include <QSqlQuery>

using namespace VDRExchangeValues;

// ---- The format ----

bool VDRReportSynchronisation::checkFileVersion(QSqlDatabase database, const QString& path)
{
    const QString title = tr("Synchronisationsfehler");
    QSqlQuery q(database);
    QString value;
    if (q.exec(QStringLiteral("SELECT value FROM meta WHERE key = 'fileversion'")) && q.next())
        value = q.value(0).toString().trimmed();
    const QStringList parts = value.split(QLatin1Char('.'));
    bool majorOk = false;
    bool minorOk = false;
    const int major = parts.value(0).toInt(&majorOk);
    const int minor = parts.value(1).toInt(&minorOk);
    if (value.isEmpty() || parts.size() != 2 || !majorOk || !minorOk || major < 0 || minor < 0) {
        message(VDRPrompt::Warning, title,
                tr("Die Datei \n%1\nkann nicht importiert werden, da sie keine gültige Austauschdatei ist.")
                    .arg(path));
        return false;
    }
    const QStringList supported = supportedFileVersion().split(QLatin1Char('.'));
    const int supportedMajor = supported.value(0).toInt();
    const int supportedMinor = supported.value(1).toInt();
    if (major > supportedMajor || (major == supportedMajor && minor > supportedMinor)) {
        message(VDRPrompt::Warning, title,
                tr("Das Format der Austauschdatei \n%1\nist mit dieser Version der Varduna Software nicht "
                   "kompatibel.\nFür den Import ist ein Update der Varduna Software erforderlich.")
                    .arg(path));
        return false;
    }
    if (major < supportedMajor || minor < supportedMinor) {
        message(VDRPrompt::Warning, title,
                tr("Das Format der Austauschdatei \n%1\nist mit dieser Version der Varduna Software nicht "
                   "kompatibel.\nDie Austauschdatei wurde mit einer älteren Version der Varduna Software "
                   "erstellt.")
                    .arg(path));
        return false;
    }
    return true;
}

bool VDRReportSynchronisation::checkDatabaseName(QSqlDatabase database, const QString& path,
                                                 const QString& diaryFileName)
{
    const QString title = tr("Synchronisationsfehler");
    QSqlQuery q(database);
    QString value;
    if (q.exec(QStringLiteral("SELECT value FROM meta WHERE key = 'database'")) && q.next())
        value = q.value(0).toString();
    if (value.isEmpty()) {
        message(VDRPrompt::Warning, title,
                tr("Die Datei %1 kann nicht importiert werden, da sie keine gültige Austauschdatei ist.")
                    .arg(path));
        return false;
    }
    if (value != diaryFileName) {
        message(
            VDRPrompt::Warning, title,
            tr("Die Datei %1 kann nur in das Varduna %2 importiert werden.\n\nBitte beachten Sie, dass "
               "Varduna-Dateien bei Verwendung der Synchronisation aus diesem Grund nicht umbenannt werden "
               "dürfen.")
                .arg(path, value));
        return false;
    }
    return true;
}

namespace {
QDateTime readCreationDateTime(QSqlDatabase database)
{
    QSqlQuery q(database);
    if (q.exec(QStringLiteral("SELECT value FROM meta WHERE key = 'creationDateTime'")) && q.next())
        return parseDateTime(q.value(0).toString());
    return QDateTime();
}
} // namespace

bool VDRReportSynchronisation::getImportVersion(QSqlDatabase database, QDateTime& dateTime)
{
    dateTime = readCreationDateTime(database);
    if (dateTime.isValid())
        return true;
    message(
        VDRPrompt::Warning, tr("Synchronisationsfehler"),
        tr("Das Erstelldatum der Austauschdatei fehlt.\nDie Datei %1 kann nicht importiert werden, da sie "
           "keine gültige Austauschdatei ist.\n")
            .arg(m_currentPath));
    return false;
}

int VDRReportSynchronisation::checkMasterDataVersion(QSqlDatabase database, QDateTime& fileTime)
{
    if (!getImportVersion(database, fileTime))
        return -1;
    const QDateTime diary = m_document->masterDataImportVersion();
    // An equal version is the same master data again (the same file imported twice).
    return diary.isValid() && diary >= fileTime ? 0 : 1;
}

bool VDRReportSynchronisation::isExchangeFileNameOf(const QString& fileName, const QString& diaryPath)
{
    const QString base = QFileInfo(diaryPath).completeBaseName();
    if (base.isEmpty() || fileName.size() != base.size() + 1 + 19 + 4)
        return false;
    if (!fileName.startsWith(base + QLatin1Char('.')) || !fileName.endsWith(QLatin1String(".vdx")))
        return false;
    static const QRegularExpression stamp(QRegularExpression::anchoredPattern(stampPattern()));
    return stamp.match(fileName.mid(base.size() + 1, 19)).hasMatch();
}

QStringList VDRReportSynchronisation::getCloudReportExchangeFiles(const QString& diaryPath,
                                                                  const QString& cloudFolder)
{
    if (diaryPath.isEmpty() || cloudFolder.isEmpty())
        return {};
    QStringList result;
    const QDir folder(cloudFolder);
    const QString canonicalFolder = folder.canonicalPath();
    for (const QFileInfo& fi : folder.entryInfoList({QStringLiteral("*.vdx")}, QDir::Files, QDir::Name)) {
        if (!isExchangeFileNameOf(fi.fileName(), diaryPath))
            continue;
        // A link that leads out of the cloud folder is not the app's file.
        if (fi.isSymLink() && QFileInfo(fi.canonicalFilePath()).absolutePath() != canonicalFolder)
            continue;
        result << fi.fileName();
    }
    return result;
}

// ---- Opening ----

bool VDRReportSynchronisation::openExchangeFile(const QString& path)
{
    closeExchangeFile();
    m_currentPath = path;
    const QString title = tr("Datenbankfehler");
    const auto refuse = [&](const QString& reason) {
        message(VDRPrompt::Critical, title, tr("Fehler beim Öffnen der Datei\n%1:\n%2").arg(path, reason));
        closeExchangeFile();
        return false;
    };
    const QFileInfo fi(path);
    if (!fi.exists() || !fi.isFile())
        return refuse(tr("Die Datei existiert nicht."));
    if (!m_confineTo.isEmpty() &&
        QFileInfo(fi.canonicalFilePath()).absolutePath() != QDir(m_confineTo).canonicalPath())
        return refuse(tr("Die Datei liegt nicht im Cloud-Ordner."));
    if (fi.size() > maxExchangeFileBytes())
        return refuse(tr("Die Datei ist zu groß (%1 MB).").arg(fi.size() / 1024000));

    // The file stays exactly as the app wrote it: opened read-only, and the exclusive locking mode
    // keeps the shared lock of the first read until the file is closed, so nobody writes meanwhile.
    m_connection = std::make_unique<VDRScopedConnection>(connectionName(), path,
                                                         QStringLiteral("QSQLITE_OPEN_READONLY"));
    if (!m_connection->isOpen())
        return refuse(m_connection->lastError().text());
    QString failure;
    {
        QSqlQuery q(m_connection->db());
        if (!q.exec(QStringLiteral("SELECT count(*) FROM sqlite_master")))
            failure = q.lastError().text();
        else
            q.exec(QStringLiteral("PRAGMA query_only = ON"));
    }
    return failure.isEmpty() ? true : refuse(failure);
}

void VDRReportSynchronisation::closeExchangeFile()
{
    m_connection.reset();
}

int VDRReportSynchronisation::countReports(const QString& path)
{
    const QFileInfo fi(path);
    if (!fi.isFile() || fi.size() > maxExchangeFileBytes())
        return 0;
    // Counting only reads; the file is opened unchanged and without a journal.
    const std::unique_ptr<VDRScopedConnection> look =
        VDRScopedConnection::readOnlyLook(connectionName(), path);
    if (!look->isOpen())
        return 0;
    QSqlQuery q(look->db());
    return q.exec(QStringLiteral("SELECT COUNT(*) as cnt FROM entry")) && q.next() ? q.value(0).toInt() : 0;
}
