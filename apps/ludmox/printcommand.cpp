#include "printcommand.h"

#include "core/comerror.h"
#include "core/dictionary.h"
#include "engine/moxengine115.h"
#include "logon.h"
#include "platform/currentprinter.h"
#include "platform/printers.h"
#include "reports/moxreport115.h"
#include "reports/moxreports115.h"
#include "reports/moxstatus115.h"
#include "reports/moxviewer6exeglobals.h"

#include <QCommandLineParser>
#include <QFileInfo>
#include <QRegularExpression>
#include <cstdio>
#include <optional>

using namespace Qt::StringLiterals;

namespace ludmox {

namespace {

void say(const QString& text)
{
    std::fputs(qPrintable(text + u'\n'), stdout);
    std::fflush(stdout);
}

int fail(const QString& text, int code)
{
    std::fputs(qPrintable(u"ludmox: "_s + text + u'\n'), stderr);
    return code;
}

/// A whole number from 1 to 32767 for an option, or nothing.
std::optional<int16_t> positive(const QString& text)
{
    bool ok = false;
    const int value = text.toInt(&ok);
    if (!ok || value < 1 || value > 32767)
        return std::nullopt;
    return static_cast<int16_t>(value);
}

/// The installed printer of that name (without regard to case), or nothing.
std::optional<platform::PrinterInfo> installedPrinter(const QString& name)
{
    for (const platform::PrinterInfo& printer : platform::Printers::installed()) {
        if (printer.deviceName().compare(name, Qt::CaseInsensitive) == 0)
            return printer;
    }
    return std::nullopt;
}

} // namespace

void addPrintOptions(QCommandLineParser& parser)
{
    parser.addOption({ u"printer"_s, u"print: the printer (see `ludmox printers`)."_s, u"name"_s });
    parser.addOption({ u"copies"_s, u"print: the number of copies."_s, u"n"_s, u"1"_s });
    parser.addOption({ u"pages"_s, u"print: the pages to print, FROM-TO."_s, u"from-to"_s });
    parser.addOption(
        { u"paper"_s, u"print: the paper size code (9 A4, 1 Letter, 8 A3...)."_s, u"code"_s });
}

int printReport(const QCommandLineParser& parser)
{
    const QStringList arguments = parser.positionalArguments();
    if (arguments.size() != 2)
        return fail(u"print takes one report: ludmox print REPORT [options]"_s, 2);
    const QString reportFile = QFileInfo(arguments.at(1)).absoluteFilePath();
    if (!QFileInfo(reportFile).isFile())
        return fail(u"the report %1 does not exist"_s.arg(reportFile), 2);
    std::optional<Logon> logon;
    try {
        logon = Logon::fromOptions(parser);
    } catch (const core::ComError& error) {
        return fail(error.description(), 2);
    }

    const std::optional<int16_t> copies = positive(parser.value(u"copies"_s));
    if (!copies)
        return fail(u"--copies takes a number from 1 to 32767"_s, 2);
    int16_t startPage = 0;
    int16_t stopPage = 0;
    if (parser.isSet(u"pages"_s)) {
        static const QRegularExpression range(u"^\\s*(\\d+)\\s*-\\s*(\\d+)\\s*$"_s);
        const auto match = range.match(parser.value(u"pages"_s));
        const auto from = match.hasMatch() ? positive(match.captured(1)) : std::nullopt;
        const auto to = match.hasMatch() ? positive(match.captured(2)) : std::nullopt;
        if (!from || !to || *to < *from)
            return fail(u"--pages takes FROM-TO, for example 2-5"_s, 2);
        startPage = *from;
        stopPage = *to;
    }
    int16_t paper = 0;
    if (parser.isSet(u"paper"_s)) {
        const auto code = positive(parser.value(u"paper"_s));
        if (!code)
            return fail(u"--paper takes a paper size code, for example 9 for A4"_s, 2);
        paper = *code;
    }
    // A printer the host names must exist: printing on another one instead would put the
    // pages where nobody looks for them.
    QString printer = platform::CurrentPrinter::instance().deviceName();
    if (parser.isSet(u"printer"_s)) {
        const auto found = installedPrinter(parser.value(u"printer"_s));
        if (!found)
            return fail(u"no printer %1 is installed; see `ludmox printers`"_s.arg(
                            parser.value(u"printer"_s)),
                2);
        printer = found->deviceName();
    }

    auto parameters = std::make_shared<core::Dictionary>(core::Dictionary::TextCompare);
    for (const QString& assignment : parser.values(u"param"_s)) {
        const qsizetype equals = assignment.indexOf(u'=');
        if (equals <= 0)
            return fail(u"--param takes NAME=VALUE, not %1"_s.arg(assignment), 2);
        parameters->add(assignment.left(equals), core::Variant(assignment.mid(equals + 1)));
    }

    // Nobody answers a dialog on the command line.
    const auto previous
        = reports::SetInputBoxPresenter([](const std::shared_ptr<dialogs::InputBoxParams>&, int32_t,
                                            const QString&, int32_t) { return false; });
    int code = 0;
    try {
        const auto moxEngine = std::make_shared<engine::MoxEngine115>();
        moxEngine->Init(3, false, 0, 0);
        logon->apply(*moxEngine);
        const auto collection = moxEngine->GetReports();
        const auto report = collection->Item(reportFile);
        report->SetParams(parameters);
        report->DefaultPrinter(printer);
        report->DefaultPaperSize(paper);
        if (!report->PrintReport(false, *copies, true, startPage, stopPage, true)) {
            code = fail(u"%1 cannot be printed: %2"_s.arg(reportFile,
                            moxEngine->LastError().isEmpty() ? u"it could not be opened"_s
                                                             : moxEngine->LastError()),
                1);
        } else {
            // The status knows the page count only when every record read was printed.
            const auto status = report->Status();
            say(status && status->NumberOfPages >= 0
                    ? u"%1: printed on %2, %3 pages"_s.arg(reportFile, printer)
                          .arg(status->NumberOfPages)
                    : u"%1: printed on %2"_s.arg(reportFile, printer));
        }
        report->CloseReport();
    } catch (const core::ComError& error) {
        code = fail(u"%1: %2"_s.arg(reportFile,
                        error.number() == core::ErrorNumber::UserCancelled
                                && error.description() == u"User Cancelled"_s
                            ? u"the report needs parameter values; give them with --param"_s
                            : error.lastErrorText()),
            1);
    }
    reports::SetInputBoxPresenter(previous);
    return code;
}

int listPrinters()
{
    const QString current = platform::CurrentPrinter::instance().deviceName();
    for (const platform::PrinterInfo& printer : platform::Printers::installed()) {
        say(u"%1 %2\t%3\t%4"_s.arg(printer.deviceName() == current ? u"*"_s : u" "_s,
            printer.deviceName(), printer.driverName(), printer.port()));
    }
    return 0;
}

} // namespace ludmox
