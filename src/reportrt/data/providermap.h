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
    QString databaseName; // the file (SQLite), else the database on the server
    QString hostName;
    int port = -1;
    QString userName;
    QString password;
    QString options; // the Qt driver's connect options
    QString odbcDriver; // QODBC: the ODBC driver's name (or library path)
    bool integratedSecurity = false; // QODBC: the system's logon instead of UID and PWD
    SqlDialect dialect = SqlDialect::SQLite;

    /// "SQLite database /data/shop.db", "PostgreSQL database shop on 127.0.0.1",
    /// "ODBC database shop on db1 (ODBC driver "FreeTDS")". Never holds the password.
    QString describe() const;
    /// Equal keys share a connection.
    QString key() const;
    /// The QODBC connect string: DRIVER, SERVER, PORT, DATABASE, then UID and PWD (or
    /// Trusted_Connection). Values with ";", braces, "=" or outer blanks are written in
    /// braces with "}" doubled, so no value can add or end an attribute. Drivers whose name
    /// has "SQL Server" (Microsoft's) take the port in SERVER as "host,port"; the others
    /// (FreeTDS, psqlODBC) as PORT. Holds the password: never log or show it.
    QString odbcConnectString() const;
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
/// setOdbcDriver, else LUDMOX_ODBC_DRIVER, else "FreeTDS" (Debian's package tdsodbc, the
/// route to SQL Server). Through an ODBC driver for PostgreSQL (psqlODBC) the SQL is
/// PostgreSQL's, through any other the generic ODBC SQL.
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
    /// The SQL a server database gets through the current server driver and ODBC driver.
    static SqlDialect serverDialect();
    /// The SQL a database reached through the ODBC driver `name` understands: PostgreSQL's
    /// for psqlODBC (names starting "PostgreSQL", libraries named psqlodbc*), else generic.
    static SqlDialect odbcDialect(const QString& name);

    /// Credentials of an application-level logon, used for tables on the same server and
    /// database whose properties carry none (while the logon-matching option is set).
    static void addLogon(const ConnectionSpec& spec);
    static void removeLogon(const QString& server, const QString& database, const QString& userId);
    static std::optional<ConnectionSpec> matchingLogon(
        const QString& server, const QString& database);
    static void setMatchLogOnInfo(bool value);
};

} // namespace reportrt
