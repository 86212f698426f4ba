#pragma once

#include <QEvent>
#include <QVariant>

// A notification of the report form's event bus; its event type is its number (1001 and up).
class VdEvent : public QEvent
{
public:
    enum Number
    {
        GotoRow = 1001,
        EntryListRowChanged = 1002,
        SelectRow = 1003,
        EnableEditors = 1006,
        SaveMetrics = 1007,
        RestoreMetrics = 1008,
    };

    explicit VdEvent(int number, const QVariant& arg1 = QVariant(), const QVariant& arg2 = QVariant(),
                     const QVariant& arg3 = QVariant(), const QVariant& arg4 = QVariant())
        : QEvent(QEvent::Type(number)), m_args{arg1, arg2, arg3, arg4}
    {
    }

    int number() const { return int(type()); }
    QVariant arg(int i) const { return i >= 0 && i < 4 ? m_args[i] : QVariant(); }

private:
    QVariant m_args[4];
};
