// Report operations on a growing diary: appending reports with their rows, copying and removing
// reports. Prints the mean time per operation and how it changes as the diary grows.
//
//   bench_reports [REPORTS]     (default 2000)
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"

#include <QCoreApplication>
#include <QDate>
#include <QElapsedTimer>
#include <QSettings>
#include <QStandardPaths>
#include <QTemporaryDir>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <ctime>

namespace {
const int kSamples = 25; // copies and removals measured at each size

// Wall time includes the disk syncs of every commit; CPU time shows what the models cost.
struct Stopwatch
{
    QElapsedTimer wall;
    std::clock_t cpu = 0;
    void start()
    {
        wall.start();
        cpu = std::clock();
    }
    double wallMs(int count) const { return wall.nsecsElapsed() / 1e6 / count; }
    double cpuMs(int count) const { return (std::clock() - cpu) * 1000.0 / CLOCKS_PER_SEC / count; }
};

void setText(VDRSqlTableModel* model, const char* field, const QString& text)
{
    model->setData(model->rowCount() - 1, QString::fromLatin1(field), text);
}

// One report as the report form fills it: the new report is submitted first, then each list
// the user edits is submitted on its own.
bool appendReport(VDRDocument& doc, int index)
{
    VDRAllEntryTableModel* entries = doc.modelEntryAll();
    if (doc.appendEntry() != 1)
        return false;
    entries->setData(entries->rowCount() - 1, QStringLiteral("progress"),
                     QStringLiteral("Rohbau Achse %1").arg(index));
    if (!entries->submitAll())
        return false;
    const int id = doc.maxEntryID();
    const QString n = QString::number(index);

    for (int i = 0; i < 2; ++i) {
        doc.appendEntryAttendee(id);
        doc.modelEntryAttendee(id)->setData(doc.modelEntryAttendee(id)->rowCount() - 1,
                                            QStringLiteral("company_id"), i + 1);
        doc.appendEntryWorkforce(id);
        setText(doc.modelEntryWorkforce(id), "comment", QStringLiteral("Kolonne ") + n);
    }
    bool ok = doc.modelEntryAttendee(id)->submitAll() && doc.modelEntryWorkforce(id)->submitAll();
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
    return ok;
}

struct CopyRemove
{
    double copyMs = 0, copyCpuMs = 0;
    double removeMs = 0, removeCpuMs = 0;
};

// Copies kSamples reports spread over the diary, then removes as many (the copies among them).
CopyRemove copyAndRemove(VDRDocument& doc)
{
    VDRAllEntryTableModel* entries = doc.modelEntryAll();
    Stopwatch timer;
    CopyRemove result;

    entries->fetch_all();
    const int rows = entries->rowCount();
    timer.start();
    for (int i = 0; i < kSamples; ++i) {
        if (!doc.copyEntryAll(i * rows / kSamples))
            std::fprintf(stderr, "copy %d failed\n", i);
    }
    result.copyMs = timer.wallMs(kSamples);
    result.copyCpuMs = timer.cpuMs(kSamples);

    timer.start();
    for (int i = 0; i < kSamples; ++i) {
        entries->fetch_all();
        if (!doc.removeEntryAll(std::max(0, entries->rowCount() - 1 - i * 3)))
            std::fprintf(stderr, "removal %d failed\n", i);
    }
    result.removeMs = timer.wallMs(kSamples);
    result.removeCpuMs = timer.cpuMs(kSamples);
    return result;
}
} // namespace

int main(int argc, char** argv)
{
    QCoreApplication app(argc, argv);
    const int reports = argc > 1 ? std::max(1, std::atoi(argv[1])) : 2000;
    const int block = reports >= 1000 ? 100 : std::max(1, reports / 10);

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
    std::printf(
        "bench_reports: %d reports, each with 2 attendees, 2 workforce rows with a time recording each,\n"
        "a deficiency, a directive, a construction measure, a material and a telephone note.\n\n",
        reports);
    std::printf("appending a report with its rows (mean per report, wall and CPU time):\n");

    QElapsedTimer total;
    total.start();
    Stopwatch timer;
    CopyRemove early;
    bool measuredEarly = false;
    for (int first = 1; first <= reports; first += block) {
        const int last = std::min(reports, first + block - 1);
        timer.start();
        for (int i = first; i <= last; ++i) {
            if (!appendReport(doc, i)) {
                std::fprintf(stderr, "appending report %d failed\n", i);
                return 1;
            }
        }
        const int count = last - first + 1;
        std::printf("  reports %6d-%-6d %8.2f ms %8.2f ms CPU\n", first, last, timer.wallMs(count),
                    timer.cpuMs(count));
        std::fflush(stdout);
        if (!measuredEarly && last >= std::min(reports, 100)) {
            early = copyAndRemove(doc);
            measuredEarly = true;
        }
    }
    doc.modelEntryAll()->fetch_all();
    const int size = doc.modelEntryAll()->rowCount();
    const CopyRemove late = copyAndRemove(doc);

    std::printf("\ncopying a report (copyEntryAll, mean of %d):\n", kSamples);
    std::printf("  with %6d reports %8.2f ms %8.2f ms CPU\n", std::min(reports, 100), early.copyMs,
                early.copyCpuMs);
    std::printf("  with %6d reports %8.2f ms %8.2f ms CPU\n", size, late.copyMs, late.copyCpuMs);
    std::printf("removing a report (removeEntryAll, mean of %d):\n", kSamples);
    std::printf("  with %6d reports %8.2f ms %8.2f ms CPU\n", std::min(reports, 100) + kSamples,
                early.removeMs, early.removeCpuMs);
    std::printf("  with %6d reports %8.2f ms %8.2f ms CPU\n", size + kSamples, late.removeMs,
                late.removeCpuMs);
    std::printf("\ntotal %.1f s\n", total.nsecsElapsed() / 1e9);
    doc.closeDocument();
    return 0;
}
