#include "reportrt/layout/pagination.h"

namespace reportrt {

Pagination::Pagination(Report& report)
    : m_report(report)
    , m_shaper(m_fonts)
    , m_showsTotalPages(LayoutEngine::showsTotalPages(report))
{ }

int Pagination::countPages()
{
    if (!m_total) {
        LayoutEngine counter(m_report, m_shaper);
        counter.setPrintDate(m_printDate);
        counter.setGroupNode(m_groupNode);
        m_total = counter.run({});
    }
    return *m_total;
}

int Pagination::run(const LayoutEngine::PageSink& sink)
{
    LayoutEngine engine(m_report, m_shaper);
    engine.setPrintDate(m_printDate);
    engine.setGroupNode(m_groupNode);
    engine.setTotalPages(m_showsTotalPages ? countPages() : 0);
    return engine.run(sink);
}

} // namespace reportrt
