#pragma once

#include <QObject>

// Any key press marks the open diary as modified, even one that changes nothing: better one save
// question too many than one too few. What cannot change the diary does not count: a modifier key
// alone (the Ctrl of Ctrl+O), the key of one of the window's commands (also while it is disabled),
// and keys in menus or in the program's message boxes and file dialogs.
class KeyPressEater : public QObject
{
    Q_OBJECT
public:
    using QObject::QObject;

protected:
    bool eventFilter(QObject* watched, QEvent* event) override;
};
