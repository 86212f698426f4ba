#include "editing/printdialogs/VDRPrintWidgets.h"

#include "editing/printdialogs/CVdPrintPreview.h"
#include "printing/VDRPrintHooks.h"

#include <QApplication>
#include <QDesktopServices>
#include <QPrintDialog>
#include <QPrinter>
#include <QUrl>

void VDRPrintWidgets::install()
{
    VDRPrintHooks::setPrintDialog([](QPrinter* printer) {
        QPrintDialog dialog(printer, QApplication::activeWindow());
        return dialog.exec() == QDialog::Accepted;
    });
    VDRPrintHooks::setPreview([](const QStringList& files) {
        CVdPrintPreview preview(QApplication::activeWindow(), files);
        preview.exec();
    });
    VDRPrintHooks::setOpenFile(
        [](const QString& path) { QDesktopServices::openUrl(QUrl::fromLocalFile(path)); });
}
