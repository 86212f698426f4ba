// Importing the mobile app's exchange file: 200 reports with four photos each, every row checked
// and written report by report, against copying the same rows with plain SQL in one transaction.
//
//   bench_import [--reports N] [--json]     (default 200 reports)
//
// --json prints one JSON object on stdout (progress goes to stderr): reports, seconds (the import),
// baseline_seconds, ratio and peak_rss_mb.
#include "VDRExchangeFileBuilder.h"
#include "document/VDRDatabaseSchema.h"
#include "document/VDRDocument.h"
#include "document/VDRFileOps.h"
#include "sync/VDRReportSynchronisation.h"

#include <QBuffer>
#include <QCoreApplication>
#include <QElapsedTimer>
#include <QFile>
#include <QFileInfo>
#include <QImage>
#include <QJsonDocument>
#include <QJsonObject>
#include <QRandomGenerator>
#include <QSqlError>
#include <QSqlQuery>
#include <QSqlRecord>
#include <QStandardPaths>
#include <QTemporaryDir>

#include <cstdio>
#include <sys/resource.h>

namespace {
bool g_json = false;

FILE* out()
{
    return g_json ? stderr : stdout;
}

double peakRssMb()
{
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    return usage.ru_maxrss / 1024.0;
}

// A photo of a size the app sends: noise does not compress, like a real picture.
QByteArray photo(int width, int height)
{
    QImage image(width, height, QImage::Format_RGB32);
    QRandomGenerator random(17);
    for (int y = 0; y < height; ++y) {
        auto* line = reinterpret_cast<quint32*>(image.scanLine(y));
        for (int x = 0; x < width; ++x)
            line[x] = 0xff000000u | (random.generate() & 0x00ffffffu);
    }
    QByteArray bytes;
    QBuffer buffer(&bytes);
    buffer.open(QIODevice::WriteOnly);
    image.save(&buffer, "JPG", 80);
    return bytes;
}

bool writeExchangeFile(const QString& path, int reports)
{
    VDRExchangeFileBuilder file(path, QStringLiteral("Baustelle.vd2"));
    if (!file.isOk())
        return false;
    const QByteArray image = photo(640, 480);
    const QByteArray thumbnail = photo(240, 180);
    const QDateTime created(QDate(2025, 1, 1), QTime(7, 0));
    for (int r = 0; r < reports; ++r) {
        const int entry = file.addReport(QString::number(r + 1).rightJustified(3, QLatin1Char('0')),
                                         QDate(2025, 1, 1).addDays(r), created.addSecs(60 * r),
                                         {{"progress", QStringLiteral("Fortschritt %1").arg(r)}});
        if (entry < 0)
            return false;
        const QVariant e = entry;
        const int workforce =
            file.addRow("entry_workforce", {{"entry_id", e}, {"person_count", 4}, {"person_type", "Maurer"}});
        file.addRow("entry_time_recording",
                    {{"entry_id", e}, {"workforce_id", workforce}, {"person_count", 4}});
        file.addRow("entry_attendee", {{"entry_id", e}, {"comment", "Bauleiter"}});
        const int deficiency =
            file.addRow("entry_progress", {{"entry_id", e}, {"type", 4}, {"description", "Riss"}});
        file.addRow("entry_task", {{"entry_id", e}, {"type", 1}, {"description", "Weisung"}});
        file.addRow("entry_equipment", {{"entry_id", e}, {"equipment", "Kran"}});
        for (int p = 0; p < 4; ++p) {
            const int imageId = file.addRow("image", {{"image", image},
                                                      {"image_ct", "image/jpeg"},
                                                      {"image_width", 640},
                                                      {"image_height", 480},
                                                      {"thumbnail", thumbnail},
                                                      {"thumbnail_ct", "image/jpeg"},
                                                      {"thumbnail_width", 240},
                                                      {"thumbnail_height", 180}});
            if (file.addRow("entry_photo", {{"entry_id", e},
                                            {"type", p == 0 ? 2 : 1},
                                            {"photo_image_id", imageId},
                                            {"caption", QStringLiteral("Foto %1").arg(p)},
                                            {"relation_id", p == 0 ? deficiency : 0}}) < 0)
                return false;
        }
    }
    return true;
}

// The baseline: the same rows read and inserted with prepared statements, ids shifted by a fixed
// offset, no checks, one transaction.
double copyWithPlainSql(const QString& diary, const QString& exchange)
{
    const QStringList tables =
        QStringList{QStringLiteral("image"), QStringLiteral("audio"), QStringLiteral("entry")} +
        VDRDatabaseSchema::reportTables();
    QElapsedTimer timer;
    timer.start();
    {
        QSqlDatabase source =
            QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), QStringLiteral("BASE_SOURCE"));
        source.setDatabaseName(exchange);
        QSqlDatabase target =
            QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), QStringLiteral("BASE_TARGET"));
        target.setDatabaseName(diary);
        if (!source.open() || !target.open())
            return -1;
        QSqlQuery(target).exec(QStringLiteral("PRAGMA locking_mode = EXCLUSIVE"));
        QSqlQuery(target).exec(QStringLiteral("BEGIN EXCLUSIVE TRANSACTION"));
        const int offset = 100000;
        for (const QString& table : tables) {
            QSqlQuery select(source);
            select.setForwardOnly(true);
            select.exec(QStringLiteral("SELECT * FROM %1").arg(table));
            const QSqlRecord record = select.record();
            QStringList columns, marks;
            for (int i = 0; i < record.count(); ++i) {
                columns << record.fieldName(i);
                marks << QStringLiteral("?");
            }
            QSqlQuery insert(target);
            insert.prepare(QStringLiteral("INSERT INTO %1 (%2) VALUES (%3)")
                               .arg(table, columns.join(QLatin1Char(',')), marks.join(QLatin1Char(','))));
            while (select.next()) {
                for (int i = 0; i < record.count(); ++i) {
                    const QString name = record.fieldName(i);
                    const bool id = name == QLatin1String("id") || name.endsWith(QLatin1String("_id"));
                    insert.addBindValue(id && !select.value(i).isNull()
                                            ? QVariant(select.value(i).toInt() + offset)
                                            : select.value(i));
                }
                if (!insert.exec()) {
                    std::fprintf(stderr, "baseline: %s\n", qPrintable(insert.lastError().text()));
                    return -1;
                }
            }
        }
        QSqlQuery(target).exec(QStringLiteral("COMMIT TRANSACTION"));
        source.close();
        target.close();
    }
    QSqlDatabase::removeDatabase(QStringLiteral("BASE_SOURCE"));
    QSqlDatabase::removeDatabase(QStringLiteral("BASE_TARGET"));
    return timer.nsecsElapsed() / 1e9;
}
} // namespace

int main(int argc, char* argv[])
{
    QCoreApplication app(argc, argv);
    QStandardPaths::setTestModeEnabled(true);
    QCoreApplication::setOrganizationName(QStringLiteral("Korvant - Software Bench"));
    QCoreApplication::setApplicationName(QStringLiteral("VardunaBench"));
    int reports = 200;
    const QStringList args = app.arguments();
    for (int i = 1; i < args.size(); ++i) {
        if (args[i] == QLatin1String("--json"))
            g_json = true;
        else if (args[i] == QLatin1String("--reports") && i + 1 < args.size())
            reports = args[++i].toInt();
    }
    QTemporaryDir dir;
    qputenv("TMPDIR", QFile::encodeName(dir.path()));
    const QString diary = dir.filePath(QStringLiteral("Baustelle.vd2"));
    const QString baselineDiary = dir.filePath(QStringLiteral("Baseline.vd2"));
    const QString exchange = dir.filePath(QStringLiteral("Baustelle.2025-01-01T07-00-00.vdx"));
    {
        VDRDocument doc;
        if (!doc.createDocument(true) || !doc.writeWorkingCopyTo(diary))
            return 2;
        doc.closeDocument();
    }
    if (!QFile::copy(diary, baselineDiary))
        return 2;
    std::fprintf(out(), "writing an exchange file of %d reports ...\n", reports);
    if (!writeExchangeFile(exchange, reports))
        return 2;
    std::fprintf(out(), "exchange file: %.1f MB\n", QFileInfo(exchange).size() / 1048576.0);

    double seconds = 0;
    int imported = 0;
    {
        VDRDocument doc;
        bool showError = true;
        if (!doc.openDocument(diary, showError))
            return 2;
        VDRReportSynchronisation sync(&doc);
        sync.setShowSummary(false);
        bool changed = false;
        QElapsedTimer timer;
        timer.start();
        const int failed = sync.importReportExchangeFiles({exchange}, false, changed);
        seconds = timer.nsecsElapsed() / 1e9;
        for (const auto* result : sync.results())
            imported += result->status() == VDRReportSynchronisationResult::Imported ? 1 : 0;
        if (failed != 0 || imported != reports) {
            std::fprintf(stderr, "import failed: %d of %d reports\n", imported, reports);
            return 2;
        }
        doc.closeDocument();
    }
    const double rss = peakRssMb();
    const double baseline = copyWithPlainSql(baselineDiary, exchange);
    if (baseline <= 0)
        return 2;
    const double ratio = seconds / baseline;
    std::fprintf(out(), "import %.3f s, plain SQL %.3f s, ratio %.2f (goal <= 2), peak %.0f MB\n", seconds,
                 baseline, ratio, rss);
    if (g_json) {
        QJsonObject o;
        o.insert(QStringLiteral("reports"), reports);
        o.insert(QStringLiteral("seconds"), seconds);
        o.insert(QStringLiteral("baseline_seconds"), baseline);
        o.insert(QStringLiteral("ratio"), ratio);
        o.insert(QStringLiteral("peak_rss_mb"), rss);
        std::fputs(QJsonDocument(o).toJson(QJsonDocument::Compact).constData(), stdout);
        std::fputs("\n", stdout);
    }
    return 0;
}
