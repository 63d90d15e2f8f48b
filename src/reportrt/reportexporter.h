#pragma once

namespace reportrt {

class ExportOptions;
class Report;

/// Carries out Report::exportReport: checks the export options and hands the report to
/// the writer of the chosen format.
///
/// PDF (format 31), Excel (38, XlsxExporter) and HTML (32, HtmlExporter) to a disk file
/// (destination 1, or 0 when none was set) are written. Mail as a destination (2) is
/// accepted as a setting but raises Error::RuntimeFailure saying it is not supported yet;
/// unknown codes and a prompting export (the runtime has no export dialog) raise it too. Nothing is
/// ever reported as written that was not.
class ReportExporter {
public:
    static void exportReport(Report& report, const ExportOptions& options, bool promptUser);
};

} // namespace reportrt
