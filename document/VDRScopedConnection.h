#pragma once

#include <QSqlDatabase>
#include <QSqlError>
#include <QString>

#include <memory>

// A named SQLite connection opened for one operation and removed on every way out. Declare it
// before any query on it, so that the queries are gone when it removes the connection.
class VDRScopedConnection
{
public:
    // 'exclusive' sets "PRAGMA locking_mode = EXCLUSIVE", as every file other than the working copy gets.
    VDRScopedConnection(const QString& name, const QString& path, const QString& options = QString(),
                        bool exclusive = true);
    ~VDRScopedConnection();
    VDRScopedConnection(const VDRScopedConnection&) = delete;
    VDRScopedConnection& operator=(const VDRScopedConnection&) = delete;

    // Opens a file only to read it, without locking it or leaving a -wal/-shm beside it: for files
    // no other process writes in place (a diary, a backup).
    static std::unique_ptr<VDRScopedConnection> readOnlyLook(const QString& name, const QString& path);
    // SQLite's primary result code of an error (SQLITE_BUSY is 5, SQLITE_CORRUPT 11 ...); 0 when none.
    static int sqliteCode(const QSqlError& error);

    bool isOpen() const { return m_open; }
    QSqlError lastError() const { return m_error; }
    QSqlDatabase db() const { return QSqlDatabase::database(m_name, false); }

private:
    QString m_name;
    bool m_added = false;
    bool m_open = false;
    QSqlError m_error;
};
