#include "reportrt/output/reportexporter.h"

#include "reportrt/base/runtimeerror.h"
#include "reportrt/exportoptions.h"
#include "reportrt/output/writertable.h"
#include "reportrt/report.h"
#include "runtime/exportdestination.h"

namespace reportrt {

namespace {
QString formatName(int32_t code)
{
    switch (static_cast<runtime::ExportFormat>(code)) {
    case runtime::ExportFormat::PDF:
        return QStringLiteral("PDF");
    case runtime::ExportFormat::Excel:
        return QStringLiteral("Excel");
    case runtime::ExportFormat::HTML:
        return QStringLiteral("HTML");
    }
    return {};
}
} // namespace

void ReportExporter::exportReport(Report& report, const ExportOptions& options, bool promptUser)
{
    if (promptUser)
        raiseError(Error::RuntimeFailure,
            QStringLiteral("The report runtime has no export dialog: set the export format, "
                           "destination and file name, and export without prompting."));
    const WriterTable::Writer* writer = WriterTable::find(options.formatType());
    if (!writer) {
        const QString name = formatName(options.formatType());
        if (!name.isEmpty())
            raiseError(Error::RuntimeFailure,
                QStringLiteral("Exporting to %1 (format %2) is not supported yet.")
                    .arg(name)
                    .arg(options.formatType()));
        raiseError(Error::RuntimeFailure,
            QStringLiteral("%1 is not an export format (31 PDF, 38 Excel, 32 HTML).")
                .arg(options.formatType()));
    }
    switch (static_cast<runtime::ExportDestination>(options.destinationType())) {
    case runtime::ExportDestination::None:
    case runtime::ExportDestination::DiskFile:
        break;
    case runtime::ExportDestination::Mail:
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
    if (status.is(runtime::PrintingProgress::Cancelled))
        return;
    status.pageCount = (*writer)(report, options, options.diskFileName());
    status.setProgress(runtime::PrintingProgress::Completed);
    report.setPrintingStatus(status);
}

} // namespace reportrt
