#pragma once

#include <QObject>

// Any key press marks the open diary as modified, even one that changes nothing: better one save
// question too many than one too few.
class KeyPressEater : public QObject
{
    Q_OBJECT
public:
    using QObject::QObject;

protected:
    bool eventFilter(QObject* watched, QEvent* event) override;
};
