#include "VDRTestCase.h"
#include "editing/masterdata/VDRCompanyDialog.h"

#include <QComboBox>
#include <QLabel>
#include <QLineEdit>
#include <QPushButton>
#include <QRadioButton>
#include <QSettings>
#include <QtTest>

class TestVDRCompanyDialog : public VDRTestCase
{
    Q_OBJECT

private slots:
    void modes_data();
    void modes();
    void okAndNotice_data();
    void okAndNotice();
};

void TestVDRCompanyDialog::modes_data()
{
    QTest::addColumn<int>("mode");
    QTest::addColumn<QString>("title");
    QTest::addColumn<bool>("radios");
    QTest::addColumn<QString>("typeLabel");
    QTest::addColumn<int>("created");
    QTest::newRow("company") << 1 << "Gewerk / Baufirma anlegen" << false << "Gewerk:" << 1;
    QTest::newRow("person") << 2 << "Am Bau beteiligte Person anlegen" << false << "Typ:" << 2;
    QTest::newRow("both") << 3 << "Am Bau beteiligte Person / Baufirma anlegen" << true << "Gewerk:" << 1;
}

void TestVDRCompanyDialog::modes()
{
    QFETCH(int, mode);
    QFETCH(QString, title);
    QFETCH(bool, radios);
    QFETCH(QString, typeLabel);
    QFETCH(int, created);
    VDRCompanyDialog dialog(mode, nullptr);
    dialog.show();
    QCOMPARE(dialog.windowTitle(), title);
    auto* person = dialog.findChild<QRadioButton*>("radioButtonPerson");
    auto* company = dialog.findChild<QRadioButton*>("radioButtonCompany");
    QCOMPARE(person->isVisible(), radios);
    QCOMPARE(company->text(), QString("Gewerk/Baufirma anlegen"));
    auto* label = dialog.findChild<QLabel*>("labelType");
    QCOMPARE(label->text(), typeLabel);
    QCOMPARE(dialog.mode(), created);
    QCOMPARE(dialog.findChild<QComboBox*>("comboBoxType")->lineEdit()->placeholderText(),
             QString("Bitte auswählen"));
    if (radios) {
        person->setChecked(true);
        QCOMPARE(dialog.mode(), 2);
        QCOMPARE(label->text(), QString("Typ:"));
    }
}

void TestVDRCompanyDialog::okAndNotice_data()
{
    QTest::addColumn<QString>("company");
    QTest::addColumn<QString>("name");
    QTest::addColumn<QString>("type");
    QTest::addColumn<bool>("dontShowBefore");
    QTest::addColumn<bool>("tick");
    QTest::addColumn<bool>("accepted");
    QTest::addColumn<bool>("notice");
    QTest::newRow("all empty cancels") << ""
                                       << ""
                                       << "" << false << false << false << false;
    QTest::newRow("blanks cancel") << "  "
                                   << " "
                                   << "   " << false << false << false << false;
    QTest::newRow("notice shown") << "Bau GmbH"
                                  << ""
                                  << "" << false << false << true << true;
    QTest::newRow("notice turned off") << ""
                                       << "Meier"
                                       << "" << false << true << true << true;
    QTest::newRow("notice stays off") << ""
                                      << ""
                                      << "Statiker" << true << false << true << false;
    QTest::newRow("long name cut") << QString(10000, QChar('x')) << QString(10000, QChar('y')) << "" << true
                                   << false << true << false;
}

void TestVDRCompanyDialog::okAndNotice()
{
    QFETCH(QString, company);
    QFETCH(QString, name);
    QFETCH(QString, type);
    QFETCH(bool, dontShowBefore);
    QFETCH(bool, tick);
    QFETCH(bool, accepted);
    QFETCH(bool, notice);
    const QString key = QStringLiteral("Messages/dontShowDataProtectionMsg");
    QSettings().setValue(key, dontShowBefore);
    if (notice) {
        const QString opening = "Wenn Sie hier personenbezogene Daten (gem. Art. 4 DSGVO) erfassen";
        if (tick)
            m_prompt.expectTicked("Erfassung personenbezogener Daten", opening, 0);
        else
            m_prompt.expect("Erfassung personenbezogener Daten", opening, 0);
    }

    VDRCompanyDialog dialog(3, nullptr);
    dialog.show();
    dialog.findChild<QLineEdit*>("lineEditCompany")->insert(company);
    dialog.findChild<QLineEdit*>("lineEditName")->insert(name);
    dialog.findChild<QComboBox*>("comboBoxType")->setEditText(type);
    dialog.findChild<QPushButton*>("pushButtonOk")->click();

    QCOMPARE(dialog.result(), accepted ? int(QDialog::Accepted) : int(QDialog::Rejected));
    VDR_VERIFY_PROMPT(m_prompt);
    QCOMPARE(QSettings().value(key).toBool(), dontShowBefore || tick);
    if (accepted) {
        QCOMPARE(dialog.company(), company.trimmed().left(128));
        QCOMPARE(dialog.name(), name.trimmed().left(64));
        QCOMPARE(dialog.type(), type);
    }
}

QTEST_MAIN(TestVDRCompanyDialog)
#include "tst_vdrcompanydialog.moc"
