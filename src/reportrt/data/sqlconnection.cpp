#include "reportrt/data/sqlconnection.h"

#include "reportrt/data/odbcdrivers.h"

#include <QFileInfo>
#include <QSqlError>
#include <QSqlQuery>
#include <atomic>

namespace reportrt {

namespace {
QString uniqueName()
{
    static std::atomic<int> counter { 0 };
    return QStringLiteral("ludmox-reportrt-%1").arg(++counter);
}

// SQLite opens any file and finds out what it is only when it first reads it; reading the
// header now makes a file of another kind fail here, named, and not in the first query.
bool isSqliteDatabase(const QSqlDatabase& db, QString& message)
{
    QSqlQuery probe(db);
    if (probe.exec(QStringLiteral("PRAGMA schema_version")))
        return true;
    message = QStringLiteral("the file is not a SQLite database (%1)")
                  .arg(probe.lastError().databaseText());
    return false;
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
    const bool isFile = m_spec.driver == u"QSQLITE";
    if (isFile && !QFileInfo(m_spec.databaseName).isFile()) {
        message = QFileInfo::exists(m_spec.databaseName)
            ? QStringLiteral("it is not a file")
            : QStringLiteral("the file does not exist");
        return false;
    }
    if (!QSqlDatabase::isDriverAvailable(m_spec.driver)) {
        message = QStringLiteral("the database driver %1 is not installed").arg(m_spec.driver);
        return false;
    }
    const bool isOdbc = m_spec.driver == u"QODBC";
    if (isOdbc) {
        // Asked first: the driver manager's own answer ("Can't open lib 'X' : file not
        // found") does not say that X is the driver's name, nor what is installed.
        message = OdbcDrivers::problem(m_spec.odbcDriver);
        if (!message.isEmpty())
            return false;
    }
    const QString connectString = isOdbc ? m_spec.odbcConnectString() : QString();
    if (connectString.contains(QChar(0))) {
        // Drivers read the string up to the first NUL; the rest would be lost unseen.
        message = QStringLiteral("a logon value holds a NUL character");
        return false;
    }
    QSqlDatabase db = QSqlDatabase::contains(m_name)
        ? QSqlDatabase::database(m_name, false)
        : QSqlDatabase::addDatabase(m_spec.driver, m_name);
    if (isOdbc) {
        // The credentials travel in the connect string, quoted: QODBC would append its user
        // name and password unquoted.
        db.setDatabaseName(connectString);
    } else {
        db.setDatabaseName(m_spec.databaseName);
        if (!m_spec.hostName.isEmpty())
            db.setHostName(m_spec.hostName);
        if (m_spec.port > 0)
            db.setPort(m_spec.port);
        db.setUserName(m_spec.userName);
        db.setPassword(m_spec.password);
    }
    db.setConnectOptions(m_spec.options);
    if (db.open()) {
        if (!isFile || isSqliteDatabase(db, message))
            return true;
        db.close();
        return false;
    }
    QString text = db.lastError().text();
    // Drivers may echo the connect string; never let a password through.
    if (!m_spec.password.isEmpty()) {
        text.replace(m_spec.password, QStringLiteral("****"));
        text.replace(
            QString(m_spec.password).replace(u'}', QStringLiteral("}}")), QStringLiteral("****"));
    }
    message = text;
    return false;
}

QSqlDatabase SqlConnection::database() const
{
    return QSqlDatabase::database(m_name, false);
}

} // namespace reportrt
