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
    // 'whileFlushing' runs on the calling thread with the written copy (under its temporary name)
    // while the copy is being flushed to disk: it reads the copy from memory while the disk works.
    bool copyAndWait(const std::function<void(const QString& copy)>& whileFlushing = nullptr);

signals:
    void copied(const QString& temporary);

protected:
    void run() override;

private:
    QString m_source;
    QString m_target;
    QString m_temporary;
    bool m_replace = true;
    bool m_ok = false;
};
