// One report of an exchange file: locate it in the diary, replace or add it, and offer a new number.
#include "sync/VDRExchangeTables.h"
#include "sync/VDRReportSynchronisation.h"

#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDatabaseSchema.h"
#include "document/VDRDocument.h"
#include "document/VDREntryNumber.h"
#include "document/VDRPrompt.h"

#include <QDebug>
#include <QSqlError>
#include <QSqlQuery>

#include <algorithm>

using namespace VDRExchangeValues;
using namespace VDRExchangeTables;

namespace {

// Runs a statement on the diary inside a savepoint; logs failures.
bool execDiary(QSqlDatabase db, const QString& sql)
{
    QSqlQuery q(db);
    if (q.exec(sql))
        return true;
    qDebug().noquote() << "SQL-Error:" << sql << q.lastError().text();
    return false;
}

// A step of one report's import returns this when the import goes on, else the report's status.
constexpr int kGoOn = 0;

} // namespace

// ---- One report ----

int VDRReportSynchronisation::entryBySynchId(int id, const QString& userId, const QDateTime& creationDate,
                                             int& row)
{
    row = -1;
    QSqlQuery q(m_document->database());
    if (!userId.isEmpty() && creationDate.isValid()) {
        q.prepare(QStringLiteral("SELECT id, creation_date FROM entry WHERE user_id = :user_id"));
        q.bindValue(QStringLiteral(":user_id"), userId);
        if (!q.exec())
            return -1;
        while (q.next()) {
            if (parseDateTime(q.value(1).toString()) == creationDate) {
                const int diaryId = q.value(0).toInt();
                if (m_document->modelEntryAll())
                    row = m_document->modelEntryAll()->rowById(diaryId);
                return diaryId;
            }
        }
        return -1;
    }
    if (creationDate.isValid())
        return -1;
    // Reports from before the identity are known by their id alone.
    q.prepare(QStringLiteral("SELECT id, user_id, creation_date FROM entry WHERE id = :id"));
    q.bindValue(QStringLiteral(":id"), id);
    if (!q.exec() || !q.next())
        return -1;
    if (!q.value(1).toString().isEmpty() && parseDateTime(q.value(2).toString()).isValid())
        return -1;
    if (m_document->modelEntryAll())
        row = m_document->modelEntryAll()->rowById(id);
    return id;
}

bool VDRReportSynchronisation::checkReportVersion(int id, const QDateTime& importVersion)
{
    QSqlQuery q(m_document->database());
    q.prepare(QStringLiteral("SELECT import_version FROM entry WHERE id = :id"));
    q.bindValue(QStringLiteral(":id"), id);
    if (!q.exec() || !q.next())
        return true;
    const QDateTime stored = parseDateTime(q.value(0).toString());
    return !(stored.isValid() && stored > importVersion);
}

bool VDRReportSynchronisation::checkImportedReportNumber(const QString& number, const QDate& date,
                                                         const QTime& time, int& highestNumber,
                                                         int& highestId)
{
    highestNumber = 0;
    highestId = -1;
    // The reports with the highest numeric part; among them the highest letter.
    QSqlQuery q(m_document->database());
    if (!q.exec(QStringLiteral("SELECT id, number, inspection_date, inspection_time_from FROM entry WHERE "
                               "CAST(number AS INTEGER) = (SELECT max(CAST(number AS INTEGER)) FROM entry "
                               "WHERE number GLOB '[0-9]*') AND number GLOB '[0-9]*'")))
        return false;
    VDREntryNumber best;
    QDate bestDate;
    QTime bestTime;
    while (q.next()) {
        const VDREntryNumber parts = VDREntryNumber::forComparing(q.value(1).toString());
        if (highestId < 0 || parts.letter() > best.letter()) {
            best = parts;
            highestId = q.value(0).toInt();
            bestDate = QDate::fromString(q.value(2).toString().left(10), Qt::ISODate);
            bestTime = QTime::fromString(q.value(3).toString(), Qt::ISODateWithMs);
            if (!bestTime.isValid())
                bestTime = QTime::fromString(q.value(3).toString(), Qt::ISODate);
        }
    }
    if (highestId < 0)
        return false;
    highestNumber = best.number();
    const bool notAbove = VDREntryNumber::forComparing(number).compare(best) <= 0;
    const bool later = date > bestDate || (date == bestDate && time > bestTime);
    return notAbove && later;
}

int VDRReportSynchronisation::nextId(const QString& table)
{
    auto it = m_idCounters.find(table);
    if (it == m_idCounters.end()) {
        QSqlQuery q(m_document->database());
        q.prepare(QStringLiteral("SELECT id_counter FROM id_generator WHERE id_table = :tablename"));
        q.bindValue(QStringLiteral(":tablename"), table);
        const int counter = q.exec() && q.next() ? q.value(0).toInt() : 0;
        it = m_idCounters.insert(table, counter);
    }
    return ++it.value();
}

bool VDRReportSynchronisation::storeIdCounters()
{
    QSqlDatabase db = m_document->database();
    for (auto it = m_idCounters.constBegin(); it != m_idCounters.constEnd(); ++it) {
        QSqlQuery q(db);
        q.prepare(QStringLiteral("UPDATE id_generator SET id_counter = :newid WHERE id_table = :tablename"));
        q.bindValue(QStringLiteral(":newid"), it.value());
        q.bindValue(QStringLiteral(":tablename"), it.key());
        if (!q.exec())
            return false;
        if (q.numRowsAffected() == 0) {
            QSqlQuery insert(db);
            insert.prepare(QStringLiteral(
                "INSERT INTO id_generator (id_table, id_counter) VALUES (:tablename, :newid)"));
            insert.bindValue(QStringLiteral(":tablename"), it.key());
            insert.bindValue(QStringLiteral(":newid"), it.value());
            if (!insert.exec())
                return false;
        }
    }
    return true;
}

// One report on its way into the diary.
struct VDRReportSynchronisation::ReportImport
{
    int appId = 0;
    // The report's own columns, checked and converted.
    QVariantHash values;
    bool locked = false;
    QString userId;
    QDateTime creationDate;
    // The diary's report that this one replaces; none when not above zero.
    int existingId = -1;
    QString diaryNumber;
    int oldAudio = 0;
    QList<int> oldImages;
    QList<ReplacedDocument> replacedDocuments;
    bool renumberCandidate = false;
    int highestNumber = 0;
    int highestId = -1;
    int entryId = -1;
    int audioId = 0;
    QString error;
};

int VDRReportSynchronisation::importReport(QSqlDatabase exchangeFile, const QString& path,
                                           const QVariantHash& raw, const QDateTime& importVersion,
                                           VDRReportSynchronisationResult* result)
{
    ReportImport report;
    int status = readReport(raw, path, report);
    if (status == kGoOn)
        status = locateReport(importVersion, report);
    if (status != kGoOn)
        return status;
    if (!writeReport(exchangeFile, path, importVersion, report))
        return reportFailed(report.error.isEmpty()
                                ? tr("Die Datei\n%1\n enthält keinen gültigen Bericht.\n%2")
                                      .arg(path, m_document->database().lastError().text())
                                : report.error);

    m_touchedReports.insert(report.entryId);
    if (report.existingId > 0) {
        result->setReplaced(true);
        result->setGivenNumber(VDREntryNumber(report.diaryNumber).withoutDraft());
        if (!report.replacedDocuments.isEmpty())
            m_replacedDocuments.insert(report.entryId, report.replacedDocuments);
    }
    m_document->setModified(true);
    if (report.renumberCandidate)
        renumber(report.entryId, report.highestNumber, report.highestId, result);
    return VDRReportSynchronisationResult::Imported;
}

int VDRReportSynchronisation::reportFailed(const QString& text)
{
    message(VDRPrompt::Critical, tr("Datenbankfehler"), text);
    return VDRReportSynchronisationResult::RefusedDatabaseError;
}

int VDRReportSynchronisation::readReport(const QVariantHash& raw, const QString& path, ReportImport& report)
{
    const auto invalidReport = [&](const QString& reason) {
        return reportFailed(tr("Die Datei\n%1\n enthält keinen gültigen Bericht.\n%2").arg(path, reason));
    };

    QVariant idValue;
    if (!convertValue(raw.value(QStringLiteral("id")), {"id", KInt, true}, idValue, report.error))
        return invalidReport(report.error);
    report.appId = idValue.toInt();

    // Check and convert the report's own columns; NULLs as the diary wants them.
    for (const Column& c : entryColumns()) {
        QVariant v;
        if (!convertValue(raw.value(QLatin1String(c.name)), c, v, report.error)) {
            if (c.kind == KDateTime) {
                v = QVariant(QVariant::String); // an unreadable creation date counts as none
            } else {
                return invalidReport(report.error);
            }
        }
        report.values.insert(QLatin1String(c.name), v);
    }
    report.values.insert(QStringLiteral("exported_by_app"), 0);
    report.locked = report.values.value(QStringLiteral("locked")).toInt() != 0;
    report.userId = report.values.value(QStringLiteral("user_id")).toString();
    report.creationDate = parseDateTime(report.values.value(QStringLiteral("creation_date")).toString());
    return kGoOn;
}

// A report without identity whose id the diary handed out and no longer has was deleted there.
bool VDRReportSynchronisation::deletedInDiary(const ReportImport& report)
{
    if (report.locked || (!report.userId.isEmpty() && report.creationDate.isValid()))
        return false;
    QSqlQuery q(m_document->database());
    int counter = 0;
    if (q.exec(QStringLiteral("SELECT id_table, id_counter FROM id_generator WHERE id_table = 'entry'")) &&
        q.next())
        counter = q.value(1).toInt();
    q.prepare(QStringLiteral("SELECT count(*) FROM entry WHERE id = :id"));
    q.bindValue(QStringLiteral(":id"), report.appId);
    const bool exists = q.exec() && q.next() && q.value(0).toInt() > 0;
    return report.appId <= counter && !exists;
}

// The diary's report that the imported one replaces, if it may be replaced; for a new report, whether
// its number is allowed and whether to offer the next free one.
int VDRReportSynchronisation::locateReport(const QDateTime& importVersion, ReportImport& report)
{
    if (deletedInDiary(report))
        return VDRReportSynchronisationResult::RefusedDeleted;

    int row = -1;
    report.existingId = entryBySynchId(report.appId, report.userId, report.creationDate, row);
    if (report.existingId > 0) {
        if (!checkReportVersion(report.existingId, importVersion))
            return VDRReportSynchronisationResult::RefusedNewerVersion;
        QSqlQuery q(m_document->database());
        q.prepare(QStringLiteral("SELECT locked, number, progress_audio_id FROM entry WHERE id = :id"));
        q.bindValue(QStringLiteral(":id"), report.existingId);
        if (!q.exec() || !q.next())
            return reportFailed(q.lastError().text());
        if (q.value(0).toInt() != 0)
            return VDRReportSynchronisationResult::RefusedLocked;
        report.diaryNumber = q.value(1).toString();
        report.oldAudio = q.value(2).toInt();
        return kGoOn;
    }

    const QString number = report.values.value(QStringLiteral("number")).toString();
    if (VDREntryNumber::forComparing(number).number() > 99999) {
        message(VDRPrompt::Warning, tr("Bauberichtnummer ungültig "),
                tr("Sie können keinen Baubericht mit einer Bauberichtnummer größer 99999 anlegen.\n"
                   "Reduzieren Sie die höchste Bauberichtnummer oder legen Sie eine neue Datei an."));
        return VDRReportSynchronisationResult::RefusedDatabaseError;
    }
    report.renumberCandidate =
        checkImportedReportNumber(number, report.values.value(QStringLiteral("inspection_date")).toDate(),
                                  report.values.value(QStringLiteral("inspection_time_from")).toTime(),
                                  report.highestNumber, report.highestId);
    return kGoOn;
}

bool VDRReportSynchronisation::writeReport(QSqlDatabase exchangeFile, const QString& path,
                                           const QDateTime& importVersion, ReportImport& report)
{
    QSqlDatabase diary = m_document->database();
    // Everything of one report in one savepoint: a failure at any row leaves the diary as it was.
    m_idCounters.clear();
    m_document->beginTransaction();
    bool ok = execDiary(diary, QStringLiteral("SAVEPOINT vdx_report"));
    report.entryId = report.existingId;
    if (ok && report.existingId > 0)
        ok = removeReplacedRows(report);
    if (ok) {
        if (report.existingId <= 0)
            report.entryId = nextId(QStringLiteral("entry"));
        ok = writeReportRows(exchangeFile, path, report.appId, report.entryId, report.values, report.audioId,
                             report.error);
    }
    ok = ok && writeEntryRow(path, importVersion, report);
    if (ok && report.existingId <= 0)
        ok = updateEntryCounter(report);
    if (ok && report.existingId > 0)
        ok = removeUnusedMedia(report);
    ok = ok && storeIdCounters();
    if (ok) {
        ok = execDiary(diary, QStringLiteral("RELEASE vdx_report"));
    } else {
        execDiary(diary, QStringLiteral("ROLLBACK TO vdx_report"));
        execDiary(diary, QStringLiteral("RELEASE vdx_report"));
    }
    m_document->endTransaction();
    m_idCounters.clear();
    return ok;
}

// The replaced report's rows go; its id and number stay. Its pictures and documents are noted: the
// pictures go once nothing uses them, the documents follow the new rows.
bool VDRReportSynchronisation::removeReplacedRows(ReportImport& report)
{
    QSqlDatabase diary = m_document->database();
    QSqlQuery q(diary);
    q.prepare(QStringLiteral("SELECT photo_image_id FROM entry_photo WHERE entry_id = :id"));
    q.bindValue(QStringLiteral(":id"), report.existingId);
    bool ok = q.exec();
    while (ok && q.next()) {
        if (q.value(0).toInt() > 0 && !report.oldImages.contains(q.value(0).toInt()))
            report.oldImages << q.value(0).toInt();
    }
    for (const char* table : {"entry_constructionmaterial", "entry_scheduleddelivery"}) {
        q.prepare(
            QStringLiteral("SELECT id, document FROM %1 WHERE entry_id = :id").arg(QLatin1String(table)));
        q.bindValue(QStringLiteral(":id"), report.existingId);
        ok = ok && q.exec();
        while (ok && q.next()) {
            if (!q.value(1).toString().trimmed().isEmpty())
                report.replacedDocuments.append(
                    {QLatin1String(table), q.value(0).toInt(), q.value(1).toString()});
        }
    }
    for (const QString& table : VDRDatabaseSchema::reportTables()) {
        QSqlQuery d(diary);
        d.prepare(QStringLiteral("DELETE FROM %1 WHERE entry_id = :id").arg(table));
        d.bindValue(QStringLiteral(":id"), report.existingId);
        ok = ok && d.exec();
        if (!ok)
            report.error = d.lastError().text();
    }
    return ok;
}

// The entry row itself, last, with the dictation's new id.
bool VDRReportSynchronisation::writeEntryRow(const QString& path, const QDateTime& importVersion,
                                             ReportImport& report)
{
    QVariantHash& values = report.values;
    values.insert(QStringLiteral("progress_audio_id"), report.audioId);
    values.insert(QStringLiteral("import_version"), versionText(importVersion));
    QString number =
        report.existingId > 0 ? report.diaryNumber : values.value(QStringLiteral("number")).toString();
    number = VDREntryNumber::compose(VDREntryNumber(number).withoutDraft(), QString(), !report.locked);
    values.insert(QStringLiteral("number"), number);
    QStringList columns;
    for (const Column& c : entryColumns())
        columns << QLatin1String(c.name);
    columns << QStringLiteral("import_version");
    QSqlQuery q(m_document->database());
    if (report.existingId > 0) {
        QStringList sets;
        for (const QString& c : qAsConst(columns))
            sets << c + QStringLiteral(" = ?");
        q.prepare(QStringLiteral("UPDATE entry SET %1 WHERE id = ?").arg(sets.join(QStringLiteral(", "))));
    } else {
        QStringList marks;
        for (int i = 0; i <= columns.size(); ++i)
            marks << QStringLiteral("?");
        q.prepare(QStringLiteral("INSERT INTO entry (%1, id) VALUES (%2)")
                      .arg(columns.join(QStringLiteral(", ")), marks.join(QLatin1Char(','))));
    }
    for (const QString& c : qAsConst(columns))
        q.addBindValue(values.value(c));
    q.addBindValue(report.entryId);
    const bool ok = q.exec();
    if (!ok)
        report.error =
            tr("Die Datei\n%1\n enthält keinen gültigen Bericht.\n%2").arg(path, q.lastError().text());
    return ok;
}

bool VDRReportSynchronisation::updateEntryCounter(ReportImport& report)
{
    QSqlQuery q(m_document->database());
    q.prepare(QStringLiteral("UPDATE vdr SET entrycounter = :id WHERE id = 1"));
    q.bindValue(QStringLiteral(":id"), report.entryId);
    const bool ok = q.exec();
    if (!ok)
        report.error = q.lastError().text();
    return ok;
}

// Pictures and the dictation of the replaced report that nothing uses any more.
bool VDRReportSynchronisation::removeUnusedMedia(const ReportImport& report)
{
    QSqlDatabase diary = m_document->database();
    bool ok = true;
    for (const int imageId : qAsConst(report.oldImages)) {
        QSqlQuery q(diary);
        q.prepare(QStringLiteral("DELETE FROM image WHERE id = :id AND NOT EXISTS (SELECT 1 FROM entry_photo "
                                 "WHERE photo_image_id = :id2) AND NOT EXISTS (SELECT 1 FROM vdr WHERE "
                                 "logo_image_id = :id3 OR logo2_image_id = :id4)"));
        q.bindValue(QStringLiteral(":id"), imageId);
        q.bindValue(QStringLiteral(":id2"), imageId);
        q.bindValue(QStringLiteral(":id3"), imageId);
        q.bindValue(QStringLiteral(":id4"), imageId);
        ok = ok && q.exec();
    }
    if (ok && report.oldAudio > 0 && report.oldAudio != report.audioId) {
        QSqlQuery q(diary);
        q.prepare(QStringLiteral("DELETE FROM audio WHERE id = :id"));
        q.bindValue(QStringLiteral(":id"), report.oldAudio);
        ok = q.exec();
    }
    return ok;
}

void VDRReportSynchronisation::renumber(int entryId, int highestNumber, int highestId,
                                        VDRReportSynchronisationResult* result)
{
    QSqlDatabase diary = m_document->database();
    QSqlQuery q(diary);
    int digits = 3;
    if (q.exec(QStringLiteral("SELECT number FROM entry ORDER BY id LIMIT 1")) && q.next())
        digits = std::max(3, VDREntryNumber(q.value(0).toString()).digits());
    const QString proposed = VDREntryNumber::padded(highestNumber + 1, digits);
    QString highestText;
    q.prepare(QStringLiteral("SELECT number FROM entry WHERE id = :id"));
    q.bindValue(QStringLiteral(":id"), highestId);
    if (q.exec() && q.next())
        highestText = VDREntryNumber(q.value(0).toString()).withoutDraft();

    bool rename = m_renameAnswer;
    if (!m_renameForAll) {
        for (int i = 0; i < m_busy; ++i)
            VDRPrompt::instance()->setBusy(false);
        bool checked = false;
        const int answer = VDRPrompt::instance()->choose(
            VDRPrompt::Warning, tr("Baubericht-Synchronisation"),
            tr("Der importierte Baubericht %1 ist neuer als der Baubericht mit der höchsten "
               "Bauberichts-Nummer: "
               "%2.\nSoll er fortlaufend nummeriert und in %3 umbenannt werden?")
                .arg(result->number(), highestText, proposed),
            {tr("Baubericht umbenennen"), tr("Nein")}, 0, 1, tr("Alle weiteren genauso behandeln"), &checked);
        for (int i = 0; i < m_busy; ++i)
            VDRPrompt::instance()->setBusy(true);
        rename = answer == 0;
        slotRenameCheckboxStateChanged(checked ? Qt::Checked : Qt::Unchecked);
        m_renameAnswer = rename;
    }
    if (!rename)
        return;
    q.prepare(QStringLiteral("SELECT locked FROM entry WHERE id = :id"));
    q.bindValue(QStringLiteral(":id"), entryId);
    const bool locked = q.exec() && q.next() && q.value(0).toInt() != 0;
    QSqlQuery update(diary);
    update.prepare(QStringLiteral("UPDATE entry SET number = :number WHERE id = :id"));
    update.bindValue(QStringLiteral(":number"), VDREntryNumber::compose(proposed, QString(), !locked));
    update.bindValue(QStringLiteral(":id"), entryId);
    if (!update.exec()) {
        qDebug().noquote() << "SQL-Error:" << update.lastError().text();
        return;
    }
    result->setGivenNumber(proposed);
}
