#pragma once

#include "platform/printerinfo.h"
#include "platform/printsettings.h"
#include "runtime/report.h"

#include <optional>

namespace reportrt {

class Report;

/// Carries out the report's printing members on the platform's printers, the virtual PDF
/// printer included.
///
/// A report prints on the printer selected for it (selectPrinter, or the one stored in its
/// file) when that printer is installed (the name compared without regard to case), and
/// otherwise on the process's current printer. Its page set-up gives orientation, paper
/// size, paper source and duplex mode; codes a printer does not know leave that setting
/// at the printer's default. On PDF printers the runtime paints copies and collation itself
/// (collated copies repeat the page range, uncollated ones repeat each page); a system
/// print queue gets copies, collation, the page range and the tray as job options instead.
class ReportPrinter {
public:
    /// Prints the report (reading its records first when needed).
    ///
    /// With promptUser the print dialog (platform::PrintDialogService) opens over the
    /// report's dialog parent window with the page count, the range, copies and collation;
    /// what the user chooses there is printed, and the printer and paper settings chosen
    /// stay with the report. A cancelled dialog prints nothing and sets the printing status
    /// to cancelled (5); it is no error. copies below 1 print one copy.
    ///
    /// Raises Error::RuntimeFailure for an empty page range or one that starts after the
    /// last page (nothing is printed), platform errors 482 and 75 when the printer cannot
    /// print, and the report's own errors from layout; a failed job publishes no file.
    ///
    /// groupNode other than -1 prints only that group of the record result, as a preview's
    /// drill-down view shows it (LayoutEngine::setGroupNode); page numbers and ranges then
    /// count that group's pages.
    static void printOut(Report& report, bool promptUser, int16_t copies, bool collated,
        std::optional<runtime::PageRange> pages, int groupNode = -1);

    /// Shows the print set-up dialog for the report over parentWindow (or the report's
    /// dialog parent window when 0); the printer, orientation, paper size, paper source and
    /// duplex mode chosen stay with the report. Cancelling changes nothing.
    static void printerSetup(Report& report, int32_t parentWindow);

    /// The printer the report prints on, and the settings it prints with.
    static platform::PrinterInfo printerFor(const Report& report);
    static platform::PrintSettings settingsFor(const Report& report);
};

} // namespace reportrt
