#pragma once

#include "editing/settings/VDRSettingsSpinDialog.h"

// How many backup generations saving keeps.
class VDRBackupConfigDialog : public VDRSettingsSpinDialog
{
    Q_OBJECT
public:
    explicit VDRBackupConfigDialog(QWidget* parent = nullptr);
};
