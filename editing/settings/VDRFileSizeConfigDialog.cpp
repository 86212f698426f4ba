#include "editing/settings/VDRFileSizeConfigDialog.h"

#include "document/VDRFileSizeDialog.h"

VDRFileSizeConfigDialog::VDRFileSizeConfigDialog(QWidget* parent)
    : VDRSettingsSpinDialog(
          {tr("Einstellungen Stammdaten Export"),
           tr("Hier stellen Sie die Dateigröße ein, ab der beim Laden eine\nAufforderung zum Anlegen "
              "einer Folgedatei angezeigt wird.\nHiermit wird das übermäßige Anwachsen der Datei "
              "vermieden.\n"),
           tr("Dateigröße (in MB):"), VDRFileSizeDialog::fileSizeSettingsKey(),
           VDRFileSizeDialog::defaultFileSize(), 0, 2000, 10},
          parent)
{
    setObjectName(QStringLiteral("VDRFileSizeConfigDialog"));
}
