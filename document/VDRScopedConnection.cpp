#include "document/VDRScopedConnection.h"

#include <QSqlQuery>
#include <QUrl>

VDRScopedConnection::VDRScopedConnection(const QString& name, const QString& path, const QString& options,
                                         bool exclusive)
    : m_name(name)
{
    if (QSqlDatabase::contains(name)) {
        // Someone holds it open; adding it again would pull it from under them.
        m_error = QSqlError(QString(), QStringLiteral("connection %1 is in use").arg(name),
                            QSqlError::ConnectionError);
        return;
    }
    m_added = true;
    QSqlDatabase db = QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), name);
    db.setDatabaseName(path);
    db.setConnectOptions(options);
    m_open = db.open();
    if (!m_open)
        m_error = db.lastError();
    else if (exclusive)
        QSqlQuery(db).exec(QStringLiteral("PRAGMA locking_mode = EXCLUSIVE"));
}

VDRScopedConnection::~VDRScopedConnection()
{
    if (!m_added)
        return;
    {
        QSqlDatabase db = QSqlDatabase::database(m_name, false);
        db.close();
    }
    QSqlDatabase::removeDatabase(m_name);
}

std::unique_ptr<VDRScopedConnection> VDRScopedConnection::readOnlyLook(const QString& name,
                                                                       const QString& path)
{
    QUrl uri = QUrl::fromLocalFile(path);
    uri.setQuery(QStringLiteral("immutable=1"));
    return std::make_unique<VDRScopedConnection>(name, uri.toString(QUrl::FullyEncoded),
                                                 QStringLiteral("QSQLITE_OPEN_READONLY;QSQLITE_OPEN_URI"),
                                                 false);
}

int VDRScopedConnection::sqliteCode(const QSqlError& error)
{
    return error.nativeErrorCode().toInt() & 0xff;
}
