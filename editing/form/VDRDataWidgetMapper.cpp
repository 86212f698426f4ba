#include "editing/form/VDRDataWidgetMapper.h"

#include "document/VDRSqlTableModel.h"

#include <QEvent>
#include <QMetaProperty>
#include <QTextDocument>
#include <QVariant>

namespace {
const QByteArray kRichText = QByteArrayLiteral("richtext");
const QByteArray kHtml = QByteArrayLiteral("html");

// The formatting of a text, read the same way on both sides, so that a change of formatting alone
// (a word made bold) is written too, while merely showing a text is not a change.
QString formattingOf(const QString& html)
{
    QTextDocument first;
    first.setHtml(html);
    QTextDocument second;
    second.setHtml(first.toHtml());
    return second.toHtml();
}

QString plainTextOf(const QString& html)
{
    QTextDocument doc;
    doc.setHtml(html);
    return doc.toPlainText();
}
// A field that reads its value out of typed text (a date, a time): reading it may correct the
// text and warn, so it is read only after the user has typed into it.
bool parsesText(const QObject* t, const QByteArray& prop)
{
    const QMetaObject* meta = t->metaObject();
    const int index = meta->indexOfProperty(prop.constData());
    return meta->indexOfProperty("modified") >= 0 && index >= 0 &&
           meta->property(index).userType() != QMetaType::QString;
}

// Such a field is written back only when the user has typed into it (or picked a value): a NULL
// or unreadable stored value (a date "2026-02-30") shown as an empty field stays as stored, and
// a stored time with seconds is not cut to the minutes the field shows.
bool untouched(const QObject* t, const QByteArray& prop)
{
    return parsesText(t, prop) && !t->property("modified").toBool();
}
} // namespace

VDRDataWidgetMapper::VDRDataWidgetMapper(QObject* parent) : QObject(parent) {}

void VDRDataWidgetMapper::setModel(VDRSqlTableModel* model)
{
    if (m_model)
        disconnect(m_model, nullptr, this, nullptr);
    clearMapping();
    m_model = model;
    m_row = -1;
    if (m_model)
        connect(m_model, &QAbstractItemModel::dataChanged, this, &VDRDataWidgetMapper::slotDataChanged);
}

void VDRDataWidgetMapper::addMapping(QObject* widget, int column, const QByteArray& propertyName)
{
    if (!widget)
        return;
    m_mappings.append({widget, column, propertyName});
    widget->installEventFilter(this);
    if (QObject* t = target(m_mappings.last()); t && t != widget)
        t->installEventFilter(this);
}

void VDRDataWidgetMapper::addMapping(QObject* widget, const QString& field, const QByteArray& propertyName)
{
    if (m_model)
        addMapping(widget, m_model->fieldIndex(field), propertyName);
}

void VDRDataWidgetMapper::clearMapping()
{
    for (const Mapping& m : qAsConst(m_mappings)) {
        if (QObject* t = target(m))
            t->removeEventFilter(this);
        if (m.widget)
            m.widget->removeEventFilter(this);
    }
    m_mappings.clear();
}

QObject* VDRDataWidgetMapper::target(const Mapping& m) const
{
    if (!m.widget || m.property != kRichText)
        return m.widget;
    // The rich-text editor sits inside the mapped widget; it is the child with an "html" property.
    if (m.widget->property(kHtml.constData()).isValid())
        return m.widget;
    const QList<QObject*> children = m.widget->findChildren<QObject*>();
    for (QObject* child : children) {
        if (child->metaObject()->indexOfProperty(kHtml.constData()) >= 0)
            return child;
    }
    return nullptr;
}

QByteArray VDRDataWidgetMapper::targetProperty(const Mapping& m) const
{
    return m.property == kRichText ? kHtml : m.property;
}

void VDRDataWidgetMapper::setCurrentRow(int row)
{
    if (!m_model)
        return;
    m_model->fetch_all();
    if (row < 0 || row >= m_model->rowCount()) {
        m_row = -1;
        populateEmpty();
        emit currentRowChanged(m_row);
        return;
    }
    m_row = row;
    populate();
    emit currentRowChanged(m_row);
}

void VDRDataWidgetMapper::toFirst()
{
    setCurrentRow(0);
}

void VDRDataWidgetMapper::toLast()
{
    if (m_model) {
        m_model->fetch_all();
        setCurrentRow(m_model->rowCount() - 1);
    }
}

void VDRDataWidgetMapper::toNext()
{
    if (m_model && m_row + 1 < m_model->rowCount())
        setCurrentRow(m_row + 1);
}

void VDRDataWidgetMapper::toPrevious()
{
    if (m_row > 0)
        setCurrentRow(m_row - 1);
}

void VDRDataWidgetMapper::populate(const Mapping& m)
{
    QObject* t = target(m);
    if (!t || !m_model || m_row < 0)
        return;
    const QVariant value = m_model->data(m_model->index(m_row, m.column), Qt::EditRole);
    const QByteArray prop = targetProperty(m);
    if (!parsesText(t, prop) && t->property(prop.constData()) == value)
        return;
    // A NULL (or a text a number field cannot take) must not leave the previous row's value behind.
    if (!t->setProperty(prop.constData(), value))
        t->setProperty(prop.constData(), QVariant(t->property(prop.constData()).userType(), nullptr));
}

void VDRDataWidgetMapper::populate()
{
    for (const Mapping& m : qAsConst(m_mappings))
        populate(m);
}

void VDRDataWidgetMapper::populateEmpty()
{
    for (const Mapping& m : qAsConst(m_mappings)) {
        QObject* t = target(m);
        if (!t)
            continue;
        const QByteArray prop = targetProperty(m);
        // The type comes from the declaration: reading a date field would correct its text and warn.
        const int index = t->metaObject()->indexOfProperty(prop.constData());
        const int type = index >= 0 ? t->metaObject()->property(index).userType()
                                    : t->property(prop.constData()).userType();
        t->setProperty(prop.constData(), QVariant(type, nullptr));
    }
}

bool VDRDataWidgetMapper::commit(int column)
{
    if (!m_model || m_row < 0)
        return false;
    bool ok = true;
    for (const Mapping& m : qAsConst(m_mappings)) {
        if (m.column != column)
            continue;
        QObject* t = target(m);
        if (!t)
            continue;
        const QModelIndex idx = m_model->index(m_row, m.column);
        const QVariant modelValue = m_model->data(idx, Qt::EditRole);
        if (m.property != kRichText && untouched(t, targetProperty(m)))
            continue;
        const QVariant widgetValue = t->property(targetProperty(m).constData());
        bool differs;
        if (m.property == kRichText)
            differs = plainTextOf(widgetValue.toString()) != plainTextOf(modelValue.toString()) ||
                      formattingOf(widgetValue.toString()) != formattingOf(modelValue.toString());
        else if (modelValue.isNull())
            // An untouched field showing the empty value of its type leaves a NULL alone.
            differs = widgetValue != QVariant(widgetValue.userType(), nullptr);
        else
            differs = widgetValue != modelValue;
        if (!differs)
            continue;
        // Writing back fires dataChanged, which would repopulate the editor and lose its cursor.
        QSignalBlocker blocker(this);
        disconnect(m_model, &QAbstractItemModel::dataChanged, this, &VDRDataWidgetMapper::slotDataChanged);
        ok &= m_model->setData(idx, widgetValue, Qt::EditRole);
        connect(m_model, &QAbstractItemModel::dataChanged, this, &VDRDataWidgetMapper::slotDataChanged);
    }
    return ok;
}

bool VDRDataWidgetMapper::submit()
{
    bool ok = true;
    for (const Mapping& m : qAsConst(m_mappings))
        ok &= commit(m.column);
    return ok;
}

void VDRDataWidgetMapper::revert()
{
    populate();
}

bool VDRDataWidgetMapper::eventFilter(QObject* watched, QEvent* event)
{
    if (event->type() == QEvent::FocusOut && m_policy == AutoSubmit) {
        for (const Mapping& m : qAsConst(m_mappings)) {
            if (m.widget == watched || target(m) == watched)
                commit(m.column);
        }
    }
    return QObject::eventFilter(watched, event);
}

void VDRDataWidgetMapper::slotDataChanged(const QModelIndex& topLeft, const QModelIndex& bottomRight)
{
    if (m_row < topLeft.row() || m_row > bottomRight.row())
        return;
    for (const Mapping& m : qAsConst(m_mappings)) {
        if (m.column >= topLeft.column() && m.column <= bottomRight.column())
            populate(m);
    }
}
