#include "enginefixture.h"

namespace enginetest {
namespace {

using fakeruntime::FakeReport;
using fakeruntime::FakeReportObject;

class SetLocation : public EngineTest {
protected:
    /// Runs SetLocation with three empty slots.
    bool setLocation(engine::MoxEngine115& engine, const std::shared_ptr<FakeReport>& report)
    {
        return engine.SetLocation(report, ole, picture, blob);
    }

    std::shared_ptr<runtime::ReportObject> ole;
    std::shared_ptr<runtime::ReportObject> picture;
    std::shared_ptr<runtime::ReportObject> blob;
};

struct PropertyCase {
    const char* name;
    engine::MoxServerTypes type;
    QString user;
    QStringList expected; // the calls on Table(Orders)
};

class ConnectionProperties : public SetLocation,
                             public ::testing::WithParamInterface<PropertyCase> { };

TEST_P(ConnectionProperties, AreReplacedInTheOrderOfTheServerType)
{
    auto engine = makeEngine();
    engine->SetLogonInfo(GetParam().type, u"srv"_s, u"Shop"_s, GetParam().user, u"pw"_s);
    auto report = fake.newReport(u"orders.rpt"_s);
    report->addTable(u"Orders"_s, u"Orders"_s);

    ASSERT_TRUE(setLocation(*engine, report)) << engine->LastError().toStdString();

    EXPECT_EQ(fake.calls(u"Table(Orders)."_s), GetParam().expected);
}

const QString deleteAll = u"Table(Orders).deleteConnectionProperties()"_s;
const QString relocate = uR"(Table(Orders).setLocation("Orders","",""))"_s;

QString property(const QString& name, const QString& value)
{
    return uR"(Table(Orders).addConnectionProperty("%1",%2))"_s.arg(name, value);
}

INSTANTIATE_TEST_SUITE_P(Engine, ConnectionProperties,
    ::testing::Values(
        PropertyCase { "SqlServer", engine::ecstMSSQL, u"sa"_s,
            { deleteAll, property(u"Provider"_s, u"\"SQLOLEDB\""_s),
                property(u"Data Source"_s, u"\"srv\""_s),
                property(u"Initial Catalog"_s, u"\"Shop\""_s), property(u"User ID"_s, u"\"sa\""_s),
                property(u"Password"_s, u"\"pw\""_s), property(u"Server Name"_s, u"\"srv\""_s),
                property(u"Server Type"_s, u"\"OLEDB\""_s), property(u"DataBase"_s, u"\"Shop\""_s),
                relocate } },
        // Integrated security goes before the user id, as a Boolean.
        PropertyCase { "SqlServerIntegrated", engine::ecstMSSQL, u""_s,
            { deleteAll, property(u"Provider"_s, u"\"SQLOLEDB\""_s),
                property(u"Data Source"_s, u"\"srv\""_s),
                property(u"Initial Catalog"_s, u"\"Shop\""_s),
                property(u"Integrated Security"_s, u"True"_s), property(u"User ID"_s, u"\"\""_s),
                property(u"Password"_s, u"\"pw\""_s), property(u"Server Name"_s, u"\"srv\""_s),
                property(u"Server Type"_s, u"\"OLEDB\""_s), property(u"DataBase"_s, u"\"Shop\""_s),
                relocate } },
        // Jet knows no integrated security.
        PropertyCase { "Jet351", engine::ecstMSJET, u""_s,
            { deleteAll, property(u"Provider"_s, u"\"Microsoft.Jet.OLEDB.3.51\""_s),
                property(u"Data Source"_s, u"\"srv\""_s),
                property(u"Initial Catalog"_s, u"\"Shop\""_s), property(u"User ID"_s, u"\"\""_s),
                property(u"Password"_s, u"\"pw\""_s), relocate } },
        PropertyCase { "Jet40", engine::ecstMSJET40, u"admin"_s,
            { deleteAll, property(u"Provider"_s, u"\"Microsoft.Jet.OLEDB.4.0\""_s),
                property(u"Data Source"_s, u"\"srv\""_s),
                property(u"Initial Catalog"_s, u"\"Shop\""_s),
                property(u"User ID"_s, u"\"admin\""_s), property(u"Password"_s, u"\"pw\""_s),
                relocate } },
        PropertyCase { "NoServerType", engine::ecstNone, u"sa"_s, { relocate } }),
    [](const auto& row) { return std::string(row.param.name); });

struct LocationCase {
    const char* name;
    QString location;
    QStringList expected; // setLocation calls on the table
};

class TableLocation : public SetLocation, public ::testing::WithParamInterface<LocationCase> { };

TEST_P(TableLocation, KeepsOnlyTheTableNameAndLeavesCommandsAlone)
{
    auto engine = loggedOnEngine();
    auto report = fake.newReport(u"r"_s);
    auto table = report->addTable(u"T"_s, GetParam().location);

    ASSERT_TRUE(setLocation(*engine, report)) << engine->LastError().toStdString();

    EXPECT_EQ(fake.calls(u"Table(T).setLocation"_s), GetParam().expected);
    // Commands still read from the logon's database.
    EXPECT_EQ(table->state.connectionProperties.size(), 8u);
}

INSTANTIATE_TEST_SUITE_P(Engine, TableLocation,
    ::testing::Values(LocationCase { "QualifiedWithDatabaseAndOwner", u"Shop.dbo.Orders"_s,
                          { uR"(Table(T).setLocation("Orders","",""))"_s } },
        LocationCase {
            "BareNameIsSetAgain", u"Orders"_s, { uR"(Table(T).setLocation("Orders","",""))"_s } },
        LocationCase { "QualifiedStoredProcedure", u"Shop.dbo.spItems;1"_s,
            { uR"(Table(T).setLocation("spItems;1","",""))"_s } },
        LocationCase { "Command", u"Command"_s, {} },
        LocationCase { "CommandInOtherCase", u"COMMAND"_s, {} }),
    [](const auto& row) { return std::string(row.param.name); });

TEST_F(SetLocation, ResetsTheDialogParentBeforeGivingTheEnginesOwn)
{
    auto engine = loggedOnEngine();
    auto report = fake.newReport(u"r"_s);
    ASSERT_TRUE(setLocation(*engine, report));
    EXPECT_EQ(fake.calls(), QStringList { u"Report(r).setDialogParentWindow(0)"_s });

    fake.clearLog();
    engine->SetDialogParentWindow(77);
    fake.failOn(u"Report.setDialogParentWindow"_s, runtimeError(RuntimeFailure));
    ASSERT_TRUE(setLocation(*engine, report)) << "a failing parent window is ignored";
    EXPECT_EQ(fake.calls(),
        (QStringList {
            u"Report(r).setDialogParentWindow(0)"_s, u"Report(r).setDialogParentWindow(77)"_s }));
}

TEST_F(SetLocation, ConnectionFailureOnTheFirstTableIsRaisedToTheCaller)
{
    auto engine = loggedOnEngine();
    auto report = fake.newReport(u"r"_s);
    report->addTable(u"Orders"_s, u"Orders"_s);
    report->addTable(u"Items"_s, u"Items"_s);
    fake.failOn(u"Table(Orders).setLocation"_s,
        runtimeError(TableConnectionFailed, u"Logon failed for password Secr3t"_s));

    try {
        setLocation(*engine, report);
        FAIL() << "expected the connection failure";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), TableConnectionFailed);
        EXPECT_EQ(error.source(), u"Crystal Reports"_s);
        EXPECT_EQ(error.description(), u"Logon failed for password ********"_s);
    }
    EXPECT_TRUE(engine->ConnectionFailed());
    EXPECT_TRUE(fake.calls(u"Table(Items)"_s).isEmpty());
}

TEST_F(SetLocation, ConnectionFailureAfterARelocatedTableOnlySetsLastError)
{
    auto engine = loggedOnEngine();
    engine->ConnectionFailed(true);
    auto report = fake.newReport(u"r"_s);
    report->addTable(u"Orders"_s, u"Orders"_s);
    report->addTable(u"Items"_s, u"Items"_s);
    report->addTable(u"Stock"_s, u"Stock"_s);
    fake.failOn(u"Table(Items).setLocation"_s, runtimeError(TableConnectionFailed, u"No link"_s));

    EXPECT_FALSE(setLocation(*engine, report));

    EXPECT_EQ(engine->LastError(), u"-2147189180, Crystal Reports, No link"_s);
    EXPECT_FALSE(engine->ConnectionFailed());
    EXPECT_TRUE(fake.calls(u"Table(Stock)"_s).isEmpty());
}

TEST_F(SetLocation, OtherLocationFailuresNameTheTable)
{
    auto engine = loggedOnEngine();
    auto report = fake.newReport(u"r"_s);
    report->addTable(u"Orders"_s, u"Shop.dbo.Orders"_s);
    fake.failOn(u"Table(Orders).setLocation"_s, runtimeError(RuntimeFailure));

    EXPECT_FALSE(setLocation(*engine, report));

    EXPECT_EQ(
        engine->LastError(), u"666, MoxEngine.SetLocation, Setting Table Location for Orders"_s);
    EXPECT_FALSE(engine->ConnectionFailed());
}

TEST_F(SetLocation, ConnectionFailureOnACommandTableBeforeAnyRelocationIsRaised)
{
    auto engine = loggedOnEngine();
    auto report = fake.newReport(u"r"_s);
    report->addTable(u"Cmd"_s, u"Command"_s);
    fake.failOn(u"Table(Cmd).addConnectionProperty"_s, runtimeError(TableConnectionFailed));

    EXPECT_THROW(setLocation(*engine, report), core::ComError);
    EXPECT_TRUE(engine->ConnectionFailed());
}

TEST_F(SetLocation, StoredProcedureSubreportGetsParameterDefaultsAndNoPrompting)
{
    auto engine = loggedOnEngine();
    auto report = fake.newReport(u"main"_s);
    auto sub = report->addSection(u"D"_s)->addSubreport(u"Items"_s);
    sub->addTable(u"Proc"_s, u"Shop.dbo.spItems;1"_s);
    const auto parameter = [&](const QString& name, int16_t kind, bool hasCurrent, bool hasDefaults,
                               bool needsValue) {
        fakeruntime::FakeParameterField::State state;
        state.name = name;
        state.kind = kind;
        state.needsCurrentValue = needsValue;
        if (hasCurrent)
            state.currentValues = { core::Variant(u"set"_s) };
        if (hasDefaults) {
            state.defaultValue = core::Variant(int32_t { 10 });
            state.defaults
                = { { core::Variant(int32_t { 10 }), {} }, { core::Variant(int32_t { 20 }), {} } };
        }
        return sub->addParameter(state);
    };
    auto filled = parameter(u"@Id"_s, 2, false, true, true);
    parameter(u"@ReportParam"_s, 1, false, true, true);
    parameter(u"@HasValue"_s, 2, true, true, true);
    parameter(u"@NoDefaults"_s, 2, false, false, true);
    parameter(u"@Optional"_s, 2, false, true, false);

    ASSERT_TRUE(setLocation(*engine, report)) << engine->LastError().toStdString();

    const QStringList calls = fake.calls();
    const QStringList expectedTail { uR"(Table(Proc).setLocation("spItems;1","",""))"_s,
        u"Param(@Id).addCurrentValue(10)"_s,
        u"Report(Items).setEnableParameterPrompting(False)"_s };
    ASSERT_GE(calls.size(), expectedTail.size());
    EXPECT_EQ(calls.mid(calls.size() - expectedTail.size()), expectedTail)
        << fake.dump().toStdString();
    EXPECT_EQ(filled->state.currentValues.size(), 1u);
}

TEST_F(SetLocation, SubreportTablesGetPropertiesAndCommandsKeepTheirLocation)
{
    auto engine = loggedOnEngine();
    auto report = fake.newReport(u"main"_s);
    auto sub = report->addSection(u"D"_s)->addSubreport(u"Sub"_s);
    auto command = sub->addTable(u"Cmd"_s, u"command"_s);
    sub->addTable(u"Items"_s, u"Shop.dbo.Items"_s);

    ASSERT_TRUE(setLocation(*engine, report)) << engine->LastError().toStdString();

    EXPECT_EQ(command->state.connectionProperties.size(), 8u);
    EXPECT_TRUE(fake.calls(u"Table(Cmd).setLocation"_s).isEmpty());
    EXPECT_EQ(fake.calls(u"Table(Items).setLocation"_s),
        QStringList { uR"(Table(Items).setLocation("Items","",""))"_s });
    EXPECT_TRUE(fake.calls(u"Report(Sub).setEnableParameterPrompting"_s).isEmpty());
}

// Stored procedures of subreports do not count as relocated tables; ordinary subreport
// tables do.
TEST_F(SetLocation, OnlyOrdinaryRelocatedTablesTurnConnectionFailuresIntoLastError)
{
    for (const bool ordinaryFirst : { false, true }) {
        SCOPED_TRACE(ordinaryFirst ? "ordinary table first" : "stored procedure first");
        fakeruntime::FakeRuntime local;
        auto engine = loggedOnEngine();
        auto report = local.newReport(u"main"_s);
        report->addTable(u"Cmd"_s, u"Command"_s);
        auto sub = report->addSection(u"D"_s)->addSubreport(u"Sub"_s);
        sub->addTable(u"First"_s, ordinaryFirst ? u"Orders"_s : u"spOrders;1"_s);
        sub->addTable(u"Second"_s, u"Items"_s);
        local.failOn(u"Table(Second).setLocation"_s, runtimeError(TableConnectionFailed));

        if (ordinaryFirst) {
            EXPECT_FALSE(setLocation(*engine, report));
            EXPECT_TRUE(engine->LastError().startsWith(u"-2147189180, "_s));
            EXPECT_FALSE(engine->ConnectionFailed());
        } else {
            EXPECT_THROW(setLocation(*engine, report), core::ComError);
            EXPECT_TRUE(engine->ConnectionFailed());
        }
    }
}

TEST_F(SetLocation, FailingSubreportStopsTheWalkButKeepsFoundObjects)
{
    auto engine = loggedOnEngine();
    auto report = fake.newReport(u"main"_s);
    auto details = report->addSection(u"D"_s);
    auto logo = details->addObject(u"ICROleObject"_s, u"Logo"_s);
    details->addSubreport(u"Broken"_s);
    auto footer = report->addSection(u"RF"_s);
    footer->addObject(u"IBlobFieldObject"_s, u"Blob"_s);
    fake.failOn(u"Object(Broken).openSubreport"_s, runtimeError(RuntimeFailure, u"Corrupt"_s));

    EXPECT_FALSE(setLocation(*engine, report));

    EXPECT_EQ(engine->LastError(), u"-2147220727, Crystal Reports, Corrupt"_s);
    EXPECT_EQ(ole, logo);
    EXPECT_EQ(blob, nullptr);
}

TEST_F(SetLocation, NoReportFailsWithoutCrashing)
{
    auto engine = loggedOnEngine();
    EXPECT_FALSE(engine->SetLocation(nullptr, ole, picture, blob));
    EXPECT_TRUE(engine->LastError().startsWith(u"91, "_s)) << engine->LastError().toStdString();
}

TEST_F(SetLocation, FindsFirstOleObjectLastPictureObjectAndLastBlobAcrossSubreports)
{
    auto engine = loggedOnEngine();
    auto report = fake.newReport(u"main"_s);
    auto header = report->addSection(u"PH"_s);
    header->addObject(u"IFieldObject"_s, u"Title"_s);
    header->addObject(u"ICROleObject"_s, u"LUDPICTURE_Path"_s);
    auto sub = header->addSubreport(u"Sub"_s);
    auto subDetails = sub->addSection(u"D"_s);
    auto subOle = subDetails->addObject(u"ICROleObject"_s, u"Chart"_s);
    subDetails->addObject(u"IBlobFieldObject"_s, u"SubBlob"_s);
    auto details = report->addSection(u"D"_s);
    details->addObject(u"ICROleObject"_s, u"Logo"_s); // an OLE object was already found
    auto lastPicture = details->addObject(u"ICROleObject"_s, u"ludPicture_Photo"_s);
    auto lastBlob = details->addObject(u"IBlobFieldObject"_s, u"Blob"_s);

    ASSERT_TRUE(setLocation(*engine, report)) << engine->LastError().toStdString();

    EXPECT_EQ(ole, subOle);
    EXPECT_EQ(picture, lastPicture);
    EXPECT_EQ(blob, lastBlob);
}

TEST_F(SetLocation, SlotsWithoutMatchKeepWhatTheCallerPassed)
{
    auto engine = loggedOnEngine();
    auto report = fake.newReport(u"main"_s);
    auto details = report->addSection(u"D"_s);
    details->addObject(u"IFieldObject"_s, u"Amount"_s);
    auto photo = details->addObject(u"ICROleObject"_s, u"LUDPICTURE_Photo"_s);
    auto other = fake.newReport(u"other"_s)->addSection(u"D"_s);
    const std::shared_ptr<runtime::ReportObject> keptOle
        = other->addObject(u"ICROleObject"_s, u"Old"_s);
    const std::shared_ptr<runtime::ReportObject> keptBlob
        = other->addObject(u"IBlobFieldObject"_s, u"Old"_s);
    ole = keptOle;
    blob = keptBlob;

    ASSERT_TRUE(setLocation(*engine, report));

    EXPECT_EQ(ole, keptOle);
    EXPECT_EQ(picture, photo);
    EXPECT_EQ(blob, keptBlob);
}

TEST_F(SetLocation, PasswordInALaterFailureIsMaskedInLastError)
{
    auto engine = loggedOnEngine();
    auto report = fake.newReport(u"r"_s);
    report->addTable(u"Orders"_s, u"Orders"_s);
    report->addTable(u"Items"_s, u"Items"_s);
    fake.failOn(u"Table(Items).addConnectionProperty"_s,
        runtimeError(RuntimeFailure, u"Bad value Secr3t"_s), 6);

    EXPECT_FALSE(setLocation(*engine, report));

    EXPECT_EQ(engine->LastError(), u"-2147220727, Crystal Reports, Bad value ********"_s);
}

} // namespace
} // namespace enginetest
