#include "editing/printdialogs/VDROutputSelectDialog.h"

#include <QCheckBox>
#include <QPushButton>
#include <QSettings>
#include <QVBoxLayout>

VDROutputSelectDialog::VDROutputSelectDialog(QIcon icon, bool showCheckbox, QWidget* parent) : QDialog(parent)
{
    setWindowTitle(tr("Ausgabe wählen"));
    setWindowIcon(icon);
    setMinimumWidth(280);
    auto* print =
        new QPushButton(QIcon(QStringLiteral(":/VDRMainWindow/Resources/icon-datei-drucken-firmenliste.png")),
                        tr("&Drucken"), this);
    print->setObjectName(QStringLiteral("pbPrint"));
    auto* pdf = new QPushButton(QIcon(QStringLiteral(":/VDRMainWindow/Resources/icon-datei-pdf.png")),
                                tr("&PDF speichern"), this);
    pdf->setObjectName(QStringLiteral("pbPdf"));
    auto* cancel = new QPushButton(
        QIcon(QStringLiteral(":/VDRMainWindow/Resources/icon-allgemein-cancel.png")), tr("&Abbrechen"), this);
    cancel->setObjectName(QStringLiteral("pbCancel"));
    m_checkBox = new QCheckBox(tr("&Listen mit Seitenumbruch trennen"), this);
    m_checkBox->setChecked(QSettings().value(checkboxStateSettingsKey(), false).toBool());
    m_checkBox->setVisible(showCheckbox);
    auto* layout = new QVBoxLayout(this);
    layout->addWidget(print);
    layout->addWidget(pdf);
    layout->addWidget(cancel);
    layout->addWidget(m_checkBox);
    connect(print, &QPushButton::clicked, this, [this] { choose(0); });
    connect(pdf, &QPushButton::clicked, this, [this] { choose(1); });
    connect(cancel, &QPushButton::clicked, this, &QDialog::reject);
}

bool VDROutputSelectDialog::separateByPageBreak() const
{
    return m_checkBox->isChecked();
}

void VDROutputSelectDialog::choose(int value)
{
    result = value;
    QSettings().setValue(checkboxStateSettingsKey(), m_checkBox->isChecked());
    accept();
}
