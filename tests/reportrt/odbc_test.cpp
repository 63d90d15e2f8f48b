#include "core/comerror.h"
#include "reportrt/data/odbcdrivers.h"
#include "reportrt/data/providermap.h"
#include "reportrt/viewer/registerruntime.h"
#include "reportrtfixture.h"
#include "runtime/application.h"
#include "runtime/applicationfactory.h"

#include <QSqlDatabase>
#include <gtest/gtest.h>
#include <optional>
#include <utility>
#include <vector>

using namespace reportrt;
using namespace reportrt::test;
using namespace Qt::StringLiterals;

namespace {

using Attributes = std::vector<std::pair<QString, QString>>;

/// Reads a connect string the way ODBC drivers do (attribute=value pairs split at ";", a
/// value in braces runs to the "}" that is not doubled), independently of the code that
/// writes it; nullopt when the string does not parse.
std::optional<Attributes> parseConnectString(const QString& text)
{
    Attributes attributes;
    qsizetype i = 0;
    while (i < text.size()) {
        const qsizetype equals = text.indexOf(u'=', i);
        if (equals < 0)
            return std::nullopt;
        const QString key = text.mid(i, equals - i);
        if (key.contains(u';') || key.contains(u'{') || key.contains(u'}') || key.isEmpty())
            return std::nullopt;
        i = equals + 1;
        QString value;
        if (i < text.size() && text[i] == u'{') {
            ++i;
            for (;;) {
                if (i >= text.size())
                    return std::nullopt;
                if (text[i] == u'}') {
                    if (i + 1 < text.size() && text[i + 1] == u'}') {
                        value += u'}';
                        i += 2;
                        continue;
                    }
                    ++i;
                    break;
                }
                value += text[i++];
            }
            if (i < text.size() && text[i] != u';')
                return std::nullopt;
        } else {
            const qsizetype end = text.indexOf(u';', i);
            value = text.mid(i, end < 0 ? -1 : end - i);
            if (value.contains(u'{') || value.contains(u'}') || value.trimmed() != value)
                return std::nullopt;
            i = end < 0 ? text.size() : end;
        }
        attributes.emplace_back(key, value);
        ++i; // the ";"
    }
    return attributes;
}

/// The server and ODBC driver settings of the provider map, cleared after each test.
class OdbcRoute : public testing::Test {
protected:
    void SetUp() override { ProviderMap::setServerDriver(u"QODBC"_s); }
    void TearDown() override
    {
        ProviderMap::setServerDriver(QString());
        ProviderMap::setOdbcDriver(QString());
    }
};

TEST_F(OdbcRoute, ConnectStringsKeepEveryValueIntact)
{
    const struct {
        const char* name;
        QString driver;
        QString server;
        QString database;
        QString password;
        bool integrated;
        Attributes expected;
    } cases[] = {
        { "plain values", u"FreeTDS"_s, u"db1,1433"_s, u"shop"_s, u"secret"_s, false,
            { { u"DRIVER"_s, u"FreeTDS"_s }, { u"SERVER"_s, u"db1"_s }, { u"PORT"_s, u"1433"_s },
                { u"DATABASE"_s, u"shop"_s }, { u"UID"_s, u"sa"_s }, { u"PWD"_s, u"secret"_s } } },
        { "a password that would add attributes", u"PostgreSQL Unicode"_s, u"db1:5432"_s, u"shop"_s,
            u"x;DRIVER={Evil};UID=root"_s, false,
            { { u"DRIVER"_s, u"PostgreSQL Unicode"_s }, { u"SERVER"_s, u"db1"_s },
                { u"PORT"_s, u"5432"_s }, { u"DATABASE"_s, u"shop"_s }, { u"UID"_s, u"sa"_s },
                { u"PWD"_s, u"x;DRIVER={Evil};UID=root"_s } } },
        { "closing braces that would end the value", u"FreeTDS"_s, u"db1"_s, u"shop"_s,
            u"a}b}};PWD=c"_s, false,
            { { u"DRIVER"_s, u"FreeTDS"_s }, { u"SERVER"_s, u"db1"_s },
                { u"DATABASE"_s, u"shop"_s }, { u"UID"_s, u"sa"_s },
                { u"PWD"_s, u"a}b}};PWD=c"_s } } },
        { "an opening brace first", u"FreeTDS"_s, u"db1"_s, u"shop"_s, u"{pw"_s, false,
            { { u"DRIVER"_s, u"FreeTDS"_s }, { u"SERVER"_s, u"db1"_s },
                { u"DATABASE"_s, u"shop"_s }, { u"UID"_s, u"sa"_s }, { u"PWD"_s, u"{pw"_s } } },
        { "outer blanks, an equals sign and non-ASCII", u"FreeTDS"_s, u"db1"_s, u"shöp=1"_s,
            u" pä ss€ "_s, false,
            { { u"DRIVER"_s, u"FreeTDS"_s }, { u"SERVER"_s, u"db1"_s },
                { u"DATABASE"_s, u"shöp=1"_s }, { u"UID"_s, u"sa"_s },
                { u"PWD"_s, u" pä ss€ "_s } } },
        { "an empty password", u"FreeTDS"_s, u"db1"_s, u"shop"_s, QString(), false,
            { { u"DRIVER"_s, u"FreeTDS"_s }, { u"SERVER"_s, u"db1"_s },
                { u"DATABASE"_s, u"shop"_s }, { u"UID"_s, u"sa"_s }, { u"PWD"_s, QString() } } },
        { "a driver name with braces and a semicolon", u"My {Driver}; v2"_s, u"db1"_s, u"shop"_s,
            u"pw"_s, false,
            { { u"DRIVER"_s, u"My {Driver}; v2"_s }, { u"SERVER"_s, u"db1"_s },
                { u"DATABASE"_s, u"shop"_s }, { u"UID"_s, u"sa"_s }, { u"PWD"_s, u"pw"_s } } },
        { "Microsoft's driver reads the port from SERVER", u"ODBC Driver 18 for SQL Server"_s,
            u"db1,1433"_s, u"shop"_s, u"pw"_s, false,
            { { u"DRIVER"_s, u"ODBC Driver 18 for SQL Server"_s }, { u"SERVER"_s, u"db1,1433"_s },
                { u"DATABASE"_s, u"shop"_s }, { u"UID"_s, u"sa"_s }, { u"PWD"_s, u"pw"_s } } },
        { "integrated security sends no credentials", u"FreeTDS"_s, u"db1"_s, u"shop"_s, QString(),
            true,
            { { u"DRIVER"_s, u"FreeTDS"_s }, { u"SERVER"_s, u"db1"_s },
                { u"DATABASE"_s, u"shop"_s }, { u"Trusted_Connection"_s, u"yes"_s } } },
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        ProviderMap::setOdbcDriver(c.driver);
        const ConnectionSpec spec
            = ProviderMap::forServer(c.server, c.database, u"sa"_s, c.password, c.integrated);
        ASSERT_EQ(spec.driver, u"QODBC"_s);
        const QString text = spec.odbcConnectString();
        const auto parsed = parseConnectString(text);
        ASSERT_TRUE(parsed) << text.toStdString();
        EXPECT_EQ(*parsed, c.expected) << text.toStdString();
        EXPECT_FALSE(spec.describe().contains(u"PWD"_s));
        if (!c.password.isEmpty()) {
            EXPECT_FALSE(spec.describe().contains(c.password));
        }
    }
    ProviderMap::setOdbcDriver(u"FreeTDS"_s);
    EXPECT_EQ(ProviderMap::forServer(u"db1,1433"_s, u"shop"_s, u"sa"_s, u"pw"_s, false)
                  .odbcConnectString(),
        u"DRIVER=FreeTDS;SERVER=db1;PORT=1433;DATABASE=shop;UID=sa;PWD=pw;"_s);
}

TEST_F(OdbcRoute, DriverNameAndDialect)
{
    const QByteArray saved = qgetenv("LUDMOX_ODBC_DRIVER");
    qunsetenv("LUDMOX_ODBC_DRIVER");
    EXPECT_EQ(ProviderMap::odbcDriver(), u"FreeTDS"_s) << "a driver Debian installs";
    qputenv("LUDMOX_ODBC_DRIVER", "PostgreSQL Unicode");
    EXPECT_EQ(ProviderMap::odbcDriver(), u"PostgreSQL Unicode"_s);
    EXPECT_EQ(ProviderMap::serverDialect(), SqlDialect::PostgreSQL);
    ProviderMap::setOdbcDriver(u"FreeTDS"_s);
    EXPECT_EQ(ProviderMap::odbcDriver(), u"FreeTDS"_s) << "the setting wins over the variable";
    EXPECT_EQ(ProviderMap::serverDialect(), SqlDialect::Generic);
    if (saved.isNull())
        qunsetenv("LUDMOX_ODBC_DRIVER");
    else
        qputenv("LUDMOX_ODBC_DRIVER", saved);

    const struct {
        const char* name;
        QString driver;
        SqlDialect dialect;
    } cases[] = {
        { "FreeTDS", u"FreeTDS"_s, SqlDialect::Generic },
        { "Microsoft's", u"ODBC Driver 18 for SQL Server"_s, SqlDialect::Generic },
        { "psqlODBC, Unicode", u"PostgreSQL Unicode"_s, SqlDialect::PostgreSQL },
        { "psqlODBC in other case", u"postgresql ansi"_s, SqlDialect::PostgreSQL },
        { "psqlODBC by library", u"/usr/lib/x86_64-linux-gnu/odbc/psqlodbcw.so"_s,
            SqlDialect::PostgreSQL },
        { "a library of another driver", u"/opt/postgresql/lib/libtdsodbc.so"_s,
            SqlDialect::Generic },
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        EXPECT_EQ(ProviderMap::odbcDialect(c.driver), c.dialect);
    }
}

TEST_F(OdbcRoute, MissingDriversAreNamed)
{
    if (!QSqlDatabase::isDriverAvailable(u"QODBC"_s)) {
        if (qEnvironmentVariableIsSet("LUDMOX_REQUIRE_ODBC"))
            FAIL() << "ODBC is required (LUDMOX_REQUIRE_ODBC) but Qt's plugin is missing";
        GTEST_SKIP() << "Qt's ODBC driver plugin is not installed";
    }
    const auto installed = OdbcDrivers::installed();
    ASSERT_TRUE(installed) << "the driver manager lists its drivers";
    const struct {
        const char* name;
        QString driver;
        QString expected;
    } cases[] = {
        { "an unknown name", u"No Such Driver 9"_s,
            u"the ODBC driver \"No Such Driver 9\" is not installed"_s },
        { "a name with a connect-string tail", u"X};SERVER=evil"_s,
            u"the ODBC driver \"X};SERVER=evil\" is not installed"_s },
        { "a missing library", u"/nonexistent/libnone.so"_s,
            u"the ODBC driver library /nonexistent/libnone.so does not exist"_s },
        { "no name", u" "_s, u"no ODBC driver is named"_s },
    };
    registerRuntime();
    const auto application = runtime::ApplicationFactory::create();
    QTemporaryDir dir;
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        ProviderMap::setOdbcDriver(c.driver);
        try {
            application->logOnServer(u"PDSOLEDB.DLL"_s, u"db1,1433"_s, u"shop"_s, u"sa"_s, u"pw"_s,
                u"SQLOLEDB"_s, QString());
            ADD_FAILURE() << "logged on";
        } catch (const core::ComError& error) {
            EXPECT_EQ(error.number(), core::ErrorNumber::LogOnFailed);
            EXPECT_TRUE(error.description().contains(c.expected))
                << error.description().toStdString();
            if (!installed->isEmpty() && !c.driver.contains(u'/')
                && !c.driver.trimmed().isEmpty()) {
                EXPECT_TRUE(error.description().contains(installed->front()))
                    << "lists what is installed: " << error.description().toStdString();
            }
        }
        // A table on the server fails the same way when it is located.
        const auto report = Report::open(writeReport(dir, shopReport()));
        const auto table = report->databaseTables()[0];
        table->deleteConnectionProperties();
        table->addConnectionProperty(u"Provider"_s, core::Variant(u"SQLOLEDB"_s));
        table->addConnectionProperty(u"Data Source"_s, core::Variant(u"db1"_s));
        table->addConnectionProperty(u"Initial Catalog"_s, core::Variant(u"shop"_s));
        try {
            table->setLocation(u"Orders"_s, QString(), QString());
            ADD_FAILURE() << "located";
        } catch (const core::ComError& error) {
            EXPECT_EQ(error.number(), core::ErrorNumber::TableConnectionFailed);
            EXPECT_TRUE(error.description().contains(c.expected))
                << error.description().toStdString();
        }
    }
}

} // namespace
