#include "VDRTestFixtures.h"
#include "VDRTestPrompt.h"
#include "document/VDRDocument.h"
#include "printing/CVdConfig.h"
#include "printing/CVdPrintoutReport.h"

#include <QDir>
#include <QProcess>
#include <QRegularExpression>
#include <QTemporaryDir>
#include <QtTest>

using namespace VDRTestFixtures;

namespace {
const char* const kReport =
    "INSERT INTO entry (id, locked, number, inspection_date, inspection_time_from, inspection_time_to, "
    "env_time, env_weather1, env_weather2, env_weather3, env_temperature, env_humidity, progress, "
    "deficiencies, construction_material_sample, print_notice, print_telephone_notice, user_id) VALUES "
    "(%1, 0, '%2', '2024-03-05', '07:00:00', '16:30:00', '00:00:00', ' ', ' ', ' ', ' ', ' ', ' ', ' ', 0, "
    "0, 0, "
    "'AB')";

// The captions of every section, in their printed order.
const QStringList kCaptions{"Wetter:",
                            "Anwesende:",
                            "Bau-Besetzung:",
                            "Leistungsstand:",
                            "Besondere Vorkommnisse:",
                            "Abnahmen:",
                            "Mängel:",
                            "Verzüge:",
                            "Behinderungen:",
                            "Wichtige Baumaßnahmen:",
                            "Weisungen:",
                            "Eingriffe in Tragwerke:",
                            "Zusatzleistungen:",
                            "Bedenkenanmeldungen:",
                            "Prüfungen / Messungen:",
                            "Telefonnotizen:",
                            "Sonstige Notizen:",
                            "Baustoffe:",
                            "Probekörper:",
                            "Pläne und Dokumente:",
                            "Geräte und Maschinen:"};
} // namespace

class TestCVdPrintoutReport : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase()
    {
        QVERIFY(m_dir.isValid());
        isolateSettings(m_dir.filePath(QStringLiteral("settings")));
        QVERIFY(QDir().mkpath(m_dir.filePath(QStringLiteral("tmp"))));
        qputenv("TMPDIR", QFile::encodeName(m_dir.filePath(QStringLiteral("tmp"))));
        CVdConfig::self()->reload();
        m_path = m_dir.filePath(QStringLiteral("Bericht.vd2"));
        QVERIFY(createDiary(m_path));
        QVERIFY(openDiary(m_doc, m_path));
    }
    void cleanupTestCase() { m_doc.closeDocument(); }
    void init()
    {
        m_prompt.reset();
        QVERIFY(execOn(m_doc.database(),
                       {"DELETE FROM entry", "DELETE FROM entry_workforce", "DELETE FROM entry_progress",
                        "DELETE FROM entry_photo", "DELETE FROM entry_telephone_notice",
                        "DELETE FROM entry_task", "UPDATE vdr SET display_empty_categories=0",
                        QString::fromLatin1(kReport).arg(1).arg(QStringLiteral("012 (Entwurf)"))}));
    }
    void cleanup() { VDR_VERIFY_PROMPT(m_prompt); }

    // What one report shows, from the data given: texts that must appear and texts that must not.
    void content_data()
    {
        QTest::addColumn<QStringList>("sql");
        QTest::addColumn<QStringList>("shown");
        QTest::addColumn<QStringList>("hidden");
        QTest::newRow("draft heading, long date and times")
            << QStringList{}
            << QStringList{"Baubericht-Nr.: 012-AB (Entwurf)", "5 Mar 2024 07:00 - 16:30 Uhr"}
            << QStringList{"Wetter:"};
        QTest::newRow("weather with time")
            << QStringList{"UPDATE entry SET env_weather1='sonnig', env_weather3='windig', "
                           "env_temperature='12', "
                           "env_humidity='60', env_time='07:30:00'"}
            << QStringList{"Wetter:", "sonnig, windig, Temperatur: 12°C, Luftfeuchtigkeit: 60% um 07:30 Uhr"}
            << QStringList{};
        QTest::newRow("weather at midnight has no time")
            << QStringList{"UPDATE entry SET env_temperature='-3'"} << QStringList{"Temperatur: -3°C"}
            << QStringList{" um "};
        QTest::newRow("telephone notice without its print flag")
            << QStringList{"INSERT INTO entry_telephone_notice (entry_id, pos, description, time) "
                           "VALUES (1, 0, 'Anruf Statiker', '09:15:00')"}
            << QStringList{} << QStringList{"Telefonnotizen:", "Anruf Statiker"};
        QTest::newRow("telephone notice with its print flag")
            << QStringList{"INSERT INTO entry_telephone_notice (entry_id, pos, description, time) "
                           "VALUES (1, 0, 'Anruf Statiker', '09:15:00')",
                           "UPDATE entry SET print_telephone_notice=1"}
            << QStringList{"Telefonnotizen:", "09:15 - Anruf Statiker"} << QStringList{};
        QTest::newRow("notes only with their print flag")
            << QStringList{"UPDATE entry SET notice='Privat'"} << QStringList{}
            << QStringList{"Sonstige Notizen:", "Privat"};
        QTest::newRow("photo notes")
            << QStringList{"UPDATE entry SET progress='<html><body><p>Rohbau "
                           "<b>fertig</b></p></body></html>'",
                           "INSERT INTO entry_progress (entry_id, pos, type, description, roomname, "
                           "roombook_number) VALUES (1, 0, 4, 'Riss', 'Bad', '2.01')",
                           "INSERT INTO entry_photo (entry_id, pos, type, caption, comment, date) VALUES "
                           "(1, 0, 1, 'a', ' ', '2024-03-05'), (1, 0, 2, 'b', ' ', '2024-03-05'), "
                           "(1, 1, 2, 'c', ' ', '2024-03-05'), (1, 2, 2, 'd', ' ', '2024-03-05')"}
            << QStringList{"(siehe Foto)", "Rohbau fertig", "(siehe 3 Fotos)", "Bad (2.01) - Riss"}
            << QStringList{"<b>"};
    }
    void content()
    {
        QFETCH(QStringList, sql);
        QFETCH(QStringList, shown);
        QFETCH(QStringList, hidden);
        QVERIFY(execOn(m_doc.database(), sql));
        const QString text = printed({1});
        for (const QString& s : shown)
            QVERIFY2(text.contains(s), qPrintable(s + QStringLiteral("\n") + text));
        for (const QString& s : hidden)
            QVERIFY2(!text.contains(s), qPrintable(s + QStringLiteral("\n") + text));
    }

    // An empty report shows heading and frame only, or every caption in order when asked to.
    void emptyReport_data()
    {
        QTest::addColumn<bool>("displayEmpty");
        QTest::newRow("empty categories hidden") << false;
        QTest::newRow("empty categories shown") << true;
    }
    void emptyReport()
    {
        QFETCH(bool, displayEmpty);
        QVERIFY(
            execOn(m_doc.database(),
                   {QStringLiteral("UPDATE vdr SET display_empty_categories=%1").arg(int(displayEmpty))}));
        const QString text = printed({1}).simplified();
        QVERIFY(text.contains(QStringLiteral("Baubericht-Nr.: 012-AB (Entwurf)")));
        QVERIFY(text.contains(QStringLiteral("Unterschrift Bauleitung")));
        int at = -1;
        for (const QString& caption : kCaptions) {
            const int found = text.indexOf(caption);
            QVERIFY2(displayEmpty ? found > at : found < 0,
                     qPrintable(caption + QStringLiteral("\n") + text));
            at = found;
        }
    }

    // Two reports: the first long enough for several pages with every row kept, page labels restarting
    // for the second, and the signature line on every page.
    void pagesPerReport()
    {
        QStringList sql{QString::fromLatin1(kReport).arg(2).arg(QStringLiteral("013"))};
        QStringList values;
        for (int i = 0; i < 500; ++i)
            values << QStringLiteral("(1, %1, 'Zeile %2', 1, ' ')").arg(i).arg(i, 4, 10, QLatin1Char('0'));
        sql << QStringLiteral(
                   "INSERT INTO entry_workforce (entry_id, pos, comment, person_count, person_type) "
                   "VALUES ") +
                   values.join(QLatin1Char(','));
        QVERIFY(execOn(m_doc.database(), sql));
        const QString pdf = m_dir.filePath(QStringLiteral("zwei.pdf"));
        CVdPrintoutReport printout(nullptr, {1, 2});
        QVERIFY(printout.print(CVdPrintout::Pdf, pdf, false, QString()));
        const int pages = pdfPages(pdf);
        QVERIFY2(pages > 3, qPrintable(QString::number(pages)));
        const QString all = pdfText(pdf);
        for (int i = 0; i < 500; ++i)
            QVERIFY2(all.contains(QStringLiteral("Zeile %1").arg(i, 4, 10, QLatin1Char('0'))),
                     qPrintable(QString::number(i)));
        for (int page = 1; page <= pages; ++page) {
            const QString text = pdfText(pdf, page);
            const QString label = page < pages ? QStringLiteral("Seite %1/%2").arg(page).arg(pages - 1)
                                               : QStringLiteral("Seite 1/1");
            QVERIFY2(text.contains(label), qPrintable(label + QStringLiteral("\n") + text));
            QVERIFY(text.contains(QStringLiteral("Unterschrift Bauleitung")));
            QCOMPARE(text.contains(QStringLiteral("013-AB")), page == pages);
        }
    }

    // However far down the page the text before it ends, a caption stays on the page of its first lines.
    void captionKeepsItsLines()
    {
        bool moved = false;
        for (int lines = 40; lines <= 80 && !moved; ++lines) {
            QStringList progress;
            for (int i = 0; i < lines; ++i)
                progress << QStringLiteral("Fortschritt %1").arg(i);
            QVERIFY(execOn(
                m_doc.database(),
                {QStringLiteral("UPDATE entry SET progress='%1', interventions='Eingriff eins\nEingriff "
                                "zwei\nEingriff drei'")
                     .arg(progress.join(QLatin1Char('\n')))}));
            const QString pdf = m_dir.filePath(QStringLiteral("fuss.pdf"));
            CVdPrintoutReport printout(nullptr, {1});
            QVERIFY(printout.print(CVdPrintout::Pdf, pdf, false, QString()));
            const int pages = pdfPages(pdf);
            for (int page = 1; page <= pages; ++page) {
                const QString text = pdfText(pdf, page);
                if (text.contains(QStringLiteral("Eingriffe in Tragwerke:"))) {
                    QVERIFY2(text.contains(QStringLiteral("Eingriff zwei")), qPrintable(text));
                    moved = page > 1 &&
                            pdfText(pdf, page - 1).contains(QStringLiteral("Fortschritt %1").arg(lines - 1));
                }
            }
        }
        QVERIFY(moved);
    }

    // An existing read-only PDF is refused with a message and stays as it was; nothing is left beside it.
    void readOnlyTarget()
    {
        const QString folder = m_dir.filePath(QStringLiteral("schreibgeschützt"));
        QVERIFY(QDir().mkpath(folder));
        const QString pdf = folder + QStringLiteral("/alt.pdf");
        QVERIFY(writeFile(pdf, "alt"));
        QVERIFY(QFile::setPermissions(pdf, QFile::ReadOwner | QFile::ReadGroup));
        m_prompt.expect(QStringLiteral("Dateifehler"), QStringLiteral("kann nicht überschrieben werden"));
        CVdPrintoutReport printout(nullptr, {1});
        QVERIFY(!printout.print(CVdPrintout::Pdf, pdf, false, QString()));
        QCOMPARE(m_prompt.messages.size(), 1);
        QFile file(pdf);
        QVERIFY(file.open(QIODevice::ReadOnly));
        QCOMPARE(file.readAll(), QByteArray("alt"));
        QCOMPARE(QDir(folder).entryList(QDir::NoDotAndDotDot | QDir::AllEntries), QStringList{"alt.pdf"});
    }

private:
    QString printed(const QList<int>& ids)
    {
        const QString pdf = m_dir.filePath(QStringLiteral("bericht.pdf"));
        CVdPrintoutReport printout(nullptr, ids);
        if (!printout.print(CVdPrintout::Pdf, pdf, false, QString()))
            return QString();
        return pdfText(pdf);
    }

    QTemporaryDir m_dir;
    VDRTestPrompt m_prompt;
    VDRDocument m_doc;
    QString m_path;
};

QTEST_MAIN(TestCVdPrintoutReport)
#include "tst_cvdprintoutreport.moc"
