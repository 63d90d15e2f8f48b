#include "core/comerror.h"
#include "reportrt/data/odbcdrivers.h"
#include "reportrt/data/providermap.h"
#include "reportrt/formula/formulaevaluator.h"
#include "reportrt/report.h"
#include "reportrt/viewer/registerruntime.h"
#include "reportrtfixture.h"
#include "runtime/application.h"
#include "runtime/applicationfactory.h"

#include <QCoreApplication>
#include <QJsonArray>
#include <QSqlDatabase>
#include <QSqlError>
#include <QSqlQuery>
#include <cstdio>
#include <gtest/gtest.h>
#include <map>
#include <optional>

using namespace reportrt;
using namespace reportrt::test;
using namespace Qt::StringLiterals;

namespace {

QString setting(const char* name, const QString& fallback)
{
    const QString value = qEnvironmentVariable(name);
    return value.isEmpty() ? fallback : value;
}

struct Server {
    QString host = setting("LUDMOX_PG_HOST", u"127.0.0.1"_s);
    QString port = setting("LUDMOX_PG_PORT", u"5432"_s);
    QString user = setting("LUDMOX_PG_USER", u"ludmox_test"_s);
    QString password = setting("LUDMOX_PG_PASSWORD", u"ludmox_test"_s);
    QString database = setting("LUDMOX_PG_DATABASE", u"ludmox_test"_s);
    /// The ODBC driver that reaches this server (psqlODBC), for the tests that compare.
    QString odbcDriver = setting("LUDMOX_PG_ODBC_DRIVER", u"PostgreSQL Unicode"_s);
};

/// Why the ODBC route to the server cannot be taken here, or an empty text.
QString odbcProblem(const QString& driver)
{
    if (!QSqlDatabase::isDriverAvailable(u"QODBC"_s))
        return u"Qt's ODBC driver plugin is not installed"_s;
    return OdbcDrivers::problem(driver);
}

/// The server tests run through QPSQL, or through QODBC when LUDMOX_SERVER_DRIVER says so.
bool throughOdbc()
{
    return ProviderMap::serverDriver() == u"QODBC";
}

/// Runs statements on the test database; false (with the reason) when it is unreachable.
bool execute(const Server& server, const QStringList& statements, QString& error)
{
    const QString name = u"pg-setup"_s;
    bool ok = true;
    {
        QSqlDatabase db = QSqlDatabase::addDatabase(u"QPSQL"_s, name);
        db.setHostName(server.host);
        db.setPort(server.port.toInt());
        db.setDatabaseName(server.database);
        db.setUserName(server.user);
        db.setPassword(server.password);
        db.setConnectOptions(u"connect_timeout=5"_s);
        if (!db.open()) {
            error = db.lastError().text();
            ok = false;
        } else {
            QSqlQuery query(db);
            for (const QString& statement : statements) {
                if (!query.exec(statement)) {
                    error = statement + u": " + query.lastError().text();
                    ok = false;
                    break;
                }
            }
            db.close();
        }
    }
    QSqlDatabase::removeDatabase(name);
    return ok;
}

class PostgreSql : public testing::Test {
protected:
    void SetUp() override
    {
        m_table = u"orders_%1"_s.arg(QCoreApplication::applicationPid());
        QString error;
        const bool reachable = execute(m_server,
            {
                u"SET client_min_messages TO warning"_s,
                u"DROP TABLE IF EXISTS %1"_s.arg(m_table),
                u"CREATE TABLE %1 (id integer primary key, customer varchar(40), region text, amount double precision, price numeric(12,4), shipped boolean, orderdate date, created timestamp, customerid integer, starts time, quantity bigint, rate real)"_s
                    .arg(m_table),
                u"INSERT INTO %1 VALUES (1, 'alpha', 'North', 100, 10.5, true, '2026-01-05', '2026-01-05 08:00:00', 1, '08:00', 1, 0.5), (2, 'Alpha', 'North', 250, 20, false, '2026-02-10', '2026-02-10 09:30:00.25', 1, '23:59:59', 12345678901, -1.25), (3, 'ALPHA', 'South', 100, NULL, true, '2026-02-10', '2026-02-10 23:59:59', 2, NULL, NULL, NULL), (4, 'beta', 'South', 75.25, 7.25, NULL, '2026-03-01', NULL, 2, '00:00', 0, 0), (5, NULL, 'East', NULL, 3, false, NULL, '2026-03-01 00:00:00', 3, '12:30:15', -7, 3), (6, 'Élan', NULL, 500, 99.99, true, '2025-12-31', '2025-12-31 12:00:00', 3, '06:05:04', 2, 2), (7, 'élan', 'East', 250, 0, true, '2026-04-15', '2026-04-15 10:15:00', NULL, '10:15', 3, 1), (8, 'gamma_1%%', 'West', 10, 1, false, '2026-04-15', '2026-04-15 10:15:00.5', 4, '10:15', 4, 4), (9, 'o''Brien', 'West', -5, 2.5, true, '2026-05-01', '2026-05-01 00:00:00', 4, '18:00', 5, 5), (10, '日本語 – ∑', 'North', 0, NULL, NULL, '2026-05-02', '2026-05-02 00:00:00', 1, '19:00', 6, 6), (11, '', 'North', 0, 12345678.1234, NULL, '1900-01-01', '1899-12-30 00:00:00', 1, '20:00', 7, 7)"_s
                    .arg(m_table),
            },
            error);
        if (!reachable) {
            if (qEnvironmentVariableIsSet("LUDMOX_REQUIRE_PG"))
                FAIL() << "PostgreSQL is required (LUDMOX_REQUIRE_PG) but not usable: "
                       << error.toStdString();
            GTEST_SKIP() << "PostgreSQL is not reachable: " << error.toStdString();
        }
        if (qEnvironmentVariableIsEmpty("LUDMOX_SERVER_DRIVER"))
            ProviderMap::setServerDriver(u"QPSQL"_s);
        if (throughOdbc()) {
            const QString problem = odbcProblem(ProviderMap::odbcDriver());
            if (!problem.isEmpty()) {
                if (qEnvironmentVariableIsSet("LUDMOX_REQUIRE_ODBC"))
                    FAIL() << "ODBC is required (LUDMOX_REQUIRE_ODBC) but not usable: "
                           << problem.toStdString();
                GTEST_SKIP() << "ODBC is not usable: " << problem.toStdString();
            }
        }
    }

    void TearDown() override
    {
        QString error;
        execute(m_server,
            { u"SET client_min_messages TO warning"_s, u"DROP TABLE IF EXISTS %1"_s.arg(m_table) },
            error);
        ProviderMap::setServerDriver(QString());
        ProviderMap::setOdbcDriver(QString());
    }

    /// Relocates the way the engine does for a SQL Server logon.
    /// Whether ODBC reaches the server; where it must (LUDMOX_REQUIRE_ODBC), not reaching it
    /// fails the test.
    bool odbcUsable() const
    {
        const QString problem = odbcProblem(m_server.odbcDriver);
        if (problem.isEmpty())
            return true;
        if (qEnvironmentVariableIsSet("LUDMOX_REQUIRE_ODBC"))
            ADD_FAILURE() << "ODBC is required (LUDMOX_REQUIRE_ODBC) but not usable: "
                          << problem.toStdString();
        else
            std::fprintf(stderr, "ODBC is not usable: %s\n", qPrintable(problem));
        return false;
    }

    std::shared_ptr<Report> open(const QString& formula, QJsonObject d = shopReport())
    {
        d[u"selectionFormula"] = formula;
        auto report = Report::open(writeReport(m_dir, d, u"pg%1.rpt"_s.arg(++m_count)));
        const auto table = report->databaseTables()[0];
        table->deleteConnectionProperties();
        const QString server = m_server.host + u',' + m_server.port;
        table->addConnectionProperty(u"Provider"_s, core::Variant(u"SQLOLEDB"_s));
        table->addConnectionProperty(u"Data Source"_s, core::Variant(server));
        table->addConnectionProperty(u"Initial Catalog"_s, core::Variant(m_server.database));
        table->addConnectionProperty(u"User ID"_s, core::Variant(m_server.user));
        table->addConnectionProperty(u"Password"_s, core::Variant(m_server.password));
        table->addConnectionProperty(u"Server Name"_s, core::Variant(server));
        table->addConnectionProperty(u"Server Type"_s, core::Variant(u"OLEDB"_s));
        table->addConnectionProperty(u"DataBase"_s, core::Variant(m_server.database));
        table->setLocation(m_table, QString(), QString());
        return report;
    }

    Server m_server;
    QString m_table;
    QTemporaryDir m_dir;
    int m_count = 0;
};

TEST_F(PostgreSql, ReadsRecordsThroughTheProviderMap)
{
    const auto report = open(
        u"{Orders.Customer} >= 'b' And {Orders.OrderDate} < #2026-05-01# And {Orders.Shipped}"_s);
    const QString crlf = u"\r\n"_s;
    EXPECT_EQ(report->sqlQueryString(),
        u"SELECT Orders.Customer, Orders.OrderDate, Orders.Shipped, Orders.ID" + crlf + u"FROM "
            + m_table + u" Orders" + crlf + u"WHERE" + crlf
            + u"    (Orders.Customer COLLATE \"C\" >= 'b') AND (Orders.OrderDate < DATE "
              u"'2026-05-01') AND (Orders.Shipped)");
    report->readRecords();
    // Code point order: lower-case and accented names sort after 'b', 'Alpha' before it.
    EXPECT_EQ(selectedIds(*report), (std::vector<int> { 6, 7 }));
    EXPECT_EQ(report->printingStatus().recordsRead, 2);
}

class PostgreSqlPushdown : public PostgreSql,
                           public testing::WithParamInterface<const char16_t*> { };

TEST_P(PostgreSqlPushdown, SelectsTheSameRecordsWithAndWithoutTheDatabase)
{
    const QString formula = QString::fromUtf16(GetParam());
    const auto pushed = open(formula);
    const QString sql = pushed->sqlQueryString();
    pushed->readRecords();
    const auto local = open(formula);
    QString plain = sql;
    const qsizetype where = plain.indexOf(u"\r\nWHERE\r\n");
    if (where >= 0)
        plain.truncate(where);
    local->setSqlQueryString(plain);
    local->readRecords();
    EXPECT_EQ(selectedIds(*pushed), selectedIds(*local)) << sql.toStdString();
}

INSTANTIATE_TEST_SUITE_P(Formulas, PostgreSqlPushdown,
    testing::Values(u"{Orders.Customer} < 'b'",
        u"{Orders.Customer} = 'alpha' Or IsNull({Orders.Customer})",
        u"{Orders.Customer} Like '*a_1%*'", u"{Orders.Customer} Like '?lpha'",
        u"{Orders.Customer} StartsWith 'él'", u"Not ({Orders.Shipped} = False)",
        u"{Orders.Created} >= #2026-02-10 09:30:00.25#",
        u"{Orders.OrderDate} In #2026-01-01# To #2026-03-01#",
        u"{Orders.Amount} In [100, 250] And Not ({Orders.Region} In ['North'])",
        u"{Orders.Customer} In ['日本語 – ∑', 'Élan']", u"{Orders.Shipped}",
        u"{Orders.OrderDate} = #1900-01-01# Or {Orders.Created} < #2025-01-01#"));

TEST_F(PostgreSql, ServerLogonAndLogonFailure)
{
    registerRuntime();
    const auto application = runtime::ApplicationFactory::create();
    const QString server = m_server.host + u',' + m_server.port;
    application->setMatchLogOnInfo(true);
    application->logOnServer(u"PDSOLEDB.DLL"_s, server, m_server.database, m_server.user,
        m_server.password, u"SQLOLEDB"_s, QString());
    application->logOffServer(
        u"PDSOLEDB.DLL"_s, server, m_server.database, m_server.user, m_server.password);
    try {
        application->logOnServer(u"PDSOLEDB.DLL"_s, server, m_server.database, m_server.user,
            u"wrong-password"_s, u"SQLOLEDB"_s, QString());
        FAIL();
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), core::ErrorNumber::LogOnFailed);
        EXPECT_FALSE(error.description().contains(u"wrong-password"));
    }
}

/// The shop report with every column of the server's table on it, times and large
/// numbers too.
QJsonObject everyColumnReport()
{
    QJsonObject d = shopReport();
    QJsonArray fields = ordersFields();
    fields.append(QJsonObject { { u"name"_s, u"Starts"_s }, { u"type"_s, u"time"_s } });
    fields.append(QJsonObject { { u"name"_s, u"Quantity"_s }, { u"type"_s, u"number"_s } });
    fields.append(QJsonObject { { u"name"_s, u"Rate"_s }, { u"type"_s, u"number"_s } });
    QJsonArray tables = d[u"tables"_s].toArray();
    QJsonObject orders = tables[0].toObject();
    orders[u"fields"_s] = fields;
    tables[0] = orders;
    d[u"tables"_s] = tables;
    QJsonArray objects;
    for (const auto& field : fields) {
        const QString name = field.toObject()[u"name"_s].toString();
        objects.append(QJsonObject { { u"kind"_s, u"field"_s },
            { u"name"_s, QString(name + u"Field"_s) }, { u"field"_s, u"{Orders.%1}"_s.arg(name) },
            { u"width"_s, 1000 }, { u"height"_s, 240 } });
    }
    QJsonArray sections = d[u"sections"_s].toArray();
    QJsonObject detail = sections[0].toObject();
    detail[u"objects"_s] = objects;
    sections[0] = detail;
    d[u"sections"_s] = sections;
    return d;
}

/// Every value of the last read by record ID: "type text" per field, in field order.
std::map<int, QStringList> everyValue(Report& report)
{
    std::map<int, QStringList> values;
    const auto* result = report.result();
    if (!result)
        return values;
    const QJsonArray fields = everyColumnReport()[u"tables"_s].toArray()[0][u"fields"_s].toArray();
    for (qsizetype position = 0; position < result->size(); ++position) {
        report.setCurrentRecord(result->recordAt(position));
        QStringList row;
        for (const auto& field : fields) {
            const Value v
                = report.fieldValue(u"{Orders.%1}"_s.arg(field.toObject()[u"name"_s].toString()));
            row << valueTypeName(v.type()) + u' ' + FormulaEvaluator::toText(v, 6);
        }
        values[static_cast<int>(report.fieldValue(u"{Orders.ID}"_s).toNumber())] = row;
    }
    report.setCurrentRecord(-1);
    return values;
}

TEST_F(PostgreSql, RecordsThroughOdbcEqualThoseThroughQpsql)
{
    if (!odbcUsable())
        GTEST_SKIP() << "ODBC is not usable";
    const auto read = [&](const QString& driver) {
        ProviderMap::setServerDriver(driver);
        ProviderMap::setOdbcDriver(m_server.odbcDriver);
        const auto report = open(QString(), everyColumnReport());
        report->readRecords();
        return everyValue(*report);
    };
    const auto direct = read(u"QPSQL"_s);
    const auto odbc = read(u"QODBC"_s);
    ASSERT_EQ(direct.size(), 11u);
    ASSERT_EQ(odbc.size(), direct.size());
    for (const auto& [id, row] : direct) {
        SCOPED_TRACE(id);
        ASSERT_TRUE(odbc.contains(id));
        EXPECT_EQ(odbc.at(id), row);
    }
    // Both right, not merely alike: "type text" per field.
    EXPECT_EQ(odbc.at(2),
        (QStringList { u"number 2.000000"_s, u"string Alpha"_s, u"string North"_s,
            u"number 250.000000"_s, u"currency 20.000000"_s, u"boolean False"_s,
            u"date 2026-02-10"_s, u"datetime 2026-02-10 09:30:00.250"_s, u"number 1.000000"_s,
            u"time 23:59:59"_s, u"number 12345678901.000000"_s, u"number -1.250000"_s }));
    EXPECT_EQ(odbc.at(10)[1], u"string 日本語 – ∑"_s);
    EXPECT_EQ(odbc.at(6)[1], u"string Élan"_s);
    EXPECT_EQ(odbc.at(3)[4], u"null "_s);
    EXPECT_EQ(odbc.at(11)[1], u"string "_s);
    EXPECT_EQ(odbc.at(11)[4], u"currency 12345678.123400"_s);
}

// scripts/start-services.sh makes the role ludmox_quote with this password.
TEST_F(PostgreSql, OdbcLogonWithHostilePassword)
{
    if (!odbcUsable())
        GTEST_SKIP() << "ODBC is not usable";
    Server quote = m_server;
    quote.user = u"ludmox_quote"_s;
    quote.password = u"p;w}d{x=y}} ;UID=postgres;"_s;
    QString error;
    if (!execute(quote, { u"SELECT 1"_s }, error)) {
        if (qEnvironmentVariableIsSet("LUDMOX_REQUIRE_ODBC"))
            FAIL() << "the role ludmox_quote (scripts/start-services.sh) cannot log on: "
                   << error.toStdString();
        GTEST_SKIP() << "the role ludmox_quote is missing: " << error.toStdString();
    }
    ProviderMap::setServerDriver(u"QODBC"_s);
    ProviderMap::setOdbcDriver(m_server.odbcDriver);
    registerRuntime();
    const auto application = runtime::ApplicationFactory::create();
    const QString server = m_server.host + u',' + m_server.port;
    const auto logOn = [&](const QString& password) -> std::optional<QString> {
        try {
            application->logOnServer(u"PDSOLEDB.DLL"_s, server, m_server.database, quote.user,
                password, u"SQLOLEDB"_s, QString());
            return std::nullopt;
        } catch (const core::ComError& e) {
            return e.description();
        }
    };
    const auto withHostile = logOn(quote.password);
    EXPECT_FALSE(withHostile) << withHostile->toStdString();
    // Cut where an unquoted string would end the value: that must not log on.
    const auto withPrefix = logOn(u"p"_s);
    ASSERT_TRUE(withPrefix) << "a part of the password logs on";
    // The failure names the route: driver and server.
    EXPECT_TRUE(withPrefix->contains(u"ODBC driver \"%1\""_s.arg(m_server.odbcDriver)))
        << withPrefix->toStdString();
    EXPECT_TRUE(withPrefix->contains(m_server.host)) << withPrefix->toStdString();
}

} // namespace
