// SaveAsPDF, SaveAsXLS and SaveAsHTML over the fake runtime: the order of the steps, the
// scratch file, the no-data and ValidMail rules, the replacement of the target and every
// error mapping of the failure handler.

#include "exportfixture.h"

#include <QFileInfo>

namespace {

using namespace reporttest;

constexpr int32_t ServerError = static_cast<int32_t>(0x80047E52);
constexpr int32_t GuardedCrash = static_cast<int32_t>(0x8004029A);
constexpr int32_t InvalidProcedureCall = 5;

class ReportExport : public ExportTest {
protected:
    /// The calls on the export options and the export itself, in order.
    QStringList exportCalls() const
    {
        QStringList result;
        for (const auto& call : fake.log()) {
            if (!call.isQuery
                && (call.kind == u"ExportOptions" || call.method == u"exportReport"
                    || call.method == u"setDisplayProgressDialog" || call.method == u"readRecords"
                    || call.method == u"setPaperSize"))
                result << call.text();
        }
        return result;
    }
};

TEST_F(ReportExport, PdfRunsItsStepsInOrderAndReplacesTheTarget)
{
    report->ValidMail(true);
    report->DefaultPaperSize(9);
    const QDateTime before = QDateTime::currentDateTime();

    ASSERT_TRUE(saveAsPdf(target(u"orders.pdf"_s))) << fake.dump().toStdString();

    const QStringList calls = exportCalls();
    ASSERT_EQ(calls.size(), 11) << fake.dump().toStdString();
    EXPECT_EQ(calls.mid(0, 4),
        (QStringList { u"Report(orders.rpt).readRecords()"_s,
            u"ExportOptions(orders.rpt).reset()"_s,
            u"ExportOptions(orders.rpt).setFormatType(31)"_s,
            u"ExportOptions(orders.rpt).setDestinationType(1)"_s }));
    EXPECT_TRUE(calls[4].startsWith(
        u"ExportOptions(orders.rpt).setDiskFileName(\""_s + tempFolder() + u"LUDMoxMassMailTemp"_s))
        << calls[4].toStdString();
    EXPECT_EQ(calls.mid(5, 3),
        (QStringList { u"Report(orders.rpt).setPaperSize(9)"_s,
            u"Report(orders.rpt).setDisplayProgressDialog(False)"_s,
            u"Report(orders.rpt).exportReport(False)"_s }));
    // The second export goes to a hidden folder beside the target, not to the target itself.
    EXPECT_TRUE(calls[8].contains(target(u".orders.pdf.ludmox-"_s))) << calls[8].toStdString();
    EXPECT_EQ(calls.mid(9),
        (QStringList { u"Report(orders.rpt).exportReport(False)"_s,
            u"Report(orders.rpt).setDisplayProgressDialog(True)"_s }));
    EXPECT_TRUE(file->state.displayProgressDialog) << "the display option is put back";

    EXPECT_EQ(outEntries(), QStringList { u"orders.pdf"_s }) << "no staging folder is left";
    EXPECT_TRUE(tempEntries().isEmpty()) << "the scratch file is removed";
    EXPECT_FALSE(report->SaveAsPDFError());
    EXPECT_FALSE(report->UnloadRequest());
    EXPECT_TRUE(isScratchName(
        callsOf(u"ExportOptions(orders.rpt).setDiskFileName"_s).first().section(u'"', 1, 1),
        tempFolder(), u"LUDMoxMassMailTemp"_s, u".pdf"_s, before));
}

TEST_F(ReportExport, EachFormatSetsItsOwnOptionsAndScratchName)
{
    struct Case {
        const char* name;
        std::function<bool()> run;
        QStringList options;
        QString base;
        QString extension;
    };
    const QString html = target(u"orders.html"_s);
    const Case cases[] = {
        { "excel: area type 4 and five switches in the fixed order",
            [&] { return saveAsXls(target(u"orders.xlsx"_s)); },
            { u"reset()"_s, u"setFormatType(38)"_s, u"setExcelAreaType(4)"_s,
                u"setExcelConstantColumnWidth(True)"_s, u"setExcelTabHasColumnHeadings(True)"_s,
                u"setExcelUseWorksheetFunctions(False)"_s, u"setExcelPageBreaks(True)"_s,
                u"setExcelExportAllPages(True)"_s, u"setDestinationType(1)"_s },
            u"LUDMoxExportXLSTemp"_s, u".xls"_s },
        // HTML sets no destination and keeps the Excel scratch name and extension.
        { "html: the caller's name and page switches, no destination",
            [&] { return saveAsHtml(html, false, false, false, true); },
            { u"reset()"_s, u"setFormatType(32)"_s, u"setHtmlFileName(\""_s + html + u"\")"_s,
                u"setHtmlSeparatePages(False)"_s, u"setHtmlNavigator(True)"_s },
            u"LUDMoxExportXLSTemp"_s, u".xls"_s },
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        // A fresh report object: the scratch name is chosen once per object.
        report->CloseReport();
        collection->Remove(u"orders.rpt"_s);
        report = open();
        fake.clearLog();
        const QDateTime before = QDateTime::currentDateTime();
        ASSERT_TRUE(c.run()) << fake.dump().toStdString();
        QStringList options = callsOf(u"ExportOptions(orders.rpt)."_s);
        for (QString& call : options)
            call.remove(u"ExportOptions(orders.rpt)."_s);
        ASSERT_GE(options.size(), c.options.size() + 1);
        EXPECT_EQ(options.mid(0, c.options.size()), c.options);
        EXPECT_TRUE(isScratchName(options[c.options.size()].section(u'"', 1, 1), tempFolder(),
            c.base, c.extension, before))
            << options[c.options.size()].toStdString();
    }
    EXPECT_EQ(outEntries(), (QStringList { u"orders.html"_s, u"orders.xlsx"_s }));
}

TEST_F(ReportExport, TheScratchFileIsRememberedAndReused)
{
    // A bare name with TempFileOnly lands in the temporary folder and becomes the scratch
    // file of the object's later exports, whatever their format.
    ASSERT_TRUE(saveAsXls(u"report.xls"_s, true));
    EXPECT_EQ(tempEntries(), QStringList { u"report.xls"_s });
    EXPECT_TRUE(outEntries().isEmpty());
    EXPECT_EQ(callsOf(u"Report(orders.rpt).exportReport"_s).size(), 1) << "no second export";

    ASSERT_TRUE(saveAsHtml(target(u"orders.html"_s)));
    EXPECT_EQ(callsOf(u"ExportOptions(orders.rpt).setDiskFileName"_s).at(1),
        u"ExportOptions(orders.rpt).setDiskFileName(\""_s + tempFolder() + u"report.xls\")"_s);
    EXPECT_TRUE(tempEntries().isEmpty()) << "the reused scratch file is deleted";

    // A path with a folder is used as it is.
    const QString kept = target(u"kept.pdf"_s);
    ASSERT_TRUE(saveAsPdf(kept, false, true));
    EXPECT_TRUE(QFileInfo::exists(kept));
    EXPECT_EQ(file->fakeExportOptions()->state.diskFileName, kept);
}

TEST_F(ReportExport, AReportWithoutRecordsWritesNothingUnlessForced)
{
    struct Case {
        const char* name;
        bool ignoreNoDataCheck;
        bool forceSave;
        bool written;
    };
    const Case cases[] = {
        { "no records", false, false, false },
        { "no records, forced", false, true, true },
        { "no records, check ignored", true, false, true },
    };
    completed(0);
    file->state.selectsNoRecords = true;
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        const QString path = target(u"empty.xlsx"_s);
        QFile::remove(path);
        report->IgnoreNoDataCheck(c.ignoreNoDataCheck);
        EXPECT_EQ(saveAsXls(path, false, c.forceSave), c.written);
        EXPECT_EQ(QFileInfo::exists(path), c.written);
        EXPECT_EQ(outEntries().size(), c.written ? 1 : 0) << "nothing staged is left";
        EXPECT_TRUE(tempEntries().isEmpty());
        EXPECT_FALSE(report->SaveAsXLSError());
        EXPECT_TRUE(file->state.displayProgressDialog);
    }
}

TEST_F(ReportExport, APdfIsWrittenOnlyForAValidMailOrWhenForced)
{
    struct Case {
        const char* name;
        bool validMail;
        bool forceSave;
        bool written;
    };
    const Case cases[] = {
        { "neither", false, false, false },
        { "valid mail", true, false, true },
        { "forced", false, true, true },
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        const QString path = target(u"orders.pdf"_s);
        QFile::remove(path);
        report->ValidMail(c.validMail);
        EXPECT_TRUE(saveAsPdf(path, false, false, c.forceSave));
        EXPECT_EQ(QFileInfo::exists(path), c.written);
        EXPECT_TRUE(tempEntries().isEmpty());
    }
}

TEST_F(ReportExport, AReadOnlyTargetIsReplacedOnlyByACompleteExport)
{
    const QString path = target(u"orders.xlsx"_s);
    write(path, "old workbook");
    QFile::setPermissions(path, QFileDevice::ReadOwner);

    // The second export fails: the old file stays as it was, nothing staged is left.
    fake.failOn(u"Report.exportReport"_s, runtimeError(RuntimeFailure, u"Disk full"_s), 2);
    EXPECT_THROW(saveAsXls(path), core::ComError);
    EXPECT_EQ(contents(path), QByteArray("old workbook"));
    EXPECT_EQ(outEntries(), QStringList { u"orders.xlsx"_s });
    EXPECT_TRUE(tempEntries().isEmpty());
    EXPECT_TRUE(report->SaveAsXLSError());

    // An export that writes no file must not replace the target with nothing.
    file->state.writeOutputFiles = false;
    EXPECT_THROW(saveAsXls(path), core::ComError);
    EXPECT_EQ(contents(path), QByteArray("old workbook"));
    EXPECT_EQ(outEntries(), QStringList { u"orders.xlsx"_s });

    file->state.writeOutputFiles = true;
    ASSERT_TRUE(saveAsXls(path));
    EXPECT_TRUE(contents(path).startsWith("fake runtime output"));
    EXPECT_FALSE(report->SaveAsXLSError());
}

TEST_F(ReportExport, ATargetInAFolderThatCannotBeWrittenFailsWithTheFileLines)
{
    const QString path = target(u"missing/orders.xlsx"_s);
    try {
        saveAsXls(path);
        FAIL() << "no error";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), 75);
        EXPECT_TRUE(error.description().endsWith(u"\r\nFileName:"_s + path))
            << error.description().toStdString();
    }
    EXPECT_TRUE(tempEntries().isEmpty());
}

TEST_F(ReportExport, AnUnloadRequestDuringTheReadExportsNothing)
{
    fake.onCall(u"Report.readRecords"_s, [this] { report->UnloadRequest(true); });
    report->ValidMail(true);
    EXPECT_TRUE(saveAsPdf(target(u"orders.pdf"_s)));
    EXPECT_FALSE(report->UnloadRequest());
    EXPECT_TRUE(callsOf(u"Report(orders.rpt).exportReport"_s).isEmpty());
    EXPECT_TRUE(outEntries().isEmpty());
}

TEST_F(ReportExport, AFirstSaveDiscardsTheDataWithoutKeepingParameterValues)
{
    addParameter(*file, Param(u"Customer"_s));
    report->SetParams(dictionary({ { u"Customer"_s, u"ACME"_s } }));
    ASSERT_TRUE(saveAsPdf(target(u"a.pdf"_s)));

    // A later export keeps the values across the reload, a first save does not.
    // The host's value is given on every export; the kept value is added back before it
    // only when the values are kept.
    fake.clearLog();
    ASSERT_TRUE(saveAsPdf(target(u"b.pdf"_s)));
    EXPECT_EQ(callsOf(u"Param(Customer).addCurrentValue"_s).size(), 2);
    fake.clearLog();
    ASSERT_TRUE(saveAsPdf(target(u"c.pdf"_s), true));
    EXPECT_EQ(callsOf(u"Param(Customer).addCurrentValue"_s).size(), 1);
    EXPECT_EQ(callsOf(u"Report(orders.rpt).discardSavedData"_s).size(), 1);
}

TEST_F(ReportExport, FailuresWhileReadingRecordsAreMappedPerFormat)
{
    struct Case {
        const char* name;
        bool pdf;
        int32_t injected;
        QString description;
        int32_t raised;
        QString raisedDescription; // empty: the generic error's text
    };
    const QString providerText = u"Provider error 0X80004005: login failed"_s;
    const Case cases[] = {
        { "pdf: server error without the provider code becomes 0x80047E53, then 5", true,
            ServerError, u"Server gone"_s, InvalidProcedureCall, QString() },
        { "pdf: server error with the provider code passes", true, ServerError, providerText,
            ServerError, providerText },
        { "pdf: table connection failure passes", true, TableConnectionFailed, u"No table"_s,
            TableConnectionFailed, u"No table"_s },
        { "pdf: any other number becomes 5", true, RuntimeFailure, u"Bad"_s, InvalidProcedureCall,
            QString() },
        { "excel: even a table connection failure becomes 5", false, TableConnectionFailed,
            u"No table"_s, InvalidProcedureCall, QString() },
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        fake.failOn(u"Report.readRecords"_s, runtimeError(c.injected, c.description));
        try {
            c.pdf ? saveAsPdf(target(u"x.pdf"_s)) : saveAsXls(target(u"x.xlsx"_s));
            ADD_FAILURE() << "no error";
        } catch (const core::ComError& error) {
            EXPECT_EQ(error.number(), c.raised);
            if (!c.raisedDescription.isEmpty()) {
                EXPECT_EQ(error.description(), c.raisedDescription) << "no file lines";
                EXPECT_EQ(error.source(), u"Crystal Reports"_s);
            }
        }
        EXPECT_TRUE(c.pdf ? report->SaveAsPDFError() : report->SaveAsXLSError());
        EXPECT_TRUE(outEntries().isEmpty());
    }
}

TEST_F(ReportExport, OtherFailuresCarryTheScratchAndTargetLines)
{
    struct Case {
        const char* name;
        QString failingCall;
        int32_t number;
        QString description;
    };
    const Case cases[] = {
        { "scratch export", u"Report.exportReport"_s, RuntimeFailure, u"Printer gone"_s },
        { "export options", u"ExportOptions.reset"_s, RuntimeFailure, u"No options"_s },
        { "display option", u"Report.displayProgressDialog"_s, TableConnectionFailed,
            u"No server"_s },
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        fake.failOn(c.failingCall, runtimeError(c.number, c.description));
        const QString path = target(u"orders.html"_s);
        try {
            saveAsHtml(path);
            ADD_FAILURE() << "no error";
        } catch (const core::ComError& error) {
            EXPECT_EQ(error.number(), c.number);
            EXPECT_EQ(error.source(), u"Crystal Reports"_s);
            EXPECT_TRUE(error.description().startsWith(c.description + u"\r\nTempFile:"_s))
                << error.description().toStdString();
            EXPECT_TRUE(error.description().endsWith(u"\r\nFileName:"_s + path));
        }
        EXPECT_TRUE(tempEntries().isEmpty()) << "the handler deletes the scratch file";
        EXPECT_TRUE(outEntries().isEmpty());
        report->CloseReport();
    }
}

TEST_F(ReportExport, ACancelledParameterDialogFailsWithUserCancelled)
{
    addParameter(*file, Param(u"Customer"_s));
    dialog.answer = [](dialogs::InputBoxParams&) { return false; };
    try {
        saveAsXls(target(u"orders.xlsx"_s));
        FAIL() << "no error";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), UserCancelled);
        EXPECT_TRUE(error.description().startsWith(u"User Cancelled\r\nTempFile:"_s))
            << error.description().toStdString();
    }
    EXPECT_TRUE(report->SaveAsXLSError());
    EXPECT_TRUE(report->UnloadRequest());
    EXPECT_TRUE(callsOf(u"Report(orders.rpt).exportReport"_s).isEmpty());
}

TEST_F(ReportExport, AReportNotReadThroughOleDbRaisesItsError)
{
    auto legacy = fake.addReport(u"legacy.rpt"_s);
    legacy->addTable(tableWithDriver(u"Orders"_s, u"Orders"_s, u"crdbxml.dll"_s));
    report = open(u"legacy.rpt"_s);
    try {
        saveAsPdf(target(u"legacy.pdf"_s));
        FAIL() << "no error";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), UserCancelled) << "0x80040099, as for a cancel";
        EXPECT_EQ(error.source(), u"LUD Crystal Engine"_s);
        EXPECT_TRUE(error.description().startsWith(
            u"Not an OLE DB report - please convert with Crystal Reports.\r\nTempFile:"_s));
    }
    EXPECT_TRUE(report->SaveAsPDFError());
}

TEST_F(ReportExport, AGuardedCrashPassesUnchangedAndSetsNoFlag)
{
    const core::ComError crash(GuardedCrash, u"LUDMoxViewer115"_s, u"Access violation"_s);
    fake.failOn(u"Report.exportReport"_s, crash);
    try {
        saveAsXls(target(u"orders.xlsx"_s));
        FAIL() << "no error";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), GuardedCrash);
        EXPECT_EQ(error.source(), crash.source());
        EXPECT_EQ(error.description(), crash.description());
    }
    EXPECT_FALSE(report->SaveAsXLSError());
    EXPECT_TRUE(tempEntries().isEmpty());
}

} // namespace
