#include "editing/VDRBackupConfigDialog.h"

#include "document/VDRDocument.h"
#include "editing/VDRSettingsSpinDialog.h"

#include <QSettings>
#include <QSpinBox>

VDRBackupConfigDialog::VDRBackupConfigDialog(QWidget* parent) : QDialog(parent)
{
    setObjectName(QStringLiteral("VDRBackupConfigDialog"));
    m_spin = VDRSettingsSpinDialog::build(
        this, tr("Datensicherung Backups"),
        tr("Hier legen Sie fest, wieviele Backup-Dateien maximal erzeugt werden.\nBeim ersten Speichern nach dem "
           "Öffnen wird die bisherige Datei zur neuesten Sicherung; die älteste Sicherung wird dann gelöscht."),
        tr("Anzahl der Sicherungs-Dateien:"), 0, 25, 1);
}

void VDRBackupConfigDialog::showEvent(QShowEvent* event)
{
    m_spin->setValue(QSettings().value(VDRDocument::numberOfBackupsSettingsKey(), defaultValue()).toInt());
    QDialog::showEvent(event);
}

void VDRBackupConfigDialog::slotDefaults()
{
    m_spin->setValue(defaultValue());
}

void VDRBackupConfigDialog::accept()
{
    QSettings().setValue(VDRDocument::numberOfBackupsSettingsKey(), m_spin->value());
    QDialog::accept();
}
