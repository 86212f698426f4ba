#include "app/KeyPressEater.h"

#include "document/VDRDocument.h"

#include <QAction>
#include <QFileDialog>
#include <QKeyEvent>
#include <QMenu>
#include <QMenuBar>
#include <QMessageBox>

namespace {
bool isModifier(int key)
{
    switch (key) {
    case Qt::Key_Shift:
    case Qt::Key_Control:
    case Qt::Key_Alt:
    case Qt::Key_AltGr:
    case Qt::Key_Meta:
    case Qt::Key_Super_L:
    case Qt::Key_Super_R:
    case Qt::Key_CapsLock:
        return true;
    default:
        return false;
    }
}

bool isCommandKey(const QKeyEvent* key, const QWidget* window)
{
    if (!(key->modifiers() & (Qt::ControlModifier | Qt::AltModifier | Qt::MetaModifier)) &&
        !(key->key() >= Qt::Key_F1 && key->key() <= Qt::Key_F35))
        return false;
    const QKeySequence pressed(int(key->modifiers() & ~Qt::KeypadModifier) | key->key());
    const auto actions = window->findChildren<QAction*>();
    for (const QAction* action : actions) {
        if (action->shortcuts().contains(pressed))
            return true;
    }
    return false;
}

bool canEditDiary(const QKeyEvent* key, const QWidget* widget)
{
    const QWidget* window = widget->window();
    if (isModifier(key->key()) || qobject_cast<const QMenuBar*>(widget) ||
        qobject_cast<const QMenu*>(window) || qobject_cast<const QMessageBox*>(window) ||
        qobject_cast<const QFileDialog*>(window))
        return false;
    return !isCommandKey(key, window);
}
} // namespace

bool KeyPressEater::eventFilter(QObject* watched, QEvent* event)
{
    if (event->type() == QEvent::KeyPress) {
        // The same press reaches the window system's window first and then the widget: judge the widget.
        const auto* widget = qobject_cast<const QWidget*>(watched);
        if (widget && canEditDiary(static_cast<const QKeyEvent*>(event), widget))
            VDRDocument::setGlobalModified(true);
        return false;
    }
    return QObject::eventFilter(watched, event);
}
