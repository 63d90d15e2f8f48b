#include "reportrt/section.h"

#include "reportrt/reportobject.h"

namespace reportrt {

Section::Section(const SectionDefinition& definition, std::weak_ptr<Report> report)
    : m_name(definition.name)
    , m_height(definition.height)
    , m_suppressed(definition.suppressed)
    , m_newPageBefore(definition.newPageBefore)
    , m_newPageAfter(definition.newPageAfter)
    , m_report(std::move(report))
{ }

void Section::createObjects(const SectionDefinition& definition)
{
    const auto self = std::static_pointer_cast<Section>(shared_from_this());
    for (const ObjectDefinition& o : definition.objects)
        m_objects.push_back(std::make_shared<ReportObject>(o, self));
}

std::vector<std::shared_ptr<runtime::ReportObject>> Section::reportObjects() const
{
    return { m_objects.begin(), m_objects.end() };
}

int Section::addFormatHandler(FormatHandler handler)
{
    const int cookie = m_nextCookie++;
    m_handlers.emplace(cookie, std::move(handler));
    return cookie;
}

void Section::removeFormatHandler(int cookie)
{
    m_handlers.erase(cookie);
}

void Section::raiseFormat()
{
    // Cookies grow with each handler, so their order is the order of adding; a handler
    // removed by an earlier one does not run.
    int next = 0;
    for (;;) {
        const auto it = m_handlers.upper_bound(next);
        if (it == m_handlers.end())
            return;
        next = it->first;
        const FormatHandler handler = it->second;
        handler();
    }
}

SectionDefinition Section::definition() const
{
    SectionDefinition s;
    s.name = m_name;
    s.height = m_height;
    s.suppressed = m_suppressed;
    s.newPageBefore = m_newPageBefore;
    s.newPageAfter = m_newPageAfter;
    for (const auto& o : m_objects)
        s.objects.push_back(o->definition());
    return s;
}

} // namespace reportrt
