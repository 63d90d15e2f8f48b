#include "platform/currentprinter.h"
#include "platform/printers.h"
#include "reports/moxstatus115.h"
#include "runtime/viewercontrolfactory.h"
#include "runtime/viewernotifications.h"
#include "viewer/moxviewer115.h"
#include "viewerfixture.h"

#include <QTimer>

using namespace Qt::StringLiterals;
using fakeruntime::ScriptedViewerControl;
using reporttest::runtimeError;
using viewer::MoxViewer115;

namespace {

constexpr int32_t Cancelled = static_cast<int32_t>(0x80047689);
constexpr int32_t ServerError = static_cast<int32_t>(0x80047E52);
constexpr int32_t ServerErrorRewritten = static_cast<int32_t>(0x80047E53);
constexpr int32_t TableConnectionFailed = static_cast<int32_t>(0x80047E44);
constexpr int32_t RuntimeFailure = static_cast<int32_t>(0x80040309);

class ViewerControl : public viewertest::ViewerTest {
protected:
    void SetUp() override
    {
        ViewerTest::SetUp();
        view = MoxViewer115::create();
        control = ScriptedViewerControl::last();
        recordViewerEvents(*view, [this](const QString& name, std::span<core::Variant> args) {
            if (answer)
                answer(name, args);
        });
    }

    runtime::ViewerNotifications& notify() { return *control->notifications(); }

    /// The arguments of every print-out the runtime was asked for.
    QStringList printOuts() const
    {
        QStringList result;
        for (const auto& call : fake.log()) {
            if (call.method == u"printOut"_s)
                result << call.arguments.join(u',');
        }
        return result;
    }

    /// The only OnReportSourceError raised: errorMsg, errorCode, UseDefault.
    std::tuple<QString, int32_t, bool> onlySourceError() const
    {
        std::vector<Event> errors;
        for (const Event& event : raised) {
            if (event.name == u"OnReportSourceError"_s)
                errors.push_back(event);
        }
        EXPECT_EQ(errors.size(), 1u);
        if (errors.size() != 1)
            return {};
        EXPECT_EQ(errors[0].dispid, MoxViewer115::OnReportSourceErrorEvent);
        return { errors[0].args[0].toText(), errors[0].args[1].toLong(),
            errors[0].args[2].toBoolean() };
    }

    std::shared_ptr<MoxViewer115> view;
    ScriptedViewerControl* control = nullptr;
    std::function<void(const QString&, std::span<core::Variant>)> answer;
};

TEST_F(ViewerControl, TheRuntimeViewerIsTheOnlyChildAndFillsTheControl)
{
    ASSERT_NE(control, nullptr);
    EXPECT_EQ(control->widget()->parentWidget(), view.get());
    EXPECT_EQ(control->widget()->objectName(), u"CRView"_s);
    view->show();
    view->resize(300, 200);
    EXPECT_EQ(control->widget()->geometry(), QRect(0, 0, 300, 200));
}

TEST_F(ViewerControl, ShowReportHandsTheLoadedReportToTheViewer)
{
    auto report = loadableReport();
    view->Report(report);
    int16_t copies = 3;
    EXPECT_FALSE(view->ShowReport(copies));
    EXPECT_EQ(control->calls,
        (QStringList { u"setReportSource(report)"_s, u"setZoom(100)"_s, u"viewReport()"_s }));
    EXPECT_EQ(control->source, report->GetReport());
    EXPECT_EQ(view->Copies(), 3);
    EXPECT_TRUE(raised.empty());
}

TEST_F(ViewerControl, ShowReportWithoutReportDoesNothing)
{
    EXPECT_FALSE(view->ShowReport());
    EXPECT_TRUE(control->calls.isEmpty());
    EXPECT_TRUE(raised.empty());
}

TEST_F(ViewerControl, CancelledParametersReachTheHostAsTheOpenFailure)
{
    auto file = addOrdersReport();
    addParameter(*file, reporttest::Param(u"Year"_s).prompt(u"Year?"_s).type(7));
    dialog.answer = [](dialogs::InputBoxParams&) { return false; };
    auto report = open();
    view->Report(report);
    view->ShowReport();

    EXPECT_EQ(dialog.shown, 1);
    EXPECT_EQ(control->source, nullptr);
    EXPECT_FALSE(control->calls.contains(u"viewReport()"_s));
    EXPECT_EQ(onlySourceError(), std::make_tuple(QString(), Cancelled, false));
    EXPECT_FALSE(report->UnloadRequest());
}

// Failures of the load leave UnloadRequest set: the host hears of it once, as a connection
// failure when the error says so and as a runtime failure otherwise.
TEST_F(ViewerControl, FailedLoadsReachTheHostOnce)
{
    struct Row {
        const char* name;
        bool reportExists;
        int32_t thrown; // by the host's QueryParameters handler; 0 for none
        int32_t expected;
    };
    const std::vector<Row> rows {
        { "missing report file", false, 0, RuntimeFailure },
        { "host handler fails with a lost connection", true, TableConnectionFailed, ServerError },
        { "host handler fails with a server error", true, ServerError, ServerError },
        { "host handler fails otherwise", true, 5, RuntimeFailure },
    };
    for (size_t i = 0; i < rows.size(); ++i) {
        SCOPED_TRACE(rows[i].name);
        raised.clear();
        const QString path = u"file%1.rpt"_s.arg(i);
        if (rows[i].reportExists) {
            auto file = addOrdersReport(path);
            addParameter(*file, reporttest::Param(u"P"_s).prompt(u"LUD#P"_s).type(12));
        }
        auto report = collection->Item(path);
        if (rows[i].thrown != 0) {
            report->MoxEvents()->connect(
                [number = rows[i].thrown](int32_t, const QString&, std::span<core::Variant>) {
                    throw runtimeError(number);
                });
        }
        view->Report(report);
        view->ShowReport();
        EXPECT_EQ(std::get<1>(onlySourceError()), rows[i].expected);
        EXPECT_FALSE(report->UnloadRequest());
        EXPECT_EQ(control->source, nullptr);
    }
}

TEST_F(ViewerControl, AViewerThatCannotShowTheReportRaisesNothing)
{
    // The load went well: the viewer reports its own failures as report-source errors.
    control->failOn(u"viewReport"_s, runtimeError(RuntimeFailure));
    view->Report(loadableReport());
    EXPECT_NO_THROW(view->ShowReport());
    EXPECT_TRUE(raised.empty());
}

TEST_F(ViewerControl, ReportSourceErrorsAreCorrected)
{
    struct Row {
        const char* name;
        QString message;
        int32_t code;
        bool useDefault;
        bool logonFailedBefore;
        int32_t expectedCode;
        bool expectedUseDefault;
    };
    const std::vector<Row> rows {
        { "server error without provider code", u"Failed to read"_s, ServerError, true, false,
            ServerErrorRewritten, true },
        { "server error with provider code", u"x 0X80004005 y"_s, ServerError, true, false,
            ServerError, false },
        { "cancelled open", u""_s, Cancelled, true, false, Cancelled, false },
        { "listed code 0x80043AE2", u""_s, static_cast<int32_t>(0x80043AE2), true, false,
            static_cast<int32_t>(0x80043AE2), false },
        { "listed code 0x80047D51", u""_s, static_cast<int32_t>(0x80047D51), true, false,
            static_cast<int32_t>(0x80047D51), false },
        { "other code keeps the viewer's message", u""_s, RuntimeFailure, true, false,
            RuntimeFailure, true },
        { "after a failed logon the connection failure is retryable", u""_s, TableConnectionFailed,
            true, true, ServerError, false },
        { "after a failed logon any error is quiet", u""_s, RuntimeFailure, true, true,
            RuntimeFailure, false },
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(row.name);
        raised.clear();
        if (row.logonFailedBefore)
            notify().databaseLogonFailed(u"srv"_s, u"Shop"_s);
        QString message = row.message;
        int32_t code = row.code;
        bool useDefault = row.useDefault;
        notify().reportSourceError(message, code, useDefault);
        EXPECT_EQ(onlySourceError(),
            std::make_tuple(row.message, row.expectedCode, row.expectedUseDefault));
        EXPECT_EQ(code, row.expectedCode);
        EXPECT_EQ(useDefault, row.expectedUseDefault);
    }
    // The mark is used up by one error.
    notify().databaseLogonFailed(u"srv"_s, u"Shop"_s);
    QString message;
    int32_t code = TableConnectionFailed;
    bool useDefault = true;
    notify().reportSourceError(message, code, useDefault);
    code = TableConnectionFailed;
    useDefault = true;
    notify().reportSourceError(message, code, useDefault);
    EXPECT_EQ(code, TableConnectionFailed);
    EXPECT_TRUE(useDefault);
}

TEST_F(ViewerControl, HostAnswersReachTheViewer)
{
    answer = [](const QString& name, std::span<core::Variant> args) {
        if (name == u"KeyDown"_s) {
            args[0] = int16_t(0);
            args[1] = int16_t(2);
        } else if (name == u"CRViewClicked"_s) {
            args[3] = false;
        } else if (name == u"OnReportSourceError"_s) {
            args[2] = true;
        } else {
            for (core::Variant& arg : args) {
                if (arg.type() == core::VariantType::Boolean)
                    arg = false;
            }
        }
    };
    bool useDefault = true;
    notify().printButtonClicked(useDefault);
    EXPECT_FALSE(useDefault);
    for (auto raiseIt : std::vector<void (runtime::ViewerNotifications::*)(bool&)> {
             &runtime::ViewerNotifications::firstPageButtonClicked,
             &runtime::ViewerNotifications::nextPageButtonClicked,
             &runtime::ViewerNotifications::prevPageButtonClicked }) {
        useDefault = true;
        (notify().*raiseIt)(useDefault);
        EXPECT_FALSE(useDefault);
    }
    QString text = u"Tallinn"_s;
    useDefault = true;
    notify().searchButtonClicked(text, useDefault);
    EXPECT_FALSE(useDefault);
    int16_t page = 4;
    useDefault = true;
    notify().goToPageNClicked(useDefault, page);
    EXPECT_FALSE(useDefault);
    int16_t key = 65;
    int16_t shift = 0;
    notify().keyDown(key, shift);
    EXPECT_EQ(key, 0);
    EXPECT_EQ(shift, 2);
    core::Variant info;
    useDefault = true;
    notify().clicked(5, 6, info, useDefault);
    EXPECT_FALSE(useDefault);
    QString message;
    int32_t code = RuntimeFailure;
    useDefault = false;
    notify().reportSourceError(message, code, useDefault);
    EXPECT_TRUE(useDefault);

    // Names and dispatch ids in declaration order, with the viewer's arguments.
    QStringList names;
    for (const Event& event : raised)
        names << u"%1 %2"_s.arg(event.dispid).arg(event.name);
    EXPECT_EQ(names,
        (QStringList { u"1 PrintButtonClicked"_s, u"8 FirstPageButtonClicked"_s,
            u"9 NextPageButtonClicked"_s, u"10 PrevPageButtonClicked"_s, u"4 SearchButtonClicked"_s,
            u"7 GoToPageNClicked"_s, u"12 KeyDown"_s, u"11 CRViewClicked"_s,
            u"17 OnReportSourceError"_s }));
    EXPECT_EQ(raised[4].args[0].toText(), u"Tallinn"_s);
    EXPECT_EQ(raised[5].args[1].toLong(), 4);
}

TEST_F(ViewerControl, NotificationsWithoutAnswerAreRaisedAsTheyCame)
{
    notify().downloadStarted(1);
    notify().downloadFinished(1);
    notify().focusChanged(true);
    notify().gotFocus();
    notify().lostFocus();
    // Declared for hosts, but never raised.
    notify().viewChanged(1, 2);
    notify().resized();
    QStringList names;
    for (const Event& event : raised)
        names << u"%1 %2"_s.arg(event.dispid).arg(event.name);
    EXPECT_EQ(names,
        (QStringList { u"2 DownloadStarted"_s, u"5 DownloadFinished"_s, u"13 CRViewFocusChanged"_s,
            u"14 CRViewGotFocus"_s, u"15 CRViewLostFocus"_s }));
}

TEST_F(ViewerControl, AFailingHostHandlerStopsAtTheControl)
{
    answer = [](const QString&, std::span<core::Variant>) { throw runtimeError(5); };
    bool useDefault = true;
    EXPECT_NO_THROW(notify().printButtonClicked(useDefault));
    EXPECT_TRUE(useDefault);
}

TEST_F(ViewerControl, DrillDownViewsPrintThroughTheReport)
{
    platform::CurrentPrinter::instance().select(platform::Printers::virtualPdfPrinter());
    auto file = addOrdersReport();
    auto report = open();
    view->Report(report);
    control->viewIndex = 2;
    bool useDefault = false;
    notify().printButtonClicked(useDefault);
    // The report chose the printer and left the printing of the view to the control.
    EXPECT_TRUE(useDefault);
    EXPECT_TRUE(raised.empty());
    EXPECT_FALSE(callsOf(u"Application.openReport"_s).isEmpty());
    EXPECT_TRUE(printOuts().isEmpty());
    EXPECT_TRUE(control->calls.isEmpty());

    // On the main view the host decides.
    fake.clearLog();
    control->viewIndex = 1;
    useDefault = true;
    notify().printButtonClicked(useDefault);
    EXPECT_EQ(raised.size(), 1u);
    EXPECT_TRUE(callsOf(u"Application.openReport"_s).isEmpty());
}

TEST_F(ViewerControl, AFailedDrillDownPrintReachesTheHost)
{
    control->viewIndex = 3;
    bool useDefault = false;
    notify().printButtonClicked(useDefault);
    EXPECT_TRUE(useDefault);
    EXPECT_EQ(std::get<1>(onlySourceError()), 91);
}

// The wait for the last page ends on any layout state but Running, whatever the busy flag
// says, and when the control goes away meanwhile.
TEST_F(ViewerControl, TheLastPageWaitIsBounded)
{
    struct Row {
        const char* name;
        int runningChecks;
        runtime::ViewerControl::LayoutState after;
        bool busy;
    };
    const std::vector<Row> rows {
        { "laid out already", 0, runtime::ViewerControl::LayoutState::Complete, false },
        { "busy forever, layout complete", 0, runtime::ViewerControl::LayoutState::Complete, true },
        { "layout fails after a while", 3, runtime::ViewerControl::LayoutState::Failed, true },
        { "layout completes after a while", 4, runtime::ViewerControl::LayoutState::Complete,
            false },
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(row.name);
        raised.clear();
        control->calls.clear();
        control->layoutChecks = 0;
        control->runningChecks = row.runningChecks;
        control->layoutAfter = row.after;
        control->busy = row.busy;
        bool useDefault = false;
        notify().lastPageButtonClicked(useDefault);
        EXPECT_TRUE(useDefault);
        EXPECT_EQ(control->calls, QStringList { u"showLastPage()"_s });
        EXPECT_EQ(control->layoutChecks, row.runningChecks + 1);
        ASSERT_EQ(raised.size(), 1u);
        EXPECT_EQ(raised[0].dispid, MoxViewer115::LastPageButtonClickedEvent);
    }
}

TEST_F(ViewerControl, TheLastPageWaitEndsWhenTheHostLetsGoOfTheControl)
{
    control->runningChecks = 1000000;
    auto* scripted = control;
    std::weak_ptr<MoxViewer115> weak = view;
    scripted->onLayoutCheck = [this, scripted] {
        if (scripted->layoutChecks == 3)
            view.reset();
    };
    bool useDefault = false;
    scripted->notifications()->lastPageButtonClicked(useDefault);
    QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
    EXPECT_TRUE(weak.expired());
}

TEST_F(ViewerControl, RefreshRereadsParametersAndLaysOutAgain)
{
    auto file = addOrdersReport();
    auto report = open();
    view->Report(report);
    int16_t copies = 1;
    view->ShowReport(copies);
    control->calls.clear();

    struct Row {
        const char* name;
        reports::enuPrintProgress progress;
        bool failPrompting;
        QStringList expected;
    };
    const std::vector<Row> rows {
        { "not printing", reports::eppPrintingCompleted, false, { u"refreshView(false)"_s } },
        { "printing in progress", reports::eppPrintingInProgress, false, {} },
        { "prompting switch fails", reports::eppPrintingCompleted, true,
            { u"refreshView(false)"_s } },
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(row.name);
        control->calls.clear();
        fake.clearLog();
        file->state.printingStatus.progress = row.progress;
        if (row.failPrompting)
            fake.failOn(
                u"Report(orders.rpt).setEnableParameterPrompting"_s, runtimeError(RuntimeFailure));
        bool useDefault = true;
        EXPECT_NO_THROW(notify().refreshButtonClicked(useDefault));
        EXPECT_FALSE(useDefault);
        EXPECT_EQ(control->calls, row.expected);
        int promptingOff = 0;
        for (const auto& call : fake.log())
            promptingOff += call.method == u"setEnableParameterPrompting"_s
                && call.arguments == QStringList { u"False"_s };
        EXPECT_EQ(promptingOff, 1);
    }
}

TEST_F(ViewerControl, RefreshWithoutReportLaysOutAgain)
{
    bool useDefault = true;
    notify().refreshButtonClicked(useDefault);
    EXPECT_FALSE(useDefault);
    EXPECT_EQ(control->calls, QStringList { u"refreshView(false)"_s });
}

TEST_F(ViewerControl, ExportingAndIsBusyAgree)
{
    for (bool busy : { false, true }) {
        control->busy = busy;
        EXPECT_EQ(view->IsBusy(), busy);
        EXPECT_EQ(view->Exporting(), view->IsBusy());
    }
}

TEST(ViewerControlFactory, WithoutRuntimeViewerTheControlCannotBeMade)
{
    auto previous = runtime::ViewerControlFactory::install({});
    try {
        MoxViewer115::create();
        ADD_FAILURE() << "made a control without a viewer";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), 429);
    }
    runtime::ViewerControlFactory::install(std::move(previous));
}

} // namespace
