#pragma once

#include "editing/reportlist/VDREntryNumberDialog.h"

// The number dialog of a report inserted between others.
class VDREntryInsertDialog : public VDREntryNumberDialog
{
    Q_OBJECT
public:
    VDREntryInsertDialog(VDRDocument* document, QWidget* parent = nullptr);
    explicit VDREntryInsertDialog(QWidget* parent);
};
