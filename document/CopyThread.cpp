#include "document/CopyThread.h"

#include "document/VDRFileOps.h"

#include <QEventLoop>
#include <QFile>

CopyThread::CopyThread(const QString& source, const QString& target, QObject* parent)
    : QThread(parent), m_source(source), m_target(target)
{
}

void CopyThread::run()
{
    m_temporary = VDRFileOps::writeCopy(m_source, m_target);
    emit copied(m_temporary);
    m_ok = !m_temporary.isEmpty();
    if (m_ok && !VDRFileOps::flush(m_temporary)) {
        QFile::remove(m_temporary);
        m_temporary.clear();
        m_ok = false;
    }
    if (m_ok && m_replace) {
        bool renamed = false;
        m_ok = VDRFileOps::replaceFile(m_temporary, m_target, &renamed);
        if (!m_ok && !renamed)
            QFile::remove(m_temporary);
        m_temporary.clear();
    }
}

bool CopyThread::copyAndWait(const std::function<void(const QString& copy)>& whileFlushing)
{
    QEventLoop written;
    QString copy;
    connect(
        this, &CopyThread::copied, &written,
        [&](const QString& temporary) {
            copy = temporary;
            written.quit();
        },
        Qt::QueuedConnection);
    // Both loops listen before the thread starts: a signal sent before a loop runs still ends it.
    QEventLoop flushed;
    connect(this, &QThread::finished, &written, &QEventLoop::quit);
    connect(this, &QThread::finished, &flushed, &QEventLoop::quit);
    start();
    written.exec(QEventLoop::ExcludeUserInputEvents);
    if (whileFlushing && !copy.isEmpty())
        whileFlushing(copy);
    if (!isFinished())
        flushed.exec(QEventLoop::ExcludeUserInputEvents);
    wait();
    return m_ok;
}
