#include "editing/form/VDRRichTextEditDialog.h"

#include "document/VDRSqlTableModel.h"
#include "editing/form/VDRRichTextEdit.h"

#include <QDialogButtonBox>
#include <QVBoxLayout>

VDRRichTextEditDialog::VDRRichTextEditDialog(VDRSqlTableModel* model, const QString& column,
                                             const QModelIndex& index, int fieldNumber, QWidget* parent)
    : QDialog(parent), m_edit(new VDRRichTextEdit(this))
{
    setObjectName(QStringLiteral("VDRRichTextEditDialog"));
    setWindowTitle(titleFor(fieldNumber));
    m_edit->setCell(model, index, column);
    m_edit->setFieldNumber(fieldNumber);
    auto* buttons = new QDialogButtonBox(this);
    buttons->addButton(tr("OK"), QDialogButtonBox::AcceptRole);
    buttons->addButton(tr("Abbrechen"), QDialogButtonBox::RejectRole);
    connect(buttons, &QDialogButtonBox::accepted, this, &QDialog::accept);
    connect(buttons, &QDialogButtonBox::rejected, this, &QDialog::reject);
    auto* layout = new QVBoxLayout(this);
    layout->addWidget(m_edit);
    layout->addWidget(buttons);
    resize(900, 650);
}

QString VDRRichTextEditDialog::titleFor(int fieldNumber)
{
    switch (fieldNumber) {
    case 0:
        return tr("Leistungsstand");
    case 1:
        return tr("Besondere Vorkommnisse");
    case 2:
        return tr("Eingriffe in Tragwerke");
    case 3:
        return tr("Prüfungen / Messungen");
    case 4:
        return tr("Sonstige Notizen");
    default:
        return QString();
    }
}

QString VDRRichTextEditDialog::enlarged(QString html)
{
    return html.replace(QLatin1String("font-size:13pt;"), QLatin1String("font-size:16pt;"));
}

QString VDRRichTextEditDialog::normal(QString html)
{
    return html.replace(QLatin1String("font-size:16pt;"), QLatin1String("font-size:13pt;"));
}

void VDRRichTextEditDialog::setText(const QString& html)
{
    m_edit->setHtml(enlarged(html));
}

QString VDRRichTextEditDialog::text() const
{
    return normal(m_edit->html());
}
