#include "editing/masterdata/VDRCompanyDialog.h"

#include "document/VDRPrompt.h"

#include <QComboBox>
#include <QDialogButtonBox>
#include <QFormLayout>
#include <QLabel>
#include <QLineEdit>
#include <QPushButton>
#include <QRadioButton>
#include <QSettings>
#include <QVBoxLayout>

namespace {
// The declared sizes of the company columns: longer input is cut while typing.
constexpr int CompanyLength = 128;
constexpr int NameLength = 64;
constexpr int TypeLength = 64;
} // namespace

VDRCompanyDialog::VDRCompanyDialog(int mode, QWidget* parent)
    : QDialog(parent), m_mode(mode == ModePerson || mode == ModeBoth ? mode : ModeCompany),
      m_radioPerson(new QRadioButton(tr("Am Bau beteiligte Person anlegen"), this)),
      m_radioCompany(new QRadioButton(tr("Gewerk/Baufirma anlegen"), this)), m_company(new QLineEdit(this)),
      m_name(new QLineEdit(this)), m_typeLabel(new QLabel(this)), m_type(new QComboBox(this))
{
    switch (m_mode) {
    case ModePerson:
        setWindowTitle(tr("Am Bau beteiligte Person anlegen"));
        break;
    case ModeBoth:
        setWindowTitle(tr("Am Bau beteiligte Person / Baufirma anlegen"));
        break;
    default:
        setWindowTitle(tr("Gewerk / Baufirma anlegen"));
        break;
    }
    m_radioPerson->setObjectName(QStringLiteral("radioButtonPerson"));
    m_radioCompany->setObjectName(QStringLiteral("radioButtonCompany"));
    m_company->setObjectName(QStringLiteral("lineEditCompany"));
    m_name->setObjectName(QStringLiteral("lineEditName"));
    m_type->setObjectName(QStringLiteral("comboBoxType"));
    m_typeLabel->setObjectName(QStringLiteral("labelType"));
    m_company->setMaxLength(CompanyLength);
    m_name->setMaxLength(NameLength);
    m_type->setEditable(true);
    m_type->setInsertPolicy(QComboBox::NoInsert);
    m_type->lineEdit()->setMaxLength(TypeLength);
    m_type->lineEdit()->setPlaceholderText(tr("Bitte auswählen"));

    auto* layout = new QVBoxLayout(this);
    layout->addWidget(m_radioPerson);
    layout->addWidget(m_radioCompany);
    m_radioPerson->setVisible(m_mode == ModeBoth);
    m_radioCompany->setVisible(m_mode == ModeBoth);
    (m_mode == ModePerson ? m_radioPerson : m_radioCompany)->setChecked(true);

    auto* form = new QFormLayout;
    form->addRow(tr("Firma:"), m_company);
    form->addRow(tr("Nachname:"), m_name);
    form->addRow(m_typeLabel, m_type);
    layout->addLayout(form);

    auto* buttons = new QDialogButtonBox(this);
    buttons->addButton(tr("OK"), QDialogButtonBox::AcceptRole)->setObjectName(QStringLiteral("pushButtonOk"));
    buttons->addButton(tr("Abbrechen"), QDialogButtonBox::RejectRole)
        ->setObjectName(QStringLiteral("pushButtonCancel"));
    layout->addWidget(buttons);
    connect(buttons, &QDialogButtonBox::accepted, this, &VDRCompanyDialog::accept);
    connect(buttons, &QDialogButtonBox::rejected, this, &VDRCompanyDialog::reject);
    connect(m_radioPerson, &QRadioButton::toggled, this, &VDRCompanyDialog::slotModeChanged);
    slotModeChanged();
}

QString VDRCompanyDialog::company() const
{
    return m_company->text().trimmed();
}

QString VDRCompanyDialog::name() const
{
    return m_name->text().trimmed();
}

QString VDRCompanyDialog::type() const
{
    return m_type->currentText().trimmed();
}

int VDRCompanyDialog::mode() const
{
    return m_radioPerson->isChecked() ? ModePerson : ModeCompany;
}

void VDRCompanyDialog::setTypes(const QStringList& types)
{
    const QString text = m_type->currentText();
    m_type->clear();
    m_type->addItems(types);
    m_type->setCurrentIndex(-1);
    m_type->setEditText(text);
}

void VDRCompanyDialog::slotModeChanged()
{
    m_typeLabel->setText(mode() == ModePerson ? tr("Typ:") : tr("Gewerk:"));
}

void VDRCompanyDialog::accept()
{
    if (company().isEmpty() && name().isEmpty() && type().isEmpty()) {
        reject();
        return;
    }
    showDataProtectionNotice();
    QDialog::accept();
}

void VDRCompanyDialog::showDataProtectionNotice()
{
    QSettings settings;
    if (settings.value(dontShowDataProtectionMsgSettingsKey(), false).toBool())
        return;
    const QString text =
        tr("Wenn Sie hier personenbezogene Daten (gem. Art. 4 DSGVO) erfassen und Berichte mit diesen Daten "
           "veröffentlichen, oder per Cloud synchronisieren, müssen die betroffenen Personen sich zuvor "
           "damit "
           "einverstanden erklärt haben.<br><br>Ein Muster einer Einwilligungserklärung finden Sie "
           "<a href=\"%1\">hier</a>.")
            .arg(consentFormUrl());
    bool dontShow = false;
    VDRPrompt::instance()->choose(VDRPrompt::Information, tr("Erfassung personenbezogener Daten"), text,
                                  {tr("OK")}, 0, 0, tr("Diese Meldung nicht mehr anzeigen"), &dontShow);
    if (dontShow)
        settings.setValue(dontShowDataProtectionMsgSettingsKey(), true);
}
