// Writing the daily reports of a diary as one PDF: 100 reports with every section filled and four
// photos each, against a baseline in the same run that decodes the same photos and draws the same
// texts into a QPdfWriter without any layout.
//
//   bench_pdf [--reports N] [--json] [--keep OUT.pdf]     (default 100 reports; runs offscreen)
//
// --json prints one JSON object on stdout (progress goes to stderr): reports, pages, seconds (the
// printout), baseline_seconds, ratio, peak_rss_mb (peak while printing, generation excluded),
// pdf_mb and baseline_pdf_mb.
#include "bench_fill.h"
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "printing/CVdConfig.h"
#include "printing/CVdPrintoutReport.h"

#include <QElapsedTimer>
#include <QFile>
#include <QFileInfo>
#include <QGuiApplication>
#include <QImage>
#include <QJsonDocument>
#include <QJsonObject>
#include <QPainter>
#include <QPdfWriter>
#include <QProcess>
#include <QRandomGenerator>
#include <QRegularExpression>
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

const QStringList kSubTables = benchSubTables();

// Peak resident memory since the last resetPeak(); the kernel's high-water mark, so that the
// generation before the measured step does not count.
bool resetPeak()
{
    QFile f(QStringLiteral("/proc/self/clear_refs"));
    return f.open(QIODevice::WriteOnly) && f.write("5") == 1;
}

double peakRssMb()
{
    QFile f(QStringLiteral("/proc/self/status"));
    if (f.open(QIODevice::ReadOnly)) {
        const auto m =
            QRegularExpression(QStringLiteral("VmHWM:\\s+(\\d+)")).match(QString::fromLatin1(f.readAll()));
        if (m.hasMatch())
            return m.captured(1).toDouble() / 1024.0;
    }
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    return usage.ru_maxrss / 1024.0;
}

bool exec(QSqlQuery& q, const QString& sql)
{
    if (q.exec(sql))
        return true;
    std::fprintf(stderr, "SQL failed: %s\n%s\n", qPrintable(sql), qPrintable(q.lastError().text()));
    return false;
}

// A camera-sized picture: smooth light and shapes with a little grain, so that it compresses like a
// photo rather than like noise or a flat colour.
bool writePhoto(const QString& path, int width, int height, int seed)
{
    QImage image(width, height, QImage::Format_RGB32);
    QRandomGenerator random(seed);
    for (int y = 0; y < height; ++y) {
        auto* line = reinterpret_cast<quint32*>(image.scanLine(y));
        for (int x = 0; x < width; ++x) {
            const int grain = int(random.generate() % 17) - 8;
            const int r = qBound(0, 90 + 120 * x / width + grain, 255);
            const int g = qBound(0, 140 - 60 * y / height + ((x / 97 + y / 61 + seed) % 5) * 12 + grain, 255);
            const int b = qBound(0, 60 + 150 * y / height + grain, 255);
            line[x] = qRgb(r, g, b);
        }
    }
    return image.save(path, "JPG", 92);
}

QStringList columns(QSqlDatabase db, const QString& table)
{
    QStringList names;
    QSqlQuery info(db);
    info.exec(QStringLiteral("PRAGMA table_info(%1)").arg(table));
    while (info.next())
        names << info.value(1).toString();
    return names;
}

// Every text, date, time and number column of a sub-table row gets a value, so that every section
// prints its rows.
bool fillRows(QSqlDatabase db, const QString& table, int entryId)
{
    QSqlQuery info(db);
    info.exec(QStringLiteral("PRAGMA table_info(%1)").arg(table));
    QStringList sets;
    while (info.next()) {
        const QString name = info.value(1).toString();
        const QString type = info.value(2).toString().toUpper();
        if (QStringList{"id", "entry_id", "pos", "type", "company_id"}.contains(name))
            continue;
        if (type.startsWith(QLatin1String("DATE")))
            sets << QStringLiteral("%1 = '2025-03-1' || (id % 10)").arg(name);
        else if (type == QLatin1String("TIME"))
            sets << QStringLiteral("%1 = '0' || (7 + id % 3) || ':30:00'").arg(name);
        else if (type == QLatin1String("REAL") || type == QLatin1String("INTEGER"))
            sets << QStringLiteral("%1 = 2 + id % 5").arg(name);
        else
            sets << QStringLiteral("%1 = 'Beispiel %1 ' || id || ' mit etwas Text, wie ihn eine Baustelle "
                                   "schreibt'")
                        .arg(name);
    }
    QSqlQuery q(db);
    return exec(q, QStringLiteral("UPDATE %1 SET %2, company_id = 900001 WHERE entry_id = %3")
                       .arg(table, sets.join(QStringLiteral(", ")))
                       .arg(entryId));
}

// One report filled through the document's own operations and SQL, copied with SQL to 'reports',
// four photos each stored through the image store (each report its own picture rows).
bool generate(VDRDocument& doc, int reports, const QString& folder)
{
    QSqlDatabase db = doc.database();
    const int id = doc.modelEntryAll()->data(0, QStringLiteral("id"), Qt::EditRole).toInt();
    fillEveryList(doc, id);
    QSqlQuery q(db);
    bool ok = exec(q, QStringLiteral("INSERT INTO company (id, category, type, firstname, lastname, company, "
                                     "street, plz, city, telephone, telefax, mobile, email, pos) VALUES "
                                     "(900001, 1, 'Rohbau', 'Erika', 'Muster', 'Muster Bau GmbH', "
                                     "'Hauptstraße 1', '12345', 'Musterstadt', ' ', ' ', ' ', ' ', 0)"));
    for (const QString& table : kSubTables)
        ok &= fillRows(db, table, id);
    const QString paragraph =
        QStringLiteral("<p>Decke über EG betoniert, Schalung OG begonnen. Bewehrung der Stützen abgenommen, "
                       "<b>Gerüst</b> an der Nordseite ergänzt.</p>");
    ok &= exec(
        q, QStringLiteral("UPDATE entry SET env_weather1 = 'heiter', env_weather2 = 'windig', "
                          "env_temperature = '14', env_humidity = '60', env_time = '07:30:00', "
                          "progress = '%1', special_incidents = '%1', interventions = '%1', tests = '%1', "
                          "notice = '%1', print_notice = 1, print_telephone_notice = 1, "
                          "construction_material_sample = 1 WHERE id = %2")
               .arg(paragraph + paragraph)
               .arg(id));

    // Four pictures as the image store keeps them: camera-sized JPEG files through createImage.
    QList<int> prototypes;
    const QList<QSize> sizes{{3000, 2000}, {3000, 2000}, {2000, 3000}, {3000, 2000}};
    for (int p = 0; p < sizes.size(); ++p) {
        const QString path = folder + QStringLiteral("/photo%1.jpg").arg(p);
        if (!writePhoto(path, sizes[p].width(), sizes[p].height(), p + 3))
            return false;
        prototypes << doc.createImage(path);
        ok &= prototypes.last() > 0;
    }

    ok &= exec(q, QStringLiteral("BEGIN"));
    ok &= exec(q, QStringLiteral("CREATE TEMP TABLE seq AS WITH RECURSIVE s(k) AS (SELECT 1 UNION ALL SELECT "
                                 "k + 1 FROM s WHERE k < %1) SELECT k FROM s")
                      .arg(reports - 1));
    const QStringList entryCols = columns(db, QStringLiteral("entry"));
    QStringList select = entryCols;
    select.replaceInStrings(QRegularExpression(QStringLiteral("^id$")), QStringLiteral("id + k"));
    select.replaceInStrings(QRegularExpression(QStringLiteral("^number$")),
                            QStringLiteral("printf('%04d (Entwurf)', id + k)"));
    select.replaceInStrings(QRegularExpression(QStringLiteral("^inspection_date$")),
                            QStringLiteral("date('2025-01-01', '+' || k || ' days')"));
    ok &= exec(q, QStringLiteral("INSERT INTO entry (%1) SELECT %2 FROM entry, seq WHERE id = %3")
                      .arg(entryCols.join(','), select.join(','))
                      .arg(id));
    for (const QString& table : kSubTables) {
        const QStringList cols = columns(db, table);
        QStringList sel = cols;
        sel.replaceInStrings(QRegularExpression(QStringLiteral("^id$")), QStringLiteral("id + k * 1000"));
        sel.replaceInStrings(QRegularExpression(QStringLiteral("^entry_id$")),
                             QStringLiteral("entry_id + k"));
        ok &= exec(q, QStringLiteral("INSERT INTO %1 (%2) SELECT %3 FROM %1, seq WHERE entry_id = %4")
                          .arg(table, cols.join(','), sel.join(','))
                          .arg(id));
    }
    ok &= exec(q, QStringLiteral("DROP TABLE seq"));
    // Types 1, 1, 2, 4: three albums, a page of two landscapes, a portrait and a landscape.
    const int types[4] = {1, 1, 2, 4};
    QSqlQuery copy(db), photo(db);
    copy.prepare(QStringLiteral("INSERT INTO image (image, image_ct, image_width, image_height, thumbnail, "
                                "thumbnail_ct, thumbnail_width, thumbnail_height) SELECT image, image_ct, "
                                "image_width, image_height, thumbnail, thumbnail_ct, thumbnail_width, "
                                "thumbnail_height FROM image WHERE id = ?"));
    photo.prepare(
        QStringLiteral("INSERT INTO entry_photo (entry_id, pos, type, photo_image_id, caption, "
                       "comment, company_id, date) VALUES (?, ?, ?, ?, ?, ' ', 900001, '2025-03-14')"));
    for (int r = 0; r < reports && ok; ++r) {
        for (int p = 0; p < 4 && ok; ++p) {
            int imageId = prototypes[p];
            if (r > 0) {
                copy.addBindValue(prototypes[p]);
                ok &= copy.exec();
                imageId = copy.lastInsertId().toInt();
            }
            photo.addBindValue(id + r);
            photo.addBindValue(p);
            photo.addBindValue(types[p]);
            photo.addBindValue(imageId);
            photo.addBindValue(QStringLiteral("Ansicht %1 der Baustelle").arg(p + 1));
            ok &= photo.exec();
        }
    }
    ok &= exec(q, QStringLiteral("COMMIT"));
    doc.modelEntryAll()->select();
    doc.modelEntryAll()->fetch_all();
    return ok && doc.modelEntryAll()->rowCount() == reports;
}

// The baseline: every report's texts read with plain SQL and drawn line after line, every photo
// decoded and drawn two to a page, into a QPdfWriter at the printout's resolution.
double baseline(QSqlDatabase db, const QList<int>& ids, const QString& path)
{
    QElapsedTimer timer;
    timer.start();
    QPdfWriter writer(path);
    writer.setPageSize(QPageSize(QPageSize::A4));
    writer.setResolution(150);
    QPainter painter(&writer);
    painter.setRenderHints(QPainter::Antialiasing | QPainter::TextAntialiasing);
    painter.setFont(CVdConfig::self()->printout_default_contents_font());
    const int line = painter.fontMetrics().height();
    const QRect page = painter.viewport();
    bool firstPage = true;
    const auto newPage = [&] {
        if (!firstPage)
            writer.newPage();
        firstPage = false;
    };
    for (const int id : ids) {
        newPage();
        int y = line;
        const auto draw = [&](const QString& text) {
            if (text.trimmed().isEmpty())
                return;
            if (y + line > page.height()) {
                writer.newPage();
                y = line;
            }
            painter.drawText(0, y, text.simplified());
            y += line;
        };
        QSqlQuery q(db);
        q.exec(QStringLiteral("SELECT * FROM entry WHERE id = %1").arg(id));
        if (q.next())
            for (int i = 0; i < q.record().count(); ++i)
                draw(q.value(i).toString().remove(QRegularExpression(QStringLiteral("<[^>]*>"))));
        for (const QString& table : kSubTables) {
            q.exec(QStringLiteral("SELECT * FROM %1 WHERE entry_id = %2 ORDER BY pos").arg(table).arg(id));
            while (q.next()) {
                QStringList values;
                for (int i = 0; i < q.record().count(); ++i)
                    values << q.value(i).toString();
                draw(values.join(QStringLiteral(" - ")));
            }
        }
        q.exec(QStringLiteral("SELECT i.image, p.caption FROM entry_photo p JOIN image i ON "
                              "i.id = p.photo_image_id WHERE p.entry_id = %1 ORDER BY p.type, p.pos")
                   .arg(id));
        int n = 0;
        while (q.next()) {
            if (n++ % 2 == 0) {
                writer.newPage();
                y = line;
            }
            const QImage image = QImage::fromData(q.value(0).toByteArray());
            const QRect box(0, y, page.width(), page.height() / 2 - 3 * line);
            painter.drawImage(QRect(box.topLeft(), image.size().scaled(box.size(), Qt::KeepAspectRatio)),
                              image);
            y += box.height() + line;
            draw(q.value(1).toString());
            y += line;
        }
    }
    painter.end();
    return timer.nsecsElapsed() / 1e9;
}

int pdfPages(const QString& pdf)
{
    QProcess info;
    info.start(QStringLiteral("pdfinfo"), {pdf});
    if (info.waitForFinished(60000)) {
        const auto m = QRegularExpression(QStringLiteral("Pages:\\s+(\\d+)"))
                           .match(QString::fromLatin1(info.readAllStandardOutput()));
        if (m.hasMatch())
            return m.captured(1).toInt();
    }
    return -1;
}
} // namespace

int main(int argc, char* argv[])
{
    qputenv("QT_QPA_PLATFORM",
            qgetenv("QT_QPA_PLATFORM").isEmpty() ? "offscreen" : qgetenv("QT_QPA_PLATFORM"));
    QGuiApplication app(argc, argv);
    QStandardPaths::setTestModeEnabled(true);
    QCoreApplication::setOrganizationName(QStringLiteral("Korvant - Software Bench"));
    QCoreApplication::setApplicationName(QStringLiteral("VardunaBench"));
    int reports = 100;
    QString keep;
    const QStringList args = app.arguments();
    for (int i = 1; i < args.size(); ++i) {
        if (args[i] == QLatin1String("--json"))
            g_json = true;
        else if (args[i] == QLatin1String("--reports") && i + 1 < args.size())
            reports = qMax(1, args[++i].toInt());
        else if (args[i] == QLatin1String("--keep") && i + 1 < args.size())
            keep = args[++i];
    }
    QTemporaryDir dir;
    qputenv("TMPDIR", QFile::encodeName(dir.path()));
    CVdConfig::self()->reload();

    VDRDocument doc;
    std::fprintf(out(), "generating a diary of %d reports with 4 photos each ...\n", reports);
    if (!doc.createDocument(true) || !generate(doc, reports, dir.path())) {
        std::fprintf(stderr, "could not generate the diary\n");
        return 2;
    }
    QList<int> ids;
    QSqlQuery q(doc.database());
    q.exec(QStringLiteral("SELECT id FROM entry ORDER BY id"));
    while (q.next())
        ids << q.value(0).toInt();

    // The printout first, so that its peak is its own.
    const QString pdf = dir.filePath(QStringLiteral("Berichte.pdf"));
    const bool peakReset = resetPeak();
    QElapsedTimer timer;
    timer.start();
    {
        CVdPrintoutReport printout(nullptr, ids);
        if (!printout.print(CVdPrintout::Pdf, pdf, false, QString())) {
            std::fprintf(stderr, "the printout failed\n");
            return 2;
        }
    }
    const double seconds = timer.nsecsElapsed() / 1e9;
    const double rss = peakRssMb();
    const QString basePdf = dir.filePath(QStringLiteral("Baseline.pdf"));
    const double base = baseline(doc.database(), ids, basePdf);
    const int pages = pdfPages(pdf);
    const double ratio = seconds / base;
    std::fprintf(out(),
                 "printout %.2f s (%d pages, %.1f MB), baseline %.2f s (%.1f MB), ratio %.2f (goal <= 1.5), "
                 "peak %.0f MB%s (goal <= 400)\n",
                 seconds, pages, QFileInfo(pdf).size() / 1048576.0, base,
                 QFileInfo(basePdf).size() / 1048576.0, ratio, rss, peakReset ? "" : " (whole run)");
    if (g_json) {
        QJsonObject o;
        o.insert(QStringLiteral("reports"), reports);
        o.insert(QStringLiteral("pages"), pages);
        o.insert(QStringLiteral("seconds"), seconds);
        o.insert(QStringLiteral("baseline_seconds"), base);
        o.insert(QStringLiteral("ratio"), ratio);
        o.insert(QStringLiteral("peak_rss_mb"), rss);
        o.insert(QStringLiteral("pdf_mb"), QFileInfo(pdf).size() / 1048576.0);
        o.insert(QStringLiteral("baseline_pdf_mb"), QFileInfo(basePdf).size() / 1048576.0);
        std::fputs(QJsonDocument(o).toJson(QJsonDocument::Compact).constData(), stdout);
        std::fputs("\n", stdout);
    }
    if (!keep.isEmpty() && !(QFile::remove(keep), QFile::copy(pdf, keep)))
        std::fprintf(stderr, "could not keep the PDF as %s\n", qPrintable(keep));
    doc.closeDocument();
    return 0;
}
