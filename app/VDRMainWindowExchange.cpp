// The main window's exchange commands: exchange files of the mobile app in, master data out.
#include "app/VDRMainWindow.h"

#include "document/VDRDocument.h"
#include "document/VDRPrompt.h"
#include "editing/reportlist/VDREntryListWidget.h"
#include "sync/VDRMasterDataExport.h"
#include "sync/VDRReportSynchronisation.h"

#include <QDir>
#include <QFileInfo>

void VDRMainWindow::on_actionExchangeReport_triggered()
{
    if (!m_document->isStateValid())
        return;
    const QString path = VDRPrompt::instance()->openFileName(
        tr("Austauschdatei importieren"), QFileInfo(m_document->getFilepath()).absolutePath(),
        tr("Austauschdatei (*.vdx)"));
    if (!path.isEmpty())
        importExchangeFile(path);
}

void VDRMainWindow::on_actionExchangeReport_2_triggered()
{
    on_actionExchangeReport_triggered();
}

int VDRMainWindow::importExchangeFile(const QString& path)
{
    VDRReportSynchronisation sync(m_document);
    bool projectDataChanged = false;
    const int result = sync.importManualReportExchangeFile(path, projectDataChanged);
    if (sync.saveNowRequested()) {
        // A diary with a file is compacted as it is saved; a new one asks for its name first.
        const bool saved = m_document->isStateNew() || m_document->getFilepath().isEmpty()
                               ? saveDocument(false, true) == 0 && !m_document->isStateModified()
                               : m_document->compactDB(false) == 0;
        if (saved)
            sync.deleteRequestedFile();
    }
    updateGui4ManualReportExchangeFileImport();
    return result;
}

void VDRMainWindow::updateGui4ManualReportExchangeFileImport()
{
    m_entryList->slotShowUserIds(); // imported reports may bring the first author code
    updateGui();
}

void VDRMainWindow::on_actionExportMasterData_triggered()
{
    if (!m_document->isStateValid())
        return;
    const QString title = tr("Stammdaten Export");
    if (m_document->isDemoProject()) {
        VDRPrompt::information(title, tr("Ein Stammdaten-Export ist für das Musterprojekt nicht möglich."));
        return;
    }
    const QString file = m_document->getFilepath();
    if (!file.isEmpty() && QFileInfo::exists(file) && !QFileInfo(file).isWritable()) {
        VDRPrompt::information(
            title, tr("Der Stammdaten Export kann für dieses Dokument nicht durchgeführt werden,\nda "
                      "die Datei %1 schreibgeschützt ist.")
                       .arg(QDir::toNativeSeparators(file)));
        return;
    }
    if (m_document->isStructureExtended()) {
        if (VDRPrompt::instance()->question(
                VDRPrompt::Warning, title,
                tr("Das Dokument wurde mit einer früheren Programmversion erstellt.\nUm den Stammdaten "
                   "Export "
                   "durchführen zu können, muss es jetzt im aktuellen Dateiformat gespeichert werden.\nSie "
                   "können das Dokument dann nicht mehr mit füheren Programmversionen bearbeiten.\n\nVorgang "
                   "fortsetzen?"),
                VDRPrompt::Ok | VDRPrompt::Cancel, VDRPrompt::Ok, VDRPrompt::Cancel) != VDRPrompt::Ok)
            return;
        m_document->acceptCurrentFormat();
        const int saved = m_document->saveDocument();
        updateGui();
        if (saved != 0)
            return;
    }
    bool exported = false;
    QString exportedTo;
    VDRMasterDataExport::check4ExportedMasterData(m_document, exported, exportedTo);
    if (exported && VDRPrompt::instance()->question(
                        VDRPrompt::Question, tr("Hinweis"),
                        tr("Die Stammdaten dieser Datei wurden bereits exportiert nach %0.\nExport der "
                           "Stammdaten fortsetzen?")
                            .arg(exportedTo),
                        VDRPrompt::Yes | VDRPrompt::No, VDRPrompt::Yes, VDRPrompt::No) != VDRPrompt::Yes)
        return;
    if (m_document->isStateModified() || m_document->isStateNew()) {
        if (VDRPrompt::instance()->question(VDRPrompt::Question, title,
                                            tr("Die Datei wird vor dem Exportieren der Stammdaten "
                                               "gespeichert!\nExport der Stammdaten fortsetzen?"),
                                            VDRPrompt::Yes | VDRPrompt::No, VDRPrompt::Yes,
                                            VDRPrompt::No) != VDRPrompt::Yes)
            return;
        if (saveDocument(false, true) != 0 || m_document->isStateModified())
            return;
    }
    const QString target = VDRPrompt::instance()->saveFileName(
        title, QFileInfo(m_document->getFilepath()).absolutePath(), tr("Varduna (*.vd2)"));
    if (target.isEmpty())
        return;
    if (VDRMasterDataExport::createFollowUpDiary(m_document, target) == 0)
        saveDocument(false, true); // the diary records where its master data went
    updateGui();
}
