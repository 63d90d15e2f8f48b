#pragma once

#include "reportrt/layout/fonttable.h"
#include "reportrt/layout/layoutengine.h"
#include "reportrt/layout/textshaper.h"

#include <QDateTime>
#include <optional>

namespace reportrt {

class Report;

/// Lays a report out in pages for one page consumer (a writer, the printer, a preview).
///
/// Every pass of one pagination shows the same print date and the same total page count:
/// a report that shows the total is laid out once to count its pages before the pass that
/// hands them on. The fonts and shaped text the pages refer to live as long as the
/// pagination does, so pages can be painted after they were laid out.
class Pagination {
public:
    explicit Pagination(Report& report);
    Pagination(const Pagination&) = delete;
    Pagination& operator=(const Pagination&) = delete;

    const FontTable& fonts() const { return m_fonts; }
    bool showsTotalPages() const { return m_showsTotalPages; }

    /// The number of pages, from a counting pass the first time (format events are raised
    /// in it: handlers decide sizes).
    int countPages();
    /// Forgets the count, for when the paper changed: other paper gives other pages.
    void forgetCount() { m_total.reset(); }
    /// Restricts every pass to one group node (LayoutEngine::setGroupNode); -1 for all.
    void setGroupNode(int node)
    {
        m_groupNode = node;
        m_total.reset();
    }

    /// Lays every page out, handing each to sink in order, and returns the number of
    /// pages. Reads the records first when the report has not read them; raises the
    /// report's errors.
    int run(const LayoutEngine::PageSink& sink);

private:
    Report& m_report;
    FontTable m_fonts;
    TextShaper m_shaper;
    QDateTime m_printDate = QDateTime::currentDateTime();
    bool m_showsTotalPages;
    std::optional<int> m_total;
    int m_groupNode = -1;
};

} // namespace reportrt
