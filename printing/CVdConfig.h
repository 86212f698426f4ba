#pragma once

#include <QFont>
#include <QObject>
#include <QString>

// Printout settings: fonts, margins and folders. Read once; the dialogs change them and save().
class CVdConfig : public QObject
{
    Q_OBJECT
public:
    static CVdConfig* self();
    // Reads the settings again (tests, and after a settings import).
    void reload();
    void save();

    static QString printoutGroup() { return QStringLiteral("Printout/"); }
    static QString HeaderFontSettingsKey() { return QStringLiteral("Kopfzeile"); }
    static QString TitleFontSettingsKey() { return QStringLiteral("Überschriften"); }
    static QString ContentsFontSettingsKey() { return QStringLiteral("Normaltext"); }
    static QString FooterFontSettingsKey() { return QStringLiteral("Fußzeile"); }
    static QString SmallFooterFontSettingsKey() { return QStringLiteral("Fußzeile klein"); }
    static QString PdfDirSettingsKey() { return QStringLiteral("PDF directory"); }
    static QString LeftMarginSettingsKey() { return QStringLiteral("Left Margin"); }
    static QString RightMarginSettingsKey() { return QStringLiteral("Right Margin"); }
    static QString TopMarginSettingsKey() { return QStringLiteral("Top Margin"); }
    static QString BottomMarginSettingsKey() { return QStringLiteral("Bottom Margin"); }
    static QString LogoDirSettingsKey() { return QStringLiteral("Logo/logo directory"); }
    static QString LogosUnderHeaderSettingsKey() { return QStringLiteral("Logo/printLogosUnderHeader"); }
    static QString LogoPrintHeightSettingsKey() { return QStringLiteral("Logo/LogoPrintHeight"); }

    static QFont printout_default_header_font();
    static QFont printout_default_title_font();
    static QFont printout_default_contents_font();
    static QFont printout_default_footer_font();
    static QFont printout_default_small_footer_font();
    static int defaultLeftMargin() { return 15; }
    static int defaultRightMargin() { return 15; }
    static int defaultTopMargin() { return 10; }
    static int defaultBottomMargin() { return 10; }

    // A font from its string form; 'fallback' when the string is not one.
    static QFont fontFromString(const QString& text, const QFont& fallback);

    QFont headerFont, titleFont, contentsFont, footerFont, smallFooterFont;
    QString pdfDir, logoDir;
    int leftMargin = 15, rightMargin = 15, topMargin = 10, bottomMargin = 10;

private:
    CVdConfig();
};
