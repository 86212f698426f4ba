#pragma once

#include <QStringListModel>

// The entries of the list selected in the editor; remembers whether the user changed them.
class CompleterStringListModel : public QStringListModel
{
    Q_OBJECT
public:
    explicit CompleterStringListModel(QObject* parent);

    // Shows a list and forgets earlier changes.
    void load(const QStringList& entries);
    bool isModified() const { return m_modified; }

    bool setData(const QModelIndex& index, const QVariant& value, int role = Qt::EditRole) override;
    bool insertRows(int row, int count, const QModelIndex& parent = QModelIndex()) override;
    bool removeRows(int row, int count, const QModelIndex& parent = QModelIndex()) override;

private:
    bool m_modified = false;
};
