// Master data: the app's project data and companies into the diary, and the diary's for the app.
#include "document/VDRDatabaseSchema.h"
#include "document/VDRDocument.h"
#include "document/VDRPrompt.h"
#include "sync/VDRExchangeValues.h"
#include "sync/VDRReportSynchronisation.h"

#include <QDebug>
#include <QFileInfo>
#include <QSqlError>
#include <QSqlQuery>
#include <QSqlRecord>

#include <vector>

using namespace VDRExchangeValues;

namespace {

const std::vector<Column>& vdrColumns()
{
    static const std::vector<Column> columns = {
        {"name", KText, true},           {"headline_left", KText, true},  {"headline_center", KText, true},
        {"headline_right", KText, true}, {"footer_left", KText, true},    {"footer_center", KText, true},
        {"footer_right", KText, true},   {"createdate", KDateTime, true},
    };
    return columns;
}

const std::vector<Column>& companyColumns()
{
    static const std::vector<Column> columns = {
        {"category", KInt, true},  {"type", KText, true},    {"firstname", KText, true},
        {"lastname", KText, true}, {"company", KText, true}, {"street", KText, true},
        {"plz", KText, true},      {"city", KText, true},    {"telephone", KText, true},
        {"telefax", KText, true},  {"mobile", KText, true},  {"email", KText, true},
        {"pos", KInt, true},
    };
    return columns;
}

int countOf(QSqlDatabase db, const QString& sql, bool* ok = nullptr)
{
    QSqlQuery q(db);
    const bool done = q.exec(sql) && q.next();
    if (ok)
        *ok = done;
    return done ? q.value(0).toInt() : 0;
}

// The id and the checked values of one row; false with the first failure in 'error'.
bool convertMasterDataRow(const QSqlQuery& q, const std::vector<Column>& columns, QVariant& id,
                          QVariantHash& values, QString& error)
{
    bool ok = convertValue(q.value(0), {"id", KInt, true}, id, error);
    for (const Column& c : columns) {
        QVariant v;
        ok = ok && convertValue(q.value(QLatin1String(c.name)), c, v, error);
        values.insert(QLatin1String(c.name), v);
    }
    return ok;
}

} // namespace

// A row of the project data or of the company list, read and checked.
struct VDRReportSynchronisation::MasterDataRow
{
    int id;
    QVariantHash values;
};

int VDRReportSynchronisation::importMasterData(QSqlDatabase exchangeFile, const QString& path,
                                               bool& companiesChanged, bool& projectDataChanged)
{
    companiesChanged = false;
    projectDataChanged = false;
    bool keepCompanies = false;
    if (!masterDataImportable(exchangeFile, path, keepCompanies))
        return 1;
    VDRPrompt::instance()->noticeText(tr("Stammdaten werden aktualisiert ..."));

    // Read and check everything first; then write it in one savepoint.
    QList<MasterDataRow> projects;
    int result = readProjectData(exchangeFile, path, projects);
    if (result != 0)
        return result;
    QList<MasterDataRow> companies;
    if (!keepCompanies) {
        result = readCompanies(exchangeFile, path, companies);
        if (result != 0)
            return result;
    }
    result = writeMasterData(path, projects, companies, keepCompanies);
    if (result != 0)
        return result;

    projectDataChanged = !projects.isEmpty();
    companiesChanged = !keepCompanies;
    if (m_document->modelVdr())
        m_document->modelVdr()->select();
    if (companiesChanged) {
        if (m_document->modelCompany1())
            m_document->modelCompany1()->select();
        if (m_document->modelCompany2())
            m_document->modelCompany2()->select();
    }
    m_document->setModified(true);
    return 0;
}

// Whether the file's master data may replace the diary's; 'keepCompanies' when the file has no
// companies and the user keeps the diary's.
bool VDRReportSynchronisation::masterDataImportable(QSqlDatabase exchangeFile, const QString& path,
                                                    bool& keepCompanies)
{
    QSqlDatabase diary = m_document->database();
    const QString syncTitle = tr("Synchronisationsfehler");

    // Companies frozen for reports locked since the app last got the master data would be lost.
    const int fileFrozen =
        countOf(exchangeFile, QStringLiteral("SELECT Count(*) FROM company WHERE category < 0"));
    const int diaryFrozen =
        countOf(diary, QStringLiteral("SELECT Count(*) FROM company WHERE category = -1 OR category = -2"));
    if (fileFrozen < diaryFrozen) {
        message(VDRPrompt::Critical, syncTitle,
                tr("Der Import ist nicht möglich, da nach dem Abschließen von Berichten der Stammdatenexport "
                   "an das "
                   "mobile Gerät nicht durchgeführt wurde.\nBitte aktualisieren Sie zunächst die Stammdaten "
                   "in der "
                   "App und wiederholen Sie anschließend die Synchronisation."));
        return false;
    }
    const int vdrCount = countOf(exchangeFile, QStringLiteral("SELECT Count(*) FROM vdr"));
    const int companyCount = countOf(exchangeFile, QStringLiteral("SELECT Count(*) FROM company"));
    if (companyCount > 0 && vdrCount == 0) {
        message(VDRPrompt::Critical, syncTitle,
                tr("Fehler in der Importdatei \n%1\n.Die Stammdatentabelle 'vdr' ist nicht belegt.\n\n Bitte "
                   "wenden Sie "
                   "sich an den Support.")
                    .arg(path));
        return false;
    }
    keepCompanies = false;
    if (companyCount == 0 &&
        countOf(diary, QStringLiteral("SELECT Count(*) FROM company WHERE category IN (1, -1, 2, -2)")) > 0) {
        for (int i = 0; i < m_busy; ++i)
            VDRPrompt::instance()->setBusy(false);
        // Deleting every company is never the default, not even for --yes.
        const int answer =
            VDRPrompt::instance()->choose(VDRPrompt::Question, tr("Stammdaten Synchronisation"),
                                          tr("Die Firmenliste in der Importdatei ist leer.\nSoll die gesamte "
                                             "Firmenliste des Vardunas gelöscht "
                                             "werden?"),
                                          {tr("Firmenliste löschen"), tr("Abbrechen")}, 1, 1);
        for (int i = 0; i < m_busy; ++i)
            VDRPrompt::instance()->setBusy(true);
        keepCompanies = answer != 0;
    }
    return true;
}

int VDRReportSynchronisation::readProjectData(QSqlDatabase exchangeFile, const QString& path,
                                              QList<MasterDataRow>& projects)
{
    const QString dbTitle = tr("Datenbankfehler");
    QSqlQuery q(exchangeFile);
    if (!q.exec(
            QStringLiteral("SELECT id, name, headline_left, headline_center, headline_right, footer_left, "
                           "footer_center, footer_right, createdate FROM vdr"))) {
        message(VDRPrompt::Critical, dbTitle,
                tr("Die Tabelle 'vdr' der Datei\n%1\n konnte nicht importiert werden.\n%2")
                    .arg(path, q.lastError().text()));
        return 3;
    }
    while (q.next()) {
        MasterDataRow row;
        QVariant id;
        QString error;
        if (!convertMasterDataRow(q, vdrColumns(), id, row.values, error)) {
            message(
                VDRPrompt::Critical, dbTitle,
                tr("Die Tabelle 'vdr' der Datei\n%1\n konnte nicht importiert werden.\n%2").arg(path, error));
            return 3;
        }
        row.id = id.toInt();
        projects << row;
    }
    return 0;
}

int VDRReportSynchronisation::readCompanies(QSqlDatabase exchangeFile, const QString& path,
                                            QList<MasterDataRow>& companies)
{
    QSqlQuery q(exchangeFile);
    if (!q.exec(QStringLiteral("SELECT id, type, category, firstname, lastname, company, street, plz, city, "
                               "telephone, telefax, mobile, email, pos FROM company ORDER BY id"))) {
        message(VDRPrompt::Critical, tr("Datenbankfehler"),
                tr("Die Tabelle 'company' der Datei\n%1\n konnte nicht importiert werden.\n%2")
                    .arg(path, q.lastError().text()));
        return 1;
    }
    while (q.next()) {
        MasterDataRow row;
        QVariant id;
        QString error;
        bool ok = convertMasterDataRow(q, companyColumns(), id, row.values, error);
        const int category = row.values.value(QStringLiteral("category")).toInt();
        if (ok && category != 1 && category != -1 && category != 2 && category != -2) {
            ok = false;
            error = tr("Die Spalte 'category' enthält einen ungültigen Wert: %1").arg(category);
        }
        if (ok && id.toInt() <= 0) {
            ok = false;
            error = tr("Die Spalte 'id' enthält einen ungültigen Wert: %1").arg(id.toInt());
        }
        if (!ok) {
            message(VDRPrompt::Critical, tr("Synchronisationsfehler"),
                    tr("Fehler beim Import der Firmenliste der Importdatei\n%1.\nDas Anlegen eines "
                       "Firmeneintrags "
                       "ist fehlgeschlagen.\nDie Firmenliste wurde nicht importiert.")
                            .arg(path) +
                        QLatin1Char('\n') + error);
            return 1;
        }
        row.id = id.toInt();
        companies << row;
    }
    return 0;
}

int VDRReportSynchronisation::writeMasterData(const QString& path, const QList<MasterDataRow>& projects,
                                              const QList<MasterDataRow>& companies, bool keepCompanies)
{
    QSqlDatabase diary = m_document->database();
    // All of it or nothing: a failure at any row leaves project data and companies as they were.
    m_document->beginTransaction();
    QSqlQuery(diary).exec(QStringLiteral("SAVEPOINT vdx_masterdata"));
    int result = writeProjectData(path, projects);
    if (result == 0 && !keepCompanies)
        result = replaceCompanies(path, companies);
    if (result == 0) {
        QSqlQuery(diary).exec(QStringLiteral("RELEASE vdx_masterdata"));
    } else {
        QSqlQuery(diary).exec(QStringLiteral("ROLLBACK TO vdx_masterdata"));
        QSqlQuery(diary).exec(QStringLiteral("RELEASE vdx_masterdata"));
    }
    if (!m_document->endTransaction() && result == 0)
        result = 1; // the commit failed: nothing was stored, and the user has been told
    return result;
}

int VDRReportSynchronisation::writeProjectData(const QString& path, const QList<MasterDataRow>& projects)
{
    for (const MasterDataRow& row : projects) {
        QSqlQuery q(m_document->database());
        q.prepare(
            QStringLiteral("UPDATE vdr SET name = :name, headline_left = :headline_left, headline_center = "
                           ":headline_center, headline_right = :headline_right, footer_left = :footer_left, "
                           "footer_center = :footer_center, footer_right = :footer_right, createdate = "
                           ":createdate WHERE id = :id"));
        for (const Column& c : vdrColumns())
            q.bindValue(QLatin1Char(':') + QLatin1String(c.name), row.values.value(QLatin1String(c.name)));
        q.bindValue(QStringLiteral(":id"), row.id);
        if (!q.exec()) {
            message(VDRPrompt::Critical, tr("Datenbankfehler"),
                    tr("Die Tabelle 'vdr' der Datei\n%1\n konnte nicht importiert werden.\n%2")
                        .arg(path, q.lastError().text()));
            return 3;
        }
    }
    return 0;
}

// The diary's companies give way to the file's, which keep their ids.
int VDRReportSynchronisation::replaceCompanies(const QString& path, const QList<MasterDataRow>& companies)
{
    QSqlDatabase diary = m_document->database();
    const QString syncTitle = tr("Synchronisationsfehler");
    QSqlQuery remove(diary);
    if (!remove.exec(QStringLiteral("DELETE FROM company WHERE category IN (1, -1, 2, -2)"))) {
        message(VDRPrompt::Critical, syncTitle,
                tr("Fehler beim Import der Importdatei \n%1.\nDie Firmenliste konnte nicht gelöscht "
                   "werden.\n\n "
                   "Bitte wenden Sie sich an den Support.")
                    .arg(path));
        return 1;
    }
    int highest = 0;
    QSqlQuery insert(diary);
    insert.prepare(
        QStringLiteral("INSERT INTO company (id, category, type, firstname, lastname, company, street, "
                       "plz, city, telephone, telefax, mobile, email, pos) VALUES (?, ?, ?, ?, ?, ?, ?, "
                       "?, ?, ?, ?, ?, ?, ?)"));
    for (const MasterDataRow& row : companies) {
        insert.addBindValue(row.id);
        for (const Column& c : companyColumns())
            insert.addBindValue(row.values.value(QLatin1String(c.name)));
        if (!insert.exec()) {
            message(VDRPrompt::Critical, syncTitle,
                    tr("Fehler beim Import der Firmenliste der Importdatei\n%1.\nDas Anlegen eines "
                       "Firmeneintrags "
                       "ist fehlgeschlagen.\nDie Firmenliste wurde nicht importiert.")
                            .arg(path) +
                        QLatin1Char('\n') + insert.lastError().text());
            return 1;
        }
        highest = std::max(highest, row.id);
    }

    // Ids are never handed out twice: the counter only grows.
    QSqlQuery q(diary);
    q.prepare(QStringLiteral("UPDATE id_generator SET id_counter = :id WHERE id_table = :tablename;"));
    q.bindValue(QStringLiteral(":id"),
                std::max(highest, countOf(diary, QStringLiteral("SELECT id_counter FROM id_generator WHERE "
                                                                "id_table = 'company'"))));
    q.bindValue(QStringLiteral(":tablename"), QStringLiteral("company"));
    if (!q.exec()) {
        message(VDRPrompt::Critical, syncTitle,
                tr("Update der Tabelle 'id_generator' ist fehlgeschlagen. (Import-Datei %1)\nDie "
                   "Firmenliste wurde "
                   "nicht importiert.\n\n%2")
                    .arg(path, q.lastError().text()));
        return 1;
    }
    return 0;
}
