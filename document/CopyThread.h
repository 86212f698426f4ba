#pragma once

#include <QThread>

#include <functional>

// Copies a large file off the GUI thread while the caller waits. The copy is flushed to disk;
// with 'replace' it is renamed over the target, otherwise it stays under a temporary name beside
// the target (temporaryFile()) for the caller to move into place.
class CopyThread : public QThread
{
    Q_OBJECT
public:
    CopyThread(const QString& source, const QString& target, QObject* parent = nullptr);

    void setReplaceTarget(bool replace) { m_replace = replace; }
    bool succeeded() const { return m_ok; }
    QString temporaryFile() const { return m_temporary; }

    // Runs the copy and waits for its end, keeping timers and painting alive but not user input.
    // 'meanwhile' runs on the calling thread while the copy runs.
    bool copyAndWait(const std::function<void()>& meanwhile = nullptr);

protected:
    void run() override;

private:
    QString m_source;
    QString m_target;
    QString m_temporary;
    bool m_replace = true;
    bool m_ok = false;
};
