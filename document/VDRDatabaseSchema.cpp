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

QString columnDefinition(const ColumnInfo& c)
{
    QString def = c.name + QLatin1Char(' ') + c.type;
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

// Rebuilds entry_progress so that `date` may be NULL. Columns beyond the six of the old layout are
// carried along, so no data is lost whatever layout the file had.
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

    const QStringList base = {"id", "entry_id", "type", "description", "company_id", "date"};
    QStringList extraDefs;
    QStringList extraNames;
    for (const ColumnInfo& c : cols) {
        if (!base.contains(c.name, Qt::CaseInsensitive)) {
            extraDefs << columnDefinition(c);
            extraNames << c.name;
        }
    }
    const QString baseDefs =
        QStringLiteral("id INTEGER NOT NULL PRIMARY KEY,entry_id INTEGER NOT NULL,type INTEGER "
                       "NOT NULL,description TEXT NOT NULL,company_id INTEGER,date DATE");
    const QString allDefs =
        extraDefs.isEmpty() ? baseDefs : baseDefs + QLatin1Char(',') + extraDefs.join(',');
    const QString allNames = (base + extraNames).join(',');

    u.transaction([&] {
        u.exec(QStringLiteral("CREATE TEMPORARY TABLE entry_progress_backup(%1)").arg(allDefs));
        if (!hasDate)
            u.exec(QStringLiteral("ALTER TABLE entry_progress ADD date DATE"));
        u.exec(
            QStringLiteral("INSERT INTO entry_progress_backup SELECT %1 FROM entry_progress").arg(allNames));
        u.exec(QStringLiteral("DROP TABLE entry_progress"));
        u.exec(QStringLiteral("CREATE TABLE entry_progress(%1)").arg(allDefs));
        u.exec(
            QStringLiteral("INSERT INTO entry_progress SELECT %1 FROM entry_progress_backup").arg(allNames));
        u.exec(QStringLiteral("DROP TABLE entry_progress_backup"));
    });
}

QString joinTypes(const QString& t1, const QString& t2, const QString& t3)
{
    QString result = t1;
    if (!t2.isEmpty() && t2 != t1)
        result += QStringLiteral(", ") + t2;
    if (!t3.isEmpty() && t3 != t1 && t3 != t2)
        result += QStringLiteral(", ") + t3;
    return result;
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
        auto col = [&](const QString& name) {
            return cols.contains(name, Qt::CaseInsensitive) ? name : QStringLiteral("NULL");
        };
        const bool hasPos = cols.contains(QLatin1String("pos"), Qt::CaseInsensitive);

        QSqlQuery read(u.db());
        read.setForwardOnly(true);
        const QString select =
            QStringLiteral(
                "SELECT id, entry_id, company_id, comment, %1, %2, %3, %4, %5, %6, %7 FROM entry_workforce")
                .arg(col("count1"), col("type1"), col("count2"), col("type2"), col("count3"), col("type3"),
                     hasPos ? QStringLiteral("pos") : QStringLiteral("NULL"));
        if (!read.exec(select)) {
            u.fail(read.lastError());
            return;
        }
        struct Row
        {
            QVariant id, entryId, companyId, comment, pos;
            int count = 0;
            QString type;
        };
        QList<Row> rows;
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
            Row row;
            row.id = read.value(0);
            row.entryId = read.value(1);
            row.companyId = read.value(2);
            row.comment = read.value(3).isNull() ? QStringLiteral(" ") : read.value(3).toString();
            row.pos = read.value(10);
            QString types[3];
            for (int i = 0; i < 3; ++i) {
                const int count = read.value(4 + 2 * i).toInt();
                types[i] = read.value(5 + 2 * i).toString();
                if (count > 0 || !types[i].trimmed().isEmpty()) {
                    insert.bindValue(QStringLiteral(":id"), ++counter);
                    insert.bindValue(QStringLiteral(":entry_id"), row.entryId);
                    insert.bindValue(QStringLiteral(":workforce_id"), row.id);
                    insert.bindValue(QStringLiteral(":person_count"), count);
                    insert.bindValue(QStringLiteral(":person_type"), types[i]);
                    if (!insert.exec()) {
                        u.fail(insert.lastError());
                        return;
                    }
                }
                row.count += count;
            }
            row.type = joinTypes(types[0], types[1], types[2]);
            rows.append(row);
        }
        read.finish();
        if (counter > 0) {
            u.exec(QStringLiteral("DELETE FROM id_generator WHERE id_table = 'entry_time_recording'"));
            u.exec(QStringLiteral(
                       "INSERT INTO id_generator (id_table, id_counter) VALUES ('entry_time_recording', %1)")
                       .arg(counter));
        }

        const QString posDef = hasPos ? QStringLiteral(", pos INTEGER NOT NULL DEFAULT 0") : QString();
        const QString layout =
            QStringLiteral("id INTEGER NOT NULL PRIMARY KEY, entry_id INTEGER NOT NULL, company_id "
                           "INTEGER, comment TEXT NOT NULL, person_count INTEGER NOT NULL, "
                           "person_type TEXT NOT NULL, man_hours REAL") +
            posDef;
        // The old rows are held in memory while the table is rebuilt.
        u.exec(QStringLiteral("DROP TABLE entry_workforce"));
        u.exec(QStringLiteral("CREATE TABLE entry_workforce (%1)").arg(layout));
        if (u.failed())
            return;
        QSqlQuery put(u.db());
        put.prepare(hasPos ? QStringLiteral("INSERT INTO entry_workforce (id, entry_id, company_id, comment, "
                                            "person_count, person_type, pos) VALUES (?, ?, ?, ?, ?, ?, ?)")
                           : QStringLiteral("INSERT INTO entry_workforce (id, entry_id, company_id, comment, "
                                            "person_count, person_type) VALUES (?, ?, ?, ?, ?, ?)"));
        for (const Row& row : rows) {
            put.addBindValue(row.id);
            put.addBindValue(row.entryId);
            put.addBindValue(row.companyId);
            put.addBindValue(row.comment);
            put.addBindValue(row.count);
            put.addBindValue(row.type);
            if (hasPos)
                put.addBindValue(row.pos.isNull() ? row.id : row.pos);
            if (!put.exec()) {
                u.fail(put.lastError());
                return;
            }
        }
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
    const bool hasPos = has("pos");
    const QString layout =
        QStringLiteral(
            "id INTEGER NOT NULL PRIMARY KEY, entry_id INTEGER NOT NULL, material TEXT NOT NULL, quantity "
            "REAL, unit TEXT, process TEXT NOT NULL, company_id INTEGER, material_temperature INTEGER NOT "
            "NULL, conditions TEXT NOT NULL, workflow TEXT NOT NULL, note TEXT NOT NULL, document TEXT") +
        (hasPos ? QStringLiteral(", pos INTEGER NOT NULL DEFAULT 0") : QString());
    const QString names = QStringLiteral("id, entry_id, material, quantity, unit, process, company_id, "
                                         "material_temperature, conditions, workflow, note, document") +
                          (hasPos ? QStringLiteral(", pos") : QString());
    const QString select =
        QStringLiteral("SELECT id, entry_id, %1, NULL, '', %2, %3, IFNULL(%4, 0), %5, %6, %7, %8%9 FROM "
                       "entry_constructionmaterial")
            .arg(text("material"), text("process"), has("company_id") ? QStringLiteral("company_id") : "NULL",
                 has("material_temperature") ? QStringLiteral("material_temperature") : "0",
                 okText("conditions", "conditions_ok"), okText("workflow", "workflow_ok"), text("note"),
                 has("document") ? QStringLiteral("document") : "NULL",
                 hasPos ? QStringLiteral(", pos") : QString());
    u.transaction([&] {
        u.exec(QStringLiteral("CREATE TEMPORARY TABLE entry_constructionmaterial_backup (%1)").arg(layout));
        u.exec(QStringLiteral("INSERT INTO entry_constructionmaterial_backup (%1) %2").arg(names, select));
        u.exec(QStringLiteral("DROP TABLE entry_constructionmaterial"));
        u.exec(QStringLiteral("CREATE TABLE entry_constructionmaterial (%1)").arg(layout));
        u.exec(QStringLiteral("INSERT INTO entry_constructionmaterial (%1) SELECT %1 FROM "
                              "entry_constructionmaterial_backup")
                   .arg(names));
        u.exec(QStringLiteral("DROP TABLE entry_constructionmaterial_backup"));
    });
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

bool VDRDatabaseSchema::createEntryIndexes(QSqlDatabase db)
{
    // One commit for all, inside the caller's transaction or on its own.
    QSqlQuery savepoint(db);
    savepoint.exec(QStringLiteral("SAVEPOINT entry_indexes"));
    bool ok = true;
    for (const char* table :
         {"entry_attendee", "entry_workforce", "entry_time_recording", "entry_progress", "entry_photo",
          "entry_task", "entry_constructionmeasure", "entry_constructionmaterial", "entry_scheduleddelivery",
          "entry_telephone_notice", "entry_concern", "entry_equipment"}) {
        if (!tableExists(db, QLatin1String(table)))
            continue;
        QSqlQuery q(db);
        if (!q.exec(QStringLiteral("CREATE INDEX IF NOT EXISTS %1_entry_id ON %1(entry_id)")
                        .arg(QLatin1String(table)))) {
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
    Upgrader u(db);

    // 1, 2
    u.addColumn("entry_photo", "company_id", "INTEGER");
    u.addColumn("entry_scheduleddelivery", "document", "TEXT");
    // 3
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
    // 4, 5
    u.addColumn("entry_constructionmaterial", "document", "TEXT");
    u.addColumn("entry_constructionmeasure", "location", "TEXT");
    u.addColumn("entry_constructionmeasure", "kks", "TEXT");
    // 6
    if (!u.failed())
        upgradeProgressDate(u);
    // 7
    if (!u.failed() && !tableExists(db, "external_entry_number"))
        u.exec("CREATE TABLE external_entry_number (number TEXT NOT NULL, filepath TEXT NOT NULL)");
    // 8
    u.addColumn("entry", "notice", "TEXT");
    u.addColumn("entry", "print_notice", "INTEGER NOT NULL DEFAULT 1");
    u.addColumn("entry", "print_telephone_notice", "INTEGER NOT NULL DEFAULT 1");
    // 9, 10
    if (!u.failed() && !tableExists(db, "entry_telephone_notice"))
        u.exec("CREATE TABLE entry_telephone_notice (id INTEGER NOT NULL PRIMARY KEY, entry_id INTEGER NOT "
               "NULL, "
               "description TEXT NOT NULL, company_id INTEGER, time TIME NOT NULL)");
    if (!u.failed() && !tableExists(db, "entry_concern"))
        u.exec("CREATE TABLE entry_concern (id INTEGER NOT NULL PRIMARY KEY, entry_id INTEGER NOT NULL, "
               "description TEXT NOT NULL, company_id INTEGER)");
    // 11
    if (!u.failed())
        upgradeTimeRecording(u);
    // 12
    if (!u.failed() && !u.hasColumn("entry_workforce", "pos")) {
        u.exec("ALTER TABLE entry_workforce ADD pos INTEGER NOT NULL DEFAULT 0");
        u.exec("UPDATE entry_workforce SET pos=id;");
    }
    // 13
    if (!u.failed())
        upgradeMaterial(u);
    // 14
    if (!u.failed() && !tableExists(db, "entry_equipment"))
        u.exec("CREATE TABLE entry_equipment (id INTEGER NOT NULL PRIMARY KEY, entry_id INTEGER NOT NULL, "
               "equipment TEXT NOT NULL, operating_zone TEXT NOT NULL, company_id INTEGER, entry_time TIME, "
               "exit_time TIME, operating_time INTEGER, downtime INTEGER, downtime_reasons TEXT NOT NULL, "
               "comment TEXT NOT NULL)");
    // 15
    u.addColumn("entry_progress", "roomname", "TEXT NOT NULL DEFAULT \"\"");
    u.addColumn("entry_progress", "roombook_number", "TEXT NOT NULL DEFAULT \"\"");
    // 16
    for (const char* table :
         {"company", "entry_attendee", "entry_progress", "entry_task", "entry_constructionmeasure",
          "entry_constructionmaterial", "entry_scheduleddelivery", "entry_telephone_notice", "entry_concern",
          "entry_equipment", "entry_time_recording"}) {
        if (!u.failed() && tableExists(db, table) && !u.hasColumn(table, "pos")) {
            u.exec(QStringLiteral("ALTER TABLE %1 ADD pos INTEGER NOT NULL DEFAULT 0")
                       .arg(QLatin1String(table)));
            u.exec(QStringLiteral("UPDATE %1 SET pos=id").arg(QLatin1String(table)));
        }
    }
    // 17 to 19
    u.addColumn("entry_photo", "relation_id", "INTEGER");
    u.addColumn("entry_progress", "image_cnt", "INTEGER");
    u.addColumn("entry", "progress_audio_id", "INTEGER");
    // 20
    if (!u.failed() && !tableExists(db, "audio"))
        u.exec(
            "CREATE TABLE audio (id INTEGER NOT NULL PRIMARY KEY AUTOINCREMENT, recording BLOB NOT NULL, "
            "recording_date DATE NOT NULL, recording_time TIME NOT NULL, recording_status INTEGER NOT NULL "
            "DEFAULT 0)");
    // 21
    if (!u.failed() && !u.hasColumn("entry", "user_id")) {
        u.exec("ALTER TABLE entry ADD user_id TEXT");
        u.addColumn("entry", "creation_date", "DATETIME");
        u.addColumn("entry", "exported_by_app", "INTEGER DEFAULT 0");
    }
    // 22
    u.addColumn("entry", "import_version", "DATETIME");

    extended = u.extended();
    return !u.failed();
}
