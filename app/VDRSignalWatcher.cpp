#include "app/VDRSignalWatcher.h"

#include <QSocketNotifier>

#include <csignal>
#include <fcntl.h>
#include <sys/socket.h>
#include <unistd.h>

namespace {
int g_fds[2] = {-1, -1};

// Only write(2) is safe inside a signal handler; the event loop does the rest.
void handler(int signalNumber)
{
    const char c = char(signalNumber);
    if (g_fds[0] >= 0) {
        const ssize_t written = ::write(g_fds[0], &c, 1);
        (void)written;
    }
}
} // namespace

VDRSignalWatcher::VDRSignalWatcher(QObject* parent) : QObject(parent)
{
    if (::socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, g_fds) != 0)
        return;
    m_notifier = new QSocketNotifier(g_fds[1], QSocketNotifier::Read, this);
    connect(m_notifier, &QSocketNotifier::activated, this, &VDRSignalWatcher::readSignal);
    struct sigaction action = {};
    action.sa_handler = handler;
    sigemptyset(&action.sa_mask);
    action.sa_flags = SA_RESTART;
    ::sigaction(SIGTERM, &action, nullptr);
    ::sigaction(SIGINT, &action, nullptr);
}

VDRSignalWatcher::~VDRSignalWatcher()
{
    ::signal(SIGTERM, SIG_DFL);
    ::signal(SIGINT, SIG_DFL);
    for (int& fd : g_fds) {
        if (fd >= 0)
            ::close(fd);
        fd = -1;
    }
}

void VDRSignalWatcher::readSignal()
{
    char c = 0;
    if (::read(g_fds[1], &c, 1) == 1)
        emit terminationRequested(int(c));
}
