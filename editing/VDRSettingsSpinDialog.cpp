#include "editing/VDRSettingsSpinDialog.h"

#include <QDialog>
#include <QFormLayout>
#include <QHBoxLayout>
#include <QLabel>
#include <QPushButton>
#include <QSpinBox>
#include <QVBoxLayout>

QSpinBox* VDRSettingsSpinDialog::build(QDialog* dialog, const QString& title, const QString& explanation,
                                       const QString& label, int minimum, int maximum, int step)
{
    dialog->setWindowTitle(title);
    auto* layout = new QVBoxLayout(dialog);
    auto* text = new QLabel(explanation, dialog);
    text->setWordWrap(true);
    layout->addWidget(text);
    auto* form = new QFormLayout;
    auto* spin = new QSpinBox(dialog);
    spin->setObjectName(QStringLiteral("spinBox"));
    spin->setRange(minimum, maximum);
    spin->setSingleStep(step);
    form->addRow(label, spin);
    layout->addLayout(form);
    auto* buttons = new QHBoxLayout;
    auto* defaults = new QPushButton(QDialog::tr("Standardeinstellung"), dialog);
    defaults->setObjectName(QStringLiteral("pushButtonDefaults"));
    auto* ok = new QPushButton(QDialog::tr("OK"), dialog);
    ok->setObjectName(QStringLiteral("pushButtonOk"));
    ok->setDefault(true);
    auto* cancel = new QPushButton(QDialog::tr("Abbrechen"), dialog);
    cancel->setObjectName(QStringLiteral("pushButtonCancel"));
    buttons->addWidget(defaults);
    buttons->addStretch();
    buttons->addWidget(ok);
    buttons->addWidget(cancel);
    layout->addLayout(buttons);
    QObject::connect(defaults, SIGNAL(clicked()), dialog, SLOT(slotDefaults()));
    QObject::connect(ok, &QPushButton::clicked, dialog, &QDialog::accept);
    QObject::connect(cancel, &QPushButton::clicked, dialog, &QDialog::reject);
    return spin;
}
