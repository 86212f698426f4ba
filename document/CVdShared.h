#pragma once

#include <QSqlError>
#include <QString>

// Small helpers used across the program.
class CVdShared
{
public:
    // The text of an SQL failure as a user should see it: SQLite's own message ("database disk
    // image is malformed") rather than Qt's generic "Unable to execute statement".
    static QString sqlErrorText(const QSqlError& error)
    {
        const QString database = error.databaseText().trimmed();
        return database.isEmpty() ? error.driverText() : database;
    }
};
