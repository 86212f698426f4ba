#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDatabaseSchema.h"
#include "document/VDRDocument.h"
#include "document/VDRFileOps.h"

#include <QDir>
#include <QFileInfo>
#include <QProcess>
#include <QScopeGuard>
#include <QtTest>

using namespace VDRTestFixtures;

namespace {
const QFile::Permissions kReadOnly = QFile::ReadOwner | QFile::ReadGroup | QFile::ReadOther;

QFile::Permissions modeOf(const QString& path)
{
    // The *User flags describe the running user, not the file's mode.
    return QFile::permissions(path) & ~(QFile::ReadUser | QFile::WriteUser | QFile::ExeUser);
}

// entry_id and company_id of every report row, as one table.
QString reportRows()
{
    const QString timeRecording = QStringLiteral("entry_time_recording");
    QStringList parts;
    for (const QString& table : VDRDatabaseSchema::reportTables()) {
        if (table != timeRecording)
            parts << QStringLiteral("SELECT entry_id, company_id FROM ") + table;
    }
    // Last: the first part names the columns.
    parts << QStringLiteral("SELECT entry_id, NULL FROM ") + timeRecording;
    return QLatin1Char('(') + parts.join(QStringLiteral(" UNION ALL ")) + QLatin1Char(')');
}
} // namespace

class TestDemoProject : public VDRTestCase
{
    Q_OBJECT

    void initRun() override
    {
        m_built = QCoreApplication::applicationDirPath() + QStringLiteral("/../Projects/Ejemplo.vd2");
        QVERIFY2(QFileInfo::exists(m_built), qPrintable(m_built));
        // Read from a copy: the window's tests may hold the built one while they run beside these.
        m_demo = m_dir.filePath(QStringLiteral("Ejemplo.vd2"));
        QVERIFY(QFile::copy(m_built, m_demo));
    }

private slots:
    void fileAsBuilt()
    {
        QCOMPARE(modeOf(m_built), kReadOnly);
        QCOMPARE(queryValue(m_demo, QStringLiteral("PRAGMA integrity_check")).toString(),
                 QStringLiteral("ok"));
        QCOMPARE(queryValue(m_demo, QStringLiteral("SELECT value FROM meta WHERE key = 'isdp'")).toString(),
                 QStringLiteral("42"));
        QCOMPARE(
            queryValue(m_demo, QStringLiteral("SELECT value FROM meta WHERE key = 'fileversion'")).toString(),
            QStringLiteral("0.4"));
    }

    void reportsOverTwoWeeks()
    {
        const auto value = [&](const char* sql) { return queryValue(m_demo, QLatin1String(sql)).toInt(); };
        QCOMPARE(value("SELECT count(*) FROM entry"), 12);
        const int locked = value("SELECT count(*) FROM entry WHERE locked = 1");
        QVERIFY2(locked > 0 && locked < 12, qPrintable(QString::number(locked)));
        const int days =
            value("SELECT julianday(max(inspection_date)) - julianday(min(inspection_date)) FROM entry");
        QVERIFY2(days >= 7 && days < 14, qPrintable(QString::number(days)));
        QVERIFY(value("SELECT count(*) FROM company WHERE category = 1") >= 4);
        QVERIFY(value("SELECT count(*) FROM company WHERE category = 2") >= 5);
        // Every list of the report form is filled somewhere, as is every photo register but obstructions.
        const QHash<QString, QStringList> only = {
            {"entry_time_recording", {"hours > 0"}},
            {"entry_progress", {"type = 1", "type = 2", "type = 3", "type = 4"}},
            {"entry_task", {"type = 1", "type = 2"}},
            {"entry_equipment", {"operating_time > 0"}},
            {"entry_photo", {"type = 1", "type = 2", "type = 4", "type = 5"}}};
        for (const QString& table : VDRDatabaseSchema::reportTables()) {
            for (const QString& where : only.value(table, {QString()})) {
                const QString from = where.isEmpty() ? table : table + QStringLiteral(" WHERE ") + where;
                QVERIFY2(queryValue(m_demo, QStringLiteral("SELECT count(*) FROM ") + from).toInt(),
                         qPrintable(from));
            }
        }
    }

    void consistent_data()
    {
        QTest::addColumn<QString>("faults");
        const QString rows = reportRows();
        const auto row = [](const char* name, const QString& faults) { QTest::newRow(name) << faults; };
        // clang-format off
        row("weekend visits", "entry WHERE strftime('%w', inspection_date) IN ('0', '6')");
        row("draft suffix", "entry WHERE (locked = 1) = (number LIKE '% (Entwurf)')");
        row("numbers against dates", "entry a JOIN entry b ON a.id < b.id WHERE a.inspection_date > "
            "b.inspection_date OR substr(a.number, 1, 3) >= substr(b.number, 1, 3)");
        row("report counter", "vdr WHERE entrycounter <> (SELECT count(*) FROM entry)");
        row("project data", "vdr WHERE name = 'Neues Varduna' OR headline_left = name OR footer_left = 'Korvant' "
            "OR projectnumber = '' OR show_projectname = 0");
        row("empty master data", "company WHERE lastname = '' AND company = ''");
        row("man-hours", "entry_workforce w WHERE man_hours IS NULL OR abs(man_hours - (SELECT sum(hours) FROM "
            "entry_time_recording t WHERE t.workforce_id = w.id AND t.entry_id = w.entry_id)) > 0.001");
        row("persons", "entry_workforce w WHERE person_count <> (SELECT sum(person_count) FROM "
            "entry_time_recording t WHERE t.workforce_id = w.id)");
        row("rows of missing reports", rows + " r WHERE entry_id NOT IN (SELECT id FROM entry)");
        row("unknown companies", rows + " r WHERE company_id NOT IN (SELECT id FROM company)");
        row("locked, not frozen", rows + " r JOIN entry e ON e.id = r.entry_id JOIN company c ON "
            "c.id = r.company_id WHERE e.locked = 1 AND c.category > 0");
        row("photos without picture", "entry_photo WHERE photo_image_id NOT IN (SELECT id FROM image)");
        row("deficiency photo count", "entry_progress p WHERE type = 4 AND image_cnt <> (SELECT count(*) FROM "
            "entry_photo f WHERE f.relation_id = p.id)");
        row("thumbnails", "image WHERE max(thumbnail_width, thumbnail_height) <> 240 OR length(thumbnail) = 0");
        // clang-format on
    }

    void consistent()
    {
        QFETCH(QString, faults);
        const QVariant count = queryValue(m_demo, QStringLiteral("SELECT count(*) FROM ") + faults);
        QVERIFY2(count.isValid(), qPrintable(faults));
        QCOMPARE(count.toInt(), 0);
    }

    void opensAsDemo_data()
    {
        QTest::addColumn<bool>("folderWritable");
        QTest::newRow("working copy beside") << true;
        QTest::newRow("read-only folder") << false;
    }

    void opensAsDemo()
    {
        QFETCH(bool, folderWritable);
        // The demo as installed, in a folder of this test's own.
        const QString folder = m_dir.filePath(QStringLiteral("Projects"));
        const QString demo = folder + QStringLiteral("/Ejemplo.vd2");
        QVERIFY(QDir().mkpath(folder));
        QFile::remove(demo);
        QVERIFY(QFile::copy(m_demo, demo));
        QVERIFY(QFile::setPermissions(demo, kReadOnly));
        const QByteArray before = fileHash(demo);
        auto restore = qScopeGuard([] { VDRFileOps::setFailurePredicate(nullptr); });
        if (!folderWritable) {
            // What a user meets whose program folder is not his: nothing there can be written.
            VDRFileOps::setFailurePredicate([folder](VDRFileOps::Op, const QString& path) {
                return QFileInfo(path).absolutePath() == folder;
            });
        }

        VDRDocument doc;
        bool showError = false;
        QVERIFY(doc.openDocument(demo, showError));
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
        QCOMPARE(fileHash(demo), before);
        QCOMPARE(modeOf(demo), kReadOnly);
    }

    void generationIsReproducible()
    {
        const QString generator = QCoreApplication::applicationDirPath() + QStringLiteral("/vdr_makedemo");
        const QString fresh = m_dir.filePath(QStringLiteral("fresh.vd2"));
        const auto run = [&]() {
            QProcess p;
            p.start(generator, {fresh});
            return p.waitForFinished(120000) && p.exitStatus() == QProcess::NormalExit ? p.exitCode() : -1;
        };
        QCOMPARE(run(), 0);

        // Made again at another time, the diary is the same row for row.
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

private:
    QString m_built;
    QString m_demo;
};

QTEST_MAIN(TestDemoProject)
#include "tst_demoproject.moc"
