#include "printing/CVdPrintout.h"

#include "document/CVdShared.h"
#include "document/VDRDocument.h"
#include "document/VDRFileOps.h"
#include "document/VDRPrompt.h"
#include "printing/CVdConfig.h"
#include "printing/CVdTexts.h"
#include "printing/PDFReaderTimer.h"
#include "printing/VDRPrintHooks.h"

#include <QCoreApplication>
#include <QDir>
#include <QEventLoop>
#include <QFileInfo>
#include <QFontMetrics>
#include <QLocale>
#include <QPainter>
#include <QPrinter>
#include <QSettings>
#include <QSqlQuery>
#include <QStandardPaths>
#include <QTemporaryDir>
#include <QTextLayout>
#include <QTimer>

#ifdef Q_OS_UNIX
#include <unistd.h>
#endif

const char* const CVdPrintout::TestText = "Xy";
const int CVdPrintout::singleLineFlags = Qt::AlignLeft | Qt::AlignBottom | Qt::TextSingleLine;
const int CVdPrintout::multiLineFlags = Qt::AlignLeft | Qt::AlignTop | Qt::TextWordWrap | Qt::TextExpandTabs;

namespace {
const int kMeasureHeight = 1000000;

QString fileErrorText(const QString& path)
{
    return QCoreApplication::translate("CVdPrintout",
                                       "Die Datei\n%1\nexistiert bereits und kann nicht überschrieben "
                                       "werden.\nÜberprüfen Sie\n- ob die Datei bereits geöffnet ist\n- Ihre "
                                       "Schreibrechte für die Datei.")
        .arg(QDir::toNativeSeparators(path));
}

QString fileErrorTitle()
{
    return QCoreApplication::translate("CVdPrintout", "Dateifehler");
}

// A folder nobody else can put files or links into: a real folder of this user's, not writable by
// all.
bool isOwnFolder(const QString& folder)
{
    const QFileInfo info(folder);
    if (folder.isEmpty() || !info.isDir() || info.isSymLink())
        return false;
#ifdef Q_OS_UNIX
    if (info.ownerId() != ::getuid())
        return false;
#endif
    return !(info.permissions() & QFileDevice::WriteOther);
}
} // namespace

CVdPrintout::CVdPrintout(QObject* parent, const QString& title) : QObject(parent), title(title)
{
    CVdConfig* config = CVdConfig::self();
    contentsFont = config->contentsFont;
    titleFont = config->titleFont;
    headerFont = config->headerFont;
    footerFont = config->footerFont;
    smallFooterFont = config->smallFooterFont;
    lastPdfDir = config->pdfDir;
    QSettings settings;
    logosUnderHeader = settings.value(CVdConfig::LogosUnderHeaderSettingsKey(), true).toBool();
    bool ok = false;
    const int height = settings.value(CVdConfig::LogoPrintHeightSettingsKey(), 25).toInt(&ok);
    // Bounded so that logos never eat the page.
    logoPrintHeightMm = ok && height >= 0 && height <= 100 ? height : 25;
    headerInfos.resize(3);
    footerTexts.resize(3);
    read_page_info();
}

CVdPrintout::~CVdPrintout()
{
    if (!m_pdfTemporary.isEmpty())
        QFile::remove(m_pdfTemporary);
    for (const QString& file : qAsConst(pictureFiles))
        QFile::remove(file);
    if (m_busy)
        CVdShared::restore_cursor();
}

void CVdPrintout::read_page_info()
{
    QSqlDatabase db = QSqlDatabase::database(VDRDocument::connectionName(), false);
    if (!db.isOpen())
        return;
    QSqlQuery query(db);
    query.exec(QStringLiteral("SELECT * FROM vdr"));
    CVdShared::check_sql_error(query.lastError(), QStringLiteral("CVdPrintout"),
                               QStringLiteral("read_page_info"), __LINE__);
    if (!query.next())
        return;
    const auto value = [&](const char* name) { return query.value(QLatin1String(name)); };
    const int logoId = value("logo_image_id").toInt();
    const int logo2Id = value("logo2_image_id").toInt();
    logo1Align = value("logo_align").toInt();
    logo2Align = value("logo2_align").toInt();
    headerInfos[0].text = value("headline_left").toString();
    headerInfos[1].text = value("headline_center").toString();
    headerInfos[2].text = value("headline_right").toString();
    footerTexts[0] = value("footer_left").toString();
    footerTexts[1] = value("footer_center").toString();
    footerTexts[2] = value("footer_right").toString();
    displayEmptyCategories = value("display_empty_categories").toInt() != 0;
    if (logoId != 0)
        read_image(logoId, logo1);
    if (logo2Id != 0)
        read_image(logo2Id, logo2);
    if (logo2Align != 0 && logo2Align == logo1Align) {
        if (logo2Align == 1)
            logo2Align = 2;
        else if (logo2Align == 2)
            logo2Align = 3;
        else if (logo2Align == 3)
            logo2Align = 1;
    }
}

void CVdPrintout::read_image(int imageId, QImage& out)
{
    out = QImage();
    QSqlQuery query(QSqlDatabase::database(VDRDocument::connectionName(), false));
    query.prepare(QStringLiteral("SELECT image FROM image WHERE id=:id"));
    query.bindValue(QStringLiteral(":id"), imageId);
    query.exec();
    CVdShared::check_sql_error(query.lastError(), QStringLiteral("CVdPrintout"), QStringLiteral("read_image"),
                               __LINE__);
    if (!query.next())
        return;
    const QByteArray blob = query.value(0).toByteArray();
    if (!blob.isEmpty() && !out.loadFromData(blob))
        out = QImage();
}

QString CVdPrintout::pdfDirSettingsKey(int kind)
{
    switch (kind) {
    case 1:
        return QStringLiteral("PDFExport/stdCompanyListPDFDir");
    case 2:
        return QStringLiteral("PDFExport/stdDeficiencyListPDFDir");
    case 3:
        return QStringLiteral("PDFExport/stdEntryPDFDir");
    default:
        return QString();
    }
}

QString CVdPrintout::privateTemporaryFolder()
{
    // Lives as long as the process: the viewer may read its PDF long after the job ended.
    static QTemporaryDir folder(QDir::tempPath() + QStringLiteral("/varduna-print-XXXXXX"));
    return folder.isValid() ? folder.path() : QString();
}

QString CVdPrintout::temporaryFolder() const
{
    return isOwnFolder(m_temporaryFolder) ? m_temporaryFolder : privateTemporaryFolder();
}

bool CVdPrintout::init(Output o, const QString& fileName, bool askForFileName)
{
    output = o;
    m_openInViewer = false;
    printer = std::make_unique<QPrinter>(QPrinter::HighResolution);
    printer->setColorMode(QPrinter::Color);
    if (o == Printer) {
        printer->setPageSize(QPageSize(QPageSize::A4));
        printer->setResolution(300);
        CVdShared::idle();
        if (!VDRPrintHooks::printDialog(printer.get())) {
            printer.reset();
            return false;
        }
        update_margins();
        return true;
    }
    if (o == Pdf)
        return setOutput4PDF(fileName, askForFileName, 0, QString());
    // The preview draws into page images; the printer only lends its page geometry.
    printer->setOutputFormat(QPrinter::PdfFormat);
    printer->setResolution(150);
    printer->setPageSize(QPageSize(QPageSize::A4));
    paperRect = printer->paperRect(QPrinter::DevicePixel).toRect();
    const QRect pageRect = printer->pageRect(QPrinter::DevicePixel).toRect();
    pageImage = QImage(pageRect.size(), QImage::Format_RGB32);
    const int dpm = qRound(39.37007874015748 * printer->resolution());
    pageImage.setDotsPerMeterX(dpm);
    pageImage.setDotsPerMeterY(dpm);
    pageImage.fill(Qt::white);
    pictureFiles.clear();
    m_pictureNumber = 0;
    m_pageUnsaved = true;
    update_margins();
    return true;
}

bool CVdPrintout::setOutput4Viewer()
{
    const QString folder = temporaryFolder();
    if (folder.isEmpty()) {
        VDRPrompt::critical(fileErrorTitle(), fileErrorText(QDir::tempPath() + tr("/Varduna.pdf")));
        return false;
    }
    if (!setOutput4PDF(folder + tr("/Varduna.pdf"), false, 0, QString()))
        return false;
    m_openInViewer = true;
    return true;
}

bool CVdPrintout::setOutput4PDF(const QString& fileName, bool askForFileName, int kind, QString defaultDir)
{
    output = Pdf;
    m_openInViewer = false;
    const QString key = pdfDirSettingsKey(kind);
    QString dir;
    if (key.isEmpty()) {
        dir = QFileInfo(fileName).absolutePath();
    } else {
        if (defaultDir.isEmpty())
            defaultDir = QStandardPaths::writableLocation(QStandardPaths::DocumentsLocation);
        if (defaultDir.isEmpty())
            defaultDir = QDir::homePath();
        dir = QSettings().value(key, defaultDir).toString();
    }
    QString proposal = QDir::toNativeSeparators(dir + QLatin1Char('/') + QFileInfo(fileName).fileName());

    const auto withSuffix = [](QString name) {
        if (QFileInfo(name).suffix().toLower() != QLatin1String("pdf"))
            name += QStringLiteral(".pdf");
        return name;
    };
    // A target is usable when a file can be made beside it and an old file there may be replaced.
    const auto claim = [&](const QString& target) {
        const QFileInfo info(target);
        QString temporary;
        // A file marked read-only is refused even where the user could replace it (root, own folder).
        const bool readOnly =
            info.exists() && !(info.permissions() &
                               (QFileDevice::WriteOwner | QFileDevice::WriteGroup | QFileDevice::WriteOther));
        if (!info.exists() || (info.isWritable() && !readOnly))
            temporary = VDRFileOps::emptyTemporaryBeside(target);
        if (temporary.isEmpty())
            VDRPrompt::critical(fileErrorTitle(), fileErrorText(target));
        return temporary;
    };

    QString target;
    QString temporary;
    if (askForFileName) {
        for (;;) {
            const QString chosen = VDRPrompt::instance()->saveFileName(tr("Speichern als PDF-Dokument"),
                                                                       proposal, tr("Pdf files (*.pdf)"));
            if (chosen.isEmpty())
                return false;
            target = QFileInfo(withSuffix(chosen)).absoluteFilePath();
            temporary = claim(target);
            if (!temporary.isEmpty())
                break;
            proposal = QDir::toNativeSeparators(target);
        }
        openAfterPrint = true;
        if (!key.isEmpty())
            QSettings().setValue(key, QFileInfo(target).absolutePath());
    } else {
        target = QFileInfo(withSuffix(fileName)).absoluteFilePath();
        temporary = claim(target);
        if (temporary.isEmpty())
            return false;
        openAfterPrint = false;
    }
    if (!m_pdfTemporary.isEmpty())
        QFile::remove(m_pdfTemporary);
    m_pdfTemporary = temporary;
    lastPdfDir = QFileInfo(target).absolutePath();
    pdfFileName = target;

    QString docName = QFileInfo(fileName).fileName();
    if (docName.endsWith(QStringLiteral(".pdf"), Qt::CaseInsensitive))
        docName.chop(4);
    if (!printer)
        printer = std::make_unique<QPrinter>(QPrinter::HighResolution);
    printer->setColorMode(QPrinter::Color);
    printer->setOutputFormat(QPrinter::PdfFormat);
    printer->setOutputFileName(m_pdfTemporary);
    printer->setResolution(150);
    printer->setPageSize(QPageSize(QPageSize::A4));
    // Archival PDF; Qt embeds every font it draws with.
    printer->setPdfVersion(QPrinter::PdfVersion_A1b);
    printer->setDocName(docName);
    printer->setCreator(QStringLiteral("Varduna"));
    update_margins();
    return true;
}

QPaintDevice* CVdPrintout::paintDevice()
{
    if (output == Preview)
        return &pageImage;
    return printer.get();
}

bool CVdPrintout::begin_painter(QPainter& painter)
{
    QPaintDevice* device = paintDevice();
    if (device && painter.begin(device))
        return true;
    if (output == Pdf)
        VDRPrompt::critical(fileErrorTitle(), fileErrorText(pdfFileName));
    return false;
}

int CVdPrintout::dpiX() const
{
    if (output == Preview)
        return pageImage.logicalDpiX();
    return printer ? printer->logicalDpiX() : 150;
}

int CVdPrintout::dpiY() const
{
    if (output == Preview)
        return pageImage.logicalDpiY();
    return printer ? printer->logicalDpiY() : 150;
}

void CVdPrintout::update_margins()
{
    if (!printer)
        return;
    const QRectF paper = printer->paperRect(QPrinter::DevicePixel);
    const QRectF page = printer->pageRect(QPrinter::DevicePixel);
    const double resX = printer->resolution();
    const double resY = printer->resolution();
    const double borderXmm = (paper.width() - page.width()) / 2.0 / (resX * InchPerMm);
    const double borderYmm = (paper.height() - page.height()) / 2.0 / (resY * InchPerMm);
    const CVdConfig* config = CVdConfig::self();
    const auto px = [](double mm, double border, double res) {
        return int(qMax(0.0, mm - border) * res * InchPerMm);
    };
    leftMargin = px(config->leftMargin, borderXmm, resX);
    rightMargin = px(config->rightMargin, borderXmm, resX);
    topMargin = px(config->topMargin, borderYmm, resY);
    bottomMargin = px(config->bottomMargin, borderYmm, resY);
    logoPrintHeightPx = int(logoPrintHeightMm * resY * InchPerMm);
}

QSize CVdPrintout::page_size() const
{
    if (output == Preview)
        return pageImage.size();
    return printer ? printer->pageRect(QPrinter::DevicePixel).toRect().size() : QSize();
}

int CVdPrintout::lineHeight(const QFont& font) const
{
    return QFontMetrics(font, const_cast<CVdPrintout*>(this)->paintDevice()).height();
}

int CVdPrintout::textWidth(const QFont& font, const QString& text) const
{
    return QFontMetrics(font, const_cast<CVdPrintout*>(this)->paintDevice()).horizontalAdvance(text);
}

void CVdPrintout::before_print(QPainter& painter)
{
    if (!m_busy) {
        CVdShared::set_busy_cursor();
        m_busy = true;
    }
    currentPage = 1;
    compute_print_area(painter);
}

void CVdPrintout::compute_text_info(QPainter& painter)
{
    painter.setFont(headerFont);
    const int gap = 2 * textWidth(headerFont, QLatin1String(TestText));
    // A header that took more than a quarter of the page would leave no room for the body.
    const int maxHeight = page_size().height() / 4;
    const auto measure = [&](CVdTextInfo& info, int boxWidth) {
        boxWidth = qMax(1, boxWidth);
        if (info.text.isEmpty()) {
            info.width = 0;
            info.height = 0;
            return;
        }
        const QRect r =
            painter.boundingRect(QRect(0, 0, boxWidth, kMeasureHeight), multiLineFlags, info.text);
        info.width = qMin(r.width(), boxWidth);
        info.height = qMin(r.height(), maxHeight);
    };
    CVdTextInfo& left = headerInfos[0];
    CVdTextInfo& centre = headerInfos[1];
    CVdTextInfo& right = headerInfos[2];
    measure(centre, (printWidth - gap) / 3);
    centre.x = (printWidth - centre.width) / 2 + leftMargin;
    const int sideBox = (printWidth - centre.width - gap) / 2;
    measure(left, sideBox);
    measure(right, sideBox);
    left.x = leftMargin;
    right.x = printWidth + leftMargin - right.width;
    headerHeight = qMax(left.height, qMax(centre.height, right.height));
}

void CVdPrintout::compute_print_area(QPainter& painter)
{
    const QSize page = page_size();
    printWidth = page.width() - leftMargin - rightMargin;
    compute_text_info(painter);
    const int headerLine = lineHeight(headerFont);
    if (headerHeight > 0 && logosUnderHeader)
        headerHeight += int(LogoSpacingFactor * headerLine);
    logoHeight = 0;
    for (QImage* logo : {&logo1, &logo2}) {
        if (logo->isNull())
            continue;
        scale_image(printWidth, logoPrintHeightPx, *logo);
    }
    // Only logos that are drawn take room.
    if (!logo1.isNull() && logo1Align >= 1 && logo1Align <= 3)
        logoHeight = qMax(logoHeight, logo1.height());
    if (!logo2.isNull() && logo2Align >= 1 && logo2Align <= 3)
        logoHeight = qMax(logoHeight, logo2.height());
    if (headerHeight > 0 && logoHeight > 0 && !logosUnderHeader)
        logoHeight += int(LogoSpacingFactor * headerLine);
    if (title.isEmpty()) {
        titleHeight = 0;
        titleGap = 0;
    } else {
        titleHeight = lineHeight(titleFont);
        titleGap = titleHeight;
    }
    footerHeight = lineHeight(footerFont);
    bottomLineHeight = lineHeight(smallFooterFont);
    const int dpi = dpiY();
    const int top = int(0.25 * dpi + logoHeight + headerHeight + titleGap + titleHeight);
    const int bottom = int(0.025 * dpi + bottomLineHeight + footerHeight);
    printHeight = page.height() - (bottom + top + topMargin) - bottomMargin;
    contentTop = top - 1 + topMargin;
    contentBottom = printHeight - 2 + top + topMargin;
}

void CVdPrintout::before_print_page(QPainter& painter)
{
    print_header(painter);
    print_logo(painter, logo1, logo1Align);
    print_logo(painter, logo2, logo2Align);
    print_title(painter);
}

void CVdPrintout::print_header(QPainter& painter)
{
    painter.setFont(headerFont);
    const int y = topMargin + (logosUnderHeader ? 0 : logoHeight);
    for (const CVdTextInfo& info : qAsConst(headerInfos))
        print_text_info(painter, info, y);
}

void CVdPrintout::print_text_info(QPainter& painter, const CVdTextInfo& info, int y)
{
    if (info.text.isEmpty())
        return;
    draw_text_ml(painter, QRect(info.x, y, info.width, info.height), info.text, multiLineFlags);
}

void CVdPrintout::print_logo(QPainter& painter, const QImage& logo, int align)
{
    if (logo.isNull() || align < 1 || align > 3)
        return;
    const int y = topMargin + (logosUnderHeader ? headerHeight : 0);
    int x = leftMargin;
    if (align == 2)
        x = (printWidth - logo.width()) / 2 + leftMargin;
    else if (align == 3)
        x = printWidth + leftMargin - logo.width();
    painter.save();
    painter.setClipRect(QRect(QPoint(x, y), logo.size()));
    painter.drawImage(QPoint(x, y), logo);
    painter.restore();
}

void CVdPrintout::print_title(QPainter& painter)
{
    if (title.isEmpty())
        return;
    painter.setFont(titleFont);
    const int y = topMargin + headerHeight + logoHeight + titleGap;
    draw_text_sl(painter, QRect(leftMargin, y, printWidth, titleHeight), title);
}

void CVdPrintout::after_print_page(QPainter& painter)
{
    print_footer(painter);
    print_bottom_line(painter);
}

void CVdPrintout::print_footer(QPainter& painter)
{
    painter.setFont(footerFont);
    const QSize page = page_size();
    const int y = page.height() - bottomMargin - footerHeight - bottomLineHeight;
    const int centreWidth = qMin(textWidth(footerFont, footerTexts[1]), printWidth);
    const int sideWidth =
        qMax(0, (printWidth - centreWidth) / 2 - 2 * textWidth(footerFont, QStringLiteral("X")));
    if (!footerTexts[1].isEmpty())
        draw_text_sl(painter,
                     QRect(leftMargin + (printWidth - centreWidth) / 2, y, centreWidth, footerHeight),
                     footerTexts[1]);
    if (!footerTexts[0].isEmpty()) {
        const int w = qMin(textWidth(footerFont, footerTexts[0]), sideWidth);
        draw_text_sl(painter, QRect(leftMargin, y, w, footerHeight), footerTexts[0]);
    }
    if (!footerTexts[2].isEmpty()) {
        const int w = qMin(textWidth(footerFont, footerTexts[2]), sideWidth);
        draw_text_sl(painter, QRect(leftMargin + printWidth - w, y, w, footerHeight), footerTexts[2]);
    }
}

void CVdPrintout::print_bottom_line(QPainter& painter)
{
    painter.setFont(smallFooterFont);
    const QSize page = page_size();
    const int y = page.height() - bottomMargin - bottomLineHeight;
    QString label = CVdTexts::self()->text(40);
    label.replace(QStringLiteral("${page.cur}"), QString::number(currentPage));
    label.replace(QStringLiteral("${page.count}"), QString::number(pageCount));
    const int labelWidth = qMin(textWidth(smallFooterFont, label), printWidth);
    draw_text_sl(painter, QRect(leftMargin + (printWidth - labelWidth) / 2, y, labelWidth, bottomLineHeight),
                 label);
    const int sideWidth =
        qMax(0, (printWidth - labelWidth) / 2 - textWidth(smallFooterFont, QStringLiteral("XX")));
    const QString notice = CVdTexts::self()->text(38);
    draw_text_sl(painter,
                 QRect(leftMargin, y, qMin(textWidth(smallFooterFont, notice), sideWidth), bottomLineHeight),
                 notice);
    if (printSignatureLine) {
        const QString signature = CVdTexts::self()->text(45);
        const int w = qMin(textWidth(smallFooterFont, signature), sideWidth);
        draw_text_sl(painter, QRect(leftMargin + printWidth - w, y, w, bottomLineHeight), signature);
    }
}

void CVdPrintout::new_page(QPainter& painter)
{
    Q_UNUSED(painter)
    if (output == Preview) {
        save_picture();
        pageImage.fill(Qt::white);
        m_pageUnsaved = true;
    } else if (printer) {
        printer->newPage();
    }
    ++currentPage;
}

void CVdPrintout::save_picture()
{
    if (pageImage.isNull())
        return;
    const double factor = 1024.0 / pageImage.width();
    const QImage scaled = pageImage.scaledToWidth(1024, Qt::SmoothTransformation);
    const QSize border((paperRect.size() - pageImage.size()) * factor);
    QImage sheet(scaled.size() + QSize(qMax(0, border.width()), qMax(0, border.height())),
                 QImage::Format_RGB32);
    sheet.fill(Qt::white);
    {
        QPainter p(&sheet);
        p.drawImage((sheet.width() - scaled.width()) / 2, (sheet.height() - scaled.height()) / 2, scaled);
    }
    m_pageUnsaved = false;
    const QString folder = temporaryFolder();
    if (folder.isEmpty())
        return;
    const QString path = QDir(folder).filePath(QString::asprintf("picture_%04d.jpeg", ++m_pictureNumber));
    QFile::remove(path);
    if (sheet.save(path, "JPEG"))
        pictureFiles << path;
}

bool CVdPrintout::after_print()
{
    if (printer && printer->printerState() == QPrinter::Active) {
        m_waitOver = false;
        QTimer limit;
        limit.setSingleShot(true);
        connect(&limit, &QTimer::timeout, this, &CVdPrintout::timeout);
        limit.start(30000);
        // The printer's state changes without an event of its own; the tick makes the loop look again.
        QTimer tick;
        tick.start(50);
        QEventLoop loop;
        while (printer->printerState() == QPrinter::Active && !m_waitOver)
            loop.processEvents(QEventLoop::AllEvents | QEventLoop::WaitForMoreEvents);
    }
    printer.reset();
    if (m_busy) {
        CVdShared::restore_cursor();
        m_busy = false;
    }
    bool ok = true;
    if (output == Preview) {
        // The page in progress; a count against pageCount would miss it after several reports.
        if (m_pageUnsaved)
            save_picture();
        VDRPrintHooks::preview(pictureFiles);
        for (const QString& file : qAsConst(pictureFiles))
            QFile::remove(file);
        pictureFiles.clear();
    } else if (output == Pdf && !m_pdfTemporary.isEmpty()) {
        // The temporary name is private to its creator; a new PDF is readable like any other new
        // file (a replaced one keeps the permissions it had).
        if (!QFileInfo::exists(pdfFileName))
            QFile::setPermissions(m_pdfTemporary, VDRFileOps::newFilePermissions());
        ok = QFileInfo(m_pdfTemporary).size() > 0 && VDRFileOps::flush(m_pdfTemporary) &&
             VDRFileOps::replaceFile(m_pdfTemporary, pdfFileName);
        if (!ok) {
            QFile::remove(m_pdfTemporary);
            VDRPrompt::critical(fileErrorTitle(), fileErrorText(pdfFileName));
        }
        m_pdfTemporary.clear();
        if (ok && openAfterPrint)
            VDRPrintHooks::openFile(pdfFileName);
        if (ok && m_openInViewer)
            (new PDFReaderTimer(pdfFileName, QCoreApplication::instance()))->start(100);
    }
    return ok;
}

void CVdPrintout::timeout()
{
    m_waitOver = true;
}

QRect CVdPrintout::text_area_sl(QPainter& painter, const QString& text)
{
    return painter.boundingRect(QRect(0, 0, kMeasureHeight, kMeasureHeight), singleLineFlags, text);
}

void CVdPrintout::draw_text_sl(QPainter& painter, const QRect& rect, const QString& text)
{
    painter.save();
    painter.setClipRect(rect);
    painter.drawText(rect, singleLineFlags, text);
    painter.restore();
}

QRect CVdPrintout::text_area_ml(QPainter& painter, const QRect& rect, const QString& text, int flags)
{
    return painter.boundingRect(QRect(rect.x(), rect.y(), rect.width(), kMeasureHeight), flags, text);
}

void CVdPrintout::draw_text_ml(QPainter& painter, const QRect& rect, const QString& text, int flags)
{
    painter.save();
    painter.setClipRect(rect);
    painter.drawText(rect, flags, text);
    painter.restore();
}

QString CVdPrintout::break_line(QPainter& painter, int width, const QString& text)
{
    // Wraps at word boundaries, and inside a word only where the word alone is wider than the
    // column (a long URL), so that nothing runs past the column's edge.
    QTextOption option;
    option.setWrapMode(QTextOption::WrapAtWordBoundaryOrAnywhere);
    QStringList lines;
    for (const QString& paragraph : text.split(QLatin1Char('\n'))) {
        QTextLayout layout(paragraph, painter.font(), painter.device());
        layout.setTextOption(option);
        layout.beginLayout();
        bool any = false;
        for (QTextLine line = layout.createLine(); line.isValid(); line = layout.createLine()) {
            line.setLineWidth(qMax(1, width));
            QString part = paragraph.mid(line.textStart(), line.textLength());
            while (!part.isEmpty() && part.back().isSpace())
                part.chop(1);
            lines << part;
            any = true;
        }
        layout.endLayout();
        if (!any)
            lines << QString();
    }
    return lines.join(QLatin1Char('\n'));
}

void CVdPrintout::reset_clipping(QPainter& painter)
{
    painter.setClipping(false);
}

QString CVdPrintout::cell2str(const QList<CText>& cell)
{
    QStringList parts;
    for (const CText& run : cell)
        parts << run.text;
    return parts.join(QLatin1Char('\n')).trimmed();
}

QString CVdPrintout::getDate4Language(const QDate& date)
{
    const QLocale locale;
    if (locale.language() == QLocale::German)
        return date.toString(QStringLiteral("dd.MM.yyyy"));
    if (locale.language() == QLocale::Spanish)
        return date.toString(QStringLiteral("dd/MM/yyyy"));
    return locale.toString(date, QLocale::ShortFormat);
}

QString CVdPrintout::reformat_date(const QString& isoDate)
{
    const QDate date = QDate::fromString(isoDate, Qt::ISODate);
    if (!date.isValid())
        return QString();
    return QLocale().dayName(date.dayOfWeek(), QLocale::LongFormat) + QStringLiteral(", ") +
           getDate4Language(date);
}

void CVdPrintout::scale_image(int w, int h, QImage& image)
{
    if (image.isNull() || w <= 0 || h <= 0) {
        if (w <= 0 || h <= 0)
            image = QImage();
        return;
    }
    image = image.scaled(w, h, Qt::KeepAspectRatio, Qt::SmoothTransformation);
}

QImage CVdPrintout::cropImage(const QImage& image)
{
    if (image.isNull() || image.width() <= 0)
        return image;
    if (double(image.height()) / image.width() <= 1.34)
        return image;
    const int height = image.width() * 4 / 3;
    return image.copy(0, (image.height() - height) / 2, image.width(), height);
}
