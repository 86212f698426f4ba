#include "document/AllCompanyModel.h"

#include <QSqlQuery>
#include <QSqlRecord>

namespace {
enum Column
{
    ColText = 0, // shown by the choosers
    ColId,
    ColFirstname,
    ColLastname,
    ColCompany,
    ColType
};
} // namespace

AllCompanyModel::AllCompanyModel(QObject* parent, QSqlDatabase db) : QSqlQueryModel(parent), m_db(db)
{
    refresh();
}

void AllCompanyModel::refresh()
{
    if (!m_db.isOpen()) {
        clear();
        return;
    }
    QSqlQuery query(m_db);
    query.prepare(QStringLiteral("SELECT '', id, firstname, lastname, company, type FROM company "
                                 "WHERE category > 0 ORDER BY category, pos, id"));
    query.exec();
    setQuery(query);
    while (canFetchMore())
        fetchMore();
}

int AllCompanyModel::getIdForIndex(int row) const
{
    if (row < 0 || row >= rowCount())
        return -1;
    return QSqlQueryModel::data(index(row, ColId)).toInt();
}

int AllCompanyModel::getIndexForId(int id) const
{
    for (int row = 0; row < rowCount(); ++row) {
        if (QSqlQueryModel::data(index(row, ColId)).toInt() == id)
            return row;
    }
    return -1;
}

QString AllCompanyModel::partyText(const QString& firstname, const QString& lastname, const QString& company,
                                   const QString& type)
{
    QString text = firstname.trimmed();
    if (!lastname.trimmed().isEmpty())
        text += (text.isEmpty() ? QString() : QStringLiteral(" ")) + lastname.trimmed();
    if (!company.trimmed().isEmpty())
        text += (text.isEmpty() ? QString() : QStringLiteral(", ")) + company.trimmed();
    if (!type.trimmed().isEmpty())
        text += QStringLiteral(" (%1)").arg(type.trimmed());
    return text.trimmed();
}

QVariant AllCompanyModel::data(const QModelIndex& index, int role) const
{
    if (index.column() == ColText && (role == Qt::DisplayRole || role == Qt::EditRole)) {
        auto field = [&](int column) {
            return QSqlQueryModel::data(this->index(index.row(), column)).toString();
        };
        return partyText(field(ColFirstname), field(ColLastname), field(ColCompany), field(ColType));
    }
    return QSqlQueryModel::data(index, role);
}
