#include "app/KeyPressEater.h"

#include "document/VDRDocument.h"

#include <QEvent>

bool KeyPressEater::eventFilter(QObject* watched, QEvent* event)
{
    if (event->type() == QEvent::KeyPress) {
        VDRDocument::setGlobalModified(true);
        return false;
    }
    return QObject::eventFilter(watched, event);
}
