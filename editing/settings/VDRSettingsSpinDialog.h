#pragma once

#include <QDialog>

class QSpinBox;

// A small settings dialog: an explanation, one labelled spin box bound to a settings key, and the
// buttons "Standardeinstellung", "OK" (stores) and "Abbrechen". It reads the stored value when shown.
class VDRSettingsSpinDialog : public QDialog
{
    Q_OBJECT
public:
    struct Setup
    {
        QString title;
        QString explanation;
        QString label;
        QString settingsKey;
        int defaultValue;
        int minimum;
        int maximum;
        int step;
    };

    VDRSettingsSpinDialog(const Setup& setup, QWidget* parent);
    QSpinBox* spinBox() const { return m_spin; }

public slots:
    void accept() override;
    void slotDefaults();

protected:
    void showEvent(QShowEvent* event) override;

private:
    QString m_key;
    int m_default;
    QSpinBox* m_spin;
};
