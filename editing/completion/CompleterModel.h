#pragma once

#include "editing/completion/CompleterInfo.h"

#include <QAbstractTableModel>

// The editor's table of stored lists: column "Feld" and the check box column "Aktiv".
class CompleterModel : public QAbstractTableModel
{
    Q_OBJECT
public:
    enum Columns
    {
        FieldColumn = 0,
        ActiveColumn = 1
    };

    explicit CompleterModel(QObject* parent);

    void setInfos(const QList<CompleterInfo>& infos);
    QList<CompleterInfo> infos() const { return m_infos; }
    CompleterInfo info(int row) const { return m_infos.value(row); }
    void replaceInfo(int row, const CompleterInfo& info);
    void toggleAllCompleters(bool enabled);
    bool isModified() const;

    int rowCount(const QModelIndex& parent = QModelIndex()) const override;
    int columnCount(const QModelIndex& parent = QModelIndex()) const override;
    QVariant data(const QModelIndex& index, int role) const override;
    bool setData(const QModelIndex& index, const QVariant& value, int role) override;
    Qt::ItemFlags flags(const QModelIndex& index) const override;
    QVariant headerData(int section, Qt::Orientation orientation, int role) const override;

private:
    QList<CompleterInfo> m_infos;
};
