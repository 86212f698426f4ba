#pragma once

#include <QStyledItemDelegate>

// Shows an entry on one line (" | " between its lines) and edits it whole, line breaks included.
class CompleterDelegate : public QStyledItemDelegate
{
    Q_OBJECT
public:
    explicit CompleterDelegate(QObject* parent);

    QString displayText(const QVariant& value, const QLocale& locale) const override;
    QWidget* createEditor(QWidget* parent, const QStyleOptionViewItem& option,
                          const QModelIndex& index) const override;
    void setEditorData(QWidget* editor, const QModelIndex& index) const override;
    void setModelData(QWidget* editor, QAbstractItemModel* model, const QModelIndex& index) const override;
    void updateEditorGeometry(QWidget* editor, const QStyleOptionViewItem& option,
                              const QModelIndex& index) const override;
};
