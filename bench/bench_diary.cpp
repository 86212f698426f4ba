// Opening, saving and compacting a large diary, each measured against what a plain tool needs
// for the same work on the same file:
//   open    vs  cp + sqlite3 "PRAGMA quick_check"
//   save    vs  cp + sync (copy and flush)
//   compact vs  sqlite3 "VACUUM"
// Opening and saving are measured warm (the file in the page cache) and cold (the diary's pages
// evicted before each run, the baseline's too).
// Usage: bench_diary [--reports N] [--photos N] [--runs N] [--file PATH] [--keep] [--json]
// BENCH_VERBOSE=1 prints every run, not only the medians. --json prints one JSON object on stdout
// with each ratio (the program's median over its baseline's median) and the medians themselves.
#include "document/VDRDocument.h"

#include <QBuffer>
#include <QCoreApplication>
#include <QDir>
#include <QElapsedTimer>
#include <QFile>
#include <QFileInfo>
#include <QImage>
#include <QJsonDocument>
#include <QJsonObject>
#include <QPainter>
#include <QProcess>
#include <QRandomGenerator>
#include <QSettings>
#include <QSqlDatabase>
#include <QSqlError>
#include <QSqlQuery>
#include <QTemporaryDir>
#include <QTextStream>
#include <QThreadPool>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <fcntl.h>
#include <unistd.h>

namespace {

bool g_json = false;

// Stdout belongs to the JSON object when one is asked for.
QTextStream& out()
{
    static QTextStream s(g_json ? stderr : stdout);
    return s;
}

// Bytes this process has read through read(2)/pread(2) so far.
qint64 bytesRead()
{
    QFile f(QStringLiteral("/proc/self/io"));
    if (!f.open(QIODevice::ReadOnly))
        return -1;
    for (const QByteArray& line : f.readAll().split('\n')) {
        if (line.startsWith("rchar:"))
            return line.mid(6).trimmed().toLongLong();
    }
    return -1;
}

QByteArray photo(int seed, int width, int height)
{
    QImage image(width, height, QImage::Format_RGB32);
    QRandomGenerator rng{quint32(seed)};
    QPainter p(&image);
    p.fillRect(image.rect(), QColor::fromHsv(seed * 37 % 360, 80, 200));
    for (int i = 0; i < 400; ++i) {
        p.setPen(QColor::fromRgb(rng.generate()));
        p.setBrush(QColor::fromRgb(rng.generate()));
        p.drawEllipse(int(rng.bounded(width)), int(rng.bounded(height)), int(rng.bounded(200)),
                      int(rng.bounded(200)));
    }
    p.end();
    QByteArray bytes;
    QBuffer buffer(&bytes);
    buffer.open(QIODevice::WriteOnly);
    image.save(&buffer, "JPEG", 80);
    return bytes;
}

bool exec(QSqlQuery& q)
{
    if (q.exec())
        return true;
    std::fprintf(stderr, "SQL failed: %s\n", qPrintable(q.lastError().text()));
    return false;
}

// A diary as years on a site leave it: reports with their lists, and photos.
bool generate(const QString& path, int reports, int photos)
{
    if (!QFile::exists(path)) {
        VDRDocument doc;
        if (!doc.createDocument(true) || !doc.writeWorkingCopyTo(path))
            return false;
        doc.closeDocument();
    }
    QList<QByteArray> pictures;
    QList<QByteArray> thumbnails;
    for (int i = 0; i < 16; ++i) {
        pictures << photo(i, 1000, 750);
        thumbnails << photo(i, 240, 180);
    }
    bool ok = true;
    {
        QSqlDatabase db = QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), QStringLiteral("GENERATOR"));
        db.setDatabaseName(path);
        ok = db.open();
        QSqlQuery q(db);
        ok = ok && q.exec(QStringLiteral("BEGIN"));
        q.exec(QStringLiteral("DELETE FROM entry"));
        QSqlQuery entry(db);
        entry.prepare(QStringLiteral(
            "INSERT INTO entry (id, locked, number, inspection_date, inspection_time_from, "
            "inspection_time_to, env_time, "
            "env_weather1, env_weather2, env_weather3, env_temperature, env_humidity, progress, "
            "deficiencies, tests, "
            "interventions, special_incidents, construction_material_sample, notice, print_notice, "
            "print_telephone_notice, progress_audio_id, user_id, exported_by_app) VALUES (?, ?, ?, ?, "
            "'07:30:00.000', "
            "'16:15:00.000', '08:00:00.000', 'sonnig', 'trocken', 'windstill', '14', '60', ?, '', '', '', "
            "'', 0, '', 1, "
            "1, 0, 'BL', 0)"));
        QSqlQuery row(db);
        int id = 0;
        auto insert = [&](const QString& sql) {
            row.prepare(sql);
            return exec(row);
        };
        const QString progress =
            QStringLiteral("Rohbauarbeiten im 2. OG fortgesetzt, Schalung der Decke über EG "
                           "abgeschlossen, Bewehrung geprüft und abgenommen. ");
        for (int r = 1; ok && r <= reports; ++r) {
            entry.addBindValue(r);
            entry.addBindValue(r < reports - 5 ? 1 : 0);
            entry.addBindValue(QString::number(r).rightJustified(reports >= 1000 ? 4 : 3, QLatin1Char('0')) +
                               (r < reports - 5 ? QString() : QStringLiteral(" (Entwurf)")));
            entry.addBindValue(QDate(2020, 1, 1).addDays(r).toString(Qt::ISODate));
            entry.addBindValue(progress.repeated(3));
            ok = exec(entry);
            for (int i = 0; ok && i < 3; ++i) {
                ++id;
                ok =
                    insert(QStringLiteral("INSERT INTO entry_attendee VALUES (%1, %2, %3, 1, 'anwesend')")
                               .arg(id)
                               .arg(r)
                               .arg(i)) &&
                    insert(QStringLiteral("INSERT INTO entry_workforce VALUES (%1, %2, %3, 2, 'Kolonne', 4, "
                                          "'Maurer, Polier', 32.0)")
                               .arg(id)
                               .arg(r)
                               .arg(i)) &&
                    insert(QStringLiteral(
                               "INSERT INTO entry_time_recording VALUES (%1, %2, %3, %1, 4, 'Maurer', "
                               "'07:00:00.000', '15:30:00.000', 30, 8.0)")
                               .arg(id)
                               .arg(r)
                               .arg(i)) &&
                    insert(QStringLiteral(
                               "INSERT INTO entry_progress VALUES (%1, %2, %3, %4, 'Riss in der "
                               "Außenwand Achse B, Breite ca. 0,3 mm', 2, '2021-05-01', 'Flur', 'OG-01', 0)")
                               .arg(id)
                               .arg(r)
                               .arg(i)
                               .arg(i % 4 + 1)) &&
                    insert(QStringLiteral(
                               "INSERT INTO entry_task VALUES (%1, %2, %3, %4, 'Gerüst prüfen lassen', 2)")
                               .arg(id)
                               .arg(r)
                               .arg(i)
                               .arg(i % 2 + 1)) &&
                    insert(QStringLiteral("INSERT INTO entry_constructionmaterial VALUES (%1, %2, %3, 'Beton "
                                          "C25/30', 12.5, 'm³', 'Einbau', 2, 8, 'trocken', 'zügig', '', '')")
                               .arg(id)
                               .arg(r)
                               .arg(i)) &&
                    insert(QStringLiteral(
                               "INSERT INTO entry_equipment VALUES (%1, %2, %3, 'Turmdrehkran', 'Feld "
                               "A', 2, '07:00:00.000', '16:00:00.000', 540, 0, '', '')")
                               .arg(id)
                               .arg(r)
                               .arg(i));
            }
        }
        QSqlQuery image(db);
        image.prepare(
            QStringLiteral("INSERT INTO image (image, image_ct, image_width, image_height, thumbnail, "
                           "thumbnail_ct, thumbnail_width, thumbnail_height) VALUES (?, 'image/jpeg', 1000, "
                           "750, ?, 'image/jpeg', 240, 180)"));
        for (int p = 1; ok && p <= photos; ++p) {
            // Bytes after the end marker keep every photo distinct without another encode.
            image.addBindValue(pictures[p % pictures.size()] + QByteArray::number(p));
            image.addBindValue(thumbnails[p % thumbnails.size()]);
            ok = exec(image);
            ok =
                ok &&
                insert(QStringLiteral("INSERT INTO entry_photo VALUES (%1, %2, %3, %4, %5, 'Foto %1', '', 2, "
                                      "'2021-05-01', -1)")
                           .arg(p)
                           .arg(1 + (p - 1) % std::max(1, reports))
                           .arg(p % 2)
                           .arg(1 + p % 5)
                           .arg(p));
        }
        for (const char* table :
             {"entry", "entry_attendee", "entry_workforce", "entry_time_recording", "entry_progress",
              "entry_task", "entry_constructionmaterial", "entry_equipment", "entry_photo"}) {
            q.exec(
                QStringLiteral("INSERT OR REPLACE INTO id_generator VALUES ('%1', (SELECT max(id) FROM %1))")
                    .arg(QLatin1String(table)));
        }
        ok = ok && q.exec(QStringLiteral("COMMIT"));
        db.close();
    }
    QSqlDatabase::removeDatabase(QStringLiteral("GENERATOR"));
    return ok;
}

// Each measurement starts with nothing left to write back, so that one step's flushing is not
// charged to the next.
void settle()
{
    ::sync();
}

// Drops a file's pages from the page cache, as after a restart: flushed first, since dirty pages
// cannot be dropped.
void evict(const QString& path)
{
    const int fd = ::open(QFile::encodeName(path).constData(), O_RDONLY);
    if (fd < 0)
        return;
    ::fdatasync(fd);
    if (::posix_fadvise(fd, 0, 0, POSIX_FADV_DONTNEED) != 0)
        std::fprintf(stderr, "could not evict %s\n", qPrintable(path));
    ::close(fd);
}

double run(const QString& program, const QStringList& args)
{
    QElapsedTimer t;
    t.start();
    QProcess p;
    p.start(program, args);
    p.waitForFinished(-1);
    if (p.exitCode() != 0)
        std::fprintf(stderr, "%s failed: %s\n", qPrintable(program), p.readAllStandardError().constData());
    return t.nsecsElapsed() / 1e6;
}

// What a baseline tool reads, measured by doing the same work in this process: the SQL on 'path'.
qint64 sqlRead(const QString& path, const QString& sql)
{
    const qint64 before = bytesRead();
    {
        QSqlDatabase db = QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), QStringLiteral("BASELINE"));
        db.setDatabaseName(path);
        if (db.open()) {
            QSqlQuery q(db);
            q.exec(sql);
            while (q.next()) {
            }
        }
        db.close();
    }
    QSqlDatabase::removeDatabase(QStringLiteral("BASELINE"));
    return bytesRead() - before;
}

qint64 copyRead(const QString& from, const QString& to)
{
    QFile::remove(to);
    const qint64 before = bytesRead();
    QFile in(from);
    QFile out(to);
    if (in.open(QIODevice::ReadOnly) && out.open(QIODevice::WriteOnly)) {
        while (!in.atEnd())
            out.write(in.read(4 << 20));
    }
    return bytesRead() - before;
}

double median(QList<double> values)
{
    std::sort(values.begin(), values.end());
    return values.isEmpty() ? 0 : values[values.size() / 2];
}

QString spread(QList<double> values)
{
    std::sort(values.begin(), values.end());
    return values.isEmpty()
               ? QString()
               : QString::asprintf("%.0f-%.0f-%.0f", values.first(), median(values), values.last());
}

void report(const char* what, const QList<double>& ours, const QList<double>& baseline, qint64 readOurs,
            qint64 readBaseline, qint64 size)
{
    out() << QString::asprintf(
        "%-10s %7.0f ms  baseline %7.0f ms  ratio %5.2f  read %5.2f x file (baseline %4.2f)  "
        "min-median-max %s / %s ms\n",
        what, median(ours), median(baseline), median(ours) / median(baseline), double(readOurs) / size,
        double(readBaseline) / size, qPrintable(spread(ours)), qPrintable(spread(baseline)));
    out().flush();
}

double ratio(const QList<double>& ours, const QList<double>& baseline)
{
    return std::round(median(ours) / median(baseline) * 100) / 100;
}

struct Timings
{
    QList<double> openOurs, openBase, saveOurs, saveBase;
    qint64 readOpen = 0, readSave = 0;
};

// One opening and one save of the diary, each after its baseline. Cold: the files a step reads
// are evicted before it.
bool openAndSave(const QString& file, const QString& copy, bool cold, int index, Timings& t)
{
    const auto prepare = [&](const QStringList& files) {
        settle();
        if (cold) {
            for (const QString& f : files)
                evict(f);
        }
    };
    QFile::remove(copy);
    prepare({file});
    t.openBase << run(QStringLiteral("cp"), {file, copy}) +
                      run(QStringLiteral("sqlite3"), {copy, QStringLiteral("PRAGMA quick_check;")});
    QFile::remove(copy);
    prepare({file});
    t.saveBase << run(QStringLiteral("cp"), {file, copy}) + run(QStringLiteral("sync"), {copy});

    VDRDocument doc;
    bool showError = true;
    prepare({file});
    const qint64 before = bytesRead();
    QElapsedTimer timer;
    timer.start();
    if (!doc.openDocument(file, showError)) {
        std::fprintf(stderr, "open failed\n");
        return false;
    }
    t.openOurs << timer.nsecsElapsed() / 1e6;
    t.readOpen = bytesRead() - before;
    doc.modelVdr()->setData(0, QStringLiteral("name"), QStringLiteral("Lauf %1").arg(index));
    doc.modelVdr()->submitAll();
    prepare({file, doc.getFilepathWorkingCopy()});
    const qint64 beforeSave = bytesRead();
    timer.restart();
    if (doc.saveDocument() != 0) {
        std::fprintf(stderr, "save failed\n");
        return false;
    }
    t.saveOurs << timer.nsecsElapsed() / 1e6;
    t.readSave = bytesRead() - beforeSave;
    doc.closeDocument();
    return true;
}

} // namespace

int main(int argc, char* argv[])
{
    QCoreApplication app(argc, argv);
    QCoreApplication::setOrganizationName(QStringLiteral("Varduna Benchmarks"));
    QCoreApplication::setApplicationName(QStringLiteral("bench_diary"));
    int reports = 2000;
    int photos = 4000;
    int runs = 3;
    QString file;
    bool keep = false;
    const QStringList args = app.arguments();
    for (int i = 1; i < args.size(); ++i) {
        if (args[i] == QLatin1String("--reports") && i + 1 < args.size())
            reports = args[++i].toInt();
        else if (args[i] == QLatin1String("--photos") && i + 1 < args.size())
            photos = args[++i].toInt();
        else if (args[i] == QLatin1String("--runs") && i + 1 < args.size())
            runs = std::max(1, args[++i].toInt());
        else if (args[i] == QLatin1String("--file") && i + 1 < args.size())
            file = args[++i];
        else if (args[i] == QLatin1String("--keep"))
            keep = true;
        else if (args[i] == QLatin1String("--json"))
            g_json = true;
    }
    QTemporaryDir dir(QDir::currentPath() + QStringLiteral("/bench-XXXXXX"));
    dir.setAutoRemove(!keep);
    // Settings of its own (default backups), never the user's.
    QSettings::setPath(QSettings::NativeFormat, QSettings::UserScope,
                       dir.filePath(QStringLiteral("settings")));
    if (file.isEmpty())
        file = dir.filePath(QStringLiteral("Großbaustelle.vd2"));

    QElapsedTimer t;
    t.start();
    if (!QFile::exists(file) && !generate(file, reports, photos)) {
        std::fprintf(stderr, "could not generate %s\n", qPrintable(file));
        return 1;
    }
    const qint64 size = QFileInfo(file).size();
    out() << QString::asprintf("diary: %s, %.1f MB, %d reports, %d photos (generated in %.1f s)\n",
                               qPrintable(file), size / 1e6, reports, photos, t.elapsed() / 1000.0);
    const QString copy = dir.filePath(QStringLiteral("baseline.vd2"));

    Timings warm, cold;
    for (int r = 0; r < runs; ++r) {
        if (!openAndSave(file, copy, false, r, warm) || !openAndSave(file, copy, true, r, cold))
            return 1;
    }
    if (qEnvironmentVariableIsSet("BENCH_VERBOSE")) {
        for (int i = 0; i < runs; ++i)
            out() << QString::asprintf(
                "  run %d: open %.0f ms (baseline %.0f), save %.0f ms (baseline %.0f); "
                "cold: open %.0f ms (baseline %.0f), save %.0f ms (baseline %.0f)\n",
                i + 1, warm.openOurs[i], warm.openBase[i], warm.saveOurs[i], warm.saveBase[i],
                cold.openOurs[i], cold.openBase[i], cold.saveOurs[i], cold.saveBase[i]);
    }
    const qint64 copyBytes = copyRead(file, copy);
    const qint64 quickCheckBytes = copyBytes + sqlRead(copy, QStringLiteral("PRAGMA quick_check"));
    report("open", warm.openOurs, warm.openBase, warm.readOpen, quickCheckBytes, size);
    report("save", warm.saveOurs, warm.saveBase, warm.readSave, copyBytes, size);
    report("open cold", cold.openOurs, cold.openBase, cold.readOpen, quickCheckBytes, size);
    report("save cold", cold.saveOurs, cold.saveBase, cold.readSave, copyBytes, size);

    copyRead(file, copy);
    const qint64 vacuumBytes = sqlRead(copy, QStringLiteral("VACUUM"));
    QList<double> compactOurs, compactBase;
    qint64 readCompact = 0;
    for (int r = 0; r < runs; ++r) {
        QFile::remove(copy);
        QFile::copy(file, copy);
        settle();
        compactBase << run(QStringLiteral("sqlite3"), {copy, QStringLiteral("VACUUM;")});
        VDRDocument doc;
        bool showError = true;
        if (!doc.openDocument(file, showError)) {
            std::fprintf(stderr, "open failed\n");
            return 1;
        }
        settle();
        const qint64 before = bytesRead();
        t.restart();
        doc.compactDB(false);
        compactOurs << t.nsecsElapsed() / 1e6;
        readCompact = bytesRead() - before;
        doc.closeDocument();
    }
    report("compact", compactOurs, compactBase, readCompact, vacuumBytes, size);

    if (g_json) {
        const QJsonObject json{
            {"file_mb", std::round(size / 1e5) / 10},
            {"runs", runs},
            {"open_ratio", ratio(warm.openOurs, warm.openBase)},
            {"save_ratio", ratio(warm.saveOurs, warm.saveBase)},
            {"compact_ratio", ratio(compactOurs, compactBase)},
            {"open_ratio_cold", ratio(cold.openOurs, cold.openBase)},
            {"save_ratio_cold", ratio(cold.saveOurs, cold.saveBase)},
            {"open_ms", median(warm.openOurs)},
            {"open_baseline_ms", median(warm.openBase)},
            {"save_ms", median(warm.saveOurs)},
            {"save_baseline_ms", median(warm.saveBase)},
            {"compact_ms", median(compactOurs)},
            {"compact_baseline_ms", median(compactBase)},
            {"open_cold_ms", median(cold.openOurs)},
            {"open_cold_baseline_ms", median(cold.openBase)},
            {"save_cold_ms", median(cold.saveOurs)},
            {"save_cold_baseline_ms", median(cold.saveBase)},
        };
        std::printf("%s\n", QJsonDocument(json).toJson(QJsonDocument::Compact).constData());
    }
    QThreadPool::globalInstance()->waitForDone();
    for (const QString& backup :
         QDir(QFileInfo(file).path()).entryList({QFileInfo(file).fileName() + "*.bak"}))
        QFile::remove(QFileInfo(file).dir().filePath(backup));
    return 0;
}
