#include "reportrt/viewer/viewerpages.h"

#include "reportrt/layout/pagination.h"
#include "reportrt/output/pagerenderer.h"
#include "reportrt/report.h"

namespace reportrt {

ViewerPages::ViewerPages(std::shared_ptr<Report> report, int groupNode, QString title)
    : m_report(std::move(report))
    , m_groupNode(groupNode)
    , m_title(std::move(title))
{ }

ViewerPages::~ViewerPages() = default;

const FontTable* ViewerPages::fonts() const
{
    return m_pagination ? &m_pagination->fonts() : nullptr;
}

void ViewerPages::layOut(const std::function<void()>& afterPage)
{
    // The renderer's raw fonts and the pages' shaped text belong to the old pagination.
    m_pages.clear();
    m_renderer.reset();
    m_pagination = std::make_unique<Pagination>(*m_report);
    m_pagination->setGroupNode(m_groupNode);
    m_renderer = std::make_unique<PageRenderer>(m_pagination->fonts());
    m_cancelRequested = false;
    m_needsLayout = false;
    m_pagination->run([&](Page&& page) {
        m_pages.push_back(std::move(page));
        afterPage();
    });
}

} // namespace reportrt
