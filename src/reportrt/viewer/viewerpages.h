#pragma once

#include "reportrt/layout/page.h"
#include "runtime/viewercontrol.h"

#include <QString>
#include <functional>
#include <memory>
#include <vector>

namespace reportrt {

class FontTable;
class PageRenderer;
class Pagination;
class Report;

/// One view of a preview: the pages of a report, or of one of its groups (a drill-down
/// view), as they are laid out.
///
/// Layout hands the pages over one at a time; afterPage runs after each one is stored and
/// may throw to stop the layout (the pages so far stay). The pages refer to the fonts of
/// the view's pagination, so they are dropped whenever a new layout starts.
class ViewerPages {
public:
    using LayoutState = runtime::ViewerControl::LayoutState;

    /// groupNode: a node of the report's record result, or -1 for the whole report.
    ViewerPages(std::shared_ptr<Report> report, int groupNode, QString title);
    ~ViewerPages();
    ViewerPages(const ViewerPages&) = delete;
    ViewerPages& operator=(const ViewerPages&) = delete;

    Report& report() const { return *m_report; }
    int groupNode() const { return m_groupNode; }
    const QString& title() const { return m_title; }
    const std::vector<Page>& pages() const { return m_pages; }
    /// Null until a layout started.
    const FontTable* fonts() const;
    /// The painter of these pages; null until a layout started.
    PageRenderer* renderer() const { return m_renderer.get(); }

    LayoutState state() const { return m_state; }
    void setState(LayoutState state) { m_state = state; }
    /// Asks a running layout to stop at its next page.
    void cancel() { m_cancelRequested = true; }
    bool isCancelRequested() const { return m_cancelRequested; }
    /// Whether the view waits for a layout to be started.
    bool needsLayout() const { return m_needsLayout; }
    void setNeedsLayout(bool value) { m_needsLayout = value; }

    /// Reads the records when the report has none, then lays every page out. Raises the
    /// report's errors and whatever afterPage throws; the state is left to the caller.
    void layOut(const std::function<void()>& afterPage);

private:
    std::shared_ptr<Report> m_report;
    int m_groupNode;
    QString m_title;
    std::unique_ptr<Pagination> m_pagination;
    std::unique_ptr<PageRenderer> m_renderer;
    std::vector<Page> m_pages;
    LayoutState m_state = LayoutState::Idle;
    bool m_cancelRequested = false;
    bool m_needsLayout = false;
};

} // namespace reportrt
