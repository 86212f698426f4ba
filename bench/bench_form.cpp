// Showing reports in the report form, one after the other, on a generated diary whose reports all
// have full lists. Baseline in the same run: reading the same report's rows with plain SQL.
// Usage: bench_form [--reports N] [--json]  (run offscreen: QT_QPA_PLATFORM=offscreen)
// --json prints one JSON object on stdout: show_ms_median, show_ms_max, baseline_ms_median,
// rss_mb_after_50, rss_mb_after_all, reports.
#include "bench_fill.h"
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "editing/form/VDREntryWidget.h"

#include <QApplication>
#include <QElapsedTimer>
#include <QFile>
#include <QJsonDocument>
#include <QJsonObject>
#include <QRegularExpression>
#include <QSqlQuery>
#include <QStandardPaths>
#include <QTemporaryDir>
#include <QTextStream>

#include <algorithm>
#include <cstdio>
#include <unistd.h>

namespace {

double rssMb()
{
    QFile f(QStringLiteral("/proc/self/statm"));
    if (!f.open(QIODevice::ReadOnly))
        return -1;
    const QList<QByteArray> fields = f.readAll().split(' ');
    return fields.value(1).toDouble() * double(sysconf(_SC_PAGESIZE)) / (1024.0 * 1024.0);
}

double median(QList<double> v)
{
    if (v.isEmpty())
        return 0;
    std::sort(v.begin(), v.end());
    return v.size() % 2 ? v[v.size() / 2] : (v[v.size() / 2 - 1] + v[v.size() / 2]) / 2;
}

bool exec(QSqlQuery& q, const QString& sql)
{
    if (q.exec(sql))
        return true;
    fprintf(stderr, "SQL failed: %s\n", qPrintable(sql));
    return false;
}

const QStringList kSubTables = benchSubTables();

// One report filled through the document's own operations, then copied with SQL to 'reports'.
bool generate(VDRDocument& doc, int reports)
{
    const int id = doc.modelEntryAll()->data(0, QStringLiteral("id"), Qt::EditRole).toInt();
    fillEveryList(doc, id);
    QSqlQuery q(doc.database());
    exec(q, QStringLiteral(
                "UPDATE entry SET progress = '<p>Decke über EG betoniert, Schalung OG begonnen.</p>', "
                "env_weather1 = 'heiter' WHERE id = %1")
                .arg(id));
    exec(q, QStringLiteral("BEGIN"));
    exec(q, QStringLiteral(
                "CREATE TEMP TABLE seq AS WITH RECURSIVE s(k) AS (SELECT 1 UNION ALL SELECT k + 1 FROM s "
                "WHERE k < %1) SELECT k FROM s")
                .arg(reports - 1));
    auto columns = [&](const QString& table) {
        QStringList names;
        QSqlQuery info(doc.database());
        info.exec(QStringLiteral("PRAGMA table_info(%1)").arg(table));
        while (info.next())
            names << info.value(1).toString();
        return names;
    };
    QStringList entryCols = columns(QStringLiteral("entry"));
    QStringList select = entryCols;
    select.replaceInStrings(QRegularExpression(QStringLiteral("^id$")), QStringLiteral("id + k"));
    select.replaceInStrings(QRegularExpression(QStringLiteral("^number$")),
                            QStringLiteral("printf('%04d (Entwurf)', id + k)"));
    select.replaceInStrings(QRegularExpression(QStringLiteral("^inspection_date$")),
                            QStringLiteral("date('2020-01-01', '+' || k || ' days')"));
    bool ok = exec(q, QStringLiteral("INSERT INTO entry (%1) SELECT %2 FROM entry, seq WHERE id = %3")
                          .arg(entryCols.join(','), select.join(','))
                          .arg(id));
    for (const QString& table : kSubTables) {
        const QStringList cols = columns(table);
        QStringList sel = cols;
        sel.replaceInStrings(QRegularExpression(QStringLiteral("^id$")), QStringLiteral("id + k * 1000"));
        sel.replaceInStrings(QRegularExpression(QStringLiteral("^entry_id$")),
                             QStringLiteral("entry_id + k"));
        ok &= exec(q, QStringLiteral("INSERT INTO %1 (%2) SELECT %3 FROM %1, seq WHERE entry_id = %4")
                          .arg(table, cols.join(','), sel.join(','))
                          .arg(id));
    }
    exec(q, QStringLiteral("DROP TABLE seq"));
    ok &= exec(q, QStringLiteral("COMMIT"));
    doc.modelEntryAll()->select();
    doc.modelEntryAll()->fetch_all();
    return ok && doc.modelEntryAll()->rowCount() == reports;
}

// What reading one report's rows costs without the form.
double baselineShow(VDRDocument& doc, int id)
{
    QElapsedTimer t;
    t.start();
    QSqlQuery q(doc.database());
    q.exec(QStringLiteral("SELECT * FROM entry WHERE id = %1").arg(id));
    while (q.next()) {
    }
    for (const QString& table : kSubTables) {
        q.exec(QStringLiteral("SELECT * FROM %1 WHERE entry_id = %2 ORDER BY pos").arg(table).arg(id));
        while (q.next()) {
        }
    }
    return t.nsecsElapsed() / 1e6;
}
} // namespace

int main(int argc, char** argv)
{
    qputenv("QT_QPA_PLATFORM",
            qgetenv("QT_QPA_PLATFORM").isEmpty() ? "offscreen" : qgetenv("QT_QPA_PLATFORM"));
    QApplication app(argc, argv);
    QStandardPaths::setTestModeEnabled(true);
    int reports = 2000;
    bool json = false;
    const QStringList args = app.arguments();
    for (int i = 1; i < args.size(); ++i) {
        if (args[i] == QLatin1String("--reports") && i + 1 < args.size())
            reports = qMax(60, args[++i].toInt());
        else if (args[i] == QLatin1String("--json"))
            json = true;
    }
    QTemporaryDir dir;
    qputenv("TMPDIR", QFile::encodeName(dir.path()));
    QTextStream err(stderr);

    VDRDocument doc;
    if (!doc.createDocument(true) || !generate(doc, reports)) {
        err << "could not generate the diary\n";
        return 1;
    }
    VDREntryWidget form;
    form.resize(1200, 800);
    form.show();
    form.slotDocumentOpened(&doc);
    QCoreApplication::processEvents();

    QList<double> show, baseline;
    double rss50 = 0;
    QElapsedTimer t;
    for (int row = 0; row < reports; ++row) {
        t.start();
        form.actionGoto(row, -1);
        // As the window's event loop would: queued events, then what was left for deletion.
        QCoreApplication::processEvents();
        QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
        show << t.nsecsElapsed() / 1e6;
        baseline << baselineShow(doc, form.currentEntryId());
        if (row + 1 == 50)
            rss50 = rssMb();
    }
    const double rssAll = rssMb();
    const double maxShow = *std::max_element(show.begin(), show.end());
    const QJsonObject result{{"reports", reports},
                             {"show_ms_median", median(show)},
                             {"show_ms_max", maxShow},
                             {"baseline_ms_median", median(baseline)},
                             {"rss_mb_after_50", rss50},
                             {"rss_mb_after_all", rssAll},
                             {"entry_model_sets", doc.entryModelSetCount()}};
    if (json) {
        printf("%s\n", QJsonDocument(result).toJson(QJsonDocument::Compact).constData());
    } else {
        printf("show a report: median %.2f ms, max %.2f ms (plain SQL baseline %.2f ms)\n", median(show),
               maxShow, median(baseline));
        printf("memory: %.1f MB after 50 reports, %.1f MB after %d (%.2fx)\n", rss50, rssAll, reports,
               rssAll / rss50);
    }
    form.slotDocumentClosed(&doc);
    doc.closeDocument();
    return 0;
}
