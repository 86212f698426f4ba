#pragma once

#include <QAbstractListModel>
#include <QList>
#include <QPair>
#include <QStringList>

// An ordered list of (text, id) pairs for the pickers.
class VDRIntModel : public QAbstractListModel
{
    Q_OBJECT
public:
    explicit VDRIntModel(QObject* parent = nullptr) : QAbstractListModel(parent) {}

    void addItem(const QString& text, int id);
    void clear();
    // Row of the id, -1 when none.
    int indexById(int id) const;
    // Id of the first entry with this text, -1 when none.
    int idByText(const QString& text) const;
    int idAt(int row) const { return row >= 0 && row < m_items.size() ? m_items.at(row).second : -1; }
    QStringList getStringList() const;
    int rowCount(const QModelIndex& parent = QModelIndex()) const override;
    QVariant data(const QModelIndex& index, int role = Qt::DisplayRole) const override;

private:
    QList<QPair<QString, int>> m_items;
};
