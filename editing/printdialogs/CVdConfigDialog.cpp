#include "editing/printdialogs/CVdConfigDialog.h"

#include "printing/CVdConfig.h"

#include <QFontDialog>
#include <QGridLayout>
#include <QHBoxLayout>
#include <QLabel>
#include <QPushButton>

CVdConfigDialog::CVdConfigDialog(QWidget* parent) : QDialog(parent)
{
    setObjectName(QStringLiteral("CVdConfigDialog"));
    setWindowTitle(tr("Schriftarten ändern"));
    setWindowIcon(
        QIcon(QStringLiteral(":/VDRMainWindow/Resources/6 Einstellungen/06-einstellungen-schriftarten.ico")));
    const CVdConfig* config = CVdConfig::self();
    headerFont = config->headerFont;
    titleFont = config->titleFont;
    contentsFont = config->contentsFont;
    footerFont = config->footerFont;

    auto* grid = new QGridLayout;
    const QString samples[] = {tr("Beispiel Kopfzeile"), tr("Beispiel Überschriften"),
                               tr("Beispiel Normaltext"), tr("Beispiel Fußzeile")};
    const QString buttons[] = {tr("Kopfzeile"), tr("Überschriften"), tr("Normaltext"), tr("Fußzeile")};
    void (CVdConfigDialog::*handlers[])() = {
        &CVdConfigDialog::header_clicked, &CVdConfigDialog::title_clicked, &CVdConfigDialog::contents_clicked,
        &CVdConfigDialog::footer_clicked};
    for (int i = 0; i < 4; ++i) {
        m_samples[i] = new QLabel(samples[i], this);
        auto* button = new QPushButton(buttons[i], this);
        connect(button, &QPushButton::clicked, this, handlers[i]);
        grid->addWidget(m_samples[i], i, 0);
        grid->addWidget(button, i, 1);
    }
    auto* defaults = new QPushButton(tr("&Standardeinstellungen"), this);
    defaults->setObjectName(QStringLiteral("pbDefaults"));
    auto* ok = new QPushButton(tr("&OK"), this);
    ok->setObjectName(QStringLiteral("pbOk"));
    auto* cancel = new QPushButton(tr("&Abbrechen"), this);
    connect(defaults, &QPushButton::clicked, this, &CVdConfigDialog::defaults_clicked);
    connect(ok, &QPushButton::clicked, this, &CVdConfigDialog::accept);
    connect(cancel, &QPushButton::clicked, this, &QDialog::reject);
    auto* row = new QHBoxLayout;
    row->addWidget(defaults);
    row->addStretch();
    row->addWidget(ok);
    row->addWidget(cancel);
    auto* layout = new QVBoxLayout(this);
    layout->addLayout(grid);
    layout->addLayout(row);
    showSamples();
}

void CVdConfigDialog::showSamples()
{
    const QFont fonts[] = {headerFont, titleFont, contentsFont, footerFont};
    for (int i = 0; i < 4; ++i)
        m_samples[i]->setFont(fonts[i]);
}

void CVdConfigDialog::chooseFont(QFont& font)
{
    bool ok = false;
    const QFont chosen = QFontDialog::getFont(&ok, font, this);
    if (ok)
        font = chosen;
    showSamples();
}

void CVdConfigDialog::header_clicked()
{
    chooseFont(headerFont);
}

void CVdConfigDialog::title_clicked()
{
    chooseFont(titleFont);
}

void CVdConfigDialog::contents_clicked()
{
    chooseFont(contentsFont);
}

void CVdConfigDialog::footer_clicked()
{
    chooseFont(footerFont);
}

void CVdConfigDialog::defaults_clicked()
{
    headerFont = CVdConfig::printout_default_header_font();
    titleFont = CVdConfig::printout_default_title_font();
    contentsFont = CVdConfig::printout_default_contents_font();
    footerFont = CVdConfig::printout_default_footer_font();
    showSamples();
}

void CVdConfigDialog::accept()
{
    CVdConfig* config = CVdConfig::self();
    config->headerFont = headerFont;
    config->titleFont = titleFont;
    config->contentsFont = contentsFont;
    config->footerFont = footerFont;
    config->save();
    QDialog::accept();
}
