#include "editing/settings/VDRBackupConfigDialog.h"

#include "document/VDRDocument.h"

VDRBackupConfigDialog::VDRBackupConfigDialog(QWidget* parent)
    : VDRSettingsSpinDialog(
          {tr("Datensicherung Backups"),
           tr("Hier legen Sie fest, wieviele Backup-Dateien maximal erzeugt werden.\nBeim ersten "
              "Speichern nach dem Öffnen wird die bisherige Datei zur neuesten Sicherung; die "
              "älteste Sicherung wird dann gelöscht."),
           tr("Anzahl der Sicherungs-Dateien:"), VDRDocument::numberOfBackupsSettingsKey(), 4, 0, 25, 1},
          parent)
{
    setObjectName(QStringLiteral("VDRBackupConfigDialog"));
}
