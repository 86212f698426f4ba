#include "document/VDRFileSizeDialog.h"

#include "document/VDRDocument.h"
#include "document/VDRPrompt.h"

#include <QFileInfo>
#include <QSettings>

int VDRFileSizeDialog::dueSizeMegabytes() const
{
    if (!m_document || !m_document->isStateValid() || m_document->getFilepath().isEmpty())
        return -1;
    if (m_document->noFileSizeWarning() || m_document->isExportedTo())
        return -1;
    const int megabytes = int(QFileInfo(m_document->getFilepath()).size() / 1024000);
    const int limit = QSettings().value(fileSizeSettingsKey(), defaultFileSize()).toInt();
    return megabytes > limit ? megabytes : -1;
}

VDRFileSizeDialog::Result VDRFileSizeDialog::exec()
{
    const int megabytes = dueSizeMegabytes();
    if (megabytes < 0)
        return NotDue;
    bool notAgain = false;
    const int choice = VDRPrompt::instance()->choose(VDRPrompt::Information, tr("Datei-Information"),
                                                     tr("Diese Datei hat eine Größe von %1 MB.\nSie können "
                                                        "eine Folgedatei anlegen, indem Sie die Stammdaten "
                                                        "exportieren.")
                                                         .arg(megabytes),
                                                     {tr("OK"), tr("Abbrechen")}, 0, 1,
                                                     tr("für diese Datei nicht mehr anzeigen"), &notAgain);
    if (notAgain && m_document->setNoFileSizeWarning())
        m_document->saveDocument(QString());
    return choice == 0 ? ExportRequested : Dismissed;
}
