#include "reportrt/data/sqlconnection.h"

#include <QSqlError>
#include <atomic>

namespace reportrt {

namespace {
QString uniqueName()
{
    static std::atomic<int> counter { 0 };
    return QStringLiteral("ludmox-reportrt-%1").arg(++counter);
}
} // namespace

SqlConnection::SqlConnection(ConnectionSpec spec)
    : m_spec(std::move(spec))
    , m_name(uniqueName())
{ }

SqlConnection::~SqlConnection()
{
    {
        QSqlDatabase db = QSqlDatabase::database(m_name, false);
        if (db.isValid())
            db.close();
    }
    if (QSqlDatabase::contains(m_name))
        QSqlDatabase::removeDatabase(m_name);
}

bool SqlConnection::open(QString& message)
{
    if (!QSqlDatabase::isDriverAvailable(m_spec.driver)) {
        message = QStringLiteral("the database driver %1 is not installed").arg(m_spec.driver);
        return false;
    }
    QSqlDatabase db = QSqlDatabase::contains(m_name)
        ? QSqlDatabase::database(m_name, false)
        : QSqlDatabase::addDatabase(m_spec.driver, m_name);
    db.setDatabaseName(m_spec.databaseName);
    if (!m_spec.hostName.isEmpty())
        db.setHostName(m_spec.hostName);
    if (m_spec.port > 0)
        db.setPort(m_spec.port);
    db.setUserName(m_spec.userName);
    db.setPassword(m_spec.password);
    if (m_spec.driver != u"QODBC")
        db.setConnectOptions(m_spec.options);
    if (db.open())
        return true;
    QString text = db.lastError().text();
    // Drivers may echo the connect string; never let a password through.
    if (!m_spec.password.isEmpty())
        text.replace(m_spec.password, QStringLiteral("****"));
    message = text;
    return false;
}

QSqlDatabase SqlConnection::database() const
{
    return QSqlDatabase::database(m_name, false);
}

} // namespace reportrt
