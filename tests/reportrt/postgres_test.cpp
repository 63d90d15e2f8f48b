#include "core/comerror.h"
#include "reportrt/data/providermap.h"
#include "reportrt/output/registerruntime.h"
#include "reportrt/report.h"
#include "reportrtfixture.h"
#include "runtime/application.h"
#include "runtime/applicationfactory.h"

#include <QCoreApplication>
#include <QSqlDatabase>
#include <QSqlError>
#include <QSqlQuery>
#include <gtest/gtest.h>

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
};

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
                u"CREATE TABLE %1 (id integer primary key, customer varchar(40), region text, amount double precision, price numeric(12,4), shipped boolean, orderdate date, created timestamp, customerid integer)"_s
                    .arg(m_table),
                u"INSERT INTO %1 VALUES (1, 'alpha', 'North', 100, 10.5, true, '2026-01-05', '2026-01-05 08:00:00', 1), (2, 'Alpha', 'North', 250, 20, false, '2026-02-10', '2026-02-10 09:30:00.25', 1), (3, 'ALPHA', 'South', 100, NULL, true, '2026-02-10', '2026-02-10 23:59:59', 2), (4, 'beta', 'South', 75.25, 7.25, NULL, '2026-03-01', NULL, 2), (5, NULL, 'East', NULL, 3, false, NULL, '2026-03-01 00:00:00', 3), (6, 'Élan', NULL, 500, 99.99, true, '2025-12-31', '2025-12-31 12:00:00', 3), (7, 'élan', 'East', 250, 0, true, '2026-04-15', '2026-04-15 10:15:00', NULL), (8, 'gamma_1%%', 'West', 10, 1, false, '2026-04-15', '2026-04-15 10:15:00.5', 4), (9, 'o''Brien', 'West', -5, 2.5, true, '2026-05-01', '2026-05-01 00:00:00', 4), (10, '', 'North', 0, NULL, NULL, '2026-05-02', '2026-05-02 00:00:00', 1)"_s
                    .arg(m_table),
            },
            error);
        if (!reachable) {
            if (qEnvironmentVariableIsSet("LUDMOX_REQUIRE_PG"))
                FAIL() << "PostgreSQL is required (LUDMOX_REQUIRE_PG) but not usable: "
                       << error.toStdString();
            GTEST_SKIP() << "PostgreSQL is not reachable: " << error.toStdString();
        }
        ProviderMap::setServerDriver(u"QPSQL"_s);
    }

    void TearDown() override
    {
        QString error;
        execute(m_server,
            { u"SET client_min_messages TO warning"_s, u"DROP TABLE IF EXISTS %1"_s.arg(m_table) },
            error);
        ProviderMap::setServerDriver(QString());
    }

    /// Relocates the way the engine does for a SQL Server logon.
    std::shared_ptr<Report> open(const QString& formula)
    {
        QJsonObject d = shopReport();
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
        u"{Orders.Amount} In [100, 250] And Not ({Orders.Region} In ['North'])"));

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

} // namespace
