#include "editing/printdialogs/CVdPrintoutSettings.h"

#include "printing/CVdConfig.h"

#include <QFormLayout>
#include <QGroupBox>
#include <QHBoxLayout>
#include <QPushButton>
#include <QSpinBox>
#include <QVBoxLayout>

CVdPrintoutSettings::CVdPrintoutSettings(QWidget* parent) : QDialog(parent)
{
    setObjectName(QStringLiteral("CVdPrintoutSettings"));
    setWindowTitle(tr("Druckeinstellungen"));
    setWindowIcon(
        QIcon(QStringLiteral(":/VDRMainWindow/Resources/6 Einstellungen/05-einstellungen-drucken.ico")));
    auto* group = new QGroupBox(tr("Seitenränder"), this);
    auto* form = new QFormLayout(group);
    const auto spin = [&](const char* name, const QString& label, int min, int max) {
        auto* box = new QSpinBox(group);
        box->setObjectName(QLatin1String(name));
        box->setRange(min, max);
        box->setSuffix(tr(" mm"));
        form->addRow(label, box);
        return box;
    };
    m_left = spin("sbLeft", tr("Links:"), MinHMarginValue, MaxHMarginValue);
    m_right = spin("sbRight", tr("Rechts:"), MinHMarginValue, MaxHMarginValue);
    m_top = spin("sbTop", tr("Oben:"), MinVMarginValue, MaxVMarginValue);
    m_bottom = spin("sbBottom", tr("Unten:"), MinVMarginValue, MaxVMarginValue);
    const CVdConfig* config = CVdConfig::self();
    m_left->setValue(config->leftMargin);
    m_right->setValue(config->rightMargin);
    m_top->setValue(config->topMargin);
    m_bottom->setValue(config->bottomMargin);

    auto* defaults = new QPushButton(tr("Standardeinstellungen"), this);
    defaults->setObjectName(QStringLiteral("pbDefaults"));
    auto* ok = new QPushButton(tr("OK"), this);
    ok->setObjectName(QStringLiteral("pbOk"));
    auto* cancel = new QPushButton(tr("Abbrechen"), this);
    connect(defaults, &QPushButton::clicked, this, &CVdPrintoutSettings::defaults_clicked);
    connect(ok, &QPushButton::clicked, this, &CVdPrintoutSettings::accept);
    connect(cancel, &QPushButton::clicked, this, &QDialog::reject);
    auto* row = new QHBoxLayout;
    row->addWidget(defaults);
    row->addStretch();
    row->addWidget(ok);
    row->addWidget(cancel);
    auto* layout = new QVBoxLayout(this);
    layout->addWidget(group);
    layout->addLayout(row);
}

void CVdPrintoutSettings::defaults_clicked()
{
    m_left->setValue(CVdConfig::defaultLeftMargin());
    m_right->setValue(CVdConfig::defaultRightMargin());
    m_top->setValue(CVdConfig::defaultTopMargin());
    m_bottom->setValue(CVdConfig::defaultBottomMargin());
}

void CVdPrintoutSettings::accept()
{
    CVdConfig* config = CVdConfig::self();
    config->leftMargin = m_left->value();
    config->rightMargin = m_right->value();
    config->topMargin = m_top->value();
    config->bottomMargin = m_bottom->value();
    config->save();
    QDialog::accept();
}
