#include "editing/reportlist/VDREntryInsertDialog.h"

VDREntryInsertDialog::VDREntryInsertDialog(VDRDocument* document, QWidget* parent)
    : VDREntryNumberDialog(document, tr("Geben Sie die neue Bauberichtsnummer ein"), parent)
{
}

VDREntryInsertDialog::VDREntryInsertDialog(QWidget* parent)
    : VDREntryInsertDialog(documentAround(parent), parent)
{
}
