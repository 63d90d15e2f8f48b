#pragma once

#include <QString>

namespace reportrt {

class Report;

/// Writes a report as a PDF file: vector text with the fonts embedded (so it can be
/// searched and copied), lines, frames and pictures, one PDF page per report page.
///
/// The file appears only when it is complete: it is written under a temporary name in the
/// target folder and renamed over the target at the end, replacing an older file; on any
/// failure the temporary file is removed and an existing target is left as it was.
///
/// Pages are painted on a second thread while the next ones are laid out, and only a few
/// pages are held at a time, so memory does not grow with the page count.
class PdfExporter {
public:
    /// Reads the records first when the report has not read them. Returns the number of
    /// pages. Raises Error::ExportFailed when the file cannot be written (the folder is
    /// missing or read-only, the disk is full) and the report's own errors from layout.
    static int exportTo(Report& report, const QString& path);
};

} // namespace reportrt
