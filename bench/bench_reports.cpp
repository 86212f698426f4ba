// Report operations on a growing diary: appending reports with their rows, copying and removing
// reports, and showing every report once. The figures at the first hundred reports are the
// baseline of those at the last hundred: a diary in its tenth year must feel like a new one.
//
//   bench_reports [--reports N] [--json]     (default 2000 reports)
//
// --json prints one JSON object on stdout (progress goes to stderr): medians in ms per operation,
// disk flushes (fsync/fdatasync) per appended report and peak memory.
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"

#include <QCoreApplication>
#include <QDate>
#include <QElapsedTimer>
#include <QFile>
#include <QJsonDocument>
#include <QJsonObject>
#include <QSettings>
#include <QStandardPaths>
#include <QTemporaryDir>

#include <algorithm>
#include <atomic>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <dlfcn.h>
#include <sys/resource.h>
#include <unistd.h>

// Every flush SQLite or Qt asks for passes here (the executable exports these, so they take the
// place of the C library's), which counts disk flushes without tracing the process.
namespace {
std::atomic<long> g_flushes{0};
template <typename Fn> Fn realFunction(const char* name)
{
    return reinterpret_cast<Fn>(dlsym(RTLD_NEXT, name));
}
} // namespace

extern "C" int fdatasync(int fd)
{
    static const auto real = realFunction<int (*)(int)>("fdatasync");
    ++g_flushes;
    return real(fd);
}

extern "C" int fsync(int fd)
{
    static const auto real = realFunction<int (*)(int)>("fsync");
    ++g_flushes;
    return real(fd);
}

namespace {
const int kSamples = 25; // copies and removals measured at each size
bool g_json = false;

// Progress for people; stdout belongs to the JSON object when one is asked for.
FILE* out()
{
    return g_json ? stderr : stdout;
}

// Wall time includes the disk flushes of every commit; CPU time shows what the code costs.
struct Sample
{
    double wallMs = 0;
    double cpuMs = 0;
};

struct Stopwatch
{
    QElapsedTimer wall;
    std::clock_t cpu = 0;
    void start()
    {
        wall.start();
        cpu = std::clock();
    }
    Sample stop() const
    {
        return {wall.nsecsElapsed() / 1e6, (std::clock() - cpu) * 1000.0 / CLOCKS_PER_SEC};
    }
};

double median(QList<double> values)
{
    if (values.isEmpty())
        return 0;
    std::sort(values.begin(), values.end());
    const int n = values.size();
    return n % 2 ? values[n / 2] : (values[n / 2 - 1] + values[n / 2]) / 2;
}

double medianWall(const QList<Sample>& samples)
{
    QList<double> values;
    for (const Sample& s : samples)
        values << s.wallMs;
    return median(values);
}

double medianCpu(const QList<Sample>& samples)
{
    QList<double> values;
    for (const Sample& s : samples)
        values << s.cpuMs;
    return median(values);
}

double residentMb()
{
    QFile statm(QStringLiteral("/proc/self/statm"));
    if (!statm.open(QIODevice::ReadOnly))
        return 0;
    const QList<QByteArray> fields = statm.readAll().split(' ');
    return fields.size() > 1 ? fields[1].toLongLong() * sysconf(_SC_PAGESIZE) / 1048576.0 : 0;
}

double peakResidentMb()
{
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    return usage.ru_maxrss / 1024.0;
}

void setText(VDRSqlTableModel* model, const char* field, const QString& text)
{
    model->setData(model->rowCount() - 1, QString::fromLatin1(field), text);
}

// One report as the report form creates and fills it: the new report, then the lists the user
// edits, each submitted. One user action, so one transaction.
bool appendReport(VDRDocument& doc, int index)
{
    VDRAllEntryTableModel* entries = doc.modelEntryAll();
    doc.beginTransaction();
    if (doc.appendEntry() != 1) {
        doc.endTransaction();
        return false;
    }
    entries->setData(entries->rowCount() - 1, QStringLiteral("progress"),
                     QStringLiteral("Rohbau Achse %1").arg(index));
    bool ok = entries->submitAll();
    const int id = doc.maxEntryID();
    const QString n = QString::number(index);

    for (int i = 0; i < 2; ++i) {
        doc.appendEntryAttendee(id);
        doc.modelEntryAttendee(id)->setData(doc.modelEntryAttendee(id)->rowCount() - 1,
                                            QStringLiteral("company_id"), i + 1);
        doc.appendEntryWorkforce(id);
        setText(doc.modelEntryWorkforce(id), "comment", QStringLiteral("Kolonne ") + n);
    }
    ok &= doc.modelEntryAttendee(id)->submitAll() && doc.modelEntryWorkforce(id)->submitAll();
    VDRSqlTableModel* workforce = doc.modelEntryWorkforce(id);
    for (int r = 0; r < workforce->rowCount(); ++r) {
        doc.appendEntryTimeRecording(id, workforce->data(r, QStringLiteral("id"), Qt::EditRole).toInt());
        setText(doc.modelEntryTimeRecording(id), "person_type", QStringLiteral("Maurer"));
    }
    ok &= doc.modelEntryTimeRecording(id)->submitAll();

    doc.appendEntryDfcy(id);
    setText(doc.modelEntryDfcy(id), "description", QStringLiteral("Riss ") + n);
    doc.appendEntryDirective(id);
    setText(doc.modelEntryDirective(id), "description", QStringLiteral("Gerüst prüfen"));
    doc.appendEntryConstructionmeasure(id);
    setText(doc.modelEntryConstructionmeasure(id), "description", QStringLiteral("Betonieren"));
    doc.appendEntryConstructionmaterial(id);
    setText(doc.modelEntryConstructionmaterial(id), "material", QStringLiteral("Beton C25/30"));
    doc.appendEntryTelephoneNotice(id);
    setText(doc.modelEntryTelephoneNotice(id), "description", QStringLiteral("Rückruf Statiker"));
    for (VDRSqlTableModel* model :
         {doc.modelEntryDfcy(id), doc.modelEntryDirective(id), doc.modelEntryConstructionmeasure(id),
          doc.modelEntryConstructionmaterial(id), doc.modelEntryTelephoneNotice(id)})
        ok &= model->submitAll();
    doc.endTransaction();
    return ok;
}

struct CopyRemove
{
    QList<Sample> copies;
    QList<Sample> removals;
    Sample reload;
};

// Copies kSamples reports spread over the diary, then removes as many (the copies among them).
CopyRemove copyAndRemove(VDRDocument& doc)
{
    VDRAllEntryTableModel* entries = doc.modelEntryAll();
    Stopwatch timer;
    CopyRemove result;

    entries->fetch_all();
    const int rows = entries->rowCount();
    for (int i = 0; i < kSamples; ++i) {
        timer.start();
        if (!doc.copyEntryAll(i * rows / kSamples))
            std::fprintf(stderr, "copy %d failed\n", i);
        result.copies << timer.stop();
    }
    for (int i = 0; i < kSamples; ++i) {
        // Each removal is charged with reading the report list again, which its predecessor left
        // to whoever needs the list next.
        timer.start();
        entries->fetch_all();
        const int row = std::max(0, entries->rowCount() - 1 - i * 3);
        if (!doc.removeEntryAll(row))
            std::fprintf(stderr, "removal %d failed\n", i);
        result.removals << timer.stop();
    }
    // What a removal leaves to the next user of the report list: it is read again from the diary
    // (the removal itself reads only the first rows).
    timer.start();
    entries->select();
    entries->fetch_all();
    result.reload = timer.stop();
    return result;
}

// Shows every report once, as paging through the report form does: the report's lists are read.
Sample touchAll(VDRDocument& doc)
{
    VDRAllEntryTableModel* entries = doc.modelEntryAll();
    entries->fetch_all();
    QList<int> ids;
    for (int row = 0; row < entries->rowCount(); ++row)
        ids << entries->data(row, QStringLiteral("id"), Qt::EditRole).toInt();
    Stopwatch timer;
    timer.start();
    int rows = 0;
    for (const int id : qAsConst(ids)) {
        for (VDRSqlTableModel* model : doc.entryModels(id))
            rows += model->rowCount();
    }
    Sample s = timer.stop();
    if (rows == 0)
        std::fprintf(stderr, "the reports have no rows\n");
    s.wallMs /= std::max(1, ids.size());
    s.cpuMs /= std::max(1, ids.size());
    return s;
}

void printLine(const char* what, int reports, const QList<Sample>& samples)
{
    std::fprintf(out(), "  %-8s at %6d reports %8.2f ms %8.2f ms CPU (median of %d)\n", what, reports,
                 medianWall(samples), medianCpu(samples), int(samples.size()));
}
} // namespace

int main(int argc, char** argv)
{
    QCoreApplication app(argc, argv);
    int reports = 2000;
    const QStringList args = app.arguments();
    for (int i = 1; i < args.size(); ++i) {
        if (args[i] == QLatin1String("--json"))
            g_json = true;
        else if (args[i] == QLatin1String("--reports") && i + 1 < args.size())
            reports = std::max(1, args[++i].toInt());
        else if (args[i].toInt() > 0)
            reports = args[i].toInt(); // the old form: bench_reports N
    }
    const int block = std::min(100, reports);

    // Everything, settings included, stays in a folder of our own.
    QTemporaryDir dir;
    if (!dir.isValid())
        return 1;
    QCoreApplication::setOrganizationName(QStringLiteral("Korvant - Software"));
    QCoreApplication::setApplicationName(QStringLiteral("Varduna"));
    QStandardPaths::setTestModeEnabled(true);
    QSettings::setPath(QSettings::NativeFormat, QSettings::UserScope,
                       dir.filePath(QStringLiteral("settings")));
    QSettings::setPath(QSettings::IniFormat, QSettings::UserScope, dir.filePath(QStringLiteral("settings")));
    qputenv("TMPDIR", QFile::encodeName(dir.path()));

    VDRDocument doc;
    if (!doc.createDocument(true)) {
        std::fprintf(stderr, "creating the diary failed\n");
        return 1;
    }
    std::fprintf(
        out(),
        "bench_reports: %d reports, each with 2 attendees, 2 workforce rows with a time recording each,\n"
        "a deficiency, a directive, a construction measure, a material and a telephone note.\n\n",
        reports);

    QElapsedTimer total;
    total.start();
    Stopwatch timer;
    QList<Sample> appends;
    long flushes = 0;
    double residentAt50 = 0;
    CopyRemove early;
    for (int i = 1; i <= reports; ++i) {
        const long flushesBefore = g_flushes;
        timer.start();
        if (!appendReport(doc, i)) {
            std::fprintf(stderr, "appending report %d failed\n", i);
            return 1;
        }
        appends << timer.stop();
        flushes += g_flushes - flushesBefore;
        if (i == std::min(50, reports))
            residentAt50 = residentMb();
        if (i % block == 0 || i == reports) {
            std::fprintf(out(), "  reports %6d-%-6d %8.2f ms %8.2f ms CPU (median per report)\n",
                         i - block + 1, i, medianWall(appends.mid(i - block, block)),
                         medianCpu(appends.mid(i - block, block)));
            std::fflush(out());
        }
        if (i == block)
            early = copyAndRemove(doc);
    }
    doc.modelEntryAll()->fetch_all();
    const int size = doc.modelEntryAll()->rowCount();
    const CopyRemove late = copyAndRemove(doc);
    const Sample touch = touchAll(doc);
    const double residentEnd = residentMb();

    const QList<Sample> firstAppends = appends.mid(0, block);
    const QList<Sample> lastAppends = appends.mid(appends.size() - block);
    std::fprintf(out(), "\n");
    printLine("append", block, firstAppends);
    printLine("append", reports, lastAppends);
    printLine("copy", block, early.copies);
    printLine("copy", size, late.copies);
    printLine("remove", block + kSamples, early.removals);
    printLine("remove", size + kSamples, late.removals);
    std::fprintf(out(), "  reading the report list again: %.2f ms CPU at %d reports, %.2f ms CPU at %d\n",
                 early.reload.cpuMs, block, late.reload.cpuMs, size);
    std::fprintf(out(), "  showing each report once: %.2f ms, %.2f ms CPU per report\n", touch.wallMs,
                 touch.cpuMs);
    std::fprintf(out(), "  disk flushes per appended report: %.1f\n", double(flushes) / reports);
    std::fprintf(out(), "  memory: %.0f MB after 50 reports, %.0f MB at the end, peak %.0f MB\n",
                 residentAt50, residentEnd, peakResidentMb());
    std::fprintf(out(), "\ntotal %.1f s\n", total.nsecsElapsed() / 1e9);

    if (g_json) {
        const auto round2 = [](double v) { return std::round(v * 100) / 100; };
        QJsonObject json{
            {"reports", reports},
            {"append_cpu_ms_first", round2(medianCpu(firstAppends))},
            {"append_cpu_ms_last", round2(medianCpu(lastAppends))},
            {"append_wall_ms_first", round2(medianWall(firstAppends))},
            {"append_wall_ms_last", round2(medianWall(lastAppends))},
            {"copy_cpu_ms_first", round2(medianCpu(early.copies))},
            {"copy_cpu_ms_last", round2(medianCpu(late.copies))},
            {"copy_wall_ms_first", round2(medianWall(early.copies))},
            {"copy_wall_ms_last", round2(medianWall(late.copies))},
            {"remove_cpu_ms_first", round2(medianCpu(early.removals))},
            {"remove_cpu_ms_last", round2(medianCpu(late.removals))},
            {"remove_wall_ms_first", round2(medianWall(early.removals))},
            {"remove_wall_ms_last", round2(medianWall(late.removals))},
            {"reload_cpu_ms_first", round2(early.reload.cpuMs)},
            {"reload_cpu_ms_last", round2(late.reload.cpuMs)},
            {"show_cpu_ms_per_report", round2(touch.cpuMs)},
            {"fsyncs_per_append", round2(double(flushes) / reports)},
            {"rss_mb_after_50", round2(residentAt50)},
            {"rss_mb_end", round2(residentEnd)},
            {"peak_rss_mb", round2(peakResidentMb())},
        };
        std::printf("%s\n", QJsonDocument(json).toJson(QJsonDocument::Compact).constData());
    }
    doc.closeDocument();
    return 0;
}
