#include "editing/settings/VDRSettingsSpinDialog.h"

#include <QFormLayout>
#include <QHBoxLayout>
#include <QLabel>
#include <QPushButton>
#include <QSettings>
#include <QSpinBox>
#include <QVBoxLayout>

VDRSettingsSpinDialog::VDRSettingsSpinDialog(const Setup& setup, QWidget* parent)
    : QDialog(parent), m_key(setup.settingsKey), m_default(setup.defaultValue), m_spin(new QSpinBox(this))
{
    setWindowTitle(setup.title);
    auto* layout = new QVBoxLayout(this);
    auto* text = new QLabel(setup.explanation, this);
    text->setWordWrap(true);
    layout->addWidget(text);
    auto* form = new QFormLayout;
    m_spin->setObjectName(QStringLiteral("spinBox"));
    m_spin->setRange(setup.minimum, setup.maximum);
    m_spin->setSingleStep(setup.step);
    form->addRow(setup.label, m_spin);
    layout->addLayout(form);

    auto* buttons = new QHBoxLayout;
    auto* defaults = new QPushButton(tr("Standardeinstellung"), this);
    defaults->setObjectName(QStringLiteral("pushButtonDefaults"));
    auto* ok = new QPushButton(tr("OK"), this);
    ok->setObjectName(QStringLiteral("pushButtonOk"));
    ok->setDefault(true);
    auto* cancel = new QPushButton(tr("Abbrechen"), this);
    cancel->setObjectName(QStringLiteral("pushButtonCancel"));
    buttons->addWidget(defaults);
    buttons->addStretch();
    buttons->addWidget(ok);
    buttons->addWidget(cancel);
    layout->addLayout(buttons);
    connect(defaults, &QPushButton::clicked, this, &VDRSettingsSpinDialog::slotDefaults);
    connect(ok, &QPushButton::clicked, this, &QDialog::accept);
    connect(cancel, &QPushButton::clicked, this, &QDialog::reject);
}

void VDRSettingsSpinDialog::showEvent(QShowEvent* event)
{
    m_spin->setValue(QSettings().value(m_key, m_default).toInt());
    QDialog::showEvent(event);
}

void VDRSettingsSpinDialog::slotDefaults()
{
    m_spin->setValue(m_default);
}

void VDRSettingsSpinDialog::accept()
{
    QSettings().setValue(m_key, m_spin->value());
    QDialog::accept();
}
