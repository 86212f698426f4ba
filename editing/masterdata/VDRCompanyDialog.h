#pragma once

#include <QDialog>

class QComboBox;
class QLabel;
class QLineEdit;
class QRadioButton;

// Creates a person or a company on the fly from a company combo box. Mode 1 creates a company,
// mode 2 a person, mode 3 lets the user choose. The caller stores the values in a new row.
class VDRCompanyDialog : public QDialog
{
    Q_OBJECT
public:
    enum Mode
    {
        ModeCompany = 1,
        ModePerson = 2,
        ModeBoth = 3
    };

    VDRCompanyDialog(int mode, QWidget* parent = nullptr);

    static QString dontShowDataProtectionMsgSettingsKey()
    {
        return QStringLiteral("Messages/dontShowDataProtectionMsg");
    }
    // The page with a sample declaration of consent that the notice links to.
    static QString consentFormUrl() { return QStringLiteral("https://www.korvant-software.de/einwilligung"); }

    QString company() const;
    QString name() const;
    QString type() const;
    // What is created: ModeCompany or ModePerson (in mode 3 the user's choice).
    int mode() const;
    // Suggestions for the type field (roles of persons, trades of companies).
    void setTypes(const QStringList& types);

public slots:
    void accept() override;

private slots:
    void slotModeChanged();

private:
    // Shows the data-protection notice unless the user turned it off.
    static void showDataProtectionNotice();

    int m_mode;
    QRadioButton* m_radioPerson;
    QRadioButton* m_radioCompany;
    QLineEdit* m_company;
    QLineEdit* m_name;
    QLabel* m_typeLabel;
    QComboBox* m_type;
};
