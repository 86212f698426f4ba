// varduna-cli: the program's own operations without a window.
#include "cli/VDRCliCompanies.h"
#include "cli/VDRCliPrompt.h"
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDiaryCheck.h"
#include "document/VDRDocument.h"
#include "document/VDRFileOps.h"
#include "printing/CVdConfig.h"
#include "printing/CVdPrintoutReport.h"
#include "printing/VDRPrintHooks.h"
#include "sync/VDRMasterDataExport.h"
#include "sync/VDRReportSynchronisation.h"

#include <QCoreApplication>
#include <QDate>
#include <QDir>
#include <QFileInfo>
#include <QGuiApplication>
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>
#include <QLocale>
#include <QRegularExpression>
#include <QSettings>
#include <QTextStream>

#include <algorithm>
#include <cstdio>
#include <memory>
#include <numeric>

namespace {

enum ExitCode
{
    ExitOk = 0,
    ExitUsage = 1,
    ExitRefused = 2,
};

// Exit codes of 'check'.
enum CheckExit
{
    CheckOpenable = 0,
    CheckMissing = 2,
    CheckDamaged = 3,
    CheckHeld = 4,
    CheckNewer = 5,
    CheckRefused = 6,
};

const char* const kHelp =
    "Usage: varduna-cli COMMAND FILE [options]\n"
    "\n"
    "Runs Varduna's own operations on a diary (.vd2) without a window, with the same\n"
    "locking as the application: a diary held by a running instance is refused.\n"
    "Messages go to stderr as \"Title: text\", results to stdout.\n"
    "\n"
    "Commands:\n"
    "  new FILE            Create a new diary and write it to FILE (an existing FILE is refused).\n"
    "  info FILE [--json]  Open FILE as the application does (working copy, lock, upgrades),\n"
    "                      print the project name, the structure version it was opened with and\n"
    "                      one line per report (number with author, date, locked), then close\n"
    "                      without saving.\n"
    "  check FILE          Read-only: integrity, structure version, working copy and its holder,\n"
    "                      backups, and whether opening would succeed (tried on private copies).\n"
    "                      Touches nothing.\n"
    "  save FILE           Open FILE as the application does (upgrading an older structure after\n"
    "                      its question) and save it over itself, turning the previous file into\n"
    "                      the newest backup (one backup generation per run).\n"
    "  restore FILE        Replace a damaged diary by its newest intact backup; the damaged file\n"
    "                      is kept under its ERROR name, which is printed.\n"
    "  compact FILE        Remove unreferenced images, rebuild the database and save; prints the\n"
    "                      size before and after in bytes.\n"
    "  companies FILE [--json]  Print the two company lists (persons, then companies) in\n"
    "                      their order: id and each company in the company and the person\n"
    "                      output format, frozen copies of locked reports marked; --json adds\n"
    "                      every field. Opens FILE as info does; exit codes as info.\n"
    "  import FILE EXCHANGE.vdx... [--delete]\n"
    "                      Import the reports (and newer master data) of the mobile app's exchange\n"
    "                      files, in the order given, and save the diary. The summary goes to\n"
    "                      stdout. With --delete, the files that were imported are deleted after\n"
    "                      the diary was saved; refused files always stay.\n"
    "  export-masterdata FILE OUT.mdd\n"
    "                      Write the master-data file for the mobile app (project data, companies,\n"
    "                      locked reports). FILE is only read.\n"
    "  pdf FILE [--reports all|locked|drafts|NUMBER|FROM-TO] [-o OUT.pdf]\n"
    "                      Print the chosen reports (default: all, in number order) into one PDF,\n"
    "                      each report with its own page numbers. NUMBER and FROM-TO select by\n"
    "                      report number (12 takes 12a and 12b too). Without -o the PDF goes\n"
    "                      into the diary's folder as \"PROJECT - Bericht NUMBER.pdf\" for one\n"
    "                      report, \"PROJECT - Berichte.pdf\" for several; an existing file there\n"
    "                      is replaced. Prints the path written. Opens FILE as info does and\n"
    "                      saves nothing.\n"
    "  preview FILE --out DIR [--reports all|locked|drafts|NUMBER|FROM-TO]\n"
    "                      Write the print preview's page images of the chosen reports (as for\n"
    "                      pdf) into DIR as picture_0001.jpeg and on, one per page, replacing\n"
    "                      older ones of those names; DIR is created when missing. Prints the\n"
    "                      paths written. Opens FILE as info does and saves nothing.\n"
    "  follow-up FILE NEW.vd2\n"
    "                      Start a follow-up diary NEW.vd2 with FILE's project data, companies and\n"
    "                      address lists, knowing FILE's report numbers, with one first report;\n"
    "                      FILE records where its master data went and is saved. An existing\n"
    "                      NEW.vd2 is refused.\n"
    "\n"
    "Options:\n"
    "  --yes               Answer questions with their affirmative default (without it every\n"
    "                      question takes its cancelling choice).\n"
    "  --json              Machine-readable output (info, check, companies).\n"
    "  -h, --help          This text.\n"
    "\n"
    "Set VARDUNA_DEBUG=1 to see the program's debug log on stderr.\n"
    "\n"
    "Exit codes of new, info, save and compact:\n"
    "  0  done\n"
    "  1  usage error\n"
    "  2  refused or failed (the message on stderr says why)\n"
    "  3  not saved: a question was answered with its cancelling choice (try --yes),\n"
    "     or the file cannot be saved (demo project, no write permission)\n"
    "\n"
    "Exit codes of import:\n"
    "  0  every file imported, diary saved\n"
    "  1  usage error\n"
    "  2  the diary could not be opened or saved\n"
    "  3  not saved: a question was answered with its cancelling choice (try --yes)\n"
    "  4  some files were refused or not fully imported (the message on stderr says why);\n"
    "     what was imported is saved\n"
    "\n"
    "Exit codes of export-masterdata and follow-up:\n"
    "  0  written\n"
    "  1  usage error\n"
    "  2  refused or failed (the message on stderr says why)\n"
    "  3  cancelled: a question was answered with its cancelling choice (try --yes)\n"
    "\n"
    "Exit codes of pdf and preview:\n"
    "  0  written\n"
    "  1  usage error\n"
    "  2  refused or failed: the diary cannot be opened (held by a running instance),\n"
    "     the PDF or a page image cannot be written, or no report matches --reports\n"
    "\n"
    "Exit codes of restore:\n"
    "  0  restored\n"
    "  1  usage error\n"
    "  2  failed or refused (missing file, held by a running instance)\n"
    "  3  no intact backup found\n"
    "  4  nothing to do: the diary is intact\n"
    "\n"
    "Exit codes of check:\n"
    "  0  can be opened\n"
    "  1  usage error\n"
    "  2  missing (no such file, or not a file)\n"
    "  3  damaged (failed integrity check, or not a diary)\n"
    "  4  held by a running instance\n"
    "  5  made by a newer program version\n"
    "  6  opening would refuse it for another reason (printed as Reason:), for example a\n"
    "     missing table, or a folder where the working copy cannot be created\n";

QTextStream& out()
{
    static QTextStream stream(stdout);
    stream.setCodec("UTF-8");
    return stream;
}

void err(const QString& text)
{
    std::fprintf(stderr, "%s\n", text.toLocal8Bit().constData());
}

int cmdNew(const QString& file)
{
    if (QFileInfo::exists(file)) {
        VDRPrompt::critical(
            QObject::tr("Dateifehler"),
            QObject::tr("Die Datei\n%1\nexistiert bereits.").arg(QFileInfo(file).absoluteFilePath()));
        return ExitRefused;
    }
    VDRDocument doc;
    if (!doc.createDocument(true))
        return ExitRefused;
    // Documents of an earlier diary of this name do not belong to the new one.
    const QString documents = VDRDocument::documentsDbPathFor(QFileInfo(file).absoluteFilePath());
    if (QFileInfo::exists(documents) && !VDRFileOps::removeDatabase(documents)) {
        VDRPrompt::critical(QObject::tr("Dateifehler"),
                            VDRFileOps::withReason(QObject::tr("Löschen der Datei\n%1\n fehlgeschlagen.")
                                                       .arg(QDir::toNativeSeparators(documents))));
        doc.closeDocument();
        return ExitRefused;
    }
    const bool written = doc.writeWorkingCopyTo(QFileInfo(file).absoluteFilePath());
    doc.closeDocument();
    if (!written) {
        VDRPrompt::critical(
            QObject::tr("Dateifehler"),
            VDRFileOps::withReason(QObject::tr("Kopieren der Datei\n%1\n fehlgeschlagen.").arg(file)));
        return ExitRefused;
    }
    out() << QFileInfo(file).absoluteFilePath() << "\n";
    return ExitOk;
}

bool openForCommand(VDRDocument& doc, const QString& file)
{
    bool showError = true;
    if (doc.openDocument(file, showError))
        return true;
    if (showError)
        VDRPrompt::critical(QObject::tr("Fehler"),
                            QObject::tr("Beim Öffnen des gewählten Dokuments ist ein Fehler aufgetreten!"));
    return false;
}

int cmdCompanies(const QString& file, bool json)
{
    VDRDocument doc;
    // Looking must not change anything: a crashed session's working copy stays for its owner.
    doc.setInspecting(true);
    if (!openForCommand(doc, file))
        return ExitRefused;
    const int result = cliListCompanies(doc, json, out());
    doc.closeDocument();
    return result;
}

int cmdInfo(const QString& file, bool json)
{
    VDRDocument doc;
    // Looking must not change anything: a crashed session's working copy stays for its owner.
    doc.setInspecting(true);
    if (!openForCommand(doc, file))
        return ExitRefused;
    VDRAllEntryTableModel* entries = doc.modelEntryAll();
    entries->fetch_all();
    QVector<int> rows(entries->rowCount());
    std::iota(rows.begin(), rows.end(), 0);
    std::stable_sort(rows.begin(), rows.end(), [&](int a, int b) {
        const int na = doc.entryNumberInt(a), nb = doc.entryNumberInt(b);
        return na != nb ? na < nb : doc.entryNumberLetter(a) < doc.entryNumberLetter(b);
    });

    if (json) {
        QJsonArray reports;
        for (int row : rows) {
            QJsonObject r;
            r.insert(QStringLiteral("number"), doc.entryNumberWithUserId(row));
            r.insert(QStringLiteral("date"),
                     entries->data(row, QStringLiteral("inspection_date"), Qt::EditRole)
                         .toDate()
                         .toString(Qt::ISODate));
            r.insert(QStringLiteral("locked"),
                     entries->data(row, QStringLiteral("locked"), Qt::EditRole).toInt() != 0);
            reports.append(r);
        }
        QJsonObject o;
        o.insert(QStringLiteral("project"), doc.projectName());
        o.insert(QStringLiteral("fileVersion"), doc.fileVersion());
        o.insert(QStringLiteral("structureExtended"), doc.isStructureExtended());
        o.insert(QStringLiteral("demo"), doc.isDemoProject());
        o.insert(QStringLiteral("reports"), reports);
        out() << QJsonDocument(o).toJson(QJsonDocument::Indented);
    } else {
        out() << "Projekt: " << doc.projectName() << "\n";
        out() << "Dateiversion: " << doc.fileVersion() << "\n";
        out() << "Bauberichte: " << rows.size() << "\n";
        for (int row : rows) {
            const bool locked = entries->data(row, QStringLiteral("locked"), Qt::EditRole).toInt() != 0;
            out() << doc.entryNumberWithUserId(row) << "\t"
                  << entries->data(row, QStringLiteral("inspection_date"), Qt::EditRole)
                         .toDate()
                         .toString(QStringLiteral("dd.MM.yyyy"))
                  << "\t" << (locked ? "gesperrt" : "offen") << "\n";
        }
    }
    out().flush();
    doc.closeDocument();
    return ExitOk;
}

int cmdSave(const QString& file)
{
    VDRDocument doc;
    if (!openForCommand(doc, file))
        return ExitRefused;
    const int shown = VDRPrompt::messagesShown();
    const int result = doc.saveDocument(QString());
    if (result == 2 && VDRPrompt::messagesShown() == shown)
        VDRPrompt::critical(QObject::tr("Fehler"),
                            QObject::tr("Beim Speichern des Dokuments ist ein Fehler aufgetreten!"));
    doc.closeDocument();
    if (result == 0)
        out() << QFileInfo(file).absoluteFilePath() << "\n";
    return result == 0 ? ExitOk : result == 1 ? 3 : ExitRefused;
}

int cmdCompact(const QString& file)
{
    VDRDocument doc;
    if (!openForCommand(doc, file))
        return ExitRefused;
    const int result = doc.compactDB(true);
    if (result == 0)
        out() << "Vorher: " << doc.lastCompactionSizeBefore()
              << " Bytes\nNachher: " << doc.lastCompactionSizeAfter() << " Bytes\n";
    doc.closeDocument();
    return result == 0 ? ExitOk : result == 1 ? 3 : ExitRefused;
}

int cmdRestore(const QString& file)
{
    const QString title = QObject::tr("Backup wiederherstellen");
    const QFileInfo fi(file);
    if (!fi.isFile()) {
        VDRPrompt::critical(
            QObject::tr("Dateifehler"),
            QObject::tr("Die Datei\n%1\nexistiert nicht.").arg(QDir::toNativeSeparators(file)));
        return ExitRefused;
    }
    const VDRDiaryCheck::Result r = VDRDiaryCheck::inspect(file);
    if (r.status == VDRDiaryCheck::Held) {
        VDRPrompt::warning(QObject::tr("Datenbank in Bearbeitung"),
                           QObject::tr("Die Datei konnte nicht geöffnet werden, da sie in Bearbeitung ist."));
        return ExitRefused;
    }
    if (r.status != VDRDiaryCheck::Damaged) {
        VDRPrompt::information(
            title, QObject::tr("Die Datei %1 ist nicht beschädigt.").arg(QDir::toNativeSeparators(file)));
        return 4;
    }
    int count = 0;
    const QString backup = VDRDocument::getBackupFile4Restore(fi.absoluteFilePath(), count);
    if (backup.isEmpty()) {
        VDRPrompt::critical(title,
                            QObject::tr("Die Datei konnte nicht wiederhegestellt werden.\n") +
                                (count > 0 ? QObject::tr("Die Backup-Dateien sind ebenfalls beschädigt.")
                                           : QObject::tr("Es existieren keine Backup-Dateien.")));
        return 3;
    }
    QString newName;
    QString error;
    if (!VDRDocument::restoreBackupFile(fi.absoluteFilePath(), backup, newName, error)) {
        VDRPrompt::critical(title, QObject::tr("Die Datei konnte nicht wiederhegestellt werden.\n") + error);
        return ExitRefused;
    }
    out() << newName << "\n";
    out().flush();
    return ExitOk;
}

int cmdCheck(const QString& file, bool json)
{
    const VDRDiaryCheck::Result r = VDRDiaryCheck::inspect(file);
    static const char* const statusNames[] = {
        "can be opened",           "missing",         "damaged", "held by a running instance",
        "made by a newer version", "cannot be opened"};
    static const int exitCodes[] = {CheckOpenable, CheckMissing, CheckDamaged,
                                    CheckHeld,     CheckNewer,   CheckRefused};
    if (json) {
        QJsonObject o;
        o.insert(QStringLiteral("status"), QLatin1String(statusNames[r.status]));
        o.insert(QStringLiteral("integrity"), r.integrity);
        o.insert(QStringLiteral("fileVersion"), r.version);
        o.insert(QStringLiteral("workingCopy"), r.workingCopyExists);
        o.insert(QStringLiteral("held"), r.workingCopyHeld);
        if (r.lockInfo.size() >= 4) {
            QJsonObject holder;
            holder.insert(QStringLiteral("user"), r.lockInfo[0]);
            holder.insert(QStringLiteral("computer"), r.lockInfo[1]);
            holder.insert(QStringLiteral("date"), r.lockInfo[2]);
            holder.insert(QStringLiteral("time"), r.lockInfo[3]);
            o.insert(QStringLiteral("lockInfo"), holder);
        }
        o.insert(QStringLiteral("backups"), QJsonArray::fromStringList(r.backups));
        if (!r.reason.isEmpty())
            o.insert(QStringLiteral("reason"), r.reason);
        out() << QJsonDocument(o).toJson(QJsonDocument::Indented);
        out().flush();
        return exitCodes[r.status];
    }
    out() << "Status: " << statusNames[r.status] << "\n";
    if (r.status == VDRDiaryCheck::Missing) {
        out().flush();
        return exitCodes[r.status];
    }
    out() << "Integrity: " << r.integrity << "\n";
    if (!r.reason.isEmpty())
        out() << "Reason: " << QString(r.reason).replace(QLatin1Char('\n'), QLatin1Char(' ')) << "\n";
    out() << "Dateiversion: " << (r.version.isEmpty() ? QStringLiteral("-") : r.version) << "\n";
    out() << "Working copy: "
          << (r.workingCopyExists ? (r.workingCopyHeld ? "held" : "present, not held") : "none") << "\n";
    if (r.workingCopyExists) {
        if (r.lockInfo.size() >= 4)
            out() << "Lock: User: " << r.lockInfo[0] << ", Computer: " << r.lockInfo[1] << ", seit dem "
                  << VDRDocument::lockDateText(r.lockInfo[2]) << " " << r.lockInfo[3] << " Uhr\n";
        else
            out() << "Lock: no lock information\n";
    }
    out() << "Backups: " << r.backups.size() << "\n";
    for (const QString& b : r.backups)
        out() << "  " << b << "\n";
    out().flush();
    return exitCodes[r.status];
}

int cmdImport(const QString& file, const QStringList& exchangeFiles, bool deleteImported)
{
    VDRDocument doc;
    if (!openForCommand(doc, file))
        return ExitRefused;
    QStringList paths;
    for (const QString& path : exchangeFiles)
        paths << QFileInfo(path).absoluteFilePath();
    VDRReportSynchronisation sync(&doc);
    sync.setShowSummary(false);
    bool projectDataChanged = false;
    // Files are deleted only once the diary holding their reports is saved.
    const int failed = sync.importReportExchangeFiles(paths, false, projectDataChanged);
    out() << sync.lastSummary();
    out().flush();
    int result = 0;
    if (!sync.importedFiles().isEmpty() || doc.isStateModified()) {
        const int shown = VDRPrompt::messagesShown();
        result = doc.saveDocument(QString());
        if (result == 2 && VDRPrompt::messagesShown() == shown)
            VDRPrompt::critical(QObject::tr("Fehler"),
                                QObject::tr("Beim Speichern des Dokuments ist ein Fehler aufgetreten!"));
    }
    doc.closeDocument();
    if (result != 0)
        return result == 1 ? 3 : ExitRefused;
    if (deleteImported) {
        for (const QString& path : sync.importedFiles()) {
            if (!VDRFileOps::remove(path))
                VDRPrompt::warning(
                    QObject::tr("Dateifehler"),
                    QObject::tr("Die importierte Austauschdatei\n%1\nkonnte nicht gelöscht werden.\n"
                                "Bitte löschen Sie diese Datei manuell.")
                        .arg(path));
        }
    }
    return failed > 0 ? 4 : ExitOk;
}

int cmdExportMasterData(const QString& file, const QString& target)
{
    VDRDocument doc;
    // Reading only: the diary and anything beside it stay as they are.
    doc.setInspecting(true);
    if (!openForCommand(doc, file))
        return ExitRefused;
    const bool ok = VDRMasterDataExport::writeMasterDataFile(&doc, QFileInfo(target).absoluteFilePath());
    doc.closeDocument();
    if (!ok)
        return ExitRefused;
    out() << QFileInfo(target).absoluteFilePath() << "\n";
    return ExitOk;
}

int cmdFollowUp(const QString& file, const QString& target)
{
    if (QFileInfo::exists(target)) {
        VDRPrompt::critical(
            QObject::tr("Dateifehler"),
            QObject::tr("Die Datei\n%1\nexistiert bereits.").arg(QFileInfo(target).absoluteFilePath()));
        return ExitRefused;
    }
    VDRDocument doc;
    if (!openForCommand(doc, file))
        return ExitRefused;
    bool exported = false;
    QString exportedTo;
    VDRMasterDataExport::check4ExportedMasterData(&doc, exported, exportedTo);
    if (exported && VDRPrompt::instance()->question(
                        VDRPrompt::Question, QObject::tr("Hinweis"),
                        QObject::tr("Die Stammdaten dieser Datei wurden bereits exportiert nach "
                                    "%0.\nExport der Stammdaten fortsetzen?")
                            .arg(exportedTo),
                        VDRPrompt::Yes | VDRPrompt::No, VDRPrompt::Yes, VDRPrompt::No) != VDRPrompt::Yes) {
        doc.closeDocument();
        return 3;
    }
    int result = VDRMasterDataExport::createFollowUpDiary(&doc, target);
    if (result == 0)
        result = doc.saveDocument(QString()) == 0 ? 0 : 2;
    doc.closeDocument();
    if (result != 0)
        return result == 1 ? ExitRefused : ExitRefused;
    out() << QFileInfo(target).absoluteFilePath() << "\n";
    return ExitOk;
}

// The reports of a --reports choice in number order; false for a choice that is not understood.
bool chooseReports(VDRDocument& doc, const QString& choice, QList<int>& ids, QStringList& numbers)
{
    int from = 0, to = 0;
    enum
    {
        All,
        Locked,
        Drafts,
        Range
    } mode = All;
    if (choice == QLatin1String("locked")) {
        mode = Locked;
    } else if (choice == QLatin1String("drafts")) {
        mode = Drafts;
    } else if (choice != QLatin1String("all")) {
        const QRegularExpression range(QStringLiteral("^(\\d+)(?:-(\\d+))?$"));
        const auto m = range.match(choice);
        if (!m.hasMatch())
            return false;
        mode = Range;
        from = m.captured(1).toInt();
        to = m.captured(2).isEmpty() ? from : m.captured(2).toInt();
    }
    VDRAllEntryTableModel* entries = doc.modelEntryAll();
    entries->fetch_all();
    QVector<int> rows(entries->rowCount());
    std::iota(rows.begin(), rows.end(), 0);
    std::stable_sort(rows.begin(), rows.end(), [&](int a, int b) {
        const int na = doc.entryNumberInt(a), nb = doc.entryNumberInt(b);
        return na != nb ? na < nb : doc.entryNumberLetter(a) < doc.entryNumberLetter(b);
    });
    for (int row : rows) {
        const bool locked = entries->data(row, QStringLiteral("locked"), Qt::EditRole).toInt() != 0;
        const int number = doc.entryNumberInt(row);
        if ((mode == Locked && !locked) || (mode == Drafts && locked) ||
            (mode == Range && (number < from || number > to)))
            continue;
        ids << entries->data(row, QStringLiteral("id"), Qt::EditRole).toInt();
        numbers << doc.entryNumberWithUserId(row);
    }
    return true;
}

// Dates in the language the application would print them in; the setting is only read.
void usePrintingLanguage()
{
    QLocale::Language systemLanguage = QLocale::system().language();
    if (systemLanguage != QLocale::English && systemLanguage != QLocale::Spanish)
        systemLanguage = QLocale::German;
    QLocale::setDefault(QLocale(
        QLocale::Language(QSettings().value(QStringLiteral("language"), int(systemLanguage)).toInt())));
    CVdConfig::self()->reload();
}

// Opens FILE for reading only and picks the reports to print; an exit code when that fails.
int openForPrinting(VDRDocument& doc, const QString& file, const QString& choice, QList<int>& ids,
                    QStringList& numbers)
{
    // Printing reads only: a crashed session's working copy stays for its owner, nothing is saved.
    doc.setInspecting(true);
    if (!openForCommand(doc, file))
        return ExitRefused;
    if (!chooseReports(doc, choice, ids, numbers)) {
        doc.closeDocument();
        err(QStringLiteral("varduna-cli: --reports takes all, locked, drafts, NUMBER or FROM-TO"));
        return ExitUsage;
    }
    if (ids.isEmpty()) {
        doc.closeDocument();
        VDRPrompt::warning(QObject::tr("Drucken"), QObject::tr("Keine Bautagesberichte ausgewählt."));
        return ExitRefused;
    }
    return ExitOk;
}

int cmdPdf(const QString& file, const QString& choice, const QString& target)
{
    VDRDocument doc;
    QList<int> ids;
    QStringList numbers;
    if (const int refused = openForPrinting(doc, file, choice, ids, numbers))
        return refused;
    QString out4 = target;
    if (out4.isEmpty()) {
        // File names cannot hold a slash; a project or report number may.
        QString name = ids.size() == 1
                           ? QObject::tr("%1 - Bericht %2.pdf").arg(doc.projectName(), numbers.first())
                           : QObject::tr("%1 - Berichte.pdf").arg(doc.projectName());
        name.replace(QRegularExpression(QStringLiteral("[/\\\\:*?\"<>|]")), QStringLiteral("_"));
        out4 = QFileInfo(file).absoluteDir().filePath(name);
    }
    usePrintingLanguage();
    CVdPrintoutReport printout(nullptr, ids);
    const bool written = printout.print(CVdPrintout::Pdf, out4, false, QString());
    doc.closeDocument();
    if (!written)
        return ExitRefused;
    out() << printout.pdfFile() << "\n";
    out().flush();
    return ExitOk;
}

int cmdPreview(const QString& file, const QString& choice, const QString& outDir)
{
    if (outDir.isEmpty()) {
        err(QStringLiteral("varduna-cli: preview needs --out DIR; see varduna-cli --help"));
        return ExitUsage;
    }
    VDRDocument doc;
    QList<int> ids;
    QStringList numbers;
    if (const int refused = openForPrinting(doc, file, choice, ids, numbers))
        return refused;
    const QDir dir(QFileInfo(outDir).absoluteFilePath());
    if (!QDir().mkpath(dir.path())) {
        doc.closeDocument();
        VDRPrompt::critical(QObject::tr("Dateifehler"),
                            QObject::tr("Der Ordner\n%1\nkann nicht angelegt werden.")
                                .arg(QDir::toNativeSeparators(dir.path())));
        return ExitRefused;
    }
    usePrintingLanguage();
    // The preview's pages live in the diary's temporary folder only while it is shown: copied out here.
    QStringList written;
    bool copied = true;
    VDRPrintHooks::setPreview([&](const QStringList& pages) {
        for (const QString& page : pages) {
            const QString target = dir.filePath(QFileInfo(page).fileName());
            if (!copied || !VDRFileOps::copyDurably(page, target)) {
                if (copied)
                    VDRPrompt::critical(QObject::tr("Dateifehler"),
                                        QObject::tr("Die Datei\n%1\nkann nicht geschrieben werden.")
                                            .arg(QDir::toNativeSeparators(target)));
                copied = false;
                continue;
            }
            written << target;
        }
    });
    CVdPrintoutReport printout(nullptr, ids);
    printout.setTemporaryFolder(doc.temporaryFolder());
    const bool printed = printout.print(CVdPrintout::Preview, QString(), false, QString());
    VDRPrintHooks::setPreview(nullptr);
    doc.closeDocument();
    if (!printed || !copied || written.isEmpty())
        return ExitRefused;
    for (const QString& path : qAsConst(written))
        out() << path << "\n";
    out().flush();
    return ExitOk;
}

// The user hears from the program through the prompt; Qt's own log lines are for developers.
void quietMessageHandler(QtMsgType type, const QMessageLogContext&, const QString& message)
{
    if (type == QtFatalMsg || type == QtCriticalMsg || qEnvironmentVariableIsSet("VARDUNA_DEBUG"))
        std::fprintf(stderr, "%s\n", message.toLocal8Bit().constData());
}

} // namespace

int main(int argc, char* argv[])
{
    qInstallMessageHandler(quietMessageHandler);
    // Printing needs fonts and a paint engine; a command-line tool never shows a window.
    const bool printing = argc > 1 && (qstrcmp(argv[1], "pdf") == 0 || qstrcmp(argv[1], "preview") == 0);
    if (printing && !qEnvironmentVariableIsSet("QT_QPA_PLATFORM"))
        qputenv("QT_QPA_PLATFORM", "offscreen");
    std::unique_ptr<QCoreApplication> app(printing ? new QGuiApplication(argc, argv)
                                                   : new QCoreApplication(argc, argv));
    QCoreApplication::setOrganizationName(QStringLiteral("Korvant - Software"));
    QCoreApplication::setOrganizationDomain(QStringLiteral("korvant-software.de"));
    QCoreApplication::setApplicationName(QStringLiteral("Varduna"));

    QStringList args = QCoreApplication::arguments().mid(1);
    const bool yes = args.removeAll(QStringLiteral("--yes")) > 0;
    const bool json = args.removeAll(QStringLiteral("--json")) > 0;
    const bool deleteImported = args.removeAll(QStringLiteral("--delete")) > 0;
    // Options with a value, for pdf.
    const auto takeValue = [&args](const QString& option, QString& value) {
        const int at = args.indexOf(option);
        if (at < 0)
            return true;
        if (at + 1 >= args.size())
            return false;
        value = args.at(at + 1);
        args.erase(args.begin() + at, args.begin() + at + 2);
        return args.indexOf(option) < 0;
    };
    QString reports = QStringLiteral("all");
    QString pdfOut;
    const bool pdfCommand = args.value(0) == QLatin1String("pdf");
    if (pdfCommand &&
        (!takeValue(QStringLiteral("--reports"), reports) || !takeValue(QStringLiteral("-o"), pdfOut))) {
        err(QStringLiteral("varduna-cli: --reports and -o take one value each; see varduna-cli --help"));
        return ExitUsage;
    }
    QString previewOut;
    const bool previewCommand = args.value(0) == QLatin1String("preview");
    if (previewCommand && (!takeValue(QStringLiteral("--reports"), reports) ||
                           !takeValue(QStringLiteral("--out"), previewOut))) {
        err(QStringLiteral("varduna-cli: --reports and --out take one value each; see varduna-cli --help"));
        return ExitUsage;
    }
    if (args.contains(QStringLiteral("-h")) || args.contains(QStringLiteral("--help"))) {
        std::fputs(kHelp, stdout);
        return ExitOk;
    }
    // Commands that take more than one file.
    const QString first = args.value(0);
    const bool manyFiles = first == QLatin1String("import") && args.size() >= 3;
    const bool twoFiles =
        (first == QLatin1String("export-masterdata") || first == QLatin1String("follow-up")) &&
        args.size() == 3;
    const auto isOption = [](const QString& a) { return a.startsWith(QLatin1String("--")); };
    const bool needsMore = first == QLatin1String("import") || first == QLatin1String("export-masterdata") ||
                           first == QLatin1String("follow-up");
    if ((args.size() != 2 && !manyFiles && !twoFiles) || (needsMore && !manyFiles && !twoFiles) ||
        std::any_of(args.begin() + 1, args.end(), isOption)) {
        err(QStringLiteral("varduna-cli: expected COMMAND FILE; see varduna-cli --help"));
        return ExitUsage;
    }

    VDRCliPrompt prompt(yes);
    VDRPrompt::setInstance(&prompt);

    const QString command = args[0];
    const QString file = args[1];
    int result;
    if (command == QLatin1String("new"))
        result = cmdNew(file);
    else if (command == QLatin1String("info"))
        result = cmdInfo(file, json);
    else if (command == QLatin1String("check"))
        result = cmdCheck(file, json);
    else if (command == QLatin1String("save"))
        result = cmdSave(file);
    else if (command == QLatin1String("restore"))
        result = cmdRestore(file);
    else if (command == QLatin1String("compact"))
        result = cmdCompact(file);
    else if (command == QLatin1String("pdf"))
        result = cmdPdf(file, reports, pdfOut);
    else if (command == QLatin1String("preview"))
        result = cmdPreview(file, reports, previewOut);
    else if (command == QLatin1String("companies"))
        result = cmdCompanies(file, json);
    else if (command == QLatin1String("export-masterdata") && twoFiles)
        result = cmdExportMasterData(file, args[2]);
    else if (command == QLatin1String("follow-up") && twoFiles)
        result = cmdFollowUp(file, args[2]);
    else if (command == QLatin1String("import") && manyFiles)
        result = cmdImport(file, args.mid(2), deleteImported);
    else {
        err(QStringLiteral("varduna-cli: unknown command '%1'; see varduna-cli --help").arg(command));
        result = ExitUsage;
    }
    VDRPrompt::setInstance(nullptr);
    return result;
}
