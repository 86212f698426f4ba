#include "editing/completion/CompleterDelegate.h"

#include <QPlainTextEdit>

CompleterDelegate::CompleterDelegate(QObject* parent) : QStyledItemDelegate(parent) {}

QString CompleterDelegate::displayText(const QVariant& value, const QLocale&) const
{
    QString text = value.toString();
    text.replace(QLatin1Char('\n'), QLatin1String(" | "));
    return text;
}

QWidget* CompleterDelegate::createEditor(QWidget* parent, const QStyleOptionViewItem&,
                                         const QModelIndex&) const
{
    auto* editor = new QPlainTextEdit(parent);
    editor->setObjectName(QStringLiteral("entryEditor"));
    return editor;
}

void CompleterDelegate::setEditorData(QWidget* editor, const QModelIndex& index) const
{
    static_cast<QPlainTextEdit*>(editor)->setPlainText(index.data(Qt::EditRole).toString());
}

void CompleterDelegate::setModelData(QWidget* editor, QAbstractItemModel* model,
                                     const QModelIndex& index) const
{
    model->setData(index, static_cast<QPlainTextEdit*>(editor)->toPlainText(), Qt::EditRole);
}

void CompleterDelegate::updateEditorGeometry(QWidget* editor, const QStyleOptionViewItem& option,
                                             const QModelIndex&) const
{
    // Room for a few lines below the row.
    QRect r = option.rect;
    r.setHeight(qMax(r.height() * 4, 80));
    editor->setGeometry(r);
}
