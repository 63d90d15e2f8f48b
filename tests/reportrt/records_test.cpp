#include "core/comerror.h"
#include "reportrt/application.h"
#include "reportrt/base/invarianttext.h"
#include "reportrt/base/runtimeerror.h"
#include "reportrt/data/providermap.h"
#include "reportrt/report.h"
#include "reportrt/viewer/registerruntime.h"
#include "reportrtfixture.h"
#include "runtime/applicationfactory.h"
#include "runtime/databasetable.h"
#include "runtime/parameterfield.h"

#include <QDir>
#include <QFile>
#include <QJsonDocument>
#include <QSqlDatabase>
#include <QSqlError>
#include <QSqlQuery>
#include <gtest/gtest.h>

using namespace reportrt;
using namespace reportrt::test;
using namespace Qt::StringLiterals;

namespace {

class Records : public testing::Test {
protected:
    void SetUp() override
    {
        ASSERT_TRUE(m_dir.isValid());
        m_database = createShopDatabase(m_dir.filePath(QStringLiteral("shop.db")));
    }

    std::shared_ptr<Report> open(const QJsonObject& document, bool relocated = true)
    {
        auto report
            = Report::open(writeReport(m_dir, document, QStringLiteral("r%1.rpt").arg(++m_count)));
        if (relocated)
            relocate(*report, m_database);
        return report;
    }

    std::shared_ptr<Report> withFormula(const QString& formula)
    {
        QJsonObject d = shopReport();
        d[u"selectionFormula"] = formula;
        return open(d);
    }

    QTemporaryDir m_dir;
    QString m_database;
    int m_count = 0;
};

const QString crlf = QStringLiteral("\r\n");

TEST_F(Records, GeneratedStatementPushesTranslatableConditionsDown)
{
    const auto report = withFormula(
        QStringLiteral("{Orders.Amount} >= 100 And UpperCase({Orders.Customer}) = 'ALPHA'\r\nAnd "
                       "{Orders.Region} In ['North', 'South'] And Not IsNull({Orders.OrderDate})"));
    // The untranslatable UpperCase condition stays with the records; the others become
    // one line under WHERE, each in parentheses.
    EXPECT_EQ(report->sqlQueryString(),
        u"SELECT Orders.Amount, Orders.Customer, Orders.Region, Orders.OrderDate, Orders.ID" + crlf
            + u"FROM Orders" + crlf + u"WHERE" + crlf
            + u"    (Orders.Amount >= 100) AND (Orders.Region COLLATE BINARY IN ('North', "
              u"'South')) AND (NOT Orders.OrderDate IS NULL)");
    report->readRecords();
    EXPECT_EQ(selectedIds(*report), (std::vector<int> { 1, 2, 3 }));
    const auto status = report->printingStatus();
    EXPECT_EQ(status.recordsRead, 3); // 6 has no region, 4 too small an amount: only 1, 2, 3 come
    EXPECT_EQ(status.recordsSelected, 3);
    EXPECT_EQ(status.recordsPrinted, 3);
    EXPECT_EQ(status.progress, 3);
}

TEST_F(Records, StatementTextBeforeRelocationUsesTheDesignerLocation)
{
    QJsonObject d = shopReport();
    d[u"selectionFormula"] = u"{Orders.ID} = 5"_s;
    const auto report = open(d, false);
    EXPECT_EQ(report->sqlQueryString(),
        u"SELECT Orders.ID" + crlf + u"FROM shop.dbo.Orders Orders" + crlf + u"WHERE" + crlf
            + u"    Orders.ID = 5");
}

TEST_F(Records, JoinsGroupsAndOrderFollowTheDocument)
{
    QJsonObject d = shopReport();
    QJsonArray tables = d[u"tables"].toArray();
    tables.append(QJsonObject { { u"name"_s, u"Customers"_s },
        { u"location"_s, u"shop.dbo.Customers"_s }, { u"fields"_s, customersFields() } });
    d[u"tables"] = tables;
    d[u"links"] = QJsonArray { QJsonObject { { u"from"_s, u"Orders"_s },
        { u"fromFields"_s, QJsonArray { u"CustomerID"_s } }, { u"to"_s, u"Customers"_s },
        { u"toFields"_s, QJsonArray { u"ID"_s } }, { u"join"_s, u"leftOuter"_s } } };
    d[u"groups"] = QJsonArray { QJsonObject { { u"field"_s, u"{Customers.Name}"_s } } };
    d[u"sorts"] = QJsonArray { QJsonObject {
        { u"field"_s, u"{Orders.Amount}"_s }, { u"order"_s, u"descending"_s } } };
    d[u"selectionFormula"] = u"{Customers.Country} = 'DE' Or IsNull({Customers.Country})"_s;
    const auto report = open(d);
    EXPECT_EQ(report->sqlQueryString(),
        u"SELECT Customers.Country, Customers.Name, Orders.Amount, Orders.ID" + crlf
            + u"FROM Orders LEFT OUTER JOIN Customers ON Orders.CustomerID = Customers.ID" + crlf
            + u"WHERE" + crlf
            + u"    Customers.Country COLLATE BINARY = 'DE' OR Customers.Country IS NULL" + crlf
            + u"ORDER BY Customers.Name, Orders.Amount DESC");
    report->readRecords();
    // Order 7 has no customer: the outer join keeps it with a Null name, which sorts
    // first. Customer 1 (Acme, DE) has orders 1, 2, 10; customer 3 (Cobalt, no country)
    // has 5 and 6; "de" of Birch is not "DE".
    EXPECT_EQ(column(*report, QStringLiteral("{Orders.ID}")),
        (std::vector<QString> {
            u"7.00"_s, u"2.00"_s, u"1.00"_s, u"10.00"_s, u"6.00"_s, u"5.00"_s }));
    const auto* result = report->result();
    ASSERT_EQ(result->topGroups.size(), 3u);
    EXPECT_TRUE(result->groups[static_cast<size_t>(result->topGroups[0])].key.isNull());
    EXPECT_EQ(result->groups[static_cast<size_t>(result->topGroups[1])].key.text(), u"Acme");
    EXPECT_EQ(result->groups[static_cast<size_t>(result->topGroups[1])].recordCount, 3);
}

QJsonObject topNReport(int count)
{
    QJsonObject d = shopReport();
    d[u"groups"] = QJsonArray { QJsonObject { { u"field"_s, u"{Orders.Region}"_s },
        { u"topN"_s,
            QJsonObject { { u"count"_s, count },
                { u"summary"_s,
                    QJsonObject { { u"operation"_s, u"sum"_s },
                        { u"field"_s, u"{Orders.Amount}"_s } } } } } } };
    d[u"sections"] = QJsonArray {
        QJsonObject { { u"name"_s, u"D"_s },
            { u"objects"_s,
                QJsonArray { QJsonObject {
                    { u"kind"_s, u"field"_s }, { u"field"_s, u"{Orders.ID}"_s } } } } },
        QJsonObject { { u"name"_s, u"GF1"_s },
            { u"objects"_s,
                QJsonArray {
                    QJsonObject { { u"kind"_s, u"summary"_s }, { u"operation"_s, u"count"_s },
                        { u"field"_s, u"{Orders.Amount}"_s }, { u"group"_s, 1 } },
                    QJsonObject { { u"kind"_s, u"summary"_s }, { u"operation"_s, u"average"_s },
                        { u"field"_s, u"{Orders.Amount}"_s }, { u"group"_s, 1 } },
                } } },
        QJsonObject { { u"name"_s, u"RF"_s },
            { u"objects"_s,
                QJsonArray {
                    QJsonObject { { u"kind"_s, u"summary"_s }, { u"operation"_s, u"sum"_s },
                        { u"field"_s, u"{Orders.Price}"_s } },
                    QJsonObject { { u"kind"_s, u"summary"_s }, { u"operation"_s, u"minimum"_s },
                        { u"field"_s, u"{Orders.Customer}"_s } },
                    QJsonObject { { u"kind"_s, u"summary"_s }, { u"operation"_s, u"maximum"_s },
                        { u"field"_s, u"{Orders.OrderDate}"_s } },
                } } },
    };
    return d;
}

TEST_F(Records, TopNKeepsTheLargestGroupsAndSummarizesWhatIsPrinted)
{
    const auto report = open(topNReport(2));
    EXPECT_EQ(report->topNGroupCount(QStringLiteral("GH1")), 2);
    report->readRecords();
    // Sums by region: North 350, South 275.25, East 250, West 5, (none) 500.
    const auto* result = report->result();
    ASSERT_EQ(result->topGroups.size(), 2u);
    const auto& first = result->groups[static_cast<size_t>(result->topGroups[0])];
    const auto& second = result->groups[static_cast<size_t>(result->topGroups[1])];
    EXPECT_TRUE(first.key.isNull());
    EXPECT_EQ(second.key.text(), u"North");
    // Summaries: [0] the top-N sum, [1] count, [2] average per group; totals [3..5].
    EXPECT_EQ(second.summaries[0].toNumber(), 350);
    EXPECT_EQ(second.summaries[1].toNumber(), 3);
    EXPECT_NEAR(second.summaries[2].toNumber(), 350.0 / 3, 1e-9);
    EXPECT_EQ(
        result->totals[3].currencyScaled(), 1304900); // 99.99 + 10.5 + 20, order 10 has no price
    EXPECT_EQ(result->totals[4].text(), u""); // order 10's empty name is the smallest text
    EXPECT_EQ(result->totals[5].toQDate(), QDate(2026, 5, 2));
    EXPECT_EQ(report->printingStatus().recordsSelected, 10);
    EXPECT_EQ(report->printingStatus().recordsPrinted, 4);

    report->setTopNGroupCount(QStringLiteral("GH1"), 9999);
    report->readRecords();
    ASSERT_EQ(report->result()->topGroups.size(), 5u);
    EXPECT_EQ(
        report->result()->groups[static_cast<size_t>(report->result()->topGroups[4])].key.text(),
        u"West");
    EXPECT_EQ(report->printingStatus().recordsPrinted, 10);
}

TEST_F(Records, TopNCountErrorsNameTheArea)
{
    const auto report = open(shopReport());
    EXPECT_THROW(report->topNGroupCount(QStringLiteral("GH1")), core::ComError);
    const auto grouped = open(topNReport(3));
    EXPECT_THROW(grouped->setTopNGroupCount(QStringLiteral("GH1"), 0), core::ComError);
    QJsonObject plain = shopReport();
    plain[u"groups"] = QJsonArray { QJsonObject { { u"field"_s, u"{Orders.Region}"_s } } };
    const auto byField = open(plain);
    EXPECT_EQ(byField->topNGroupCount(QStringLiteral("GH1")), 0);
    try {
        byField->setTopNGroupCount(QStringLiteral("GH1"), 5);
        FAIL();
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), core::ErrorNumber::RuntimeFailure);
        EXPECT_TRUE(error.description().contains(u"GH1"));
    }
}

TEST_F(Records, SetStatementIsUsedVerbatimWithTheWholeFormulaOnEachRecord)
{
    const auto report = withFormula(QStringLiteral("{Orders.Amount} >= 100"));
    const QString generated = report->sqlQueryString();
    // What the component does with a list selection: splice a condition in.
    const QString spliced = generated + u" AND (Orders.ID IN (1,3,7))";
    report->setSqlQueryString(spliced);
    EXPECT_EQ(report->sqlQueryString(), spliced);
    report->setRecordSelectionFormula(
        QStringLiteral("{Orders.Amount} >= 100 And {Orders.ID} <> 3"));
    EXPECT_EQ(report->sqlQueryString(), spliced);
    report->readRecords();
    EXPECT_EQ(selectedIds(*report), (std::vector<int> { 1, 7 }));
    EXPECT_EQ(report->printingStatus().recordsRead, 3);
    report->setSqlQueryString(QString());
    EXPECT_EQ(report->sqlQueryString().left(15), u"SELECT Orders.A");
}

TEST_F(Records, SavedDataIsReusedOnlyWhileTheInputsAreUnchanged)
{
    const auto report = withFormula(QStringLiteral("{Orders.Region} = 'North'"));
    report->readRecords();
    EXPECT_EQ(selectedIds(*report), (std::vector<int> { 1, 2, 10 }));
    execute(m_database, { QStringLiteral("INSERT INTO Orders (ID, Region) VALUES (11, 'North')") });
    report->readRecords();
    EXPECT_EQ(selectedIds(*report), (std::vector<int> { 1, 2, 10 })); // saved data
    report->discardSavedData();
    EXPECT_FALSE(report->hasSavedData());
    report->readRecords();
    EXPECT_EQ(selectedIds(*report), (std::vector<int> { 1, 2, 10, 11 }));
    report->setRecordSelectionFormula(QStringLiteral("{Orders.Region} = 'West'"));
    report->readRecords(); // a new formula reads anew
    EXPECT_EQ(selectedIds(*report), (std::vector<int> { 8, 9 }));
}

TEST_F(Records, NoDataEventCanCancel)
{
    const auto report = withFormula(QStringLiteral("{Orders.ID} > 100"));
    int raised = 0;
    report->setNoDataHandler([&](bool& cancel) {
        ++raised;
        cancel = true;
    });
    report->readRecords();
    EXPECT_EQ(raised, 1);
    EXPECT_EQ(report->printingStatus().recordsSelected, 0);
    EXPECT_EQ(report->printingStatus().progress, 5);
    const auto some = withFormula(QStringLiteral("{Orders.ID} = 1"));
    some->setNoDataHandler([&](bool&) { ++raised; });
    some->readRecords();
    EXPECT_EQ(raised, 1);
}

TEST_F(Records, ParameterValuesSelectButNeverEnterTheStatement)
{
    QJsonObject d = shopReport();
    d[u"parameters"] = QJsonArray {
        QJsonObject { { u"name"_s, u"Regions"_s }, { u"valueType"_s, 12 },
            { u"allowsMultipleValues"_s, true } },
        QJsonObject { { u"name"_s, u"From"_s }, { u"valueType"_s, 10 } },
    };
    d[u"selectionFormula"] = u"{Orders.Region} = {?Regions} And {Orders.OrderDate} >= {?From} "
                             u"And {Orders.ID} < 10"_s;
    const auto report = open(d);
    EXPECT_THROW(report->readRecords(), core::ComError); // no values yet
    EXPECT_EQ(report->printingStatus().progress, 4);
    const QString withoutValues = report->sqlQueryString();
    report->parameterFields()[0]->addCurrentValue(core::Variant(QStringLiteral("North")));
    report->parameterFields()[0]->addCurrentValue(core::Variant(QStringLiteral("East")));
    report->parameterFields()[1]->addCurrentValue(core::Variant::fromDate(QDate(2026, 2, 1)));
    // Only the condition without a parameter goes to the database; the statement is the
    // same with values as without.
    EXPECT_EQ(report->sqlQueryString(), withoutValues);
    EXPECT_TRUE(withoutValues.endsWith(u"WHERE" + crlf + u"    Orders.ID < 10"))
        << withoutValues.toStdString();
    report->readRecords();
    EXPECT_EQ(selectedIds(*report), (std::vector<int> { 2, 7 }));
}

// What the component does to a report: it reads the statement once, splices its selection
// in and sets it back, and the report is saved and opened again; the parameter's value
// changes in between. Every read must follow the value of its time.
TEST_F(Records, ChangedParameterValuesReachEveryReadAfterTheStatementWasSetAndSaved)
{
    QJsonObject d = shopReport();
    d[u"parameters"] = QJsonArray { QJsonObject {
        { u"name"_s, u"Region"_s }, { u"valueType"_s, 12 }, { u"kind"_s, 1 } } };
    d[u"selectionFormula"] = u"{Orders.Region} = {?Region}"_s;
    const auto setRegion = [](runtime::Report& report, const QString& region) {
        const auto parameter = report.parameterFields()[0];
        parameter->clearCurrentValues();
        parameter->addCurrentValue(core::Variant(region));
    };
    const auto report = open(d);
    setRegion(*report, u"North"_s);
    report->readRecords();
    EXPECT_EQ(selectedIds(*report), (std::vector<int> { 1, 2, 10 }));
    EXPECT_EQ(report->printingStatus().recordsRead, 3) << "the database selected by the value";

    const QString captured = report->sqlQueryString();
    EXPECT_FALSE(captured.contains(u"North")) << captured.toStdString();
    report->setSqlQueryString(captured + u"\r\nWHERE\r\n    (Orders.ID <> 2)"_s);
    setRegion(*report, u"West"_s);
    report->readRecords();
    EXPECT_EQ(selectedIds(*report), (std::vector<int> { 8, 9 }));
    setRegion(*report, u"North"_s);
    report->readRecords();
    EXPECT_EQ(selectedIds(*report), (std::vector<int> { 1, 10 }));

    const QString saved = m_dir.filePath(u"saved.rpt"_s);
    report->saveAs(saved, 0);
    const auto reopened = Report::open(saved);
    relocate(*reopened, m_database);
    EXPECT_FALSE(reopened->sqlQueryString().contains(u"North")) << "saved with the statement";
    setRegion(*reopened, u"West"_s);
    reopened->readRecords();
    EXPECT_EQ(selectedIds(*reopened), (std::vector<int> { 8, 9 }));
}

// A host restricts a report to thousands of records with one Or term each.
TEST_F(Records, TenThousandOrTermsSelectWhatTheDatabaseSelects)
{
    execute(m_database,
        { u"INSERT INTO Orders (ID, Region, Amount) WITH RECURSIVE n(i) AS (SELECT 11 UNION ALL "
          u"SELECT i + 1 FROM n WHERE i < 2000) SELECT i, CASE i % 7 WHEN 0 THEN 'West' ELSE "
          u"'North' END, i % 1000 FROM n"_s });
    QStringList terms;
    QStringList ids; // the same terms for SQLite, written by hand
    QStringList westAmounts;
    for (int i = 0; i < 10000; ++i) {
        if (i % 100 == 99) {
            terms << u"{Orders.Region} = 'West' And {Orders.Amount} = %1"_s.arg(i);
            westAmounts << QString::number(i);
        } else {
            terms << u"{Orders.ID} = %1"_s.arg(i * 3 + 1);
            ids << QString::number(i * 3 + 1);
        }
    }
    const QString formula = terms.join(u" Or "_s);
    const auto pushed = withFormula(formula);
    const QString sql = pushed->sqlQueryString();
    EXPECT_TRUE(sql.contains(u"\r\nWHERE\r\n"_s)) << "the selection goes to the database";
    pushed->readRecords();

    std::vector<int> expected;
    {
        QSqlDatabase db = QSqlDatabase::addDatabase(u"QSQLITE"_s, u"or-terms"_s);
        db.setDatabaseName(m_database);
        ASSERT_TRUE(db.open());
        QSqlQuery query(db);
        ASSERT_TRUE(query.exec(
            u"SELECT ID FROM Orders WHERE ID IN (%1) OR (Region = 'West' AND "
            u"Amount IN (%2)) ORDER BY ID"_s.arg(ids.join(u", "_s), westAmounts.join(u", "_s))))
            << query.lastError().text().toStdString();
        while (query.next())
            expected.push_back(query.value(0).toInt());
    }
    QSqlDatabase::removeDatabase(u"or-terms"_s);
    // About a third of the 2,000 orders by ID, and a few West ones by amount.
    ASSERT_GT(expected.size(), 600u);
    EXPECT_EQ(selectedIds(*pushed), expected);
    EXPECT_EQ(pushed->printingStatus().recordsRead, static_cast<int>(expected.size()))
        << "the database did the selecting";

    // Without the database's help the runtime evaluates the 10,000 terms itself.
    const auto local = withFormula(formula);
    local->setSqlQueryString(sql.left(sql.indexOf(u"\r\nWHERE\r\n"_s)));
    local->readRecords();
    EXPECT_EQ(selectedIds(*local), expected);
}

TEST_F(Records, CommandTablesRunTheAuthorsStatement)
{
    QJsonObject d = shopReport();
    d[u"tables"]
        = QJsonArray { QJsonObject { { u"name"_s, u"Command"_s }, { u"location"_s, u"Command"_s },
            { u"command"_s, u"SELECT ID, Amount FROM Orders WHERE Amount > 90"_s },
            { u"fields"_s,
                QJsonArray { QJsonObject { { u"name"_s, u"ID"_s }, { u"type"_s, u"number"_s } },
                    QJsonObject { { u"name"_s, u"Amount"_s }, { u"type"_s, u"number"_s } } } } } };
    d[u"sections"] = QJsonArray { QJsonObject { { u"name"_s, u"D"_s },
        { u"objects"_s,
            QJsonArray { QJsonObject {
                { u"kind"_s, u"field"_s }, { u"field"_s, u"{Command.ID}"_s } } } } } };
    d[u"selectionFormula"] = u"{Command.Amount} < 300"_s;
    const auto report = open(d);
    EXPECT_EQ(report->databaseTables()[0]->location(), u"Command");
    EXPECT_EQ(report->sqlQueryString(), u"SELECT ID, Amount FROM Orders WHERE Amount > 90");
    report->readRecords();
    EXPECT_EQ(column(*report, QStringLiteral("{Command.ID}")),
        (std::vector<QString> { u"1.00"_s, u"2.00"_s, u"3.00"_s, u"7.00"_s }));
}

TEST_F(Records, LocationsThatCannotBeReachedRaiseTheConnectionError)
{
    const auto report = open(shopReport(), false);
    const auto table = report->databaseTables()[0];
    table->deleteConnectionProperties();
    table->addConnectionProperty(
        QStringLiteral("Provider"), core::Variant(QStringLiteral("Microsoft.Jet.OLEDB.4.0")));
    table->addConnectionProperty(
        QStringLiteral("Data Source"), core::Variant(m_dir.filePath(QStringLiteral("none.db"))));
    try {
        table->setLocation(QStringLiteral("Orders"), QString(), QString());
        FAIL();
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), core::ErrorNumber::TableConnectionFailed);
    }
    EXPECT_EQ(table->location(), u"shop.dbo.Orders");
    EXPECT_FALSE(
        QFile::exists(m_dir.filePath(QStringLiteral("none.db")))); // no empty database made
    table->addConnectionProperty(QStringLiteral("Data Source"), core::Variant(m_database));
    EXPECT_THROW(
        table->setLocation(QStringLiteral("Suppliers"), QString(), QString()), core::ComError);
    table->setLocation(QStringLiteral("Orders"), QString(), QString());
    EXPECT_EQ(table->location(), u"Orders");
}

// What failed is named: the file, and whether it is missing or of another kind. A Jet
// logon passes the file as the server name, which must not turn into an ODBC connection.
TEST_F(Records, DataSourcesThatAreNoDatabaseNameTheFileAndTheCause)
{
    QFile text(m_dir.filePath(u"notes.txt"_s));
    ASSERT_TRUE(text.open(QIODevice::WriteOnly));
    text.write(QByteArray("These are notes, not a database.\n").repeated(40));
    text.close();
    const QString missing = m_dir.filePath(u"gone/shop.db"_s);
    const struct {
        const char* name;
        QString file;
        const char16_t* cause;
        bool asServer; // a folder is no server name of a file (a socket folder may be one)
    } cases[] = {
        { "a text file", text.fileName(), u"is not a SQLite database", true },
        { "a missing file", missing, u"does not exist", true },
        { "a folder", m_dir.path(), u"not a file", false },
    };
    registerRuntime();
    const auto application = runtime::ApplicationFactory::create();
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        const auto report = open(shopReport(), false);
        const auto table = report->databaseTables()[0];
        table->deleteConnectionProperties();
        table->addConnectionProperty(u"Provider"_s, core::Variant(u"Microsoft.Jet.OLEDB.4.0"_s));
        table->addConnectionProperty(u"Data Source"_s, core::Variant(c.file));
        try {
            table->setLocation(u"Orders"_s, QString(), QString());
            ADD_FAILURE() << "the table was located";
        } catch (const core::ComError& error) {
            EXPECT_EQ(error.number(), core::ErrorNumber::TableConnectionFailed);
            EXPECT_TRUE(error.description().contains(c.file)) << error.description().toStdString();
            EXPECT_TRUE(error.description().contains(QStringView(c.cause)))
                << error.description().toStdString();
        }
        if (!c.asServer)
            continue;
        try {
            application->logOnServer(u"PDSOLEDB.DLL"_s, c.file, u"shop"_s, u"admin"_s, QString(),
                u"SQLOLEDB"_s, QString());
            ADD_FAILURE() << "logged on";
        } catch (const core::ComError& error) {
            EXPECT_EQ(error.number(), core::ErrorNumber::LogOnFailed);
            EXPECT_TRUE(error.description().contains(c.file)) << error.description().toStdString();
            EXPECT_TRUE(error.description().contains(QStringView(c.cause)))
                << error.description().toStdString();
            EXPECT_FALSE(error.description().contains(u"ODBC"_s))
                << error.description().toStdString();
        }
    }
    EXPECT_FALSE(QFile::exists(missing)) << "no empty database made";
}

TEST(ProviderMap, ServerNamesThatAreDatabaseFiles)
{
    const struct {
        const char* name;
        QString server;
        bool isFile;
    } cases[] = {
        { "a missing path", u"/data/none/shop.db"_s, true },
        { "a Jet file of the original platform", u"C:\\Data\\Shop.MDB"_s, true },
        { "a relative path", u"data/shop"_s, true },
        { "a host", u"dbserver"_s, false },
        { "a host and port", u"10.0.0.5,1433"_s, false },
        { "a named instance", u"dbserver\\SQLEXPRESS"_s, false },
        { "a socket folder", QDir::tempPath(), false },
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        const ConnectionSpec spec = ProviderMap::forServer(c.server, u"shop"_s, u"sa"_s, {}, false);
        EXPECT_EQ(spec.driver == u"QSQLITE", c.isFile) << spec.driver.toStdString();
    }
}

TEST_F(Records, BadValuesAndFormulaFailuresAreReportedWithTheRecord)
{
    execute(m_database, { QStringLiteral("UPDATE Orders SET OrderDate = 'someday' WHERE ID = 4") });
    const auto report
        = withFormula(QStringLiteral("{Orders.ID} > 0 And Year({Orders.OrderDate}) > 2000"));
    try {
        report->readRecords();
        FAIL();
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), core::ErrorNumber::ServerError);
        EXPECT_TRUE(error.description().contains(u"\"someday\" of Orders.OrderDate"))
            << error.description().toStdString();
    }
    const auto dividing = withFormula(QStringLiteral("100 / {Orders.Amount} > 1"));
    try {
        dividing->readRecords();
        FAIL();
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), Error::FormulaError);
        EXPECT_TRUE(error.description().contains(u"division by zero"))
            << error.description().toStdString();
    }
}

// The same selection with the database doing the translatable part and without: a
// statement set on the report runs as it is and leaves every condition to the runtime.
class Pushdown : public Records, public testing::WithParamInterface<const char16_t*> { };

TEST_P(Pushdown, SelectsTheSameRecordsWithAndWithoutTheDatabase)
{
    const QString formula = QString::fromUtf16(GetParam());
    const auto pushed = withFormula(formula);
    const QString sql = pushed->sqlQueryString();
    pushed->readRecords();

    const auto local = withFormula(formula);
    QString plain = sql;
    const qsizetype where = plain.indexOf(u"\r\nWHERE\r\n");
    if (where >= 0)
        plain.truncate(where);
    local->setSqlQueryString(plain);
    local->readRecords();

    EXPECT_EQ(selectedIds(*pushed), selectedIds(*local)) << sql.toStdString();
    EXPECT_EQ(local->printingStatus().recordsRead, 10);
}

INSTANTIATE_TEST_SUITE_P(Formulas, Pushdown,
    testing::Values(u"{Orders.Amount} = 100", u"{Orders.Amount} <> 100",
        u"Not ({Orders.Amount} > 80)", u"{Orders.Amount} > 80 Or {Orders.Region} = 'East'",
        u"Not ({Orders.Amount} > 80 Or {Orders.Region} = 'East')",
        u"Not ({Orders.Amount} > 80 And {Orders.Region} = 'North')", u"{Orders.Customer} = 'alpha'",
        u"{Orders.Customer} <> 'alpha'", u"{Orders.Customer} < 'b'", u"{Orders.Customer} >= 'élan'",
        u"{Orders.Customer} In ['alpha', 'Élan']", u"Not ({Orders.Customer} In ['alpha', 'Élan'])",
        u"{Orders.Customer} In 'A' To 'Z'", u"{Orders.Customer} Like 'a*'",
        u"{Orders.Customer} Like '*[1]'", u"{Orders.Customer} Like '?lpha'",
        u"Not ({Orders.Customer} Like '*a')", u"{Orders.Customer} StartsWith 'Al'",
        u"{Orders.Customer} StartsWith ''", u"'lph' In {Orders.Customer}",
        u"IsNull({Orders.Customer}) Or {Orders.Customer} = ''", u"{Orders.Shipped}",
        u"Not {Orders.Shipped}", u"{Orders.Shipped} = False", u"{Orders.OrderDate} = #2026-02-10#",
        u"{Orders.OrderDate} In #2026-01-01# To #2026-03-01#",
        u"{Orders.Created} >= DateTime(2026, 2, 10, 9, 30, 0)",
        u"{Orders.Created} < #2026-04-15 10:15:00.5#",
        u"{Orders.Created} = #2026-04-15 10:15:00.5#", u"{Orders.Price} > 5",
        u"{Orders.Amount} In [100, 250] And {Orders.Customer} Like '*a'",
        u"{Orders.Amount} * 2 > 150 And {Orders.Region} <> 'South'",
        u"({Orders.Amount} > 0 Or IsNull({Orders.Amount})) And Not ({Orders.Region} = 'West')",
        u"{Orders.ID} In [1, 3, 5] Or UpperCase({Orders.Customer}) = 'BETA'",
        u"{Orders.Amount} = {Orders.ID} * 100 Or {Orders.CustomerID} = {Orders.ID}"));

TEST(Application, LogOnToAFileDatabaseAndToAnUnreachableServer)
{
    QTemporaryDir dir;
    const QString db = createShopDatabase(dir.filePath(QStringLiteral("shop.db")));
    registerRuntime();
    const auto application = runtime::ApplicationFactory::create();
    EXPECT_EQ(application, runtime::ApplicationFactory::create());
    application->setMatchLogOnInfo(true);
    application->logOnServer(QStringLiteral("PDSOLEDB.DLL"), db, QStringLiteral("shop"),
        QStringLiteral("admin"), QString(), QStringLiteral("SQLOLEDB"),
        QStringLiteral("Provider=SQLOLEDB;Server=x;Persist Security Info=False;"));
    EXPECT_FALSE(application->canClose());
    application->logOffServer(QStringLiteral("PDSOLEDB.DLL"), db, QStringLiteral("shop"),
        QStringLiteral("admin"), QString());
    EXPECT_TRUE(application->canClose());
    try {
        application->logOnServer(QStringLiteral("PDSOLEDB.DLL"), QStringLiteral("127.0.0.1,1"),
            QStringLiteral("shop"), QStringLiteral("sa"), QStringLiteral("topsecret"),
            QStringLiteral("SQLOLEDB"), QString());
        FAIL();
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), core::ErrorNumber::LogOnFailed);
        EXPECT_FALSE(error.description().contains(u"topsecret"));
    }
    const auto report = application->openReport(writeReport(dir, shopReport()), 1);
    EXPECT_FALSE(application->canClose());
    try {
        application->openReport(dir.filePath(QStringLiteral("missing.rpt")), 1);
        FAIL();
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), core::ErrorNumber::OpenReportFailed);
    }
}

} // namespace

TEST(InvariantText, DatesAsDatabasesWriteThem)
{
    struct Case {
        const char16_t* text;
        std::optional<QDate> date;
    };
    const Case cases[] = {
        { u"2026-12-06", QDate(2026, 12, 6) }, { u"0001-01-01", QDate(1, 1, 1) },
        { u"2024-02-29", QDate(2024, 2, 29) }, { u"2026-02-29", std::nullopt }, // no such day
        { u"2026-13-01", std::nullopt }, { u"2026-1-01", std::nullopt },
        { u"2026/12/06", std::nullopt }, { u"2026-12-06 ", std::nullopt },
        { u"20261-2-06", std::nullopt },
        { u"\u0662\u0660\u0662\u0666-\u0660\u0661-\u0660\u0661", std::nullopt }, // other digits
    };
    for (const Case& c : cases) {
        const auto day = invarianttext::parseDate(QString::fromUtf16(c.text));
        if (c.date)
            EXPECT_EQ(day, c.date->toJulianDay()) << QString::fromUtf16(c.text).toStdString();
        else
            EXPECT_FALSE(day) << QString::fromUtf16(c.text).toStdString();
    }
}
