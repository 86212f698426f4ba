#pragma once

#include "editing/settings/VDRSettingsSpinDialog.h"

// From which file size opening a diary suggests a follow-up file.
class VDRFileSizeConfigDialog : public VDRSettingsSpinDialog
{
    Q_OBJECT
public:
    explicit VDRFileSizeConfigDialog(QWidget* parent = nullptr);
};
