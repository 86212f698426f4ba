#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "document/VDREntryNumber.h"

#include <QPointer>
#include <QSqlError>
#include <QSqlQuery>
#include <QSqlRecord>
#include <QtTest>

#include <functional>
#include <memory>

using namespace VDRTestFixtures;

namespace {
struct NewRowCase
{
    QString tag;
    std::function<bool(VDRDocument&)> append;
    QString columns; // "table: columns" of the newest row
    QString expected;
};

QList<NewRowCase> newRowCases()
{
    using D = VDRDocument&;
    const QDate d(2024, 5, 6);
    const QString progress =
        "entry_progress: type, pos, description, company_id, date, roomname, roombook_number, image_cnt";
    const QString photo =
        "entry_photo: type, pos, photo_image_id, caption, comment, company_id, date, relation_id";
    const QString task = "entry_task: type, pos, description, company_id";
    const QString company = "company: category, type, firstname, lastname, company, street, plz, city, "
                            "telephone, telefax, mobile, email, pos";
    // clang-format off
    return {
        {"attendee", [](D doc) { return doc.appendEntryAttendee(1); },
         "entry_attendee: pos, company_id, comment", "2|NULL|"},
        {"workforce", [](D doc) { return doc.appendEntryWorkforce(1); },
         "entry_workforce: pos, company_id, comment, person_count, person_type, man_hours",
         "2|NULL||0||NULL"},
        {"time", [](D doc) { return doc.appendEntryTimeRecording(1, 7); },
         "entry_time_recording: pos, workforce_id, person_count, person_type, time_from, time_to",
         "2|7|0||NULL|NULL"},
        {"delay", [](D doc) { return doc.appendEntryDelay(1); }, progress, "1|2||NULL|NULL|||0"},
        {"obstruction", [](D doc) { return doc.appendEntryObstruction(1); }, progress, "2|2||NULL|NULL|||0"},
        {"deficiency", [](D doc) { return doc.appendEntryDfcy(1); }, progress, "4|2||NULL|NULL|||0"},
        {"acceptance", [](D doc) { return doc.appendEntryAcceptance(1); }, progress, "3|2||NULL|NULL|||0"},
        {"photo1", [d](D doc) { return doc.appendEntryPhoto1(1, d, "Ansicht", 9); }, photo,
         "1|2|9|Ansicht||NULL|2024-05-06|-1"},
        {"photo2", [d](D doc) { return doc.appendEntryPhoto2(1, d, "Ansicht", 9); }, photo,
         "2|2|9|Ansicht||NULL|2024-05-06|-1"},
        {"photo3", [d](D doc) { return doc.appendEntryPhoto3(1, d, "Ansicht", 9); }, photo,
         "3|2|9|Ansicht||NULL|2024-05-06|-1"},
        {"photo4", [d](D doc) { return doc.appendEntryPhoto4(1, d, "Ansicht", 9); }, photo,
         "4|2|9|Ansicht||NULL|2024-05-06|-1"},
        {"photo5", [d](D doc) { return doc.appendEntryPhoto5(1, d, "Ansicht", 9); }, photo,
         "5|2|9|Ansicht||NULL|2024-05-06|-1"},
        {"directive", [](D doc) { return doc.appendEntryDirective(1); }, task, "1|2||NULL"},
        {"auxiliary", [](D doc) { return doc.appendEntryAuxiliaryservice(1); }, task, "2|2||NULL"},
        {"measure", [](D doc) { return doc.appendEntryConstructionmeasure(1); },
         "entry_constructionmeasure: pos, description, company_id, location, kks, "
         "timefrom IS NOT NULL AND timeto IS NOT NULL", "2||NULL|NULL|NULL|1"},
        {"material", [](D doc) { return doc.appendEntryConstructionmaterial(1); },
         "entry_constructionmaterial: pos, material, quantity, unit, process, company_id, "
         "material_temperature, conditions, workflow, note, document", "2||NULL|||NULL|0||||"},
        {"delivery", [](D doc) { return doc.appendEntryScheduleddelivery(1); },
         "entry_scheduleddelivery: pos, deliverynumber, deliveryindex, "
         "deliverydate = date('now', 'localtime'), company_id, comment, document", "2|||1|NULL||"},
        {"telephone", [](D doc) { return doc.appendEntryTelephoneNotice(1); },
         "entry_telephone_notice: pos, description, company_id, time IS NOT NULL", "2||NULL|1"},
        {"concern", [](D doc) { return doc.appendEntryConcern(1); },
         "entry_concern: pos, description, company_id", "2||NULL"},
        {"equipment", [](D doc) { return doc.appendEntryEquipment(1); },
         "entry_equipment: pos, equipment, operating_zone, company_id, entry_time, exit_time, "
         "operating_time, downtime, downtime_reasons, comment", "2|||NULL|NULL|NULL|NULL|NULL||"},
        {"company1", [](D doc) { return doc.appendCompany1("Statiker"); }, company, "1|Statiker|||||||||||5"},
        {"company2", [](D doc) { return doc.appendCompany2(); }, company, "2||||||||||||2"},
        {"entry", [](D doc) { return doc.appendEntry() == 1; },
         "entry: locked, persistent_document, persistent_document_ct, number, "
         "inspection_date = date('now', 'localtime'), env_weather1, env_weather2, env_weather3, "
         "env_temperature, env_humidity, progress, deficiencies, tests, interventions, special_incidents, "
         "notice, construction_material_sample, print_notice, print_telephone_notice, progress_audio_id, "
         "user_id, creation_date, exported_by_app, import_version",
         "0|NULL|NULL|003 (Entwurf)|1||||||||||||0|1|1|0||NULL|0|NULL"},
    };
    // clang-format on
}
} // namespace

class TestVDRReports : public VDRTestCase
{
    Q_OBJECT

    void initTest() override
    {
        m_doc = std::make_unique<VDRDocument>();
        QVERIFY(m_doc->createDocument(true));
    }
    void cleanupTest() override { m_doc.reset(); }

private slots:
    void numbering_data()
    {
        QTest::addColumn<int>("count");
        QTest::addColumn<QStringList>("numbers");
        QTest::addColumn<QString>("external"); // a number of the predecessor file
        QTest::addColumn<QString>("title");    // of the one message expected
        QTest::addColumn<QString>("text");
        QTest::addColumn<int>("answer");
        QTest::addColumn<QString>("expectedNew"); // empty: refused
        QTest::addColumn<QString>("expectedFirst");
        const QString widen = "Der Baubericht Nr. %1 wird angelegt. Die Datenbank wird jetzt auf %2-stellige "
                              "Berichtsnummern umgestellt.\nDieser Vorgang kann einige Minuten dauern.";
        const QString tooBig =
            "Sie können keinen Baubericht mit einer Bauberichtnummer größer 99999 "
            "anlegen.\nReduzieren Sie die höchste Bauberichtnummer oder legen Sie eine neue "
            "Datei an.";
        const QString taken = "Die Nummer 012 ist bereits in der Vorgänger-Datei /alt/Tagebuch 2023.vd2 "
                              "vergeben!\nNummer trotzdem vergeben?";
        const QString shift = "Umstellung der Datenbank";
        const QStringList none, n011 = {"011"};
        const int yes = VDRPrompt::Yes, no = VDRPrompt::No;
        // clang-format off
        QTest::newRow("new diary") << 0 << none << "" << "" << "" << 0 << "002 (Entwurf)" << "001 (Entwurf)";
        QTest::newRow("1000 widens to four digits")
            << 999 << none << "" << shift << widen.arg(1000).arg(4) << 0 << "1000 (Entwurf)" << "0001";
        QTest::newRow("10000 widens to five digits") << 0 << QStringList({"0001", "0002 (Entwurf)", "9999"})
            << "" << shift << widen.arg(10000).arg(5) << 0 << "10000 (Entwurf)" << "00001";
        QTest::newRow("99999 refuses") << 0 << QStringList({"00001", "99999"})
            << "" << "Bauberichtnummer ungültig " << tooBig << 0 << "" << "00001";
        QTest::newRow("letters count as their number")
            << 0 << QStringList({"011", "011a (Entwurf)"}) << "" << "" << "" << 0 << "012 (Entwurf)" << "011";
        QTest::newRow("four digits stay") << 0 << QStringList({"0999", "1000"}) << "" << "" << "" << 0
                                          << "1001 (Entwurf)" << "0999";
        QTest::newRow("predecessor 12, anyway") << 0 << n011 << "12" << "Warnung" << taken << yes
                                                << "012 (Entwurf)" << "011";
        QTest::newRow("predecessor 12, refused") << 0 << n011 << "12" << "Warnung" << taken << no << "" << "011";
        QTest::newRow("predecessor 0012") << 0 << n011 << "0012" << "Warnung" << taken << no << "" << "011";
        QTest::newRow("predecessor draft") << 0 << n011 << "012 (Entwurf)" << "Warnung" << taken << no << ""
                                           << "011";
        QTest::newRow("predecessor 12a") << 0 << n011 << "12a" << "" << "" << 0 << "012 (Entwurf)" << "011";
        QTest::newRow("predecessor 13") << 0 << n011 << "13" << "" << "" << 0 << "012 (Entwurf)" << "011";
        // clang-format on
    }

    void numbering()
    {
        QFETCH(int, count);
        QFETCH(QStringList, numbers);
        QFETCH(QString, external);
        QFETCH(QString, title);
        QFETCH(QString, text);
        QFETCH(int, answer);
        QFETCH(QString, expectedNew);
        QFETCH(QString, expectedFirst);

        if (count > 0 || !numbers.isEmpty())
            setReports(count, numbers);
        if (!external.isEmpty())
            exec({QStringLiteral("INSERT INTO external_entry_number VALUES ('%1', '/alt/Tagebuch 2023.vd2')")
                      .arg(external)});
        m_doc->modelExternalEntryNumber()->select();
        const QStringList before = rows("SELECT number FROM entry ORDER BY id");
        const int counter = rows("SELECT entrycounter FROM vdr").first().toInt();
        if (!title.isEmpty())
            m_prompt.expect(title, text, answer);

        QCOMPARE(m_doc->appendEntry(), expectedNew.isEmpty() ? -1 : 1);
        QVERIFY(m_doc->modelEntryAll()->submitAll());
        const QStringList stored = rows("SELECT number FROM entry ORDER BY id");
        QCOMPARE(stored.first(), expectedFirst);
        if (expectedNew.isEmpty()) {
            QCOMPARE(stored, before);
            QCOMPARE(rows("SELECT entrycounter FROM vdr").first().toInt(), counter);
            return;
        }
        QCOMPARE(stored.size(), before.size() + 1);
        QCOMPARE(stored.last(), expectedNew);
        QCOMPARE(rows("SELECT entrycounter FROM vdr").first().toInt(), counter + 1);
        // Every older number has the new report's digit count.
        for (const QString& number : stored)
            QCOMPARE(VDREntryNumber(number).digits(), VDREntryNumber(expectedNew).digits());
    }

    void numberTexts_data()
    {
        QTest::addColumn<QString>("draft");
        QTest::addColumn<QString>("userId");
        QTest::addColumn<QString>("locked");
        QTest::addColumn<QString>("draftWithUser");
        QTest::addColumn<QString>("lockedWithUser");
        QTest::addColumn<QString>("letter");
        QTest::addColumn<int>("value");
        // clang-format off
        QTest::newRow("012") << "012 (Entwurf)" << "AB" << "012" << "012-AB (Entwurf)" << "012-AB" << "" << 12;
        QTest::newRow("012a") << "012a (Entwurf)" << "" << "012a" << "012a (Entwurf)" << "012a" << "a" << 12;
        QTest::newRow("0100b") << "0100b (Entwurf)" << "XY" << "0100b" << "0100b-XY (Entwurf)" << "0100b-XY"
                               << "b" << 100;
        // clang-format on
    }

    void numberTexts()
    {
        QFETCH(QString, draft);
        QFETCH(QString, userId);
        QFETCH(QString, locked);
        QFETCH(QString, draftWithUser);
        QFETCH(QString, lockedWithUser);
        QFETCH(QString, letter);
        QFETCH(int, value);

        setReports(0, {draft});
        exec({QStringLiteral("UPDATE entry SET user_id = '%1'").arg(userId)});
        m_doc->modelEntryAll()->select();
        QCOMPARE(m_doc->entryNumberWithUserId(0), draftWithUser);
        QCOMPARE(m_doc->entryNumberString(0), locked);
        QCOMPARE(QString(m_doc->entryNumberLetter(0)).remove(QChar(0)), letter);
        QCOMPARE(m_doc->entryNumberInt(0), value);

        QVERIFY(m_doc->lockEntry(0, true));
        QCOMPARE(rows("SELECT locked, number FROM entry"), QStringList{"1|" + locked});
        QCOMPARE(m_doc->entryNumberWithUserId(0), lockedWithUser);
        QVERIFY(m_doc->lockEntry(0, false));
        QCOMPARE(rows("SELECT locked, number FROM entry"), QStringList{"0|" + draft});
    }

    void newRowDefaults_data()
    {
        QTest::addColumn<int>("index");
        const QList<NewRowCase> cases = newRowCases();
        for (int i = 0; i < cases.size(); ++i)
            QTest::newRow(qPrintable(cases[i].tag)) << i;
    }

    void newRowDefaults()
    {
        QFETCH(int, index);
        const NewRowCase c = newRowCases().at(index);
        // Twice: the second row's pos shows maxPos() + 1.
        QVERIFY(c.append(*m_doc) && c.append(*m_doc));
        // Submitting also proves every NOT NULL column got a value.
        for (VDRSqlTableModel* model :
             m_doc->entryModels(1) + QList<VDRSqlTableModel*>{m_doc->modelCompany1(), m_doc->modelCompany2(),
                                                              m_doc->modelEntryAll()})
            QVERIFY2(model->submitAll(), qPrintable(model->lastError().text()));

        const QString table = c.columns.section(QLatin1Char(':'), 0, 0);
        const QString where = table.startsWith("entry_") ? QStringLiteral(" WHERE entry_id = 1") : QString();
        QCOMPARE(rows(QStringLiteral("SELECT %1 FROM %2%3 ORDER BY id DESC LIMIT 1")
                          .arg(c.columns.section(QLatin1Char(':'), 1), table, where)),
                 QStringList{c.expected});
    }

    void copyEntryAll()
    {
        exec(
            {"UPDATE entry SET locked = 1, number = '001', inspection_date = '2024-05-06', notice = 'Notiz', "
             "progress = 'Rohbau', user_id = 'AB', progress_audio_id = 5, creation_date = "
             "'2024-05-06T10:00:00', exported_by_app = 1, import_version = '2024-05-07T10:00:00'",
             "INSERT INTO entry_workforce VALUES (1, 1, 1, 2, 'Kolonne A', 3, '', 24), "
             "(2, 1, 2, 2, 'Kolonne B', 1, '', 8)",
             "INSERT INTO entry_time_recording VALUES (1, 1, 1, 2, 2, 'Maurer', '07:00:00', '15:00:00', 30, "
             "7.5), (2, 1, 2, 2, 1, 'Polier', NULL, NULL, NULL, NULL), "
             "(3, 1, 3, 1, 1, 'Helfer', NULL, NULL, NULL, NULL)",
             "INSERT INTO entry_progress VALUES (1, 1, 1, 4, 'Riss', 2, NULL, 'Flur', 'EG-001', 1)",
             "INSERT INTO entry_photo VALUES (1, 1, 1, 2, 1, 'Riss', '', 2, '2024-05-06', 1)",
             "INSERT INTO entry_constructionmaterial VALUES (1, 1, 1, 'Beton', 3.5, 'm³', 'Einbau', 2, 5, "
             "'', '', '', 'plan.pdf')",
             "INSERT INTO entry_constructionmeasure VALUES (1, 1, 1, 'Betonieren', '08:00:00', '12:00:00', "
             "2, "
             "'Halle 2', NULL)",
             "INSERT INTO id_generator VALUES ('entry_workforce', 2), ('entry_time_recording', 3), "
             "('entry_progress', 1), ('entry_photo', 1), ('entry_constructionmaterial', 1), "
             "('entry_constructionmeasure', 1)"});
        m_doc->modelEntryAll()->select();

        QVERIFY(m_doc->copyEntryAll(0));
        QCOMPARE(m_doc->transactionDepth(), 0);
        QCOMPARE(
            rows("SELECT id, locked, number, inspection_date, progress, notice, user_id, progress_audio_id, "
                 "creation_date, exported_by_app, import_version FROM entry ORDER BY id"),
            QStringList({"1|1|001|2024-05-06|Rohbau|Notiz|AB|5|2024-05-06T10:00:00|1|2024-05-07T10:00:00",
                         "2|0|002 (Entwurf)|2024-05-06|Rohbau|Notiz||0|NULL|0|NULL"}));
        // The time recordings follow the copies of their workforce rows.
        const QString times =
            "SELECT w.pos, w.comment, w.person_count, w.man_hours, t.pos, t.person_count, "
            "t.person_type, time(t.time_from), t.breaks, t.hours FROM entry_time_recording t JOIN "
            "entry_workforce w ON w.id = t.workforce_id AND w.entry_id = t.entry_id WHERE "
            "t.entry_id = %1 ORDER BY w.pos, t.pos";
        QCOMPARE(rows(times.arg(2)), rows(times.arg(1)));
        QCOMPARE(rows(times.arg(2)).size(), 3);
        QCOMPARE(rows("SELECT id FROM entry_workforce WHERE entry_id = 2"), QStringList({"3", "4"}));
        // No photos, so no photo count; the attached document stays with the original row.
        QCOMPARE(rows("SELECT count(*) FROM entry_photo WHERE entry_id = 2"), QStringList{"0"});
        QCOMPARE(rows("SELECT entry_id, type, description, company_id, roomname, roombook_number, image_cnt "
                      "FROM entry_progress ORDER BY id"),
                 QStringList({"1|4|Riss|2|Flur|EG-001|1", "2|4|Riss|2|Flur|EG-001|0"}));
        QCOMPARE(rows("SELECT entry_id, material, quantity, unit, company_id, document FROM "
                      "entry_constructionmaterial"),
                 QStringList({"1|Beton|3.5|m³|2|plan.pdf", "2|Beton|3.5|m³|2|"}));
        QCOMPARE(
            rows("SELECT entry_id, description, time(timeto), location, kks FROM entry_constructionmeasure"),
            QStringList({"1|Betonieren|12:00:00|Halle 2|NULL", "2|Betonieren|12:00:00|Halle 2|NULL"}));
    }

    void lockFreezesNamedCompanies()
    {
        exec({"INSERT INTO company VALUES (4, 2, '', '', '', 'Bau GmbH', '', '', 'Köln', '', '', '', '', 1), "
              "(5, 2, '', '', '', 'Unbeteiligt AG', '', '', 'Bonn', '', '', '', '', 2)",
              "UPDATE id_generator SET id_counter = 5 WHERE id_table = 'company'",
              "INSERT INTO entry_attendee VALUES (1, 1, 1, 1, '')", // Bauherr, list 1
              "INSERT INTO entry_workforce VALUES (1, 1, 1, 4, '', 1, '', NULL)",
              "INSERT INTO entry_progress VALUES (1, 1, 1, 4, 'Riss', 4, NULL, '', '', 0)",
              "INSERT INTO id_generator VALUES ('entry_attendee', 1), ('entry_workforce', 1), "
              "('entry_progress', 1)"});
        m_doc->modelCompany1()->select();
        m_doc->modelCompany2()->select();
        QVERIFY(!m_doc->isMasterDataModified());

        QVERIFY(m_doc->lockEntry(0, true));
        QCOMPARE(rows("SELECT number, locked FROM entry"), QStringList{"001|1"});
        QCOMPARE(rows("SELECT id, category, type, company, city FROM company WHERE category < 0 ORDER BY id"),
                 QStringList({"6|-2||Bau GmbH|Köln", "7|-1|Bauherr||"}));
        QVERIFY(m_doc->isMasterDataModified());
        const QString named =
            "SELECT c.category, c.type, c.company FROM company c JOIN (SELECT company_id FROM "
            "entry_attendee UNION ALL SELECT company_id FROM entry_workforce UNION ALL SELECT "
            "company_id FROM entry_progress) r ON r.company_id = c.id ORDER BY c.category DESC";
        const QStringList frozen = {"-1|Bauherr|", "-2||Bau GmbH", "-2||Bau GmbH"};
        QCOMPARE(rows(named), frozen);

        // Editing the master data afterwards leaves the locked report as it was.
        m_doc->modelCompany2()->setDataById(4, "company", "Neubau AG");
        m_doc->modelCompany1()->setDataById(1, "type", "Investor");
        QVERIFY(m_doc->modelCompany2()->submitAll() && m_doc->modelCompany1()->submitAll());
        QCOMPARE(rows(named), frozen);

        // Unlocking and locking again copies nothing twice.
        QVERIFY(m_doc->lockEntry(0, false));
        QCOMPARE(rows("SELECT number FROM entry"), QStringList{"001 (Entwurf)"});
        QVERIFY(m_doc->lockEntry(0, true));
        QCOMPARE(rows("SELECT count(*) FROM company WHERE category < 0"), QStringList{"2"});
        QCOMPARE(rows(named), frozen);
    }

    void removeEntryAll()
    {
        QCOMPARE(m_doc->appendEntry(), 1);
        QVERIFY(m_doc->modelEntryAll()->submitAll());
        const QString image = "INSERT INTO image (image, image_ct, image_width, image_height, thumbnail, "
                              "thumbnail_ct, thumbnail_width, thumbnail_height) VALUES (zeroblob(10), "
                              "'image/jpeg', 1, 1, zeroblob(10), 'image/jpeg', 1, 1)";
        const QString audio =
            "INSERT INTO audio (recording, recording_date, recording_time, recording_status) "
            "VALUES (zeroblob(10), '2024-05-06', '10:00:00', 0)";
        // Image 1 is used twice in report 1 only, image 2 also by report 2, image 3 by nobody.
        exec({image, image, image, audio, audio, "UPDATE entry SET progress_audio_id = id",
              "INSERT INTO entry_photo VALUES (1, 1, 0, 1, 1, 'a', '', NULL, '2024-05-06', -1), "
              "(2, 1, 0, 4, 1, 'b', '', NULL, '2024-05-06', -1), "
              "(3, 1, 0, 2, 2, 'c', '', NULL, '2024-05-06', -1), "
              "(4, 2, 0, 2, 2, 'd', '', NULL, '2024-05-06', -1)",
              "INSERT INTO entry_workforce VALUES (1, 1, 0, NULL, '', 1, '', NULL)",
              "INSERT INTO entry_time_recording VALUES (1, 1, 0, 1, 1, '', NULL, NULL, NULL, NULL)",
              "INSERT INTO entry_concern VALUES (1, 1, 0, 'Statik', NULL), (2, 2, 0, 'Brandschutz', NULL)"});
        m_doc->modelEntryAll()->select();

        QVERIFY(m_doc->removeEntryAll(0));
        QCOMPARE(m_doc->transactionDepth(), 0);
        QCOMPARE(rows("SELECT id FROM entry"), QStringList{"2"});
        QCOMPARE(
            rows("SELECT entry_id FROM entry_photo UNION ALL SELECT entry_id FROM entry_workforce UNION ALL "
                 "SELECT entry_id FROM entry_time_recording UNION ALL SELECT entry_id FROM entry_concern"),
            QStringList({"2", "2"}));
        QCOMPARE(rows("SELECT id FROM image ORDER BY id"), QStringList({"2", "3"}));
        QCOMPARE(rows("SELECT id FROM audio"), QStringList{"2"});
    }

    void fullDiskFailsAReportOperationAndSaysSo()
    {
        const QString folder = m_dir.filePath(QStringLiteral("voll"));
        SmallDisk disk(folder, 1024 * 1024);
        if (!disk.isMounted())
            QSKIP("needs a small disk of its own (mounting needs root)");
        const QByteArray tmp = qgetenv("TMPDIR");
        qputenv("TMPDIR", QFile::encodeName(folder));
        m_doc = std::make_unique<VDRDocument>();
        QVERIFY(m_doc->createDocument(true));
        qputenv("TMPDIR", tmp);
        QVERIFY(disk.fill());
        // Space freed inside the file carries a few more reports; the first that needs more fails.
        m_prompt.expect(QStringLiteral("Datenbankfehler"), QStringLiteral("kein Speicherplatz"));
        QStringList stored = rows(QStringLiteral("SELECT id FROM entry"));
        int appended = 0;
        while (appended < 500 && m_doc->appendEntry() == 1) {
            ++appended;
            stored = rows(QStringLiteral("SELECT id FROM entry"));
        }
        QVERIFY(appended < 500);
        QCOMPARE(m_doc->transactionDepth(), 0);
        QCOMPARE(rows(QStringLiteral("SELECT id FROM entry")), stored); // nothing of the failed one
        m_doc.reset();                                                  // while the disk is still there
    }

    // A step that fails inside an operation undoes the whole operation, even though the commit
    // itself would succeed.
    void failedStepUndoesTheOperation_data()
    {
        QTest::addColumn<QString>("trigger");
        QTest::addColumn<int>("operation");
        QTest::newRow("copy without its workforce") << "BEFORE INSERT ON entry_workforce" << 0;
        QTest::newRow("removal of a report that stays") << "BEFORE DELETE ON entry" << 1;
        QTest::newRow("lock without its frozen companies") << "BEFORE INSERT ON company" << 2;
    }

    void failedStepUndoesTheOperation()
    {
        QFETCH(QString, trigger);
        QFETCH(int, operation);
        exec({"INSERT INTO company VALUES (4, 2, '', '', '', 'Bau GmbH', '', '', 'Köln', '', '', '', '', 1)",
              "UPDATE id_generator SET id_counter = 4 WHERE id_table = 'company'",
              "INSERT INTO entry_attendee VALUES (1, 1, 1, 4, 'Polier')",
              "INSERT INTO entry_workforce VALUES (1, 1, 1, 4, '', 3, '', 24)",
              "INSERT INTO entry_concern VALUES (1, 1, 0, 'Statik', NULL)",
              "INSERT INTO id_generator VALUES ('entry_attendee', 1), ('entry_workforce', 1), "
              "('entry_concern', 1)",
              QStringLiteral("CREATE TRIGGER fails %1 BEGIN SELECT RAISE(ABORT, 'refused'); END")
                  .arg(trigger)});
        m_doc->modelEntryAll()->select();
        m_doc->modelCompany2()->select();
        const QString everything =
            "SELECT 'e', id, number, locked FROM entry UNION ALL SELECT 'a', id, entry_id, comment FROM "
            "entry_attendee UNION ALL SELECT 'w', id, entry_id, person_count FROM entry_workforce UNION ALL "
            "SELECT 'k', id, entry_id, description FROM entry_concern UNION ALL SELECT 'c', id, category, "
            "company FROM company";
        const QStringList before = rows(everything);

        m_prompt.expect(QStringLiteral("Datenbankfehler"), QStringLiteral("rückgängig"));
        const bool ok = operation == 0   ? m_doc->copyEntryAll(0)
                        : operation == 1 ? m_doc->removeEntryAll(0)
                                         : m_doc->lockEntry(0, true);
        QVERIFY(!ok);
        QCOMPARE(m_doc->transactionDepth(), 0);
        QCOMPARE(rows(everything), before);
        // The models show the file again, not what the undone steps left in them.
        QCOMPARE(m_doc->modelEntryAll()->rowCount(), 1);
        QCOMPARE(m_doc->modelEntryAll()->data(0, QStringLiteral("number"), Qt::EditRole).toString(),
                 QStringLiteral("001 (Entwurf)"));
        QCOMPARE(m_doc->modelEntryConcern(1)->rowCount(), 1);
        QCOMPARE(m_doc->modelCompany2()->rowCount(), 1);

        // The next operation works as usual.
        exec({"DROP TRIGGER fails"});
        QVERIFY(m_doc->copyEntryAll(0));
        QCOMPARE(rows("SELECT count(*) FROM entry_workforce"), QStringList{"2"});
    }

    void reportListAfterRemovals_data()
    {
        QTest::addColumn<bool>("editedList");
        QTest::addColumn<bool>("modelsInUse");
        QTest::newRow("list read") << false << false;
        QTest::newRow("list with an unsubmitted edit") << true << false;
        QTest::newRow("removed reports shown") << false << true;
    }

    void reportListAfterRemovals()
    {
        QFETCH(bool, editedList);
        QFETCH(bool, modelsInUse);
        setReports(10, {});
        VDRAllEntryTableModel* list = m_doc->modelEntryAll();
        const auto shown = [list](const QString& field) {
            QStringList values;
            for (int r = 0; r < list->rowCount(); ++r)
                values << list->data(r, field, Qt::EditRole).toString();
            return values;
        };
        if (editedList)
            QVERIFY(list->setData(1, QStringLiteral("env_weather1"), QStringLiteral("Regen")));
        // The first, a middle and the last report, then the list is edited and grows again.
        for (const int row : {0, 4, 7}) {
            const int id = list->data(row, QStringLiteral("id"), Qt::EditRole).toInt();
            if (modelsInUse)
                QVERIFY(m_doc->appendEntryConcern(id)); // left unsubmitted
            QVERIFY(m_doc->removeEntryAll(row));
            QCOMPARE(shown(QStringLiteral("id")), rows("SELECT id FROM entry"));
        }
        QVERIFY(list->setData(3, QStringLiteral("env_weather2"), QStringLiteral("Sonne")));
        QCOMPARE(m_doc->appendEntry(), 1);
        QVERIFY(list->submitAll());
        QCOMPARE(shown(QStringLiteral("id")), rows("SELECT id FROM entry"));
        QCOMPARE(shown(QStringLiteral("env_weather2")), rows("SELECT env_weather2 FROM entry"));
        QStringList edits = {"5||Sonne"};
        if (editedList)
            edits.prepend("2|Regen|");
        QCOMPARE(rows("SELECT id, env_weather1, env_weather2 FROM entry "
                      "WHERE id <= 10 AND (env_weather1 <> '' OR env_weather2 <> '')"),
                 edits);
        QCOMPARE(rows("SELECT count(*) FROM entry_concern"), QStringList{"0"});
    }

    void modelsOfFewReportsKept()
    {
        setReports(300, {});
        exec({"INSERT INTO entry_attendee SELECT id, id, 0, NULL, 'Person ' || id FROM entry",
              "INSERT INTO id_generator VALUES ('entry_attendee', 300)"});
        const int wholeDiary = m_doc->findChildren<VDRSqlTableModel*>().size();
        // The report on show is pinned and another one holds an unsubmitted row: both must stay.
        const VDRDocument::EntryModelsPin shown(m_doc.get(), 1);
        const QPointer<VDRSqlTableModel> shownModel = m_doc->modelEntryAttendee(1);
        QVERIFY(m_doc->appendEntryConcern(2));
        const QPointer<VDRSqlTableModel> edited = m_doc->modelEntryConcern(2);
        const QPointer<VDRSqlTableModel> early = m_doc->modelEntryAttendee(3);
        const int perReport = m_doc->entryModels(3).size();

        int most = 0;
        for (int id = 1; id <= 300; ++id) {
            QCOMPARE(
                m_doc->modelEntryAttendee(id)->data(0, QStringLiteral("comment"), Qt::EditRole).toString(),
                QStringLiteral("Person %1").arg(id));
            most = std::max(most, m_doc->findChildren<VDRSqlTableModel*>().size() - wholeDiary);
        }
        QVERIFY2(most <= (VDRDocument::keptEntryModelSets() + 2) * perReport,
                 qPrintable(QString::number(most)));
        QVERIFY(shownModel && edited && !early);
        QVERIFY(edited->submitAll());
        QCOMPARE(rows("SELECT entry_id, id FROM entry_concern"), QStringList{"2|1"});

        // Copying reports far apart, as the report list does, keeps the bound too.
        QVERIFY(m_doc->copyEntryAll(0) && m_doc->copyEntryAll(150));
        QCOMPARE(rows("SELECT entry_id, comment FROM entry_attendee WHERE entry_id > 300"),
                 QStringList({"301|Person 1", "302|Person 151"}));
        QVERIFY(m_doc->entryModelSetCount() <= VDRDocument::keptEntryModelSets() + 2);
    }

    void oldVersionFreezesOnOpening_data()
    {
        QTest::addColumn<QString>("version");
        QTest::addColumn<bool>("repaired");
        QTest::newRow("0.0") << "0.0" << true;
        QTest::newRow("0.1") << "0.1" << true;
        QTest::newRow("0.2") << "0.2" << false;
    }

    void oldVersionFreezesOnOpening()
    {
        QFETCH(QString, version);
        QFETCH(bool, repaired);

        m_doc->closeDocument(); // the fixture opens a document of its own
        const QString path = m_dir.filePath(QStringLiteral("alt %1.vd2").arg(version));
        QVERIFY(createDiary(path));
        const QStringList sql = {
            QStringLiteral("UPDATE meta SET value = '%1' WHERE key = 'fileversion'").arg(version),
            "INSERT INTO company VALUES (10, 2, '', '', '', 'Bau GmbH', '', '', '', '', '', '', '', 1)",
            "UPDATE id_generator SET id_counter = 10 WHERE id_table = 'company'",
            "UPDATE entry SET locked = 1, number = '001'",
            "INSERT INTO entry SELECT 2, 0, NULL, NULL, '002 (Entwurf)', inspection_date, "
            "inspection_time_from, "
            "inspection_time_to, env_time, '', '', '', '', '', '', '', '', '', '', 0, '', 1, 1, 0, '', NULL, "
            "0, "
            "NULL FROM entry WHERE id = 1",
            "INSERT INTO entry_workforce VALUES (1, 1, 5, 10, '', 2, '', NULL), (2, 1, 9, 1, '', 1, '', "
            "NULL), "
            "(3, 2, 0, 10, '', 1, '', NULL)",
            "INSERT INTO id_generator VALUES ('entry_workforce', 3)"};
        QVERIFY(execSql(path, sql));
        // A current structure under an old version number: nothing to extend, so no message.
        QVERIFY(openDiary(*m_doc, path));
        QCOMPARE(rows("SELECT category, company FROM company WHERE category < 0 ORDER BY id"),
                 repaired ? QStringList({"-2|Bau GmbH", "-1|"}) : QStringList());
        // Only the locked report points at the copies; its rows are renumbered from 0.
        QCOMPARE(rows("SELECT w.entry_id, w.pos, c.category FROM entry_workforce w JOIN company c ON "
                      "c.id = w.company_id ORDER BY w.id"),
                 repaired ? QStringList({"1|0|-2", "1|1|-1", "2|0|2"})
                          : QStringList({"1|5|2", "1|9|1", "2|0|2"}));
    }

    void photoAssignmentRepair_data()
    {
        QTest::addColumn<bool>("hadRelations");
        QTest::addColumn<QStringList>("photos");
        QTest::addColumn<QStringList>("deficiencies");
        QTest::addColumn<QStringList>("reportTexts");
        // clang-format off
        QTest::newRow("file from before relation_id") << false
            << QStringList({"1|2|", "2|3|", "3|NULL| ", "4|NULL|Riss in Wand", "5|5|", "6|2|"})
            << QStringList({"2|1|Riss in Wand|3|2", "3|1|Riss in Wand|2|1", "4|2|Fenster klemmt|NULL|0",
                            "5|2|Riss in Wand|3|1"})
            << QStringList({"", ""});
        QTest::newRow("file with relation_id") << true
            << QStringList({"1|NULL|Riss in Wand", "2|NULL|Riss in Wand", "3|NULL| ", "4|NULL|Riss in Wand",
                            "5|NULL| Riss in Wand ", "6|NULL|Riss in Wand"})
            << QStringList({"2|1|Riss in Wand|3|NULL"}) << QStringList({"", "Fenster klemmt"});
        // clang-format on
    }

    void photoAssignmentRepair()
    {
        QFETCH(bool, hadRelations);
        QFETCH(QStringList, photos);
        QFETCH(QStringList, deficiencies);
        QFETCH(QStringList, reportTexts);

        // The repair's trigger: entry_photo had no relation_id until this opening added it.
        const QString path = m_dir.filePath(QStringLiteral("fotos%1.vd2").arg(hadRelations));
        QVERIFY(createOldestLayoutDiary(path, QStringLiteral("0.3")));
        QStringList sql = {"ALTER TABLE entry_photo ADD company_id INTEGER"};
        if (hadRelations)
            sql << "ALTER TABLE entry_photo ADD relation_id INTEGER";
        // Report 1 has deficiency 2, "Riss in Wand" of company 3; report 2 has none.
        sql << "INSERT INTO entry_photo (id, entry_id, pos, type, photo_image_id, caption, comment, date, "
               "company_id) VALUES (1, 1, 0, 2, 1, 'Foto', 'Riss in Wand', '2009-03-02', 3), "
               "(2, 1, 1, 2, 2, 'Foto', 'Riss in Wand', '2009-03-02', 2), " // another company
               "(3, 1, 2, 2, 3, 'Foto', ' ', '2009-03-02', NULL), "         // blank: nothing to assign
               "(4, 1, 3, 1, 4, 'Foto', 'Riss in Wand', '2009-03-02', 3), " // progress register
               "(5, 2, 0, 2, 5, 'Foto', ' Riss in Wand ', '2009-03-02', 3), "
               "(6, 1, 4, 2, 6, 'Foto', 'Riss in Wand', '2009-03-02', 3)"
            << "UPDATE entry SET deficiencies = 'Fenster klemmt' WHERE id = 2"
            << "INSERT INTO id_generator VALUES ('entry_progress', 2)";
        QVERIFY(execSql(path, sql));

        m_doc->closeDocument();
        m_prompt.expect(QStringLiteral("Datei-Warnung"),
                        QStringLiteral("Die Struktur des Dokuments wird jetzt erweitert"));
        QVERIFY(openDiary(*m_doc, path));
        QCOMPARE(rows("SELECT id, relation_id, comment FROM entry_photo ORDER BY id"), photos);
        QCOMPARE(rows("SELECT id, entry_id, description, company_id, image_cnt FROM entry_progress "
                      "WHERE type = 4 ORDER BY id"),
                 deficiencies);
        QCOMPARE(rows("SELECT deficiencies FROM entry ORDER BY id"), reportTexts);
    }

private:
    void exec(const QStringList& statements) { QVERIFY(execOn(m_doc->database(), statements)); }
    // Rows of a query on the document's own connection, values joined by "|", NULL as "NULL".
    QStringList rows(const QString& sql) { return textsOn(m_doc->database(), sql); }

    // Replaces the reports by locked ones numbered 001..count followed by 'numbers'.
    void setReports(int count, const QStringList& numbers)
    {
        QStringList sql = {"CREATE TEMP TABLE numbers (id INTEGER PRIMARY KEY, number TEXT)"};
        sql << QStringLiteral(
                   "INSERT INTO numbers WITH RECURSIVE n(i) AS (SELECT 1 UNION ALL SELECT i + 1 FROM n "
                   "WHERE i < %1) SELECT i, printf('%03d', i) FROM n WHERE %1 > 0")
                   .arg(count);
        for (const QString& number : numbers)
            sql << QStringLiteral("INSERT INTO numbers (number) VALUES ('%1')").arg(number);
        // Copies of the new diary's report under the new ids and numbers, locked unless a draft.
        sql << "INSERT INTO entry SELECT n.id + 1000000, instr(n.number, '(') = 0, NULL, NULL, n.number, "
               "e.inspection_date, e.inspection_time_from, e.inspection_time_to, e.env_time, '', '', '', '', "
               "'', "
               "'', '', '', '', '', 0, '', 1, 1, 0, '', NULL, 0, NULL FROM numbers n, entry e WHERE e.id = 1"
            << "DELETE FROM entry WHERE id < 1000000"
            << "UPDATE entry SET id = id - 1000000"
            << "DROP TABLE numbers"
            << QStringLiteral("UPDATE id_generator SET id_counter = %1 WHERE id_table = 'entry'")
                   .arg(count + numbers.size());
        exec(sql);
        m_doc->modelEntryAll()->select();
    }

    std::unique_ptr<VDRDocument> m_doc;
};

QTEST_GUILESS_MAIN(TestVDRReports)
#include "tst_vdrreports.moc"
