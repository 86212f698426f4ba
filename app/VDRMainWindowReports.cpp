// The main window's report commands: the report list and calendar, the report actions and printing.
#include "app/VDRMainWindow.h"

#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "document/VDRPrompt.h"
#include "editing/form/VDREntryWidget.h"
#include "editing/form/VdEvent.h"
#include "editing/form/VdEventsController.h"
#include "editing/printdialogs/CVdConfigDialog.h"
#include "editing/printdialogs/CVdPrintoutSettings.h"
#include "editing/printdialogs/VDROutputSelectDialog.h"
#include "editing/printdialogs/VDRPrintTextsEditor.h"
#include "editing/reportlist/VDREntryListWidget.h"
#include "editing/reportlist/VDREntrySelectorWidget.h"
#include "printing/CVdPrintFirmList.h"
#include "printing/CVdPrintoutFormblatt.h"
#include "printing/CVdPrintoutReport.h"
#include "printing/CVdTexts.h"

#include <QFileInfo>
#include <QIcon>
#include <QRegularExpression>

void VDRMainWindow::slot_dockWidgetEntryDate_dateSelected(const QDate& date, bool& found)
{
    found = false;
    if (!m_document->isStateValid() || !m_document->modelEntryAll())
        return;
    VDREntryWidget* form = existingEntryWidget();
    if (form && form->document() == m_document) {
        form->actionAskForSubmit();
        found = form->actionGotoDate(date);
        return;
    }
    // Without a form the list at least selects the report of that date.
    VDRAllEntryTableModel* model = m_document->modelEntryAll();
    model->fetch_all();
    const QString wanted = date.toString(QStringLiteral("yyyy-MM-dd"));
    for (int row = 0; row < model->rowCount() && !found; ++row) {
        if (model->data(row, QStringLiteral("inspection_date"), Qt::EditRole).toString() == wanted) {
            found = true;
            VdEventsController::instance()->send_event(VdEvent::SelectRow, row);
        }
    }
}

void VDRMainWindow::runOnEntryRow(int row, void (VDREntryWidget::*command)())
{
    VDREntryWidget* form = existingEntryWidget();
    if (!form || form->document() != m_document || !m_document->isStateValid())
        return;
    // Showing the row first keeps what was typed into the report shown before.
    form->actionGoto(row, -1);
    if (form->currentRow() != row)
        return;
    (form->*command)();
    // After a copy or a deletion the form shows another row than the one clicked.
    VdEventsController::instance()->send_event(VdEvent::SelectRow, form->currentRow());
}

void VDRMainWindow::slot_dockWidgetEntryList_doEntryAllAlterNumber(int row)
{
    runOnEntryRow(row, &VDREntryWidget::actionAlterNumber);
}

void VDRMainWindow::slot_dockWidgetEntryList_doEntryAllCopy(int row)
{
    runOnEntryRow(row, &VDREntryWidget::actionCopy);
}

void VDRMainWindow::slot_dockWidgetEntryList_doEntryAllDelete(int row)
{
    runOnEntryRow(row, &VDREntryWidget::actionDelete);
}

void VDRMainWindow::slot_dockWidgetEntryList_doEntryAllChangeUID(int row)
{
    runOnEntryRow(row, &VDREntryWidget::actionEntryChangeUID);
}

void VDRMainWindow::slot_dockWidgetEntryList_doEntryDisableDelete()
{
    m_entryList->setDeleteEnabled(false);
}

void VDRMainWindow::slot_dockWidgetEntryList_doEntryEnableDelete()
{
    m_entryList->setDeleteEnabled(true);
}

int VDRMainWindow::displayEntrySelector(QList<int>& ids, int mode, const QString& title, QString* pdfFileName)
{
    ids.clear();
    VDREntrySelectorWidget dialog(mode, this);
    if (!title.isEmpty())
        dialog.setWindowTitle(title);
    VDREntryWidget* form = existingEntryWidget();
    const int currentRow = form ? form->currentRow() : m_entryList->currentRow();
    dialog.setDocument(m_document, currentRow);
    const int result = dialog.exec();
    if (result == VDREntrySelectorWidget::Cancelled)
        return result;
    ids = VDREntrySelectorWidget::entryIds(m_document, dialog.getSelectedMode(), currentRow,
                                           dialog.getSelectionMode5From(), dialog.getSelectionMode5To());
    if (pdfFileName)
        *pdfFileName = VDREntrySelectorWidget::pdfFileName(m_document, dialog.getSelectedMode(), ids);
    return result;
}

void VDRMainWindow::on_actionFilePrintEmptyEntry_triggered()
{
    if (!m_document->isStateValid())
        return;
    CVdPrintoutFormblatt printout(this);
    printout.print(false);
}

void VDRMainWindow::on_actionFilePrintCompanyList_triggered()
{
    if (!m_document->isStateValid())
        return;
    VDROutputSelectDialog select(
        QIcon(QStringLiteral(":/VDRMainWindow/Resources/icon-datei-drucken-firmenliste.png")), true, this);
    if (select.exec() != QDialog::Accepted)
        return;
    const QString fileName = m_document->projectName() + tr(" - ") + tr(" Firmenliste.pdf");
    CVdPrintFirmList printout(this);
    printout.print(select.result == 1, select.separateByPageBreak(), fileName,
                   QFileInfo(m_document->getFilepath()).absolutePath());
}

void VDRMainWindow::on_actionToolbarPrintCompanyList_triggered()
{
    on_actionFilePrintCompanyList_triggered();
}

void VDRMainWindow::on_actionPrintoutSettings_triggered()
{
    CVdPrintoutSettings dialog(this);
    dialog.exec();
}

void VDRMainWindow::on_actionSchriftarten_triggered()
{
    CVdConfigDialog dialog(this);
    dialog.exec();
}

void VDRMainWindow::on_actionDrucktexte_triggered()
{
    VDRPrintTextsEditor editor(CVdTexts::self()->model(), this);
    editor.exec();
}

void VDRMainWindow::on_actionEntryNew_triggered()
{
    entryWidget()->actionNew();
}

void VDRMainWindow::on_actionEntryInsert_triggered()
{
    entryWidget()->actionInsert();
}

void VDRMainWindow::on_actionEntryCopy_triggered()
{
    entryWidget()->actionCopy();
}

void VDRMainWindow::on_actionEntryDelete_triggered()
{
    entryWidget()->actionDelete();
}

void VDRMainWindow::on_actionEntryGotoFirst_triggered()
{
    entryWidget()->actionToFirst();
}

void VDRMainWindow::on_actionEntryGotoPrevious_triggered()
{
    entryWidget()->actionToPrevious();
}

void VDRMainWindow::on_actionEntryGotoNext_triggered()
{
    entryWidget()->actionToNext();
}

void VDRMainWindow::on_actionEntryGotoLast_triggered()
{
    entryWidget()->actionToLast();
}

void VDRMainWindow::on_actionEntryAlterNumber_triggered()
{
    entryWidget()->actionAlterNumber();
}

void VDRMainWindow::on_actionEntryChangeUID_triggered()
{
    entryWidget()->actionEntryChangeUID();
}

void VDRMainWindow::on_actionSettingsChangeUID_triggered()
{
    entryWidget()->actionSettingsChangeUID();
}

bool VDRMainWindow::readyToPrint()
{
    if (!m_document->isStateValid())
        return false;
    VDREntryWidget* form = existingEntryWidget();
    if (form && form->document() == m_document)
        form->actionAskForSubmit();
    return true;
}

int VDRMainWindow::currentEntryRow()
{
    VDREntryWidget* form = existingEntryWidget();
    if (form && form->document() == m_document)
        return form->currentEntryId() > 0 ? form->currentRow() : -1;
    return m_entryList->currentRow();
}

void VDRMainWindow::printCurrentEntry(int output)
{
    if (!readyToPrint())
        return;
    const int row = currentEntryRow();
    if (row < 0) {
        VDRPrompt::warning(tr("Hinweis"), tr("Sie haben keinen Bautagesbericht ausgewählt!"));
        return;
    }
    printEntryRow(row, output);
}

void VDRMainWindow::printEntryRow(int row, int output)
{
    VDRAllEntryTableModel* model = m_document->modelEntryAll();
    if (!model || row < 0 || row >= model->rowCount())
        return;
    const int id = model->data(row, QStringLiteral("id"), Qt::EditRole).toInt();
    QString name;
    if (output == CVdPrintout::Pdf) {
        name =
            tr("%1 - Bericht %2.pdf").arg(m_document->projectName(), m_document->entryNumberWithUserId(row));
        // The project's name or the author's id may hold characters that no file name can.
        name.replace(QRegularExpression(QStringLiteral("[/\\\\:*?\"<>|\\x00-\\x1f]")), QStringLiteral("_"));
    }
    printEntries({id}, output, name);
}

void VDRMainWindow::printEntries(const QList<int>& ids, int output, const QString& pdfFileName)
{
    const QString diary = m_document->getFilepath();
    CVdPrintoutReport printout(this, ids);
    printout.setTemporaryFolder(m_document->temporaryFolder());
    printout.print(CVdPrintout::Output(output), pdfFileName, true,
                   diary.isEmpty() ? QString() : QFileInfo(diary).absolutePath());
}

void VDRMainWindow::on_actionFilePrintCurEntry_triggered()
{
    printCurrentEntry(CVdPrintout::Printer);
}

void VDRMainWindow::on_actionFilePDFCurEntry_triggered()
{
    printCurrentEntry(CVdPrintout::Pdf);
}

void VDRMainWindow::on_actionFilePreviewEntry_triggered()
{
    printCurrentEntry(CVdPrintout::Preview);
}

void VDRMainWindow::on_actionFilePrintEntries_triggered()
{
    if (!readyToPrint())
        return;
    QList<int> ids;
    QString name;
    const int mode =
        currentEntryRow() >= 0 ? VDREntrySelectorWidget::CurrentEntry : VDREntrySelectorWidget::AllEntries;
    const int result = displayEntrySelector(ids, mode, QString(), &name);
    if (result == VDREntrySelectorWidget::Cancelled)
        return;
    if (ids.isEmpty()) {
        VDRPrompt::warning(tr("Hinweis"), tr("Sie haben keinen Bautagesbericht ausgewählt!"));
        return;
    }
    // "OK" prints, as "Drucken" does.
    printEntries(ids, result == VDREntrySelectorWidget::Pdf ? CVdPrintout::Pdf : CVdPrintout::Printer, name);
}

void VDRMainWindow::slot_dockWidgetEntryList_doEntryAllPrint(int row)
{
    if (readyToPrint())
        printEntryRow(row, CVdPrintout::Printer);
}

void VDRMainWindow::slot_dockWidgetEntryList_doEntryAllPdf(int row)
{
    if (readyToPrint())
        printEntryRow(row, CVdPrintout::Pdf);
}
