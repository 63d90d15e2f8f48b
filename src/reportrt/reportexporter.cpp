#include "reportexporter.h"

#include "exportoptions.h"
#include "pdfexporter.h"
#include "report.h"
#include "reportrt/output/htmlexporter.h"
#include "reportrt/output/xlsxexporter.h"
#include "runtimeerror.h"

namespace reportrt {

namespace {
constexpr int32_t formatPdf = 31;
constexpr int32_t formatExcel = 38;
constexpr int32_t formatHtml = 32;
constexpr int32_t destinationNone = 0;
constexpr int32_t destinationDisk = 1;
constexpr int32_t destinationMail = 2;
constexpr int16_t progressCompleted = 3;
constexpr int16_t progressCancelled = 5;
} // namespace

void ReportExporter::exportReport(Report& report, const ExportOptions& options, bool promptUser)
{
    if (promptUser)
        raiseError(Error::RuntimeFailure,
            QStringLiteral("The report runtime has no export dialog: set the export format, "
                           "destination and file name, and export without prompting."));
    switch (options.formatType()) {
    case formatPdf:
    case formatExcel:
    case formatHtml:
        break;
    default:
        raiseError(Error::RuntimeFailure,
            QStringLiteral("%1 is not an export format (31 PDF, 38 Excel, 32 HTML).")
                .arg(options.formatType()));
    }
    switch (options.destinationType()) {
    case destinationNone:
    case destinationDisk:
        break;
    case destinationMail:
        raiseError(Error::RuntimeFailure,
            QStringLiteral("Exporting to mail (destination 2) is not supported yet."));
    default:
        raiseError(Error::RuntimeFailure,
            QStringLiteral("%1 is not an export destination (1 disk file, 2 mail).")
                .arg(options.destinationType()));
    }
    if (!report.result())
        report.readRecords();
    runtime::PrintingStatus status = report.printingStatus();
    // The no-data event cancelled the report: there is nothing to export.
    if (status.progress == progressCancelled)
        return;
    switch (options.formatType()) {
    case formatExcel:
        status.pageCount = XlsxExporter::exportTo(report, options, options.diskFileName());
        break;
    case formatHtml:
        // The disk file name is where this export goes (a scratch file first, then the
        // caller's); the HTML file name only stands in when none was set.
        status.pageCount = HtmlExporter::exportTo(report, options,
            options.diskFileName().isEmpty() ? options.htmlFileName() : options.diskFileName());
        break;
    default:
        status.pageCount = PdfExporter::exportTo(report, options.diskFileName());
    }
    status.progress = progressCompleted;
    report.setPrintingStatus(status);
}

} // namespace reportrt
