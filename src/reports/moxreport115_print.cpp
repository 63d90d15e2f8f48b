// Printing a report: the printer decisions, the print itself behind an optional dialog, and
// the report's own printer set-up dialog.

#include "core/comerror.h"
#include "core/text.h"
#include "engine/ludpsetup.h"
#include "engine/moxengine115.h"
#include "platform/currentprinter.h"
#include "platform/printers.h"
#include "platform/windowhandles.h"
#include "reports/frmplex.h"
#include "reports/moxevents115.h"
#include "reports/moxreport115.h"
#include "reports/moxreport115_p.h"
#include "reports/moxreports115.h"
#include "reports/reportslogging_p.h"
#include "runtime/report.h"

#include <QApplication>
#include <QWindow>
#include <optional>

using namespace Qt::StringLiterals;

namespace reports {

namespace {

const QString useReportPrinterKeyword = u"usereportprinter"_s;
/// The text a connection failure of the OLE DB provider carries; other server errors of
/// that number are told apart from it by their own number.
const QString providerFailure = u"0x80004005"_s;

/// The invisible owner of the print dialog, shown over the host's dialog parent window for
/// as long as the print runs, and released on every way out of it.
class OwnerWindow {
public:
    explicit OwnerWindow(int32_t dialogParent)
        : m_dialogParent(dialogParent)
    {
        // Without a widget application (a console host) there is no window to own anything.
        if (!qobject_cast<QApplication*>(QCoreApplication::instance()))
            return;
        m_form.emplace();
        m_form->move(0, 0);
        m_form->resize(0, 0);
        if (m_dialogParent != 0)
            platform::WindowHandles::setOwner(&*m_form, m_dialogParent);
        m_form->show();
    }
    OwnerWindow(const OwnerWindow&) = delete;
    OwnerWindow& operator=(const OwnerWindow&) = delete;
    ~OwnerWindow() { release(); }

    /// Gives the window no owner, closes it and puts the focus back on the host's window.
    void release()
    {
        if (!m_form)
            return;
        if (QWindow* window = m_form->windowHandle())
            window->setTransientParent(nullptr);
        m_form->hide();
        m_form.reset();
        if (QWidget* parent = platform::WindowHandles::findWidget(m_dialogParent))
            parent->activateWindow();
    }

private:
    int32_t m_dialogParent = 0;
    std::optional<frmPlex> m_form;
};

/// Selects `printer` for the report with its three names.
void selectFor(runtime::Report& report, const platform::PrinterInfo& printer)
{
    report.selectPrinter(printer.driverName(), printer.deviceName(), printer.port());
}

/// The error PrintReport hands to its caller for `error`: a server error without the
/// provider's failure text gets the rewritten number; everything else passes unchanged.
core::ComError printError(const core::ComError& error)
{
    const int32_t number = error.number();
    if (number == core::ErrorNumber::ServerError
        && !error.description().contains(providerFailure, Qt::CaseInsensitive))
        return core::ComError(
            core::ErrorNumber::ServerErrorRewritten, error.source(), error.description());
    return error;
}

} // namespace

bool MoxReport115::PrintReport(bool ShowDialog, int16_t Copies, bool Collate, int16_t StartPage,
    int16_t StopPage, bool UseDefaultPrinter, bool DrillDownPrint)
{
    bool noDialog = false;
    if (!LoadReport(false, noDialog)) {
        if (d->NotOLEDB)
            throw notOleDbError();
        return false;
    }
    std::optional<OwnerWindow> ownerWindow;
    try {
        // Held: a host may close the report from an event raised below.
        const std::shared_ptr<runtime::Report> held = d->mReport;
        runtime::Report& report = *held;
        const platform::CurrentPrinter& current = platform::CurrentPrinter::instance();
        int16_t keptOrientation = 0;
        int32_t keptPaperSize = 0;

        // The first installed printer named DefaultPrinter becomes the report's; with it
        // goes the host's paper size for it.
        const auto selectDefaultPrinter = [&] {
            for (const platform::PrinterInfo& printer : platform::Printers::installed()) {
                if (core::text::equalsText(printer.deviceName(), d->DefaultPrinter)) {
                    selectFor(report, printer);
                    if (d->DefaultPaperSize != 0)
                        keptPaperSize = d->DefaultPaperSize;
                    return;
                }
            }
        };

        const bool useReportPrinter = d->DefaultPrinter.isEmpty()
            && report.summaryComments().contains(useReportPrinterKeyword, Qt::CaseInsensitive);

        if (!d->PrinterChosen && !useReportPrinter && !ShowDialog) {
            keptOrientation = report.paperOrientation();
            keptPaperSize = report.paperSize();
            if (!d->DefaultPrinter.isEmpty() && UseDefaultPrinter) {
                selectDefaultPrinter();
            } else {
                traceReport(u"MoxReport.PrintReport_BeforeSelectPrinter,"_s + current.driverName()
                    + u", "_s + current.deviceName() + u","_s + current.port());
                selectFor(report, current.printer());
                if (!d->DefaultPrinter.isEmpty()
                    && core::text::equalsText(d->DefaultPrinter, current.deviceName())
                    && d->DefaultPaperSize != 0)
                    keptPaperSize = d->DefaultPaperSize;
            }
            if (keptOrientation != 0)
                report.setPaperOrientation(keptOrientation);
            if (keptPaperSize != 0)
                ignoringErrors([&] { report.setPaperSize(static_cast<int16_t>(keptPaperSize)); });
        }

        // A printer the user chose in a dialog stays with the report: going back to the
        // application's printer here would undo that choice on the next silent print.
        if (!useReportPrinter && !d->PrinterChosen) {
            if (!d->DefaultPrinter.isEmpty() && (ShowDialog || UseDefaultPrinter)) {
                if (!core::text::equalsText(report.printerDeviceName(), d->DefaultPrinter))
                    selectDefaultPrinter();
            } else {
                selectFor(report, current.printer());
            }
        }

        if (!d->PrinterChosen && !useReportPrinter) {
            const engine::DevModeRecord& settings = engine::DevMode();
            if (keptPaperSize == 0)
                report.setPaperSize(settings.dmPaperSize);
            report.setPaperSource(settings.dmDefaultSource);
            report.setPrinterDuplex(settings.dmDuplex);
        }

        if (ShowDialog)
            d->PrinterChosen = true;

        if (!d->UnloadRequest && !d->FreshData && !d->PreviewActive)
            report.discardSavedData();
        d->FreshData = false;

        traceReport(u"MoxReport.PrintReport_BeforeSetParameters"_s);
        bool cancelled = false;
        SetParameters(cancelled, false);
        traceReport(u"MoxReport.PrintReport_BeforeSetSQLSelection"_s);
        ApplySqlSelection();
        traceReport(u"MoxReport.PrintReport_BeforeReadRecords"_s);
        // The selection may have closed the report from an event; nothing is left to print.
        if (!d->mReport)
            throw core::ComError::basic(core::ErrorNumber::ObjectVariableNotSet);
        d->mReport->readRecords();
        traceReport(u"MoxReport.PrintReport_RecordsRead"_s);

        if (Copies < 1)
            Copies = 1;

        if (!d->UnloadRequest && !DrillDownPrint) {
            if (ShowDialog) {
                int32_t dialogParent = 0;
                if (const auto parent = GetParent()) {
                    if (const auto owner = parent->GetEngine())
                        dialogParent = owner->Properties(u"DialogParentHwnd"_s).toLong();
                }
                ownerWindow.emplace(dialogParent);
            }
            if (StartPage == 0 || StopPage == 0) {
                traceReport(u"MoxReport.PrintReport_BeforePrintOut00"_s);
                d->mReport->printOut(ShowDialog, Copies, Collate, std::nullopt);
                traceReport(u"MoxReport.PrintReport_AfterPrintOut00"_s);
            } else {
                traceReport(u"MoxReport.PrintReport_BeforePrintOut"_s);
                d->mReport->printOut(
                    ShowDialog, Copies, Collate, runtime::PageRange { StartPage, StopPage });
                traceReport(u"MoxReport.PrintReport_AfterPrintOut"_s);
            }
            if (ShowDialog) {
                ownerWindow.reset();
                if (const auto events = d->Events)
                    events->AfterDialogs();
            }
        }

        traceReport(u"MoxReport.PrintReport_DoExit"_s);
        d->UnloadRequest = false;
        return true;
    } catch (const core::ComError& error) {
        traceReport(u"MoxReport.PrintReport_Hell"_s);
        ownerWindow.reset();
        throw printError(error);
    }
}

bool MoxReport115::PrinterSetup(int32_t hWndParent)
{
    bool noDialog = false;
    if (!LoadReport(false, noDialog)) {
        if (d->NotOLEDB)
            throw notOleDbError();
        return false;
    }
    try {
        const std::shared_ptr<runtime::Report> held = d->mReport;
        runtime::Report& report = *held;
        if (!d->PrinterChosen) {
            const int16_t orientation = report.paperOrientation();
            selectFor(report, platform::CurrentPrinter::instance().printer());
            if (orientation != 0)
                report.setPaperOrientation(orientation);
        }
        report.printerSetup(hWndParent);
        d->PrinterChosen = true;
        return true;
    } catch (const core::ComError&) {
        return false;
    }
}

} // namespace reports
