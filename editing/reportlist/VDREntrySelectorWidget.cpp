#include "editing/reportlist/VDREntrySelectorWidget.h"

#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "document/VDREntryNumber.h"
#include "document/VDRPrompt.h"

#include <QButtonGroup>
#include <QGridLayout>
#include <QHBoxLayout>
#include <QLabel>
#include <QLineEdit>
#include <QPushButton>
#include <QRadioButton>
#include <QRegularExpression>
#include <QRegularExpressionValidator>
#include <QVBoxLayout>

namespace {
// The leading digits of a number field; 'fallback' when there are none.
int fieldNumber(const QString& text, int fallback)
{
    const VDREntryNumber number(text);
    return number.digits() > 0 ? number.number() : fallback;
}
} // namespace

VDREntrySelectorWidget::VDREntrySelectorWidget(int mode, QWidget* parent)
    : QDialog(parent), m_modes(new QButtonGroup(this)),
      m_label(new QLabel(tr("Bitte wählen Sie hier die Bautagesberichte aus:"), this)),
      m_from(new QLineEdit(this)), m_to(new QLineEdit(this))
{
    setWindowTitle(tr("Bautagesberichte auswählen"));
    setModal(true);
    auto* layout = new QVBoxLayout(this);
    m_label->setObjectName(QStringLiteral("labelText"));
    m_label->setWordWrap(true);
    layout->addWidget(m_label);
    const QString texts[] = {tr("Alle Bautagesberichte"), tr("Alle abgeschlossenen Bautagesberichte"),
                             tr("Alle Entwürfe"), tr("Aktuellen Bautagesbericht"),
                             tr("Bestimmte Bautagesberichte (Bautagesbericht-Nr.):")};
    for (int m = AllEntries; m <= NumberRange; ++m) {
        auto* radio = new QRadioButton(texts[m - 1], this);
        radio->setObjectName(QStringLiteral("radioButtonEntry%1").arg(m));
        m_modes->addButton(radio, m);
        layout->addWidget(radio);
    }
    // Numbers of up to five digits and a letter; anything else could not match a report.
    auto* validator =
        new QRegularExpressionValidator(QRegularExpression(QStringLiteral("[0-9]{0,5}[a-zA-Z]?")), this);
    auto* range = new QGridLayout;
    const struct
    {
        QLineEdit* edit;
        const char* name;
        QString label;
        QString start;
    } fields[] = {{m_from, "lineEditEntry5From", tr("Von:"), QStringLiteral("00000")},
                  {m_to, "lineEditEntry5To", tr("Bis:"), QStringLiteral("99999")}};
    int column = 0;
    for (const auto& field : fields) {
        field.edit->setObjectName(QLatin1String(field.name));
        field.edit->setValidator(validator);
        field.edit->setText(field.start);
        range->addWidget(new QLabel(field.label, this), 0, column++);
        range->addWidget(field.edit, 0, column++);
        connect(field.edit, &QLineEdit::textEdited, this, [this] { setSelectedMode(NumberRange); });
    }
    layout->addLayout(range);

    auto* buttons = new QHBoxLayout;
    const struct
    {
        const char* name;
        QString text;
        int result;
    } buttonDefs[] = {{"pushButtonPdf", tr("PDF speichern"), Pdf},
                      {"pushButtonPrint", tr("Drucken"), Print},
                      {"pushButtonOk", tr("OK"), Ok},
                      {"pushButtonCancel", tr("Abbrechen"), Cancelled}};
    buttons->addStretch();
    for (const auto& def : buttonDefs) {
        auto* button = new QPushButton(def.text, this);
        button->setObjectName(QLatin1String(def.name));
        button->setDefault(def.result == Ok);
        const int result = def.result;
        connect(button, &QPushButton::clicked, this, [this, result] { finish(result); });
        buttons->addWidget(button);
    }
    layout->addLayout(buttons);
    setSelectedMode(mode);
}

int VDREntrySelectorWidget::getSelectedMode() const
{
    const int id = m_modes->checkedId();
    return id < 0 ? NoMode : id;
}

void VDREntrySelectorWidget::setSelectedMode(int mode)
{
    if (QAbstractButton* button = m_modes->button(mode)) {
        button->setChecked(true);
    } else if (QAbstractButton* checked = m_modes->checkedButton()) {
        m_modes->setExclusive(false);
        checked->setChecked(false);
        m_modes->setExclusive(true);
    }
}

QString VDREntrySelectorWidget::getSelectionMode5From() const
{
    return m_from->text();
}

QString VDREntrySelectorWidget::getSelectionMode5To() const
{
    return m_to->text();
}

void VDREntrySelectorWidget::setSelectionMode5From(const QString& number)
{
    m_from->setText(number);
}

void VDREntrySelectorWidget::setSelectionMode5To(const QString& number)
{
    m_to->setText(number);
}

void VDREntrySelectorWidget::setLabelText(const QString& text)
{
    m_label->setText(text);
}

void VDREntrySelectorWidget::setDocument(VDRDocument* document, int currentRow)
{
    m_document = document;
    m_currentRow = currentRow;
}

void VDREntrySelectorWidget::finish(int result)
{
    if (result == Cancelled) {
        done(Cancelled);
        return;
    }
    if (m_document &&
        entryIds(m_document, getSelectedMode(), m_currentRow, m_from->text(), m_to->text()).isEmpty()) {
        VDRPrompt::information(windowTitle(), tr("Die Auswahl enthält keinen Bautagesbericht."));
        return;
    }
    done(result);
}

QList<int> VDREntrySelectorWidget::entryIds(VDRDocument* document, int mode, int currentRow,
                                            const QString& from, const QString& to)
{
    QList<int> ids;
    VDRAllEntryTableModel* model = document ? document->modelEntryAll() : nullptr;
    if (!model || mode < AllEntries || mode > NumberRange)
        return ids;
    model->fetch_all();
    const int rows = model->rowCount();
    if (mode == CurrentEntry) {
        if (currentRow >= 0 && currentRow < rows)
            ids << model->data(currentRow, QStringLiteral("id"), Qt::EditRole).toInt();
        return ids;
    }
    int low = fieldNumber(from, 0);
    int high = fieldNumber(to, 99999);
    if (low > high)
        std::swap(low, high);
    for (int row = 0; row < rows; ++row) {
        const bool locked = model->data(row, QStringLiteral("locked"), Qt::EditRole).toInt() != 0;
        bool take =
            mode == AllEntries || (mode == LockedEntries && locked) || (mode == DraftEntries && !locked);
        if (mode == NumberRange) {
            const int number = document->entryNumberInt(row);
            take = number >= low && number <= high;
        }
        if (take)
            ids << model->data(row, QStringLiteral("id"), Qt::EditRole).toInt();
    }
    return ids;
}

QString VDREntrySelectorWidget::pdfFileName(VDRDocument* document, int mode, const QList<int>& ids)
{
    if (!document || !document->modelEntryAll() || ids.isEmpty())
        return QString();
    VDRAllEntryTableModel* model = document->modelEntryAll();
    // The project's name may hold characters that no file name can.
    QString project = document->projectName();
    project.replace(QRegularExpression(QStringLiteral("[/\\\\:*?\"<>|\\x00-\\x1f]")), QStringLiteral("_"));
    const QString first = document->entryNumberString(model->rowById(ids.first()));
    const QString last = document->entryNumberString(model->rowById(ids.last()));
    switch (mode) {
    case LockedEntries:
        return tr("%1 - geschlossene Berichte.pdf").arg(project);
    case DraftEntries:
        return tr("%1 - Entwürfe.pdf").arg(project);
    case CurrentEntry:
        return tr("%1 - Bericht %2.pdf").arg(project, first);
    default:
        return tr("%1 - Berichte %2-%3.pdf").arg(project, first, last);
    }
}
