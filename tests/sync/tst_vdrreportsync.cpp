#include "VDRExchangeFileBuilder.h"
#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "document/VDRDocumentsDb.h"
#include "sync/VDRMasterDataExport.h"
#include "sync/VDRReportSynchronisation.h"

#include <QColor>
#include <QImage>
#include <QSqlError>
#include <QSqlQuery>
#include <QtTest>

#include <memory>

using namespace VDRTestFixtures;

namespace {
const QDateTime kT1(QDate(2026, 3, 7), QTime(16, 5, 9));
const QDateTime kT2(QDate(2026, 3, 7), QTime(16, 5, 10));
const QDateTime kCreated(QDate(2026, 3, 1), QTime(7, 30, 0));
const QString kSync = QStringLiteral("Synchronisationsfehler");
const QString kDbError = QStringLiteral("Datenbankfehler");
const QString kNotice = QStringLiteral("Cloud Synchronisation");
} // namespace

class TestVDRReportSync : public VDRTestCase
{
    Q_OBJECT

    void initTest() override;
    void cleanupTest() override;

private slots:
    void newReportWithAllLists();
    void replacing_data();
    void replacing();
    void reportsWithoutIdentity_data();
    void reportsWithoutIdentity();
    void refusedFiles_data();
    void refusedFiles();
    void untrustedRows_data();
    void untrustedRows();
    void failureLeavesDiaryAsBefore_data();
    void failureLeavesDiaryAsBefore();
    void renumbering_data();
    void renumbering();
    void documentsFollowReplacedRows();
    void cloudFolder();
    void masterData_data();
    void masterData();
    void commandLine();
    void masterDataForTheApp();
    void followUpDiary_data();
    void followUpDiary();

private:
    QString exchangePath(const QDateTime& stamp = kT1) const;
    // A file with one report numbered 'number', created on the app at kCreated, with every list.
    void writeFullFile(const QString& path, const QDateTime& version,
                       const QString& progress = QStringLiteral("Rohbau"));
    // Imports files as a cloud run would (summary not shown) and returns the summary.
    QString import(const QStringList& paths, const std::function<void()>& expectations = nullptr);
    QStringList rows(const QString& sql) { return textsOn(m_doc->database(), sql); }
    QVariant value(const QString& sql);
    // Every row of every table of the working copy, with the structure: equal dumps, equal diaries.
    QStringList dump();
    // Reports 001 to 'count' (locked, the last 'open' ones not), a frozen company, a logo.
    void fillDiary(int count, int open);
    // Runs varduna-cli; returns the exit code.
    int cli(const QStringList& arguments, QString* out, QString* err);

    QString m_case;
    QString m_diary;
    std::unique_ptr<VDRDocument> m_doc;
    int m_cases = 0;
};

void TestVDRReportSync::initTest()
{
    m_case = m_dir.filePath(QStringLiteral("case%1").arg(++m_cases));
    QVERIFY(QDir().mkpath(m_case));
    m_diary = m_case + QStringLiteral("/Baustelle.vd2");
    QVERIFY(createDiary(m_diary));
    m_doc = std::make_unique<VDRDocument>();
    bool showError = true;
    QVERIFY(m_doc->openDocument(m_diary, showError));
    // Start without reports: the app's reports are the only ones unless a test adds some.
    QVERIFY(QSqlQuery(m_doc->database()).exec(QStringLiteral("DELETE FROM entry")));
    m_doc->modelEntryAll()->select();
}

void TestVDRReportSync::cleanupTest()
{
    m_doc.reset();
}

QString TestVDRReportSync::exchangePath(const QDateTime& stamp) const
{
    return m_case + QStringLiteral("/Baustelle.") + stamp.toString(QStringLiteral("yyyy-MM-ddThh-mm-ss")) +
           QStringLiteral(".vdx");
}

void TestVDRReportSync::writeFullFile(const QString& path, const QDateTime& version, const QString& progress)
{
    VDRExchangeFileBuilder file(path, QStringLiteral("Baustelle.vd2"), version);
    QVERIFY(file.isOk());
    const int entry = file.addReport(QStringLiteral("001 (Entwurf)"), QDate(2026, 3, 7), kCreated,
                                     {{"progress", progress}, {"notice", QVariant()}});
    QVERIFY(entry > 0);
    QVERIFY(file.addFullReportContent(entry));
}

QString TestVDRReportSync::import(const QStringList& paths, const std::function<void()>& expectations)
{
    VDRReportSynchronisation sync(m_doc.get());
    sync.setShowSummary(false);
    bool projectChanged = false;
    m_prompt.expect(kNotice);
    if (expectations)
        expectations();
    sync.importReportExchangeFiles(paths, false, projectChanged);
    return sync.lastSummary();
}

QVariant TestVDRReportSync::value(const QString& sql)
{
    QSqlQuery q(m_doc->database());
    return q.exec(sql) && q.next() ? q.value(0) : QVariant();
}

QStringList TestVDRReportSync::dump()
{
    QStringList result = rows(QStringLiteral("SELECT type, name, sql FROM sqlite_master ORDER BY name"));
    for (const QString& table :
         rows(QStringLiteral("SELECT name FROM sqlite_master WHERE type = 'table' ORDER BY name"))) {
        for (const QString& row : rows(QStringLiteral("SELECT * FROM \"%1\" ORDER BY rowid").arg(table)))
            result << table + QLatin1Char(':') + row;
    }
    return result;
}

// A report with every list, photos and a dictation arrives under new ids with consistent references,
// and the exchange file is left exactly as it was.
void TestVDRReportSync::newReportWithAllLists()
{
    const QString path = exchangePath();
    writeFullFile(path, kT1);
    const QByteArray before = fileHash(path);
    const QString summary = import({path});
    QVERIFY2(summary.contains(QStringLiteral("Folgende Bauberichte wurden erfolgreich importiert:\n\nBericht "
                                             "001 (Entwurf)-AB als Bericht 001 (Entwurf)-AB \n\n")),
             qPrintable(summary));
    QCOMPARE(fileHash(path), before);

    QCOMPARE(rows(QStringLiteral("SELECT count(*) FROM entry")), QStringList{QStringLiteral("1")});
    const int id = value(QStringLiteral("SELECT id FROM entry")).toInt();
    QVERIFY(id > 0 && id < 700);
    QCOMPARE(rows(QStringLiteral(
                 "SELECT number, user_id, exported_by_app, import_version, notice, progress FROM entry")),
             QStringList{QStringLiteral("001 (Entwurf)|AB|0|2026-03-07T16:05:09||Rohbau")});
    QCOMPARE(value(QStringLiteral("SELECT entrycounter FROM vdr WHERE id = 1")).toInt(), id);
    // Every list, each row under a new id of the diary's counters.
    const QString counts = QStringLiteral(
        "SELECT (SELECT count(*) FROM entry_attendee), (SELECT count(*) FROM entry_workforce), "
        "(SELECT count(*) FROM entry_time_recording), (SELECT group_concat(type) FROM (SELECT type FROM "
        "entry_progress "
        "ORDER BY type)), (SELECT group_concat(type) FROM (SELECT type FROM entry_photo ORDER BY type)), "
        "(SELECT group_concat(type) FROM (SELECT type FROM entry_task ORDER BY type)), "
        "(SELECT count(*) FROM entry_constructionmeasure), (SELECT count(*) FROM "
        "entry_constructionmaterial), "
        "(SELECT count(*) FROM entry_scheduleddelivery), (SELECT count(*) FROM entry_telephone_notice), "
        "(SELECT count(*) FROM entry_concern), (SELECT count(*) FROM entry_equipment), (SELECT count(*) FROM "
        "image), "
        "(SELECT count(*) FROM audio)");
    QCOMPARE(rows(counts), QStringList{QStringLiteral("1|1|1|1,2,3,4|1,2,5|1,2|1|1|1|1|1|1|2|1")});
    QCOMPARE(
        value(QStringLiteral("SELECT count(*) FROM entry_attendee WHERE id >= 700 OR entry_id <> %1").arg(id))
            .toInt(),
        0);
    // References point at the new rows.
    QCOMPARE(
        rows(QStringLiteral("SELECT (SELECT count(*) FROM entry_time_recording t JOIN entry_workforce w ON "
                            "w.id = t.workforce_id WHERE t.time_from = '07:00:00.000'), (SELECT count(*) "
                            "FROM entry_photo p JOIN entry_progress d ON d.id = p.relation_id WHERE d.type "
                            "= 4 AND p.type = 2), (SELECT count(*) FROM entry_photo p JOIN image i ON i.id "
                            "= p.photo_image_id)")),
        QStringList{QStringLiteral("1|1|3")});
    QCOMPARE(value(QStringLiteral("SELECT i.image FROM entry_photo p JOIN image i ON i.id = p.photo_image_id "
                                  "WHERE p.caption = 'Riss'"))
                 .toByteArray(),
             VDRExchangeFileBuilder::jpeg(Qt::green));
    QCOMPARE(
        value(QStringLiteral("SELECT a.recording FROM entry e JOIN audio a ON a.id = e.progress_audio_id"))
            .toByteArray(),
        QByteArray("RIFF-audio"));
    // Values keep their types: a real stays a real, a time is a time of the diary's form.
    QCOMPARE(rows(QStringLiteral("SELECT typeof(quantity), quantity, unit FROM entry_constructionmaterial")),
             QStringList{QStringLiteral("real|12.5|m3")});
    QCOMPARE(rows(QStringLiteral("SELECT typeof(operating_time), entry_time, location FROM entry_equipment, "
                                 "entry_constructionmeasure")),
             QStringList{QStringLiteral("integer|NULL|Achse 4")});
    // The report list shows it.
    QCOMPARE(m_doc->modelEntryAll()->rowCount(), 1);
}

// The same file twice, a later edit on the app, a report the desktop locked meanwhile, an older file.
void TestVDRReportSync::replacing_data()
{
    QTest::addColumn<QString>("second");
    QTest::addColumn<QString>("section");
    QTest::addColumn<QString>("progress");
    // clang-format off
    QTest::newRow("same file twice") << "same" << "erfolgreich importiert" << "Rohbau";
    QTest::newRow("edited on the app") << "edited" << "erfolgreich importiert" << "Dach";
    QTest::newRow("locked on the desktop") << "locked" << "da der Baubericht abgeschlossen ist" << "Rohbau";
    QTest::newRow("older file") << "older" << "bereits eine aktuellere Version" << "Rohbau";
    // clang-format on
}

void TestVDRReportSync::replacing()
{
    QFETCH(QString, second);
    QFETCH(QString, section);
    QFETCH(QString, progress);
    const QDateTime first = second == QLatin1String("older") ? kT2 : kT1;
    const QString path1 = exchangePath(first);
    writeFullFile(path1, first);
    import({path1});
    const int id = value(QStringLiteral("SELECT id FROM entry")).toInt();
    // The diary numbers the report on its own meanwhile.
    QVERIFY(QSqlQuery(m_doc->database()).exec(QStringLiteral("UPDATE entry SET number = '007 (Entwurf)'")));
    if (second == QLatin1String("locked")) {
        m_doc->modelEntryAll()->select();
        QVERIFY(m_doc->lockEntry(0, true));
    }
    const QStringList before = dump();

    const QDateTime later = second == QLatin1String("same")    ? kT1
                            : second == QLatin1String("older") ? kT1
                                                               : kT2;
    const QString path2 = second == QLatin1String("same") ? path1 : exchangePath(later);
    if (path2 != path1)
        writeFullFile(path2, later,
                      second == QLatin1String("edited") ? QStringLiteral("Dach") : QStringLiteral("Rohbau"));
    const QString summary = import({path2});
    QVERIFY2(summary.contains(section), qPrintable(summary));

    QCOMPARE(value(QStringLiteral("SELECT count(*) FROM entry")).toInt(), 1);
    QCOMPARE(value(QStringLiteral("SELECT id FROM entry")).toInt(), id);
    QCOMPARE(value(QStringLiteral("SELECT progress FROM entry")).toString(), progress);
    QVERIFY(value(QStringLiteral("SELECT number FROM entry")).toString().startsWith(QLatin1String("007")));
    if (section.contains(QLatin1String("erfolgreich"))) {
        QVERIFY2(summary.contains(QStringLiteral("als Bericht 007-AB")), qPrintable(summary));
        // No duplicates, and the replaced report's pictures and dictation are gone.
        QCOMPARE(
            rows(QStringLiteral("SELECT (SELECT count(*) FROM entry_photo), (SELECT count(*) FROM image), "
                                "(SELECT count(*) FROM audio), (SELECT count(*) FROM entry_workforce)")),
            QStringList{QStringLiteral("3|2|1|1")});
    } else {
        QCOMPARE(dump(), before);
    }
}

// Reports from before the identity are known by their id: deleted in the diary, still there, new.
void TestVDRReportSync::reportsWithoutIdentity_data()
{
    QTest::addColumn<int>("appId");
    QTest::addColumn<bool>("keepInDiary");
    QTest::addColumn<QString>("section");
    QTest::addColumn<QString>("ids");
    // clang-format off
    QTest::newRow("deleted in the diary") << 5 << false << "da sie bereits gelöscht wurden:\n\nBericht 005\n" << "";
    QTest::newRow("still in the diary") << 5 << true << "Bericht 005 als Bericht 005 \n" << "5|Dach";
    QTest::newRow("beyond the diary's counter") << 9 << false << "Bericht 005 als Bericht 005 \n" << "6|Dach";
    // clang-format on
}

void TestVDRReportSync::reportsWithoutIdentity()
{
    QFETCH(int, appId);
    QFETCH(bool, keepInDiary);
    QFETCH(QString, section);
    QFETCH(QString, ids);
    QSqlDatabase db = m_doc->database();
    QVERIFY(QSqlQuery(db).exec(QStringLiteral(
        "INSERT INTO entry (id, locked, number, inspection_date, inspection_time_from, inspection_time_to, "
        "env_time, "
        "env_weather1, env_weather2, env_weather3, env_temperature, env_humidity, progress, deficiencies, "
        "construction_material_sample, print_notice, print_telephone_notice) VALUES (5, 0, '005 (Entwurf)', "
        "'2026-03-01', '07:00', '08:00', '08:00', '', '', '', '', '', 'alt', '', 0, 1, 1)")));
    QVERIFY(QSqlQuery(db).exec(
        QStringLiteral("UPDATE id_generator SET id_counter = 5 WHERE id_table = 'entry'")));
    if (!keepInDiary)
        QVERIFY(QSqlQuery(db).exec(QStringLiteral("DELETE FROM entry")));
    m_doc->modelEntryAll()->select();
    const QString path = exchangePath();
    {
        VDRExchangeFileBuilder file(path, QStringLiteral("Baustelle.vd2"));
        QVERIFY(file.addReport(QStringLiteral("005"), QDate(2026, 3, 1), QDateTime(),
                               {{"id", appId},
                                {"user_id", QVariant()},
                                {"creation_date", QVariant()},
                                {"progress", "Dach"}}) > 0);
    }
    const QString summary = import({path});
    QVERIFY2(summary.contains(section), qPrintable(summary));
    QCOMPARE(rows(QStringLiteral("SELECT id, progress FROM entry")).join(QLatin1Char('|')), ids);
}

// Files refused as a whole: nothing of them arrives, and the file stays as it was.
void TestVDRReportSync::refusedFiles_data()
{
    QTest::addColumn<QString>("change");
    QTest::addColumn<QString>("title");
    QTest::addColumn<QString>("text");
    // clang-format off
    QTest::newRow("version 0.1") << "fileversion=0.1" << kSync << "mit einer älteren Version";
    QTest::newRow("version 1.0") << "fileversion=1.0" << kSync << "ein Update der Varduna Software";
    QTest::newRow("version 0.10") << "fileversion=0.10" << kSync << "ein Update der Varduna Software";
    QTest::newRow("version missing") << "fileversion=" << kSync << "keine gültige Austauschdatei";
    QTest::newRow("version text") << "fileversion=zwei" << kSync << "keine gültige Austauschdatei";
    QTest::newRow("renamed diary") << "database=Altname.vd2" << kSync << "nur in das Varduna Altname.vd2 importiert";
    QTest::newRow("database missing") << "database=" << kSync << "keine gültige Austauschdatei";
    QTest::newRow("no creation date") << "creationDateTime=" << kSync << "Das Erstelldatum der Austauschdatei fehlt";
    QTest::newRow("bad creation date") << "creationDateTime=2026-02-30T10:00:00" << kSync << "Erstelldatum";
    QTest::newRow("missing table") << "sql=DROP TABLE entry_concern" << kSync << "Die Tabelle 'entry_concern' fehlt";
    QTest::newRow("missing column") << "sql=ALTER TABLE entry_equipment RENAME COLUMN downtime TO pause"
                                    << kSync << "Die Spalte 'downtime' der Tabelle 'entry_equipment' fehlt";
    QTest::newRow("not SQLite") << "garbage" << kDbError << "Fehler beim Öffnen der Datei";
    QTest::newRow("missing file") << "missing" << kDbError << "Fehler beim Öffnen der Datei";
    // clang-format on
}

void TestVDRReportSync::refusedFiles()
{
    QFETCH(QString, change);
    QFETCH(QString, title);
    QFETCH(QString, text);
    const QString path = exchangePath();
    writeFullFile(path, kT1);
    {
        const QString key = change.section(QLatin1Char('='), 0, 0);
        const QString val = change.section(QLatin1Char('='), 1);
        if (key == QLatin1String("sql")) {
            QVERIFY(execSql(path, {val}));
        } else if (change == QLatin1String("garbage")) {
            QFile f(path);
            QVERIFY(f.open(QIODevice::WriteOnly));
            f.write(QByteArray(4096, 'x'));
        } else if (change == QLatin1String("missing")) {
            QVERIFY(QFile::remove(path));
        } else {
            QVERIFY(execSql(
                path, {val.isEmpty()
                           ? QStringLiteral("DELETE FROM meta WHERE key = '%1'").arg(key)
                           : QStringLiteral("UPDATE meta SET value = '%1' WHERE key = '%2'").arg(val, key)}));
        }
    }
    const QByteArray hash = fileHash(path);
    const QStringList before = dump();
    const QString summary = import({path}, [&]() {
        m_prompt.expect(title, text);
        if (title == kDbError)
            m_prompt.expect(kSync, QStringLiteral("wurde die Synchronisation abgebrochen"));
    });
    QVERIFY2(summary.contains(QStringLiteral("nicht oder nur teilweise importiert:\n\n") + path),
             qPrintable(summary));
    QCOMPARE(dump(), before);
    QCOMPARE(fileHash(path), hash);
    QVERIFY(!QSqlDatabase::contains(VDRReportSynchronisation::connectionName()));
}

// Rows the app should never send: the report goes whole or not at all, with a clear message.
void TestVDRReportSync::untrustedRows_data()
{
    QTest::addColumn<QString>("sql");
    QTest::addColumn<QString>("text"); // empty: imported without a message
    QTest::addColumn<QString>("check");
    QTest::addColumn<QString>("expected");
    const auto row = [](const char* tag, const char* sql, const char* text, const char* check = "",
                        const char* expected = "") {
        QTest::newRow(tag) << QString::fromUtf8(sql) << QString::fromUtf8(text) << QString::fromUtf8(check)
                           << QString::fromUtf8(expected);
    };
    row("photo type 6, progress type 5",
        "UPDATE entry_photo SET type = 6 WHERE caption = 'Beton';; UPDATE entry_progress SET type = 5 WHERE "
        "type = 3",
        "",
        "SELECT (SELECT group_concat(type) FROM entry_photo), (SELECT count(*) FROM entry_progress), "
        "(SELECT count(*) FROM image)",
        "1,2|3|2");
    row("image pointing nowhere", "UPDATE entry_photo SET photo_image_id = 9999 WHERE caption = 'Rohbau'", "",
        "SELECT photo_image_id FROM entry_photo WHERE caption = 'Rohbau'", "0");
    row("relation pointing nowhere", "UPDATE entry_photo SET relation_id = 9999", "",
        "SELECT group_concat(relation_id) FROM entry_photo", "0,0,0");
    row("apostrophes and SQL in texts",
        "UPDATE entry_concern SET description = 'O''Brien''); DROP TABLE entry; --'", "",
        "SELECT description FROM entry_concern", "O'Brien'); DROP TABLE entry; --");
    // clang-format off
    row("invalid date", "UPDATE entry_scheduleddelivery SET deliverydate = '2026-02-30'", "Die Tabelle 'entry_scheduleddelivery' der Datei");
    row("empty NOT NULL date", "UPDATE entry SET inspection_date = ''", "enthält keinen gültigen Bericht");
    row("text for a number", "UPDATE entry_workforce SET person_count = 'drei'", "Die Spalte 'person_count' enthält einen ungültigen Wert");
    row("50 MB text", "UPDATE entry_equipment SET comment = zeroblob(50000000) || ''", "ist zu lang");
    row("text as picture", "UPDATE image SET image = 'kein Bild'", "Die Tabelle 'image' der Datei");
    row("number above 99999", "UPDATE entry SET number = '100000 (Entwurf)'", "größer 99999");
    // clang-format on
}

void TestVDRReportSync::untrustedRows()
{
    QFETCH(QString, sql);
    QFETCH(QString, text);
    QFETCH(QString, check);
    QFETCH(QString, expected);
    const QString path = exchangePath();
    writeFullFile(path, kT1);
    QVERIFY(execSql(path, sql.split(QStringLiteral(";; "))));
    const QStringList before = dump();
    const QString summary = import({path}, [&]() {
        if (!text.isEmpty())
            m_prompt.expect(text.contains(QLatin1String("99999"))
                                ? QStringLiteral("Bauberichtnummer ungültig ")
                                : kDbError,
                            text);
    });
    if (text.isEmpty()) {
        QVERIFY2(summary.contains(QStringLiteral("erfolgreich importiert")), qPrintable(summary));
        QCOMPARE(rows(check).join(QLatin1Char('\n')), expected);
    } else {
        QVERIFY2(
            summary.contains(QStringLiteral("aufgrund von Datenbankfehlern nicht importiert:\n\nBericht ")),
            qPrintable(summary));
        QCOMPARE(dump(), before);
    }
}

// A failure of the diary itself in the middle of a report's rows undoes everything of that report.
void TestVDRReportSync::failureLeavesDiaryAsBefore_data()
{
    QTest::addColumn<bool>("replace");
    QTest::newRow("new report") << false;
    QTest::newRow("replacing a report") << true;
}

void TestVDRReportSync::failureLeavesDiaryAsBefore()
{
    QFETCH(bool, replace);
    if (replace) {
        const QString path = exchangePath(kT1);
        writeFullFile(path, kT1);
        import({path});
    }
    // The diary refuses the last list of the report, after every other row was written.
    QVERIFY(QSqlQuery(m_doc->database())
                .exec(QStringLiteral("CREATE TRIGGER fail_equipment BEFORE INSERT ON entry_equipment BEGIN "
                                     "SELECT RAISE(ABORT, 'disk on fire'); END")));
    const QStringList before = dump();
    const QString path = exchangePath(kT2);
    writeFullFile(path, kT2, QStringLiteral("Dach"));
    const QString summary =
        import({path}, [&]() { m_prompt.expect(kDbError, QStringLiteral("disk on fire")); });
    QVERIFY2(summary.contains(QStringLiteral("Datenbankfehlern")), qPrintable(summary));
    QCOMPARE(dump(), before);
    QCOMPARE(m_doc->modelEntryAll()->rowCount(), replace ? 1 : 0);
}

// A new app report dated after the highest-numbered report but numbered lower.
void TestVDRReportSync::renumbering_data()
{
    QTest::addColumn<bool>("forAll");
    QTest::addColumn<int>("answer");
    QTest::addColumn<QStringList>("numbers");
    QTest::newRow("rename, for all") << true << 0 << QStringList{"001", "002", "003", "004", "005"};
    QTest::newRow("keep, asked each time") << false << 1 << QStringList{"001", "002", "003", "002", "003"};
}

void TestVDRReportSync::renumbering()
{
    QFETCH(bool, forAll);
    QFETCH(int, answer);
    QFETCH(QStringList, numbers);
    for (int i = 1; i <= 3; ++i) {
        QSqlQuery q(m_doc->database());
        QVERIFY(q.exec(
            QStringLiteral("INSERT INTO entry (id, locked, number, inspection_date, inspection_time_from, "
                           "inspection_time_to, env_time, env_weather1, env_weather2, env_weather3, "
                           "env_temperature, env_humidity, progress, deficiencies, "
                           "construction_material_sample, print_notice, print_telephone_notice) VALUES "
                           "(%1, 1, '00%1', '2026-03-0%1', '07:00', '08:00', '08:00', '', '', '', '', '', "
                           "'', '', 0, 1, 1)")
                .arg(i)));
    }
    QVERIFY(QSqlQuery(m_doc->database())
                .exec(QStringLiteral("UPDATE id_generator SET id_counter = 3 WHERE id_table = 'entry'")));
    const QString path = exchangePath();
    {
        VDRExchangeFileBuilder file(path, QStringLiteral("Baustelle.vd2"), kT1);
        file.addReport(QStringLiteral("002"), QDate(2026, 3, 5), kCreated, {{"locked", 1}});
        file.addReport(QStringLiteral("003"), QDate(2026, 3, 6), kCreated.addSecs(60), {{"locked", 1}});
    }
    const QString question = QStringLiteral("Baubericht-Synchronisation");
    const QString summary = import({path}, [&]() {
        if (forAll) {
            m_prompt.expectTicked(
                question,
                QStringLiteral("Der importierte Baubericht 002 ist neuer als der Baubericht "
                               "mit der höchsten Bauberichts-Nummer: 003.\nSoll er fortlaufend "
                               "nummeriert und in 004 umbenannt werden?"),
                answer);
        } else {
            m_prompt.expect(question, QStringLiteral("in 004 umbenannt"), answer);
            m_prompt.expect(question, QStringLiteral("Baubericht 003 ist neuer"), answer);
        }
    });
    QCOMPARE(rows(QStringLiteral("SELECT number FROM entry ORDER BY inspection_date")), numbers);
    if (forAll)
        QVERIFY2(summary.contains(QStringLiteral("Bericht 003-AB als Bericht 005-AB \n")),
                 qPrintable(summary));
}

// Attached documents follow the rows of a replaced report; a document whose row did not come back
// is a pending removal, which discarding the working copy undoes.
void TestVDRReportSync::documentsFollowReplacedRows()
{
    const QString path1 = exchangePath(kT1);
    writeFullFile(path1, kT1);
    QVERIFY(
        execSql(path1, {QStringLiteral("UPDATE entry_constructionmaterial SET document = 'Plan.pdf'"),
                        QStringLiteral("UPDATE entry_scheduleddelivery SET document = 'Lieferschein.pdf'")}));
    import({path1});
    const int entry = value(QStringLiteral("SELECT id FROM entry")).toInt();
    const int material = value(QStringLiteral("SELECT id FROM entry_constructionmaterial")).toInt();
    const int delivery = value(QStringLiteral("SELECT id FROM entry_scheduleddelivery")).toInt();
    QVERIFY(VDRDocumentsDb::createDocumentsDb(m_diary));
    const QString documents = VDRDocument::documentsDbPathFor(m_diary);
    QVERIFY(execSql(documents,
                    {QStringLiteral("INSERT INTO documents (id, entry_id, tablename, documentname, "
                                    "document_content, record_id, status) VALUES (1, %1, "
                                    "'entry_constructionmaterial', 'Plan.pdf', x'25504446', %2, 0), (2, %1, "
                                    "'entry_scheduleddelivery', 'Lieferschein.pdf', x'25504446', %3, 0)")
                         .arg(entry)
                         .arg(material)
                         .arg(delivery)}));

    const QString path2 = exchangePath(kT2);
    writeFullFile(path2, kT2);
    QVERIFY(execSql(path2, {QStringLiteral("UPDATE entry_constructionmaterial SET document = 'Plan.pdf'")}));
    import({path2});
    const int newMaterial = value(QStringLiteral("SELECT id FROM entry_constructionmaterial")).toInt();
    QVERIFY(newMaterial != material);
    QCOMPARE(queryTexts(documents,
                        QStringLiteral("SELECT record_id, entry_id, status, orig_record_id FROM documents "
                                       "ORDER BY id")),
             (QStringList{QStringLiteral("%1|%2|0|%3").arg(newMaterial).arg(entry).arg(material),
                          QStringLiteral("%1|%2|2|-1").arg(delivery).arg(entry)}));
    m_doc.reset();
    QVERIFY(VDRDocumentsDb::resetChangesOnDocumentsDb(m_diary));
    QCOMPARE(queryTexts(documents, QStringLiteral("SELECT record_id, status FROM documents ORDER BY id")),
             (QStringList{QStringLiteral("%1|0").arg(material), QStringLiteral("%1|0").arg(delivery)}));
}

// Files found by their stamp, imported in stamp order, deleted once imported; links out of the
// folder are not the app's.
void TestVDRReportSync::cloudFolder()
{
    const QString cloud = m_case + QStringLiteral("/cloud");
    QVERIFY(QDir().mkpath(cloud));
    const QString outside = m_case + QStringLiteral("/outside.vdx");
    writeFullFile(outside, kT1);
    QVERIFY(QFile::link(outside, cloud + QStringLiteral("/Baustelle.2026-03-07T16-05-08.vdx")));
    writeFullFile(cloud + QStringLiteral("/Baustelle.2026-03-07T16-05-10.vdx"), kT2,
                  QStringLiteral("zweite"));
    writeFullFile(cloud + QStringLiteral("/Baustelle.2026-03-07T16-05-09.vdx"), kT1, QStringLiteral("erste"));
    for (const char* other : {"Baustelle.2026-03-07.vdx", "Baustelle.2026-03-07T16-65-09.vdx",
                              "Andere.2026-03-07T16-05-09.vdx", "Baustelle.2026-03-07T16-05-09.vdx.bak"})
        QVERIFY(QFile::copy(outside, cloud + QLatin1Char('/') + QLatin1String(other)));

    const QStringList found = VDRReportSynchronisation::getCloudReportExchangeFiles(m_diary, cloud);
    QCOMPARE(found, (QStringList{"Baustelle.2026-03-07T16-05-09.vdx", "Baustelle.2026-03-07T16-05-10.vdx"}));
    QVERIFY(VDRReportSynchronisation::getCloudReportExchangeFiles(QString(), cloud).isEmpty());

    VDRReportSynchronisation sync(m_doc.get());
    bool imported = false;
    bool changed = false;
    m_prompt.expect(kNotice);
    m_prompt.expect(QStringLiteral("Ergebnis der Synchronisation"),
                    QStringLiteral("Folgende Austauschdateien wurden importiert"));
    QCOMPARE(sync.importCloudReportExchangeFiles(cloud, found, imported, changed), 0);
    QVERIFY(imported);
    // Had the later file come first, the earlier would have been refused as older.
    QCOMPARE(value(QStringLiteral("SELECT progress FROM entry")).toString(), QStringLiteral("zweite"));
    QVERIFY(!QFileInfo::exists(cloud + QLatin1Char('/') + found[0]));
    QVERIFY(!QFileInfo::exists(cloud + QLatin1Char('/') + found[1]));
    QVERIFY(QFileInfo::exists(outside));
}

// The app's project data and companies: imported only when newer, never half, and never over
// companies frozen for reports the app does not know as locked.
void TestVDRReportSync::masterData_data()
{
    QTest::addColumn<QString>("setup");
    QTest::addColumn<QString>("title");
    QTest::addColumn<QString>("text");
    QTest::addColumn<int>("answer");
    QTest::addColumn<QString>("companies"); // empty: the diary stays as before
    // clang-format off
    QTest::newRow("newer") << "" << "" << "" << -1 << "7|O'Neill & Söhne|7|8|Kran-Verleih|8|9|Alt'Firma|9";
    QTest::newRow("older") << "older" << "Stammdaten Synchronisation" << "bereits aktuellere Stammdaten" << -1 << "1|Bau AG|1|2|Elektro|2";
    QTest::newRow("frozen companies unknown to the app") << "frozen" << kSync << "nach dem Abschließen von Berichten" << -1 << "";
    QTest::newRow("empty list, delete") << "empty" << "Stammdaten Synchronisation" << "Firmenliste in der Importdatei ist leer" << 0 << "";
    QTest::newRow("empty list, keep") << "empty" << "Stammdaten Synchronisation" << "Firmenliste in der Importdatei ist leer" << 1 << "1|Bau AG|1|2|Elektro|2";
    QTest::newRow("invalid category") << "category" << kSync << "Die Spalte 'category' enthält einen ungültigen Wert" << -1 << "";
    QTest::newRow("failure in the middle of the list") << "trigger" << kSync << "Das Anlegen eines Firmeneintrags" << -1 << "";
    // clang-format on
}

void TestVDRReportSync::masterData()
{
    QFETCH(QString, setup);
    QFETCH(QString, title);
    QFETCH(QString, text);
    QFETCH(int, answer);
    QFETCH(QString, companies);
    QSqlDatabase db = m_doc->database();
    QVERIFY(QSqlQuery(db).exec(QStringLiteral("DELETE FROM company")));
    for (const QString& sql :
         {QStringLiteral(
              "INSERT INTO company (id, category, type, firstname, lastname, company, street, plz, city, "
              "telephone, telefax, mobile, email, pos) VALUES (1, 1, '', '', '', 'Bau AG', '', '', '', '', "
              "'', '', '', 1), (2, 2, '', '', '', 'Elektro', '', '', '', '', '', '', '', 2)"),
          QStringLiteral("UPDATE id_generator SET id_counter = 20 WHERE id_table = 'company'")})
        QVERIFY(QSqlQuery(db).exec(sql));
    if (setup == QLatin1String("frozen"))
        QVERIFY(QSqlQuery(db).exec(QStringLiteral("UPDATE company SET category = -category")));
    if (setup == QLatin1String("older"))
        QVERIFY(m_doc->setMasterDataImportVersion(kT2));
    if (setup == QLatin1String("trigger"))
        QVERIFY(QSqlQuery(db).exec(
            QStringLiteral("CREATE TRIGGER fail_company BEFORE INSERT ON company WHEN NEW.id = 8 "
                           "BEGIN SELECT RAISE(ABORT, 'disk on fire'); END")));
    m_doc->modelCompany1()->select();
    m_doc->modelCompany2()->select();
    const QString path = exchangePath();
    writeFullFile(path, kT1);
    {
        VDRExchangeFileBuilder file(path);
        file.addRow(QStringLiteral("vdr"), {{"id", 1}, {"name", "App-Projekt"}, {"headline_left", "Kopf's"}});
        if (setup != QLatin1String("empty")) {
            file.addRow(QStringLiteral("company"),
                        {{"id", 7}, {"category", 1}, {"company", "O'Neill & Söhne"}});
            file.addRow(QStringLiteral("company"), {{"id", 8}, {"category", 2}, {"company", "Kran-Verleih"}});
            file.addRow(QStringLiteral("company"), {{"id", 9},
                                                    {"category", setup == QLatin1String("category") ? 7 : -1},
                                                    {"company", "Alt'Firma"}});
        }
    }
    const QStringList before = dump();
    const QString projectBefore = value(QStringLiteral("SELECT name FROM vdr")).toString();
    const QString summary = import({path}, [&]() {
        if (!title.isEmpty())
            m_prompt.expect(title, text, answer);
    });
    const bool refused = companies.isEmpty() && setup != QLatin1String("empty");
    if (refused) {
        QVERIFY2(summary.contains(QStringLiteral("nicht oder nur teilweise importiert")),
                 qPrintable(summary));
        QCOMPARE(dump(), before);
        return;
    }
    QVERIFY2(summary.contains(QStringLiteral("erfolgreich importiert")), qPrintable(summary));
    QCOMPARE(rows(QStringLiteral("SELECT id, company, pos FROM company ORDER BY id")).join(QLatin1Char('|')),
             companies);
    const bool imported = setup != QLatin1String("older");
    QCOMPARE(value(QStringLiteral("SELECT name FROM vdr")).toString(),
             imported ? QStringLiteral("App-Projekt") : projectBefore);
    QCOMPARE(m_doc->masterDataImportVersion(), imported ? kT1 : kT2);
    QCOMPARE(value(QStringLiteral("SELECT id_counter FROM id_generator WHERE id_table = 'company'")).toInt(),
             20);
    QCOMPARE(m_doc->modelCompany1()->rowCount() + m_doc->modelCompany2()->rowCount(),
             companies.isEmpty() ? 0 : companies.count(QLatin1Char('|')) / 3 + 1);
}

// varduna-cli import: the summary on stdout, the diary saved, imported files deleted on request.
void TestVDRReportSync::commandLine()
{
    m_doc.reset();
    const QString good = exchangePath(kT1);
    writeFullFile(good, kT1);
    const QString refused = exchangePath(kT2);
    writeFullFile(refused, kT2);
    QVERIFY(execSql(refused, {QStringLiteral("UPDATE meta SET value = '0.1' WHERE key = 'fileversion'")}));

    QString out, err;
    QCOMPARE(cli({QStringLiteral("import"), m_diary, good, refused, QStringLiteral("--delete")}, &out, &err),
             4);
    QVERIFY2(out.contains(QStringLiteral("Folgende Bauberichte wurden erfolgreich importiert")),
             qPrintable(out));
    QVERIFY2(err.contains(QStringLiteral("mit einer älteren Version")), qPrintable(err));
    QVERIFY(!QFileInfo::exists(good));
    QVERIFY(QFileInfo::exists(refused));
    QCOMPARE(queryValue(m_diary, QStringLiteral("SELECT count(*) FROM entry_photo")).toInt(), 3);
}

void TestVDRReportSync::fillDiary(int count, int open)
{
    QSqlDatabase db = m_doc->database();
    QSqlQuery q(db);
    q.prepare(QStringLiteral(
        "INSERT INTO entry (id, locked, number, inspection_date, inspection_time_from, "
        "inspection_time_to, env_time, env_weather1, env_weather2, env_weather3, env_temperature, "
        "env_humidity, progress, deficiencies, construction_material_sample, print_notice, "
        "print_telephone_notice, user_id, creation_date) VALUES (?, ?, ?, '2026-03-01', '07:00', "
        "'08:00', '08:00', '', '', '', '', '', '', '', 0, 1, 1, 'AB', ?)"));
    for (int i = 1; i <= count; ++i) {
        const bool locked = i <= count - open;
        q.addBindValue(i);
        q.addBindValue(locked ? 1 : 0);
        q.addBindValue(QString::number(i).rightJustified(3, QLatin1Char('0')) +
                       (locked ? QString() : QStringLiteral(" (Entwurf)")));
        q.addBindValue(QStringLiteral("2026-03-01T07:%1:00").arg(i % 60, 2, 10, QLatin1Char('0')));
        QVERIFY2(q.exec(), qPrintable(q.lastError().text()));
    }
    QImage logo(40, 20, QImage::Format_RGB32);
    logo.fill(Qt::blue);
    const int logoId = m_doc->createImage(logo);
    QVERIFY(logoId > 0);
    for (const QString& sql :
         {QStringLiteral("UPDATE id_generator SET id_counter = %1 WHERE id_table = 'entry'").arg(count),
          QStringLiteral("UPDATE vdr SET logo_image_id = %1, logo2_image_id = 0, name = 'Haus ''Süd''', "
                         "projectnumber = NULL")
              .arg(logoId),
          QStringLiteral(
              "UPDATE company SET company = 'Bau''s & Co' WHERE id = (SELECT min(id) FROM company)"),
          QStringLiteral(
              "INSERT INTO company (id, category, type, firstname, lastname, company, street, plz, city, "
              "telephone, telefax, mobile, email, pos) SELECT 90, -1, type, firstname, lastname, 'Gefroren', "
              "street, plz, city, telephone, telefax, mobile, email, 90 FROM company WHERE category = 1 "
              "LIMIT 1")})
        QVERIFY2(QSqlQuery(db).exec(sql), qPrintable(sql));
    m_doc->modelEntryAll()->select();
    m_doc->modelVdr()->select();
}

int TestVDRReportSync::cli(const QStringList& arguments, QString* out, QString* err)
{
    const CliRun run = runCli(arguments);
    *out = run.out;
    *err = run.err;
    return run.exitCode;
}

// The master-data file the app reads: typed values, apostrophes, the locked reports.
void TestVDRReportSync::masterDataForTheApp()
{
    fillDiary(3, 1);
    const QString mdd = m_case + QStringLiteral("/Baustelle.mdd");
    QVERIFY(VDRMasterDataExport::writeMasterDataFile(m_doc.get(), mdd));
    QCOMPARE(queryTexts(mdd, QStringLiteral("SELECT key, value FROM meta ORDER BY key")),
             (QStringList{"database|Baustelle.vd2", "fileversion|0.1"}));
    QCOMPARE(queryTexts(mdd, QStringLiteral("SELECT name, typeof(id) FROM vdr")),
             QStringList{"Haus 'Süd'|integer"});
    QCOMPARE(queryValue(mdd, QStringLiteral("SELECT count(*) FROM company WHERE company = 'Bau''s & Co' AND "
                                            "typeof(category) = 'integer' AND typeof(pos) = 'integer'"))
                 .toInt(),
             1);
    QCOMPARE(queryValue(mdd, QStringLiteral("SELECT count(*) FROM company WHERE category = -1")).toInt(), 1);
    QCOMPARE(
        queryTexts(mdd, QStringLiteral("SELECT id, user_id, creation_date FROM locked_reports ORDER BY id")),
        (QStringList{"1|AB|2026-03-01T07:01:00", "2|AB|2026-03-01T07:02:00"}));
    QVERIFY(!QFileInfo::exists(mdd + QStringLiteral("-journal")));
}

// The follow-up diary of reports 1 to 37: same master data, the old numbers known, 038 (Entwurf).
void TestVDRReportSync::followUpDiary_data()
{
    QTest::addColumn<bool>("commandLine");
    QTest::newRow("in the program") << false;
    QTest::newRow("varduna-cli follow-up") << true;
}

void TestVDRReportSync::followUpDiary()
{
    QFETCH(bool, commandLine);
    fillDiary(37, 0);
    const QString next = m_case + QStringLiteral("/Baustelle 2.vd2");
    QByteArray logo;
    {
        QSqlQuery q(m_doc->database());
        QVERIFY(q.exec(QStringLiteral("SELECT i.image FROM image i JOIN vdr v ON v.logo_image_id = i.id")) &&
                q.next());
        logo = q.value(0).toByteArray();
    }
    if (commandLine) {
        QCOMPARE(m_doc->saveDocument(), 0);
        m_doc.reset();
        QString out, err;
        QCOMPARE(cli({QStringLiteral("follow-up"), m_diary, next}, &out, &err), 0);
        QCOMPARE(cli({QStringLiteral("follow-up"), m_diary, next}, &out, &err), 2); // exists: refused
        QCOMPARE(
            queryValue(m_diary, QStringLiteral("SELECT value FROM meta WHERE key = 'exportedTo'")).toString(),
            next);
    } else {
        m_prompt.expect(QStringLiteral("Stammdaten Export"),
                        QStringLiteral("nicht in die Originaldatei exportieren"));
        QCOMPARE(VDRMasterDataExport::createFollowUpDiary(m_doc.get(), m_diary), 1);
        QCOMPARE(VDRMasterDataExport::createFollowUpDiary(m_doc.get(), next), 0);
        bool exported = false;
        QString to;
        QVERIFY(VDRMasterDataExport::check4ExportedMasterData(m_doc.get(), exported, to));
        QVERIFY(exported);
        QCOMPARE(to, next);
        m_doc.reset();
    }
    QCOMPARE(queryTexts(next, QStringLiteral("SELECT number, locked FROM entry")),
             QStringList{"038 (Entwurf)|0"});
    QCOMPARE(queryTexts(next, QStringLiteral(
                                  "SELECT count(DISTINCT number), min(number), max(number), "
                                  "min(filepath) = max(filepath), min(filepath) FROM external_entry_number")),
             QStringList{"37|001|037|1|" + m_diary});
    QCOMPARE(queryTexts(next, QStringLiteral(
                                  "SELECT key, value FROM meta WHERE key IN ('exportedFrom', 'exportedTo', "
                                  "'fileversion') ORDER BY key")),
             (QStringList{"exportedFrom|" + m_diary, "fileversion|0.4"}));
    // NULLs stay NULL, numbers numbers, quotes quotes, pictures bytes; frozen companies stay behind.
    QCOMPARE(queryTexts(next, QStringLiteral("SELECT name, typeof(projectnumber), typeof(logo2_image_id), "
                                             "typeof(logo_image_id) FROM vdr")),
             QStringList{"Haus 'Süd'|null|integer|integer"});
    QCOMPARE(queryValue(next, QStringLiteral("SELECT count(*) FROM company WHERE category < 0")).toInt(), 0);
    QCOMPARE(queryValue(next, QStringLiteral("SELECT count(*) FROM company WHERE company = 'Bau''s & Co'"))
                 .toInt(),
             1);
    QCOMPARE(
        queryValue(next, QStringLiteral("SELECT i.image FROM image i JOIN vdr v ON v.logo_image_id = i.id"))
            .toByteArray(),
        logo);
    // The new diary opens and goes on from 038.
    VDRDocument follow;
    bool showError = true;
    QVERIFY(follow.openDocument(next, showError));
    QCOMPARE(follow.maxEntryNumber(), 38);
    follow.closeDocument();
}

QTEST_GUILESS_MAIN(TestVDRReportSync)
#include "tst_vdrreportsync.moc"
