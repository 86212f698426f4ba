#include "editing/VDRFileSizeConfigDialog.h"

#include "document/VDRFileSizeDialog.h"
#include "editing/VDRSettingsSpinDialog.h"

#include <QSettings>
#include <QSpinBox>

VDRFileSizeConfigDialog::VDRFileSizeConfigDialog(QWidget* parent) : QDialog(parent)
{
    setObjectName(QStringLiteral("VDRFileSizeConfigDialog"));
    m_spin = VDRSettingsSpinDialog::build(
        this, tr("Einstellungen Stammdaten Export"),
        tr("Hier stellen Sie die Dateigröße ein, ab der beim Laden eine\nAufforderung zum Anlegen einer Folgedatei "
           "angezeigt wird.\nHiermit wird das übermäßige Anwachsen der Datei vermieden.\n"),
        tr("Dateigröße (in MB):"), 0, 2000, 10);
}

void VDRFileSizeConfigDialog::showEvent(QShowEvent* event)
{
    m_spin->setValue(
        QSettings().value(VDRFileSizeDialog::fileSizeSettingsKey(), VDRFileSizeDialog::defaultFileSize()).toInt());
    QDialog::showEvent(event);
}

void VDRFileSizeConfigDialog::slotDefaults()
{
    m_spin->setValue(defaultValue());
}

void VDRFileSizeConfigDialog::accept()
{
    QSettings().setValue(VDRFileSizeDialog::fileSizeSettingsKey(), m_spin->value());
    QDialog::accept();
}
