#pragma once

#include <QString>

namespace reportrt {

class ExportOptions;
class Report;

/// Writes a report as an Excel workbook (.xlsx, whatever the file's extension) of one
/// worksheet: one row per detail instance, one column per field object of the details
/// (ordered by left edge), cells typed as their values (numbers and currency with the
/// field's display pattern as number format, dates and times as date cells, Booleans,
/// texts; Null stays empty). The Excel options (docs/report-format.md, "Excel export")
/// choose the heading row, the group and total rows with their outline levels, SUBTOTAL
/// formulas, page breaks, the column widths and how many pages are written.
///
/// Rows are streamed to disk (memory does not grow with the row count). The workbook is
/// written under a hidden temporary name in the target folder and renamed over the
/// target when complete; on failure the temporary file is removed and an existing target
/// stays as it was.
class XlsxExporter {
public:
    /// Reads the records first when the report has not read them. Returns the number of
    /// printed pages the rows came from. Raises Error::ExportFailed when the file cannot
    /// be written, and the report's own errors (a formula failing on a record).
    static int exportTo(Report& report, const ExportOptions& options, const QString& path);
};

} // namespace reportrt
