// Import runs: the files of a run one after another, each file's reports, and the summary.
#include "sync/VDRReportSynchronisation.h"
#include "sync/VDRExchangeTables.h"

#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "document/VDRFileOps.h"
#include "document/VDRPrompt.h"
#include "document/VDRScopedConnection.h"

#include <QDir>
#include <QFileInfo>
#include <QSqlError>
#include <QSqlQuery>
#include <QSqlRecord>

VDRReportSynchronisation::VDRReportSynchronisation(VDRDocument* document, QObject* parent)
    : QObject(parent), m_document(document)
{
}

VDRReportSynchronisation::~VDRReportSynchronisation()
{
    closeExchangeFile();
}

void VDRReportSynchronisation::clearResultList()
{
    qDeleteAll(m_results);
    m_results.clear();
}

void VDRReportSynchronisation::slotRenameCheckboxStateChanged(int state)
{
    m_renameForAll = state == Qt::Checked;
}

void VDRReportSynchronisation::message(int kind, const QString& title, const QString& text)
{
    // The busy cursor is not meant for a message box.
    for (int i = 0; i < m_busy; ++i)
        VDRPrompt::instance()->setBusy(false);
    if (kind == VDRPrompt::Critical)
        VDRPrompt::critical(title, text);
    else if (kind == VDRPrompt::Warning)
        VDRPrompt::warning(title, text);
    else
        VDRPrompt::information(title, text);
    for (int i = 0; i < m_busy; ++i)
        VDRPrompt::instance()->setBusy(true);
}

// ---- One file ----

int VDRReportSynchronisation::importReportExchangeFile(const QString& path, int totalReports,
                                                       int reportsBefore, int& importedCount,
                                                       bool& masterDataImported, bool& projectDataChanged)
{
    if (!openExchangeFile(path))
        return FileOpenFailed;
    int result = FileRefused;
    {
        QSqlDatabase db = m_connection->db();
        result = importOpenedFile(db, path, totalReports, reportsBefore, importedCount, masterDataImported,
                                  projectDataChanged);
    }
    closeExchangeFile();
    return result;
}

int VDRReportSynchronisation::importOpenedFile(QSqlDatabase db, const QString& path, int totalReports,
                                               int reportsBefore, int& importedCount,
                                               bool& masterDataImported, bool& projectDataChanged)
{
    const auto done = [](int result) { return result; };
    if (!checkFileVersion(db, path))
        return done(FileRefused);
    // A new diary has no name yet; it takes whatever file it is given.
    const QString diaryName = QFileInfo(m_document->getFilepath()).fileName();
    if (!diaryName.isEmpty() && !checkDatabaseName(db, path, diaryName))
        return done(FileRefused);
    const QString missing = VDRExchangeTables::missingStructure(db);
    if (!missing.isEmpty()) {
        message(VDRPrompt::Warning, tr("Synchronisationsfehler"),
                tr("Die Datei \n%1\nkann nicht importiert werden, da sie keine gültige Austauschdatei ist.")
                        .arg(path) +
                    QLatin1Char('\n') + missing);
        return done(FileRefused);
    }

    int vdrCount = 0;
    int companyCount = 0;
    {
        QSqlQuery q(db);
        if (q.exec(QStringLiteral("SELECT COUNT(*) FROM vdr")) && q.next())
            vdrCount = q.value(0).toInt();
        if (q.exec(QStringLiteral("SELECT COUNT(*) FROM company")) && q.next())
            companyCount = q.value(0).toInt();
    }
    QDateTime importVersion;
    if (vdrCount > 0 || companyCount > 0) {
        const int version = checkMasterDataVersion(db, importVersion);
        if (version < 0)
            return done(FileRefused);
        if (version == 0) {
            message(VDRPrompt::Warning, tr("Stammdaten Synchronisation"),
                    tr("Die Stammdaten der Austauschdatei %1 werden nicht importiert, da bereits aktuellere "
                       "Stammdaten in das Varduna importiert wurden.")
                        .arg(path));
        } else {
            bool companiesChanged = false;
            bool projectChanged = false;
            const int result = importMasterData(db, path, companiesChanged, projectChanged);
            if (result == 3) {
                message(
                    VDRPrompt::Warning, tr("Synchronisationsfehler"),
                    tr("Fehlerhafte Projektdaten in der Austauschdatei \n%1.\nDie Projektdaten konnten nicht "
                       "importiert werden.")
                        .arg(path));
                return done(FileProjectDataFaulty);
            }
            if (result != 0)
                return done(FileRefused);
            m_document->setMasterDataImportVersion(importVersion);
            masterDataImported = true;
            projectDataChanged = projectDataChanged || projectChanged;
        }
    } else if (!getImportVersion(db, importVersion)) {
        return done(FileRefused);
    }

    int count = 0;
    // The file is one transaction, each report a savepoint in it: one commit, not one per report.
    m_document->beginTransaction();
    const int resultsBefore = m_results.size();
    const int reports = importReports(db, path, totalReports, reportsBefore, count, importVersion);
    const bool committed = m_document->endTransaction();
    refreshModels();
    if (!committed) {
        // Nothing of the file reached the diary (the user has been told why).
        for (int i = resultsBefore; i < m_results.size(); ++i) {
            if (m_results[i]->status() == VDRReportSynchronisationResult::Imported)
                m_results[i]->setStatus(VDRReportSynchronisationResult::RefusedDatabaseError);
        }
        return done(FileRefused);
    }
    importedCount += count;
    return done(reports == 0 ? FileImported : FileRefused);
}

int VDRReportSynchronisation::importReports(QSqlDatabase exchangeFile, const QString& path, int totalReports,
                                            int reportsBefore, int& count, const QDateTime& importVersion)
{
    QSqlQuery q(exchangeFile);
    q.setForwardOnly(true);
    if (!q.exec(QStringLiteral(
            "SELECT id, locked, persistent_document, persistent_document_ct, number, "
            "inspection_date, inspection_time_from, inspection_time_to, env_time, env_weather1, "
            "env_weather2, env_weather3, env_temperature, env_humidity, progress, deficiencies, "
            "tests, interventions, special_incidents, construction_material_sample, notice, "
            "print_notice, print_telephone_notice, progress_audio_id, user_id, creation_date, "
            "exported_by_app FROM entry ORDER BY inspection_date"))) {
        message(VDRPrompt::Critical, tr("Datenbankfehler"),
                tr("Die Datei\n%1\n enthält keinen gültigen Bericht.\n%2").arg(path, q.lastError().text()));
        return 1;
    }
    m_replacedDocuments.clear();
    m_touchedReports.clear();
    int failed = 0;
    while (q.next()) {
        ++count;
        VDRPrompt::instance()->noticeText(
            tr("Baubericht %1 von %2 wird importiert ...").arg(reportsBefore + count).arg(totalReports));
        if (totalReports > 0)
            VDRPrompt::instance()->noticeProgress((reportsBefore + count) * 100 / totalReports);
        QVariantHash row;
        const QSqlRecord record = q.record();
        for (int i = 0; i < record.count(); ++i)
            row.insert(record.fieldName(i), record.value(i));
        const QString number = row.value(QStringLiteral("number")).toString().trimmed();
        const QString userId = row.value(QStringLiteral("user_id")).toString();
        auto* result = new VDRReportSynchronisationResult(path, number, QString(), userId, false, 0, this);
        m_results.append(result);
        const int status = importReport(exchangeFile, path, row, importVersion, result);
        result->setStatus(status);
        if (status == VDRReportSynchronisationResult::RefusedDatabaseError)
            ++failed;
    }
    importDocuments(m_replacedDocuments);
    m_replacedDocuments.clear();
    return failed == 0 ? 0 : 3;
}

void VDRReportSynchronisation::refreshModels()
{
    // The reports were written with SQL; the models show what the diary now holds.
    if (m_document->modelEntryAll())
        m_document->modelEntryAll()->select();
    if (m_document->modelVdr())
        m_document->modelVdr()->select();
    for (const int entryId : qAsConst(m_touchedReports)) {
        if (!m_document->hasEntryModels(entryId))
            continue;
        for (VDRSqlTableModel* model : m_document->entryModels(entryId))
            model->select();
    }
    m_touchedReports.clear();
}

// ---- Runs ----

QString VDRReportSynchronisation::buildSummary(bool manual) const
{
    QString text;
    if (!m_failedFiles.isEmpty())
        text +=
            tr("Aufgrund eines Import-Fehlers konnten nicht alle Austauschdateien importiert werden.\n\n");
    if (!m_importedFiles.isEmpty()) {
        text += tr("Folgende Austauschdateien wurden importiert:\n\n");
        for (const QString& file : m_importedFiles)
            text += QStringLiteral("%1\n").arg(file);
        text += QLatin1Char('\n');
    }
    if (!m_failedFiles.isEmpty()) {
        text += tr("\nFolgende Austauschdateien wurden nicht oder nur teilweise importiert:\n\n");
        for (const QString& file : m_failedFiles)
            text += QStringLiteral("%1\n").arg(file);
        text += QStringLiteral("\n\n");
    }
    const std::pair<int, QString> sections[] = {
        {VDRReportSynchronisationResult::Imported,
         tr("Folgende Bauberichte wurden erfolgreich importiert:\n\n")},
        {VDRReportSynchronisationResult::RefusedLocked,
         tr("Folgende Bauberichte wurden nicht importiert, da der Baubericht abgeschlossen ist:\n\n")},
        {VDRReportSynchronisationResult::RefusedDatabaseError,
         tr("Folgende Bauberichte wurden aufgrund von Datenbankfehlern nicht importiert:\n\n")},
        {VDRReportSynchronisationResult::RefusedNewerVersion,
         tr("Folgende Bauberichte wurden nicht importiert, da bereits eine aktuellere Version des Berichts "
            "importiert wurde:\n\n")},
        {VDRReportSynchronisationResult::RefusedDeleted,
         tr("Folgende Bauberichte wurden nicht importiert, da sie bereits gelöscht wurden:\n\n")},
    };
    for (const auto& section : sections) {
        QString lines;
        for (const VDRReportSynchronisationResult* r : m_results) {
            if (r->status() != section.first)
                continue;
            const QString number = r->number().trimmed();
            const QString given = r->givenNumber().trimmed();
            if (section.first == VDRReportSynchronisationResult::Imported) {
                lines += r->userId().isEmpty() ? tr("Bericht %1 als Bericht %2 \n").arg(number, given)
                                               : tr("Bericht %1-%2 als Bericht %3-%4 \n")
                                                     .arg(number, r->userId(), given, r->userId());
            } else {
                lines += r->userId().isEmpty() ? tr("Bericht %1\n").arg(number)
                                               : tr("Bericht %1-%2\n").arg(number, r->userId());
            }
        }
        if (!lines.isEmpty())
            text += section.second + lines + QLatin1Char('\n');
    }
    if (manual && !text.isEmpty())
        text += tr("\nNach dem Import von Berichten sollte das Varduna gespeichert werden.\n");
    return text;
}

void VDRReportSynchronisation::runFiles(const QStringList& paths, bool deleteImported,
                                        bool& projectDataChanged, bool manual)
{
    clearResultList();
    m_importedFiles.clear();
    m_failedFiles.clear();
    m_saveNow = false;
    m_deleteRequested = false;
    m_renameForAll = false;
    m_renameAnswer = false;
    // Edits not yet submitted would be lost when the report list is read again.
    if (m_document->modelEntryAll() && m_document->modelEntryAll()->isDirty())
        m_document->modelEntryAll()->submitAll();

    if (manual)
        VDRPrompt::instance()->beginNotice(tr("Import einer Austauschdatei"),
                                           tr("Import der Austauschdatei läuft."));
    else
        VDRPrompt::instance()->beginNotice(tr("Cloud Synchronisation"), tr("Cloud-Synchronisation läuft."));
    VDRPrompt::instance()->setBusy(true);
    ++m_busy;

    int total = 0;
    for (const QString& path : paths)
        total += countReports(path);
    int before = 0;
    bool aborted = false;
    for (const QString& path : paths) {
        if (aborted) {
            m_failedFiles << path;
            continue;
        }
        int count = 0;
        bool masterData = false;
        const int result =
            importReportExchangeFile(path, total, before, count, masterData, projectDataChanged);
        before += count;
        if (result == FileImported) {
            m_importedFiles << path;
        } else if (result == FileOpenFailed) {
            message(VDRPrompt::Warning, tr("Synchronisationsfehler"),
                    tr("Aufgrund von Fehlern beim Import der Austauschdatei \n%1.\nwurde die Synchronisation "
                       "abgebrochen.\nBitte wenden Sie sich an den Support.")
                        .arg(path));
            m_failedFiles << path;
            aborted = true;
        } else {
            m_failedFiles << path;
        }
    }
    --m_busy;
    VDRPrompt::instance()->setBusy(false);
    VDRPrompt::instance()->endNotice();

    m_lastSummary = buildSummary(manual);
    if (manual) {
        const QString path = paths.value(0);
        if (m_lastSummary.isEmpty() || !m_showSummary)
            return;
        // Only an imported file may be deleted; a refused one stays where it is.
        bool remove = false;
        const bool offerDelete = m_importedFiles.contains(path);
        const int answer = VDRPrompt::instance()->choose(
            VDRPrompt::Information, tr("Ergebnis der Synchronisation"), m_lastSummary,
            {tr("Jetzt speichern"), tr("Später speichern")}, 0, 1,
            offerDelete ? tr("Importierte Austauschdatei %1 löschen").arg(QFileInfo(path).fileName())
                        : QString(),
            &remove);
        m_saveNow = answer == 0;
        m_deleteRequested = offerDelete && remove;
        if (!m_saveNow)
            deleteRequestedFile();
        return;
    }
    if (!m_lastSummary.isEmpty() && m_showSummary)
        message(VDRPrompt::Information, tr("Ergebnis der Synchronisation"), m_lastSummary);
    if (deleteImported) {
        for (const QString& path : qAsConst(m_importedFiles)) {
            if (!VDRFileOps::remove(path))
                message(
                    VDRPrompt::Warning, tr("Dateifehler"),
                    tr("Die importierte Austauschdatei\n%1\nkonnte nicht gelöscht werden.\nBitte löschen Sie "
                       "diese Datei manuell.")
                        .arg(path));
        }
    }
}

bool VDRReportSynchronisation::deleteRequestedFile()
{
    if (!m_deleteRequested || m_importedFiles.isEmpty())
        return true;
    m_deleteRequested = false;
    const QString path = m_importedFiles.constFirst();
    if (VDRFileOps::remove(path))
        return true;
    message(
        VDRPrompt::Warning, tr("Dateifehler"),
        tr("Die Austauschdatei\n%1\nkonnte nicht gelöscht werden.\nBitte löschen Sie diese Datei manuell.")
            .arg(path));
    return false;
}

int VDRReportSynchronisation::importCloudReportExchangeFiles(const QString& cloudFolder,
                                                             const QStringList& fileNames, bool& imported,
                                                             bool& projectDataChanged)
{
    imported = false;
    if (fileNames.isEmpty())
        return 0;
    QStringList paths;
    for (const QString& name : fileNames) {
        // Names only: a name that climbs out of the folder is not the app's file.
        paths << (QFileInfo(name).fileName() == name
                      ? QDir(cloudFolder).filePath(name)
                      : QDir(cloudFolder).filePath(QFileInfo(name).fileName()));
    }
    m_confineTo = cloudFolder;
    runFiles(paths, true, projectDataChanged, false);
    m_confineTo.clear();
    imported = !m_importedFiles.isEmpty();
    return m_failedFiles.size();
}

int VDRReportSynchronisation::importReportExchangeFiles(const QStringList& paths, bool deleteImported,
                                                        bool& projectDataChanged)
{
    runFiles(paths, deleteImported, projectDataChanged, false);
    return m_failedFiles.size();
}

int VDRReportSynchronisation::importManualReportExchangeFile(const QString& path, bool& projectDataChanged)
{
    runFiles({path}, false, projectDataChanged, true);
    return m_failedFiles.isEmpty() ? FileImported : FileRefused;
}
