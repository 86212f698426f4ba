#include "editing/completion/CompleterStringListModel.h"

CompleterStringListModel::CompleterStringListModel(QObject* parent) : QStringListModel(parent) {}

void CompleterStringListModel::load(const QStringList& entries)
{
    setStringList(entries);
    m_modified = false;
}

bool CompleterStringListModel::setData(const QModelIndex& index, const QVariant& value, int role)
{
    const bool changed = index.data(role) != value;
    const bool done = QStringListModel::setData(index, value, role);
    m_modified = m_modified || (done && changed);
    return done;
}

bool CompleterStringListModel::insertRows(int row, int count, const QModelIndex& parent)
{
    const bool done = QStringListModel::insertRows(row, count, parent);
    m_modified = m_modified || done;
    return done;
}

bool CompleterStringListModel::removeRows(int row, int count, const QModelIndex& parent)
{
    const bool done = QStringListModel::removeRows(row, count, parent);
    m_modified = m_modified || done;
    return done;
}
