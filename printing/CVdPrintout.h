#pragma once

#include "printing/CText.h"
#include "printing/CVdTextInfo.h"

#include <QDate>
#include <QFont>
#include <QImage>
#include <QList>
#include <QObject>
#include <QRect>
#include <QStringList>
#include <QVector>

#include <memory>

class QPainter;
class QPaintDevice;
class QPrinter;

// The base of every printout: the output device and the page frame (header texts, logos, title,
// footer texts and the bottom line). Subclasses draw the body between contentTop and contentBottom.
class CVdPrintout : public QObject
{
    Q_OBJECT
public:
    enum Output
    {
        Printer = 0,
        Pdf = 1,
        Preview = 2
    };

    static const char* const TestText;
    static constexpr double LogoSpacingFactor = 0.75;
    static constexpr double InchPerMm = 0.03937007874015748; // inches per millimetre
    static const int singleLineFlags;
    static const int multiLineFlags;

    CVdPrintout(QObject* parent, const QString& title);
    ~CVdPrintout() override;

    void read_page_info();
    static void read_image(int imageId, QImage& out);

    // False when the user cancelled or the target cannot be used.
    bool init(Output output, const QString& fileName, bool askForFileName);
    bool setOutput4PDF(const QString& fileName, bool askForFileName, int kind, QString defaultDir);
    // The device to paint on once init succeeded.
    QPaintDevice* paintDevice();
    // Begins painting on the device; reports a file that cannot be written.
    bool begin_painter(QPainter& painter);

    void before_print(QPainter& painter);
    void before_print_page(QPainter& painter);
    void after_print_page(QPainter& painter);
    void new_page(QPainter& painter);
    // Ends the job; false when a PDF could not be put in place.
    bool after_print();
    // The daily report's way to the printer: a PDF in the temporary folder, written without a
    // dialog and handed to the system's viewer shortly after the job ends.
    bool setOutput4Viewer();

    // Where the viewer's PDF and the preview's page images go: the open diary's own temporary
    // folder. Without one (or one that is not ours alone) a folder private to this process.
    void setTemporaryFolder(const QString& folder) { m_temporaryFolder = folder; }
    QString temporaryFolder() const;
    static QString privateTemporaryFolder();

    QSize page_size() const;

    QRect text_area_sl(QPainter& painter, const QString& text);
    void draw_text_sl(QPainter& painter, const QRect& rect, const QString& text);
    QRect text_area_ml(QPainter& painter, const QRect& rect, const QString& text, int flags);
    void draw_text_ml(QPainter& painter, const QRect& rect, const QString& text, int flags);
    // The text with line breaks where it must wrap to fit 'width'.
    QString break_line(QPainter& painter, int width, const QString& text);
    void reset_clipping(QPainter& painter);

    static QString cell2str(const QList<CText>& cell);
    static QString reformat_date(const QString& isoDate);
    static QString getDate4Language(const QDate& date);
    static void scale_image(int w, int h, QImage& image);
    static QImage cropImage(const QImage& image);

    void setOutput(Output o) { output = o; }
    void setDir(const QString& dir) { lastPdfDir = dir; }
    void setPath(const QString& path) { pdfFileName = path; }

    // For callers that report the outcome.
    QString pdfFile() const { return pdfFileName; }
    int contentTopPx() const { return contentTop; }
    int contentBottomPx() const { return contentBottom; }
    int printWidthPx() const { return printWidth; }
    int leftMarginPx() const { return leftMargin; }
    int topMarginPx() const { return topMargin; }
    int logo1Alignment() const { return logo1Align; }
    int logo2Alignment() const { return logo2Align; }
    const QVector<CVdTextInfo>& headerTextInfos() const { return headerInfos; }

    static QString pdfDirSettingsKey(int kind);

public slots:
    void timeout();

protected:
    void update_margins();
    void compute_print_area(QPainter& painter);
    void compute_text_info(QPainter& painter);
    void print_header(QPainter& painter);
    void print_text_info(QPainter& painter, const CVdTextInfo& info, int y);
    void print_logo(QPainter& painter, const QImage& logo, int align);
    void print_title(QPainter& painter);
    void print_footer(QPainter& painter);
    void print_bottom_line(QPainter& painter);
    void save_picture();
    int lineHeight(const QFont& font) const;
    int textWidth(const QFont& font, const QString& text) const;
    int dpiX() const;
    int dpiY() const;

    std::unique_ptr<QPrinter> printer;
    QString title;
    QImage logo1, logo2;
    QVector<CVdTextInfo> headerInfos;
    QVector<QString> footerTexts;
    QFont contentsFont, titleFont, headerFont, footerFont, smallFooterFont;
    int pageCount = 1;
    int currentPage = 1;
    int logo1Align = 0, logo2Align = 0;
    int printWidth = 0, printHeight = 0;
    int headerHeight = 0, logoHeight = 0, logoPrintHeightPx = 0, titleHeight = 0, titleGap = 0,
        footerHeight = 0, bottomLineHeight = 0;
    int contentTop = 0, contentBottom = 0;
    Output output = Printer;
    bool displayEmptyCategories = false;
    bool printSignatureLine = false;
    QString lastPdfDir;
    QString pdfFileName;
    QRect paperRect;
    QImage pageImage;
    QStringList pictureFiles;
    int leftMargin = 0, rightMargin = 0, topMargin = 0, bottomMargin = 0;
    bool openAfterPrint = false;
    bool logosUnderHeader = true;
    int logoPrintHeightMm = 25;

private:
    // The PDF is written beside its target under a temporary name and renamed over it when complete.
    QString m_pdfTemporary;
    bool m_waitOver = false;
    bool m_busy = false;
    QString m_temporaryFolder;
    bool m_openInViewer = false;
    // Page images are numbered through the job: page numbers restart with every report.
    int m_pictureNumber = 0;
    bool m_pageUnsaved = false;
};
