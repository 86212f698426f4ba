#include "editing/reportlist/VDREntryNumberDialog.h"

#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "document/VDREntryNumber.h"
#include "editing/reportlist/QSpinBoxLetter.h"

#include <QFormLayout>
#include <QHBoxLayout>
#include <QLabel>
#include <QPushButton>
#include <QSpinBox>
#include <QVBoxLayout>

namespace {
int diaryDigits(VDRDocument* document)
{
    if (!document || !document->isStateValid() || !document->modelEntryAll() ||
        document->modelEntryAll()->rowCount() == 0)
        return 3;
    return qMax(3, document->entryNumberDigits(0));
}
} // namespace

VDREntryNumberDialog::VDREntryNumberDialog(VDRDocument* document, QWidget* parent)
    : VDREntryNumberDialog(document, tr("Vergeben Sie hier eine neue Bauberichtsnummer, sofern gewünscht."),
                           parent)
{
}

VDREntryNumberDialog::VDREntryNumberDialog(QWidget* parent)
    : VDREntryNumberDialog(documentAround(parent), parent)
{
}

VDRDocument* VDREntryNumberDialog::documentAround(QWidget* widget)
{
    // The window that holds the report form also owns the open diary.
    for (QObject* o = widget; o; o = o->parent())
        if (auto* document = o->findChild<VDRDocument*>(QString(), Qt::FindDirectChildrenOnly))
            return document;
    return nullptr;
}

VDREntryNumberDialog::VDREntryNumberDialog(VDRDocument* document, const QString& text, QWidget* parent)
    : QDialog(parent), m_digits(diaryDigits(document)), m_number(new QSpinBox(this)),
      m_letter(new QSpinBoxLetter(this))
{
    setWindowTitle(tr("Nummer vergeben"));
    auto* layout = new QVBoxLayout(this);
    auto* label = new QLabel(text, this);
    label->setObjectName(QStringLiteral("labelText"));
    label->setWordWrap(true);
    layout->addWidget(label);

    m_number->setObjectName(QStringLiteral("spinBoxNumber"));
    m_number->setRange(1, m_digits < 4 ? 999 : m_digits == 4 ? 9999 : 99999);
    m_letter->setObjectName(QStringLiteral("spinBoxLetter"));
    auto* form = new QFormLayout;
    form->addRow(tr("Nummer:"), m_number);
    form->addRow(tr("Index (optional):"), m_letter);
    layout->addLayout(form);

    auto* buttons = new QHBoxLayout;
    auto* ok = new QPushButton(tr("OK"), this);
    ok->setObjectName(QStringLiteral("pushButtonOk"));
    ok->setDefault(true);
    auto* cancel = new QPushButton(tr("Abbrechen"), this);
    cancel->setObjectName(QStringLiteral("pushButtonCancel"));
    buttons->addStretch();
    buttons->addWidget(ok);
    buttons->addWidget(cancel);
    layout->addLayout(buttons);
    connect(ok, &QPushButton::clicked, this, &QDialog::accept);
    connect(cancel, &QPushButton::clicked, this, &QDialog::reject);
}

QString VDREntryNumberDialog::getEntryNumber() const
{
    return VDREntryNumber::padded(m_number->value(), m_digits);
}

char VDREntryNumberDialog::getEntryLetter() const
{
    const int v = m_letter->value();
    return v >= 1 && v <= 26 ? char(v + 96) : 0;
}

void VDREntryNumberDialog::setEntryNumber(const QString& number)
{
    // The spin box bounds what is too large.
    const VDREntryNumber parsed(number);
    if (parsed.digits() > 0)
        m_number->setValue(parsed.number());
}

void VDREntryNumberDialog::setEntry(const VDREntryNumber& number)
{
    setEntryNumber(number.text());
    m_letter->setValue(number.letterIndex());
}

void VDREntryNumberDialog::setEntryLetter(char letter)
{
    const int v = QChar::fromLatin1(letter).toLower().unicode() - 96;
    m_letter->setValue(v >= 1 && v <= 26 ? v : 0);
}
