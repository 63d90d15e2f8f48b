// PrintReport and PrinterSetup of the report object over the scriptable fake runtime: the
// printer decisions, the print-out arguments, the trace in order, the owner window of the
// print dialog and how errors reach the host.

#include "engine/ludpsetup.h"
#include "platform/currentprinter.h"
#include "platform/printers.h"
#include "platform/windowhandles.h"
#include "reportfixture.h"

#include <QApplication>
#include <QDir>
#include <QLoggingCategory>
#include <QTemporaryDir>
#include <QWidget>
#include <QWindow>

namespace {

using namespace reporttest;

constexpr int32_t ServerError = static_cast<int32_t>(0x80047E52);
constexpr int32_t ServerErrorRewritten = static_cast<int32_t>(0x80047E53);
constexpr int32_t GuardedCrash = static_cast<int32_t>(0x8004029A);

/// The report's trace texts, collected from the "ludmox.reports" debug messages.
class TraceCapture {
public:
    TraceCapture()
    {
        s_lines.clear();
        QLoggingCategory::setFilterRules(u"ludmox.reports.debug=true"_s);
        m_previous = qInstallMessageHandler(&TraceCapture::handle);
    }
    ~TraceCapture()
    {
        qInstallMessageHandler(m_previous);
        QLoggingCategory::setFilterRules(QString());
    }
    TraceCapture(const TraceCapture&) = delete;
    TraceCapture& operator=(const TraceCapture&) = delete;

    /// The PrintReport tags, without the printer names of the select-printer line.
    static QStringList printTags()
    {
        QStringList tags;
        for (const QString& line : s_lines) {
            if (line.startsWith(u"MoxReport.PrintReport_"_s))
                tags << line.section(u',', 0, 0);
        }
        return tags;
    }
    static const QStringList& lines() { return s_lines; }

private:
    static void handle(QtMsgType, const QMessageLogContext& context, const QString& message)
    {
        if (context.category && QLatin1StringView(context.category) == "ludmox.reports"_L1)
            s_lines << message;
    }
    static inline QStringList s_lines;
    QtMessageHandler m_previous = nullptr;
};

class ReportPrint : public ReportTest {
protected:
    void SetUp() override
    {
        ReportTest::SetUp();
        ASSERT_TRUE(m_folder.isValid());
        m_previousPrinters = qgetenv("LUDMOX_PDF_PRINTERS");
        qputenv("LUDMOX_PDF_PRINTERS", (u"Archive="_s + m_folder.filePath(u"archive"_s)).toUtf8());
        platform::CurrentPrinter::instance().select(platform::Printers::virtualPdfPrinter());
        m_devMode = engine::DevMode();
        engine::DevMode().dmPaperSize = 8;
        engine::DevMode().dmDefaultSource = 2;
        engine::DevMode().dmDuplex = 3;
    }
    void TearDown() override
    {
        engine::DevMode() = m_devMode;
        qputenv("LUDMOX_PDF_PRINTERS", m_previousPrinters);
        ReportTest::TearDown();
    }

    /// A report stored for another printer, landscape on Letter.
    std::shared_ptr<fakeruntime::FakeReport> addStoredReport(const QString& summary = QString())
    {
        auto file = addOrdersReport();
        file->state.summaryComments = summary;
        file->state.printerDriverName = u"winspool"_s;
        file->state.printerDeviceName = u"Office Laser"_s;
        file->state.printerPortName = u"LPT1:"_s;
        file->state.paperOrientation = 2;
        file->state.paperSize = 1;
        return file;
    }

    /// The calls that change the report's printer and paper, and the print-out, in order.
    QStringList printerCalls() const
    {
        static const QStringList methods { u"selectPrinter"_s, u"setPaperOrientation"_s,
            u"setPaperSize"_s, u"setPaperSource"_s, u"setPrinterDuplex"_s, u"printOut"_s };
        QStringList result;
        for (const auto& call : fake.log()) {
            if (!call.isQuery && methods.contains(call.method))
                result << call.method + u'(' + call.arguments.join(u',') + u')';
        }
        return result;
    }

public:
    QString archiveFolder() const { return QDir::cleanPath(m_folder.filePath(u"archive"_s)); }
    static QString pdfPrinter()
    {
        const auto pdf = platform::Printers::virtualPdfPrinter();
        return u"selectPrinter(\"%1\",\"%2\",\"%3\")"_s.arg(
            pdf.driverName(), pdf.deviceName(), pdf.port());
    }
    QString archivePrinter() const
    {
        return u"selectPrinter(\"ludmox-pdf\",\"Archive\",\"%1\")"_s.arg(archiveFolder());
    }

protected:
    QTemporaryDir m_folder;

private:
    QByteArray m_previousPrinters;
    engine::DevModeRecord m_devMode {};
};

TEST_F(ReportPrint, SilentPrintChoosesPrinterAndPaper)
{
    struct Case {
        const char* name;
        QString summary;
        QString defaultPrinter;
        int16_t defaultPaperSize;
        bool useDefaultPrinter;
        int16_t storedOrientation;
        int16_t storedPaperSize;
        std::function<QStringList(const ReportPrint&)> expected;
    };
    const Case cases[] = {
        { "the application's printer, the report's paper kept", {}, {}, 0, false, 2, 1,
            [](const ReportPrint&) {
                return QStringList { pdfPrinter(), u"setPaperOrientation(2)"_s,
                    u"setPaperSize(1)"_s, pdfPrinter(), u"setPaperSource(2)"_s,
                    u"setPrinterDuplex(3)"_s, u"printOut(False,1,True)"_s };
            } },
        { "the host's printer in any letter case with its paper", {}, u"ARCHIVE"_s, 9, true, 2, 1,
            [](const ReportPrint& t) {
                return QStringList { t.archivePrinter(), u"setPaperOrientation(2)"_s,
                    u"setPaperSize(9)"_s, u"setPaperSource(2)"_s, u"setPrinterDuplex(3)"_s,
                    u"printOut(False,1,True)"_s };
            } },
        { "a host's printer that is not installed keeps the report's", {}, u"Nowhere"_s, 9, true, 2,
            1,
            [](const ReportPrint&) {
                return QStringList { u"setPaperOrientation(2)"_s, u"setPaperSize(1)"_s,
                    u"setPaperSource(2)"_s, u"setPrinterDuplex(3)"_s, u"printOut(False,1,True)"_s };
            } },
        { "the keyword keeps the report's own printer and paper", u"Please UseReportPrinter."_s, {},
            0, false, 2, 1,
            [](const ReportPrint&) { return QStringList { u"printOut(False,1,True)"_s }; } },
        { "a host's printer overrides the keyword", u"usereportprinter"_s, u"Archive"_s, 0, false,
            2, 1,
            [](const ReportPrint&) {
                return QStringList { pdfPrinter(), u"setPaperOrientation(2)"_s,
                    u"setPaperSize(1)"_s, pdfPrinter(), u"setPaperSource(2)"_s,
                    u"setPrinterDuplex(3)"_s, u"printOut(False,1,True)"_s };
            } },
        { "the host's paper for the application's printer", {}, u"lud mox pdf"_s, 11, false, 2, 1,
            [](const ReportPrint&) {
                return QStringList { pdfPrinter(), u"setPaperOrientation(2)"_s,
                    u"setPaperSize(11)"_s, pdfPrinter(), u"setPaperSource(2)"_s,
                    u"setPrinterDuplex(3)"_s, u"printOut(False,1,True)"_s };
            } },
        { "a report without paper takes the shared settings' paper", {}, {}, 0, false, 0, 0,
            [](const ReportPrint&) {
                return QStringList { pdfPrinter(), pdfPrinter(), u"setPaperSize(8)"_s,
                    u"setPaperSource(2)"_s, u"setPrinterDuplex(3)"_s, u"printOut(False,1,True)"_s };
            } },
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        collection->Remove(u"orders.rpt"_s);
        fakeruntime::FakeRuntime local;
        engine::ReleaseApplication();
        auto file = local.addReport(u"orders.rpt"_s);
        file->addTable(u"Orders"_s, u"Shop.dbo.Orders"_s);
        file->state.summaryComments = c.summary;
        file->state.printerDeviceName = u"Office Laser"_s;
        file->state.paperOrientation = c.storedOrientation;
        file->state.paperSize = c.storedPaperSize;
        const auto report = open();
        report->DefaultPrinter(c.defaultPrinter);
        report->DefaultPaperSize(c.defaultPaperSize);

        EXPECT_TRUE(report->PrintReport(false, 1, true, 0, 0, c.useDefaultPrinter));

        QStringList made;
        for (const auto& call : local.log()) {
            static const QStringList methods { u"selectPrinter"_s, u"setPaperOrientation"_s,
                u"setPaperSize"_s, u"setPaperSource"_s, u"setPrinterDuplex"_s, u"printOut"_s };
            if (!call.isQuery && methods.contains(call.method))
                made << call.method + u'(' + call.arguments.join(u',') + u')';
        }
        EXPECT_EQ(made, c.expected(*this));
    }
}

TEST_F(ReportPrint, ARefusedPaperSizeDoesNotStopTheSilentPrint)
{
    auto file = addStoredReport();
    fake.failOn(u"Report.setPaperSize"_s, runtimeError(RuntimeFailure));
    const auto report = open();

    EXPECT_TRUE(report->PrintReport(false));
    EXPECT_EQ(callsOf(u"Report(orders.rpt).printOut"_s).size(), 1);
}

TEST_F(ReportPrint, ADialogsChoiceStaysForLaterSilentPrints)
{
    auto file = addStoredReport();
    const auto report = open();
    report->DefaultPrinter(u"Archive"_s);
    report->DefaultPaperSize(9);

    ASSERT_TRUE(report->PrintReport(true));
    EXPECT_EQ(printerCalls(),
        (QStringList { archivePrinter(), u"setPaperSource(2)"_s, u"setPrinterDuplex(3)"_s,
            u"printOut(True,1,True)"_s }));

    // What the user chose in the runtime's dialog.
    file->state.printerDeviceName = u"LUDMox-CUPS"_s;
    file->state.paperSize = 11;
    fake.clearLog();
    ASSERT_TRUE(report->PrintReport(false, 1, true, 0, 0, true));
    ASSERT_TRUE(report->PrintReport(false));
    EXPECT_EQ(
        printerCalls(), (QStringList { u"printOut(False,1,True)"_s, u"printOut(False,1,True)"_s }));

    // Closing the report does not forget the choice.
    report->CloseReport();
    fake.clearLog();
    ASSERT_TRUE(report->PrintReport(false));
    EXPECT_EQ(printerCalls(), QStringList { u"printOut(False,1,True)"_s });
}

TEST_F(ReportPrint, PrintOutArgumentsFollowTheRequest)
{
    struct Case {
        const char* name;
        int16_t copies;
        bool collate;
        int16_t startPage;
        int16_t stopPage;
        bool drillDown;
        QStringList expected;
    };
    const Case cases[] = {
        { "no copies print one", 0, true, 0, 0, false,
            { u"Report(orders.rpt).printOut(False,1,True)"_s } },
        { "negative copies print one", -3, false, 0, 0, false,
            { u"Report(orders.rpt).printOut(False,1,False)"_s } },
        { "a range with an open end prints everything", 2, true, 3, 0, false,
            { u"Report(orders.rpt).printOut(False,2,True)"_s } },
        { "a range without start prints everything", 2, true, 0, 4, false,
            { u"Report(orders.rpt).printOut(False,2,True)"_s } },
        { "a closed range is passed on", 3, false, 2, 4, false,
            { u"Report(orders.rpt).printOut(False,3,False,2,4)"_s } },
        { "a drill-down print only prepares", 2, true, 2, 4, true, {} },
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        collection->Remove(u"orders.rpt"_s);
        fakeruntime::FakeRuntime local;
        engine::ReleaseApplication();
        local.addReport(u"orders.rpt"_s)->addTable(u"Orders"_s, u"Shop.dbo.Orders"_s);
        const auto report = open();

        EXPECT_TRUE(report->PrintReport(
            false, c.copies, c.collate, c.startPage, c.stopPage, false, c.drillDown));
        EXPECT_EQ(local.calls(u"Report(orders.rpt).printOut"_s), c.expected);
        EXPECT_EQ(local.calls(u"Report(orders.rpt).readRecords"_s).size(), 1);
    }
}

TEST_F(ReportPrint, TracesEveryStepInOrder)
{
    addStoredReport();
    const auto report = open();
    {
        TraceCapture trace;
        ASSERT_TRUE(report->PrintReport(false, 1, true, 2, 3));
        EXPECT_EQ(TraceCapture::printTags(),
            (QStringList { u"MoxReport.PrintReport_BeforeSelectPrinter"_s,
                u"MoxReport.PrintReport_BeforeSetParameters"_s,
                u"MoxReport.PrintReport_BeforeSetSQLSelection"_s,
                u"MoxReport.PrintReport_BeforeReadRecords"_s,
                u"MoxReport.PrintReport_RecordsRead"_s, u"MoxReport.PrintReport_BeforePrintOut"_s,
                u"MoxReport.PrintReport_AfterPrintOut"_s, u"MoxReport.PrintReport_DoExit"_s }));
        const auto pdf = platform::Printers::virtualPdfPrinter();
        EXPECT_TRUE(TraceCapture::lines().contains(
            u"MoxReport.PrintReport_BeforeSelectPrinter,%1, %2,%3"_s.arg(
                pdf.driverName(), pdf.deviceName(), pdf.port())));
    }
    {
        TraceCapture trace;
        ASSERT_TRUE(report->PrintReport(true));
        EXPECT_EQ(TraceCapture::printTags(),
            (QStringList { u"MoxReport.PrintReport_BeforeSetParameters"_s,
                u"MoxReport.PrintReport_BeforeSetSQLSelection"_s,
                u"MoxReport.PrintReport_BeforeReadRecords"_s,
                u"MoxReport.PrintReport_RecordsRead"_s, u"MoxReport.PrintReport_BeforePrintOut00"_s,
                u"MoxReport.PrintReport_AfterPrintOut00"_s, u"MoxReport.PrintReport_DoExit"_s }));
    }
    {
        TraceCapture trace;
        fake.failOn(u"Report.readRecords"_s, runtimeError(RuntimeFailure));
        EXPECT_THROW(report->PrintReport(false), core::ComError);
        EXPECT_EQ(TraceCapture::printTags(),
            (QStringList { u"MoxReport.PrintReport_BeforeSetParameters"_s,
                u"MoxReport.PrintReport_BeforeSetSQLSelection"_s,
                u"MoxReport.PrintReport_BeforeReadRecords"_s, u"MoxReport.PrintReport_Hell"_s }));
    }
}

TEST_F(ReportPrint, LaterPrintsReadTheRecordsAgainUnlessPreviewed)
{
    auto file = addStoredReport();
    const auto report = open();

    ASSERT_TRUE(report->PrintReport(false));
    EXPECT_TRUE(callsOf(u"Report(orders.rpt).discardSavedData"_s).isEmpty())
        << "the first print uses the data read while loading";
    ASSERT_TRUE(report->PrintReport(false));
    EXPECT_EQ(callsOf(u"Report(orders.rpt).discardSavedData"_s).size(), 1);

    report->PreviewActive(true);
    ASSERT_TRUE(report->PrintReport(false));
    EXPECT_EQ(callsOf(u"Report(orders.rpt).discardSavedData"_s).size(), 1);
}

TEST_F(ReportPrint, ErrorsReachTheHostWithTheirNumbers)
{
    struct Case {
        const char* name;
        QString failingCall;
        int32_t number;
        QString description;
        int32_t expectedNumber;
    };
    const Case cases[] = {
        { "a server error without the provider's text", u"Report.printOut"_s, ServerError,
            u"Database Connector Error"_s, ServerErrorRewritten },
        { "a server error with the provider's text", u"Report.printOut"_s, ServerError,
            u"Error Code: 0X80004005 login failed"_s, ServerError },
        { "a table connection failure", u"Report.readRecords"_s, TableConnectionFailed,
            u"Failed to open the connection."_s, TableConnectionFailed },
        { "a guarded crash", u"Report.printOut"_s, GuardedCrash, u"Access violation"_s,
            GuardedCrash },
        { "a printer refusing its paper source", u"Report.setPaperSource"_s, RuntimeFailure,
            u"Bad source"_s, RuntimeFailure },
        { "a printer that cannot be selected", u"Report.selectPrinter"_s, RuntimeFailure,
            u"No printer"_s, RuntimeFailure },
        { "a refused duplex mode", u"Report.setPrinterDuplex"_s, RuntimeFailure, u"Bad duplex"_s,
            RuntimeFailure },
        { "the summary that cannot be read", u"Report.summaryComments"_s, RuntimeFailure,
            u"Unreadable"_s, RuntimeFailure },
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        collection->Remove(u"orders.rpt"_s);
        fakeruntime::FakeRuntime local;
        engine::ReleaseApplication();
        local.addReport(u"orders.rpt"_s)->addTable(u"Orders"_s, u"Shop.dbo.Orders"_s);
        local.failOn(c.failingCall, core::ComError(c.number, u"Crystal Reports"_s, c.description));
        const auto report = open();
        try {
            report->PrintReport(false);
            ADD_FAILURE() << "expected an error";
        } catch (const core::ComError& error) {
            EXPECT_EQ(error.number(), c.expectedNumber);
            EXPECT_EQ(error.source(), u"Crystal Reports"_s);
            EXPECT_EQ(error.description(), c.description);
        }
    }
}

TEST_F(ReportPrint, ReportsThatCannotLoad)
{
    auto legacy = fake.addReport(u"legacy.rpt"_s);
    legacy->addTable(tableWithDriver(u"Orders"_s, u"Orders"_s, u"crdbxml.dll"_s));
    const auto report = open(u"legacy.rpt"_s);
    try {
        report->PrintReport(false);
        FAIL() << "expected the not-OLE-DB error";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), UserCancelled);
        EXPECT_EQ(error.source(), u"LUD Crystal Engine"_s);
        EXPECT_EQ(
            error.description(), u"Not an OLE DB report - please convert with Crystal Reports."_s);
    }
    EXPECT_THROW(report->PrinterSetup(0), core::ComError);

    addOrdersReport();
    fake.failAlways(u"Table.setLocation"_s, runtimeError(RuntimeFailure));
    const auto unlocated = open();
    EXPECT_FALSE(unlocated->PrintReport(false));
    EXPECT_FALSE(unlocated->PrinterSetup(0));
    EXPECT_TRUE(unlocated->UnloadRequest());
    EXPECT_TRUE(callsOf(u"Report(orders.rpt).printOut"_s).isEmpty());
}

TEST_F(ReportPrint, ACancelledParameterDialogEndsThePrint)
{
    auto file = addStoredReport();
    addParameter(*file, Param(u"Customer"_s));
    dialog.answer = [](dialogs::InputBoxParams&) { return false; };
    const auto report = open();
    // The load asks first; the host is told, and the print asks again.
    EXPECT_THROW(report->PrintReport(false), core::ComError);
    try {
        bool noDialog = true;
        ASSERT_TRUE(report->LoadReport(false, noDialog));
        report->PrintReport(false);
        FAIL() << "expected User Cancelled";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), UserCancelled);
        EXPECT_EQ(error.description(), u"User Cancelled"_s);
    }
    EXPECT_TRUE(report->UnloadRequest());
    EXPECT_TRUE(callsOf(u"Report(orders.rpt).printOut"_s).isEmpty());
}

TEST_F(ReportPrint, AFailedSelectionPrintsNothingAndSucceeds)
{
    auto file = addStoredReport();
    file->state.sqlQuery = u"SELECT Orders.ID FROM Orders"_s;
    fake.failAlways(u"Report.setSqlQueryString"_s, runtimeError(RuntimeFailure));
    const auto report = open();
    report->SetSelection(u"Orders"_s, core::VariantArray::fromList({ int32_t(3) }));

    EXPECT_TRUE(report->PrintReport(false));
    EXPECT_TRUE(callsOf(u"Report(orders.rpt).printOut"_s).isEmpty());
    EXPECT_FALSE(report->UnloadRequest());
}

TEST_F(ReportPrint, TheDialogsOwnerWindowLivesOnlyWhileThePrintRuns)
{
    QWidget host;
    host.resize(200, 100);
    host.show();
    const int32_t hostHandle = platform::WindowHandles::handle(&host);
    moxEngine->SetDialogParentWindow(hostHandle);
    const auto ownerWindows = [] {
        QList<QWidget*> found;
        for (QWidget* widget : QApplication::topLevelWidgets()) {
            if (widget->objectName() == u"frmPlex"_s)
                found << widget;
        }
        return found;
    };

    struct Case {
        const char* name;
        bool fails;
    };
    for (const Case c : { Case { "a print that ends", false }, Case { "a failed print", true } }) {
        SCOPED_TRACE(c.name);
        collection->Remove(u"orders.rpt"_s);
        fakeruntime::FakeRuntime local;
        engine::ReleaseApplication();
        local.addReport(u"orders.rpt"_s)->addTable(u"Orders"_s, u"Shop.dbo.Orders"_s);
        bool ownedDuringPrint = false;
        local.onCall(u"Report.printOut"_s, [&] {
            const auto windows = ownerWindows();
            ownedDuringPrint = windows.size() == 1 && windows.front()->isVisible()
                && windows.front()->width() == 0 && windows.front()->windowHandle()
                && windows.front()->windowHandle()->transientParent() == host.windowHandle();
            if (c.fails)
                throw runtimeError(RuntimeFailure);
        });
        const auto report = open();
        events.clear();
        recordEvents(*report);

        if (c.fails)
            EXPECT_THROW(report->PrintReport(true), core::ComError);
        else
            EXPECT_TRUE(report->PrintReport(true));
        EXPECT_TRUE(ownedDuringPrint);
        EXPECT_TRUE(ownerWindows().isEmpty());
        const bool afterDialogs = std::any_of(events.begin(), events.end(),
            [](const RaisedEvent& e) { return e.name == u"AfterDialogs"_s; });
        EXPECT_EQ(afterDialogs, !c.fails);
    }
}

TEST_F(ReportPrint, PrinterSetupKeepsTheChoiceAndSwallowsRuntimeErrors)
{
    auto file = addStoredReport();
    const auto report = open();

    EXPECT_TRUE(report->PrinterSetup(4711));
    EXPECT_EQ(printerCalls(), (QStringList { pdfPrinter(), u"setPaperOrientation(2)"_s }));
    EXPECT_EQ(callsOf(u"Report(orders.rpt).printerSetup"_s),
        QStringList { u"Report(orders.rpt).printerSetup(4711)"_s });

    fake.clearLog();
    EXPECT_TRUE(report->PrinterSetup());
    EXPECT_TRUE(printerCalls().isEmpty()) << "a chosen printer is not replaced";
    ASSERT_TRUE(report->PrintReport(false));
    EXPECT_EQ(printerCalls(), QStringList { u"printOut(False,1,True)"_s });

    fake.failOn(u"Report.printerSetup"_s, runtimeError(RuntimeFailure));
    EXPECT_FALSE(report->PrinterSetup());

    // A report without its own orientation keeps the printer's.
    collection->Remove(u"orders.rpt"_s);
    file->state.paperOrientation = 0;
    fake.clearLog();
    EXPECT_TRUE(open()->PrinterSetup());
    EXPECT_EQ(printerCalls(), QStringList { pdfPrinter() });
}

} // namespace
