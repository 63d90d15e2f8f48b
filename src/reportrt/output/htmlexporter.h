#pragma once

#include <QString>

namespace reportrt {

class ExportOptions;
class Report;

/// Writes a report as UTF-8 HTML5: each page a <table> whose columns come from the edges
/// of the report's objects, the page header and report header in its <thead>, one row
/// per section instance in its <tbody>, the page footer in its <tfoot>. Fonts, colours,
/// alignment, lines and boxes become CSS in the file; pictures are embedded as data: URIs,
/// so a file never depends on anything beside it. Every value is escaped.
///
/// With separate pages each page goes to its own file (name.html, name2.html...), with
/// the navigator option linked by first, previous, next and last links; without it one
/// continuous table holds the whole report. Page breaks follow the sections' designed
/// heights (BandWalker).
///
/// Every file is written under a hidden temporary name in the target folder and renamed
/// over its target only once all files of the export are complete; on failure the
/// temporary files are removed and existing files stay as they were.
class HtmlExporter {
public:
    /// Reads the records first when the report has not read them. Returns the number of
    /// pages. Raises Error::ExportFailed when a file cannot be written, and the report's
    /// own errors (a formula failing on a record).
    static int exportTo(Report& report, const ExportOptions& options, const QString& path);

    /// The file of page (1-based) of a separate-pages export to path: path itself for the
    /// first page, the number before the extension for the others.
    static QString pageFileName(const QString& path, int page);
};

} // namespace reportrt
