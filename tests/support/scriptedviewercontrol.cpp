#include "support/scriptedviewercontrol.h"

#include "runtime/viewercontrolfactory.h"

#include <algorithm>

using namespace Qt::StringLiterals;

namespace fakeruntime {

namespace {
ScriptedViewerControl* g_last = nullptr;
int g_created = 0;
} // namespace

ScriptedViewerControl::ScriptedViewerControl()
    : m_widget(std::make_unique<QWidget>())
{
    m_widget->setObjectName(u"ScriptedViewer"_s);
}

ScriptedViewerControl::~ScriptedViewerControl()
{
    if (g_last == this)
        g_last = nullptr;
}

std::shared_ptr<void> ScriptedViewerControl::install(
    std::function<void(ScriptedViewerControl&)> configure)
{
    g_created = 0;
    g_last = nullptr;
    auto previous = runtime::ViewerControlFactory::install([configure] {
        auto control = std::make_unique<ScriptedViewerControl>();
        if (configure)
            configure(*control);
        g_last = control.get();
        ++g_created;
        return std::unique_ptr<runtime::ViewerControl>(std::move(control));
    });
    return std::shared_ptr<void>(nullptr, [previous = std::move(previous)](void*) mutable {
        runtime::ViewerControlFactory::install(std::move(previous));
    });
}

ScriptedViewerControl* ScriptedViewerControl::last()
{
    return g_last;
}

int ScriptedViewerControl::created()
{
    return g_created;
}

void ScriptedViewerControl::record(const QString& call)
{
    calls.append(call);
    const auto failure = m_failures.find(call.section(u'(', 0, 0));
    if (failure != m_failures.end())
        throw failure->second;
}

void ScriptedViewerControl::failOn(const QString& operation, const core::ComError& error)
{
    m_failures.insert_or_assign(operation, error);
}

void ScriptedViewerControl::setNotifications(runtime::ViewerNotifications* notifications)
{
    m_notifications = notifications;
}

void ScriptedViewerControl::setReportSource(std::shared_ptr<runtime::Report> report)
{
    record(u"setReportSource(%1)"_s.arg(report ? u"report"_s : u"none"_s));
    source = std::move(report);
}

void ScriptedViewerControl::setZoom(int32_t percent)
{
    record(u"setZoom(%1)"_s.arg(percent));
    zoomPercent = percent;
}

void ScriptedViewerControl::viewReport()
{
    record(u"viewReport()"_s);
    if (onViewReport)
        onViewReport();
}

void ScriptedViewerControl::refreshView(bool rereadData)
{
    record(u"refreshView(%1)"_s.arg(rereadData ? u"true"_s : u"false"_s));
}

int32_t ScriptedViewerControl::currentPageNumber() const
{
    return page;
}

runtime::ViewerControl::LayoutState ScriptedViewerControl::layoutState() const
{
    ++layoutChecks;
    if (onLayoutCheck)
        onLayoutCheck();
    return layoutChecks <= runningChecks ? LayoutState::Running : layoutAfter;
}

void ScriptedViewerControl::showFirstPage()
{
    record(u"showFirstPage()"_s);
    page = 1;
}

void ScriptedViewerControl::showLastPage()
{
    record(u"showLastPage()"_s);
    page = pages;
}

void ScriptedViewerControl::showNextPage()
{
    record(u"showNextPage()"_s);
    page = std::min(page + 1, pages);
}

void ScriptedViewerControl::showPreviousPage()
{
    record(u"showPreviousPage()"_s);
    page = std::max(page - 1, 1);
}

void ScriptedViewerControl::showNthPage(int32_t pageNumber)
{
    record(u"showNthPage(%1)"_s.arg(pageNumber));
    page = pageNumber;
}

void ScriptedViewerControl::printReport()
{
    record(u"printReport()"_s);
}

int32_t ScriptedViewerControl::searchForText(const QString& text)
{
    record(u"searchForText(%1)"_s.arg(text));
    return 0;
}

void ScriptedViewerControl::takeFocus()
{
    record(u"takeFocus()"_s);
}

} // namespace fakeruntime
