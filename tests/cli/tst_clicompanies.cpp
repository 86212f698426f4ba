#include "VDRTestCase.h"
#include "VDRTestFixtures.h"

#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>
#include <QSettings>
#include <QtTest>

using namespace VDRTestFixtures;

// varduna-cli companies: the lists as scripts and support read them.
class TestCliCompanies : public VDRTestCase
{
    Q_OBJECT

    void initRun() override
    {
        m_diary = m_dir.filePath(QStringLiteral("Baustelle.vd2"));
        QVERIFY(createDiary(m_diary));
        const QString insert =
            "INSERT INTO company (id, category, type, firstname, lastname, company, street, plz, "
            "city, telephone, telefax, mobile, email, pos) VALUES ";
        QVERIFY(execSql(m_diary,
                        {insert + "(101, 2, 'Statik', '', 'Meier', 'Bau GmbH', '', '', '', '', '', '', "
                                  "'', 7)",
                         insert + "(102, 2, 'Elektro', '', '', 'Strom AG', '', '', '', '', '', '', '', 3)",
                         insert + "(103, -2, 'Statik', '', 'Meier', 'Bau GmbH alt', '', '', '', '', '', "
                                  "'', '', 5)",
                         insert + "(104, 2, ' ', ' ', ' ', ' ', '', '', '', '', '', '', '', 9)"}));
    }

private slots:
    void listsInOrderWithBothFormats_data()
    {
        QTest::addColumn<bool>("bothBrackets");
        QTest::addColumn<QStringList>("companies");
        QTest::newRow("defaults")
            << false
            << QStringList({"102\tStrom AG (Elektro)\tStrom AG (Elektro)",
                            "103\tBau GmbH alt (Statik)\tMeier Bau GmbH alt (Statik)\t(eingefroren)",
                            "101\tBau GmbH (Statik)\tMeier Bau GmbH (Statik)", "104\t\t"});
        QTest::newRow("both brackets")
            << true
            << QStringList({"102\t(Strom AG, Elektro)\tStrom AG (Elektro)",
                            "103\t(Bau GmbH alt, Statik)\tMeier Bau GmbH alt "
                            "(Statik)\t(eingefroren)",
                            "101\t(Bau GmbH, Statik)\tMeier Bau GmbH (Statik)", "104\t\t"});
    }

    void listsInOrderWithBothFormats()
    {
        QFETCH(bool, bothBrackets);
        QFETCH(QStringList, companies);
        QSettings().setValue("CompanyOutputFormats/format1Field2InBrackets", bothBrackets);
        QSettings().sync();
        const QByteArray before = fileHash(m_diary);

        QString out;
        QCOMPARE(cli({"companies", m_diary}, &out), 0);
        const QStringList lines = out.split('\n');
        const int start = lines.indexOf("Gewerke/Baufirmen:");
        QVERIFY2(start > 0, qPrintable(out));
        QCOMPARE(lines.first(), QString("Am Bau beteiligte Personen:"));
        QCOMPARE(lines.mid(1, start - 1).size(), 3); // the three persons of a new diary
        QCOMPARE(lines.mid(start + 1, 4), companies);

        QCOMPARE(cli({"companies", m_diary, "--json"}, &out), 0);
        const QJsonObject json = QJsonDocument::fromJson(out.toUtf8()).object();
        const QJsonArray list2 = json.value("companies").toArray();
        QCOMPARE(list2.size(), 4);
        QCOMPARE(list2.at(0).toObject().value("format1").toString(), companies.at(0).section('\t', 1, 1));
        QCOMPARE(list2.at(1).toObject().value("frozen").toBool(), true);
        QCOMPARE(list2.at(2).toObject().value("lastname").toString(), QString("Meier"));
        QCOMPARE(json.value("persons").toArray().at(0).toObject().value("format2").toString(),
                 QString("(Bauherr)"));
        QCOMPARE(fileHash(m_diary), before); // looking changes nothing
    }

    void missingFileIsRefused()
    {
        QString out;
        QCOMPARE(cli({"companies", m_dir.filePath("fehlt.vd2")}, &out), 2);
        QVERIFY(out.isEmpty());
    }

private:
    int cli(const QStringList& args, QString* out)
    {
        const CliRun run = runCli(args);
        *out = run.out;
        return run.exitCode;
    }

    QString m_diary;
};

QTEST_MAIN(TestCliCompanies)
#include "tst_clicompanies.moc"
