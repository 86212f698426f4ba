#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "document/VDRDocument.h"
#include "editing/printdialogs/CVdPrintPreview.h"
#include "editing/printdialogs/VDRPrintPreviewWidget.h"
#include "editing/printdialogs/VDRPrintWidgets.h"
#include "printing/CVdConfig.h"
#include "printing/CVdPrintoutReport.h"
#include "printing/PDFReaderTimer.h"
#include "printing/VDRPrintHooks.h"

#include <QDesktopServices>
#include <QDir>
#include <QLabel>
#include <QPainter>
#include <QPicture>
#include <QPointer>
#include <QPushButton>
#include <QtTest>

using namespace VDRTestFixtures;

namespace {
QStringList filesIn(const QString& folder, const QString& pattern)
{
    return QDir(folder).entryList({pattern}, QDir::Files);
}
} // namespace

// The way a printed report takes: to the viewer, into the preview, and the preview's widgets.
class TestPrintPipeline : public VDRTestCase
{
    Q_OBJECT

public slots:
    // Stands in for the desktop's file opener.
    void openUrl(const QUrl& url) { m_urls << url; }

private:
    void initRun() override
    {
        CVdConfig::self()->reload();
        const QString path = m_dir.filePath(QStringLiteral("Bericht.vd2"));
        QVERIFY(createDiary(path));
        QVERIFY(openDiary(m_doc, path));
        QVERIFY(execOn(m_doc.database(),
                       {"DELETE FROM entry", reportInsertSql(1, "012"), reportInsertSql(2, "013")}));
    }
    void cleanupRun() override
    {
        VDRPrintHooks::setOpenFile(nullptr);
        VDRPrintHooks::setPreview(nullptr);
        VDRPrintHooks::setPrintDialog(nullptr);
        QDesktopServices::unsetUrlHandler(QStringLiteral("file"));
        m_doc.closeDocument();
    }
    void initTest() override
    {
        m_urls.clear();
        m_opened.clear();
        VDRPrintHooks::setOpenFile([this](const QString& path) { m_opened << path; });
        VDRPrintHooks::setPreview(nullptr);
    }

private slots:
    void printerWritesIntoAFolderOfItsOwn_data()
    {
        QTest::addColumn<QString>("folder"); // "document", "none" or "open to all"
        QTest::newRow("document's folder") << "document";
        QTest::newRow("no document") << "none";
        QTest::newRow("folder writable by all") << "open to all";
    }

    // The report for the printer goes to the viewer as Varduna.pdf, never into the shared temporary folder.
    void printerWritesIntoAFolderOfItsOwn()
    {
        QFETCH(QString, folder);
        QString given;
        if (folder == QLatin1String("document")) {
            given = m_doc.temporaryFolder();
        } else if (folder == QLatin1String("open to all")) {
            given = m_dir.filePath(QStringLiteral("offen"));
            QVERIFY(QDir().mkpath(given));
            QVERIFY(QFile::setPermissions(given, QFileDevice::Permissions(0x7777)));
        }
        CVdPrintoutReport printout(nullptr, {1});
        printout.setTemporaryFolder(given);
        QVERIFY(printout.print(CVdPrintout::Printer, QString(), false, QString()));
        QVERIFY(m_opened.isEmpty()); // not before the viewer's moment
        const QString pdf = printout.pdfFile();
        const QString expectedFolder =
            folder == QLatin1String("document") ? given : CVdPrintout::privateTemporaryFolder();
        QCOMPARE(pdf, QDir(expectedFolder).filePath(QStringLiteral("Varduna.pdf")));
        QVERIFY(expectedFolder != temporaryFolder() && !expectedFolder.isEmpty());
        // Only its owner may look in: it holds the diary's pictures and printouts.
        QCOMPARE(QFileInfo(expectedFolder).permissions() & QFileDevice::Permissions(0x0077), 0);
        QVERIFY(filesIn(temporaryFolder(), QStringLiteral("*.pdf")).isEmpty());
        QVERIFY(pdfText(pdf).contains(QStringLiteral("012-AB")));
        QTRY_COMPARE(m_opened, QStringList{pdf});
    }

    void previewPagesLiveWhileShown_data()
    {
        QTest::addColumn<QList<int>>("reports");
        QTest::addColumn<bool>("dialog");
        QTest::newRow("one page, dialog") << QList<int>{1} << true;
        QTest::newRow("two reports, dialog") << QList<int>{1, 2} << true;
        QTest::newRow("one page, no preview window") << QList<int>{1} << false;
    }

    // Page images in the diary's temporary folder, one per page of the job, gone when the preview closes.
    void previewPagesLiveWhileShown()
    {
        QFETCH(QList<int>, reports);
        QFETCH(bool, dialog);
        QStringList shown;
        bool goneWithDialog = false;
        if (dialog) {
            VDRPrintHooks::setPreview([&](const QStringList& files) {
                shown = files;
                for (const QString& file : files)
                    QVERIFY2(QFileInfo(file).absolutePath() == m_doc.temporaryFolder() && QFile::exists(file),
                             qPrintable(file));
                {
                    CVdPrintPreview preview(nullptr, files);
                    preview.show();
                    auto* label = preview.findChild<QLabel*>(QStringLiteral("labelPage"));
                    QCOMPARE(label->text(), QStringLiteral("Seite 1/%1").arg(files.size()));
                    preview.next();
                    QCOMPARE(preview.currentPage(), qMin(1, files.size() - 1));
                }
                goneWithDialog = std::none_of(files.begin(), files.end(),
                                              [](const QString& file) { return QFile::exists(file); });
            });
        }
        CVdPrintoutReport printout(nullptr, reports);
        printout.setTemporaryFolder(m_doc.temporaryFolder());
        QVERIFY(printout.print(CVdPrintout::Preview, QString(), false, QString()));
        VDRPrintHooks::setPreview(nullptr);
        if (dialog) {
            QCOMPARE(shown.size(), reports.size());
            QCOMPARE(QSet<QString>(shown.begin(), shown.end()).size(), shown.size());
            QVERIFY(goneWithDialog);
        }
        QVERIFY(filesIn(m_doc.temporaryFolder(), QStringLiteral("picture_*")).isEmpty());
        QVERIFY(filesIn(temporaryFolder(), QStringLiteral("picture_*")).isEmpty());
    }

    // The window's opener hands a file to the desktop as a file URL: a quote in the name is just a character.
    void viewerGetsAFileUrl()
    {
        VDRPrintWidgets::install();
        QDesktopServices::setUrlHandler(QStringLiteral("file"), this, "openUrl");
        const QString path = m_dir.filePath(QStringLiteral("Bericht \"; touch x; \".pdf"));
        QPointer<PDFReaderTimer> timer = new PDFReaderTimer(path, this);
        timer->start(0);
        QTRY_COMPARE(m_urls.size(), 1);
        QCOMPARE(m_urls.first().scheme(), QStringLiteral("file"));
        QCOMPARE(m_urls.first().toLocalFile(), path);
        QTRY_VERIFY(timer.isNull());
        QDesktopServices::unsetUrlHandler(QStringLiteral("file"));
        VDRPrintHooks::setPrintDialog(nullptr);
    }

    // Recorded pages one at a time on a white A4 sheet; the buttons stay within the pages.
    void previewWidgetShowsRecordedPages()
    {
        QStringList files;
        for (int page = 0; page < 2; ++page) {
            QPicture picture;
            QPainter painter(&picture);
            // A page at 150 dpi: A4 is 1240 pixels wide; the mark fills its left half.
            painter.fillRect(QRect(0, 0, 620, 1754), page == 0 ? Qt::black : Qt::white);
            painter.end();
            files << m_dir.filePath(QStringLiteral("seite%1.pic").arg(page));
            QVERIFY(picture.save(files.last()));
        }
        VDRPrintPreviewWidget widget;
        widget.resize(400, 700);
        widget.setPreviewFiles(files);
        widget.show();
        auto* label = widget.findChild<QLabel*>(QStringLiteral("labelPage"));
        QCOMPARE(label->text(), QStringLiteral("<b>Seite 1/2</b>"));
        QVERIFY(!widget.findChild<QPushButton*>(QStringLiteral("pbPrevious"))->isEnabled());
        auto* sheet = widget.findChild<QWidget*>(QStringLiteral("page"));
        const QImage first = sheet->grab().toImage();
        const QRect page = QRect(QPoint(), sheet->size());
        // Black at the sheet's left, white at its right.
        const QPoint centre = page.center();
        QCOMPARE(QColor(first.pixel(centre.x() / 2, centre.y())), QColor(Qt::black));
        QCOMPARE(QColor(first.pixel(centre.x() * 3 / 2, centre.y())), QColor(Qt::white));
        widget.findChild<QPushButton*>(QStringLiteral("pbNext"))->click();
        widget.nextPage();
        QCOMPARE(label->text(), QStringLiteral("<b>Seite 2/2</b>"));
        QCOMPARE(QColor(sheet->grab().toImage().pixel(centre.x() / 2, centre.y())), QColor(Qt::white));
    }

private:
    VDRDocument m_doc;
    QList<QUrl> m_urls;
    QStringList m_opened;
};

QTEST_MAIN(TestPrintPipeline)
#include "tst_printpipeline.moc"
