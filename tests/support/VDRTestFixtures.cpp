#include "VDRTestFixtures.h"

#include "document/VDRDocument.h"

#include <QCoreApplication>
#include <QCryptographicHash>
#include <QDebug>
#include <QDir>
#include <QFile>
#include <QProcess>
#include <QRegularExpression>
#include <QSettings>
#include <QSqlError>
#include <QSqlQuery>
#include <QSqlRecord>
#include <QStandardPaths>
#include <QUuid>

namespace VDRTestFixtures {

namespace {
template <typename F> auto withDb(const QString& path, F work)
{
    const QString name = QStringLiteral("FIXTURE_") + QUuid::createUuid().toString(QUuid::Id128);
    decltype(work(std::declval<QSqlDatabase>())) result{};
    {
        QSqlDatabase db = QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), name);
        db.setDatabaseName(path);
        if (db.open())
            result = work(db);
        db.close();
    }
    QSqlDatabase::removeDatabase(name);
    return result;
}
} // namespace

void isolateSettings(const QString& folder)
{
    // The program's own names, so that settings written here are the ones a child process reads.
    QCoreApplication::setOrganizationName(QStringLiteral("Korvant - Software"));
    QCoreApplication::setApplicationName(QStringLiteral("Varduna"));
    QStandardPaths::setTestModeEnabled(true);
    QSettings::setPath(QSettings::NativeFormat, QSettings::UserScope, folder);
    QSettings::setPath(QSettings::IniFormat, QSettings::UserScope, folder);
    qputenv("XDG_CONFIG_HOME", QFile::encodeName(folder));
}

QString isolateRun(const QString& folder)
{
    isolateSettings(folder + QStringLiteral("/settings"));
    const QString temporary = folder + QStringLiteral("/tmp");
    if (!QDir().mkpath(temporary))
        return QString();
    qputenv("TMPDIR", QFile::encodeName(temporary));
    return temporary;
}

bool createDiary(const QString& path)
{
    VDRDocument doc;
    if (!doc.createDocument(true))
        return false;
    const bool ok = doc.writeWorkingCopyTo(path);
    doc.closeDocument();
    return ok;
}

bool openDiary(VDRDocument& doc, const QString& path)
{
    bool showError = true;
    return doc.openDocument(path, showError);
}

bool setProjectName(VDRDocument& doc, const QString& name)
{
    return doc.modelVdr()->setData(0, QStringLiteral("name"), name) && doc.modelVdr()->submitAll();
}

bool saveGenerations(const QString& path, const QStringList& names)
{
    for (const QString& name : names) {
        VDRDocument doc;
        if (!openDiary(doc, path) || !setProjectName(doc, name) || doc.saveDocument() != 0 ||
            !doc.closeDocument())
            return false;
    }
    return true;
}

QString projectNameIn(const QString& path)
{
    return queryValue(path, QStringLiteral("SELECT name FROM vdr")).toString();
}

bool isIntact(const QString& path)
{
    return queryValue(path, QStringLiteral("PRAGMA quick_check")).toString() == QLatin1String("ok");
}

bool writeFile(const QString& path, const QByteArray& bytes)
{
    QFile file(path);
    return file.open(QIODevice::WriteOnly) && file.write(bytes) == bytes.size() && file.flush();
}

QString reportInsertSql(int id, const QString& number)
{
    return QStringLiteral(
               "INSERT INTO entry (id, locked, number, inspection_date, inspection_time_from, "
               "inspection_time_to, env_time, env_weather1, env_weather2, env_weather3, env_temperature, "
               "env_humidity, progress, deficiencies, construction_material_sample, print_notice, "
               "print_telephone_notice, user_id) VALUES (%1, 0, '%2', '2024-03-05', '07:00:00', '16:30:00', "
               "'00:00:00', ' ', ' ', ' ', ' ', ' ', ' ', ' ', 0, 0, 0, 'AB')")
        .arg(id)
        .arg(number);
}

QString imageInsertSql(qint64 bytes)
{
    return QStringLiteral("INSERT INTO image (image, image_ct, image_width, image_height, thumbnail, "
                          "thumbnail_ct, thumbnail_width, thumbnail_height) VALUES (zeroblob(%1), "
                          "'image/jpeg', 1, 1, zeroblob(10), 'image/jpeg', 1, 1)")
        .arg(bytes);
}

bool execOn(QSqlDatabase db, const QStringList& statements)
{
    for (const QString& sql : statements) {
        QSqlQuery q(db);
        if (!q.exec(sql)) {
            qWarning().noquote() << "fixture SQL failed:" << sql << q.lastError().text();
            return false;
        }
    }
    return true;
}

QStringList textsOn(QSqlDatabase db, const QString& sql)
{
    QStringList result;
    QSqlQuery q(db);
    if (!q.exec(sql))
        return {QStringLiteral("SQL failed: ") + q.lastError().text()};
    while (q.next()) {
        QStringList values;
        for (int i = 0; i < q.record().count(); ++i)
            values << (q.value(i).isNull() ? QStringLiteral("NULL") : q.value(i).toString());
        result << values.join(QLatin1Char('|'));
    }
    return result;
}

bool execSql(const QString& path, const QStringList& statements)
{
    return withDb(path, [&](QSqlDatabase db) { return execOn(db, statements); });
}

QVariant queryValue(const QString& path, const QString& sql)
{
    return withDb(path, [&](QSqlDatabase db) {
        QSqlQuery q(db);
        if (q.exec(sql) && q.next())
            return q.value(0);
        return QVariant();
    });
}

QList<QVariantList> queryRows(const QString& path, const QString& sql)
{
    return withDb(path, [&](QSqlDatabase db) {
        QList<QVariantList> rows;
        QSqlQuery q(db);
        if (!q.exec(sql))
            qWarning().noquote() << "fixture query failed:" << sql << q.lastError().text();
        while (q.next()) {
            QVariantList row;
            for (int i = 0; i < q.record().count(); ++i)
                row << q.value(i);
            rows << row;
        }
        return rows;
    });
}

QStringList queryTexts(const QString& path, const QString& sql)
{
    QStringList result;
    for (const QVariantList& row : queryRows(path, sql)) {
        QStringList values;
        for (const QVariant& v : row)
            values << (v.isNull() ? QStringLiteral("NULL") : v.toString());
        result << values.join(QLatin1Char('|'));
    }
    return result;
}

QStringList tableLayout(const QString& path, const QString& table)
{
    QStringList result;
    for (const QVariantList& row : queryRows(path, QStringLiteral("PRAGMA table_info(%1)").arg(table)))
        result << QStringLiteral("%1 %2 %3 %4 %5")
                      .arg(row[1].toString(), row[2].toString(), row[3].toString(),
                           row[4].isNull() ? QStringLiteral("-") : row[4].toString(), row[5].toString());
    return result;
}

QStringList tableNames(const QString& path)
{
    QStringList result;
    for (const QVariantList& row : queryRows(
             path, QStringLiteral("SELECT name FROM sqlite_master WHERE type = 'table' AND name NOT LIKE "
                                  "'sqlite_%' ORDER BY name")))
        result << row[0].toString();
    return result;
}

QByteArray fileHash(const QString& path)
{
    QFile f(path);
    if (!f.open(QIODevice::ReadOnly))
        return QByteArray();
    return QCryptographicHash::hash(f.readAll(), QCryptographicHash::Sha256);
}

bool damageFile(const QString& path)
{
    QFile f(path);
    if (!f.open(QIODevice::ReadWrite))
        return false;
    const qint64 size = f.size();
    // Page 1 holds the schema: scribbling over the b-tree pages after it leaves the header intact
    // but makes quick_check fail.
    const qint64 pageSize = 4096;
    for (qint64 offset = pageSize; offset + 64 < size; offset += pageSize) {
        f.seek(offset);
        f.write(QByteArray(64, '\xA5'));
    }
    return f.flush();
}

QStringList folderState(const QString& folder)
{
    QStringList state;
    const QDir dir(folder);
    for (const QString& name : dir.entryList(QDir::Files | QDir::Hidden, QDir::Name))
        state << name + QLatin1Char('=') + QString::fromLatin1(fileHash(dir.filePath(name)).toHex());
    return state;
}

bool damageSchemaPage(const QString& path)
{
    QFile f(path);
    if (!f.open(QIODevice::ReadWrite) || !f.seek(100))
        return false;
    f.write(QByteArray(8, '\xFF'));
    return f.flush();
}

bool setImmutable(const QString& path, bool immutable)
{
    return QProcess::execute(QStringLiteral("chattr"),
                             {immutable ? QStringLiteral("+i") : QStringLiteral("-i"), path}) == 0;
}

SmallDisk::SmallDisk(const QString& folder, qint64 bytes) : m_folder(folder)
{
    QDir().mkpath(folder);
    QProcess mount;
    mount.start(QStringLiteral("mount"),
                {QStringLiteral("-t"), QStringLiteral("tmpfs"), QStringLiteral("-o"),
                 QStringLiteral("size=%1").arg(bytes), QStringLiteral("tmpfs"), folder});
    m_mounted =
        mount.waitForFinished(10000) && mount.exitStatus() == QProcess::NormalExit && mount.exitCode() == 0;
}

SmallDisk::~SmallDisk()
{
    if (m_mounted)
        QProcess::execute(QStringLiteral("umount"), {QStringLiteral("-l"), m_folder});
}

bool SmallDisk::fill()
{
    QFile filler(QDir(m_folder).filePath(QStringLiteral("filler.bin")));
    if (!filler.open(QIODevice::WriteOnly | QIODevice::Append | QIODevice::Unbuffered))
        return false;
    const QByteArray block(4096, 'x');
    while (filler.write(block) == block.size()) {
    }
    return true;
}

bool createOldestLayoutDiary(const QString& path, const QString& fileVersion)
{
    QFile::remove(path);
    return execSql(
        path,
        {
            "CREATE TABLE id_generator (id_table TEXT PRIMARY KEY, id_counter INTEGER NOT NULL)",
            "CREATE TABLE meta (key TEXT PRIMARY KEY, value TEXT NOT NULL)",
            "CREATE TABLE image (id INTEGER NOT NULL PRIMARY KEY AUTOINCREMENT, image BLOB NOT NULL, "
            "image_ct TEXT NOT "
            "NULL, image_width INT NOT NULL, image_height INT NOT NULL, thumbnail BLOB NOT NULL, "
            "thumbnail_ct TEXT NOT "
            "NULL, thumbnail_width INT NOT NULL, thumbnail_height INT NOT NULL)",
            "CREATE TABLE vdr (id INTEGER NOT NULL PRIMARY KEY, name VARCHAR (64) NOT NULL, logo_image_id "
            "INTEGER, "
            "logo_align INTEGER NOT NULL, headline_left TEXT NOT NULL, headline_center TEXT NOT NULL, "
            "headline_right TEXT "
            "NOT NULL, footer_left TEXT NOT NULL, footer_center TEXT NOT NULL, footer_right TEXT NOT NULL, "
            "createdate "
            "DATETIME NOT NULL, entrycounter INTEGER NOT NULL, email_subject TEXT NOT NULL, email_body TEXT "
            "NOT NULL, "
            "display_empty_categories INTEGER NOT NULL)",
            "CREATE TABLE company (id INTEGER NOT NULL PRIMARY KEY, category INTEGER NOT NULL, type VARCHAR "
            "(64) NOT NULL, "
            "firstname VARCHAR (64) NOT NULL, lastname VARCHAR (64) NOT NULL, company VARCHAR (128) NOT "
            "NULL, street "
            "VARCHAR (128) NOT NULL, plz VARCHAR (16) NOT NULL, city VARCHAR (64) NOT NULL, telephone "
            "VARCHAR (64) NOT "
            "NULL, telefax VARCHAR (64) NOT NULL, mobile VARCHAR (64) NOT NULL, email VARCHAR (128) NOT "
            "NULL)",
            "CREATE TABLE entry (id INTEGER NOT NULL PRIMARY KEY, locked INTEGER NOT NULL, "
            "persistent_document BLOB, "
            "persistent_document_ct TEXT, number TEXT NOT NULL, inspection_date DATE NOT NULL, "
            "inspection_time_from TIME "
            "NOT NULL, inspection_time_to TIME NOT NULL, env_time TIME NOT NULL, env_weather1 TEXT NOT NULL, "
            "env_weather2 "
            "TEXT NOT NULL, env_weather3 TEXT NOT NULL, env_temperature TEXT NOT NULL, env_humidity TEXT NOT "
            "NULL, "
            "progress TEXT NOT NULL, deficiencies TEXT NOT NULL, tests TEXT, interventions TEXT, "
            "special_incidents TEXT, "
            "construction_material_sample INTEGER NOT NULL)",
            "CREATE TABLE entry_attendee (id INTEGER NOT NULL PRIMARY KEY, entry_id INTEGER NOT NULL, "
            "company_id INTEGER, "
            "comment TEXT NOT NULL)",
            "CREATE TABLE entry_workforce (id INTEGER NOT NULL PRIMARY KEY, entry_id INTEGER NOT NULL, "
            "company_id INTEGER, "
            "comment TEXT NOT NULL, count1 INTEGER, type1 TEXT, count2 INTEGER, type2 TEXT, count3 INTEGER, "
            "type3 TEXT)",
            "CREATE TABLE entry_progress (id INTEGER NOT NULL PRIMARY KEY, entry_id INTEGER NOT NULL, type "
            "INTEGER NOT "
            "NULL, description TEXT NOT NULL, company_id INTEGER, date DATE NOT NULL)",
            "CREATE TABLE entry_photo (id INTEGER NOT NULL PRIMARY KEY, entry_id INTEGER NOT NULL, pos "
            "INTEGER NOT NULL, "
            "type INTEGER NOT NULL, photo_image_id INTEGER, caption TEXT NOT NULL, comment TEXT NOT NULL, "
            "date DATE NOT "
            "NULL)",
            "CREATE TABLE entry_task (id INTEGER NOT NULL PRIMARY KEY, entry_id INTEGER NOT NULL, type "
            "INTEGER NOT NULL, "
            "description TEXT NOT NULL, company_id INTEGER)",
            "CREATE TABLE entry_constructionmeasure (id INTEGER NOT NULL PRIMARY KEY, entry_id INTEGER NOT "
            "NULL, "
            "description TEXT NOT NULL, timefrom TIME NOT NULL, timeto TIME NOT NULL, company_id INTEGER)",
            "CREATE TABLE entry_constructionmaterial (id INTEGER NOT NULL PRIMARY KEY, entry_id INTEGER NOT "
            "NULL, material "
            "TEXT NOT NULL, process TEXT NOT NULL, company_id INTEGER, material_temperature INTEGER NOT "
            "NULL, conditions "
            "TEXT NOT NULL, conditions_ok INTEGER, workflow TEXT NOT NULL, workflow_ok INTEGER, note TEXT "
            "NOT NULL)",
            "CREATE TABLE entry_scheduleddelivery (id INTEGER NOT NULL PRIMARY KEY, entry_id INTEGER NOT "
            "NULL, "
            "deliverynumber TEXT NOT NULL, deliveryindex TEXT NOT NULL, deliverydate DATE NOT NULL, "
            "company_id INTEGER, "
            "comment TEXT NOT NULL)",
            "CREATE TABLE addresslist (id INTEGER NOT NULL PRIMARY KEY, name TEXT NOT NULL)",
            "CREATE TABLE addresslist_item (id INTEGER NOT NULL PRIMARY KEY, addresslist_id INTEGER NOT "
            "NULL, active "
            "INTEGER NOT NULL, bcc INTEGER NOT NULL, type VARCHAR (64) NOT NULL, lastname VARCHAR (64) NOT "
            "NULL, company "
            "VARCHAR (128) NOT NULL, email VARCHAR (128) NOT NULL)",
            QStringLiteral("INSERT INTO meta VALUES ('fileversion', '%1')").arg(fileVersion),
            "INSERT INTO vdr VALUES (1, 'Altbau Schillerstraße', NULL, 2, 'Altbau', '', '', 'Korvant', "
            "'Varduna', '', "
            "'2009-03-01T08:00:00', 2, '', '', 0)",
            "INSERT INTO company VALUES (1, 1, 'Bauherr', 'Anna', 'Müller', '', '', '', '', '', '', '', '')",
            "INSERT INTO company VALUES (2, 2, 'Rohbau', '', '', 'Bau GmbH', '', '', '', '', '', '', '')",
            "INSERT INTO company VALUES (3, 2, 'Elektro', '', '', 'Strom AG', '', '', '', '', '', '', '')",
            "INSERT INTO entry VALUES (1, 1, NULL, NULL, '001', '2009-03-02', '08:00:00', '16:00:00', "
            "'08:00:00', "
            "'sonnig', '', '', '12', '', 'Rohbau', '', NULL, NULL, NULL, 0)",
            "INSERT INTO entry VALUES (2, 0, NULL, NULL, '002 (Entwurf)', '2009-03-03', '08:00:00', "
            "'16:00:00', "
            "'08:00:00', 'Regen', '', '', '8', '', '', '', NULL, NULL, NULL, 0)",
            "INSERT INTO entry_attendee VALUES (1, 1, 1, 'anwesend')",
            "INSERT INTO entry_workforce VALUES (4, 1, 2, 'Kolonne A', 2, 'Maurer', 3, 'Polier', 0, '')",
            "INSERT INTO entry_workforce VALUES (5, 1, 3, 'Kolonne B', 1, 'Elektriker', 0, 'Helfer', 4, "
            "'Elektriker')",
            "INSERT INTO entry_workforce VALUES (6, 2, 2, 'leer', 0, '', 0, '', 0, '')",
            "INSERT INTO entry_progress VALUES (1, 1, 1, 'Lieferung verspätet', 2, '2009-03-02')",
            "INSERT INTO entry_progress VALUES (2, 1, 4, 'Riss in Wand', 3, '2009-03-02')",
            "INSERT INTO entry_task VALUES (1, 1, 1, 'Gerüst prüfen', 2)",
            "INSERT INTO entry_constructionmeasure VALUES (1, 1, 'Betonieren', '08:00:00', '12:00:00', 2)",
            "INSERT INTO entry_constructionmaterial VALUES (1, 1, 'Beton C25/30', 'Einbau', 2, 5, 'trocken', "
            "1, "
            "'zügig', 0, 'Probe genommen')",
            "INSERT INTO entry_scheduleddelivery VALUES (1, 1, 'P-100', 'a', '2009-03-02', 2, 'Grundriss')",
            "INSERT INTO id_generator VALUES ('entry', 2)",
            "INSERT INTO id_generator VALUES ('entry_workforce', 6)",
            "INSERT INTO id_generator VALUES ('company', 3)",
        });
}

QString tool(const QString& program, const QStringList& args)
{
    QProcess p;
    p.start(program, args);
    if (!p.waitForFinished(60000))
        return QString();
    return QString::fromUtf8(p.readAllStandardOutput());
}

CliRun runCli(const QStringList& args)
{
    QProcess p;
    p.start(QCoreApplication::applicationDirPath() + QStringLiteral("/varduna-cli"), args);
    CliRun run;
    if (!p.waitForFinished(120000))
        return run;
    run.exitCode = p.exitStatus() == QProcess::NormalExit ? p.exitCode() : -1;
    run.out = QString::fromUtf8(p.readAllStandardOutput());
    // The tool writes its messages in the locale's encoding.
    run.err = QString::fromLocal8Bit(p.readAllStandardError());
    return run;
}

QString pdfText(const QString& pdf, int page)
{
    QStringList args{QStringLiteral("-layout")};
    if (page > 0)
        args << QStringLiteral("-f") << QString::number(page) << QStringLiteral("-l")
             << QString::number(page);
    return tool(QStringLiteral("pdftotext"), args << pdf << QStringLiteral("-"));
}

int pdfPages(const QString& pdf)
{
    const auto m =
        QRegularExpression(QStringLiteral("Pages:\\s+(\\d+)")).match(tool(QStringLiteral("pdfinfo"), {pdf}));
    return m.hasMatch() ? m.captured(1).toInt() : 0;
}

} // namespace VDRTestFixtures
