#include "editing/form/VdEventsController.h"

#include "editing/form/VdEvent.h"

#include <QCoreApplication>

VdEventsController* VdEventsController::instance()
{
    static VdEventsController controller;
    return &controller;
}

void VdEventsController::registerEvent(QObject* receiver, int number)
{
    if (!receiver)
        return;
    QList<QPointer<QObject>>& list = m_receivers[number];
    if (!list.contains(receiver))
        list.append(receiver);
}

void VdEventsController::unregisterEvent(QObject* receiver, int number)
{
    auto it = m_receivers.find(number);
    if (it != m_receivers.end())
        it->removeAll(receiver);
}

void VdEventsController::unregisterReceiver(QObject* receiver)
{
    for (auto& list : m_receivers)
        list.removeAll(receiver);
}

void VdEventsController::send_event(int number, const QVariant& arg1, const QVariant& arg2,
                                    const QVariant& arg3, const QVariant& arg4)
{
    auto it = m_receivers.find(number);
    if (it == m_receivers.end())
        return;
    // Receivers destroyed since they registered are dropped here.
    it->removeAll(QPointer<QObject>());
    for (const QPointer<QObject>& receiver : qAsConst(*it))
        QCoreApplication::postEvent(receiver, new VdEvent(number, arg1, arg2, arg3, arg4));
}

int VdEventsController::receiverCount(int number) const
{
    int count = 0;
    for (const QPointer<QObject>& receiver : m_receivers.value(number))
        count += receiver ? 1 : 0;
    return count;
}
