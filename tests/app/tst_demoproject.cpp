#include "VDRTestFixtures.h"
#include "VDRTestPrompt.h"
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "document/VDRFileOps.h"

#include <QDir>
#include <QFileInfo>
#include <QProcess>
#include <QScopeGuard>
#include <QTemporaryDir>
#include <QtTest>

using namespace VDRTestFixtures;

namespace {
const QFile::Permissions kReadOnly = QFile::ReadOwner | QFile::ReadGroup | QFile::ReadOther;

QFile::Permissions modeOf(const QString& path)
{
    // The *User flags describe the running user, not the file's mode.
    return QFile::permissions(path) & ~(QFile::ReadUser | QFile::WriteUser | QFile::ExeUser);
}

// entry_id and company_id of every report row.
const char* const kReportRows =
    "(SELECT entry_id, company_id FROM entry_attendee UNION ALL SELECT entry_id, company_id FROM "
    "entry_workforce "
    "UNION ALL SELECT entry_id, company_id FROM entry_progress UNION ALL SELECT entry_id, company_id FROM "
    "entry_task "
    "UNION ALL SELECT entry_id, company_id FROM entry_constructionmeasure UNION ALL SELECT entry_id, "
    "company_id FROM "
    "entry_constructionmaterial UNION ALL SELECT entry_id, company_id FROM entry_scheduleddelivery UNION ALL "
    "SELECT "
    "entry_id, company_id FROM entry_telephone_notice UNION ALL SELECT entry_id, company_id FROM "
    "entry_concern "
    "UNION ALL SELECT entry_id, company_id FROM entry_equipment UNION ALL SELECT entry_id, company_id FROM "
    "entry_photo UNION ALL SELECT entry_id, NULL FROM entry_time_recording)";
} // namespace

class TestDemoProject : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void init() { m_prompt.reset(); }
    void cleanup() { VDR_VERIFY_PROMPT(m_prompt); }
    void fileAsBuilt();
    void contents_data();
    void contents();
    void opensAsDemo_data();
    void opensAsDemo();
    void generationIsReproducible();

private:
    QTemporaryDir m_dir;
    QString m_demo;
    VDRTestPrompt m_prompt;
};

void TestDemoProject::initTestCase()
{
    QVERIFY(m_dir.isValid());
    isolateSettings(m_dir.filePath(QStringLiteral("settings")));
    QVERIFY(QDir().mkpath(m_dir.filePath(QStringLiteral("tmp"))));
    qputenv("TMPDIR", QFile::encodeName(m_dir.filePath(QStringLiteral("tmp"))));
    m_demo =
        QDir::cleanPath(QCoreApplication::applicationDirPath() + QStringLiteral("/../Projects/Ejemplo.vd2"));
    QVERIFY2(QFileInfo::exists(m_demo), qPrintable(m_demo));
}

void TestDemoProject::fileAsBuilt()
{
    QCOMPARE(modeOf(m_demo), kReadOnly);
    QCOMPARE(queryValue(m_demo, QStringLiteral("PRAGMA integrity_check")).toString(), QStringLiteral("ok"));
    QCOMPARE(queryValue(m_demo, QStringLiteral("SELECT value FROM meta WHERE key = 'isdp'")).toString(),
             QStringLiteral("42"));
    QCOMPARE(
        queryValue(m_demo, QStringLiteral("SELECT value FROM meta WHERE key = 'fileversion'")).toString(),
        QStringLiteral("0.4"));
}

void TestDemoProject::contents_data()
{
    QTest::addColumn<QString>("sql");
    QTest::addColumn<int>("minimum");
    QTest::addColumn<int>("maximum");
    const auto row = [](const char* name, const QString& sql, int min, int max = 1000) {
        QTest::newRow(name) << sql << min << max;
    };
    const auto count = [](const QString& from) { return QStringLiteral("SELECT count(*) FROM ") + from; };
    const QString reportRows = QString::fromLatin1(kReportRows);
    row("a dozen reports", count("entry"), 12, 12);
    row("some locked", count("entry WHERE locked = 1"), 1, 11);
    row("over two weeks",
        "SELECT julianday(max(inspection_date)) - julianday(min(inspection_date)) FROM entry", 7, 13);
    row("on weekdays", count("entry WHERE strftime('%w', inspection_date) IN ('0', '6')"), 0, 0);
    row("drafts marked", count("entry WHERE (locked = 1) = (number LIKE '% (Entwurf)')"), 0, 0);
    row("numbers follow dates",
        count("entry a JOIN entry b ON a.id < b.id WHERE a.inspection_date > "
              "b.inspection_date OR substr(a.number, 1, 3) >= substr(b.number, 1, 3)"),
        0, 0);
    row("report counter", count("vdr WHERE entrycounter = (SELECT count(*) FROM entry)"), 1, 1);
    row("project data",
        count("vdr WHERE name <> 'Neues Varduna' AND headline_left <> name AND footer_left <> "
              "'Korvant' AND projectnumber <> '' AND show_projectname = 1"),
        1, 1);
    row("persons", count("company WHERE category = 1"), 4);
    row("companies", count("company WHERE category = 2"), 5);
    row("no empty master data", count("company WHERE lastname = '' AND company = ''"), 0, 0);
    row("frozen for locked reports", count("company WHERE category < 0"), 1);
    row("attendees", count("entry_attendee"), 1);
    row("workforce", count("entry_workforce"), 1);
    row("time recording", count("entry_time_recording WHERE hours > 0"), 1);
    row("delays", count("entry_progress WHERE type = 1"), 1);
    row("obstructions", count("entry_progress WHERE type = 2"), 1);
    row("acceptances", count("entry_progress WHERE type = 3"), 1);
    row("deficiencies", count("entry_progress WHERE type = 4"), 1);
    row("directives", count("entry_task WHERE type = 1"), 1);
    row("auxiliary services", count("entry_task WHERE type = 2"), 1);
    row("construction measures", count("entry_constructionmeasure"), 1);
    row("materials", count("entry_constructionmaterial"), 1);
    row("deliveries", count("entry_scheduleddelivery"), 1);
    row("telephone notes", count("entry_telephone_notice"), 1);
    row("concerns", count("entry_concern"), 1);
    row("equipment", count("entry_equipment WHERE operating_time > 0"), 1);
    row("photos", count("entry_photo"), 3);
    row("photo registers", "SELECT count(DISTINCT type) FROM entry_photo", 3);
    row("man-hours add up",
        count("entry_workforce w WHERE man_hours IS NULL OR abs(man_hours - (SELECT sum(hours) "
              "FROM entry_time_recording t WHERE t.workforce_id = w.id AND t.entry_id = "
              "w.entry_id)) > 0.001"),
        0, 0);
    row("persons add up",
        count("entry_workforce w WHERE person_count <> (SELECT sum(person_count) FROM "
              "entry_time_recording t WHERE t.workforce_id = w.id)"),
        0, 0);
    row("rows of missing reports", count(reportRows + " r WHERE entry_id NOT IN (SELECT id FROM entry)"), 0,
        0);
    row("unknown companies", count(reportRows + " r WHERE company_id NOT IN (SELECT id FROM company)"), 0, 0);
    row("locked reports frozen",
        count(reportRows + " r JOIN entry e ON e.id = r.entry_id JOIN company "
                           "c ON c.id = r.company_id WHERE e.locked = 1 AND c.category > 0"),
        0, 0);
    row("photos with pictures", count("entry_photo WHERE photo_image_id NOT IN (SELECT id FROM image)"), 0,
        0);
    row("deficiency photo counts",
        count("entry_progress p WHERE type = 4 AND image_cnt <> (SELECT count(*) FROM "
              "entry_photo f WHERE f.relation_id = p.id)"),
        0, 0);
    row("thumbnails",
        count("image WHERE max(thumbnail_width, thumbnail_height) <> 240 OR length(thumbnail) = 0"), 0, 0);
}

void TestDemoProject::contents()
{
    QFETCH(QString, sql);
    QFETCH(int, minimum);
    QFETCH(int, maximum);
    const QVariant value = queryValue(m_demo, sql);
    QVERIFY2(value.isValid(), qPrintable(sql));
    QVERIFY2(value.toDouble() >= minimum && value.toDouble() <= maximum,
             qPrintable(QStringLiteral("%1 gave %2").arg(sql, value.toString())));
}

void TestDemoProject::opensAsDemo_data()
{
    QTest::addColumn<bool>("folderWritable");
    QTest::newRow("working copy beside") << true;
    QTest::newRow("read-only folder") << false;
}

void TestDemoProject::opensAsDemo()
{
    QFETCH(bool, folderWritable);
    const QString folder = QFileInfo(m_demo).absolutePath();
    const QByteArray before = fileHash(m_demo);
    auto restore = qScopeGuard([] { VDRFileOps::setFailurePredicate(nullptr); });
    if (!folderWritable) {
        // What a user meets whose program folder is not his: nothing there can be written.
        VDRFileOps::setFailurePredicate([folder](VDRFileOps::Op, const QString& path) {
            return QFileInfo(path).absolutePath() == folder;
        });
    }

    VDRDocument doc;
    bool showError = false;
    QVERIFY(doc.openDocument(m_demo, showError));
    QVERIFY(doc.isDemoProject());
    const QString workingCopy = doc.getFilepathWorkingCopy();
    if (!folderWritable) {
        QVERIFY2(QFileInfo(workingCopy).absolutePath() != folder, qPrintable(workingCopy));
        QVERIFY2(workingCopy.startsWith(QDir::tempPath()), qPrintable(workingCopy));
    }
    doc.modelEntryAll()->fetch_all();
    QCOMPARE(doc.modelEntryAll()->rowCount(), 12);
    const QList<int> images = doc.getImageIds();
    QVERIFY(images.size() >= 3);
    for (const int id : images) {
        QVERIFY(!doc.getImage(id).isNull());
        QCOMPARE(qMax(doc.getImageThumbnail(id).width(), doc.getImageThumbnail(id).height()), 240);
    }

    m_prompt.expect(QStringLiteral("Speichern"),
                    QStringLiteral("Das Musterprojekt kann nicht gespeichert werden."));
    QCOMPARE(doc.saveDocument(), 1);
    QVERIFY(doc.closeDocument());

    QVERIFY(!QFileInfo::exists(workingCopy));
    QCOMPARE(QDir(folder).entryList(QDir::AllEntries | QDir::NoDotAndDotDot | QDir::Hidden),
             QStringList{QStringLiteral("Ejemplo.vd2")});
    QCOMPARE(fileHash(m_demo), before);
    QCOMPARE(modeOf(m_demo), kReadOnly);
}

void TestDemoProject::generationIsReproducible()
{
    const QString generator = QCoreApplication::applicationDirPath() + QStringLiteral("/vdr_makedemo");
    const QString fresh = m_dir.filePath(QStringLiteral("fresh.vd2"));
    const auto run = [&]() {
        QProcess p;
        p.start(generator, {fresh});
        return p.waitForFinished(120000) && p.exitStatus() == QProcess::NormalExit ? p.exitCode() : -1;
    };
    QCOMPARE(run(), 0);

    // Built at another time of day, the diary is still the same, row for row.
    QCOMPARE(tableNames(fresh), tableNames(m_demo));
    for (const QString& table : tableNames(m_demo)) {
        const QString sql =
            table == QLatin1String("image")
                ? QStringLiteral("SELECT id, hex(image), hex(thumbnail) FROM image ORDER BY 1")
                : QStringLiteral("SELECT * FROM %1 ORDER BY 1").arg(table);
        QVERIFY2(queryTexts(fresh, sql) == queryTexts(m_demo, sql), qPrintable(table));
    }

    // An existing file is never overwritten.
    const QByteArray hash = fileHash(fresh);
    QCOMPARE(run(), 1);
    QCOMPARE(fileHash(fresh), hash);
}

QTEST_MAIN(TestDemoProject)
#include "tst_demoproject.moc"
