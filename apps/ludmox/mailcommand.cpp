#include "mailcommand.h"

#include "core/comerror.h"
#include "logon.h"
#include "reporthost.h"
#include "reports/moxreport115.h"

#include <QCommandLineParser>
#include <cstdio>

using namespace Qt::StringLiterals;

namespace { } // namespace

int mailCommand(const QStringList& arguments)
{
    QCommandLineParser parser;
    parser.setApplicationDescription(
        u"Mails a report as an attachment. The server comes from LUDMOX_SMTP_URL and the "
        u"settings; without one the mail is kept as an .eml file in the outbox folder."_s);
    parser.addHelpOption();
    parser.addPositionalArgument(u"mail"_s, u"The command."_s);
    parser.addPositionalArgument(u"report"_s, u"The report file to mail."_s, u"REPORT"_s);
    parser.addOption({ u"to"_s, u"Recipients, separated by ; or , (required)."_s, u"address"_s });
    parser.addOption({ u"cc"_s, u"Copy recipients."_s, u"address"_s });
    parser.addOption({ u"bcc"_s, u"Blind copy recipients."_s, u"address"_s });
    parser.addOption({ u"subject"_s, u"The subject."_s, u"text"_s });
    parser.addOption({ u"message"_s, u"The message text."_s, u"text"_s });
    parser.addOption({ u"format"_s, u"The attachment's format: pdf (the default), xlsx or html."_s,
        u"format"_s, u"pdf"_s });
    parser.addOption(
        { u"attachment"_s, u"The attachment's base name (a file name)."_s, u"name"_s });
    ReportHost::addReportOptions(parser);
    if (!ReportHost::parseArguments(parser, arguments))
        return 2;

    const QStringList reportPaths = parser.positionalArguments().mid(1);
    if (reportPaths.size() != 1) {
        ReportHost::printError(u"name one report to mail"_s);
        return 2;
    }
    QString address = parser.value(u"to"_s);
    if (address.trimmed().isEmpty()) {
        ReportHost::printError(u"give the recipients with --to ADDRESS"_s);
        return 2;
    }
    const QString format = parser.value(u"format"_s).toLower();
    int32_t attachmentType = 0;
    if (format == u"pdf")
        attachmentType = 31;
    else if (format == u"xlsx")
        attachmentType = 38;
    else if (format == u"html")
        attachmentType = 32;
    else {
        ReportHost::printError(u"unknown format %1; use pdf, xlsx or html"_s.arg(format));
        return 2;
    }

    try {
        ReportHost host(Logon::fromOptions(parser));
        try {
            const auto report = host.open(reportPaths.front(), parser);
            report->ValidMail(true);
            QString subject = parser.value(u"subject"_s);
            QString message = parser.value(u"message"_s);
            QString cc = parser.value(u"cc"_s);
            QString bcc = parser.value(u"bcc"_s);
            QString attachment = parser.value(u"attachment"_s);
            bool showDialog = false;
            bool firstMail = false;
            ReportHost::progress(u"%1: reading and sending..."_s.arg(reportPaths.front()));
            const bool sent = report->SendReport(address, subject, message, attachmentType,
                showDialog, firstMail, cc, bcc, attachment);
            ReportHost::progress(QString());
            if (sent) {
                std::fputs(
                    qPrintable(u"%1: mailed to %2\n"_s.arg(reportPaths.front(), address)), stdout);
                return 0;
            }
            if (!report->SendMailError()) {
                ReportHost::printError(u"%1: the report has no records; nothing was mailed"_s.arg(
                    reportPaths.front()));
                return 1;
            }
            const QString cause = host.failureText();
            ReportHost::printError(
                cause.isEmpty() ? u"%1: the mail was not sent"_s.arg(reportPaths.front()) : cause);
            return 1;
        } catch (const core::ComError& error) {
            ReportHost::progress(QString());
            ReportHost::printError(u"%1: %2"_s.arg(reportPaths.front(), host.explain(error)));
            return 1;
        }
    } catch (const core::ComError& error) {
        ReportHost::printError(error.description());
        return 2;
    }
}
