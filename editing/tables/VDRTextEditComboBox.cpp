#include "editing/tables/VDRTextEditComboBox.h"

#include "editing/tables/VDRIntModel.h"
#include "editing/tables/VDRTextEditComboBoxListView.h"
#include "editing/tables/VDRTextEditComboBoxTextEdit.h"

#include <QHBoxLayout>
#include <QKeyEvent>
#include <QToolButton>

VDRTextEditComboBoxTextEdit::VDRTextEditComboBoxTextEdit(QWidget* parent) : QTextEdit(parent)
{
    setAcceptRichText(false);
    setTabChangesFocus(true);
}

void VDRTextEditComboBoxTextEdit::keyPressEvent(QKeyEvent* event)
{
    if (event->key() == Qt::Key_Down && (event->modifiers() & Qt::AltModifier)) {
        emit listRequested();
        return;
    }
    QTextEdit::keyPressEvent(event);
}

VDRTextEditComboBoxListView::VDRTextEditComboBoxListView(QWidget* parent) : QListView(parent)
{
    setEditTriggers(QAbstractItemView::NoEditTriggers);
    connect(this, &QListView::clicked, this, [this](const QModelIndex& index) { emit picked(index.row()); });
}

void VDRTextEditComboBoxListView::keyPressEvent(QKeyEvent* event)
{
    if ((event->key() == Qt::Key_Return || event->key() == Qt::Key_Enter) && currentIndex().isValid()) {
        emit picked(currentIndex().row());
        return;
    }
    if (event->key() == Qt::Key_Escape) {
        hide();
        return;
    }
    QListView::keyPressEvent(event);
}

VDRTextEditComboBox::VDRTextEditComboBox(VDRTableView* view, QWidget* parent, bool frame)
    : QWidget(parent), m_view(view), m_model(new VDRIntModel(this)),
      m_edit(new VDRTextEditComboBoxTextEdit(this)), m_list(new VDRTextEditComboBoxListView(this)),
      m_button(new QToolButton(this))
{
    auto* layout = new QHBoxLayout(this);
    layout->setContentsMargins(0, 0, 0, 0);
    layout->setSpacing(0);
    layout->addWidget(m_edit);
    layout->addWidget(m_button);
    if (!frame)
        m_edit->setFrameShape(QFrame::NoFrame);
    m_button->setArrowType(Qt::DownArrow);
    m_button->setFocusPolicy(Qt::NoFocus);
    m_list->setModel(m_model);
    m_list->setWindowFlags(Qt::Popup);
    m_list->hide();
    setFocusProxy(m_edit);
    connect(m_button, &QToolButton::clicked, this, &VDRTextEditComboBox::showList);
    connect(m_edit, &VDRTextEditComboBoxTextEdit::listRequested, this, &VDRTextEditComboBox::showList);
    connect(m_edit, &QTextEdit::textChanged, this, &VDRTextEditComboBox::slotTextChanged);
    connect(m_list, &VDRTextEditComboBoxListView::picked, this, &VDRTextEditComboBox::slotPicked);
}

void VDRTextEditComboBox::addItem(const QString& text, int id)
{
    m_model->addItem(text, id);
}

void VDRTextEditComboBox::setText(const QString& text)
{
    m_settingText = true;
    m_edit->setPlainText(text);
    m_settingText = false;
    slotTextChanged();
}

void VDRTextEditComboBox::setCurrentId(int id)
{
    const int row = m_model->indexById(id);
    m_settingText = true;
    m_edit->setPlainText(row >= 0 ? m_model->getStringList().at(row) : QString());
    m_settingText = false;
    m_currentId = row >= 0 ? id : -1;
}

void VDRTextEditComboBox::setCurrentId(const QString& text)
{
    setCurrentId(m_model->idByText(text));
}

QString VDRTextEditComboBox::currentText() const
{
    return m_edit->toPlainText();
}

void VDRTextEditComboBox::showList()
{
    const int row = m_model->indexById(m_currentId);
    if (row >= 0)
        m_list->setCurrentIndex(m_model->index(row));
    m_list->move(mapToGlobal(QPoint(0, height())));
    m_list->resize(std::max(width(), 200), 160);
    m_list->show();
    m_list->setFocus();
}

void VDRTextEditComboBox::slotTextChanged()
{
    if (m_settingText)
        return;
    const int id = m_model->idByText(currentText());
    if (id != m_currentId) {
        m_currentId = id;
        emit currentIdChanged(id);
    }
}

void VDRTextEditComboBox::slotPicked(int row)
{
    m_list->hide();
    setCurrentId(m_model->idAt(row));
    m_edit->setFocus();
    emit currentIdChanged(m_currentId);
    emit picked(m_currentId);
}
