#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "document/VDRDocument.h"
#include "printing/CVdConfig.h"
#include "printing/CVdPrintFirmList.h"
#include "printing/CVdPrintout.h"
#include "printing/CVdPrintoutFormblatt.h"
#include "printing/CVdTexts.h"
#include "printing/VDRPrintHooks.h"

#include <QBuffer>
#include <QDir>
#include <QPainter>
#include <QProcess>
#include <QRegularExpression>
#include <QSettings>
#include <QtTest>

#include <sys/stat.h>

using namespace VDRTestFixtures;

namespace {
// A printout whose body is one line per page: the frame is all there is to see.
class FramePrintout : public CVdPrintout
{
public:
    FramePrintout(const QString& title, int pages, bool body = true)
        : CVdPrintout(nullptr, title), m_pages(pages), m_body(body)
    {
    }
    bool run(Output target, const QString& fileName) { return init(target, fileName, false) && draw(); }
    bool draw()
    {
        QPainter painter;
        if (!begin_painter(painter)) {
            after_print();
            return false;
        }
        pageCount = m_pages;
        before_print(painter);
        for (int page = 1; page <= m_pages; ++page) {
            if (page > 1)
                new_page(painter);
            before_print_page(painter);
            if (m_body) {
                painter.setFont(contentsFont);
                draw_text_sl(painter, QRect(leftMargin, contentTop, printWidth, 200),
                             QStringLiteral("Inhalt %1").arg(page));
            }
            after_print_page(painter);
        }
        painter.end();
        return after_print();
    }

private:
    int m_pages;
    bool m_body;
};

// Rows of pdffonts after its two heading lines; each ends in "emb sub uni object ID".
QStringList fontRows(const QString& pdf)
{
    QStringList rows = tool(QStringLiteral("pdffonts"), {pdf}).split(QLatin1Char('\n'), Qt::SkipEmptyParts);
    return rows.mid(2);
}

bool allEmbedded(const QString& pdf)
{
    const QStringList rows = fontRows(pdf);
    for (const QString& row : rows) {
        const QStringList cols = row.split(QLatin1Char(' '), Qt::SkipEmptyParts);
        if (cols.size() < 5 || cols.at(cols.size() - 5) != QLatin1String("yes"))
            return false;
    }
    return !rows.isEmpty();
}

QString sqlText(const QString& text)
{
    return QLatin1Char('\'') + QString(text).replace(QLatin1Char('\''), QStringLiteral("''")) +
           QLatin1Char('\'');
}

bool isRed(QRgb c)
{
    return qRed(c) > 180 && qGreen(c) < 90 && qBlue(c) < 90;
}
} // namespace

class TestCVdPrintout : public VDRTestCase
{
    Q_OBJECT

    void initRun() override
    {
        CVdConfig::self()->reload();
        const QString demo =
            QCoreApplication::applicationDirPath() + QStringLiteral("/../Projects/Ejemplo.vd2");
        m_path = m_dir.filePath(QStringLiteral("Ejemplo.vd2"));
        QVERIFY(QFile::copy(demo, m_path));
        QFile::setPermissions(m_path, QFile::ReadOwner | QFile::WriteOwner);
        QVERIFY(openDiary(m_doc, m_path));
        VDRPrintHooks::setPreview([this](const QStringList& files) {
            m_pages.clear();
            for (const QString& f : files)
                m_pages << QImage(f);
        });
    }
    void cleanupRun() override
    {
        VDRPrintHooks::setPreview(nullptr);
        m_doc.closeDocument();
    }
    void initTest() override { setPage({}, {}, 0, 0, 0, 0); }

private slots:
    // Header, title, footer and bottom line where they belong, on a PDF/A with embedded fonts.
    void frameOnPdf()
    {
        setPage({"KopfLinks", "KopfMitte", "KopfRechts"}, {"FussLinks", "FussMitte", "FussRechts"}, 0, 0, 0,
                0);
        const QString pdf = m_dir.filePath(QStringLiteral("Rahmen Test.pdf"));
        FramePrintout printout(QStringLiteral("Testtitel"), 2);
        QVERIFY(printout.run(CVdPrintout::Pdf, pdf));
        QCOMPARE(pdfPages(pdf), 2);
        const QString first = pdfText(pdf, 1);
        QVERIFY2(first.contains(QRegularExpression(QStringLiteral("KopfLinks\\s+KopfMitte\\s+KopfRechts"))),
                 qPrintable(first));
        QVERIFY(first.contains(QRegularExpression(QStringLiteral("FussLinks\\s+FussMitte\\s+FussRechts"))));
        QVERIFY(first.contains(QStringLiteral("Testtitel")));
        QVERIFY(first.contains(QStringLiteral("Seite 1/2")));
        QVERIFY(first.contains(QStringLiteral("Korvant - Software")));
        // Top to bottom: header, title, body, footer, bottom line.
        QVERIFY(first.indexOf(QStringLiteral("KopfMitte")) < first.indexOf(QStringLiteral("Testtitel")));
        QVERIFY(first.indexOf(QStringLiteral("Testtitel")) < first.indexOf(QStringLiteral("Inhalt 1")));
        QVERIFY(first.indexOf(QStringLiteral("Inhalt 1")) < first.indexOf(QStringLiteral("FussMitte")));
        QVERIFY(first.indexOf(QStringLiteral("FussMitte")) < first.indexOf(QStringLiteral("Seite 1/2")));
        QVERIFY(pdfText(pdf, 2).contains(QStringLiteral("Seite 2/2")));

        const QString info = tool(QStringLiteral("pdfinfo"), {pdf}) +
                             tool(QStringLiteral("pdfinfo"), {QStringLiteral("-meta"), pdf});
        QVERIFY2(info.contains(QRegularExpression(QStringLiteral("Title:\\s+Rahmen Test\\n"))),
                 qPrintable(info));
        QVERIFY(info.contains(QRegularExpression(QStringLiteral("Creator:\\s+Varduna"))));
        QVERIFY2(info.contains(QStringLiteral("pdfaid:part=\"1\"")) &&
                     info.contains(QStringLiteral("pdfaid:conformance=\"B\"")),
                 qPrintable(info));
        QVERIFY2(allEmbedded(pdf), qPrintable(fontRows(pdf).join(QLatin1Char('\n'))));
        QVERIFY(fontRows(pdf).join(QLatin1Char(' ')).contains(QStringLiteral("Liberation")));
        QVERIFY(QDir(m_dir.path()).entryList({QStringLiteral("*.tmp")}).isEmpty());
    }

    // Hostile project data and settings still give a readable page.
    void badInput_data()
    {
        QTest::addColumn<QString>("header");
        QTest::addColumn<QString>("font");
        QTest::newRow("header of 5000 characters") << QString(5000, QLatin1Char('W')) << QString();
        QTest::newRow("long header with words") << QStringLiteral("Wort ").repeated(1000) << QString();
        QTest::newRow("font not on this machine")
            << QStringLiteral("Kopf") << QStringLiteral("Nonexistent,9,-1,5,50,0,0,0,0,0");
        QTest::newRow("not a font") << QStringLiteral("Kopf") << QStringLiteral("Nonexistent");
        QTest::newRow("font of size zero")
            << QStringLiteral("Kopf") << QStringLiteral("Arial,0,-1,5,50,0,0,0,0,0");
    }
    void badInput()
    {
        QFETCH(QString, header);
        QFETCH(QString, font);
        QSettings settings;
        for (const QString& key : {CVdConfig::HeaderFontSettingsKey(), CVdConfig::ContentsFontSettingsKey(),
                                   CVdConfig::SmallFooterFontSettingsKey()})
            if (!font.isEmpty())
                settings.setValue(CVdConfig::printoutGroup() + key, font);
        settings.sync();
        CVdConfig::self()->reload();
        setPage({header, header, header}, {header, header, header}, 0, 0, 0, 0);
        const QString pdf = m_dir.filePath(QStringLiteral("bad.pdf"));
        FramePrintout printout(QStringLiteral("Titel"), 1);
        const bool ok = printout.run(CVdPrintout::Pdf, pdf);
        settings.remove(QStringLiteral("Printout"));
        settings.sync();
        CVdConfig::self()->reload();
        QVERIFY(ok);
        QVERIFY(printout.contentTopPx() < printout.contentBottomPx());
        const QString text = pdfText(pdf);
        QVERIFY(text.contains(QStringLiteral("Seite 1/1")));
        QVERIFY(text.contains(QStringLiteral("Inhalt 1")));
        QVERIFY(allEmbedded(pdf));
    }

    // Logos on the preview's page image: where the red logo shows, by thirds of the header band.
    void logos_data()
    {
        QTest::addColumn<int>("align1");
        QTest::addColumn<int>("align2");
        QTest::addColumn<bool>("validBlob");
        QTest::addColumn<QString>("thirds");
        QTest::newRow("left") << 1 << 0 << true << "L";
        QTest::newRow("left twice: second moves to the centre") << 1 << 1 << true << "LC";
        QTest::newRow("centre twice: second moves right") << 2 << 2 << true << "CR";
        QTest::newRow("right twice: second wraps to the left") << 3 << 3 << true << "LR";
        QTest::newRow("alignment 0") << 0 << 0 << true << "";
        QTest::newRow("alignment 4") << 4 << 4 << true << "";
        QTest::newRow("blob not an image") << 1 << 3 << false << "";
    }
    void logos()
    {
        QFETCH(int, align1);
        QFETCH(int, align2);
        QFETCH(bool, validBlob);
        QFETCH(QString, thirds);
        QImage logo(100, 100, QImage::Format_RGB32);
        logo.fill(Qt::red);
        QByteArray bytes;
        QBuffer buffer(&bytes);
        buffer.open(QIODevice::WriteOnly);
        logo.save(&buffer, "PNG");
        if (!validBlob)
            bytes = QByteArray("not a picture at all");
        QVERIFY(execOn(
            m_doc.database(),
            {QStringLiteral("DELETE FROM image WHERE id = 9001"),
             QStringLiteral("INSERT INTO image (id, image, image_ct, image_width, image_height, thumbnail, "
                            "thumbnail_ct, thumbnail_width, thumbnail_height) VALUES (9001, X'%1', "
                            "'image/png', 100, 100, X'00', 'image/png', 1, 1)")
                 .arg(QString::fromLatin1(bytes.toHex()))}));
        setPage({}, {}, 9001, align1, 9001, align2);
        FramePrintout printout(QString(), 1, false);
        QVERIFY(printout.run(CVdPrintout::Preview, QString()));
        QCOMPARE(m_pages.size(), 1);
        const QImage page = m_pages.first();
        QString found;
        const QString names = QStringLiteral("LCR");
        for (int third = 0; third < 3; ++third) {
            int red = 0;
            for (int y = 0; y < page.height() / 5; ++y)
                for (int x = third * page.width() / 3; x < (third + 1) * page.width() / 3; ++x)
                    red += isRed(page.pixel(x, y));
            if (red > 500)
                found += names.at(third);
        }
        QCOMPARE(found, thirds);
        setPage({}, {}, 0, 0, 0, 0);
    }

    // A long centre text changes only the middle third of the page, over several lines.
    void centreTextWrapsInItsThird()
    {
        const auto render = [&](const QString& centre) {
            setPage({"Links", centre, "Rechts"}, {}, 0, 0, 0, 0);
            FramePrintout printout(QString(), 1, false);
            return printout.run(CVdPrintout::Preview, QString()) && m_pages.size() == 1 ? m_pages.first()
                                                                                        : QImage();
        };
        const QImage control = render(QString());
        const QImage wrapped = render(QStringLiteral("Sehr langer Kopfzeilentext der Mitte ").repeated(12));
        QVERIFY(!control.isNull() && control.size() == wrapped.size());
        QRect changed;
        for (int y = 0; y < control.height(); ++y)
            for (int x = 0; x < control.width(); ++x)
                if (qAbs(qGray(control.pixel(x, y)) - qGray(wrapped.pixel(x, y))) > 80)
                    changed |= QRect(x, y, 1, 1);
        QVERIFY(!changed.isEmpty());
        QVERIFY2(changed.left() > control.width() / 3 && changed.right() < 2 * control.width() / 3,
                 qPrintable(QStringLiteral("%1..%2 of %3")
                                .arg(changed.left())
                                .arg(changed.right())
                                .arg(control.width())));
        QVERIFY2(changed.height() > 60, qPrintable(QString::number(changed.height())));
    }

    void margins_data()
    {
        QTest::addColumn<int>("millimetres");
        QTest::addColumn<bool>("zero");
        QTest::newRow("none") << 0 << true;
        QTest::newRow("inside the unprintable border") << 2 << true;
        QTest::newRow("default") << 15 << false;
    }
    void margins()
    {
        QFETCH(int, millimetres);
        QFETCH(bool, zero);
        CVdConfig::self()->leftMargin = millimetres;
        CVdConfig::self()->topMargin = millimetres;
        FramePrintout printout(QString(), 1);
        QVERIFY(printout.init(CVdPrintout::Preview, QString(), false));
        CVdConfig::self()->reload();
        QCOMPARE(printout.leftMarginPx() == 0, zero);
        QCOMPARE(printout.topMarginPx() == 0, zero);
        // Never more than configured: 15 mm at 150 dpi are 88 pixels.
        QVERIFY(printout.leftMarginPx() >= 0 && printout.leftMarginPx() < 89);
    }

    void cropImage_data()
    {
        QTest::addColumn<QSize>("size");
        QTest::addColumn<QSize>("cropped");
        QTest::newRow("portrait 4:3 stays") << QSize(300, 400) << QSize(300, 400);
        QTest::newRow("portrait 1.5 is cut to 3:4") << QSize(200, 300) << QSize(200, 266);
        QTest::newRow("landscape stays") << QSize(400, 300) << QSize(400, 300);
    }
    void cropImage()
    {
        QFETCH(QSize, size);
        QFETCH(QSize, cropped);
        QImage image(size, QImage::Format_RGB32);
        image.fill(Qt::white);
        // A red band at the very top is cut away only when the picture is cropped (centred).
        for (int y = 0; y < 10; ++y)
            for (int x = 0; x < size.width(); ++x)
                image.setPixel(x, y, qRgb(255, 0, 0));
        const QImage out = CVdPrintout::cropImage(image);
        QCOMPARE(out.size(), cropped);
        QCOMPARE(isRed(out.pixel(0, 0)), size == cropped);
    }

    void dates()
    {
        QLocale::setDefault(QLocale(QLocale::German, QLocale::Germany));
        QCOMPARE(CVdPrintout::reformat_date(QStringLiteral("2024-03-05")),
                 QStringLiteral("Dienstag, 05.03.2024"));
        QCOMPARE(CVdPrintout::reformat_date(QStringLiteral("2024-02-30")), QString());
        QLocale::setDefault(QLocale(QLocale::Spanish, QLocale::Spain));
        QCOMPARE(CVdPrintout::getDate4Language(QDate(2024, 3, 5)), QStringLiteral("05/03/2024"));
        QLocale::setDefault(QLocale::c());
    }

    void pdfTargetNotWritable()
    {
        const QString folder = m_dir.filePath(QStringLiteral("locked"));
        QVERIFY(QDir().mkpath(folder));
        if (!setImmutable(folder, true))
            QSKIP("This file system cannot make a folder immutable");
        m_prompt.expect(QStringLiteral("Dateifehler"), QStringLiteral("kann nicht überschrieben werden"));
        FramePrintout printout(QString(), 1);
        const bool ok = printout.run(CVdPrintout::Pdf, folder + QStringLiteral("/x.pdf"));
        setImmutable(folder, false);
        QVERIFY(!ok);
        QCOMPARE(m_prompt.messages.size(), 1);
        QVERIFY(QDir(folder).entryList(QDir::NoDotAndDotDot | QDir::AllEntries).isEmpty());
    }

    // The file name's suffix, and whether the PDF is opened: only when chosen in the dialog. A file
    // that cannot be replaced is named, and the dialog comes again.
    void pdfNaming_data()
    {
        QTest::addColumn<QString>("name");
        QTest::addColumn<bool>("ask");
        QTest::addColumn<QString>("written");
        QTest::newRow("no suffix, chosen") << "a" << true << "a.pdf";
        QTest::newRow("suffix in capitals, chosen") << "b.PDF" << true << "b.PDF";
        QTest::newRow("no suffix, given") << "c" << false << "c.pdf";
        QTest::newRow("existing file held, chosen again") << "held.pdf" << true << "d.pdf";
    }
    void pdfNaming()
    {
        ::umask(022);
        QFETCH(QString, name);
        QFETCH(bool, ask);
        QFETCH(QString, written);
        const QString folder = m_dir.filePath(QStringLiteral("naming"));
        QVERIFY(QDir().mkpath(folder));
        const QString held = folder + QStringLiteral("/held.pdf");
        const bool holding = name == QLatin1String("held.pdf");
        if (holding) {
            QVERIFY(writeFile(held, "old"));
            if (!setImmutable(held, true))
                QSKIP("This file system cannot make a file immutable");
            m_prompt.expect(QStringLiteral("Dateifehler"), QStringLiteral("held.pdf"));
            m_prompt.expectFileName(held);
            m_prompt.expectFileName(folder + QStringLiteral("/d"));
        } else if (ask) {
            m_prompt.expectFileName(folder + QLatin1Char('/') + name);
        }
        QStringList opened;
        VDRPrintHooks::setOpenFile([&](const QString& path) { opened << path; });
        FramePrintout printout(QString(), 1);
        const bool ok = ask ? printout.setOutput4PDF(QStringLiteral("Vorschlag.pdf"), true, 2, folder)
                            : printout.setOutput4PDF(folder + QLatin1Char('/') + name, false, 0, QString());
        if (holding)
            setImmutable(held, false);
        QVERIFY(ok);
        QVERIFY(printout.draw());
        VDRPrintHooks::setOpenFile(nullptr);
        const QString path = folder + QLatin1Char('/') + written;
        QVERIFY(QFile::exists(path));
        // Written under a private temporary name, but a new PDF is as readable as any new file.
        QCOMPARE(QFileInfo(path).permissions() & QFileDevice::Permissions(0x0777),
                 QFileDevice::Permissions(0x0644));
        QCOMPARE(opened, ask ? QStringList{path} : QStringList());
    }

    // The demo diary's company list with enough companies for several pages.
    void companyList_data()
    {
        QTest::addColumn<bool>("separate");
        QTest::newRow("lists follow each other") << false;
        QTest::newRow("second list on a new page") << true;
    }
    void companyList()
    {
        QFETCH(bool, separate);
        // Two persons leave room on the first page for the second list.
        QStringList inserts{
            QStringLiteral("DELETE FROM company WHERE id >= 90000"),
            QStringLiteral("UPDATE company SET category = -9 WHERE category = 1 AND id NOT IN "
                           "(SELECT id FROM company WHERE category = 1 ORDER BY pos LIMIT 2)")};
        for (int i = 0; i < 40; ++i)
            inserts << QStringLiteral(
                           "INSERT INTO company (id, category, type, firstname, lastname, company, street, "
                           "plz, city, telephone, telefax, mobile, email, pos) VALUES (%1, 2, 'Gewerk %2', "
                           "' ', ' ', 'Zusatzfirma %2', 'Teststraße %2', '12345', 'Teststadt', %3, ' ', "
                           "' ', 'f%2@example.org', %1)")
                           .arg(90000 + i)
                           .arg(i, 2, 10, QLatin1Char('0'))
                           .arg(i % 2 ? QStringLiteral("' '") : QStringLiteral("'0%1'").arg(i));
        QVERIFY(execOn(m_doc.database(), inserts));
        const QString pdf = m_dir.filePath(QStringLiteral("Firmenliste.pdf"));
        CVdPrintFirmList printout;
        QVERIFY(printout.run(CVdPrintout::Pdf, separate, pdf, false));
        const int pages = pdfPages(pdf);
        QVERIFY(pages >= 3);
        QStringList pageTexts;
        for (int p = 1; p <= pages; ++p)
            pageTexts << pdfText(pdf, p);
        const auto pageOf = [&](const QString& text) {
            for (int p = 0; p < pages; ++p)
                if (pageTexts.at(p).contains(text))
                    return p;
            return -1;
        };
        const int persons = pageOf(QStringLiteral("Am Bau beteiligte Personen"));
        const int trades = pageOf(QStringLiteral("Gewerke / Baufirmen"));
        QCOMPARE(persons, 0);
        QCOMPARE(trades, separate ? 1 : 0);
        const int phones = pageTexts.join(QString()).count(QStringLiteral("Telefon:"));
        const int withPhone =
            textsOn(m_doc.database(), QStringLiteral("SELECT id FROM company WHERE category IN (1, 2) "
                                                     "AND trim(telephone) <> ''"))
                .size();
        QCOMPARE(phones, withPhone);
        for (int i = 0; i < 40; ++i) {
            const QString n = QStringLiteral("%1").arg(i, 2, 10, QLatin1Char('0'));
            const int page = pageOf(QStringLiteral("Zusatzfirma ") + n);
            QVERIFY(page >= 0);
            QCOMPARE(pageOf(QStringLiteral("f%1@example.org").arg(n)), page);
        }
        QVERIFY(execOn(m_doc.database(),
                       {QStringLiteral("DELETE FROM company WHERE id >= 90000"),
                        QStringLiteral("UPDATE company SET category = 1 WHERE category = -9")}));
    }

    void blankForm()
    {
        const QString pdf = m_dir.filePath(QStringLiteral("Formblatt.pdf"));
        CVdPrintoutFormblatt printout;
        QVERIFY(printout.run(CVdPrintout::Pdf, pdf, false));
        QCOMPARE(pdfPages(pdf), 1);
        const QString text = pdfText(pdf);
        QVERIFY(text.contains(QStringLiteral("Baubericht-Nr.:")));
        QVERIFY(text.contains(QStringLiteral("Baubegehung vom:")));
        int at = 0;
        for (int id : CVdPrintoutFormblatt::captionIds()) {
            const int found = text.indexOf(CVdTexts::self()->text(id), at);
            QVERIFY2(found >= 0, qPrintable(CVdTexts::self()->text(id)));
            at = found;
        }
    }

private:
    void setPage(const QStringList& header, const QStringList& footer, int logo1, int align1, int logo2,
                 int align2)
    {
        const auto at = [](const QStringList& l, int i) { return sqlText(l.value(i, QString())); };
        QVERIFY(
            execOn(m_doc.database(),
                   {QStringLiteral("UPDATE vdr SET headline_left=%1, headline_center=%2, headline_right=%3, "
                                   "footer_left=%4, footer_center=%5, footer_right=%6, logo_image_id=%7, "
                                   "logo_align=%8, logo2_image_id=%9, logo2_align=%10")
                        .arg(at(header, 0), at(header, 1), at(header, 2), at(footer, 0), at(footer, 1),
                             at(footer, 2))
                        .arg(logo1)
                        .arg(align1)
                        .arg(logo2)
                        .arg(align2)}));
    }

    VDRDocument m_doc;
    QString m_path;
    QList<QImage> m_pages;
};

QTEST_MAIN(TestCVdPrintout)
#include "tst_cvdprintout.moc"
