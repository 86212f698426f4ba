// Preloaded into a Qt program by bench_startup: reports the moment the first top-level window is
// painted (CLOCK_MONOTONIC in ns, and the process's CPU time in ms) on stderr and ends the program
// there. It hooks the QApplication constructors, which every Qt widget program runs through.
#include <QApplication>
#include <QEvent>
#include <QWidget>

#include <cstdio>
#include <ctime>
#include <dlfcn.h>
#include <sys/resource.h>
#include <unistd.h>

namespace {

class FirstPaint : public QObject
{
public:
    bool eventFilter(QObject* watched, QEvent* event) override
    {
        if (event->type() != QEvent::Paint || !watched->isWidgetType() ||
            !static_cast<QWidget*>(watched)->isWindow())
            return false;
        timespec now{};
        clock_gettime(CLOCK_MONOTONIC, &now);
        rusage usage{};
        getrusage(RUSAGE_SELF, &usage);
        const double cpuMs = (usage.ru_utime.tv_sec + usage.ru_stime.tv_sec) * 1e3 +
                             (usage.ru_utime.tv_usec + usage.ru_stime.tv_usec) / 1e3;
        std::fprintf(stderr, "FIRSTPAINT %lld %.2f %s\n", now.tv_sec * 1000000000LL + now.tv_nsec, cpuMs,
                     watched->metaObject()->className());
        std::fflush(stderr);
        _exit(0);
    }
};

void watch()
{
    static FirstPaint filter;
    qApp->installEventFilter(&filter);
}

using Constructor = void (*)(void*, int&, char**, int);

Constructor original(const char* name)
{
    return reinterpret_cast<Constructor>(dlsym(RTLD_NEXT, name));
}

} // namespace

// QApplication::QApplication(int&, char**, int), complete and base object constructors.
extern "C" void _ZN12QApplicationC1ERiPPci(void* self, int& argc, char** argv, int flags)
{
    static const Constructor next = original("_ZN12QApplicationC1ERiPPci");
    next(self, argc, argv, flags);
    watch();
}

extern "C" void _ZN12QApplicationC2ERiPPci(void* self, int& argc, char** argv, int flags)
{
    static const Constructor next = original("_ZN12QApplicationC2ERiPPci");
    next(self, argc, argv, flags);
    watch();
}
