#include "editing/completion/CompleterModel.h"

CompleterModel::CompleterModel(QObject* parent) : QAbstractTableModel(parent) {}

void CompleterModel::setInfos(const QList<CompleterInfo>& infos)
{
    beginResetModel();
    m_infos = infos;
    endResetModel();
}

void CompleterModel::replaceInfo(int row, const CompleterInfo& info)
{
    if (row < 0 || row >= m_infos.size())
        return;
    m_infos[row] = info;
    emit dataChanged(index(row, 0), index(row, columnCount() - 1));
}

void CompleterModel::toggleAllCompleters(bool enabled)
{
    for (CompleterInfo& info : m_infos)
        info.setEnabled(enabled);
    if (!m_infos.isEmpty())
        emit dataChanged(index(0, ActiveColumn), index(m_infos.size() - 1, ActiveColumn));
}

bool CompleterModel::isModified() const
{
    for (const CompleterInfo& info : m_infos) {
        if (info.isModified())
            return true;
    }
    return false;
}

int CompleterModel::rowCount(const QModelIndex& parent) const
{
    return parent.isValid() ? 0 : m_infos.size();
}

int CompleterModel::columnCount(const QModelIndex& parent) const
{
    return parent.isValid() ? 0 : 2;
}

QVariant CompleterModel::data(const QModelIndex& index, int role) const
{
    if (!index.isValid() || index.row() >= m_infos.size())
        return QVariant();
    const CompleterInfo& info = m_infos.at(index.row());
    if (index.column() == FieldColumn && (role == Qt::DisplayRole || role == Qt::ToolTipRole))
        return info.fieldText();
    if (index.column() == ActiveColumn && role == Qt::CheckStateRole)
        return info.isEnabled() ? Qt::Checked : Qt::Unchecked;
    return QVariant();
}

bool CompleterModel::setData(const QModelIndex& index, const QVariant& value, int role)
{
    if (!index.isValid() || index.column() != ActiveColumn || role != Qt::CheckStateRole)
        return false;
    m_infos[index.row()].setEnabled(value.toInt() == Qt::Checked);
    emit dataChanged(index, index);
    return true;
}

Qt::ItemFlags CompleterModel::flags(const QModelIndex& index) const
{
    Qt::ItemFlags f = QAbstractTableModel::flags(index);
    if (index.column() == ActiveColumn)
        f |= Qt::ItemIsUserCheckable;
    return f;
}

QVariant CompleterModel::headerData(int section, Qt::Orientation orientation, int role) const
{
    if (orientation != Qt::Horizontal || role != Qt::DisplayRole)
        return QAbstractTableModel::headerData(section, orientation, role);
    return section == FieldColumn ? tr("Feld") : tr("Aktiv");
}
