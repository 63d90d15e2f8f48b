#pragma once

#include "reportrt/data/sqltranslator.h"
#include "reportrt/document/reportdocument.h"

#include <QString>
#include <optional>
#include <vector>

namespace reportrt {

/// How a Qt SQL connection is opened. Never shown with its password.
struct ConnectionSpec {
    QString driver; // "QSQLITE", "QPSQL" or "QODBC"
    QString databaseName; // the file (SQLite), the database (PostgreSQL), the connect string (ODBC)
    QString hostName;
    int port = -1;
    QString userName;
    QString password;
    QString options;
    SqlDialect dialect = SqlDialect::SQLite;

    /// "SQLite database /data/shop.db", "PostgreSQL database shop on 127.0.0.1".
    QString describe() const;
    /// Equal keys share a connection.
    QString key() const;
};

/// Maps the connection properties a report's tables carry, and the server logon of the
/// application, to Qt SQL connections (docs/report-format.md, "Data sources"):
///
/// - Provider "Microsoft.Jet.OLEDB.3.51" or "Microsoft.Jet.OLEDB.4.0" (and "SQLite"): the
///   SQLite database file named by "Data Source", opened read-only; it must exist.
/// - Provider "SQLOLEDB" (and "SQLNCLI", "SQLNCLI11", "MSOLEDBSQL"): the server database
///   "Initial Catalog" (or "DataBase") on the server "Data Source" (or "Server Name";
///   "host", "host,port" or "host:port") through the server driver: QPSQL (PostgreSQL) or
///   QODBC with the configured ODBC driver. "User ID" and "Password" log on; with
///   "Integrated Security" True no password is sent.
///
/// The server driver comes from setServerDriver, else the environment variable
/// LUDMOX_SERVER_DRIVER ("QPSQL" or "QODBC"), else QODBC; the ODBC driver name from
/// setOdbcDriver, else LUDMOX_ODBC_DRIVER, else "ODBC Driver 18 for SQL Server".
class ProviderMap {
public:
    /// Raises Error::TableConnectionFailed when the properties name no known provider or
    /// lack the data source.
    static ConnectionSpec fromProperties(const std::vector<ConnectionProperty>& properties);
    /// The server logon. A server name that is the path of a file, or looks like one (a "/"
    /// or a database file's extension), is a database file: the engine passes a Jet database
    /// file as the server name.
    static ConnectionSpec forServer(const QString& server, const QString& database,
        const QString& userId, const QString& password, bool integratedSecurity);

    static void setServerDriver(const QString& driver);
    static QString serverDriver();
    static void setOdbcDriver(const QString& name);
    static QString odbcDriver();

    /// Credentials of an application-level logon, used for tables on the same server and
    /// database whose properties carry none (while the logon-matching option is set).
    static void addLogon(const ConnectionSpec& spec);
    static void removeLogon(const QString& server, const QString& database, const QString& userId);
    static std::optional<ConnectionSpec> matchingLogon(
        const QString& server, const QString& database);
    static void setMatchLogOnInfo(bool value);
};

} // namespace reportrt
