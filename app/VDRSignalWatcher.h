#pragma once

#include <QObject>

class QSocketNotifier;

// Turns SIGTERM and SIGINT (logout, shutdown, Ctrl+C) into a Qt signal on the event loop, where
// the program can end without questions and without losing unsaved work.
class VDRSignalWatcher : public QObject
{
    Q_OBJECT
public:
    explicit VDRSignalWatcher(QObject* parent = nullptr);
    ~VDRSignalWatcher() override;

signals:
    void terminationRequested(int signalNumber);

private:
    void readSignal();
    QSocketNotifier* m_notifier = nullptr;
};
