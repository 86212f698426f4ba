#pragma once

#include <QDialog>

class QSpinBox;

// From which file size opening a diary suggests a follow-up file.
class VDRFileSizeConfigDialog : public QDialog
{
    Q_OBJECT
public:
    explicit VDRFileSizeConfigDialog(QWidget* parent = nullptr);
    static int defaultValue() { return 100; }
    QSpinBox* spinBox() const { return m_spin; }

public slots:
    void accept() override;
    void slotDefaults();

protected:
    void showEvent(QShowEvent* event) override;

private:
    QSpinBox* m_spin;
};
