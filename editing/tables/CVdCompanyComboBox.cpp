#include "editing/tables/CVdCompanyComboBox.h"

#include "document/CVdShared.h"
#include "document/VDRDocument.h"
#include "document/VDRSqlTableModel.h"
#include "editing/masterdata/VDRCompanyDialog.h"

#include <QLineEdit>

CVdCompanyComboBox::CVdCompanyComboBox(QWidget* parent) : QComboBox(parent)
{
    setEditable(true);
    setInsertPolicy(QComboBox::NoInsert);
    setMaxVisibleItems(20);
    connect(this, QOverload<int>::of(&QComboBox::activated), this, &CVdCompanyComboBox::slotActivated);
}

void CVdCompanyComboBox::set_company_data(VDRDocument* document, int editorNumber)
{
    m_document = document;
    m_editorNumber = editorNumber;
    clear();
    addItem(tr("Neu..."), -1);
    if (!document)
        return;
    switch (editorNumber) {
    case 1:
        addRows(document->modelCompany1(), PersonFormat);
        break;
    case 3:
        addRows(document->modelCompany2(), PersonFormat);
        break;
    case 17:
        addRows(document->modelCompany1(), PersonFormat);
        addRows(document->modelCompany2(), PersonFormat);
        break;
    default:
        addRows(document->modelCompany2(), CompanyFormat);
        break;
    }
}

void CVdCompanyComboBox::addRows(VDRSqlTableModel* model, Format format)
{
    if (!model)
        return;
    model->fetch_all();
    // In list order; frozen copies of locked reports are never offered.
    QVector<QPair<int, int>> rows; // pos, row
    for (int row = 0; row < model->rowCount(); ++row) {
        if (model->data(row, QStringLiteral("category"), Qt::EditRole).toInt() < 0)
            continue;
        rows.append({model->data(row, QStringLiteral("pos"), Qt::EditRole).toInt(), row});
    }
    std::stable_sort(rows.begin(), rows.end(),
                     [](const QPair<int, int>& a, const QPair<int, int>& b) { return a.first < b.first; });
    for (const auto& entry : qAsConst(rows)) {
        const QString text = formatCompany(model, entry.second, format);
        if (!text.isEmpty())
            addItem(text, model->data(entry.second, QStringLiteral("id"), Qt::EditRole).toInt());
    }
}

// One line of text for a company row in the output format the list uses.
QString CVdCompanyComboBox::formatCompany(VDRSqlTableModel* model, int row, Format format)
{
    const QString separator = QStringLiteral(" ");
    return format == CompanyFormat ? CVdShared::getCompanyFormat1(model, row, separator)
                                   : CVdShared::getCompanyFormat2(model, row, separator);
}

QString CVdCompanyComboBox::companyText(VDRDocument* document, int companyId, int editorNumber)
{
    if (!document || companyId <= 0)
        return QString();
    for (VDRSqlTableModel* model : {document->modelCompany1(), document->modelCompany2()}) {
        if (!model)
            continue;
        const int row = model->rowById(companyId);
        if (row < 0)
            continue;
        const bool companyFormat =
            model == document->modelCompany2() && editorNumber != 3 && editorNumber != 17;
        return formatCompany(model, row, companyFormat ? CompanyFormat : PersonFormat);
    }
    return QString();
}

int CVdCompanyComboBox::currentCompanyId() const
{
    const QString text = currentText().trimmed();
    if (text.isEmpty())
        return 0;
    const int index = findText(text, Qt::MatchFixedString);
    return index > 0 ? itemData(index).toInt() : -1;
}

void CVdCompanyComboBox::setCurrentCompanyId(int id)
{
    const int index = id > 0 ? findData(id) : -1;
    if (index > 0) {
        setCurrentIndex(index);
    } else {
        setCurrentIndex(-1);
        setEditText(QString());
    }
}

void CVdCompanyComboBox::slotActivated(int index)
{
    if (index == 0) {
        newCompany();
        return;
    }
    if (m_editorNumber == 1)
        slot_selectedPersonChanged(index);
    else if (m_editorNumber == 17)
        slot_selectedEntryChanged(index);
    else
        slot_selectedCompanyChanged(index);
}

void CVdCompanyComboBox::slot_selectedCompanyChanged(int index)
{
    emit companyChosen(itemData(index).toInt());
}

void CVdCompanyComboBox::slot_selectedPersonChanged(int index)
{
    emit companyChosen(itemData(index).toInt());
}

void CVdCompanyComboBox::slot_selectedEntryChanged(int index)
{
    emit companyChosen(itemData(index).toInt());
}

// The company dialog decides whether a person or a company is created when it offers both.
bool CVdCompanyComboBox::askNewCompany(int mode, QString* company, QString* name, QString* type,
                                       int* chosenMode)
{
    VDRCompanyDialog dialog(mode, this);
    if (dialog.exec() != QDialog::Accepted)
        return false;
    *company = dialog.company();
    *name = dialog.name();
    *type = dialog.type();
    *chosenMode = dialog.mode();
    return true;
}

void CVdCompanyComboBox::newCompany()
{
    const int mode = m_editorNumber == 1 ? 2 : m_editorNumber == 17 ? 3 : 1;
    QString company;
    QString name;
    QString type;
    int chosenMode = mode;
    if (!m_document || !askNewCompany(mode, &company, &name, &type, &chosenMode)) {
        setCurrentIndex(-1);
        setEditText(QString());
        return;
    }
    // A person goes to the persons list, so that the persons' choosers offer it too.
    const bool person = chosenMode == 2;
    VDRSqlTableModel* model = person ? m_document->modelCompany1() : m_document->modelCompany2();
    if (!model || !(person ? m_document->appendCompany1(type) : m_document->appendCompany2())) {
        setEditText(QString());
        return;
    }
    const int row = model->rowCount() - 1;
    model->setData(row, QStringLiteral("company"), company);
    model->setData(row, QStringLiteral("lastname"), name);
    model->setData(row, QStringLiteral("type"), type);
    const int id = model->data(row, QStringLiteral("id"), Qt::EditRole).toInt();
    if (!model->submitAll()) {
        setEditText(QString());
        return;
    }
    const QString text = formatCompany(model, model->rowById(id), person ? PersonFormat : CompanyFormat);
    addItem(text.isEmpty() ? name : text, id);
    setCurrentIndex(count() - 1);
    emit companyChosen(id);
}
