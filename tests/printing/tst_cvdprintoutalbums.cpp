#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "document/VDRDocument.h"
#include "printing/CVdConfig.h"
#include "printing/CVdPrintoutReport.h"

#include <QDir>
#include <QImage>
#include <QRegularExpression>
#include <QtTest>

using namespace VDRTestFixtures;

// The photo albums at the end of a report: page grouping, geometry and what the PDF shows.
class TestCVdPrintoutAlbums : public VDRTestCase
{
    Q_OBJECT

    void initRun() override
    {
        CVdConfig::self()->reload();
        m_path = m_dir.filePath(QStringLiteral("Fotos.vd2"));
        QVERIFY(createDiary(m_path));
        QVERIFY(openDiary(m_doc, m_path));
        QImage landscape(600, 400, QImage::Format_RGB32), portrait(300, 400, QImage::Format_RGB32),
            camera(4000, 3000, QImage::Format_RGB32);
        landscape.fill(Qt::darkBlue);
        portrait.fill(Qt::darkGreen);
        camera.fill(Qt::darkRed);
        m_landscapeId = m_doc.createImage(landscape);
        m_portraitId = m_doc.createImage(portrait);
        m_cameraId = m_doc.createImage(camera);
        QVERIFY(m_landscapeId > 0 && m_portraitId > 0 && m_cameraId > 0);
        QVERIFY(execOn(m_doc.database(),
                       {imageInsertSql(64),
                        "INSERT INTO company (id, category, type, firstname, lastname, company, street, plz, "
                        "city, telephone, telefax, mobile, email, pos) VALUES (7, 1, ' ', ' ', ' ', "
                        "'Muster GmbH', ' ', ' ', ' ', ' ', ' ', ' ', ' ', 0)"}));
        m_brokenId = textsOn(m_doc.database(), QStringLiteral("SELECT max(id) FROM image")).value(0).toInt();
        QVERIFY(m_brokenId > m_cameraId);
    }
    void cleanupRun() override { m_doc.closeDocument(); }
    void initTest() override
    {
        QVERIFY(execOn(m_doc.database(), {"DELETE FROM entry", "DELETE FROM entry_photo",
                                          reportInsertSql(1, QStringLiteral("012"))}));
    }

private slots:
    // Photos in list order, L landscape and P portrait, and the layout code of each page.
    void grouping_data()
    {
        QTest::addColumn<QString>("photos");
        QTest::addColumn<QList<int>>("codes");
        QTest::newRow("none") << "" << QList<int>{};
        QTest::newRow("L") << "L" << QList<int>{1};
        QTest::newRow("LL") << "LL" << QList<int>{2};
        QTest::newRow("LP") << "LP" << QList<int>{3};
        QTest::newRow("LLL") << "LLL" << QList<int>{4};
        QTest::newRow("LPP") << "LPP" << QList<int>{5};
        QTest::newRow("P") << "P" << QList<int>{10};
        QTest::newRow("PP") << "PP" << QList<int>{11};
        QTest::newRow("PL") << "PL" << QList<int>{12};
        QTest::newRow("PPP") << "PPP" << QList<int>{13};
        QTest::newRow("PPL") << "PPL" << QList<int>{14};
        QTest::newRow("PPPP") << "PPPP" << QList<int>{15};
        QTest::newRow("five portraits") << "PPPPP" << QList<int>{15, 10};
        QTest::newRow("portrait breaks landscapes") << "LPL" << QList<int>{3, 1};
        QTest::newRow("no fourth landscape") << "LLLL" << QList<int>{4, 1};
        QTest::newRow("portrait after two landscapes") << "LLP" << QList<int>{2, 10};
        QTest::newRow("landscape after L, P") << "LPPL" << QList<int>{5, 1};
        QTest::newRow("nothing joins 12") << "PLP" << QList<int>{12, 10};
        QTest::newRow("no fourth after 14") << "PPLP" << QList<int>{14, 10};
        QTest::newRow("landscape fourth") << "PPPL" << QList<int>{13, 1};
        QTest::newRow("no fourth after 5") << "LPPP" << QList<int>{5, 10};
        QTest::newRow("nine") << "PPPPPPPPL" << QList<int>{15, 15, 1};
    }
    void grouping()
    {
        QFETCH(QString, photos);
        QFETCH(QList<int>, codes);
        QList<bool> portrait;
        for (const QChar c : photos)
            portrait << (c == QLatin1Char('P'));
        QCOMPARE(CVdPrintoutReport::album_layouts(portrait), codes);
        int taken = 0;
        for (const int code : codes)
            taken += CVdPrintoutReport::album_page_photos(code);
        QCOMPARE(taken, photos.size());
    }

    // Every slot of every layout lies inside the body and no two overlap.
    void slotsStayInside()
    {
        const QRect area(120, 300, 1000, 1400);
        for (const int code : {1, 2, 3, 4, 5, 10, 11, 12, 13, 14, 15}) {
            const QVector<QRect> pageSlots = CVdPrintoutReport::album_slots(code, area, 20);
            QCOMPARE(pageSlots.size(), CVdPrintoutReport::album_page_photos(code));
            for (int i = 0; i < pageSlots.size(); ++i) {
                QVERIFY2(area.contains(pageSlots[i]) && pageSlots[i].width() > 300 &&
                             pageSlots[i].height() > 300,
                         qPrintable(QString::number(code)));
                for (int j = i + 1; j < pageSlots.size(); ++j)
                    QVERIFY2(!pageSlots[i].intersects(pageSlots[j]), qPrintable(QString::number(code)));
            }
        }
    }

    // Photos given as type and kind (L, P, C a 12-megapixel landscape, X bytes that are no picture,
    // M a missing picture row): the texts shown, the page count and how many pictures the PDF holds,
    // none wider than the page's body.
    void printed_data()
    {
        QTest::addColumn<QStringList>("photos");
        QTest::addColumn<QStringList>("shown");
        QTest::addColumn<int>("pages");
        QTest::addColumn<int>("images");
        QTest::newRow("deficiencies") << QStringList{"2L", "2L", "2L"}
                                      << QStringList{"Bilder zur Mängelerfassung", "Bild 2 von 3 von Mängel",
                                                     "Bild 3 von 3 von Mängel",    "Datum:",
                                                     "Fototitel: Foto 1",          "Firma: Muster GmbH"}
                                      << 2 << 3;
        QTest::newRow("five portraits")
            << QStringList{"1P", "1P", "1P", "1P", "1P"}
            << QStringList{"Bilder zum Leistungsstand", "Bild 5 von 5 von Leistungsstand"} << 3 << 5;
        QTest::newRow("albums in type order, other types ignored")
            << QStringList{"5L", "6L", "3P", "4P"}
            << QStringList{"Bilder zu Behinderungen",
                           "Bild 1 von 1 von Behinderungen",
                           "Bilder zu Wichtige Baumaßnahmen",
                           "Bild 1 von 1 von Wichtige Baumaßnahmen",
                           "Bilder zu Baustoffen",
                           "Bild 1 von 1 von Baustoffe"}
            << 4 << 3;
        QTest::newRow("camera-sized photo")
            << QStringList{"1C", "1P"} << QStringList{"Bild 1 von 2 von Leistungsstand"} << 2 << 2;
        QTest::newRow("not a picture")
            << QStringList{"2X", "2M"} << QStringList{"Bild 1 von 2 von Mängel", "Bild 2 von 2 von Mängel"}
            << 2 << 0;
    }
    void printed()
    {
        QFETCH(QStringList, photos);
        QFETCH(QStringList, shown);
        QFETCH(int, pages);
        QFETCH(int, images);
        QStringList sql;
        for (int i = 0; i < photos.size(); ++i) {
            const QChar kind = photos[i].at(1);
            const int image = kind == QLatin1Char('L')   ? m_landscapeId
                              : kind == QLatin1Char('P') ? m_portraitId
                              : kind == QLatin1Char('C') ? m_cameraId
                              : kind == QLatin1Char('X') ? m_brokenId
                                                         : 99999;
            sql << QStringLiteral("INSERT INTO entry_photo (entry_id, pos, type, photo_image_id, caption, "
                                  "comment, company_id, date) VALUES (1, %1, %2, %3, 'Foto %1', ' ', 7, "
                                  "'2024-03-0%4')")
                       .arg(i)
                       .arg(photos[i].at(0))
                       .arg(image)
                       .arg(i % 9 + 1);
        }
        QVERIFY(execOn(m_doc.database(), sql));
        const QString pdf = m_dir.filePath(QStringLiteral("album.pdf"));
        CVdPrintoutReport printout(nullptr, {1});
        QVERIFY(printout.print(CVdPrintout::Pdf, pdf, false, QString()));
        QCOMPARE(pdfPages(pdf), pages);
        const QString text = pdfText(pdf);
        int at = -1;
        for (const QString& s : shown) {
            const int found = text.indexOf(s, qMax(at, 0));
            QVERIFY2(found >= 0, qPrintable(s + QStringLiteral("\n") + text));
            at = s.startsWith(QLatin1String("Bilder")) ? found : at;
        }
        // Each album starts a page of its own after the report's first page.
        QVERIFY(!pdfText(pdf, 1).contains(QStringLiteral("Bilder z")));
        const QStringList list =
            tool(QStringLiteral("pdfimages"), {QStringLiteral("-list"), pdf}).split(QLatin1Char('\n'));
        const QStringList embedded =
            list.filter(QRegularExpression(QStringLiteral("^\\s*\\d+\\s+\\d+\\s+image")));
        QCOMPARE(embedded.size(), images);
        // A4 at 150 dpi less the margins: about 1060 pixels.
        for (const QString& row : embedded)
            QVERIFY2(row.simplified().section(QLatin1Char(' '), 3, 3).toInt() <= 1100, qPrintable(row));
        if (photos.first().at(1) == QLatin1Char('X')) {
            // The grey box of the slot is there in place of the picture.
            const QString png = m_dir.filePath(QStringLiteral("seite"));
            tool(QStringLiteral("pdftoppm"),
                 {QStringLiteral("-r"), QStringLiteral("20"), QStringLiteral("-f"), QStringLiteral("2"),
                  QStringLiteral("-singlefile"), QStringLiteral("-png"), pdf, png});
            const QImage page(png + QStringLiteral(".png"));
            QVERIFY(!page.isNull());
            int grey = 0;
            for (int y = 0; y < page.height(); ++y)
                for (int x = 0; x < page.width(); ++x)
                    grey += qAbs(qGray(page.pixel(x, y)) - qGray(QColor(Qt::lightGray).rgb())) < 8;
            QVERIFY2(grey > page.width() * page.height() / 4, qPrintable(QString::number(grey)));
        }
    }

private:
    VDRDocument m_doc;
    QString m_path;
    int m_landscapeId = 0, m_portraitId = 0, m_cameraId = 0, m_brokenId = 0;
};

QTEST_MAIN(TestCVdPrintoutAlbums)
#include "tst_cvdprintoutalbums.moc"
