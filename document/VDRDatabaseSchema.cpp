#include "document/VDRDatabaseSchema.h"

#include "document/CVdShared.h"
#include "document/VDRPrompt.h"

#include <QCoreApplication>
#include <QDebug>
#include <QFile>
#include <QSqlError>
#include <QSqlQuery>
#include <QSqlRecord>
#include <QTextStream>

#include <functional>

static void initDatabaseResources()
{
    Q_INIT_RESOURCE(database);
}

namespace {

QString tr(const char* text)
{
    return QCoreApplication::translate("VDRDatabaseSchema", text);
}

struct ColumnInfo
{
    QString name;
    QString type;
    bool notNull = false;
    QString defaultValue;
    bool primaryKey = false;
};

QList<ColumnInfo> columnInfo(QSqlDatabase db, const QString& table)
{
    QList<ColumnInfo> result;
    QSqlQuery q(db);
    if (!q.exec(QStringLiteral("PRAGMA table_info(%1)").arg(table)))
        return result;
    while (q.next()) {
        ColumnInfo c;
        c.name = q.value(1).toString();
        c.type = q.value(2).toString();
        c.notNull = q.value(3).toInt() != 0;
        c.defaultValue = q.value(4).isNull() ? QString() : q.value(4).toString();
        c.primaryKey = q.value(5).toInt() != 0;
        result.append(c);
    }
    return result;
}

// Column names come from the file: quoted, so any name the file holds can be written again.
QString quotedName(const QString& name)
{
    return QLatin1Char('"') + QString(name).replace(QLatin1Char('"'), QLatin1String("\"\"")) +
           QLatin1Char('"');
}

QString columnDefinition(const ColumnInfo& c)
{
    QString def = quotedName(c.name) + QLatin1Char(' ') + c.type;
    if (c.notNull)
        def += QStringLiteral(" NOT NULL");
    if (c.primaryKey)
        def += QStringLiteral(" PRIMARY KEY");
    if (!c.defaultValue.isNull())
        def += QStringLiteral(" DEFAULT ") + c.defaultValue;
    return def;
}

// Runs the upgrade statements and remembers the first failure.
class Upgrader
{
public:
    explicit Upgrader(QSqlDatabase db) : m_db(db) {}

    bool failed() const { return m_failed; }
    bool extended() const { return m_extended; }

    bool exec(const QString& sql)
    {
        if (m_failed)
            return false;
        QSqlQuery q(m_db);
        if (!q.exec(sql)) {
            m_failed = true;
            qWarning().noquote() << "upgrade failed:" << sql << q.lastError().text();
            VDRPrompt::warning(QStringLiteral("SQL Error"), CVdShared::sqlErrorText(q.lastError()));
            return false;
        }
        m_extended = true;
        return true;
    }

    void fail(const QSqlError& error)
    {
        m_failed = true;
        qWarning().noquote() << "upgrade failed:" << error.text();
        VDRPrompt::warning(QStringLiteral("SQL Error"), CVdShared::sqlErrorText(error));
    }

    bool hasColumn(const QString& table, const QString& column)
    {
        return VDRDatabaseSchema::columns(m_db, table).contains(column, Qt::CaseInsensitive);
    }

    void addColumn(const QString& table, const QString& column, const QString& definition)
    {
        if (!m_failed && !hasColumn(table, column))
            exec(QStringLiteral("ALTER TABLE %1 ADD %2 %3").arg(table, column, definition));
    }

    void createTable(const QString& table, const QString& statement)
    {
        if (!m_failed && !VDRDatabaseSchema::tableExists(m_db, table))
            exec(statement);
    }

    // Runs 'work' inside one transaction; a failure rolls the step back.
    void transaction(const std::function<void()>& work)
    {
        if (m_failed)
            return;
        QSqlQuery q(m_db);
        q.exec(QStringLiteral("BEGIN EXCLUSIVE TRANSACTION"));
        work();
        QSqlQuery end(m_db);
        if (m_failed)
            end.exec(QStringLiteral("ROLLBACK TRANSACTION"));
        else if (!end.exec(QStringLiteral("COMMIT TRANSACTION")))
            exec(QStringLiteral("COMMIT TRANSACTION"));
    }

    QSqlDatabase db() const { return m_db; }

private:
    QSqlDatabase m_db;
    bool m_failed = false;
    bool m_extended = false;
};

// One column of a rebuilt table: its definition, and the expression that fills it from the old rows
// (empty: the old column of the same name).
struct NewColumn
{
    QString definition;
    QString source;
};

// Rebuilds 'table' into 'layout' through a temporary "<table>_backup", inside the caller's
// transaction. Old columns that the layout does not name and 'consumed' does not list are carried
// along with their values: a file may hold columns this version does not know.
void rebuildTable(Upgrader& u, const QString& table, const QList<NewColumn>& layout,
                  const QStringList& consumed = {})
{
    if (u.failed())
        return;
    QStringList definitions;
    QStringList names;
    QStringList sources;
    for (const NewColumn& c : layout) {
        const QString name = c.definition.section(QLatin1Char(' '), 0, 0);
        definitions << c.definition;
        names << name;
        sources << (c.source.isEmpty() ? name : c.source);
    }
    const QStringList known = names + consumed;
    for (const ColumnInfo& c : columnInfo(u.db(), table)) {
        if (known.contains(c.name, Qt::CaseInsensitive))
            continue;
        definitions << columnDefinition(c);
        names << quotedName(c.name);
        sources << quotedName(c.name);
    }
    const QString backup = table + QStringLiteral("_backup");
    const QString allNames = names.join(QLatin1String(", "));
    u.exec(
        QStringLiteral("CREATE TEMPORARY TABLE %1 (%2)").arg(backup, definitions.join(QLatin1String(", "))));
    u.exec(QStringLiteral("INSERT INTO %1 (%2) SELECT %3 FROM %4")
               .arg(backup, allNames, sources.join(QLatin1String(", ")), table));
    u.exec(QStringLiteral("DROP TABLE %1").arg(table));
    u.exec(QStringLiteral("CREATE TABLE %1 (%2)").arg(table, definitions.join(QLatin1String(", "))));
    u.exec(QStringLiteral("INSERT INTO %1 (%2) SELECT %2 FROM %3").arg(table, allNames, backup));
    u.exec(QStringLiteral("DROP TABLE %1").arg(backup));
}

// Rebuilds entry_progress so that `date` may be NULL.
void upgradeProgressDate(Upgrader& u)
{
    const QList<ColumnInfo> cols = columnInfo(u.db(), QStringLiteral("entry_progress"));
    bool hasDate = false;
    bool dateNotNull = false;
    for (const ColumnInfo& c : cols) {
        if (c.name.compare(QLatin1String("date"), Qt::CaseInsensitive) == 0) {
            hasDate = true;
            dateNotNull = c.notNull;
        }
    }
    if (hasDate && !dateNotNull)
        return;

    u.transaction([&] {
        if (!hasDate)
            u.exec(QStringLiteral("ALTER TABLE entry_progress ADD date DATE"));
        rebuildTable(u, QStringLiteral("entry_progress"),
                     {{QStringLiteral("id INTEGER NOT NULL PRIMARY KEY"), {}},
                      {QStringLiteral("entry_id INTEGER NOT NULL"), {}},
                      {QStringLiteral("type INTEGER NOT NULL"), {}},
                      {QStringLiteral("description TEXT NOT NULL"), {}},
                      {QStringLiteral("company_id INTEGER"), {}},
                      {QStringLiteral("date DATE"), {}}});
    });
}

// Creates entry_time_recording and turns the three count/type pairs of the old workforce rows
// into time-recording rows and one summed workforce row each.
void upgradeTimeRecording(Upgrader& u)
{
    if (VDRDatabaseSchema::tableExists(u.db(), QStringLiteral("entry_time_recording")))
        return;
    u.transaction([&] {
        u.exec(QStringLiteral(
            "CREATE TABLE entry_time_recording (id INTEGER NOT NULL PRIMARY KEY, entry_id INTEGER NOT "
            "NULL, workforce_id INTEGER NOT NULL, person_count INTEGER, person_type TEXT NOT NULL, "
            "time_from TIME, time_to TIME, breaks INTEGER, hours REAL)"));
        if (u.failed())
            return;
        const QStringList cols = VDRDatabaseSchema::columns(u.db(), QStringLiteral("entry_workforce"));
        const bool oldLayout = cols.contains(QLatin1String("count1"), Qt::CaseInsensitive);
        if (!oldLayout)
            return;
        auto has = [&](const QString& name) { return cols.contains(name, Qt::CaseInsensitive); };
        auto count = [&](int pair) {
            const QString name = QStringLiteral("count%1").arg(pair);
            return has(name) ? QStringLiteral("CAST(IFNULL(%1, 0) AS INTEGER)").arg(name)
                             : QStringLiteral("0");
        };
        auto type = [&](int pair) {
            const QString name = QStringLiteral("type%1").arg(pair);
            return has(name) ? QStringLiteral("CAST(IFNULL(%1, '') AS TEXT)").arg(name)
                             : QStringLiteral("''");
        };

        QSqlQuery read(u.db());
        read.setForwardOnly(true);
        if (!read.exec(QStringLiteral("SELECT id, entry_id, %1, %2, %3, %4, %5, %6 FROM entry_workforce")
                           .arg(count(1), type(1), count(2), type(2), count(3), type(3)))) {
            u.fail(read.lastError());
            return;
        }
        int counter = 0;
        {
            QSqlQuery maxId(u.db());
            if (maxId.exec(QStringLiteral(
                    "SELECT id_counter FROM id_generator WHERE id_table = 'entry_time_recording'")) &&
                maxId.next())
                counter = maxId.value(0).toInt();
        }
        QSqlQuery insert(u.db());
        insert.prepare(QStringLiteral(
            "INSERT INTO entry_time_recording (id, entry_id, workforce_id, person_count, "
            "person_type) VALUES (:id, :entry_id, :workforce_id, :person_count, :person_type)"));
        while (read.next()) {
            for (int i = 0; i < 3; ++i) {
                const int personCount = read.value(2 + 2 * i).toInt();
                const QString personType = read.value(3 + 2 * i).toString();
                if (personCount > 0 || !personType.trimmed().isEmpty()) {
                    insert.bindValue(QStringLiteral(":id"), ++counter);
                    insert.bindValue(QStringLiteral(":entry_id"), read.value(1));
                    insert.bindValue(QStringLiteral(":workforce_id"), read.value(0));
                    insert.bindValue(QStringLiteral(":person_count"), personCount);
                    insert.bindValue(QStringLiteral(":person_type"), personType);
                    if (!insert.exec()) {
                        u.fail(insert.lastError());
                        return;
                    }
                }
            }
        }
        read.finish();
        if (counter > 0) {
            u.exec(QStringLiteral("DELETE FROM id_generator WHERE id_table = 'entry_time_recording'"));
            u.exec(QStringLiteral(
                       "INSERT INTO id_generator (id_table, id_counter) VALUES ('entry_time_recording', %1)")
                       .arg(counter));
        }

        // The type texts are joined with ", ", each only when it is not empty and not seen before.
        const QString personType =
            QStringLiteral("%1 || CASE WHEN %2 <> '' AND %2 <> %1 THEN ', ' || %2 ELSE '' END || CASE WHEN "
                           "%3 <> '' AND %3 <> %1 AND %3 <> %2 THEN ', ' || %3 ELSE '' END")
                .arg(type(1), type(2), type(3));
        QList<NewColumn> layout{
            {QStringLiteral("id INTEGER NOT NULL PRIMARY KEY"), {}},
            {QStringLiteral("entry_id INTEGER NOT NULL"), {}},
            {QStringLiteral("company_id INTEGER"), {}},
            {QStringLiteral("comment TEXT NOT NULL"), QStringLiteral("IFNULL(comment, ' ')")},
            {QStringLiteral("person_count INTEGER NOT NULL"),
             QStringLiteral("%1 + %2 + %3").arg(count(1), count(2), count(3))},
            {QStringLiteral("person_type TEXT NOT NULL"), personType},
            {QStringLiteral("man_hours REAL"),
             has(QStringLiteral("man_hours")) ? QString() : QStringLiteral("NULL")},
        };
        if (has(QStringLiteral("pos")))
            layout.append(
                {QStringLiteral("pos INTEGER NOT NULL DEFAULT 0"), QStringLiteral("IFNULL(pos, id)")});
        rebuildTable(u, QStringLiteral("entry_workforce"), layout,
                     {QStringLiteral("count1"), QStringLiteral("type1"), QStringLiteral("count2"),
                      QStringLiteral("type2"), QStringLiteral("count3"), QStringLiteral("type3")});
    });
}

// Rebuilds entry_constructionmaterial with quantity and unit; the old OK flags move into the texts.
void upgradeMaterial(Upgrader& u)
{
    const QStringList cols = VDRDatabaseSchema::columns(u.db(), QStringLiteral("entry_constructionmaterial"));
    if (cols.isEmpty() || cols.contains(QLatin1String("quantity"), Qt::CaseInsensitive))
        return;
    auto has = [&](const char* name) { return cols.contains(QLatin1String(name), Qt::CaseInsensitive); };
    auto text = [&](const char* name) {
        return has(name) ? QStringLiteral("IFNULL(%1, '')").arg(QLatin1String(name)) : QStringLiteral("''");
    };
    auto okText = [&](const char* textCol, const char* flagCol) {
        if (!has(flagCol))
            return text(textCol);
        return QStringLiteral("CASE WHEN %1 THEN 'OK, ' || %2 ELSE %2 END")
            .arg(QLatin1String(flagCol), text(textCol));
    };
    auto orElse = [&](const char* name, const char* fallback) {
        return has(name) ? QString() : QString::fromLatin1(fallback);
    };
    QList<NewColumn> layout{
        {QStringLiteral("id INTEGER NOT NULL PRIMARY KEY"), {}},
        {QStringLiteral("entry_id INTEGER NOT NULL"), {}},
        {QStringLiteral("material TEXT NOT NULL"), text("material")},
        {QStringLiteral("quantity REAL"), QStringLiteral("NULL")},
        {QStringLiteral("unit TEXT"), QStringLiteral("''")},
        {QStringLiteral("process TEXT NOT NULL"), text("process")},
        {QStringLiteral("company_id INTEGER"), orElse("company_id", "NULL")},
        {QStringLiteral("material_temperature INTEGER NOT NULL"),
         has("material_temperature") ? QStringLiteral("IFNULL(material_temperature, 0)")
                                     : QStringLiteral("0")},
        {QStringLiteral("conditions TEXT NOT NULL"), okText("conditions", "conditions_ok")},
        {QStringLiteral("workflow TEXT NOT NULL"), okText("workflow", "workflow_ok")},
        {QStringLiteral("note TEXT NOT NULL"), text("note")},
        {QStringLiteral("document TEXT"), orElse("document", "NULL")},
    };
    if (has("pos"))
        layout.append({QStringLiteral("pos INTEGER NOT NULL DEFAULT 0"), {}});
    u.transaction([&] {
        rebuildTable(u, QStringLiteral("entry_constructionmaterial"), layout,
                     {QStringLiteral("conditions_ok"), QStringLiteral("workflow_ok")});
    });
}

void addPhotoCompanyAndDeliveryDocument(Upgrader& u)
{
    u.addColumn("entry_photo", "company_id", "INTEGER");
    u.addColumn("entry_scheduleddelivery", "document", "TEXT");
}

// The project's number, address and description, what the printout's head and foot show, and a
// second logo.
void addProjectDataColumns(Upgrader& u)
{
    for (const char* c : {"projectnumber", "projectaddress", "projectdescription"})
        u.addColumn("vdr", c, "TEXT");
    for (const char* c : {"show_projectname", "show_projectnumber", "show_headleft", "show_headcenter",
                          "show_headright", "show_footerleft", "show_footercenter", "show_footerright",
                          "show_projectaddress", "show_projectdescription"})
        u.addColumn("vdr", c, "INTEGER NOT NULL DEFAULT 0");
    for (const char* c : {"show_address1", "show_address2", "show_address3"})
        u.addColumn("vdr", c, "INTEGER DEFAULT 0");
    for (const char* c : {"address1", "address2", "address3"})
        u.addColumn("vdr", c, "INTEGER DEFAULT -1");
    u.addColumn("vdr", "logo2_image_id", "INTEGER NOT NULL DEFAULT 0");
    u.addColumn("vdr", "logo2_align", "INTEGER NOT NULL DEFAULT 0");
}

void addMaterialDocumentAndMeasureLocation(Upgrader& u)
{
    u.addColumn("entry_constructionmaterial", "document", "TEXT");
    u.addColumn("entry_constructionmeasure", "location", "TEXT");
    u.addColumn("entry_constructionmeasure", "kks", "TEXT");
}

void createExternalEntryNumberTable(Upgrader& u)
{
    u.createTable("external_entry_number",
                  "CREATE TABLE external_entry_number (number TEXT NOT NULL, filepath TEXT NOT NULL)");
}

void addReportNoticeColumns(Upgrader& u)
{
    u.addColumn("entry", "notice", "TEXT");
    u.addColumn("entry", "print_notice", "INTEGER NOT NULL DEFAULT 1");
    u.addColumn("entry", "print_telephone_notice", "INTEGER NOT NULL DEFAULT 1");
}

void createTelephoneNoticeAndConcernTables(Upgrader& u)
{
    u.createTable("entry_telephone_notice",
                  "CREATE TABLE entry_telephone_notice (id INTEGER NOT NULL PRIMARY KEY, "
                  "entry_id INTEGER NOT NULL, description TEXT NOT NULL, company_id INTEGER, "
                  "time TIME NOT NULL)");
    u.createTable("entry_concern",
                  "CREATE TABLE entry_concern (id INTEGER NOT NULL PRIMARY KEY, "
                  "entry_id INTEGER NOT NULL, description TEXT NOT NULL, company_id INTEGER)");
}

// The rows keep the order they were made in.
void addWorkforcePositions(Upgrader& u)
{
    if (u.hasColumn("entry_workforce", "pos"))
        return;
    u.exec("ALTER TABLE entry_workforce ADD pos INTEGER NOT NULL DEFAULT 0");
    u.exec("UPDATE entry_workforce SET pos=id;");
}

void createEquipmentTable(Upgrader& u)
{
    u.createTable(
        "entry_equipment",
        "CREATE TABLE entry_equipment (id INTEGER NOT NULL PRIMARY KEY, entry_id INTEGER NOT NULL, "
        "equipment TEXT NOT NULL, operating_zone TEXT NOT NULL, company_id INTEGER, entry_time TIME, "
        "exit_time TIME, operating_time INTEGER, downtime INTEGER, downtime_reasons TEXT NOT NULL, "
        "comment TEXT NOT NULL)");
}

void addProgressRoomColumns(Upgrader& u)
{
    u.addColumn("entry_progress", "roomname", "TEXT NOT NULL DEFAULT \"\"");
    u.addColumn("entry_progress", "roombook_number", "TEXT NOT NULL DEFAULT \"\"");
}

// Rows the user can reorder; the existing ones keep the order they were made in.
void addPositionColumns(Upgrader& u)
{
    for (const char* table :
         {"company", "entry_attendee", "entry_progress", "entry_task", "entry_constructionmeasure",
          "entry_constructionmaterial", "entry_scheduleddelivery", "entry_telephone_notice", "entry_concern",
          "entry_equipment", "entry_time_recording"}) {
        if (!u.failed() && VDRDatabaseSchema::tableExists(u.db(), table) && !u.hasColumn(table, "pos")) {
            u.exec(QStringLiteral("ALTER TABLE %1 ADD pos INTEGER NOT NULL DEFAULT 0")
                       .arg(QLatin1String(table)));
            u.exec(QStringLiteral("UPDATE %1 SET pos=id").arg(QLatin1String(table)));
        }
    }
}

void addPhotoRelationAndAudioColumns(Upgrader& u)
{
    u.addColumn("entry_photo", "relation_id", "INTEGER");
    u.addColumn("entry_progress", "image_cnt", "INTEGER");
    u.addColumn("entry", "progress_audio_id", "INTEGER");
}

void createAudioTable(Upgrader& u)
{
    u.createTable(
        "audio",
        "CREATE TABLE audio (id INTEGER NOT NULL PRIMARY KEY AUTOINCREMENT, recording BLOB NOT NULL, "
        "recording_date DATE NOT NULL, recording_time TIME NOT NULL, "
        "recording_status INTEGER NOT NULL DEFAULT 0)");
}

// The report's author, when it was made, and whether the mobile app exported it.
void addReportAuthorColumns(Upgrader& u)
{
    if (u.hasColumn("entry", "user_id"))
        return;
    u.exec("ALTER TABLE entry ADD user_id TEXT");
    u.addColumn("entry", "creation_date", "DATETIME");
    u.addColumn("entry", "exported_by_app", "INTEGER DEFAULT 0");
}

void addReportImportVersion(Upgrader& u)
{
    u.addColumn("entry", "import_version", "DATETIME");
}

} // namespace

bool VDRDatabaseSchema::runScript(QSqlDatabase db, const QString& resourcePath, const QString& dbErrorTitle)
{
    initDatabaseResources();
    QFile file(resourcePath);
    if (!file.open(QIODevice::ReadOnly | QIODevice::Text)) {
        VDRPrompt::critical(dbErrorTitle, file.errorString());
        VDRPrompt::critical(tr("interner Fehler"), tr("Datenbank-Initialisierung fehlgeschlagen."));
        return false;
    }
    const QString script = QString::fromUtf8(file.readAll());
    const QStringList statements = script.split(QLatin1Char(';'));
    for (const QString& piece : statements) {
        const QString statement = piece.trimmed();
        if (statement.isEmpty())
            continue;
        QSqlQuery q(db);
        if (!q.exec(statement)) {
            qWarning().noquote() << "schema statement failed:" << q.lastError().text();
            VDRPrompt::critical(tr("interner Fehler"), tr("Datenbank-Initialisierung fehlgeschlagen."));
            return false;
        }
    }
    return true;
}

bool VDRDatabaseSchema::createStructure(QSqlDatabase db)
{
    return runScript(db, createScriptPath(), tr("Datenbankfehler"));
}

int VDRDatabaseSchema::compareVersions(const QString& a, const QString& b)
{
    const QStringList pa = a.split(QLatin1Char('.'));
    const QStringList pb = b.split(QLatin1Char('.'));
    const int majorA = pa.value(0).toInt();
    const int majorB = pb.value(0).toInt();
    if (majorA != majorB)
        return majorA < majorB ? -1 : 1;
    const int minorA = pa.value(1).toInt();
    const int minorB = pb.value(1).toInt();
    if (minorA != minorB)
        return minorA < minorB ? -1 : 1;
    return 0;
}

QStringList VDRDatabaseSchema::reportTables()
{
    return {QStringLiteral("entry_attendee"),
            QStringLiteral("entry_workforce"),
            QStringLiteral("entry_time_recording"),
            QStringLiteral("entry_progress"),
            QStringLiteral("entry_photo"),
            QStringLiteral("entry_task"),
            QStringLiteral("entry_constructionmeasure"),
            QStringLiteral("entry_constructionmaterial"),
            QStringLiteral("entry_scheduleddelivery"),
            QStringLiteral("entry_telephone_notice"),
            QStringLiteral("entry_concern"),
            QStringLiteral("entry_equipment")};
}

bool VDRDatabaseSchema::createEntryIndexes(QSqlDatabase db)
{
    // One commit for all, inside the caller's transaction or on its own.
    QSqlQuery savepoint(db);
    savepoint.exec(QStringLiteral("SAVEPOINT entry_indexes"));
    bool ok = true;
    for (const QString& table : reportTables()) {
        if (!tableExists(db, table))
            continue;
        QSqlQuery q(db);
        if (!q.exec(QStringLiteral("CREATE INDEX IF NOT EXISTS %1_entry_id ON %1(entry_id)").arg(table))) {
            qWarning().noquote() << "index on" << table << "not created:" << q.lastError().text();
            ok = false;
        }
    }
    savepoint.exec(QStringLiteral("RELEASE entry_indexes"));
    return ok;
}

bool VDRDatabaseSchema::tableExists(QSqlDatabase db, const QString& table)
{
    QSqlQuery q(db);
    q.prepare(QStringLiteral("SELECT count(*) FROM sqlite_master WHERE type = 'table' AND name = :name"));
    q.bindValue(QStringLiteral(":name"), table);
    return q.exec() && q.next() && q.value(0).toInt() > 0;
}

QStringList VDRDatabaseSchema::columns(QSqlDatabase db, const QString& table)
{
    QStringList result;
    for (const ColumnInfo& c : columnInfo(db, table))
        result << c.name;
    return result;
}

bool VDRDatabaseSchema::upgrade(QSqlDatabase db, bool& extended)
{
    // In the order the structure grew: a later step may rely on what an earlier one made.
    using UpgradeStep = void (*)(Upgrader&);
    static const UpgradeStep steps[] = {
        addPhotoCompanyAndDeliveryDocument,
        addProjectDataColumns,
        addMaterialDocumentAndMeasureLocation,
        upgradeProgressDate,
        createExternalEntryNumberTable,
        addReportNoticeColumns,
        createTelephoneNoticeAndConcernTables,
        upgradeTimeRecording,
        addWorkforcePositions,
        upgradeMaterial,
        createEquipmentTable,
        addProgressRoomColumns,
        addPositionColumns,
        addPhotoRelationAndAudioColumns,
        createAudioTable,
        addReportAuthorColumns,
        addReportImportVersion,
    };
    Upgrader u(db);
    for (const UpgradeStep step : steps) {
        if (u.failed())
            break;
        step(u);
    }
    extended = u.extended();
    return !u.failed();
}
