#pragma once

#include <QTextEdit>

// The text part of VDRTextEditComboBox: plain text, Alt+Down opens the list.
class VDRTextEditComboBoxTextEdit : public QTextEdit
{
    Q_OBJECT
public:
    explicit VDRTextEditComboBoxTextEdit(QWidget* parent = nullptr);

signals:
    void listRequested();

protected:
    void keyPressEvent(QKeyEvent* event) override;
};
