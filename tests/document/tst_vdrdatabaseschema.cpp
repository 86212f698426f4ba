#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "document/VDRDatabaseSchema.h"
#include "document/VDRDocument.h"

#include <QFile>
#include <QRegularExpression>
#include <QtTest>

using namespace VDRTestFixtures;

namespace {

QStringList columnNames(const QString& path, const QString& table)
{
    QStringList names;
    for (const QVariantList& row : queryRows(path, QStringLiteral("PRAGMA table_info(%1)").arg(table)))
        names << row[1].toString();
    names.sort();
    return names;
}
} // namespace

class TestVDRDatabaseSchema : public VDRTestCase
{
    Q_OBJECT

private slots:
    void versionComparison_data()
    {
        QTest::addColumn<QString>("a");
        QTest::addColumn<QString>("b");
        QTest::addColumn<int>("expected");
        const auto row = [](const char* tag, const char* a, const char* b, int expected) {
            QTest::newRow(tag) << QString::fromLatin1(a) << QString::fromLatin1(b) << expected;
        };
        row("equal", "0.4", "0.4", 0);
        row("older minor", "0.3", "0.4", -1);
        row("newer minor", "0.5", "0.4", 1);
        row("minor compares as number", "0.10", "0.4", 1);
        row("major wins", "1.0", "0.9", 1);
        row("oldest", "0.0", "0.1", -1);
        row("missing minor", "1", "1.0", 0);
        row("empty is oldest", "", "0.1", -1);
    }

    void versionComparison()
    {
        QFETCH(QString, a);
        QFETCH(QString, b);
        QFETCH(int, expected);
        QCOMPARE(VDRDatabaseSchema::compareVersions(a, b), expected);
        QCOMPARE(VDRDatabaseSchema::compareVersions(b, a), -expected);
    }

    void newDiaryContents()
    {
        const QString path = newDiary(QStringLiteral("neu.vd2"));
        QVERIFY(!path.isEmpty());
        QCOMPARE(tableNames(path).size(), 22);
        // Columns whose type, NOT NULL and default the mobile app and older versions rely on:
        // "table.name type notnull default pk".
        const QStringList columns = {"image.id INTEGER 1 - 1",
                                     "image.image BLOB 1 - 0",
                                     "vdr.name VARCHAR (64) 1 - 0",
                                     "vdr.logo2_image_id INTEGER 1 0 0",
                                     "vdr.address1 INTEGER 0 -1 0",
                                     "vdr.show_address1 INTEGER 0 0 0",
                                     "company.plz VARCHAR (16) 1 - 0",
                                     "entry.number TEXT 1 - 0",
                                     "entry.notice TEXT 0 - 0",
                                     "entry.inspection_date DATE 1 - 0",
                                     "entry_progress.date DATE 0 - 0",
                                     "entry_photo.date DATE 1 - 0",
                                     "entry_time_recording.person_count INTEGER 1 - 0",
                                     "entry_constructionmaterial.quantity REAL 0 - 0",
                                     "id_generator.id_table TEXT 0 - 1",
                                     "external_entry_number.filepath TEXT 1 - 0",
                                     "audio.recording_status INTEGER 1 - 0"};
        QStringList layouts;
        for (const QString& wanted : columns) {
            const QString table = wanted.section(QLatin1Char('.'), 0, 0);
            const QString column = wanted.section(QLatin1Char('.'), 1).section(QLatin1Char(' '), 0, 0);
            const QStringList found =
                tableLayout(path, table).filter(QRegularExpression(QStringLiteral("^%1 ").arg(column)));
            layouts << (found.isEmpty() ? wanted + QStringLiteral(" missing")
                                        : table + QLatin1Char('.') + found[0]);
        }
        QCOMPARE(layouts, columns);

        QCOMPARE(queryTexts(path, "SELECT key, value FROM meta ORDER BY key"),
                 QStringList({"documentImport|noAction", "fileversion|0.4"}));
        QCOMPARE(
            queryTexts(path,
                       "SELECT id, name, logo_image_id, logo_align, logo2_image_id, headline_left, "
                       "headline_center, footer_left, footer_center, entrycounter, display_empty_categories, "
                       "address1, show_projectname FROM vdr"),
            QStringList({"1|Neues Varduna|NULL|2|0|Neues Varduna||Korvant|Varduna|1|0|-1|0"}));
        QCOMPARE(queryValue(path, "SELECT date(createdate) FROM vdr").toString(),
                 QDate::currentDate().toString(Qt::ISODate));
        QCOMPARE(queryTexts(path, "SELECT category, type, firstname, company, pos FROM company ORDER BY pos"),
                 QStringList({"1|Bauherr|||1", "1|Bauleitung|||2", "1|Architekt|||3"}));
        QCOMPARE(
            queryTexts(
                path,
                "SELECT number, locked, inspection_date, print_notice, progress_audio_id, creation_date, "
                "user_id, exported_by_app FROM entry"),
            QStringList({"001 (Entwurf)|0|" + QDate::currentDate().toString(Qt::ISODate) + "|1|0|NULL||0"}));
        QCOMPARE(queryValue(path, "SELECT id_counter FROM id_generator WHERE id_table = 'company'").toInt(),
                 3);
        QCOMPARE(queryValue(path, "SELECT count(*) FROM meta WHERE key = 'dummy'").toInt(), 0);
        QVERIFY(!QFile::exists(path + ".workingcopy"));

        // A current file opens without an upgrade and without a word.
        VDRDocument doc;
        QVERIFY(openDiary(doc, path));
        QVERIFY(!doc.isStructureExtended());
        QCOMPARE(doc.fileVersion(), QStringLiteral("0.4"));
        QVERIFY(m_prompt.messages.isEmpty());
        QVERIFY(doc.closeDocument());
    }

    // The oldest layout reaches the current structure, its data converted; the diary itself changes only
    // on save.
    void upgradeOfOldestLayout()
    {
        const QString current = newDiary(QStringLiteral("aktuell.vd2"));
        const QString old = m_dir.filePath(QStringLiteral("alt.vd2"));
        QVERIFY(createOldestLayoutDiary(old));
        const QByteArray before = fileHash(old);

        const QString db = openUpgradedWorkingCopy(old);
        QVERIFY(!db.isEmpty());
        QCOMPARE(tableNames(db), tableNames(current));
        for (const QString& table : tableNames(current))
            QCOMPARE(columnNames(db, table), columnNames(current, table));
        QCOMPARE(queryValue(db, "PRAGMA quick_check").toString(), QStringLiteral("ok"));
        QCOMPARE(fileHash(old), before);
        QVERIFY(!QFile::exists(old + ".workingcopy"));

        // Files of version 0.1 also get their list positions renumbered from 0 per report, and the locked
        // report 001 names frozen copies of its companies from then on.
        QCOMPARE(
            queryTexts(db, "SELECT id, category, type, company FROM company WHERE category < 0 ORDER BY id"),
            QStringList({"4|-2|Rohbau|Bau GmbH", "5|-2|Elektro|Strom AG", "6|-1|Bauherr|"}));
        // Three count/type pairs become one summed workforce row plus one time recording per used pair.
        QCOMPARE(queryTexts(db,
                            "SELECT id, entry_id, company_id, comment, person_count, person_type, pos FROM "
                            "entry_workforce ORDER BY id"),
                 QStringList({"4|1|4|Kolonne A|5|Maurer, Polier|0", "5|1|5|Kolonne B|5|Elektriker, Helfer|1",
                              "6|2|2|leer|0||0"}));
        QCOMPARE(queryTexts(
                     db,
                     "SELECT id, entry_id, workforce_id, person_count, person_type FROM entry_time_recording "
                     "ORDER BY id"),
                 QStringList({"1|1|4|2|Maurer", "2|1|4|3|Polier", "3|1|5|1|Elektriker", "4|1|5|0|Helfer",
                              "5|1|5|4|Elektriker"}));
        QCOMPARE(queryValue(db, "SELECT id_counter FROM id_generator WHERE id_table = 'entry_time_recording'")
                     .toInt(),
                 5);

        // The OK flags of materials are folded into their texts.
        QCOMPARE(queryTexts(
                     db,
                     "SELECT material, quantity, unit, conditions, workflow, note, material_temperature, pos "
                     "FROM entry_constructionmaterial"),
                 QStringList({"Beton C25/30|NULL||OK, trocken|zügig|Probe genommen|5|0"}));

        // Progress rows keep their data; the date may now be empty.
        QCOMPARE(
            queryTexts(db,
                       "SELECT id, type, description, company_id, date, roomname, roombook_number, pos FROM "
                       "entry_progress ORDER BY id"),
            QStringList({"1|1|Lieferung verspätet|4|2009-03-02|||0", "2|4|Riss in Wand|5|2009-03-02|||0"}));
        QVERIFY(execSql(
            db,
            {"INSERT INTO entry_progress (id, entry_id, pos, type, description, roomname, roombook_number) "
             "VALUES (9, 1, 3, 1, 'ohne Datum', '', '')"}));

        QCOMPARE(
            queryTexts(
                db,
                "SELECT number, print_notice, print_telephone_notice, user_id, exported_by_app FROM entry "
                "ORDER BY id"),
            QStringList({"001|1|1|NULL|0", "002 (Entwurf)|1|1|NULL|0"}));
        QCOMPARE(queryTexts(db, "SELECT name, address1, show_address1, logo2_image_id FROM vdr"),
                 QStringList({"Altbau Schillerstraße|-1|0|0"}));
        QCOMPARE(
            queryValue(db, "SELECT group_concat(pos) FROM company WHERE category > 0 ORDER BY id").toString(),
            QStringLiteral("1,2,3"));
        QCOMPARE(queryValue(db, "SELECT value FROM meta WHERE key = 'fileversion'").toString(),
                 QStringLiteral("0.1"));
    }

    void upgradeRebuildsKeepUnknownColumns_data()
    {
        QTest::addColumn<QString>("table");
        QTest::addColumn<QString>("column");
        QTest::addColumn<QString>("type");
        QTest::addColumn<QString>("value");

        const auto row = [](const char* table, const char* column, const char* type, const char* value) {
            QTest::newRow(table) << QString::fromLatin1(table) << QString::fromLatin1(column)
                                 << QString::fromLatin1(type) << QString::fromLatin1(value);
        };
        row("entry_workforce", "lohn gruppe", "INTEGER", "id * 10");
        row("entry_constructionmaterial", "lieferant", "TEXT NOT NULL DEFAULT 'unbekannt'", "'Werk ' || id");
        row("entry_progress", "gewerk", "VARCHAR (32)", "'Gewerk ' || id");
    }

    // A file written by another version may hold columns the upgrade does not know: a table rebuilt into
    // the current layout keeps them with their values.
    void upgradeRebuildsKeepUnknownColumns()
    {
        QFETCH(QString, table);
        QFETCH(QString, column);
        QFETCH(QString, type);
        QFETCH(QString, value);
        const QString old = m_dir.filePath(QStringLiteral("fremd-%1.vd2").arg(table));
        QVERIFY(createOldestLayoutDiary(old));
        const QString quoted = '"' + column + '"';
        QVERIFY(execSql(old, {QStringLiteral("ALTER TABLE %1 ADD %2 %3").arg(table, quoted, type),
                              QStringLiteral("UPDATE %1 SET %2 = %3").arg(table, quoted, value)}));
        const QString select = QStringLiteral("SELECT id, %1 FROM %2 ORDER BY id").arg(quoted, table);
        const QStringList rows = queryTexts(old, select);
        QVERIFY(rows.size() >= 1);
        const auto layoutOf = [&](const QString& path) {
            return tableLayout(path, table)
                .filter(QRegularExpression('^' + QRegularExpression::escape(column) + ' '));
        };
        const QStringList layout = layoutOf(old);
        QCOMPARE(layout.size(), 1);

        const QString upgraded = openUpgradedWorkingCopy(old);
        QVERIFY(!upgraded.isEmpty());
        QCOMPARE(layoutOf(upgraded), layout);
        QCOMPARE(queryTexts(upgraded, select), rows);
    }

    void failingUpgradeStepEndsOpening()
    {
        // A progress table without a description cannot be rebuilt: the step fails with SQL Error.
        const QString path = m_dir.filePath(QStringLiteral("kaputt.vd2"));
        QVERIFY(createOldestLayoutDiary(path));
        QVERIFY(execSql(
            path, {"DROP TABLE entry_progress",
                   "CREATE TABLE entry_progress (id INTEGER NOT NULL PRIMARY KEY, entry_id INTEGER NOT NULL, "
                   "type INTEGER NOT NULL, date DATE NOT NULL)"}));
        const QByteArray before = fileHash(path);

        VDRDocument doc;
        m_prompt.expect(QStringLiteral("SQL Error"));
        QVERIFY(!openDiary(doc, path));
        QVERIFY(!doc.isStateValid());
        QCOMPARE(fileHash(path), before);
        // A half-upgraded working copy must not be resumed next time.
        QVERIFY(!QFile::exists(path + ".workingcopy"));
        QVERIFY(!QFile::exists(VDRDocument::lockInfoPathFor(path)));
    }

private:
    // Opens an old diary, lets the upgrades run on its working copy and hands back a copy of that
    // working copy taken while the document is open.
    QString openUpgradedWorkingCopy(const QString& path)
    {
        VDRDocument doc;
        m_prompt.expect(QStringLiteral("Datei-Warnung"),
                        QStringLiteral("Die Struktur des Dokuments wird jetzt erweitert"));
        if (!openDiary(doc, path))
            return QString();
        const QString copy = path + QStringLiteral(".upgraded");
        QFile::remove(copy);
        if (!doc.writeWorkingCopyTo(copy))
            return QString();
        doc.closeDocument();
        return copy;
    }
};

QTEST_GUILESS_MAIN(TestVDRDatabaseSchema)
#include "tst_vdrdatabaseschema.moc"
