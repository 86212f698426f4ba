#include "printing/CVdConfig.h"

#include "printing/CVdSettings.h"

#include <QCoreApplication>

namespace {
QFont defaultFont(const char* text)
{
    QFont font;
    font.fromString(QLatin1String(text));
    return font;
}
} // namespace

CVdConfig* CVdConfig::self()
{
    // Lives as long as the process.
    static CVdConfig config;
    return &config;
}

CVdConfig::CVdConfig()
{
    reload();
}

QFont CVdConfig::printout_default_header_font()
{
    return defaultFont("Arial, 10,-1,5,75,0,0,0,0,0");
}

QFont CVdConfig::printout_default_title_font()
{
    return defaultFont("Arial,17,-1,5,75,0,0,0,0,0");
}

QFont CVdConfig::printout_default_contents_font()
{
    return defaultFont("Arial,9,-1,5,50,0,0,0,0,0");
}

QFont CVdConfig::printout_default_footer_font()
{
    return defaultFont("Arial, 7,-1,5,50,0,0,0,0,0");
}

QFont CVdConfig::printout_default_small_footer_font()
{
    return defaultFont("Arial, 5,-1,5,50,0,0,0,0,0");
}

QFont CVdConfig::fontFromString(const QString& text, const QFont& fallback)
{
    QFont font;
    if (text.trimmed().isEmpty())
        return fallback;
    // A size of 0 or less would make every line height 0 and the page layout loop forever.
    if (!font.fromString(text) || font.pointSizeF() <= 0)
        return fallback;
    return font;
}

void CVdConfig::reload()
{
    CVdSettings settings;
    const QString g = printoutGroup();
    const auto fontAt = [&](const QString& key, const QFont& fallback) {
        return fontFromString(settings.value(g + key).toString(), fallback);
    };
    headerFont = fontAt(HeaderFontSettingsKey(), printout_default_header_font());
    titleFont = fontAt(TitleFontSettingsKey(), printout_default_title_font());
    contentsFont = fontAt(ContentsFontSettingsKey(), printout_default_contents_font());
    footerFont = fontAt(FooterFontSettingsKey(), printout_default_footer_font());
    smallFooterFont = fontAt(SmallFooterFontSettingsKey(), printout_default_small_footer_font());
    const QString appDir = QCoreApplication::applicationDirPath();
    pdfDir = settings.value(g + PdfDirSettingsKey(), appDir).toString();
    logoDir = settings.value(LogoDirSettingsKey(), appDir).toString();
    const auto marginAt = [&](const QString& key, int fallback) {
        bool ok = false;
        const int v = settings.value(g + key, fallback).toInt(&ok);
        return ok && v >= 0 && v < 200 ? v : fallback;
    };
    leftMargin = marginAt(LeftMarginSettingsKey(), defaultLeftMargin());
    rightMargin = marginAt(RightMarginSettingsKey(), defaultRightMargin());
    topMargin = marginAt(TopMarginSettingsKey(), defaultTopMargin());
    bottomMargin = marginAt(BottomMarginSettingsKey(), defaultBottomMargin());
}

void CVdConfig::save()
{
    CVdSettings settings;
    const QString g = printoutGroup();
    settings.save(g + HeaderFontSettingsKey(), headerFont.toString());
    settings.save(g + TitleFontSettingsKey(), titleFont.toString());
    settings.save(g + ContentsFontSettingsKey(), contentsFont.toString());
    settings.save(g + FooterFontSettingsKey(), footerFont.toString());
    settings.save(g + SmallFooterFontSettingsKey(), smallFooterFont.toString());
    settings.save(g + PdfDirSettingsKey(), pdfDir);
    settings.save(g + LeftMarginSettingsKey(), leftMargin);
    settings.save(g + RightMarginSettingsKey(), rightMargin);
    settings.save(g + TopMarginSettingsKey(), topMargin);
    settings.save(g + BottomMarginSettingsKey(), bottomMargin);
    settings.save(LogoDirSettingsKey(), logoDir);
}
