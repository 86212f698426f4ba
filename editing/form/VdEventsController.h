#pragma once

#include <QHash>
#include <QList>
#include <QObject>
#include <QPointer>
#include <QVariant>

// The in-process event bus of the report form: receivers register for event numbers, and every
// event sent is posted (queued) to each receiver of its number as a VdEvent.
class VdEventsController : public QObject
{
    Q_OBJECT
public:
    static VdEventsController* instance();

    void registerEvent(QObject* receiver, int number);
    void unregisterEvent(QObject* receiver, int number);
    void unregisterReceiver(QObject* receiver);
    void send_event(int number, const QVariant& arg1 = QVariant(), const QVariant& arg2 = QVariant(),
                    const QVariant& arg3 = QVariant(), const QVariant& arg4 = QVariant());
    int receiverCount(int number) const;

private:
    VdEventsController() = default;
    QHash<int, QList<QPointer<QObject>>> m_receivers;
};
