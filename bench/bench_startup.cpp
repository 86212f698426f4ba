// Window start-up: the time from starting varduna to its first painted window (offscreen), against
// a minimal Qt window started the same way in the same run. The moment of the first paint comes
// from a probe preloaded into both programs (startup_probe.cpp); nothing in the program is changed.
//
//   bench_startup [--runs N] [--json]      (default 7 runs, alternating)
//
// --json prints one JSON object on stdout: startup_ratio (median wall time over the baseline's
// median), startup_cpu_ratio, and the medians in ms.
#include <QApplication>
#include <QCoreApplication>
#include <QDir>
#include <QFileInfo>
#include <QJsonDocument>
#include <QJsonObject>
#include <QMainWindow>
#include <QProcess>
#include <QTemporaryDir>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <ctime>

namespace {

struct Start
{
    double wallMs = -1;
    double cpuMs = -1;
};

qint64 monotonicNs()
{
    timespec now{};
    clock_gettime(CLOCK_MONOTONIC, &now);
    return now.tv_sec * 1000000000LL + now.tv_nsec;
}

// Starts the program with fresh settings of its own and waits for the probe's report.
Start measure(const QString& program, const QStringList& arguments, const QString& probe)
{
    QTemporaryDir home;
    QProcessEnvironment env = QProcessEnvironment::systemEnvironment();
    env.insert(QStringLiteral("QT_QPA_PLATFORM"), QStringLiteral("offscreen"));
    env.insert(QStringLiteral("LD_PRELOAD"), probe);
    for (const char* name : {"HOME", "XDG_CONFIG_HOME", "XDG_DATA_HOME", "XDG_CACHE_HOME"})
        env.insert(QString::fromLatin1(name), home.path());
    QProcess process;
    process.setProcessEnvironment(env);
    process.setProcessChannelMode(QProcess::SeparateChannels);
    const qint64 started = monotonicNs();
    process.start(program, arguments);
    if (!process.waitForFinished(120000)) {
        process.kill();
        process.waitForFinished();
    }
    for (const QByteArray& line : process.readAllStandardError().split('\n')) {
        if (!line.startsWith("FIRSTPAINT "))
            continue;
        const QList<QByteArray> fields = line.split(' ');
        if (fields.size() >= 3)
            return {(fields[1].toLongLong() - started) / 1e6, fields[2].toDouble()};
    }
    std::fprintf(stderr, "%s showed no window\n", qPrintable(program));
    return {};
}

double median(QList<double> values)
{
    std::sort(values.begin(), values.end());
    const int n = values.size();
    return n == 0 ? 0 : n % 2 ? values[n / 2] : (values[n / 2 - 1] + values[n / 2]) / 2;
}

QString spread(QList<double> values)
{
    std::sort(values.begin(), values.end());
    return values.isEmpty()
               ? QString()
               : QString::asprintf("%.0f-%.0f-%.0f", values.first(), median(values), values.last());
}

} // namespace

int main(int argc, char* argv[])
{
    for (int i = 1; i < argc; ++i) {
        if (qstrcmp(argv[i], "--minimal-window") == 0) {
            // The baseline: a Qt main window and nothing else.
            QApplication app(argc, argv);
            QMainWindow window;
            window.show();
            return app.exec();
        }
    }
    QCoreApplication app(argc, argv);
    int runs = 7;
    bool json = false;
    const QStringList args = app.arguments();
    for (int i = 1; i < args.size(); ++i) {
        if (args[i] == QLatin1String("--runs") && i + 1 < args.size())
            runs = std::max(1, args[++i].toInt());
        else if (args[i] == QLatin1String("--json"))
            json = true;
    }
    const QDir bin(QCoreApplication::applicationDirPath());
    const QString varduna = bin.filePath(QStringLiteral("varduna"));
    const QString probe = bin.filePath(QStringLiteral("libbench_startup_probe.so"));
    if (!QFileInfo::exists(varduna) || !QFileInfo::exists(probe)) {
        std::fprintf(stderr, "needs %s and %s\n", qPrintable(varduna), qPrintable(probe));
        return 1;
    }

    QList<double> wall, cpu, baseWall, baseCpu;
    for (int r = 0; r < runs; ++r) {
        const Start base =
            measure(QCoreApplication::applicationFilePath(), {QStringLiteral("--minimal-window")}, probe);
        const Start ours = measure(varduna, {}, probe);
        if (base.wallMs < 0 || ours.wallMs < 0)
            return 1;
        baseWall << base.wallMs;
        baseCpu << base.cpuMs;
        wall << ours.wallMs;
        cpu << ours.cpuMs;
    }
    FILE* out = json ? stderr : stdout;
    std::fprintf(out, "first window   %6.0f ms  baseline %6.0f ms  ratio %5.2f   min-median-max %s / %s ms\n",
                 median(wall), median(baseWall), median(wall) / median(baseWall), qPrintable(spread(wall)),
                 qPrintable(spread(baseWall)));
    std::fprintf(out, "  its CPU time %6.0f ms  baseline %6.0f ms  ratio %5.2f   min-median-max %s / %s ms\n",
                 median(cpu), median(baseCpu), median(cpu) / median(baseCpu), qPrintable(spread(cpu)),
                 qPrintable(spread(baseCpu)));
    if (json) {
        const auto round2 = [](double v) { return std::round(v * 100) / 100; };
        const QJsonObject result{
            {"runs", runs},
            {"startup_ratio", round2(median(wall) / median(baseWall))},
            {"startup_cpu_ratio", round2(median(cpu) / median(baseCpu))},
            {"startup_ms", round2(median(wall))},
            {"startup_baseline_ms", round2(median(baseWall))},
            {"startup_cpu_ms", round2(median(cpu))},
            {"startup_baseline_cpu_ms", round2(median(baseCpu))},
        };
        std::printf("%s\n", QJsonDocument(result).toJson(QJsonDocument::Compact).constData());
    }
    return 0;
}
