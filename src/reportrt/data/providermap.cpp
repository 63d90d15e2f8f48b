#include "reportrt/data/providermap.h"

#include "platform/sitesettings.h"
#include "reportrt/base/runtimeerror.h"

#include <QCryptographicHash>
#include <QFileInfo>

namespace reportrt {

namespace {
struct Settings {
    QString serverDriver;
    QString odbcDriver;
    std::vector<ConnectionSpec> logons;
    std::vector<std::pair<QString, QString>> logonKeys; // server, database
    bool matchLogOnInfo = false;
};

Settings& settings()
{
    static Settings instance;
    return instance;
}

const ConnectionProperty* property(
    const std::vector<ConnectionProperty>& properties, const char16_t* name)
{
    for (const auto& p : properties) {
        if (p.name.compare(QStringView(name), Qt::CaseInsensitive) == 0)
            return &p;
    }
    return nullptr;
}

QString text(const std::vector<ConnectionProperty>& properties, const char16_t* name)
{
    const ConnectionProperty* p = property(properties, name);
    if (!p)
        return {};
    switch (p->kind) {
    case ConnectionProperty::Kind::Text:
        return p->text;
    case ConnectionProperty::Kind::Boolean:
        return p->boolean ? QStringLiteral("True") : QStringLiteral("False");
    case ConnectionProperty::Kind::Number:
        return QString::number(p->number);
    }
    return {};
}

bool flag(const std::vector<ConnectionProperty>& properties, const char16_t* name)
{
    const ConnectionProperty* p = property(properties, name);
    if (!p)
        return false;
    if (p->kind == ConnectionProperty::Kind::Boolean)
        return p->boolean;
    if (p->kind == ConnectionProperty::Kind::Number)
        return p->number != 0;
    const QString t = p->text.trimmed();
    return t.compare(u"true", Qt::CaseInsensitive) == 0
        || t.compare(u"yes", Qt::CaseInsensitive) == 0
        || t.compare(u"sspi", Qt::CaseInsensitive) == 0 || t == u"1" || t == u"-1";
}

bool isJet(const QString& provider)
{
    return provider.startsWith(u"Microsoft.Jet.OLEDB", Qt::CaseInsensitive)
        || provider.startsWith(u"Microsoft.ACE.OLEDB", Qt::CaseInsensitive)
        || provider.compare(u"SQLite", Qt::CaseInsensitive) == 0;
}

bool isSqlServer(const QString& provider)
{
    for (const char16_t* name :
        { u"SQLOLEDB", u"SQLNCLI", u"SQLNCLI10", u"SQLNCLI11", u"MSOLEDBSQL", u"MSOLEDBSQL19" }) {
        if (provider.compare(QStringView(name), Qt::CaseInsensitive) == 0
            || provider.startsWith(QString::fromUtf16(name) + u'.', Qt::CaseInsensitive))
            return true;
    }
    return false;
}

ConnectionSpec fileDatabase(const QString& path)
{
    ConnectionSpec spec;
    spec.driver = QStringLiteral("QSQLITE");
    spec.databaseName = path;
    // Reports only read; the file must exist (SQLite would create an empty one).
    spec.options = QStringLiteral("QSQLITE_OPEN_READONLY");
    spec.dialect = SqlDialect::SQLite;
    return spec;
}

/// A Jet logon names its database file as the server. A name with a "/" (a host name has
/// none) or a database file's extension is taken for such a file even when it is missing,
/// so that the error names the file and not a server driver nobody meant to use. Host
/// names with "\" (a server's named instance) are not files.
bool namesDatabaseFile(const QString& server)
{
    if (server.isEmpty())
        return false;
    const QFileInfo file(server);
    if (file.isFile())
        return true;
    if (file.isDir())
        return false;
    if (server.contains(u'/'))
        return true;
    for (const char16_t* extension :
        { u".db", u".db3", u".sqlite", u".sqlite3", u".mdb", u".accdb" }) {
        if (server.endsWith(QStringView(extension), Qt::CaseInsensitive))
            return true;
    }
    return false;
}

/// A value of an ODBC connect string. Unbraced, a ";" would end the attribute and start one
/// the host never meant ("PWD=x;DRIVER=..."), a leading "{" would open a braced value and
/// outer blanks are dropped; in braces only "}" is special and is doubled.
QString odbcValue(const QString& value)
{
    const bool plain = !value.contains(u';') && !value.contains(u'{') && !value.contains(u'}')
        && !value.contains(u'=') && value.trimmed() == value;
    if (plain)
        return value;
    QString escaped = value;
    escaped.replace(u'}', QStringLiteral("}}"));
    return u'{' + escaped + u'}';
}

/// Microsoft's ODBC drivers ("ODBC Driver 18 for SQL Server", "SQL Server Native Client
/// 11.0") read the port from SERVER and ignore PORT.
bool takesPortInServer(const QString& odbcDriver)
{
    return odbcDriver.contains(u"SQL Server", Qt::CaseInsensitive);
}
} // namespace

QString ConnectionSpec::describe() const
{
    if (driver == u"QSQLITE")
        return QStringLiteral("SQLite database %1").arg(databaseName);
    if (driver == u"QPSQL")
        return QStringLiteral("PostgreSQL database %1 on %2").arg(databaseName, hostName);
    return QStringLiteral("ODBC database %1 on %2 (ODBC driver \"%3\")")
        .arg(databaseName, hostName, odbcDriver);
}

QString ConnectionSpec::key() const
{
    // The password takes part only as a hash, so the key can be logged.
    const QByteArray hash
        = QCryptographicHash::hash(password.toUtf8(), QCryptographicHash::Sha256).toHex();
    return QStringList { driver, databaseName, hostName, QString::number(port), userName,
        QString::fromLatin1(hash), options, odbcDriver,
        integratedSecurity ? QStringLiteral("1") : QStringLiteral("0") }
        .join(QChar(0x1F));
}

QString ConnectionSpec::odbcConnectString() const
{
    QStringList attributes { u"DRIVER=" + odbcValue(odbcDriver) };
    const bool portInServer = takesPortInServer(odbcDriver);
    attributes << u"SERVER="
            + odbcValue(
                port > 0 && portInServer ? hostName + u',' + QString::number(port) : hostName);
    if (port > 0 && !portInServer)
        attributes << u"PORT=" + QString::number(port);
    if (!databaseName.isEmpty())
        attributes << u"DATABASE=" + odbcValue(databaseName);
    if (integratedSecurity) {
        attributes << QStringLiteral("Trusted_Connection=yes");
    } else {
        attributes << u"UID=" + odbcValue(userName);
        attributes << u"PWD=" + odbcValue(password);
    }
    return attributes.join(u';') + u';';
}

ConnectionSpec ProviderMap::forServer(const QString& server, const QString& database,
    const QString& userId, const QString& password, bool integratedSecurity)
{
    if (namesDatabaseFile(server))
        return fileDatabase(server);
    ConnectionSpec spec;
    spec.driver = serverDriver();
    QString host = server.trimmed();
    int port = -1;
    const qsizetype separator = std::max(host.lastIndexOf(u','), host.lastIndexOf(u':'));
    if (separator > 0) {
        bool ok = false;
        const int value = host.mid(separator + 1).trimmed().toInt(&ok);
        if (ok && value > 0 && value < 65536) {
            port = value;
            host = host.left(separator).trimmed();
        }
    }
    if (spec.driver == u"QPSQL") {
        spec.dialect = SqlDialect::PostgreSQL;
        spec.hostName = host;
        spec.port = port;
        spec.databaseName = database;
        if (!integratedSecurity || !password.isEmpty()) {
            spec.userName = userId;
            spec.password = password;
        }
        spec.options = QStringLiteral("connect_timeout=10");
        return spec;
    }
    spec.driver = QStringLiteral("QODBC");
    spec.odbcDriver = odbcDriver();
    spec.dialect = odbcDialect(spec.odbcDriver);
    spec.hostName = host;
    spec.port = port;
    spec.databaseName = database;
    spec.integratedSecurity = integratedSecurity && password.isEmpty();
    if (!spec.integratedSecurity) {
        spec.userName = userId;
        spec.password = password;
    }
    // A server that does not answer must not hold the report for the driver's default wait.
    spec.options = QStringLiteral("SQL_ATTR_LOGIN_TIMEOUT=10");
    return spec;
}

ConnectionSpec ProviderMap::fromProperties(const std::vector<ConnectionProperty>& properties)
{
    const QString provider = text(properties, u"Provider").trimmed();
    if (provider.isEmpty())
        raiseError(Error::TableConnectionFailed,
            QStringLiteral("Failed to open the connection: the table has no \"Provider\" "
                           "connection property."));
    if (isJet(provider)) {
        const QString path = text(properties, u"Data Source");
        if (path.isEmpty())
            raiseError(Error::TableConnectionFailed,
                QStringLiteral("Failed to open the connection: the table has no \"Data Source\"."));
        if (!QFileInfo(path).isFile())
            raiseError(Error::TableConnectionFailed,
                QStringLiteral("Failed to open the connection: the database file %1 %2.")
                    .arg(path,
                        QFileInfo::exists(path) ? QStringLiteral("is not a file")
                                                : QStringLiteral("does not exist")));
        return fileDatabase(path);
    }
    if (isSqlServer(provider)) {
        QString server = text(properties, u"Data Source");
        if (server.isEmpty())
            server = text(properties, u"Server Name");
        QString database = text(properties, u"Initial Catalog");
        if (database.isEmpty())
            database = text(properties, u"DataBase");
        QString user = text(properties, u"User ID");
        QString password = text(properties, u"Password");
        const bool integrated = flag(properties, u"Integrated Security");
        if (server.isEmpty())
            raiseError(Error::TableConnectionFailed,
                QStringLiteral("Failed to open the connection: the table has no \"Data Source\"."));
        if (user.isEmpty() && password.isEmpty() && !integrated && settings().matchLogOnInfo) {
            if (const auto logon = matchingLogon(server, database)) {
                user = logon->userName;
                password = logon->password;
            }
        }
        return forServer(server, database, user, password, integrated);
    }
    raiseError(Error::TableConnectionFailed,
        QStringLiteral("Failed to open the connection: the provider \"%1\" is not supported.")
            .arg(provider));
}

void ProviderMap::setServerDriver(const QString& driver)
{
    settings().serverDriver = driver;
}

QString ProviderMap::serverDriver()
{
    QString driver = settings().serverDriver;
    if (driver.isEmpty())
        driver = platform::SiteSettings().value(platform::SiteSettings::Setting::ServerDriver);
    driver = driver.trimmed().toUpper();
    return driver == u"QPSQL" ? driver : QStringLiteral("QODBC");
}

void ProviderMap::setOdbcDriver(const QString& name)
{
    settings().odbcDriver = name;
}

QString ProviderMap::odbcDriver()
{
    if (!settings().odbcDriver.isEmpty())
        return settings().odbcDriver;
    const QString fromSite
        = platform::SiteSettings().value(platform::SiteSettings::Setting::OdbcDriver);
    return fromSite.isEmpty() ? QStringLiteral("FreeTDS") : fromSite;
}

SqlDialect ProviderMap::serverDialect()
{
    return serverDriver() == u"QPSQL" ? SqlDialect::PostgreSQL : odbcDialect(odbcDriver());
}

SqlDialect ProviderMap::odbcDialect(const QString& name)
{
    const QString file = name.mid(name.lastIndexOf(u'/') + 1);
    if (name.trimmed().startsWith(u"PostgreSQL", Qt::CaseInsensitive)
        || file.startsWith(u"psqlodbc", Qt::CaseInsensitive))
        return SqlDialect::PostgreSQL;
    return SqlDialect::Generic;
}

void ProviderMap::addLogon(const ConnectionSpec& spec)
{
    settings().logons.push_back(spec);
}

void ProviderMap::removeLogon(const QString& server, const QString& database, const QString& userId)
{
    auto& logons = settings().logons;
    const ConnectionSpec probe = forServer(server, database, userId, QString(), false);
    std::erase_if(logons, [&](const ConnectionSpec& s) {
        return s.hostName.compare(probe.hostName, Qt::CaseInsensitive) == 0 && s.port == probe.port
            && s.userName.compare(userId, Qt::CaseInsensitive) == 0
            && s.databaseName.compare(probe.databaseName, Qt::CaseInsensitive) == 0;
    });
}

std::optional<ConnectionSpec> ProviderMap::matchingLogon(
    const QString& server, const QString& database)
{
    const ConnectionSpec probe = forServer(server, database, QString(), QString(), true);
    for (const ConnectionSpec& s : settings().logons) {
        if (s.driver == probe.driver && s.hostName.compare(probe.hostName, Qt::CaseInsensitive) == 0
            && s.port == probe.port
            && s.databaseName.compare(probe.databaseName, Qt::CaseInsensitive) == 0)
            return s;
    }
    return std::nullopt;
}

void ProviderMap::setMatchLogOnInfo(bool value)
{
    settings().matchLogOnInfo = value;
}

} // namespace reportrt
