#pragma once

#include <QSqlDatabase>
#include <QString>
#include <QStringList>

// Creates a diary's structure from the schema script and brings older structures up to date.
class VDRDatabaseSchema
{
public:
    static QString currentVersion() { return QStringLiteral("0.4"); }
    static QString createScriptPath()
    {
        return QStringLiteral(":/VDRDatabase/Resources/database_create.sql");
    }

    // Splits a script at ";" and runs every non-empty statement. The caller owns the transaction.
    // Reports failures to the user; returns false on the first failing statement.
    static bool runScript(QSqlDatabase db, const QString& resourcePath, const QString& dbErrorTitle);
    static bool createStructure(QSqlDatabase db);

    // Compares "major.minor" texts numerically: <0, 0 or >0. Missing parts count as 0.
    static int compareVersions(const QString& a, const QString& b);
    static bool isNewerThanCurrent(const QString& version)
    {
        return compareVersions(version, currentVersion()) > 0;
    }

    // Applies every upgrade step whose condition holds. 'extended' tells whether any did.
    // An SQL failure is shown as "SQL Error" and returns false.
    static bool upgrade(QSqlDatabase db, bool& extended);

    // Indexes on entry_id of the report sub-tables, so that one report's models read only its rows.
    // They change no table and no query result, and every SQLite reader and writer keeps them up to
    // date. Missing tables are left out; a failure only costs speed.
    static bool createEntryIndexes(QSqlDatabase db);
    // The twelve tables of a report's rows, each with its entry_id, in a fixed order.
    static QStringList reportTables();

    static bool tableExists(QSqlDatabase db, const QString& table);
    static QStringList columns(QSqlDatabase db, const QString& table);
};
