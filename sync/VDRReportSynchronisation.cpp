#include "sync/VDRReportSynchronisation.h"
#include "sync/VDRExchangeValues.h"

#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "document/VDRDocumentsDb.h"
#include "document/VDRFileOps.h"
#include "document/VDRPrompt.h"
#include "document/VDRScopedConnection.h"

#include <QDebug>
#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QRegularExpression>
#include <QSet>
#include <QSqlError>
#include <QSqlQuery>
#include <QSqlRecord>

#include <climits>
#include <cmath>
#include <vector>

namespace VDRExchangeValues {

namespace {
QString tr(const char* text)
{
    return VDRReportSynchronisation::tr(text);
}

QString shortened(const QString& text)
{
    return text.size() > 40 ? text.left(40) + QStringLiteral("...") : text;
}
} // namespace

QDateTime parseDateTime(const QString& text)
{
    QString t = text.trimmed();
    if (t.size() > 10 && t.at(10) == QLatin1Char(' '))
        t[10] = QLatin1Char('T');
    QDateTime result = QDateTime::fromString(t, Qt::ISODateWithMs);
    if (!result.isValid())
        result = QDateTime::fromString(t, Qt::ISODate);
    return result;
}

QString versionText(const QDateTime& dateTime)
{
    QString text = dateTime.toString(QStringLiteral("yyyy-MM-ddThh:mm:ss"));
    if (dateTime.time().msec() != 0)
        text += dateTime.toString(QStringLiteral(".zzz"));
    return text;
}

// Checks one value of the exchange file against its column and turns it into what the diary's
// own models would bind. False with 'error' set when the value cannot be taken.
bool convertValue(const QVariant& raw, const Column& column, QVariant& out, QString& error)
{
    const QString name = QLatin1String(column.name);
    const bool null = raw.isNull();
    const auto invalid = [&]() {
        error = tr("Die Spalte '%1' enthält einen ungültigen Wert: %2")
                    .arg(name, shortened(raw.type() == QVariant::ByteArray ? QStringLiteral("<BLOB>")
                                                                           : raw.toString()));
        return false;
    };
    const auto missing = [&]() {
        error = tr("Die Spalte '%1' enthält keinen Wert.").arg(name);
        return false;
    };
    switch (column.kind) {
    case KInt: {
        if (null) {
            out = column.notNull ? QVariant(0) : QVariant(QVariant::Int);
            return true;
        }
        bool ok = false;
        qint64 value = 0;
        if (raw.type() == QVariant::Double) {
            const double d = raw.toDouble();
            ok = std::isfinite(d) && d == std::floor(d) && std::fabs(d) < 1e15;
            value = static_cast<qint64>(d);
        } else if (raw.type() != QVariant::ByteArray) {
            value = raw.toString().trimmed().toLongLong(&ok);
        }
        if (!ok || value < INT_MIN || value > INT_MAX)
            return invalid();
        out = static_cast<int>(value);
        return true;
    }
    case KReal: {
        if (null) {
            out = column.notNull ? QVariant(0.0) : QVariant(QVariant::Double);
            return true;
        }
        bool ok = false;
        const double value = raw.type() == QVariant::ByteArray ? 0.0 : raw.toString().trimmed().toDouble(&ok);
        if (!ok || !std::isfinite(value))
            return invalid();
        out = value;
        return true;
    }
    case KText:
    case KTextOrNull: {
        if (null) {
            out = column.kind == KTextOrNull ? QVariant(QVariant::String) : QVariant(QStringLiteral(""));
            return true;
        }
        const QString text =
            raw.type() == QVariant::ByteArray ? QString::fromUtf8(raw.toByteArray()) : raw.toString();
        if (text.size() > VDRReportSynchronisation::maxTextChars()) {
            error = tr("Der Text der Spalte '%1' ist zu lang (%2 Zeichen).").arg(name).arg(text.size());
            return false;
        }
        out = text;
        return true;
    }
    case KDate: {
        if (null || raw.toString().trimmed().isEmpty()) {
            if (column.notNull)
                return missing();
            out = QVariant(QVariant::Date);
            return true;
        }
        QString text = raw.toString().trimmed();
        if (text.size() > 10 && (text.at(10) == QLatin1Char('T') || text.at(10) == QLatin1Char(' ')))
            text.truncate(10);
        const QDate date = QDate::fromString(text, Qt::ISODate);
        if (!date.isValid() || text.size() != 10)
            return invalid();
        out = date;
        return true;
    }
    case KTime: {
        if (null || raw.toString().trimmed().isEmpty()) {
            if (column.notNull)
                return missing();
            out = QVariant(QVariant::Time);
            return true;
        }
        QString text = raw.toString().trimmed();
        const int t = text.indexOf(QLatin1Char('T'));
        if (t >= 0)
            text = text.mid(t + 1);
        QTime time = QTime::fromString(text, Qt::ISODateWithMs);
        if (!time.isValid())
            time = QTime::fromString(text, Qt::ISODate);
        if (!time.isValid())
            return invalid();
        out = time;
        return true;
    }
    case KDateTime: {
        if (null || raw.toString().trimmed().isEmpty()) {
            if (column.notNull)
                return missing();
            out = QVariant(QVariant::String);
            return true;
        }
        const QDateTime dateTime = parseDateTime(raw.toString());
        if (!dateTime.isValid())
            return invalid();
        out = versionText(dateTime);
        return true;
    }
    case KBlob: {
        if (null) {
            if (column.notNull)
                return missing();
            out = QVariant(QVariant::ByteArray);
            return true;
        }
        if (raw.type() != QVariant::ByteArray)
            return invalid();
        const QByteArray bytes = raw.toByteArray();
        if (bytes.size() > VDRReportSynchronisation::maxBlobBytes()) {
            error =
                tr("Der Inhalt der Spalte '%1' ist zu groß (%2 MB).").arg(name).arg(bytes.size() / 1024000);
            return false;
        }
        if (column.notNull && bytes.isEmpty())
            return missing();
        out = bytes;
        return true;
    }
    }
    return invalid();
}

} // namespace VDRExchangeValues

namespace {

using namespace VDRExchangeValues;

struct Table
{
    const char* name;
    std::vector<Column> columns; // without id and entry_id
};

const std::vector<Column>& entryColumns()
{
    static const std::vector<Column> columns = {
        {"locked", KInt, true},
        {"persistent_document", KBlob, false},
        {"persistent_document_ct", KTextOrNull, false},
        {"number", KText, true},
        {"inspection_date", KDate, true},
        {"inspection_time_from", KTime, true},
        {"inspection_time_to", KTime, true},
        {"env_time", KTime, true},
        {"env_weather1", KText, true},
        {"env_weather2", KText, true},
        {"env_weather3", KText, true},
        {"env_temperature", KText, true},
        {"env_humidity", KText, true},
        {"progress", KText, true},
        {"deficiencies", KText, true},
        {"tests", KText, false},
        {"interventions", KText, false},
        {"special_incidents", KText, false},
        {"construction_material_sample", KInt, true},
        {"notice", KText, false},
        {"print_notice", KInt, true},
        {"print_telephone_notice", KInt, true},
        {"progress_audio_id", KInt, true},
        {"user_id", KText, false},
        {"creation_date", KDateTime, false},
        {"exported_by_app", KInt, false},
    };
    return columns;
}

const Table kAttendee = {"entry_attendee",
                         {{"company_id", KInt, false}, {"comment", KText, true}, {"pos", KInt, true}}};
const Table kWorkforce = {"entry_workforce",
                          {{"company_id", KInt, false},
                           {"comment", KText, true},
                           {"person_count", KInt, true},
                           {"person_type", KText, true},
                           {"man_hours", KReal, false},
                           {"pos", KInt, true}}};
const Table kTimeRecording = {"entry_time_recording",
                              {{"workforce_id", KInt, true},
                               {"person_count", KInt, true},
                               {"person_type", KText, true},
                               {"time_from", KTime, false},
                               {"time_to", KTime, false},
                               {"breaks", KInt, false},
                               {"hours", KReal, false},
                               {"pos", KInt, true}}};
const Table kProgress = {"entry_progress",
                         {{"type", KInt, true},
                          {"description", KText, true},
                          {"company_id", KInt, false},
                          {"date", KDate, false},
                          {"roomname", KText, true},
                          {"roombook_number", KText, true},
                          {"pos", KInt, true},
                          {"image_cnt", KInt, false}}};
const Table kPhoto = {"entry_photo",
                      {{"pos", KInt, true},
                       {"type", KInt, true},
                       {"photo_image_id", KInt, false},
                       {"company_id", KInt, false},
                       {"caption", KText, true},
                       {"comment", KText, true},
                       {"date", KDate, true},
                       {"relation_id", KInt, false}}};
const Table kTask = {
    "entry_task",
    {{"type", KInt, true}, {"description", KText, true}, {"company_id", KInt, false}, {"pos", KInt, true}}};
const Table kMeasure = {"entry_constructionmeasure",
                        {{"description", KText, true},
                         {"timefrom", KTime, true},
                         {"timeto", KTime, true},
                         {"company_id", KInt, false},
                         {"location", KText, false},
                         {"kks", KText, false},
                         {"pos", KInt, true}}};
const Table kMaterial = {"entry_constructionmaterial",
                         {{"material", KText, true},
                          {"quantity", KReal, false},
                          {"unit", KText, false},
                          {"process", KText, true},
                          {"company_id", KInt, false},
                          {"material_temperature", KInt, true},
                          {"conditions", KText, true},
                          {"workflow", KText, true},
                          {"note", KText, true},
                          {"document", KText, false},
                          {"pos", KInt, true}}};
const Table kDelivery = {"entry_scheduleddelivery",
                         {{"deliverynumber", KText, true},
                          {"deliveryindex", KText, true},
                          {"deliverydate", KDate, true},
                          {"company_id", KInt, false},
                          {"comment", KText, true},
                          {"document", KText, false},
                          {"pos", KInt, true}}};
const Table kTelephone = {
    "entry_telephone_notice",
    {{"description", KText, true}, {"company_id", KInt, false}, {"time", KTime, true}, {"pos", KInt, true}}};
const Table kConcern = {"entry_concern",
                        {{"description", KText, true}, {"company_id", KInt, false}, {"pos", KInt, true}}};
const Table kEquipment = {"entry_equipment",
                          {{"equipment", KText, true},
                           {"operating_zone", KText, true},
                           {"company_id", KInt, false},
                           {"entry_time", KTime, false},
                           {"exit_time", KTime, false},
                           {"operating_time", KInt, false},
                           {"downtime", KInt, false},
                           {"downtime_reasons", KText, true},
                           {"comment", KText, true},
                           {"pos", KInt, true}}};
const Table kImage = {"image",
                      {{"image", KBlob, true},
                       {"image_ct", KText, true},
                       {"image_width", KInt, true},
                       {"image_height", KInt, true},
                       {"thumbnail", KBlob, true},
                       {"thumbnail_ct", KText, true},
                       {"thumbnail_width", KInt, true},
                       {"thumbnail_height", KInt, true}}};
const Table kAudio = {"audio",
                      {{"recording", KBlob, true},
                       {"recording_date", KDate, true},
                       {"recording_time", KTime, true},
                       {"recording_status", KInt, true}}};

// Every sub-table of a report in the diary, for removing a replaced report's rows.
const char* const kReportTables[] = {"entry_attendee",
                                     "entry_workforce",
                                     "entry_time_recording",
                                     "entry_progress",
                                     "entry_photo",
                                     "entry_task",
                                     "entry_constructionmeasure",
                                     "entry_constructionmaterial",
                                     "entry_scheduleddelivery",
                                     "entry_telephone_notice",
                                     "entry_concern",
                                     "entry_equipment"};

const QString kDraftSuffix = QStringLiteral(" (Entwurf)");

QString columnList(const Table& table, bool withEntryId)
{
    QStringList names = {QStringLiteral("id")};
    if (withEntryId)
        names << QStringLiteral("entry_id");
    for (const Column& c : table.columns)
        names << QLatin1String(c.name);
    return names.join(QStringLiteral(", "));
}

// The checked values of one row of 'table', by column name.
bool convertRow(const QSqlQuery& q, const Table& table, QVariantHash& values, QString& error)
{
    for (const Column& c : table.columns) {
        QVariant v;
        if (!convertValue(q.value(QLatin1String(c.name)), c, v, error))
            return false;
        values.insert(QLatin1String(c.name), v);
    }
    return true;
}

int rowId(const QSqlQuery& q, bool* ok)
{
    QVariant v;
    QString error;
    *ok = convertValue(q.value(0), {"id", KInt, true}, v, error);
    return v.toInt();
}

// Runs a statement on the diary inside a savepoint; logs failures.
bool execDiary(QSqlDatabase db, const QString& sql)
{
    QSqlQuery q(db);
    if (q.exec(sql))
        return true;
    qDebug().noquote() << "SQL-Error:" << sql << q.lastError().text();
    return false;
}

// The names of the reference schema's tables and columns missing in an exchange file.
QString missingStructure(QSqlDatabase db)
{
    const QList<const Table*> tables = {&kAttendee, &kWorkforce, &kTimeRecording, &kProgress, &kPhoto,
                                        &kTask,     &kMeasure,   &kMaterial,      &kDelivery, &kTelephone,
                                        &kConcern,  &kEquipment, &kImage,         &kAudio};
    QHash<QString, QStringList> expected;
    for (const Table* t : tables) {
        QStringList columns = {QStringLiteral("id")};
        if (QLatin1String(t->name).startsWith(QLatin1String("entry_")))
            columns << QStringLiteral("entry_id");
        for (const Column& c : t->columns)
            columns << QLatin1String(c.name);
        expected.insert(QLatin1String(t->name), columns);
    }
    QStringList entry = {QStringLiteral("id")};
    for (const Column& c : entryColumns())
        entry << QLatin1String(c.name);
    expected.insert(QStringLiteral("entry"), entry);
    expected.insert(QStringLiteral("meta"), {QStringLiteral("key"), QStringLiteral("value")});
    expected.insert(QStringLiteral("vdr"), {QStringLiteral("id")});
    expected.insert(QStringLiteral("company"), {QStringLiteral("id"), QStringLiteral("category")});

    QStringList keys = expected.keys();
    std::sort(keys.begin(), keys.end());
    for (const QString& table : keys) {
        QSet<QString> present;
        QSqlQuery q(db);
        if (q.exec(QStringLiteral("PRAGMA table_info(\"%1\")").arg(table))) {
            while (q.next())
                present.insert(q.value(1).toString());
        }
        if (present.isEmpty())
            return VDRReportSynchronisation::tr("Die Tabelle '%1' fehlt.").arg(table);
        for (const QString& column : expected.value(table)) {
            if (!present.contains(column))
                return VDRReportSynchronisation::tr("Die Spalte '%1' der Tabelle '%2' fehlt.")
                    .arg(column, table);
        }
    }
    return QString();
}

} // namespace

// ---------------------------------------------------------------------------------------------

VDRReportSynchronisation::VDRReportSynchronisation(VDRDocument* document, QObject* parent)
    : QObject(parent), m_document(document)
{
}

VDRReportSynchronisation::~VDRReportSynchronisation()
{
    closeExchangeFile();
}

void VDRReportSynchronisation::clearResultList()
{
    qDeleteAll(m_results);
    m_results.clear();
}

void VDRReportSynchronisation::slotRenameCheckboxStateChanged(int state)
{
    m_renameForAll = state == Qt::Checked;
}

void VDRReportSynchronisation::message(int kind, const QString& title, const QString& text)
{
    // The busy cursor is not meant for a message box.
    for (int i = 0; i < m_busy; ++i)
        VDRPrompt::instance()->setBusy(false);
    if (kind == VDRPrompt::Critical)
        VDRPrompt::critical(title, text);
    else if (kind == VDRPrompt::Warning)
        VDRPrompt::warning(title, text);
    else
        VDRPrompt::information(title, text);
    for (int i = 0; i < m_busy; ++i)
        VDRPrompt::instance()->setBusy(true);
}

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

// ---- One file ----

int VDRReportSynchronisation::importReportExchangeFile(const QString& path, int totalReports,
                                                       int reportsBefore, int& importedCount,
                                                       bool& masterDataImported, bool& projectDataChanged)
{
    if (!openExchangeFile(path))
        return FileOpenFailed;
    int result = FileRefused;
    {
        QSqlDatabase db = m_connection->db();
        result = importOpenedFile(db, path, totalReports, reportsBefore, importedCount, masterDataImported,
                                  projectDataChanged);
    }
    closeExchangeFile();
    return result;
}

int VDRReportSynchronisation::importOpenedFile(QSqlDatabase db, const QString& path, int totalReports,
                                               int reportsBefore, int& importedCount,
                                               bool& masterDataImported, bool& projectDataChanged)
{
    const auto done = [](int result) { return result; };
    if (!checkFileVersion(db, path))
        return done(FileRefused);
    // A new diary has no name yet; it takes whatever file it is given.
    const QString diaryName = QFileInfo(m_document->getFilepath()).fileName();
    if (!diaryName.isEmpty() && !checkDatabaseName(db, path, diaryName))
        return done(FileRefused);
    const QString missing = missingStructure(db);
    if (!missing.isEmpty()) {
        message(VDRPrompt::Warning, tr("Synchronisationsfehler"),
                tr("Die Datei \n%1\nkann nicht importiert werden, da sie keine gültige Austauschdatei ist.")
                        .arg(path) +
                    QLatin1Char('\n') + missing);
        return done(FileRefused);
    }

    int vdrCount = 0;
    int companyCount = 0;
    {
        QSqlQuery q(db);
        if (q.exec(QStringLiteral("SELECT COUNT(*) FROM vdr")) && q.next())
            vdrCount = q.value(0).toInt();
        if (q.exec(QStringLiteral("SELECT COUNT(*) FROM company")) && q.next())
            companyCount = q.value(0).toInt();
    }
    QDateTime importVersion;
    if (vdrCount > 0 || companyCount > 0) {
        const int version = checkMasterDataVersion(db, importVersion);
        if (version < 0)
            return done(FileRefused);
        if (version == 0) {
            message(VDRPrompt::Warning, tr("Stammdaten Synchronisation"),
                    tr("Die Stammdaten der Austauschdatei %1 werden nicht importiert, da bereits aktuellere "
                       "Stammdaten in das Varduna importiert wurden.")
                        .arg(path));
        } else {
            bool companiesChanged = false;
            bool projectChanged = false;
            const int result = importMasterData(db, path, companiesChanged, projectChanged);
            if (result == 3) {
                message(
                    VDRPrompt::Warning, tr("Synchronisationsfehler"),
                    tr("Fehlerhafte Projektdaten in der Austauschdatei \n%1.\nDie Projektdaten konnten nicht "
                       "importiert werden.")
                        .arg(path));
                return done(FileProjectDataFaulty);
            }
            if (result != 0)
                return done(FileRefused);
            m_document->setMasterDataImportVersion(importVersion);
            masterDataImported = true;
            projectDataChanged = projectDataChanged || projectChanged;
        }
    } else if (!getImportVersion(db, importVersion)) {
        return done(FileRefused);
    }

    int count = 0;
    // The file is one transaction, each report a savepoint in it: one commit, not one per report.
    m_document->beginTransaction();
    const int resultsBefore = m_results.size();
    const int reports = importReports(db, path, totalReports, reportsBefore, count, importVersion);
    const bool committed = m_document->endTransaction();
    refreshModels();
    if (!committed) {
        // Nothing of the file reached the diary (the user has been told why).
        for (int i = resultsBefore; i < m_results.size(); ++i) {
            if (m_results[i]->status() == VDRReportSynchronisationResult::Imported)
                m_results[i]->setStatus(VDRReportSynchronisationResult::RefusedDatabaseError);
        }
        return done(FileRefused);
    }
    importedCount += count;
    return done(reports == 0 ? FileImported : FileRefused);
}

int VDRReportSynchronisation::importReports(QSqlDatabase exchangeFile, const QString& path, int totalReports,
                                            int reportsBefore, int& count, const QDateTime& importVersion)
{
    QSqlQuery q(exchangeFile);
    q.setForwardOnly(true);
    if (!q.exec(QStringLiteral(
            "SELECT id, locked, persistent_document, persistent_document_ct, number, "
            "inspection_date, inspection_time_from, inspection_time_to, env_time, env_weather1, "
            "env_weather2, env_weather3, env_temperature, env_humidity, progress, deficiencies, "
            "tests, interventions, special_incidents, construction_material_sample, notice, "
            "print_notice, print_telephone_notice, progress_audio_id, user_id, creation_date, "
            "exported_by_app FROM entry ORDER BY inspection_date"))) {
        message(VDRPrompt::Critical, tr("Datenbankfehler"),
                tr("Die Datei\n%1\n enthält keinen gültigen Bericht.\n%2").arg(path, q.lastError().text()));
        return 1;
    }
    m_replacedDocuments.clear();
    m_touchedReports.clear();
    int failed = 0;
    while (q.next()) {
        ++count;
        VDRPrompt::instance()->noticeText(
            tr("Baubericht %1 von %2 wird importiert ...").arg(reportsBefore + count).arg(totalReports));
        if (totalReports > 0)
            VDRPrompt::instance()->noticeProgress((reportsBefore + count) * 100 / totalReports);
        QVariantHash row;
        const QSqlRecord record = q.record();
        for (int i = 0; i < record.count(); ++i)
            row.insert(record.fieldName(i), record.value(i));
        const QString number = row.value(QStringLiteral("number")).toString().trimmed();
        const QString userId = row.value(QStringLiteral("user_id")).toString();
        auto* result = new VDRReportSynchronisationResult(path, number, QString(), userId, false, 0, this);
        m_results.append(result);
        const int status = importReport(exchangeFile, path, row, importVersion, result);
        result->setStatus(status);
        if (status == VDRReportSynchronisationResult::RefusedDatabaseError)
            ++failed;
    }
    importDocuments(m_replacedDocuments);
    m_replacedDocuments.clear();
    return failed == 0 ? 0 : 3;
}

void VDRReportSynchronisation::refreshModels()
{
    // The reports were written with SQL; the models show what the diary now holds.
    if (m_document->modelEntryAll())
        m_document->modelEntryAll()->select();
    if (m_document->modelVdr())
        m_document->modelVdr()->select();
    for (const int entryId : qAsConst(m_touchedReports)) {
        if (!m_document->hasEntryModels(entryId))
            continue;
        for (VDRSqlTableModel* model : m_document->entryModels(entryId))
            model->select();
    }
    m_touchedReports.clear();
}

// ---- One report ----

int VDRReportSynchronisation::entryBySynchId(int id, const QString& userId, const QDateTime& creationDate,
                                             int& row)
{
    row = -1;
    QSqlQuery q(m_document->database());
    if (!userId.isEmpty() && creationDate.isValid()) {
        q.prepare(QStringLiteral("SELECT id, creation_date FROM entry WHERE user_id = :user_id"));
        q.bindValue(QStringLiteral(":user_id"), userId);
        if (!q.exec())
            return -1;
        while (q.next()) {
            if (parseDateTime(q.value(1).toString()) == creationDate) {
                const int diaryId = q.value(0).toInt();
                if (m_document->modelEntryAll())
                    row = m_document->modelEntryAll()->rowById(diaryId);
                return diaryId;
            }
        }
        return -1;
    }
    if (creationDate.isValid())
        return -1;
    // Reports from before the identity are known by their id alone.
    q.prepare(QStringLiteral("SELECT id, user_id, creation_date FROM entry WHERE id = :id"));
    q.bindValue(QStringLiteral(":id"), id);
    if (!q.exec() || !q.next())
        return -1;
    if (!q.value(1).toString().isEmpty() && parseDateTime(q.value(2).toString()).isValid())
        return -1;
    if (m_document->modelEntryAll())
        row = m_document->modelEntryAll()->rowById(id);
    return id;
}

bool VDRReportSynchronisation::checkReportVersion(int id, const QDateTime& importVersion)
{
    QSqlQuery q(m_document->database());
    q.prepare(QStringLiteral("SELECT import_version FROM entry WHERE id = :id"));
    q.bindValue(QStringLiteral(":id"), id);
    if (!q.exec() || !q.next())
        return true;
    const QDateTime stored = parseDateTime(q.value(0).toString());
    return !(stored.isValid() && stored > importVersion);
}

namespace {
struct NumberParts
{
    int number = 0;
    QChar letter;
};

NumberParts numberParts(const QString& text)
{
    NumberParts parts;
    const QString cut = VDRDocument::cutNumber(text.trimmed());
    const int digits = VDRDocument::entryNumberDigits(cut);
    qint64 value = 0;
    for (int i = 0; i < digits && value <= INT_MAX; ++i)
        value = value * 10 + cut.at(i).digitValue();
    parts.number = static_cast<int>(std::min<qint64>(value, INT_MAX));
    if (digits > 0 && digits < cut.size())
        parts.letter = cut.at(digits);
    return parts;
}
} // namespace

bool VDRReportSynchronisation::checkImportedReportNumber(const QString& number, const QDate& date,
                                                         const QTime& time, int& highestNumber,
                                                         int& highestId)
{
    highestNumber = 0;
    highestId = -1;
    // The reports with the highest numeric part; among them the highest letter.
    QSqlQuery q(m_document->database());
    if (!q.exec(QStringLiteral("SELECT id, number, inspection_date, inspection_time_from FROM entry WHERE "
                               "CAST(number AS INTEGER) = (SELECT max(CAST(number AS INTEGER)) FROM entry "
                               "WHERE number GLOB '[0-9]*') AND number GLOB '[0-9]*'")))
        return false;
    NumberParts best;
    QDate bestDate;
    QTime bestTime;
    while (q.next()) {
        const NumberParts parts = numberParts(q.value(1).toString());
        if (highestId < 0 || parts.letter > best.letter) {
            best = parts;
            highestId = q.value(0).toInt();
            bestDate = QDate::fromString(q.value(2).toString().left(10), Qt::ISODate);
            bestTime = QTime::fromString(q.value(3).toString(), Qt::ISODateWithMs);
            if (!bestTime.isValid())
                bestTime = QTime::fromString(q.value(3).toString(), Qt::ISODate);
        }
    }
    if (highestId < 0)
        return false;
    highestNumber = best.number;
    const NumberParts incoming = numberParts(number);
    const bool notAbove =
        incoming.number < best.number || (incoming.number == best.number && incoming.letter <= best.letter);
    const bool later = date > bestDate || (date == bestDate && time > bestTime);
    return notAbove && later;
}

int VDRReportSynchronisation::nextId(const QString& table)
{
    auto it = m_idCounters.find(table);
    if (it == m_idCounters.end()) {
        QSqlQuery q(m_document->database());
        q.prepare(QStringLiteral("SELECT id_counter FROM id_generator WHERE id_table = :tablename"));
        q.bindValue(QStringLiteral(":tablename"), table);
        const int counter = q.exec() && q.next() ? q.value(0).toInt() : 0;
        it = m_idCounters.insert(table, counter);
    }
    return ++it.value();
}

bool VDRReportSynchronisation::storeIdCounters()
{
    QSqlDatabase db = m_document->database();
    for (auto it = m_idCounters.constBegin(); it != m_idCounters.constEnd(); ++it) {
        QSqlQuery q(db);
        q.prepare(QStringLiteral("UPDATE id_generator SET id_counter = :newid WHERE id_table = :tablename"));
        q.bindValue(QStringLiteral(":newid"), it.value());
        q.bindValue(QStringLiteral(":tablename"), it.key());
        if (!q.exec())
            return false;
        if (q.numRowsAffected() == 0) {
            QSqlQuery insert(db);
            insert.prepare(QStringLiteral(
                "INSERT INTO id_generator (id_table, id_counter) VALUES (:tablename, :newid)"));
            insert.bindValue(QStringLiteral(":tablename"), it.key());
            insert.bindValue(QStringLiteral(":newid"), it.value());
            if (!insert.exec())
                return false;
        }
    }
    return true;
}

int VDRReportSynchronisation::importReport(QSqlDatabase exchangeFile, const QString& path,
                                           const QVariantHash& raw, const QDateTime& importVersion,
                                           VDRReportSynchronisationResult* result)
{
    QSqlDatabase diary = m_document->database();
    const auto fail = [&](const QString& text) {
        message(VDRPrompt::Critical, tr("Datenbankfehler"), text);
        return int(VDRReportSynchronisationResult::RefusedDatabaseError);
    };
    const auto invalidReport = [&](const QString& reason) {
        return fail(tr("Die Datei\n%1\n enthält keinen gültigen Bericht.\n%2").arg(path, reason));
    };

    QVariant idValue;
    QString error;
    if (!convertValue(raw.value(QStringLiteral("id")), {"id", KInt, true}, idValue, error))
        return invalidReport(error);
    const int appId = idValue.toInt();

    // Check and convert the report's own columns; NULLs as the diary wants them.
    QVariantHash values;
    for (const Column& c : entryColumns()) {
        QVariant v;
        if (!convertValue(raw.value(QLatin1String(c.name)), c, v, error)) {
            if (c.kind == KDateTime) {
                v = QVariant(QVariant::String); // an unreadable creation date counts as none
            } else {
                return invalidReport(error);
            }
        }
        values.insert(QLatin1String(c.name), v);
    }
    values.insert(QStringLiteral("exported_by_app"), 0);
    const bool locked = values.value(QStringLiteral("locked")).toInt() != 0;
    const QString userId = values.value(QStringLiteral("user_id")).toString();
    const QDateTime creationDate = parseDateTime(values.value(QStringLiteral("creation_date")).toString());

    // A report without identity whose id the diary handed out and no longer has was deleted there.
    if (!locked && (userId.isEmpty() || !creationDate.isValid())) {
        QSqlQuery q(diary);
        int counter = 0;
        if (q.exec(
                QStringLiteral("SELECT id_table, id_counter FROM id_generator WHERE id_table = 'entry'")) &&
            q.next())
            counter = q.value(1).toInt();
        q.prepare(QStringLiteral("SELECT count(*) FROM entry WHERE id = :id"));
        q.bindValue(QStringLiteral(":id"), appId);
        const bool exists = q.exec() && q.next() && q.value(0).toInt() > 0;
        if (appId <= counter && !exists)
            return VDRReportSynchronisationResult::RefusedDeleted;
    }

    int row = -1;
    const int existingId = entryBySynchId(appId, userId, creationDate, row);
    bool renumberCandidate = false;
    int highestNumber = 0;
    int highestId = -1;
    QString diaryNumber;
    QList<int> oldImages;
    int oldAudio = 0;
    if (existingId > 0) {
        if (!checkReportVersion(existingId, importVersion))
            return VDRReportSynchronisationResult::RefusedNewerVersion;
        QSqlQuery q(diary);
        q.prepare(QStringLiteral("SELECT locked, number, progress_audio_id FROM entry WHERE id = :id"));
        q.bindValue(QStringLiteral(":id"), existingId);
        if (!q.exec() || !q.next())
            return fail(q.lastError().text());
        if (q.value(0).toInt() != 0)
            return VDRReportSynchronisationResult::RefusedLocked;
        diaryNumber = q.value(1).toString();
        oldAudio = q.value(2).toInt();
    } else {
        const QString number = values.value(QStringLiteral("number")).toString();
        if (numberParts(number).number > 99999) {
            message(VDRPrompt::Warning, tr("Bauberichtnummer ungültig "),
                    tr("Sie können keinen Baubericht mit einer Bauberichtnummer größer 99999 anlegen.\n"
                       "Reduzieren Sie die höchste Bauberichtnummer oder legen Sie eine neue Datei an."));
            return VDRReportSynchronisationResult::RefusedDatabaseError;
        }
        renumberCandidate = checkImportedReportNumber(
            number, values.value(QStringLiteral("inspection_date")).toDate(),
            values.value(QStringLiteral("inspection_time_from")).toTime(), highestNumber, highestId);
    }

    // Everything of one report in one savepoint: a failure at any row leaves the diary as it was.
    m_idCounters.clear();
    m_document->beginTransaction();
    bool ok = execDiary(diary, QStringLiteral("SAVEPOINT vdx_report"));
    QList<ReplacedDocument> replacedDocuments;
    int entryId = existingId;
    if (ok && existingId > 0) {
        // The replaced report's rows go; its id and number stay.
        QSqlQuery q(diary);
        q.prepare(QStringLiteral("SELECT photo_image_id FROM entry_photo WHERE entry_id = :id"));
        q.bindValue(QStringLiteral(":id"), existingId);
        ok = q.exec();
        while (ok && q.next()) {
            if (q.value(0).toInt() > 0 && !oldImages.contains(q.value(0).toInt()))
                oldImages << q.value(0).toInt();
        }
        for (const char* table : {"entry_constructionmaterial", "entry_scheduleddelivery"}) {
            q.prepare(
                QStringLiteral("SELECT id, document FROM %1 WHERE entry_id = :id").arg(QLatin1String(table)));
            q.bindValue(QStringLiteral(":id"), existingId);
            ok = ok && q.exec();
            while (ok && q.next()) {
                if (!q.value(1).toString().trimmed().isEmpty())
                    replacedDocuments.append(
                        {QLatin1String(table), q.value(0).toInt(), q.value(1).toString()});
            }
        }
        for (const char* table : kReportTables) {
            QSqlQuery d(diary);
            d.prepare(QStringLiteral("DELETE FROM %1 WHERE entry_id = :id").arg(QLatin1String(table)));
            d.bindValue(QStringLiteral(":id"), existingId);
            ok = ok && d.exec();
            if (!ok)
                error = d.lastError().text();
        }
    }

    int audioId = 0;
    if (ok) {
        if (existingId <= 0)
            entryId = nextId(QStringLiteral("entry"));
        ok = writeReportRows(exchangeFile, path, appId, entryId, values, audioId, error);
    }
    if (ok) {
        // The entry row itself, last, with the dictation's new id.
        values.insert(QStringLiteral("progress_audio_id"), audioId);
        values.insert(QStringLiteral("import_version"), versionText(importVersion));
        QString number = existingId > 0 ? diaryNumber : values.value(QStringLiteral("number")).toString();
        number = VDRDocument::cutNumber(number) + (locked ? QString() : kDraftSuffix);
        values.insert(QStringLiteral("number"), number);
        QStringList columns;
        for (const Column& c : entryColumns())
            columns << QLatin1String(c.name);
        columns << QStringLiteral("import_version");
        QSqlQuery q(diary);
        if (existingId > 0) {
            QStringList sets;
            for (const QString& c : qAsConst(columns))
                sets << c + QStringLiteral(" = ?");
            q.prepare(
                QStringLiteral("UPDATE entry SET %1 WHERE id = ?").arg(sets.join(QStringLiteral(", "))));
        } else {
            QStringList marks;
            for (int i = 0; i <= columns.size(); ++i)
                marks << QStringLiteral("?");
            q.prepare(QStringLiteral("INSERT INTO entry (%1, id) VALUES (%2)")
                          .arg(columns.join(QStringLiteral(", ")), marks.join(QLatin1Char(','))));
        }
        for (const QString& c : qAsConst(columns))
            q.addBindValue(values.value(c));
        q.addBindValue(entryId);
        ok = q.exec();
        if (!ok)
            error =
                tr("Die Datei\n%1\n enthält keinen gültigen Bericht.\n%2").arg(path, q.lastError().text());
    }
    if (ok && existingId <= 0) {
        QSqlQuery q(diary);
        q.prepare(QStringLiteral("UPDATE vdr SET entrycounter = :id WHERE id = 1"));
        q.bindValue(QStringLiteral(":id"), entryId);
        ok = q.exec();
        if (!ok)
            error = q.lastError().text();
    }
    if (ok && existingId > 0) {
        // Pictures and the dictation of the replaced report that nothing uses any more.
        for (const int imageId : qAsConst(oldImages)) {
            QSqlQuery q(diary);
            q.prepare(
                QStringLiteral("DELETE FROM image WHERE id = :id AND NOT EXISTS (SELECT 1 FROM entry_photo "
                               "WHERE photo_image_id = :id2) AND NOT EXISTS (SELECT 1 FROM vdr WHERE "
                               "logo_image_id = :id3 OR logo2_image_id = :id4)"));
            q.bindValue(QStringLiteral(":id"), imageId);
            q.bindValue(QStringLiteral(":id2"), imageId);
            q.bindValue(QStringLiteral(":id3"), imageId);
            q.bindValue(QStringLiteral(":id4"), imageId);
            ok = ok && q.exec();
        }
        if (ok && oldAudio > 0 && oldAudio != audioId) {
            QSqlQuery q(diary);
            q.prepare(QStringLiteral("DELETE FROM audio WHERE id = :id"));
            q.bindValue(QStringLiteral(":id"), oldAudio);
            ok = q.exec();
        }
    }
    ok = ok && storeIdCounters();
    if (ok) {
        ok = execDiary(diary, QStringLiteral("RELEASE vdx_report"));
    } else {
        execDiary(diary, QStringLiteral("ROLLBACK TO vdx_report"));
        execDiary(diary, QStringLiteral("RELEASE vdx_report"));
    }
    m_document->endTransaction();
    m_idCounters.clear();
    if (!ok)
        return fail(error.isEmpty() ? tr("Die Datei\n%1\n enthält keinen gültigen Bericht.\n%2")
                                          .arg(path, diary.lastError().text())
                                    : error);

    m_touchedReports.insert(entryId);
    if (existingId > 0) {
        result->setReplaced(true);
        result->setGivenNumber(VDRDocument::cutNumber(diaryNumber));
        if (!replacedDocuments.isEmpty())
            m_replacedDocuments.insert(entryId, replacedDocuments);
    }
    m_document->setModified(true);
    if (renumberCandidate)
        renumber(entryId, highestNumber, highestId, result);
    return VDRReportSynchronisationResult::Imported;
}

bool VDRReportSynchronisation::writeReportRows(QSqlDatabase exchangeFile, const QString& path, int appEntryId,
                                               int entryId, const QVariantHash& entry, int& audioId,
                                               QString& error)
{
    QSqlDatabase diary = m_document->database();
    const auto tableError = [&](const char* table, const QString& reason) {
        error = tr("Die Tabelle '%1' der Datei\n%2\n konnte nicht importiert werden.\n%3")
                    .arg(QLatin1String(table), path, reason);
        return false;
    };

    // Copies the rows 'select' yields into the diary's table; 'adjust' may map values, skip a row
    // (returns 0) or fail (returns -1). 'mapped' collects app id -> diary id.
    const auto copyRows = [&](const Table& table, QSqlQuery& select,
                              const std::function<int(QVariantHash&)>& adjust, QHash<int, int>* mapped) {
        QStringList columns = {QStringLiteral("id"), QStringLiteral("entry_id")};
        for (const Column& c : table.columns)
            columns << QLatin1String(c.name);
        QStringList marks;
        for (int i = 0; i < columns.size(); ++i)
            marks << QStringLiteral("?");
        QSqlQuery insert(diary);
        if (!insert.prepare(QStringLiteral("INSERT INTO %1 (%2) VALUES (%3)")
                                .arg(QLatin1String(table.name), columns.join(QStringLiteral(", ")),
                                     marks.join(QLatin1Char(',')))))
            return tableError(table.name, insert.lastError().text());
        while (select.next()) {
            bool idOk = false;
            const int appRowId = rowId(select, &idOk);
            QVariantHash values;
            QString rowError;
            if (!idOk || !convertRow(select, table, values, rowError))
                return tableError(table.name,
                                  idOk ? rowError : tr("Die Spalte 'id' enthält einen ungültigen Wert."));
            if (adjust) {
                const int verdict = adjust(values);
                if (verdict < 0)
                    return tableError(table.name, tr("Ungültiger Verweis in Zeile %1.").arg(appRowId));
                if (verdict == 0)
                    continue;
            }
            const int newId = nextId(QLatin1String(table.name));
            insert.addBindValue(newId);
            insert.addBindValue(entryId);
            for (const Column& c : table.columns)
                insert.addBindValue(values.value(QLatin1String(c.name)));
            if (!insert.exec())
                return tableError(table.name, insert.lastError().text());
            if (mapped)
                mapped->insert(appRowId, newId);
        }
        if (select.lastError().isValid())
            return tableError(table.name, select.lastError().text());
        return true;
    };
    const auto selectRows = [&](QSqlQuery& q, const Table& table, const QString& where) {
        q.setForwardOnly(true);
        q.prepare(QStringLiteral("SELECT %1 FROM %2 WHERE %3")
                      .arg(columnList(table, false), QLatin1String(table.name), where));
        q.bindValue(QStringLiteral(":entryId"), appEntryId);
        return q.exec();
    };

    // The dictation.
    audioId = 0;
    const int appAudio = entry.value(QStringLiteral("progress_audio_id")).toInt();
    if (appAudio > 0) {
        QSqlQuery q(exchangeFile);
        q.prepare(QStringLiteral(
            "SELECT id, recording, recording_date, recording_time, recording_status FROM audio "
            "WHERE id = :audioId;"));
        q.bindValue(QStringLiteral(":audioId"), appAudio);
        if (!q.exec())
            return tableError("audio", q.lastError().text());
        if (q.next()) {
            QVariantHash values;
            QString rowError;
            if (!convertRow(q, kAudio, values, rowError))
                return tableError("audio", rowError);
            QSqlQuery insert(diary);
            insert.prepare(QStringLiteral("INSERT INTO audio (recording, recording_date, recording_time, "
                                          "recording_status) VALUES (?, ?, ?, ?)"));
            for (const Column& c : kAudio.columns)
                insert.addBindValue(values.value(QLatin1String(c.name)));
            if (!insert.exec())
                return tableError("audio", insert.lastError().text());
            audioId = insert.lastInsertId().toInt();
        }
    }

    const QString byEntry = QStringLiteral("entry_id = :entryId");
    {
        QSqlQuery q(exchangeFile);
        if (!selectRows(q, kAttendee, byEntry) || !copyRows(kAttendee, q, nullptr, nullptr))
            return error.isEmpty() ? tableError("entry_attendee", q.lastError().text()) : false;
    }
    QHash<int, int> workforce;
    {
        QSqlQuery q(exchangeFile);
        if (!selectRows(q, kWorkforce, byEntry) || !copyRows(kWorkforce, q, nullptr, &workforce))
            return error.isEmpty() ? tableError("entry_workforce", q.lastError().text()) : false;
    }
    {
        QList<int> appWorkforce = workforce.keys();
        std::sort(appWorkforce.begin(), appWorkforce.end());
        for (const int appWorkforceId : qAsConst(appWorkforce)) {
            QSqlQuery q(exchangeFile);
            q.setForwardOnly(true);
            q.prepare(
                QStringLiteral("SELECT %1 FROM entry_time_recording WHERE workforce_id = :workforceId AND "
                               "entry_id = :entryId")
                    .arg(columnList(kTimeRecording, false)));
            q.bindValue(QStringLiteral(":workforceId"), appWorkforceId);
            q.bindValue(QStringLiteral(":entryId"), appEntryId);
            const int newWorkforce = workforce.value(appWorkforceId);
            const auto mapWorkforce = [newWorkforce](QVariantHash& v) {
                v.insert(QStringLiteral("workforce_id"), newWorkforce);
                return 1;
            };
            if (!q.exec() || !copyRows(kTimeRecording, q, mapWorkforce, nullptr))
                return error.isEmpty() ? tableError("entry_time_recording", q.lastError().text()) : false;
        }
    }
    QHash<int, int> progress;
    {
        QSqlQuery q(exchangeFile);
        const auto knownType = [](QVariantHash& v) {
            const int type = v.value(QStringLiteral("type")).toInt();
            return type >= 1 && type <= 4 ? 1 : 0;
        };
        if (!selectRows(q, kProgress, byEntry) || !copyRows(kProgress, q, knownType, &progress))
            return error.isEmpty() ? tableError("entry_progress", q.lastError().text()) : false;
    }
    QHash<int, int> images;
    {
        // Only pictures that a photo of one of the five registers shows travel along.
        QSqlQuery ids(exchangeFile);
        ids.prepare(
            QStringLiteral("SELECT DISTINCT entry_photo.photo_image_id FROM image JOIN entry_photo ON "
                           "image.id = entry_photo.photo_image_id WHERE entry_photo.entry_id = :entryId AND "
                           "entry_photo.type BETWEEN 1 AND 5 ORDER BY entry_photo.photo_image_id"));
        ids.bindValue(QStringLiteral(":entryId"), appEntryId);
        if (!ids.exec())
            return tableError("image", ids.lastError().text());
        QList<int> appImages;
        while (ids.next())
            appImages << ids.value(0).toInt();
        QSqlQuery insert(diary);
        insert.prepare(
            QStringLiteral("INSERT INTO image (image, image_ct, image_width, image_height, thumbnail, "
                           "thumbnail_ct, thumbnail_width, thumbnail_height) VALUES (:image, :image_ct, "
                           ":image_width, :image_height, :thumbnail, :thumbnail_ct, :thumbnail_width, "
                           ":thumbnail_height)"));
        for (const int appImage : qAsConst(appImages)) {
            QSqlQuery q(exchangeFile);
            q.prepare(QStringLiteral("SELECT %1 FROM image WHERE id = :id").arg(columnList(kImage, false)));
            q.bindValue(QStringLiteral(":id"), appImage);
            if (!q.exec() || !q.next())
                return tableError("image", q.lastError().text());
            QVariantHash values;
            QString rowError;
            if (!convertRow(q, kImage, values, rowError))
                return tableError("image", rowError);
            for (const Column& c : kImage.columns)
                insert.bindValue(QLatin1Char(':') + QLatin1String(c.name),
                                 values.value(QLatin1String(c.name)));
            if (!insert.exec())
                return tableError("image", insert.lastError().text());
            images.insert(appImage, insert.lastInsertId().toInt());
        }
    }
    {
        QSqlQuery q(exchangeFile);
        const auto mapPhoto = [&](QVariantHash& v) {
            const int type = v.value(QStringLiteral("type")).toInt();
            if (type < 1 || type > 5)
                return 0;
            v.insert(QStringLiteral("photo_image_id"),
                     images.value(v.value(QStringLiteral("photo_image_id")).toInt(), 0));
            v.insert(QStringLiteral("relation_id"),
                     progress.value(v.value(QStringLiteral("relation_id")).toInt(), 0));
            return 1;
        };
        if (!selectRows(q, kPhoto, byEntry) || !copyRows(kPhoto, q, mapPhoto, nullptr))
            return error.isEmpty() ? tableError("entry_photo", q.lastError().text()) : false;
    }
    {
        QSqlQuery q(exchangeFile);
        const auto knownType = [](QVariantHash& v) {
            const int type = v.value(QStringLiteral("type")).toInt();
            return type == 1 || type == 2 ? 1 : 0;
        };
        if (!selectRows(q, kTask, byEntry) || !copyRows(kTask, q, knownType, nullptr))
            return error.isEmpty() ? tableError("entry_task", q.lastError().text()) : false;
    }
    for (const Table* table : {&kMeasure, &kMaterial, &kDelivery, &kTelephone, &kConcern, &kEquipment}) {
        QSqlQuery q(exchangeFile);
        if (!selectRows(q, *table, byEntry) || !copyRows(*table, q, nullptr, nullptr))
            return error.isEmpty() ? tableError(table->name, q.lastError().text()) : false;
    }
    return true;
}

void VDRReportSynchronisation::renumber(int entryId, int highestNumber, int highestId,
                                        VDRReportSynchronisationResult* result)
{
    QSqlDatabase diary = m_document->database();
    QSqlQuery q(diary);
    int digits = 3;
    if (q.exec(QStringLiteral("SELECT number FROM entry ORDER BY id LIMIT 1")) && q.next())
        digits = std::max(3, VDRDocument::entryNumberDigits(q.value(0).toString()));
    const QString proposed = QString::number(highestNumber + 1).rightJustified(digits, QLatin1Char('0'));
    QString highestText;
    q.prepare(QStringLiteral("SELECT number FROM entry WHERE id = :id"));
    q.bindValue(QStringLiteral(":id"), highestId);
    if (q.exec() && q.next())
        highestText = VDRDocument::cutNumber(q.value(0).toString());

    bool rename = m_renameAnswer;
    if (!m_renameForAll) {
        for (int i = 0; i < m_busy; ++i)
            VDRPrompt::instance()->setBusy(false);
        bool checked = false;
        const int answer = VDRPrompt::instance()->choose(
            VDRPrompt::Warning, tr("Baubericht-Synchronisation"),
            tr("Der importierte Baubericht %1 ist neuer als der Baubericht mit der höchsten "
               "Bauberichts-Nummer: "
               "%2.\nSoll er fortlaufend nummeriert und in %3 umbenannt werden?")
                .arg(result->number(), highestText, proposed),
            {tr("Baubericht umbenennen"), tr("Nein")}, 0, 1, tr("Alle weiteren genauso behandeln"), &checked);
        for (int i = 0; i < m_busy; ++i)
            VDRPrompt::instance()->setBusy(true);
        rename = answer == 0;
        slotRenameCheckboxStateChanged(checked ? Qt::Checked : Qt::Unchecked);
        m_renameAnswer = rename;
    }
    if (!rename)
        return;
    q.prepare(QStringLiteral("SELECT locked FROM entry WHERE id = :id"));
    q.bindValue(QStringLiteral(":id"), entryId);
    const bool locked = q.exec() && q.next() && q.value(0).toInt() != 0;
    QSqlQuery update(diary);
    update.prepare(QStringLiteral("UPDATE entry SET number = :number WHERE id = :id"));
    update.bindValue(QStringLiteral(":number"), proposed + (locked ? QString() : kDraftSuffix));
    update.bindValue(QStringLiteral(":id"), entryId);
    if (!update.exec()) {
        qDebug().noquote() << "SQL-Error:" << update.lastError().text();
        return;
    }
    result->setGivenNumber(proposed);
}

// ---- Documents ----

void VDRReportSynchronisation::importDocuments(const QHash<int, QList<ReplacedDocument>>& replaced)
{
    const QString diaryPath = m_document->getFilepath();
    if (replaced.isEmpty() || diaryPath.isEmpty())
        return;
    const QString documentsPath = VDRDocument::documentsDbPathFor(diaryPath);
    if (!QFileInfo::exists(documentsPath))
        return;
    VDRScopedConnection connection(VDRDocumentsDb::connectionName(), documentsPath);
    if (!connection.isOpen()) {
        message(VDRPrompt::Critical, tr("SQL Error"), connection.lastError().text());
        return;
    }
    QSqlDatabase db = connection.db();
    QSqlDatabase diary = m_document->database();
    const auto sqlError = [&](const QSqlQuery& q) {
        message(VDRPrompt::Critical, tr("SQL Error"), q.lastError().text());
    };
    // A replaced report's documents follow its new rows of the same document name; a document
    // whose row did not come back is a pending removal, undone if the diary is not saved.
    for (auto it = replaced.constBegin(); it != replaced.constEnd(); ++it) {
        const int entryId = it.key();
        for (const ReplacedDocument& d : it.value()) {
            QSqlQuery find(diary);
            find.prepare(
                QStringLiteral("SELECT id FROM %1 WHERE entry_id = :entry AND document = :name ORDER BY id")
                    .arg(d.table));
            find.bindValue(QStringLiteral(":entry"), entryId);
            find.bindValue(QStringLiteral(":name"), d.name);
            if (!find.exec()) {
                sqlError(find);
                continue;
            }
            if (!find.next()) {
                VDRDocumentsDb::setStatus4DocumentRecord(db, d.table, d.recordId, 2);
                continue;
            }
            const int newRecord = find.value(0).toInt();
            QSqlQuery q(db);
            q.prepare(QStringLiteral(
                "UPDATE documents SET orig_record_id = record_id, orig_entry_id = entry_id WHERE "
                "tablename = :table AND record_id = :record AND documentname = :name AND "
                "orig_record_id = -1 AND orig_entry_id = -1 AND (status = 0 OR status = 1)"));
            q.bindValue(QStringLiteral(":table"), d.table);
            q.bindValue(QStringLiteral(":record"), d.recordId);
            q.bindValue(QStringLiteral(":name"), d.name);
            if (!q.exec()) {
                sqlError(q);
                continue;
            }
            q.prepare(QStringLiteral(
                "UPDATE documents SET record_id = :newRecord, entry_id = :entry WHERE tablename = "
                ":table AND record_id = :record AND documentname = :name AND (status = 0 OR "
                "status = 1)"));
            q.bindValue(QStringLiteral(":newRecord"), newRecord);
            q.bindValue(QStringLiteral(":entry"), entryId);
            q.bindValue(QStringLiteral(":table"), d.table);
            q.bindValue(QStringLiteral(":record"), d.recordId);
            q.bindValue(QStringLiteral(":name"), d.name);
            if (!q.exec())
                sqlError(q);
        }
    }
}

// ---- Runs ----

QString VDRReportSynchronisation::buildSummary(bool manual) const
{
    QString text;
    if (!m_failedFiles.isEmpty())
        text +=
            tr("Aufgrund eines Import-Fehlers konnten nicht alle Austauschdateien importiert werden.\n\n");
    if (!m_importedFiles.isEmpty()) {
        text += tr("Folgende Austauschdateien wurden importiert:\n\n");
        for (const QString& file : m_importedFiles)
            text += QStringLiteral("%1\n").arg(file);
        text += QLatin1Char('\n');
    }
    if (!m_failedFiles.isEmpty()) {
        text += tr("\nFolgende Austauschdateien wurden nicht oder nur teilweise importiert:\n\n");
        for (const QString& file : m_failedFiles)
            text += QStringLiteral("%1\n").arg(file);
        text += QStringLiteral("\n\n");
    }
    const std::pair<int, QString> sections[] = {
        {VDRReportSynchronisationResult::Imported,
         tr("Folgende Bauberichte wurden erfolgreich importiert:\n\n")},
        {VDRReportSynchronisationResult::RefusedLocked,
         tr("Folgende Bauberichte wurden nicht importiert, da der Baubericht abgeschlossen ist:\n\n")},
        {VDRReportSynchronisationResult::RefusedDatabaseError,
         tr("Folgende Bauberichte wurden aufgrund von Datenbankfehlern nicht importiert:\n\n")},
        {VDRReportSynchronisationResult::RefusedNewerVersion,
         tr("Folgende Bauberichte wurden nicht importiert, da bereits eine aktuellere Version des Berichts "
            "importiert wurde:\n\n")},
        {VDRReportSynchronisationResult::RefusedDeleted,
         tr("Folgende Bauberichte wurden nicht importiert, da sie bereits gelöscht wurden:\n\n")},
    };
    for (const auto& section : sections) {
        QString lines;
        for (const VDRReportSynchronisationResult* r : m_results) {
            if (r->status() != section.first)
                continue;
            const QString number = r->number().trimmed();
            const QString given = r->givenNumber().trimmed();
            if (section.first == VDRReportSynchronisationResult::Imported) {
                lines += r->userId().isEmpty() ? tr("Bericht %1 als Bericht %2 \n").arg(number, given)
                                               : tr("Bericht %1-%2 als Bericht %3-%4 \n")
                                                     .arg(number, r->userId(), given, r->userId());
            } else {
                lines += r->userId().isEmpty() ? tr("Bericht %1\n").arg(number)
                                               : tr("Bericht %1-%2\n").arg(number, r->userId());
            }
        }
        if (!lines.isEmpty())
            text += section.second + lines + QLatin1Char('\n');
    }
    if (manual && !text.isEmpty())
        text += tr("\nNach dem Import von Berichten sollte das Varduna gespeichert werden.\n");
    return text;
}

void VDRReportSynchronisation::runFiles(const QStringList& paths, bool deleteImported,
                                        bool& projectDataChanged, bool manual)
{
    clearResultList();
    m_importedFiles.clear();
    m_failedFiles.clear();
    m_saveNow = false;
    m_deleteRequested = false;
    m_renameForAll = false;
    m_renameAnswer = false;
    // Edits not yet submitted would be lost when the report list is read again.
    if (m_document->modelEntryAll() && m_document->modelEntryAll()->isDirty())
        m_document->modelEntryAll()->submitAll();

    if (manual)
        VDRPrompt::instance()->beginNotice(tr("Import einer Austauschdatei"),
                                           tr("Import der Austauschdatei läuft."));
    else
        VDRPrompt::instance()->beginNotice(tr("Cloud Synchronisation"), tr("Cloud-Synchronisation läuft."));
    VDRPrompt::instance()->setBusy(true);
    ++m_busy;

    int total = 0;
    for (const QString& path : paths)
        total += countReports(path);
    int before = 0;
    bool aborted = false;
    for (const QString& path : paths) {
        if (aborted) {
            m_failedFiles << path;
            continue;
        }
        int count = 0;
        bool masterData = false;
        const int result =
            importReportExchangeFile(path, total, before, count, masterData, projectDataChanged);
        before += count;
        if (result == FileImported) {
            m_importedFiles << path;
        } else if (result == FileOpenFailed) {
            message(VDRPrompt::Warning, tr("Synchronisationsfehler"),
                    tr("Aufgrund von Fehlern beim Import der Austauschdatei \n%1.\nwurde die Synchronisation "
                       "abgebrochen.\nBitte wenden Sie sich an den Support.")
                        .arg(path));
            m_failedFiles << path;
            aborted = true;
        } else {
            m_failedFiles << path;
        }
    }
    --m_busy;
    VDRPrompt::instance()->setBusy(false);
    VDRPrompt::instance()->endNotice();

    m_lastSummary = buildSummary(manual);
    if (manual) {
        const QString path = paths.value(0);
        if (m_lastSummary.isEmpty() || !m_showSummary)
            return;
        // Only an imported file may be deleted; a refused one stays where it is.
        bool remove = false;
        const bool offerDelete = m_importedFiles.contains(path);
        const int answer = VDRPrompt::instance()->choose(
            VDRPrompt::Information, tr("Ergebnis der Synchronisation"), m_lastSummary,
            {tr("Jetzt speichern"), tr("Später speichern")}, 0, 1,
            offerDelete ? tr("Importierte Austauschdatei %1 löschen").arg(QFileInfo(path).fileName())
                        : QString(),
            &remove);
        m_saveNow = answer == 0;
        m_deleteRequested = offerDelete && remove;
        if (!m_saveNow)
            deleteRequestedFile();
        return;
    }
    if (!m_lastSummary.isEmpty() && m_showSummary)
        message(VDRPrompt::Information, tr("Ergebnis der Synchronisation"), m_lastSummary);
    if (deleteImported) {
        for (const QString& path : qAsConst(m_importedFiles)) {
            if (!VDRFileOps::remove(path))
                message(
                    VDRPrompt::Warning, tr("Dateifehler"),
                    tr("Die importierte Austauschdatei\n%1\nkonnte nicht gelöscht werden.\nBitte löschen Sie "
                       "diese Datei manuell.")
                        .arg(path));
        }
    }
}

bool VDRReportSynchronisation::deleteRequestedFile()
{
    if (!m_deleteRequested || m_importedFiles.isEmpty())
        return true;
    m_deleteRequested = false;
    const QString path = m_importedFiles.constFirst();
    if (VDRFileOps::remove(path))
        return true;
    message(
        VDRPrompt::Warning, tr("Dateifehler"),
        tr("Die Austauschdatei\n%1\nkonnte nicht gelöscht werden.\nBitte löschen Sie diese Datei manuell.")
            .arg(path));
    return false;
}

int VDRReportSynchronisation::importCloudReportExchangeFiles(const QString& cloudFolder,
                                                             const QStringList& fileNames, bool& imported,
                                                             bool& projectDataChanged)
{
    imported = false;
    if (fileNames.isEmpty())
        return 0;
    QStringList paths;
    for (const QString& name : fileNames) {
        // Names only: a name that climbs out of the folder is not the app's file.
        paths << (QFileInfo(name).fileName() == name
                      ? QDir(cloudFolder).filePath(name)
                      : QDir(cloudFolder).filePath(QFileInfo(name).fileName()));
    }
    m_confineTo = cloudFolder;
    runFiles(paths, true, projectDataChanged, false);
    m_confineTo.clear();
    imported = !m_importedFiles.isEmpty();
    return m_failedFiles.size();
}

int VDRReportSynchronisation::importReportExchangeFiles(const QStringList& paths, bool deleteImported,
                                                        bool& projectDataChanged)
{
    runFiles(paths, deleteImported, projectDataChanged, false);
    return m_failedFiles.size();
}

int VDRReportSynchronisation::importManualReportExchangeFile(const QString& path, bool& projectDataChanged)
{
    runFiles({path}, false, projectDataChanged, true);
    return m_failedFiles.isEmpty() ? FileImported : FileRefused;
}
