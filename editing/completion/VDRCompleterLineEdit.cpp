#include "editing/completion/VDRCompleterLineEdit.h"

#include "editing/completion/VDRCompleter.h"

#include <QAbstractItemView>
#include <QKeyEvent>
#include <QToolButton>

VDRCompleterLineEdit::VDRCompleterLineEdit(QWidget* parent)
    : QLineEdit(parent), m_button(new QToolButton(this))
{
    m_button->setObjectName(QStringLiteral("completerButton"));
    m_button->setArrowType(Qt::DownArrow);
    m_button->setToolTip(tr("Autotexte"));
    m_button->setCursor(Qt::ArrowCursor);
    m_button->setFocusPolicy(Qt::NoFocus);
    connect(m_button, &QToolButton::clicked, this, &VDRCompleterLineEdit::slotListButton);
    connect(this, &QLineEdit::editingFinished, this, &VDRCompleterLineEdit::slotLearn);
    updateButton();
}

void VDRCompleterLineEdit::setCompleterData(int regIdx, const QString& title, int tableID,
                                            const QString& column, int columnID)
{
    m_regIdx = regIdx;
    m_title = title;
    m_tableID = tableID;
    m_column = column;
    m_columnID = columnID;
}

void VDRCompleterLineEdit::createCompleter()
{
    setOwnCompleter(new VDRCompleter(m_regIdx, m_title, m_tableID, m_column, m_columnID, this));
}

void VDRCompleterLineEdit::setOwnCompleter(VDRCompleter* completer)
{
    if (m_completer == completer)
        return;
    if (m_completer && m_completer->parent() == this)
        delete m_completer;
    m_completer = completer;
    if (m_completer) {
        m_completer->setParent(this);
        m_completer->setWidget(this);
        connect(m_completer, QOverload<const QString&>::of(&QCompleter::activated), this,
                &VDRCompleterLineEdit::slotChosen);
    }
    updateButton();
}

void VDRCompleterLineEdit::enableCompleter(bool enable)
{
    m_enabled = enable;
    if (!enable && m_completer)
        m_completer->popup()->hide();
    updateButton();
}

void VDRCompleterLineEdit::keyPressEvent(QKeyEvent* event)
{
    if (!m_completer || !m_enabled) {
        QLineEdit::keyPressEvent(event);
        return;
    }
    if (m_completer->popupTakesKey(event)) {
        event->ignore();
        return;
    }
    const bool ctrlE = event->key() == Qt::Key_E && (event->modifiers() & Qt::ControlModifier);
    if (!ctrlE)
        QLineEdit::keyPressEvent(event);
    m_completer->offer(event, text().trimmed(), rect());
}

void VDRCompleterLineEdit::resizeEvent(QResizeEvent* event)
{
    QLineEdit::resizeEvent(event);
    updateButton();
}

void VDRCompleterLineEdit::slotChosen(const QString& display)
{
    setText(m_completer->getMultiLineEntry(display));
}

void VDRCompleterLineEdit::slotLearn()
{
    if (m_completer && m_enabled)
        m_completer->updateFromWidget();
}

void VDRCompleterLineEdit::slotListButton()
{
    if (!m_completer)
        return;
    setFocus();
    m_completer->showAll(rect());
}

void VDRCompleterLineEdit::updateButton()
{
    const bool shown = m_completer && m_enabled;
    m_button->setVisible(shown);
    const int side = qMax(height() - 4, 12);
    m_button->setGeometry(width() - side - 2, (height() - side) / 2, side, side);
    setTextMargins(0, 0, shown ? side + 2 : 0, 0);
}
