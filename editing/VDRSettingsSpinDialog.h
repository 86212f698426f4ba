#pragma once

#include <QString>

class QDialog;
class QSpinBox;

// The shared layout of the small settings dialogs: an explanation, a labelled spin box and the
// buttons "Standardeinstellung", "OK" and "Abbrechen".
namespace VDRSettingsSpinDialog {
QSpinBox* build(QDialog* dialog, const QString& title, const QString& explanation, const QString& label, int minimum,
                int maximum, int step);
}
