#pragma once

#include <QDialog>

class QSpinBox;

// The page margins of all printouts.
class CVdPrintoutSettings : public QDialog
{
    Q_OBJECT
public:
    explicit CVdPrintoutSettings(QWidget* parent = nullptr);

    static constexpr int MinHMarginValue = 0;
    static constexpr int MaxHMarginValue = 70;
    static constexpr int MinVMarginValue = 0;
    static constexpr int MaxVMarginValue = 99;

public slots:
    void defaults_clicked();
    void accept() override;

private:
    QSpinBox* m_left;
    QSpinBox* m_right;
    QSpinBox* m_top;
    QSpinBox* m_bottom;
};
