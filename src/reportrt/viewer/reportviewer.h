#pragma once

#include "reportrt/viewer/pageview.h"
#include "runtime/exportformat.h"
#include "runtime/viewercontrol.h"

#include <QPointer>
#include <memory>
#include <vector>

class QComboBox;
class QKeyEvent;
class QLabel;
class QLineEdit;
class QTabBar;
class QWidget;

namespace core {
class ComError;
}

namespace reportrt {

class Report;
class ViewerPages;

/// The report runtime's preview control.
///
/// Shows the report source's pages as they print, laid out on the GUI thread in slices
/// (the window answers at least every 30 ms and shows the first page while the rest is
/// laid out), in views: view 1 is the whole report, each drill-down into a group header
/// opens another (2, 3, ...). A refresh, a new source, closing a view or destroying the
/// control stops a running layout at its next page. Errors of reading and layout arrive as
/// reportSourceError and, unless the container handles them, as a message inside the
/// control; it never opens a modal box. Dialogs (file choice, print set-up) only open when
/// a display can answer them.
///
/// The original viewer's numbered members that the container does not use have no
/// counterpart here: property 260 (the group tree's visibility), properties 342 and 347
/// and operation 402 (the download progress animation and its state), the notifications
/// with two, three, four and six arguments (drill-down and hyperlink notifications and the
/// database-logon prompt that the runtime does not show), and the one-argument focus
/// request, which takeFocus() replaces.
class ReportViewer : public runtime::ViewerControl {
public:
    /// Raises core::ComError (RuntimeFailure) when the process has no QApplication: a
    /// widget cannot exist without one.
    ReportViewer();
    ~ReportViewer() override;
    ReportViewer(const ReportViewer&) = delete;
    ReportViewer& operator=(const ReportViewer&) = delete;

    // runtime::ViewerControl
    QWidget* widget() override;
    void setNotifications(runtime::ViewerNotifications* notifications) override;
    std::shared_ptr<runtime::Report> reportSource() const override;
    void setReportSource(std::shared_ptr<runtime::Report> report) override;
    int32_t zoom() const override;
    void setZoom(int32_t percent) override;
    void viewReport() override;
    void refreshView(bool rereadData) override;
    int32_t currentPageNumber() const override;
    int32_t pageCount() const override;
    LayoutState layoutState() const override;
    bool isBusy() const override;
    void showFirstPage() override;
    void showLastPage() override;
    void showNextPage() override;
    void showPreviousPage() override;
    void showNthPage(int32_t pageNumber) override;
    int32_t activeViewIndex() const override;
    /// Prints the active view (a drill-down view prints only its group) on the report's
    /// printer; the print dialog only opens when a display can answer it. Raises the
    /// runtime's ComError when printing fails.
    void printReport() override;
    int32_t searchForText(const QString& text) override;
    void takeFocus() override;

    /// The views open (1 and more once a source is shown), and switching among them.
    int32_t viewCount() const;
    void setActiveViewIndex(int32_t index);
    /// Closes a drill-down view (view 1 stays); the first view becomes active when the
    /// active one closes. Other indexes change nothing.
    void closeView(int32_t index);
    /// Opens a view of one group node of the record result and makes it active; returns
    /// its index. Raises ComError (RuntimeFailure) for a node the result does not have.
    int32_t drillDown(int groupNode);

    /// The percentage shown, fitted zooms included.
    int32_t effectiveZoom() const;
    void setContinuous(bool continuous);

    /// The hits of the last search on the active view and the one shown (0-based, -1 for
    /// none); findNext steps to the next or previous one, wrapping at the ends.
    const std::vector<PageSearch::Hit>& searchHits() const { return m_hits; }
    int32_t currentHit() const { return m_currentHit; }
    void findNext(bool backwards);

    /// Writes the report (all of it, also from a drill-down view) to path through the
    /// runtime's writer of the format; raises the writer's ComError.
    void exportTo(runtime::ExportFormat format, const QString& path);

    /// The status line and the message shown in place of the pages ("" for none).
    QString statusText() const;
    QString messageText() const;
    /// The pages of the active view; null before a source is shown.
    const ViewerPages* activePages() const;
    PageView* pageView() const { return m_pageView; }

private:
    void buildWidget();
    template <typename Call> bool notify(Call call);
    std::shared_ptr<ViewerPages> active() const;
    void scheduleLayout();
    void runLayouts();
    bool runLayout(const std::shared_ptr<ViewerPages>& view);
    void cancelLayouts();
    void reportError(const core::ComError& error);
    void showMessage(const QString& text);
    void showActive();
    void pagesGrew();
    void updateStatus();
    void clearSearch();
    void goTo(int index);
    void onKey(QKeyEvent* event);
    void onClicked(const QPoint& point);
    void onDoubleClicked(const QPoint& point);
    void onPrintButton();
    void onExportButton(runtime::ExportFormat format);
    void onRefreshButton();
    void onSearchButton();
    void onPageBox();
    void onZoomBox();
    void stepZoom(int steps);
    void activate(int32_t index);

    std::shared_ptr<bool> m_alive = std::make_shared<bool>(true);
    std::shared_ptr<int> m_eventDepth = std::make_shared<int>(0);
    QPointer<QWidget> m_widget;
    QPointer<PageView> m_pageView;
    QPointer<QTabBar> m_tabs;
    QPointer<QLabel> m_status;
    QPointer<QLabel> m_message;
    QPointer<QLineEdit> m_pageBox;
    QPointer<QLineEdit> m_searchBox;
    QPointer<QComboBox> m_zoomBox;

    runtime::ViewerNotifications* m_notifications = nullptr;
    std::shared_ptr<runtime::Report> m_source;
    std::vector<std::shared_ptr<ViewerPages>> m_views;
    size_t m_active = 0;
    int m_runDepth = 0;
    bool m_scheduled = false;
    bool m_lastPageWhenDone = false;
    int32_t m_zoom = 100;
    QString m_searchText;
    std::vector<PageSearch::Hit> m_hits;
    int32_t m_currentHit = -1;
};

} // namespace reportrt
