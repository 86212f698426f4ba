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
        m_ok = VDRFileOps::replaceFile(m_temporary, m_target);
        if (!m_ok)
            QFile::remove(m_temporary);
        m_temporary.clear();
    }
}

bool CopyThread::copyAndWait()
{
    QEventLoop loop;
    connect(this, &QThread::finished, &loop, &QEventLoop::quit);
    start();
    if (!isFinished())
        loop.exec(QEventLoop::ExcludeUserInputEvents);
    wait();
    return m_ok;
}
