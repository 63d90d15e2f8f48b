#include "reportfixture.h"
#include "reports/moxstatus115.h"

namespace {

using namespace reporttest;
using fakeruntime::FakeParameterField;

class ReportLifecycle : public ReportTest {
protected:
    /// The calls that mark the loader's steps, as "Kind.method", in the order made.
    QStringList milestones() const
    {
        static const QStringList methods { u"openReport"_s, u"logOnServer"_s, u"discardSavedData"_s,
            u"setLocation"_s, u"addFormatHandler"_s, u"addCurrentValue"_s, u"setSqlQueryString"_s,
            u"setTopNGroupCount"_s };
        QStringList result;
        for (const auto& call : fake.log()) {
            if (!call.isQuery && methods.contains(call.method))
                result << call.kind + u'.' + call.method;
        }
        return result;
    }
};

TEST_F(ReportLifecycle, FirstUseOpensLogsOnLocatesAndAppliesInOrder)
{
    auto file = addOrdersReport();
    file->state.savedData = true;
    file->state.sqlQuery = u"SELECT Orders.ID FROM Orders"_s;
    file->state.topN[u"GH1"_s] = 10;
    file->state.sections.front()->addObject(u"ICROleObject"_s, u"Logo"_s);
    addParameter(*file, Param(u"Customer"_s));
    const auto report = open();
    report->SetParams(dictionary({ { u"Customer"_s, u"ACME"_s } }));
    report->TopNGroups(3);
    report->SetSelection(u"Orders"_s, core::VariantArray::fromList({ int32_t(3) }));
    EXPECT_TRUE(fake.calls().isEmpty()) << "requests before the first use open nothing";

    ASSERT_EQ(report->C_Report(), file);

    EXPECT_EQ(milestones(),
        (QStringList { u"Application.openReport"_s, u"Application.logOnServer"_s,
            u"Report.discardSavedData"_s, u"Table.setLocation"_s, u"Section.addFormatHandler"_s,
            u"Param.addCurrentValue"_s, u"Report.setSqlQueryString"_s,
            u"Report.setTopNGroupCount"_s }))
        << fake.dump().toStdString();
    EXPECT_EQ(report->TopNGroups(), 3);
    EXPECT_FALSE(report->UnloadRequest());
    EXPECT_EQ(dialog.shown, 0);
}

TEST_F(ReportLifecycle, ALoadedReportIsNotPreparedAgainUnlessRefreshed)
{
    auto file = addOrdersReport();
    addParameter(*file, Param(u"Customer"_s));
    const auto report = open();
    report->SetParams(dictionary({ { u"Customer"_s, u"ACME"_s } }));
    ASSERT_TRUE(load(*report));
    fake.clearLog();

    ASSERT_TRUE(load(*report));
    EXPECT_TRUE(fake.calls().isEmpty()) << fake.dump().toStdString();

    file->state.savedData = true;
    ASSERT_TRUE(load(*report, true));
    EXPECT_EQ(callsOf(u"Report(orders.rpt).discardSavedData"_s).size(), 1);
    EXPECT_EQ(callsOf(u"Param(Customer).addCurrentValue"_s),
        QStringList { u"Param(Customer).addCurrentValue(\"ACME\")"_s });
    EXPECT_TRUE(callsOf(u"Application."_s).isEmpty()) << "no second open or logon";
}

TEST_F(ReportLifecycle, AReportNotReadThroughOleDbStaysClosed)
{
    auto file = fake.addReport(u"legacy.rpt"_s);
    file->addTable(tableWithDriver(u"Orders"_s, u"Orders"_s, u"crdbxml.dll"_s));
    const auto report = open(u"legacy.rpt"_s);

    EXPECT_EQ(report->C_Report(), nullptr);
    EXPECT_TRUE(report->UnloadRequest());
    EXPECT_EQ(report->GetReport(), nullptr);
    EXPECT_TRUE(callsOf(u"Application.logOnServer"_s).isEmpty());

    // Every load tries the file again; CheckOLEDB answers from the flag.
    EXPECT_EQ(report->C_Report(), nullptr);
    EXPECT_FALSE(report->CheckOLEDB());
    EXPECT_EQ(callsOf(u"Application.openReport"_s).size(), 2);
}

TEST_F(ReportLifecycle, CheckOleDbComparesTheDriverWithoutRegardToCaseAndKeepsTheReportOpen)
{
    auto file = fake.addReport(u"orders.rpt"_s);
    file->addTable(tableWithDriver(u"Orders"_s, u"Orders"_s, u"CRDB_ADO.DLL"_s));
    const auto report = open();

    EXPECT_TRUE(report->CheckOLEDB());
    EXPECT_EQ(report->GetReport(), file);
    EXPECT_TRUE(callsOf(u"Application.logOnServer"_s).isEmpty()) << "checking does not load";
    EXPECT_TRUE(report->CheckOLEDB());
    EXPECT_EQ(callsOf(u"Application.openReport"_s).size(), 1);

    const auto unnamed = open(QString());
    EXPECT_FALSE(unnamed->CheckOLEDB());
}

TEST_F(ReportLifecycle, CheckOleDbPassesRuntimeErrorsOn)
{
    const auto report = open(u"missing.rpt"_s);
    try {
        report->CheckOLEDB();
        FAIL() << "expected the runtime's error";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), OpenReportFailed);
    }
}

TEST_F(ReportLifecycle, LogonAndLocationRefusalsRaiseErrorOccuredAndFail)
{
    struct Case {
        const char* name;
        QString failingCall;
        core::ComError error;
        QString expectedMessage;
    };
    const Case cases[] = {
        { "server logon fails", u"Application.logOnServer"_s,
            runtimeError(LogOnFailed, u"Login failed"_s),
            u"-2147189155, Crystal Reports, Login failed"_s },
        { "table location refused", u"Table(Orders).setLocation"_s,
            runtimeError(RuntimeFailure, u"Bad table"_s),
            u"666, MoxEngine.SetLocation, Setting Table Location for Orders"_s },
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        engine::ReleaseApplication();
        fakeruntime::FakeRuntime local;
        auto file = local.addReport(u"orders.rpt"_s);
        file->addTable(u"Orders"_s, u"Shop.dbo.Orders"_s);
        local.failOn(c.failingCall, c.error);
        auto engineObject = std::make_shared<engine::MoxEngine115>();
        engineObject->SetLogonInfo(engine::ecstMSSQL, u"srv"_s, u"Shop"_s, u"sa"_s, u"pw"_s);
        auto reportsObject = std::make_shared<reports::MoxReports115>();
        reportsObject->SetEngine(engineObject);
        const auto report = reportsObject->Item(u"orders.rpt"_s);
        events.clear();
        recordEvents(*report);

        EXPECT_FALSE(load(*report));
        EXPECT_TRUE(report->UnloadRequest());
        ASSERT_EQ(events.size(), 1u);
        EXPECT_EQ(events[0].name, u"ErrorOccured"_s);
        EXPECT_EQ(events[0].args[0], core::Variant(c.expectedMessage));
        EXPECT_TRUE(local.calls(u"Param"_s).isEmpty());
        EXPECT_TRUE(local.calls(u"Report(orders.rpt).setSqlQueryString"_s).isEmpty());
    }
}

TEST_F(ReportLifecycle, WithoutAnEventObjectARefusedLogonOnlyFails)
{
    addOrdersReport();
    fake.failOn(u"Application.logOnServer"_s, runtimeError(LogOnFailed));
    const auto report = open();
    EXPECT_FALSE(load(*report));
    EXPECT_TRUE(report->UnloadRequest());
}

TEST_F(ReportLifecycle, RuntimeErrorsReachTheCallerAfterTheCleanUp)
{
    struct Case {
        const char* name;
        QString failingCall;
        int32_t number;
    };
    const Case cases[] = {
        { "connection refused on the first table", u"Table(Orders).setLocation"_s,
            TableConnectionFailed },
        { "parameters cannot be read", u"Report(orders.rpt).parameterFields"_s, RuntimeFailure },
        { "driver cannot be read", u"Table(Orders).driverName"_s, RuntimeFailure },
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        engine::ReleaseApplication();
        fakeruntime::FakeRuntime local;
        auto file = local.addReport(u"orders.rpt"_s);
        file->addTable(u"Orders"_s, u"Shop.dbo.Orders"_s);
        local.failOn(c.failingCall, runtimeError(c.number, u"Broken"_s));
        auto engineObject = std::make_shared<engine::MoxEngine115>();
        engineObject->SetLogonInfo(engine::ecstMSSQL, u"srv"_s, u"Shop"_s, u"sa"_s, u"pw"_s);
        auto reportsObject = std::make_shared<reports::MoxReports115>();
        reportsObject->SetEngine(engineObject);
        const auto report = reportsObject->Item(u"orders.rpt"_s);

        try {
            report->C_Report();
            ADD_FAILURE() << "expected the error to pass on";
        } catch (const core::ComError& error) {
            EXPECT_EQ(error.number(), c.number);
            EXPECT_EQ(error.source(), u"Crystal Reports"_s);
            EXPECT_EQ(error.description(), u"Broken"_s);
        }
        EXPECT_TRUE(report->UnloadRequest());
        // The failure was the first matching call only: the next use loads.
        EXPECT_NE(report->C_Report(), nullptr);
        EXPECT_FALSE(report->UnloadRequest());
    }
}

TEST_F(ReportLifecycle, AReportWithoutCollectionCannotReachAnEngine)
{
    addOrdersReport();
    auto orphan = std::make_shared<reports::MoxReport115>();
    orphan->SetFileName(u"orders.rpt"_s);
    try {
        orphan->C_Report();
        FAIL() << "expected error 91";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), core::ErrorNumber::ObjectVariableNotSet);
    }
    EXPECT_TRUE(orphan->UnloadRequest());
}

TEST_F(ReportLifecycle, ALoadStartedFromAnEventDuringLoadingReturnsAtOnce)
{
    addOrdersReport();
    fake.failOn(u"Application.logOnServer"_s, runtimeError(LogOnFailed));
    const auto report = open();
    bool nested = true;
    recordEvents(*report, [&](const QString&, std::span<core::Variant>) {
        report->UnloadRequest(false);
        nested = load(*report);
        // The nested call must not have cleared or set anything.
        EXPECT_FALSE(report->UnloadRequest());
    });

    EXPECT_FALSE(load(*report));
    EXPECT_FALSE(nested);
    EXPECT_EQ(callsOf(u"Application.openReport"_s).size(), 1);
}

TEST_F(ReportLifecycle, AReportClosedByTheHostWhileLoadingIsNotLoaded)
{
    auto file = addOrdersReport();
    addParameter(*file, Param(u"Region"_s).prompt(u"LUD#Regions"_s).satisfied());
    const auto report = open();
    recordEvents(*report, [&](const QString&, std::span<core::Variant>) { report->CloseReport(); });

    EXPECT_FALSE(load(*report));
    EXPECT_TRUE(report->UnloadRequest());
    EXPECT_EQ(report->GetReport(), nullptr);
    // The next use starts afresh.
    EXPECT_EQ(report->C_Report(), file);
}

TEST_F(ReportLifecycle, ARepeatedSingleRecordSelectionLogsOnAgainOnTheNextLoad)
{
    addOrdersReport();
    const auto report = open();
    ASSERT_TRUE(load(*report));
    // Changed logon data drop the engine's logon; only a repeated selection makes a loaded
    // report log on again.
    moxEngine->SetLogonInfo(engine::ecstMSSQL, u"other"_s, u"Shop"_s, u"sa"_s, u"Secr3t"_s);
    ASSERT_TRUE(load(*report));
    EXPECT_EQ(callsOf(u"Application.logOnServer"_s).size(), 1);

    report->SetSelection(u"Orders"_s, int32_t(5), u"Total > 1"_s);
    report->SetSelection(u"orders"_s, int32_t(5), u"TOTAL > 1"_s);
    ASSERT_TRUE(load(*report));
    EXPECT_EQ(callsOf(u"Application.logOnServer"_s).size(), 2);

    ASSERT_TRUE(load(*report));
    EXPECT_EQ(callsOf(u"Application.logOnServer"_s).size(), 2) << "consumed by one load";
}

TEST_F(ReportLifecycle, PictureSectionsAreBoundOnceAndReleasedOnClose)
{
    auto file = addOrdersReport();
    auto header = file->addSection(u"PH"_s);
    header->addObject(u"ICROleObject"_s, u"Logo"_s);
    auto details = file->state.sections.front();
    details->addObject(u"ICROleObject"_s, u"LUDPICTURE_Path"_s);
    details->addObject(u"IBlobFieldObject"_s, u"Photo"_s);
    const auto report = open();

    ASSERT_TRUE(load(*report));
    EXPECT_EQ(header->formatHandlerCount(), 1);
    EXPECT_EQ(details->formatHandlerCount(), 2);
    header->fireFormat();
    details->fireFormat();

    report->CloseReport();
    EXPECT_EQ(header->formatHandlerCount(), 0);
    EXPECT_EQ(details->formatHandlerCount(), 0);
    EXPECT_EQ(report->GetReport(), nullptr);

    ASSERT_TRUE(load(*report));
    EXPECT_EQ(header->formatHandlerCount(), 1);
    EXPECT_EQ(details->formatHandlerCount(), 2);
}

TEST_F(ReportLifecycle, HandlersOfAnEndedReportAreGone)
{
    auto file = addOrdersReport();
    auto details = file->state.sections.front();
    details->addObject(u"ICROleObject"_s, u"Logo"_s);
    {
        auto report = open();
        ASSERT_TRUE(load(*report));
        ASSERT_EQ(details->formatHandlerCount(), 1);
        collection->Remove(u"orders.rpt"_s);
    }
    EXPECT_EQ(details->formatHandlerCount(), 0);
    file->state.selectsNoRecords = true;
    file->readRecords(); // no handler left to call into the ended report
}

TEST_F(ReportLifecycle, TheNoDataEventMarksTheReportEmptyUnlessIgnored)
{
    auto file = addOrdersReport();
    file->state.selectsNoRecords = true;
    const auto report = open();
    const auto runtimeReport = report->C_Report();
    ASSERT_TRUE(runtimeReport);

    runtimeReport->readRecords();
    EXPECT_TRUE(report->NoData());
    EXPECT_FALSE(file->state.noDataCancelled) << "the cancel flag is left as given";

    report->IgnoreNoDataCheck(true);
    runtimeReport->readRecords();
    EXPECT_FALSE(report->NoData());
}

TEST_F(ReportLifecycle, TopNGroupsFollowsWhatTheReportAllows)
{
    struct Case {
        const char* name;
        int32_t areaCount; // 0: the report does not sort groups by top N
        int32_t requested;
        int32_t expected;
    };
    const Case cases[] = {
        { "no top-N grouping", 0, 5, -1 },
        { "five groups", 10, 5, 5 },
        { "zero shows all groups", 10, 0, 9999 },
        { "negative shows all groups", 10, -7, 9999 },
        { "not set", 10, -1, -1 },
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        collection->Remove(u"orders.rpt"_s);
        auto file = addOrdersReport();
        file->state.topN[u"GH1"_s] = c.areaCount;

        // Before loading the request is only stored; loading applies it.
        const auto beforeLoad = open();
        beforeLoad->TopNGroups(c.requested);
        EXPECT_EQ(beforeLoad->TopNGroups(), c.requested);
        ASSERT_TRUE(load(*beforeLoad));
        EXPECT_EQ(beforeLoad->TopNGroups(), c.expected);

        // On a loaded report the Let applies at once.
        file->state.topN[u"GH1"_s] = c.areaCount;
        beforeLoad->TopNGroups(c.requested);
        EXPECT_EQ(beforeLoad->TopNGroups(), c.expected);
    }
}

TEST_F(ReportLifecycle, TopNGroupsIsMinusOneWhenTheRuntimeFails)
{
    auto file = addOrdersReport();
    file->state.topN[u"GH1"_s] = 10;
    const auto report = open();
    ASSERT_TRUE(load(*report));
    fake.failOn(u"Report.setTopNGroupCount"_s, runtimeError(RuntimeFailure));
    report->TopNGroups(4);
    EXPECT_EQ(report->TopNGroups(), -1);
}

TEST_F(ReportLifecycle, StatusReportsTheRuntimesPrintProgress)
{
    struct Case {
        const char* name;
        runtime::PrintingStatus printing;
        int32_t expectedPages;
    };
    const Case cases[] = {
        { "printing in progress", { 10, 9, 4, 2, 3 }, -1 },
        { "completed, every record printed", { 10, 9, 10, 3, 3 }, 3 },
        { "completed, records missing", { 10, 9, 8, 3, 3 }, -1 },
    };
    auto file = addOrdersReport();
    const auto report = open();

    const auto closed = report->Status();
    ASSERT_TRUE(closed);
    EXPECT_EQ(closed->Progress, reports::eppNoReport);
    EXPECT_EQ(closed->NumberOfPages, 0);

    ASSERT_TRUE(load(*report));
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        file->state.printingStatus = c.printing;
        const auto status = report->Status();
        ASSERT_TRUE(status);
        EXPECT_EQ(status->NumberOfPages, c.expectedPages);
        EXPECT_EQ(status->NumberOfRecordRead, c.printing.recordsRead);
        EXPECT_EQ(status->NumberOfRecordSelected, c.printing.recordsSelected);
        EXPECT_EQ(status->NumberOfRecordPrinted, c.printing.recordsPrinted);
        EXPECT_EQ(static_cast<int>(status->Progress), c.printing.progress);
    }

    fake.failOn(u"Report.printingStatus"_s, runtimeError(RuntimeFailure));
    EXPECT_EQ(report->Status(), nullptr);
}

TEST_F(ReportLifecycle, CloseReportKeepsSettingsAndOptionallyTheParameters)
{
    auto file = addOrdersReport();
    file->state.selectionFormula = u"{Orders.Open} = 1"_s;
    addParameter(*file, Param(u"Customer"_s));
    const auto report = open();
    report->SetParams(dictionary({ { u"Customer"_s, u"ACME"_s } }));
    report->SetSelection(u"Orders"_s, int32_t(5));
    report->DefaultPrinter(u"Office"_s);
    report->PreviewActive(true);
    const auto eventsBefore = report->MoxEvents();
    ASSERT_TRUE(load(*report));

    bool keepParameters = true;
    EXPECT_TRUE(report->CloseReport(keepParameters));
    EXPECT_EQ(report->GetReport(), nullptr);
    EXPECT_FALSE(report->PreviewActive());
    EXPECT_EQ(report->DefaultPrinter(), u"Office"_s);
    EXPECT_NE(report->MoxEvents(), eventsBefore) << "the event object is released";

    // The author's formula was captured before; reopening applies the same selection again
    // and the kept parameter values without a dialog.
    file->state.selectionFormula = u"{Orders.Open} = 1"_s;
    fake.clearLog();
    ASSERT_TRUE(load(*report));
    EXPECT_EQ(file->state.selectionFormula,
        lines({ u"(//LUD#1"_s, u"{Orders.Open} = 1"_s, u")//LUD#2"_s, u"//LUDSELECTION"_s,
            u"AND ({Orders.ID}=5)"_s }));
    EXPECT_EQ(callsOf(u"Param(Customer).addCurrentValue"_s).size(), 1);
    EXPECT_EQ(dialog.shown, 0);

    report->CloseReport();
    file->state.parameters.front()->state.needsCurrentValue = true;
    ASSERT_TRUE(load(*report));
    EXPECT_EQ(dialog.shown, 1) << "without the host's values the dialog asks";
    report->CloseReport8();
}

TEST_F(ReportLifecycle, ReloadKeepingParametersPutsTheFirstValuesBack)
{
    auto file = addOrdersReport();
    auto customer = addParameter(*file, Param(u"Customer"_s));
    auto year = addParameter(*file, Param(u"Year"_s).type(5));
    const auto report = open();
    report->SetParams(dictionary({ { u"Customer"_s, u"ACME"_s }, { u"Year"_s, int32_t(2026) } }));
    ASSERT_TRUE(load(*report));
    // The runtime forgets current values with the saved data.
    fake.onCall(u"Report(orders.rpt).discardSavedData"_s, [&] {
        customer->state.currentValues.clear();
        year->state.currentValues.clear();
    });

    EXPECT_TRUE(report->ReloadKeepingParameters(false));
    EXPECT_EQ(customer->state.currentValues, (std::vector<core::Variant> { u"ACME"_s }));
    EXPECT_EQ(year->state.currentValues, (std::vector<core::Variant> { int32_t(2026) }));

    EXPECT_TRUE(report->ReloadKeepingParameters(true));
    EXPECT_TRUE(customer->state.currentValues.empty());
    EXPECT_FALSE(report->ReloadKeepingParameters(false)) << "nothing left to keep";
}

} // namespace
