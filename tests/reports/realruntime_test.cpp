// The report object over the real report runtime, on a SQLite database made by the test:
// the selection reaches the runtime's formula and statement, and the records read follow.

#include "core/dictionary.h"
#include "reportfixture.h"
#include "reportrt/viewer/registerruntime.h"
#include "runtime/applicationfactory.h"
#include "runtime/report.h"
#include "support/fulldisk.h"

#include <QDir>
#include <QFile>
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>
#include <QSqlDatabase>
#include <QSqlError>
#include <QSqlQuery>
#include <QTemporaryDir>

namespace {

using namespace reporttest;

void createShop(const QString& path)
{
    const QString connection = u"report-test-setup"_s;
    {
        QSqlDatabase db = QSqlDatabase::addDatabase(u"QSQLITE"_s, connection);
        db.setDatabaseName(path);
        ASSERT_TRUE(db.open()) << db.lastError().text().toStdString();
        QSqlQuery query(db);
        for (const QString& statement :
            { u"CREATE TABLE Orders (ID INTEGER PRIMARY KEY, Status TEXT, Total REAL)"_s,
                u"INSERT INTO Orders VALUES (1, 'open', 50)"_s,
                u"INSERT INTO Orders VALUES (3, 'open', 150)"_s,
                u"INSERT INTO Orders VALUES (5, 'closed', 500)"_s,
                u"INSERT INTO Orders VALUES (7, 'open', 700)"_s }) {
            ASSERT_TRUE(query.exec(statement)) << query.lastError().text().toStdString();
        }
    }
    QSqlDatabase::removeDatabase(connection);
}

QJsonObject ordersReport(const QString& selectionFormula, const QJsonArray& parameters = {})
{
    const QJsonArray designerConnection {
        QJsonObject { { u"name"_s, u"Provider"_s }, { u"value"_s, u"SQLOLEDB"_s } },
        QJsonObject { { u"name"_s, u"Data Source"_s }, { u"value"_s, u"designsrv"_s } },
        QJsonObject { { u"name"_s, u"Initial Catalog"_s }, { u"value"_s, u"shop"_s } },
    };
    const QJsonArray fields {
        QJsonObject { { u"name"_s, u"ID"_s }, { u"type"_s, u"number"_s } },
        QJsonObject { { u"name"_s, u"Status"_s }, { u"type"_s, u"string"_s } },
        QJsonObject { { u"name"_s, u"Total"_s }, { u"type"_s, u"number"_s } },
    };
    return QJsonObject {
        { u"format"_s, u"ludmox-report"_s },
        { u"version"_s, 1 },
        { u"tables"_s,
            QJsonArray { QJsonObject { { u"name"_s, u"Orders"_s },
                { u"location"_s, u"shop.dbo.Orders"_s }, { u"driver"_s, u"crdb_ado.dll"_s },
                { u"connection"_s, designerConnection }, { u"fields"_s, fields } } } },
        { u"selectionFormula"_s, selectionFormula },
        { u"parameters"_s, parameters },
        { u"sections"_s,
            QJsonArray { QJsonObject { { u"name"_s, u"D"_s }, { u"height"_s, 300 },
                { u"objects"_s,
                    QJsonArray { QJsonObject { { u"kind"_s, u"field"_s },
                        { u"name"_s, u"IDField"_s }, { u"field"_s, u"{Orders.ID}"_s },
                        { u"width"_s, 1000 }, { u"height"_s, 240 } } } } } } },
    };
}

/// The host's value for the parameter S.
std::shared_ptr<core::Dictionary> statusValue(const QString& value)
{
    auto values = std::make_shared<core::Dictionary>();
    values->add(u"S"_s, core::Variant(value));
    return values;
}

class RealRuntime : public ::testing::Test {
protected:
    void SetUp() override
    {
        ASSERT_TRUE(m_folder.isValid());
        m_previousFactory = runtime::ApplicationFactory::install(nullptr);
        reportrt::registerRuntime();
        engine::ReleaseApplication();
        m_database = m_folder.filePath(u"shop.db"_s);
        createShop(m_database);
        // A Jet logon names the database file as its server.
        m_engine->SetLogonInfo(engine::ecstMSJET, m_database, QString(), u"admin"_s, QString());
        m_reports->SetEngine(m_engine);
    }
    void TearDown() override
    {
        m_reports->Destroy();
        engine::ReleaseApplication();
        runtime::ApplicationFactory::install(std::move(m_previousFactory));
        engine::gServerType = engine::ecstMSSQL;
    }

    std::shared_ptr<reports::MoxReport115> report(const QString& selectionFormula,
        const QJsonArray& parameters = {}, const QString& folder = QString())
    {
        const QString path
            = QDir(folder.isEmpty() ? m_folder.path() : folder).filePath(u"orders.rpt"_s);
        QFile file(path);
        EXPECT_TRUE(file.open(QIODevice::WriteOnly | QIODevice::Truncate));
        file.write(QJsonDocument(ordersReport(selectionFormula, parameters)).toJson());
        file.close();
        return m_reports->Item(path);
    }

    static QByteArray contents(const QString& path)
    {
        QFile file(path);
        return file.open(QIODevice::ReadOnly) ? file.readAll() : QByteArray("<unreadable>");
    }

    static int32_t recordsSelected(runtime::Report& runtimeReport)
    {
        runtimeReport.readRecords();
        return runtimeReport.printingStatus().recordsSelected;
    }

    QTemporaryDir m_folder;
    QString m_database;
    runtime::ApplicationFactory::Function m_previousFactory;
    std::shared_ptr<engine::MoxEngine115> m_engine = std::make_shared<engine::MoxEngine115>();
    std::shared_ptr<reports::MoxReports115> m_reports = std::make_shared<reports::MoxReports115>();
};

TEST_F(RealRuntime, AnIdSelectionGoesIntoTheFormulaBesideTheAuthors)
{
    const auto orders = report(u"{Orders.Status} = 'open'"_s);
    ASSERT_TRUE(orders->SetSelection(u"Orders"_s, int32_t(3)));
    const auto runtimeReport = orders->C_Report();
    ASSERT_TRUE(runtimeReport) << m_engine->LastError().toStdString();
    EXPECT_FALSE(orders->UnloadRequest());
    EXPECT_EQ(runtimeReport->recordSelectionFormula(),
        lines({ u"(//LUD#1"_s, u"{Orders.Status} = 'open'"_s, u")//LUD#2"_s, u"//LUDSELECTION"_s,
            u"AND ({Orders.ID}=3)"_s }));
    EXPECT_EQ(recordsSelected(*runtimeReport), 1);

    // A closed order is not the author's: nothing is selected.
    ASSERT_TRUE(orders->SetSelection(u"Orders"_s, int32_t(5)));
    EXPECT_EQ(recordsSelected(*runtimeReport), 0);
}

TEST_F(RealRuntime, AListSelectionIsSplicedIntoTheRuntimesStatement)
{
    const auto orders = report(u"{Orders.Status} = 'open'"_s);
    ASSERT_TRUE(orders->SetSelection(u"Orders"_s,
        core::VariantArray::fromList({ int32_t(1), int32_t(5), int32_t(7) }), u"Total > 100"_s));
    const auto runtimeReport = orders->C_Report();
    ASSERT_TRUE(runtimeReport) << m_engine->LastError().toStdString();
    EXPECT_FALSE(orders->UnloadRequest());

    const QString statement = runtimeReport->sqlQueryString();
    const qsizetype where = statement.lastIndexOf(u"\r\nWHERE\r\n    "_s);
    ASSERT_GE(where, 0) << statement.toStdString();
    EXPECT_TRUE(statement.endsWith(u" AND ((Orders.ID IN (1,5,7)) AND (((Orders.Total > 100))))"_s))
        << statement.toStdString();
    EXPECT_FALSE(statement.contains(u'"')) << "Jet statements quote with grave accents";
    // Open (the author's), among 1, 5 and 7, above 100: order 7 only.
    EXPECT_EQ(recordsSelected(*runtimeReport), 1);
}

TEST_F(RealRuntime, SavingForEditingAndReplacingKeepTheMarkersWorking)
{
    const auto orders = report(u"{Orders.Status} = 'open'"_s);
    ASSERT_TRUE(orders->SetSelection(u"Orders"_s, int32_t(3)));
    ASSERT_TRUE(orders->C_Report());
    const QString scratch = m_folder.filePath(u"scratch.rpt"_s);
    ASSERT_TRUE(orders->SaveReport(scratch));

    QString fileName = scratch;
    QString originalSel;
    QString savedSel;
    QString editedSel;
    ASSERT_TRUE(orders->CheckEditedSelection(fileName, originalSel, savedSel, editedSel));
    EXPECT_EQ(editedSel, u"{Orders.Status} = 'open'"_s);

    ASSERT_TRUE(orders->ReplaceEdited(scratch, u"{Orders.Total} > 100"_s));
    const auto reopened = orders->C_Report();
    ASSERT_TRUE(reopened);
    EXPECT_EQ(reopened->recordSelectionFormula(),
        lines({ u"(//LUD#1"_s, u"{Orders.Total} > 100"_s, u")//LUD#2"_s, u"//LUDSELECTION"_s,
            u"AND ({Orders.ID}=3)"_s }));
    EXPECT_EQ(recordsSelected(*reopened), 1);
}

// A report with a text parameter in its selection: the host changes the value between
// reads, after the component captured the runtime's statement to splice a list into it, and
// after the report went through the editing cycle. Each read selects by the value of its
// time.
TEST_F(RealRuntime, AChangedParameterValueSelectsAtEveryStepOfTheCycle)
{
    const QJsonArray status { QJsonObject { { u"name"_s, u"S"_s }, { u"valueType"_s, 12 } } };
    const auto orders = report(u"{Orders.Status} = {?S}"_s, status);
    ASSERT_TRUE(orders->SetParams(statusValue(u"open"_s)));
    ASSERT_TRUE(orders->SetSelection(u"Orders"_s,
        core::VariantArray::fromList({ int32_t(1), int32_t(3), int32_t(5), int32_t(7) })));
    auto runtimeReport = orders->C_Report();
    ASSERT_TRUE(runtimeReport) << m_engine->LastError().toStdString();
    EXPECT_EQ(recordsSelected(*runtimeReport), 3); // 1, 3 and 7 are open
    EXPECT_FALSE(runtimeReport->sqlQueryString().contains(u"open"))
        << runtimeReport->sqlQueryString().toStdString();

    ASSERT_TRUE(orders->SetParams(statusValue(u"closed"_s)));
    runtimeReport = orders->C_Report();
    ASSERT_TRUE(runtimeReport);
    EXPECT_EQ(recordsSelected(*runtimeReport), 1); // 5
    EXPECT_TRUE(runtimeReport->sqlQueryString().endsWith(u"WHERE\r\n    Orders.ID IN (1,3,5,7)"_s))
        << runtimeReport->sqlQueryString().toStdString();

    const QString scratch = m_folder.filePath(u"scratch.rpt"_s);
    ASSERT_TRUE(orders->SaveReport(scratch));
    EXPECT_FALSE(contents(scratch).contains("IN (1,3,5,7)")) << "the author's statement is saved";
    ASSERT_TRUE(orders->ReplaceEdited(scratch));
    ASSERT_TRUE(orders->SetParams(statusValue(u"open"_s)));
    runtimeReport = orders->C_Report();
    ASSERT_TRUE(runtimeReport) << m_engine->LastError().toStdString();
    EXPECT_EQ(recordsSelected(*runtimeReport), 3);

    // The saved copy, opened as a report of its own, selects by whatever value it gets.
    const auto copy = m_reports->Item(scratch);
    ASSERT_TRUE(copy->SetParams(statusValue(u"closed"_s)));
    const auto copyReport = copy->C_Report();
    ASSERT_TRUE(copyReport) << m_engine->LastError().toStdString();
    EXPECT_EQ(recordsSelected(*copyReport), 1);
}

struct FullDiskCase {
    const char* name;
    testsupport::FullDisk::Kind kind;
};

class RealRuntimeOnAFullDisk : public RealRuntime,
                               public testing::WithParamInterface<FullDiskCase> { };

TEST_P(RealRuntimeOnAFullDisk, SavingAndReplacingFailAndKeepTheFiles)
{
    QTemporaryDir full;
    testsupport::FullDisk disk(GetParam().kind, full.path());
    if (!disk.isReady())
        GTEST_SKIP() << "this process may not mount a file system";
    const auto orders = report(u"{Orders.Status} = 'open'"_s, {}, full.path());
    const QString ownFile = full.filePath(u"orders.rpt"_s);
    ASSERT_TRUE(orders->SetSelection(u"Orders"_s, int32_t(3)));
    ASSERT_TRUE(orders->C_Report()) << m_engine->LastError().toStdString();
    // An earlier copy for editing, and an edited one to put in place, outside the full disk.
    const QString scratch = full.filePath(u"scratch.rpt"_s);
    ASSERT_TRUE(orders->SaveReport(scratch));
    const QString edited = m_folder.filePath(u"edited.rpt"_s);
    ASSERT_TRUE(orders->SaveReport(edited));
    const QByteArray scratchBytes = contents(scratch);
    const QByteArray ownBytes = contents(ownFile);

    disk.fill();
    EXPECT_FALSE(orders->SaveReport(scratch));
    EXPECT_FALSE(orders->ReplaceEdited(edited, u"{Orders.Total} > 100"_s));

    EXPECT_EQ(contents(scratch), scratchBytes);
    EXPECT_EQ(contents(ownFile), ownBytes);
    QStringList left = QDir(full.path()).entryList(QDir::Files | QDir::Hidden);
    left.removeAll(u"filler"_s);
    EXPECT_EQ(left, (QStringList { u"orders.rpt"_s, u"scratch.rpt"_s }));
}

INSTANTIATE_TEST_SUITE_P(RealRuntime, RealRuntimeOnAFullDisk,
    testing::Values(FullDiskCase { "Tmpfs", testsupport::FullDisk::Kind::Tmpfs },
        FullDiskCase { "SizeLimit", testsupport::FullDisk::Kind::SizeLimit }),
    [](const testing::TestParamInfo<FullDiskCase>& param) {
        return std::string(param.param.name);
    });

} // namespace
