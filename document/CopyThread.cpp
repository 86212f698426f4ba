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
    m_temporary = VDRFileOps::writeDurableCopy(m_source, m_target);
    m_ok = !m_temporary.isEmpty();
    if (m_ok && m_replace) {
        bool renamed = false;
        m_ok = VDRFileOps::replaceFile(m_temporary, m_target, &renamed);
        if (!m_ok && !renamed)
            QFile::remove(m_temporary);
        m_temporary.clear();
    }
}

bool CopyThread::copyAndWait(const std::function<void()>& meanwhile)
{
    QEventLoop loop;
    connect(this, &QThread::finished, &loop, &QEventLoop::quit);
    start();
    if (meanwhile)
        meanwhile();
    if (!isFinished())
        loop.exec(QEventLoop::ExcludeUserInputEvents);
    wait();
    return m_ok;
}
