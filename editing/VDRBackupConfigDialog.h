#pragma once

#include <QDialog>

class QSpinBox;

// How many backup generations saving keeps.
class VDRBackupConfigDialog : public QDialog
{
    Q_OBJECT
public:
    explicit VDRBackupConfigDialog(QWidget* parent = nullptr);
    static int defaultValue() { return 4; }
    QSpinBox* spinBox() const { return m_spin; }

public slots:
    void accept() override;
    void slotDefaults();

protected:
    void showEvent(QShowEvent* event) override;

private:
    QSpinBox* m_spin;
};
