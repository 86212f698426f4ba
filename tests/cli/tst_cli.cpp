#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "document/VDRDocument.h"

#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>
#include <QScopeGuard>
#include <QSettings>
#include <QtTest>

using namespace VDRTestFixtures;

// Drives varduna-cli as a separate process, as people who automate use it.
class TestCli : public VDRTestCase
{
    Q_OBJECT

private slots:
    void helpListsCommandsAndExitCodes();
    void usageErrors_data();
    void usageErrors();
    void newWritesAFreshDiary();
    void newRefusesExistingFile();
    void infoListsReports_data();
    void infoListsReports();
    void infoUpgradesOnlyTheWorkingCopy();
    void checkExitCodes_data();
    void checkExitCodes();
    void heldDiaryIsReportedByInfoAndCheck();
    void saveRunRepeatedlyRotatesBackups_data();
    void saveRunRepeatedlyRotatesBackups();
    void saveOfOlderStructureNeedsYes();
    void restore_data();
    void restore();
    void compactReportsSizes();
    void pdfOfDemoReports_data();
    void pdfOfDemoReports();
    void previewWritesOnePicturePerPage_data();
    void previewWritesOnePicturePerPage();

private:
    // A copy of the demo diary under 'name', made once per run.
    QString demoCopy(const QString& name);
};

QString TestCli::demoCopy(const QString& name)
{
    const QString path = m_dir.filePath(name);
    if (!QFile::exists(path) &&
        QFile::copy(QCoreApplication::applicationDirPath() + QStringLiteral("/../Projects/Ejemplo.vd2"),
                    path))
        QFile::setPermissions(path, QFile::ReadOwner | QFile::WriteOwner);
    return path;
}

void TestCli::helpListsCommandsAndExitCodes()
{
    const CliRun r = runCli({QStringLiteral("--help")});
    QCOMPARE(r.exitCode, 0);
    for (const char* word :
         {"new FILE", "info FILE", "check FILE", "preview FILE", "--yes", "held by a running instance"})
        QVERIFY2(r.out.contains(QLatin1String(word)), word);
}

void TestCli::usageErrors_data()
{
    QTest::addColumn<QStringList>("args");
    QTest::newRow("nothing") << QStringList();
    QTest::newRow("no file") << QStringList{"info"};
    QTest::newRow("unknown command") << QStringList{"frobnicate", "x.vd2"};
    QTest::newRow("preview without --out") << QStringList{"preview", "x.vd2"};
}

void TestCli::usageErrors()
{
    QFETCH(QStringList, args);
    const CliRun r = runCli(args);
    QCOMPARE(r.exitCode, 1);
    QVERIFY(r.err.contains(QLatin1String("--help")));
}

void TestCli::newWritesAFreshDiary()
{
    const QString path = m_dir.filePath(QStringLiteral("Neubau Müllerstraße.vd2"));
    // Documents left by an earlier diary of the same name must not attach to the new one.
    const QString documents = VDRDocument::documentsDbPathFor(path);
    QVERIFY(execSql(documents, {"CREATE TABLE documents (id INTEGER)"}));
    const CliRun r = runCli({QStringLiteral("new"), path});
    QCOMPARE(r.exitCode, 0);
    QVERIFY(QFile::exists(path));
    QVERIFY(!QFile::exists(documents));
    QVERIFY(!QFile::exists(path + QStringLiteral(".workingcopy")));
    QVERIFY(!QFile::exists(VDRDocument::lockInfoPathFor(path)));
    QCOMPARE(queryTexts(path, "SELECT number FROM entry"), QStringList{"001 (Entwurf)"});
    QCOMPARE(queryValue(path, "SELECT count(*) FROM company WHERE category = 1").toInt(), 3);
    QCOMPARE(queryValue(path, "PRAGMA quick_check").toString(), QStringLiteral("ok"));

    // The same structure as a diary the application creates.
    const QString reference = m_dir.filePath(QStringLiteral("referenz.vd2"));
    QVERIFY(createDiary(reference));
    QCOMPARE(tableNames(path), tableNames(reference));
    for (const QString& table : tableNames(reference))
        QCOMPARE(tableLayout(path, table), tableLayout(reference, table));
}

void TestCli::newRefusesExistingFile()
{
    const QString path = m_dir.filePath(QStringLiteral("vorhanden.vd2"));
    QVERIFY(writeFile(path, "wichtig"));
    const CliRun r = runCli({QStringLiteral("new"), path});
    QCOMPARE(r.exitCode, 2);
    QVERIFY(r.err.startsWith(QLatin1String("Dateifehler: Die Datei\n")));
    QCOMPARE(fileHash(path), QCryptographicHash::hash("wichtig", QCryptographicHash::Sha256));
}

void TestCli::infoListsReports_data()
{
    QTest::addColumn<bool>("json");
    QTest::newRow("text") << false;
    QTest::newRow("json") << true;
}

void TestCli::infoListsReports()
{
    QFETCH(bool, json);
    const QString path = m_dir.filePath(QStringLiteral("info.vd2"));
    if (!QFile::exists(path)) {
        QVERIFY(createDiary(path));
        QVERIFY(execSql(
            path, {"UPDATE vdr SET name = 'Kita Sonnenschein'",
                   "UPDATE entry SET user_id = 'AB', inspection_date = '2026-11-30'",
                   "INSERT INTO entry (id, locked, number, inspection_date, inspection_time_from, "
                   "inspection_time_to, env_time, env_weather1, env_weather2, env_weather3, "
                   "env_temperature, env_humidity, progress, deficiencies, construction_material_sample, "
                   "print_notice, print_telephone_notice, user_id) VALUES (2, 1, '002', '2026-12-01', "
                   "'08:00', '12:00', '08:00', '', '', '', '', '', '', '', 0, 1, 1, '')"}));
    }
    QStringList args{QStringLiteral("info"), path};
    if (json)
        args << QStringLiteral("--json");
    const CliRun r = runCli(args);
    QCOMPARE(r.exitCode, 0);
    QVERIFY2(r.err.isEmpty(), qPrintable(r.err));
    if (json) {
        const QJsonObject o = QJsonDocument::fromJson(r.out.toUtf8()).object();
        QCOMPARE(o.value("project").toString(), QStringLiteral("Kita Sonnenschein"));
        QCOMPARE(o.value("fileVersion").toString(), QStringLiteral("0.4"));
        const QJsonArray reports = o.value("reports").toArray();
        QCOMPARE(reports.size(), 2);
        QCOMPARE(reports[0].toObject().value("number").toString(), QStringLiteral("001-AB (Entwurf)"));
        QCOMPARE(reports[0].toObject().value("date").toString(), QStringLiteral("2026-11-30"));
        QCOMPARE(reports[1].toObject().value("locked").toBool(), true);
    } else {
        QCOMPARE(r.out.split(QLatin1Char('\n'), Qt::SkipEmptyParts),
                 QStringList({"Projekt: Kita Sonnenschein", "Dateiversion: 0.4", "Bauberichte: 2",
                              "001-AB (Entwurf)\t30.11.2026\toffen", "002\t01.12.2026\tgesperrt"}));
    }
    QVERIFY(!QFile::exists(path + QStringLiteral(".workingcopy")));
}

void TestCli::infoUpgradesOnlyTheWorkingCopy()
{
    const QString path = m_dir.filePath(QStringLiteral("altbau.vd2"));
    QVERIFY(createOldestLayoutDiary(path, QStringLiteral("0.3")));
    const QByteArray before = fileHash(path);
    const CliRun r = runCli({QStringLiteral("info"), path});
    QCOMPARE(r.exitCode, 0);
    QVERIFY(r.err.startsWith(QStringLiteral("Datei-Warnung: Sie öffnen ein Dokument, das mit einer früheren "
                                            "Programmversion erstellt wurde.")));
    QVERIFY(r.out.contains(QLatin1String("Dateiversion: 0.3\n")));
    QVERIFY(r.out.contains(QLatin1String("001\t02.03.2009\tgesperrt\n")));
    QCOMPARE(fileHash(path), before);
    QVERIFY(!QFile::exists(path + QStringLiteral(".workingcopy")));
}

void TestCli::checkExitCodes_data()
{
    QTest::addColumn<QString>("kind");
    QTest::addColumn<int>("exitCode");
    QTest::addColumn<QString>("status");
    // The title with which opening refuses, for the cases check predicts.
    QTest::addColumn<QString>("refusal");
    // clang-format off
    QTest::newRow("intact") << "intact" << 0 << "can be opened" << "";
    QTest::newRow("missing") << "missing" << 2 << "missing" << "Dateifehler";
    QTest::newRow("folder") << "folder" << 2 << "missing" << "Dateifehler";
    QTest::newRow("damaged") << "damaged" << 3 << "damaged" << "-";
    QTest::newRow("not a diary") << "text" << 3 << "damaged" << "-";
    QTest::newRow("newer") << "newer" << 5 << "made by a newer version" << "Datei öffnen";
    QTest::newRow("no meta table") << "no meta" << 6 << "cannot be opened" << "SQL Error";
    QTest::newRow("no vdr table") << "no vdr" << 6 << "cannot be opened" << "Datenbankfehler";
    QTest::newRow("renamed meta columns") << "renamed" << 6 << "cannot be opened" << "SQL Error";
    QTest::newRow("leftover dummy row") << "dummy" << 0 << "can be opened" << "";
    QTest::newRow("WAL mode") << "wal" << 0 << "can be opened" << "";
    QTest::newRow("folder without write access") << "immutable" << 6 << "cannot be opened" << "Dateifehler";
    // clang-format on
}

void TestCli::checkExitCodes()
{
    QFETCH(QString, kind);
    QFETCH(int, exitCode);
    QFETCH(QString, status);
    QFETCH(QString, refusal);
    const QString folder = m_dir.filePath(QStringLiteral("check-") + kind);
    QDir().mkpath(folder);
    const QString path = QDir(folder).filePath(QStringLiteral("tagebuch.vd2"));
    if (kind == QLatin1String("folder")) {
        QDir().mkpath(path);
    } else if (kind == QLatin1String("text")) {
        QVERIFY(writeFile(path, "kein Tagebuch"));
    } else if (kind != QLatin1String("missing")) {
        QVERIFY(createDiary(path));
        if (kind == QLatin1String("damaged"))
            QVERIFY(damageFile(path));
        const QMap<QString, QString> change{
            {"newer", "UPDATE meta SET value = '0.10' WHERE key = 'fileversion'"},
            {"no meta", "DROP TABLE meta"},
            {"no vdr", "DROP TABLE vdr"},
            {"renamed", "ALTER TABLE meta RENAME COLUMN key TO schluessel"},
            {"dummy", "INSERT INTO meta (key, value) VALUES ('dummy', 'dummy')"},
            {"wal", "PRAGMA journal_mode = WAL"}};
        if (change.contains(kind))
            QVERIFY(execSql(path, {change.value(kind)}));
        QVERIFY(QFile::copy(path, path + QStringLiteral(".bak")));
    }
    auto mutableAgain = qScopeGuard([&] {
        if (kind == QLatin1String("immutable"))
            setImmutable(folder, false);
    });
    if (kind == QLatin1String("immutable") && !setImmutable(folder, true))
        QSKIP("the file system cannot make a folder immutable");
    const QStringList before = folderState(folder);
    const CliRun r = runCli({QStringLiteral("check"), path});
    QCOMPARE(r.exitCode, exitCode);
    QVERIFY2(r.out.startsWith(QStringLiteral("Status: ") + status + QLatin1Char('\n')), qPrintable(r.out));
    QCOMPARE(folderState(folder), before);

    // Opening agrees with what check said.
    if (refusal != QLatin1String("-")) {
        VDRDocument doc;
        bool showError = true;
        if (!refusal.isEmpty())
            m_prompt.expect(refusal);
        QCOMPARE(doc.openDocument(path, showError), refusal.isEmpty());
        doc.closeDocument();
    }
    if (kind == QLatin1String("intact"))
        QVERIFY(r.out.contains(QLatin1String("Working copy: none\nBackups: 1\n")));

    const CliRun j = runCli({QStringLiteral("check"), path, QStringLiteral("--json")});
    QCOMPARE(j.exitCode, exitCode);
    QCOMPARE(QJsonDocument::fromJson(j.out.toUtf8()).object().value("status").toString(), status);
}

void TestCli::heldDiaryIsReportedByInfoAndCheck()
{
    const QString path = m_dir.filePath(QStringLiteral("in Bearbeitung.vd2"));
    QVERIFY(createDiary(path));
    VDRDocument doc;
    QVERIFY(openDiary(doc, path));

    const QString holder = QStringLiteral("User: %1\nComputer: %2\nseit dem %3 ")
                               .arg(VDRDocument::currentUserName(), VDRDocument::currentComputerName(),
                                    QDate::currentDate().toString(QStringLiteral("dd.MM.yyyy")));
    const CliRun info = runCli({QStringLiteral("info"), path, QStringLiteral("--yes")});
    QCOMPARE(info.exitCode, 2);
    QVERIFY2(info.err.startsWith(
                 QStringLiteral("Datenbank in Bearbeitung: Die Datei konnte nicht geöffnet werden, da "
                                "sie in Bearbeitung ist von\n") +
                 holder),
             qPrintable(info.err));
    QVERIFY(!info.err.contains(QLatin1String("Fehler:"))); // no second, general message

    const CliRun pdf =
        runCli({QStringLiteral("pdf"), path, QStringLiteral("-o"), m_dir.filePath("held.pdf")});
    QCOMPARE(pdf.exitCode, 2);
    QVERIFY2(pdf.err.startsWith(QStringLiteral("Datenbank in Bearbeitung: ")), qPrintable(pdf.err + pdf.out));
    QVERIFY(!QFile::exists(m_dir.filePath("held.pdf")));
    const CliRun preview =
        runCli({QStringLiteral("preview"), path, QStringLiteral("--out"), m_dir.filePath("held pages")});
    QCOMPARE(preview.exitCode, 2);
    QVERIFY(preview.err.startsWith(QStringLiteral("Datenbank in Bearbeitung: ")));
    QVERIFY(!QFileInfo::exists(m_dir.filePath("held pages")));

    const CliRun check = runCli({QStringLiteral("check"), path});
    QCOMPARE(check.exitCode, 4);
    QVERIFY(check.out.contains(QStringLiteral("Working copy: held\n")));
    QVERIFY(check.out.contains(QStringLiteral("Lock: User: %1, Computer: %2")
                                   .arg(VDRDocument::currentUserName(), VDRDocument::currentComputerName())));

    // The holder is undisturbed: it can still write and close cleanly.
    QVERIFY(setProjectName(doc, QStringLiteral("weiter bearbeitet")));
    QVERIFY(doc.closeDocument());
    QCOMPARE(runCli({QStringLiteral("check"), path}).exitCode, 0);
}

void TestCli::saveRunRepeatedlyRotatesBackups_data()
{
    QTest::addColumn<int>("backups");
    QTest::addColumn<QStringList>("expected");
    QTest::newRow("four") << 4
                          << QStringList{"d.vd2: Stand 5", "d.vd2.01.bak: Stand 4", "d.vd2.02.bak: Stand 3",
                                         "d.vd2.03.bak: Stand 2", "d.vd2.bak: Stand 5"};
    QTest::newRow("none") << 0 << QStringList{"d.vd2: Stand 5"};
}

void TestCli::saveRunRepeatedlyRotatesBackups()
{
    QFETCH(int, backups);
    QFETCH(QStringList, expected);
    QSettings().setValue(QStringLiteral("file/NumberOfBackups"), backups);
    QSettings().sync();
    const QString folder = m_dir.filePath(QStringLiteral("rotation-%1").arg(backups));
    QDir().mkpath(folder);
    const QString path = folder + QStringLiteral("/d.vd2");
    QCOMPARE(runCli({QStringLiteral("new"), path}).exitCode, 0);
    // Each run is one opening with one save; the diary is changed in between as by another session.
    for (int i = 1; i <= 5; ++i) {
        QVERIFY(execSql(path, {QStringLiteral("UPDATE vdr SET name = 'Stand %1'").arg(i)}));
        const CliRun r = runCli({QStringLiteral("save"), path});
        QCOMPARE(r.exitCode, 0);
        QVERIFY2(r.err.isEmpty(), qPrintable(r.err));
    }
    QStringList found;
    for (const QString& name : QDir(folder).entryList(QDir::Files, QDir::Name))
        found << name + QStringLiteral(": ") + projectNameIn(folder + QLatin1Char('/') + name);
    QCOMPARE(found, expected);
    QSettings().remove(QStringLiteral("file/NumberOfBackups"));
}

void TestCli::saveOfOlderStructureNeedsYes()
{
    const QString path = m_dir.filePath(QStringLiteral("alt-speichern.vd2"));
    QVERIFY(createOldestLayoutDiary(path, QStringLiteral("0.3")));
    const QByteArray before = fileHash(path);
    const CliRun cancelled = runCli({QStringLiteral("save"), path});
    QCOMPARE(cancelled.exitCode, 3);
    QVERIFY(cancelled.err.contains(
        QStringLiteral("Datei-Warnung: Das Dokument wurde mit einer früheren Programmversion "
                       "erstellt.")));
    QCOMPARE(fileHash(path), before);

    const CliRun saved = runCli({QStringLiteral("save"), path, QStringLiteral("--yes")});
    QCOMPARE(saved.exitCode, 0);
    QCOMPARE(queryValue(path, "SELECT value FROM meta WHERE key = 'fileversion'").toString(),
             QStringLiteral("0.4"));
    QCOMPARE(queryValue(path + QStringLiteral(".bak"), "SELECT value FROM meta WHERE key = 'fileversion'")
                 .toString(),
             QStringLiteral("0.3"));
    QCOMPARE(runCli({QStringLiteral("info"), path}).err, QString()); // nothing left to upgrade
}

void TestCli::restore_data()
{
    QTest::addColumn<QStringList>("damaged");
    QTest::addColumn<int>("exitCode");
    QTest::newRow("from the newest intact backup") << QStringList{"r.vd2", "r.vd2.bak"} << 0;
    QTest::newRow("intact diary") << QStringList() << 4;
    QTest::newRow("no intact backup") << QStringList{"r.vd2", "r.vd2.bak", "r.vd2.01.bak"} << 3;
}

void TestCli::restore()
{
    QFETCH(QStringList, damaged);
    QFETCH(int, exitCode);
    const QString folder = m_dir.filePath(QStringLiteral("restore-%1").arg(exitCode));
    QDir().mkpath(folder);
    const QString path = folder + QStringLiteral("/r.vd2");
    QCOMPARE(runCli({QStringLiteral("new"), path}).exitCode, 0);
    for (int i = 1; i <= 2; ++i) {
        QVERIFY(execSql(path, {QStringLiteral("UPDATE vdr SET name = 'Stand %1'").arg(i)}));
        QCOMPARE(runCli({QStringLiteral("save"), path}).exitCode, 0);
    }
    // r.vd2 and r.vd2.bak: Stand 2, r.vd2.01.bak: Stand 1.
    for (const QString& name : damaged)
        QVERIFY(damageFile(folder + QLatin1Char('/') + name));
    const CliRun r = runCli({QStringLiteral("restore"), path});
    QCOMPARE(r.exitCode, exitCode);
    if (exitCode == 0) {
        QCOMPARE(r.out, folder + QStringLiteral("/rERROR.01.vd2\n"));
        QCOMPARE(projectNameIn(path), QStringLiteral("Stand 1"));
        QCOMPARE(runCli({QStringLiteral("check"), path}).exitCode, 0);
    } else if (exitCode == 3) {
        QVERIFY(r.err.contains(QStringLiteral("Die Backup-Dateien sind ebenfalls beschädigt.")));
    }
}

void TestCli::compactReportsSizes()
{
    const QString path = m_dir.filePath(QStringLiteral("kompakt.vd2"));
    QVERIFY(createDiary(path));
    QVERIFY(execSql(path, {imageInsertSql(2000000)}));
    const CliRun r = runCli({QStringLiteral("compact"), path});
    QCOMPARE(r.exitCode, 0);
    const QStringList lines = r.out.split(QLatin1Char('\n'), Qt::SkipEmptyParts);
    QCOMPARE(lines.size(), 2);
    const qint64 before = lines[0].section(QLatin1Char(' '), 1, 1).toLongLong();
    const qint64 after = lines[1].section(QLatin1Char(' '), 1, 1).toLongLong();
    QVERIFY(before > 2000000);
    QVERIFY(after < before - 1900000);
    QCOMPARE(after, QFileInfo(path).size());
    QVERIFY(r.err.contains(QStringLiteral("Die Dateigröße wurde von")));
}

QTEST_GUILESS_MAIN(TestCli)
#include "tst_cli.moc"

// Report numbers of the demo diary as info prints them, with their locked state.
void TestCli::pdfOfDemoReports_data()
{
    QTest::addColumn<QString>("reports");
    QTest::addColumn<int>("exitCode");
    QTest::newRow("all by default") << QString() << 0;
    QTest::newRow("locked") << QStringLiteral("locked") << 0;
    QTest::newRow("drafts") << QStringLiteral("drafts") << 0;
    QTest::newRow("range") << QStringLiteral("2-3") << 0;
    QTest::newRow("no such report") << QStringLiteral("999") << 2;
    QTest::newRow("not a choice") << QStringLiteral("some") << 1;
}

void TestCli::pdfOfDemoReports()
{
    QFETCH(QString, reports);
    QFETCH(int, exitCode);
    const QString path = demoCopy(QStringLiteral("Demo.vd2"));
    QVERIFY(QFile::exists(path));
    const QByteArray before = fileHash(path);
    const QString pdf = m_dir.filePath(QStringLiteral("Demo Berichte.pdf"));
    QFile::remove(pdf);
    QStringList args{QStringLiteral("pdf"), path, QStringLiteral("-o"), pdf};
    if (!reports.isEmpty())
        args << QStringLiteral("--reports") << reports;
    const CliRun r = runCli(args);
    QCOMPARE(r.exitCode, exitCode);
    QCOMPARE(fileHash(path), before);
    QVERIFY(!QFile::exists(path + QStringLiteral(".workingcopy")));
    if (exitCode != 0) {
        QVERIFY(!QFile::exists(pdf));
        return;
    }
    QCOMPARE(r.out.trimmed(), pdf);

    const QString printed = pdfText(pdf);
    const QStringList lines =
        runCli({QStringLiteral("info"), path}).out.split(QLatin1Char('\n'), Qt::SkipEmptyParts);
    int expected = 0;
    for (const QString& line : lines.mid(3)) {
        const QStringList cols = line.split(QLatin1Char('\t'));
        const int number = cols.value(0).left(3).toInt();
        const bool locked = cols.value(2) == QLatin1String("gesperrt");
        const bool chosen = reports.isEmpty() || (reports == QLatin1String("locked") && locked) ||
                            (reports == QLatin1String("drafts") && !locked) ||
                            (reports == QLatin1String("2-3") && number >= 2 && number <= 3);
        expected += chosen;
        QVERIFY2(printed.contains(QStringLiteral("Baubericht-Nr.: ") + cols.value(0)) == chosen,
                 qPrintable(line));
    }
    QVERIFY(expected > 0);
}

void TestCli::previewWritesOnePicturePerPage_data()
{
    QTest::addColumn<QString>("reports");
    QTest::newRow("one report") << QStringLiteral("4");
    QTest::newRow("all") << QStringLiteral("all");
}

// As many page images as the PDF of the same reports has pages, each the picture of a portrait page.
void TestCli::previewWritesOnePicturePerPage()
{
    QFETCH(QString, reports);
    const QString path = demoCopy(QStringLiteral("Vorschau.vd2"));
    QVERIFY(QFile::exists(path));
    const QByteArray before = fileHash(path);
    const QString pdf = m_dir.filePath(QStringLiteral("Vorschau.pdf"));
    QCOMPARE(
        runCli({QStringLiteral("pdf"), path, QStringLiteral("--reports"), reports, QStringLiteral("-o"), pdf})
            .exitCode,
        0);
    const int pages = pdfPages(pdf);
    QVERIFY(pages > 0);
    const QString out = m_dir.filePath(QStringLiteral("Seiten ") + reports);
    const CliRun r = runCli({QStringLiteral("preview"), path, QStringLiteral("--reports"), reports,
                             QStringLiteral("--out"), out});
    QCOMPARE(r.exitCode, 0);
    QCOMPARE(fileHash(path), before);
    QStringList expected;
    for (int page = 1; page <= pages; ++page)
        expected << QDir(out).filePath(QString::asprintf("picture_%04d.jpeg", page));
    QCOMPARE(r.out.split(QLatin1Char('\n'), Qt::SkipEmptyParts), expected);
    QCOMPARE(QDir(out).entryList(QDir::Files).size(), pages);
    for (const QString& file : expected) {
        const QImage image(file);
        QVERIFY2(image.width() >= 1024 && image.height() > image.width(), qPrintable(file));
    }
}
