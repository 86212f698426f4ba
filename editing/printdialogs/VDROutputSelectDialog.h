#pragma once

#include <QDialog>
#include <QIcon>

class QCheckBox;

// Printer or PDF, and for the company list whether its two lists start on pages of their own.
class VDROutputSelectDialog : public QDialog
{
    Q_OBJECT
public:
    VDROutputSelectDialog(QIcon icon, bool showCheckbox, QWidget* parent);

    static QString checkboxStateSettingsKey() { return QStringLiteral("OutputSelectDialog/checkboxState"); }
    // 0 printer, 1 PDF.
    int result = 0;
    bool separateByPageBreak() const;

private:
    void choose(int value);
    QCheckBox* m_checkBox;
};
