#pragma once

#include "reportrt/layout/page.h"
#include "reportrt/layout/pagegeometry.h"

#include <QDateTime>
#include <functional>

namespace reportrt {

class Report;
class TextShaper;

/// Lays a report out in pages, after its records were read.
///
/// Banded layout in twips: the report header starts the first page, the page header
/// follows it there and starts every other page, the page footer ends every page at the
/// bottom margin, and between them come the group headers, the details, the group footers
/// and last the report footer. An instance that does not fit below what the page already
/// holds moves to a new page; one that does not fit on an empty page is placed there and
/// cut off at the page. A group header moves on with the first record of its group rather
/// than end a page. Sections marked "new page before" start a page (unless they are first
/// on one) and "new page after" makes the next instance that shows anything start one.
///
/// Each instance of a section raises the section's format event before it is measured
/// (field values are those of the instance's record, so handlers can read them). What a
/// handler changes on the section's objects (picture, position, size) is laid out, and put
/// back once the instance is placed. An instance is as tall as its section, or as its
/// lowest object after the handlers and after can-grow text grew. Subreports are laid out
/// in their section instance from their object's position, over as many pages as they
/// need, each instance reading the subreport's records that match its links; the section
/// ends below the subreport.
///
/// Page footers keep their designed height; can-grow does not apply to them.
class LayoutEngine {
public:
    using PageSink = std::function<void(Page&& page)>;

    LayoutEngine(Report& report, TextShaper& shaper);
    ~LayoutEngine();
    LayoutEngine(const LayoutEngine&) = delete;
    LayoutEngine& operator=(const LayoutEngine&) = delete;

    /// What "total pages" fields show; without it they stay empty.
    void setTotalPages(int count);
    /// The print date fields show; the current time by default.
    void setPrintDate(const QDateTime& dateTime);
    /// Lays out only the records of one group node of the report's record result (an index
    /// into RecordProcessor::Result::groups): that group's header, details and footer with
    /// the page headers and footers, without the report header and footer, whose totals
    /// cover every record. -1 (the default) lays out the whole report. A node the result
    /// does not have raises Error::RuntimeFailure.
    void setGroupNode(int node) { m_groupNode = node; }

    /// Lays every page out, handing each to sink in order; a null sink only counts pages
    /// (format events are raised all the same: handlers decide sizes). Reads the records
    /// first when the report has not read them. Returns the number of pages. Raises the
    /// report's errors (a formula failing on a record, a subreport that cannot be read).
    int run(const PageSink& sink);

    /// Whether the report or one of its subreports shows the total page count, which takes
    /// a counting run before the drawing one.
    static bool showsTotalPages(Report& report);

private:
    Report& m_report;
    TextShaper& m_shaper;
    int m_totalPages = 0;
    int m_groupNode = -1;
    QDateTime m_printDate = QDateTime::currentDateTime();
};

} // namespace reportrt
