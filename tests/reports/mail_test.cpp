// SendReport over the fake runtime: the mail settings and their order, the ValidMail and
// no-data rules, the attachment name through a temporary copy of the report, and the
// failure paths.

#include "exportfixture.h"

#include <QFileInfo>

namespace {

using namespace reporttest;

constexpr int32_t GuardedCrash = static_cast<int32_t>(0x8004029A);

class ReportMail : public ExportTest {
protected:
    QString scratch() const { return tempFolder() + u"LUDMoxMassMailTemp.pdf"_s; }
    /// Whether the runtime was asked to send: the destination became 2.
    bool mailed() const
    {
        return callsOf(u"ExportOptions(orders.rpt).setDestinationType(2)"_s).size() == 1;
    }
};

TEST_F(ReportMail, AValidMailGivesTheSettingsInOrderAndSends)
{
    report->ValidMail(true);
    Mail mail;
    mail.attachmentType = 38;
    mail.cc = u"bob@example.com"_s;
    mail.bcc = u"carl@example.com"_s;
    ASSERT_TRUE(sendReport(mail)) << fake.dump().toStdString();

    EXPECT_EQ(callsOf(u"ExportOptions(orders.rpt)."_s),
        (QStringList { u"ExportOptions(orders.rpt).reset()"_s,
            u"ExportOptions(orders.rpt).setMailToList(\"ann@example.com\")"_s,
            u"ExportOptions(orders.rpt).setMailSubject(\"Orders\")"_s,
            u"ExportOptions(orders.rpt).setFormatType(38)"_s,
            u"ExportOptions(orders.rpt).setMailMessage(\"See the attachment.\")"_s,
            u"ExportOptions(orders.rpt).setMailCcList(\"bob@example.com\")"_s,
            u"ExportOptions(orders.rpt).setMailBccList(\"carl@example.com\")"_s,
            u"ExportOptions(orders.rpt).setDestinationType(1)"_s,
            // The scratch name is the PDF one whatever the attachment's format.
            u"ExportOptions(orders.rpt).setDiskFileName(\""_s + scratch() + u"\")"_s,
            u"ExportOptions(orders.rpt).setDestinationType(2)"_s }))
        << fake.dump().toStdString();
    EXPECT_EQ(callsOf(u"Report(orders.rpt).exportReport"_s).size(), 2);
    EXPECT_FALSE(report->SendMailError());
    EXPECT_TRUE(file->state.displayProgressDialog);
    EXPECT_TRUE(QFileInfo::exists(scratch())) << "the mail's scratch export stays";
}

TEST_F(ReportMail, NothingIsMailedWithoutValidMailOrRecords)
{
    struct Case {
        const char* name;
        bool validMail;
        int32_t records;
        bool sendMailError;
    };
    const Case cases[] = {
        { "ValidMail not given", false, 5, true },
        { "no records", true, 0, false },
        { "no records and no ValidMail", false, 0, false },
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        fake.clearLog();
        report->ValidMail(c.validMail);
        completed(c.records);
        EXPECT_FALSE(sendReport({}));
        EXPECT_EQ(report->SendMailError(), c.sendMailError);
        EXPECT_FALSE(mailed());
        EXPECT_EQ(callsOf(u"Report(orders.rpt).exportReport"_s).size(), 1) << "scratch only";
        EXPECT_TRUE(file->state.displayProgressDialog);
    }
}

TEST_F(ReportMail, AnAttachmentNameMailsFromATemporaryCopyAndPutsTheReportBack)
{
    const QString copyPath = tempFolder() + u"Invoice.rpt"_s;
    auto copy = fake.addReport(copyPath);
    copy->addTable(u"Orders"_s, u"Shop.dbo.Orders"_s);
    copy->state.printingStatus = file->state.printingStatus;
    addParameter(*file, Param(u"Customer"_s));
    report->SetParams(dictionary({ { u"Customer"_s, u"ACME"_s } }));
    report->ValidMail(true);
    Mail mail;
    mail.attachment = u"Invoice"_s;
    ASSERT_TRUE(sendReport(mail)) << fake.dump().toStdString();

    EXPECT_EQ(callsOf(u"Report(orders.rpt).saveAs"_s),
        QStringList { u"Report(orders.rpt).saveAs(\""_s + copyPath + u"\",0)"_s });
    EXPECT_EQ(callsOf(u"Application.openReport"_s),
        (QStringList { u"Application.openReport(\"orders.rpt\",1)"_s,
            u"Application.openReport(\""_s + copyPath + u"\",1)"_s,
            u"Application.openReport(\"orders.rpt\",0)"_s }));
    // The copy is located like the report and is what the runtime mails from.
    EXPECT_EQ(callsOf(u"Table(Orders).setLocation"_s).size(), 3);
    EXPECT_EQ(callsOf(u"ExportOptions("_s + copyPath + u").setDestinationType(2)"_s).size(), 1);
    EXPECT_FALSE(mailed()) << "not from the report's own object";
    // Afterwards the report is its own file again, with its parameter value restored.
    EXPECT_EQ(report->GetReport(), file);
    const QStringList calls = fake.calls();
    const qsizetype reopened = calls.lastIndexOf(u"Application.openReport(\"orders.rpt\",0)"_s);
    EXPECT_TRUE(calls.mid(reopened).contains(u"Param(Customer).addCurrentValue(\"ACME\")"_s));
    EXPECT_FALSE(QFileInfo::exists(copyPath)) << "the temporary copy is deleted";
    EXPECT_FALSE(report->SendMailError());
}

TEST_F(ReportMail, AFailingSendFromTheCopyStillPutsTheReportBack)
{
    const QString copyPath = tempFolder() + u"Invoice.rpt"_s;
    auto copy = fake.addReport(copyPath);
    copy->addTable(u"Orders"_s, u"Shop.dbo.Orders"_s);
    copy->state.printingStatus = file->state.printingStatus;
    fake.failOn(u"Report("_s + copyPath + u").exportReport"_s,
        runtimeError(RuntimeFailure, u"Server refused"_s), 2);
    report->ValidMail(true);
    Mail mail;
    mail.attachment = u"Invoice"_s;
    EXPECT_FALSE(sendReport(mail));
    EXPECT_TRUE(report->SendMailError());
    EXPECT_EQ(report->GetReport(), file);
    EXPECT_FALSE(QFileInfo::exists(copyPath));
}

TEST_F(ReportMail, ACopyThatCannotBeOpenedMailsUnderTheReportsOwnName)
{
    // No fake report at the copy's path: opening it fails.
    report->ValidMail(true);
    Mail mail;
    mail.attachment = u"Invoice"_s;
    EXPECT_TRUE(sendReport(mail));
    EXPECT_TRUE(mailed());
    EXPECT_EQ(report->GetReport(), file);
    EXPECT_FALSE(QFileInfo::exists(tempFolder() + u"Invoice.rpt"_s)) << "no copy is left";
}

TEST_F(ReportMail, AnAttachmentNameThatIsAPathIsRefused)
{
    report->ValidMail(true);
    for (const QString& name :
        { u"../Invoice"_s, u"sub/Invoice"_s, u"C:\\Temp\\Invoice"_s, u".."_s }) {
        SCOPED_TRACE(name.toStdString());
        fake.clearLog();
        Mail mail;
        mail.attachment = name;
        EXPECT_FALSE(sendReport(mail));
        EXPECT_TRUE(report->SendMailError());
        EXPECT_TRUE(callsOf(u"Report(orders.rpt).saveAs"_s).isEmpty());
        EXPECT_FALSE(mailed());
    }
    EXPECT_FALSE(QFileInfo::exists(tempFolder() + u"../Invoice.rpt"_s));
}

TEST_F(ReportMail, FailuresSetTheFlagAndOnlyTheReadRaises)
{
    struct Case {
        const char* name;
        QString failingCall;
        int occurrence;
        bool raises;
    };
    const Case cases[] = {
        { "reading the records", u"Report.readRecords"_s, 1, true },
        { "scratch export", u"Report.exportReport"_s, 1, false },
        { "sending", u"Report.exportReport"_s, 2, false },
        { "no-data check", u"Report.printingStatus"_s, 1, false },
        { "mail settings", u"ExportOptions.setMailToList"_s, 1, false },
    };
    report->ValidMail(true);
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        fake.failOn(c.failingCall, runtimeError(RuntimeFailure, u"Broken"_s), c.occurrence);
        if (c.raises) {
            try {
                sendReport({});
                ADD_FAILURE() << "no error";
            } catch (const core::ComError& error) {
                EXPECT_EQ(error.number(), 5) << "the runtime's own number does not pass";
            }
        } else {
            EXPECT_FALSE(sendReport({}));
        }
        EXPECT_TRUE(report->SendMailError());
    }
}

TEST_F(ReportMail, CancelledDialogsAndOtherDriversGiveFalseWithoutAnError)
{
    addParameter(*file, Param(u"Customer"_s));
    dialog.answer = [](dialogs::InputBoxParams&) { return false; };
    report->ValidMail(true);
    EXPECT_FALSE(sendReport({}));
    EXPECT_TRUE(report->SendMailError());

    auto legacy = fake.addReport(u"legacy.rpt"_s);
    legacy->addTable(tableWithDriver(u"Orders"_s, u"Orders"_s, u"crdbxml.dll"_s));
    report = open(u"legacy.rpt"_s);
    report->ValidMail(true);
    EXPECT_FALSE(sendReport({}));
    EXPECT_TRUE(report->SendMailError());
}

TEST_F(ReportMail, AGuardedCrashIsRaisedAgain)
{
    fake.failOn(u"Report.exportReport"_s,
        core::ComError(GuardedCrash, u"LUDMoxViewer115"_s, u"Access violation"_s));
    report->ValidMail(true);
    try {
        sendReport({});
        FAIL() << "no error";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), GuardedCrash);
        EXPECT_EQ(error.description(), u"Access violation"_s);
    }
}

TEST_F(ReportMail, AnUnloadRequestDuringTheReadSendsNothing)
{
    fake.onCall(u"Report.readRecords"_s, [this] { report->UnloadRequest(true); });
    report->ValidMail(true);
    EXPECT_TRUE(sendReport({}));
    EXPECT_FALSE(report->UnloadRequest());
    EXPECT_TRUE(callsOf(u"Report(orders.rpt).exportReport"_s).isEmpty());
}

TEST_F(ReportMail, OnlyAFirstMailDropsTheKeptParameterValues)
{
    addParameter(*file, Param(u"Customer"_s));
    report->SetParams(dictionary({ { u"Customer"_s, u"ACME"_s } }));
    report->ValidMail(true);
    ASSERT_TRUE(sendReport({}));
    fake.clearLog();
    ASSERT_TRUE(sendReport({}));
    // The host's value is given on every mail; the kept one only when values are kept.
    EXPECT_EQ(callsOf(u"Param(Customer).addCurrentValue"_s).size(), 2);
    fake.clearLog();
    Mail first;
    first.firstMail = true;
    ASSERT_TRUE(sendReport(first));
    EXPECT_EQ(callsOf(u"Param(Customer).addCurrentValue"_s).size(), 1);
    EXPECT_EQ(callsOf(u"Report(orders.rpt).discardSavedData"_s).size(), 1);
}

} // namespace
