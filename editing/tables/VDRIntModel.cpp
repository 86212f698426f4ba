#include "editing/tables/VDRIntModel.h"

void VDRIntModel::addItem(const QString& text, int id)
{
    beginInsertRows(QModelIndex(), m_items.size(), m_items.size());
    m_items.append(qMakePair(text, id));
    endInsertRows();
}

void VDRIntModel::clear()
{
    beginResetModel();
    m_items.clear();
    endResetModel();
}

int VDRIntModel::indexById(int id) const
{
    for (int row = 0; row < m_items.size(); ++row) {
        if (m_items.at(row).second == id)
            return row;
    }
    return -1;
}

int VDRIntModel::idByText(const QString& text) const
{
    for (const auto& item : m_items) {
        if (item.first == text)
            return item.second;
    }
    return -1;
}

QStringList VDRIntModel::getStringList() const
{
    QStringList list;
    for (const auto& item : m_items)
        list << item.first;
    return list;
}

int VDRIntModel::rowCount(const QModelIndex& parent) const
{
    return parent.isValid() ? 0 : m_items.size();
}

QVariant VDRIntModel::data(const QModelIndex& index, int role) const
{
    if (!index.isValid() || index.row() >= m_items.size())
        return QVariant();
    if (role == Qt::DisplayRole || role == Qt::EditRole)
        return m_items.at(index.row()).first;
    if (role == Qt::UserRole)
        return m_items.at(index.row()).second;
    return QVariant();
}
