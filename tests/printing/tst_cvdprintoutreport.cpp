#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "document/VDRDocument.h"
#include "printing/CVdConfig.h"
#include "printing/CVdPrintoutReport.h"

#include <QBuffer>
#include <QDir>
#include <QProcess>
#include <QRegularExpression>
#include <QtTest>

using namespace VDRTestFixtures;

namespace {
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

class TestCVdPrintoutReport : public VDRTestCase
{
    Q_OBJECT

    void initRun() override
    {
        CVdConfig::self()->reload();
        m_path = m_dir.filePath(QStringLiteral("Bericht.vd2"));
        QVERIFY(createDiary(m_path));
        QVERIFY(openDiary(m_doc, m_path));
    }
    void cleanupRun() override { m_doc.closeDocument(); }
    void initTest() override
    {
        QVERIFY(execOn(m_doc.database(),
                       {"DELETE FROM entry", "DELETE FROM entry_workforce", "DELETE FROM entry_progress",
                        "DELETE FROM entry_photo", "DELETE FROM entry_telephone_notice",
                        "DELETE FROM entry_task", "DELETE FROM entry_attendee", "DELETE FROM entry_equipment",
                        "DELETE FROM company", "UPDATE vdr SET display_empty_categories=0",
                        reportInsertSql(1, QStringLiteral("012 (Entwurf)"))}));
    }

private slots:
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
            << QStringList{"Telefonnotizen:", "09:15 Uhr", "Anruf Statiker"} << QStringList{};
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
            << QStringList{"Rohbau fertig", "(siehe Foto)", "Bad (2.01)", "Riss", "(siehe 3 Fotos)"}
            << QStringList{"<b>"};
        QTest::newRow("deficiency parts beside each other, company first")
            << QStringList{"INSERT INTO company (id, category, type, firstname, lastname, company, street, "
                           "plz, "
                           "city, telephone, telefax, mobile, email, pos) VALUES (7, 1, ' ', ' ', ' ', "
                           "'Maler Blau', ' ', ' ', ' ', ' ', ' ', ' ', ' ', 0)",
                           "INSERT INTO entry_progress (entry_id, pos, type, description, roomname, "
                           "roombook_number, company_id) VALUES (1, 0, 4, 'Fleck', 'Flur', ' ', NULL), "
                           "(1, 1, 4, 'Riss', 'Bad', '2.01', 7)"}
            << QStringList{"Mängel:", "Maler Blau", "Riss", "Bad (2.01)", "Flur", "Fleck"}
            << QStringList{" - Riss"};
        QTest::newRow("attendees: companies in pos order, then rows without one")
            << QStringList{"INSERT INTO company (id, category, type, firstname, lastname, company, street, "
                           "plz, "
                           "city, telephone, telefax, mobile, email, pos) VALUES (7, 1, ' ', ' ', ' ', "
                           "'Planbüro', ' ', ' ', ' ', ' ', ' ', ' ', ' ', 0), (8, 1, ' ', ' ', ' ', "
                           "'Rohbau AG', ' ', ' ', ' ', ' ', ' ', ' ', ' ', 1)",
                           "INSERT INTO entry_attendee (entry_id, pos, company_id, comment) VALUES "
                           "(1, 0, NULL, 'Gast'), (1, 1, 8, 'Polier'), (1, 2, 99, 'Verwaist'), "
                           "(1, 3, 7, 'Architekt')"}
            << QStringList{"Anwesende:", "Rohbau AG", "Polier", "Planbüro", "Architekt", "Gast", "Verwaist"}
            << QStringList{};
        QTest::newRow("rich text keeps its words in order")
            << QStringList{"UPDATE entry SET progress='<html><body><p>Erste <b>fette</b> Zeile</p><ul>"
                           "<li>Punkt eins</li><li>Punkt zwei</li></ul><table border=1><tr><td>Zelle A</td>"
                           "<td>Zelle B</td></tr></table><p>Schluss</p></body></html>'"}
            << QStringList{"Erste fette Zeile", "Punkt eins", "Punkt zwei", "Zelle A", "Zelle B", "Schluss"}
            << QStringList{"<", "&"};
        QTest::newRow("equipment times as hours with sums")
            << QStringList{"INSERT INTO entry_equipment (entry_id, pos, equipment, operating_zone, "
                           "operating_time, downtime, downtime_reasons, comment) VALUES "
                           "(1, 0, 'Bagger', 'Nord', 90, 30, ' ', ' '), (1, 1, 'Kran', 'Süd', 60, 0, ' ', ' "
                           "')"}
            << QStringList{"Geräte und Maschinen:",
                           "Bagger",
                           "Nord",
                           "Einsatzzeiten:",
                           "Stillstandszeiten:",
                           "1:30 Stunden",
                           "0:30 Stunden",
                           "Kran",
                           "Süd",
                           "Einsatzzeiten:",
                           "1:00 Stunden",
                           "Summen:",
                           "Einsatzzeiten:",
                           "Stillstandszeiten:",
                           "2:30 Stunden",
                           "0:30 Stunden"}
            << QStringList{"0:00 Stunden"};
        // Numbers no form would store, from a file written by hand: printed as they are, sums stop
        // at the end of the range.
        QTest::newRow("absurd stored numbers")
            << QStringList{"INSERT INTO entry_equipment (entry_id, pos, equipment, operating_zone, "
                           "operating_time, downtime, downtime_reasons, comment) VALUES "
                           "(1, 0, 'Bagger', ' ', -9223372036854775808, -9223372036854775808, ' ', ' '), "
                           "(1, 1, 'Kran', ' ', -2147483648, -1, ' ', ' ')",
                           "INSERT INTO entry_workforce (entry_id, pos, company_id, comment, person_count, "
                           "person_type) VALUES "
                           "(1, 0, NULL, ' ', 9223372036854775807, ' '), (1, 1, NULL, ' ', "
                           "9223372036854775807, ' ')"}
            << QStringList{"9223372036854775807", "-153722867280912930:08", "-35791394:08"}
            << QStringList{"-2 Personen", "-2\n"};
    }
    void content()
    {
        QFETCH(QStringList, sql);
        QFETCH(QStringList, shown);
        QFETCH(QStringList, hidden);
        QVERIFY(execOn(m_doc.database(), sql));
        const QString text = printed({1});
        // Shown texts appear in the order given.
        int at = 0;
        for (const QString& s : shown) {
            at = text.indexOf(s, at);
            QVERIFY2(at >= 0, qPrintable(s + QStringLiteral("\n") + text));
        }
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

    // Two reports: the first with 500 workforce rows over many pages, every company once and in pos order
    // before the row without one, the totals at the end; page labels restart for the second report, and
    // the signature line is on every page.
    void pagesPerReport()
    {
        QStringList sql{reportInsertSql(2, QStringLiteral("013"))};
        QStringList companies, rows{QStringLiteral("(1, -1, NULL, 'ohne Firma', 1, ' ')")};
        for (int i = 0; i < 500; ++i) {
            companies << QStringLiteral(
                             "(%1, 1, ' ', ' ', ' ', 'Firma %2', ' ', ' ', ' ', ' ', ' ', ' ', ' ', 0)")
                             .arg(1000 + 500 - i)
                             .arg(i, 4, 10, QLatin1Char('0'));
            rows << QStringLiteral("(1, %1, %2, 'Zeile %3', 1, ' ')")
                        .arg(i)
                        .arg(1000 + 500 - i)
                        .arg(i, 4, 10, QLatin1Char('0'));
        }
        sql << QStringLiteral(
                   "INSERT INTO company (id, category, type, firstname, lastname, company, street, "
                   "plz, city, telephone, telefax, mobile, email, pos) VALUES ") +
                   companies.join(QLatin1Char(','))
            << QStringLiteral(
                   "INSERT INTO entry_workforce (entry_id, pos, company_id, comment, person_count, "
                   "person_type) VALUES ") +
                   rows.join(QLatin1Char(','));
        QVERIFY(execOn(m_doc.database(), sql));
        const QString pdf = m_dir.filePath(QStringLiteral("zwei.pdf"));
        CVdPrintoutReport printout(nullptr, {1, 2});
        QVERIFY(printout.print(CVdPrintout::Pdf, pdf, false, QString()));
        const int pages = pdfPages(pdf);
        QVERIFY2(pages > 5, qPrintable(QString::number(pages)));
        const QString all = pdfText(pdf);
        int at = 0;
        for (int i = 0; i < 500; ++i) {
            const QString name = QStringLiteral("Firma %1").arg(i, 4, 10, QLatin1Char('0'));
            QVERIFY2(all.count(name) == 1 && all.indexOf(name) > at, qPrintable(name));
            at = all.indexOf(name);
        }
        QVERIFY(all.indexOf(QStringLiteral("ohne Firma")) > at);
        QVERIFY(all.indexOf(QStringLiteral("Summen:")) > all.indexOf(QStringLiteral("ohne Firma")));
        QVERIFY(all.contains(QStringLiteral("501 Personen")));
        for (int page = 1; page <= pages; ++page) {
            const QString text = pdfText(pdf, page);
            const QString label = page < pages ? QStringLiteral("Seite %1/%2").arg(page).arg(pages - 1)
                                               : QStringLiteral("Seite 1/1");
            QVERIFY2(text.contains(label), qPrintable(label + QStringLiteral("\n") + text));
            QVERIFY(text.contains(QStringLiteral("Unterschrift Bauleitung")));
            QCOMPARE(text.contains(QStringLiteral("013-AB")), page == pages);
        }
    }

    // However far down the page the rows before it end, a caption stays on the page of its first line.
    void captionKeepsItsLines_data()
    {
        QTest::addColumn<QString>("filler");   // %1: the number of filler rows
        QTest::addColumn<QString>("lastFill"); // the last filler row, %1 its index
        QTest::addColumn<QString>("section");
        QTest::addColumn<QString>("caption");
        QTest::addColumn<QString>("firstLine");
        QTest::newRow("plain text after plain text")
            << "UPDATE entry SET progress=(WITH RECURSIVE n(i) AS (SELECT 0 UNION ALL SELECT i+1 FROM n "
               "WHERE i+1<%1) SELECT group_concat('Fortschritt ' || i, char(10)) FROM n)"
            << "Fortschritt %1"
            << "UPDATE entry SET interventions='Eingriff eins\nEingriff zwei\nEingriff drei'"
            << "Eingriffe in Tragwerke:"
            << "Eingriff eins";
        QTest::newRow("rich text after workforce rows")
            << "INSERT INTO entry_workforce (entry_id, pos, comment, person_count, person_type) WITH "
               "RECURSIVE "
               "n(i) AS (SELECT 0 UNION ALL SELECT i+1 FROM n WHERE i+1<%1) SELECT 1, i, 'Zeile ' || i, 1, ' "
               "' "
               "FROM n"
            << "Zeile %1"
            << "UPDATE entry SET progress='<p>Erster <b>Absatz</b></p><p>Zweiter Absatz</p>'"
            << "Leistungsstand:"
            << "Erster Absatz";
    }
    void captionKeepsItsLines()
    {
        QFETCH(QString, filler);
        QFETCH(QString, lastFill);
        QFETCH(QString, section);
        QFETCH(QString, caption);
        QFETCH(QString, firstLine);
        bool moved = false;
        for (int rows = 20; rows <= 90 && !moved; ++rows) {
            QVERIFY(execOn(m_doc.database(), {"DELETE FROM entry_workforce", "UPDATE entry SET progress=' '",
                                              filler.arg(rows), section}));
            const QString pdf = m_dir.filePath(QStringLiteral("fuss.pdf"));
            CVdPrintoutReport printout(nullptr, {1});
            QVERIFY(printout.print(CVdPrintout::Pdf, pdf, false, QString()));
            const int pages = pdfPages(pdf);
            for (int page = 1; page <= pages; ++page) {
                const QString text = pdfText(pdf, page);
                if (text.contains(caption)) {
                    QVERIFY2(text.contains(firstLine), qPrintable(text));
                    moved = page > 1 && pdfText(pdf, page - 1).contains(lastFill.arg(rows - 1));
                }
            }
        }
        QVERIFY(moved);
    }

    // Over-long words, a 20,000-pixel image and a 20,000-pixel table stay inside the body: everything is
    // printed once, the pages are bounded, and no word lies right of the print area or over the footer.
    void staysInBody_data()
    {
        const QString word = QStringLiteral("abcdefghij").repeated(30);
        QStringList tableRows;
        for (int i = 0; i < 1000; ++i)
            tableRows << QStringLiteral("<tr><td>R%1</td><td>W</td></tr>").arg(i, 4, 10, QLatin1Char('0'));
        QTest::addColumn<QString>("sql");
        QTest::addColumn<QStringList>("once");
        QTest::addColumn<int>("maxPages");
        QTest::newRow("300-character word")
            << QStringLiteral("UPDATE entry SET progress='Anfang %1 Ende'").arg(word)
            << QStringList{"Anfang" + word + "Ende"} << 1;
        QTest::newRow("long address in a two-column cell")
            << QStringLiteral("INSERT INTO entry_attendee (entry_id, pos, company_id, comment) VALUES "
                              "(1, 0, NULL, 'siehe https://example.com/%1')")
                   .arg(word)
            << QStringList{"https://example.com/" + word} << 1;
        QStringList lines;
        for (int i = 0; i < 150; ++i)
            lines << QStringLiteral("Zeile%1").arg(i, 3, 10, QLatin1Char('0'));
        QTest::newRow("a 150-line cell continues over pages")
            << QStringLiteral("UPDATE entry SET progress='%1'").arg(lines.join(QLatin1Char('\n'))) << lines
            << 4;
        QTest::newRow("20,000-pixel image")
            << "UPDATE entry SET progress='<p>Vorher</p><p><img src=\"fehlt.png\" width=\"300\" "
               "height=\"20000\"></p><p>Nachher</p>'"
            << QStringList{"Vorher", "Nachher"} << 3;
        QStringList cells;
        for (int i = 0; i < 1000; ++i)
            cells << QStringLiteral("R%1W").arg(i, 4, 10, QLatin1Char('0'));
        QTest::newRow("20,000-pixel table")
            << QStringLiteral("UPDATE entry SET progress='<table border=1>%1</table>'")
                   .arg(tableRows.join(QString()))
            << cells << 40;
    }
    void staysInBody()
    {
        QFETCH(QString, sql);
        QFETCH(QStringList, once);
        QFETCH(int, maxPages);
        // The frame's own words, from a report without content, mark the footer.
        const QString pdf = m_dir.filePath(QStringLiteral("rand.pdf"));
        QVERIFY(CVdPrintoutReport(nullptr, {1}).print(CVdPrintout::Pdf, pdf, false, QString()));
        qreal footerTop = 1e9, right = 0;
        QSet<QString> footerWords;
        for (const Word& w : words(pdf))
            if (w.box.top() > w.pageHeight / 2) {
                footerTop = qMin(footerTop, w.box.top());
                footerWords << w.text;
                right = qMax(right, w.box.right());
            }
        QVERIFY(!footerWords.isEmpty());

        QVERIFY(execOn(m_doc.database(), {sql, "UPDATE entry SET special_incidents='Danach'"}));
        QVERIFY(CVdPrintoutReport(nullptr, {1}).print(CVdPrintout::Pdf, pdf, false, QString()));
        const int pages = pdfPages(pdf);
        QVERIFY2(pages >= 1 && pages <= maxPages, qPrintable(QString::number(pages)));
        const QString text = pdfText(pdf).remove(QRegularExpression(QStringLiteral("\\s")));
        for (const QString& s : once + QStringList{"Danach"})
            QVERIFY2(text.count(s) == 1, qPrintable(s));
        const QRegularExpression pageLabel(QStringLiteral("^\\d+/\\d+$"));
        for (const Word& w : words(pdf)) {
            QVERIFY2(w.box.right() <= right + 0.5, qPrintable(w.text));
            const bool footer = footerWords.contains(w.text) || pageLabel.match(w.text).hasMatch();
            QVERIFY2(w.box.bottom() <= footerTop || (footer && w.box.top() >= footerTop - 0.5),
                     qPrintable(w.text));
        }
    }

    // A stored text shows the pictures it carries, never a file of this computer it names.
    void richTextShowsOnlyItsOwnPictures()
    {
        const auto png = [](int w, int h) {
            QImage image(w, h, QImage::Format_RGB32);
            image.fill(Qt::red);
            QByteArray bytes;
            QBuffer buffer(&bytes);
            buffer.open(QIODevice::WriteOnly);
            image.save(&buffer, "PNG");
            return bytes;
        };
        const QString local = m_dir.filePath(QStringLiteral("geheim.png"));
        QVERIFY(writeFile(local, png(200, 100)));
        QVERIFY(execOn(m_doc.database(),
                       {QStringLiteral("UPDATE entry SET progress='<p>A</p><img src=\"%1\"><img "
                                       "src=\"file://%1\"><img src=\"data:image/png;base64,%2\"><p>B</p>'")
                            .arg(local, QString::fromLatin1(png(30, 20).toBase64()))}));
        const QString pdf = m_dir.filePath(QStringLiteral("bilder.pdf"));
        QVERIFY(CVdPrintoutReport(nullptr, {1}).print(CVdPrintout::Pdf, pdf, false, QString()));
        const QString list = tool(QStringLiteral("pdfimages"), {QStringLiteral("-list"), pdf});
        QVERIFY2(list.contains(QRegularExpression(QStringLiteral("image\\s+30\\s+20\\s"))), qPrintable(list));
        QVERIFY2(!list.contains(QRegularExpression(QStringLiteral("image\\s+200\\s+100\\s"))),
                 qPrintable(list));
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
    struct Word
    {
        QString text;
        QRectF box;
        qreal pageHeight;
    };
    // Every word of a PDF with its box in points, as pdftotext -bbox reports it.
    static QList<Word> words(const QString& pdf)
    {
        QList<Word> found;
        qreal pageHeight = 0;
        const QRegularExpression tag(QStringLiteral(
            "<page width=\"[\\d.]+\" height=\"([\\d.]+)\">|<word xMin=\"([\\d.]+)\" yMin=\"([\\d.]+)\" "
            "xMax=\"([\\d.]+)\" yMax=\"([\\d.]+)\">([^<]*)</word>"));
        auto it = tag.globalMatch(tool(QStringLiteral("pdftotext"), {QStringLiteral("-bbox"), pdf, "-"}));
        while (it.hasNext()) {
            const auto m = it.next();
            if (!m.captured(1).isEmpty()) {
                pageHeight = m.captured(1).toDouble();
                continue;
            }
            found << Word{m.captured(6),
                          QRectF(QPointF(m.captured(2).toDouble(), m.captured(3).toDouble()),
                                 QPointF(m.captured(4).toDouble(), m.captured(5).toDouble())),
                          pageHeight};
        }
        return found;
    }

    QString printed(const QList<int>& ids)
    {
        const QString pdf = m_dir.filePath(QStringLiteral("bericht.pdf"));
        CVdPrintoutReport printout(nullptr, ids);
        if (!printout.print(CVdPrintout::Pdf, pdf, false, QString()))
            return QString();
        return pdfText(pdf);
    }

    VDRDocument m_doc;
    QString m_path;
};

QTEST_MAIN(TestCVdPrintoutReport)
#include "tst_cvdprintoutreport.moc"
