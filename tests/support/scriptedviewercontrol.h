#pragma once

#include "core/comerror.h"
#include "runtime/viewercontrol.h"

#include <QString>
#include <QStringList>
#include <QWidget>
#include <functional>
#include <map>
#include <memory>

namespace fakeruntime {

/// A viewer control that tests script: it records every operation, answers its state from
/// public fields, raises an injected error from any named operation and hands its
/// notifications to whoever calls `notifications()`.
///
///     ScriptedViewerControl::install();           // the next controls made are scripted
///     auto* control = ScriptedViewerControl::last();
///     control->failOn(u"viewReport"_s, core::ComError(...));
///     bool useDefault = true;
///     control->notifications()->printButtonClicked(useDefault);
class ScriptedViewerControl : public runtime::ViewerControl {
public:
    ScriptedViewerControl();
    ~ScriptedViewerControl() override;

    /// Installs a factory that makes scripted controls, each passed to `configure` first;
    /// returns a guard that puts the previous factory back when it goes.
    [[nodiscard]] static std::shared_ptr<void> install(
        std::function<void(ScriptedViewerControl&)> configure = {});
    /// The control made last by the installed factory, while it lives.
    static ScriptedViewerControl* last();
    /// How many controls the installed factory made.
    static int created();

    QWidget* widget() override { return m_widget.get(); }
    void setNotifications(runtime::ViewerNotifications* notifications) override;
    runtime::ViewerNotifications* notifications() const { return m_notifications; }

    std::shared_ptr<runtime::Report> reportSource() const override { return source; }
    void setReportSource(std::shared_ptr<runtime::Report> report) override;
    int32_t zoom() const override { return zoomPercent; }
    void setZoom(int32_t percent) override;
    void viewReport() override;
    void refreshView(bool rereadData) override;
    int32_t currentPageNumber() const override;
    int32_t pageCount() const override { return pages; }
    /// Counts its calls; Running for the first `runningChecks` of them, then `layoutAfter`.
    LayoutState layoutState() const override;
    bool isBusy() const override { return busy; }
    void showFirstPage() override;
    void showLastPage() override;
    void showNextPage() override;
    void showPreviousPage() override;
    void showNthPage(int32_t pageNumber) override;
    int32_t activeViewIndex() const override { return viewIndex; }
    void printReport() override;
    int32_t searchForText(const QString& text) override;
    void takeFocus() override;

    /// The operation raises error every time from now on.
    void failOn(const QString& operation, const core::ComError& error);

    QStringList calls;
    std::shared_ptr<runtime::Report> source;
    int32_t zoomPercent = 1;
    int32_t page = 1;
    int32_t pages = 3;
    int32_t viewIndex = 1;
    bool busy = false;
    int runningChecks = 0;
    LayoutState layoutAfter = LayoutState::Complete;
    mutable int layoutChecks = 0;
    /// Runs inside viewReport, after it was recorded: a viewer notifies from there.
    std::function<void()> onViewReport;
    /// Runs at each look at the layout state (inside the wait loop's yields, for one).
    std::function<void()> onLayoutCheck;

private:
    void record(const QString& call);

    std::unique_ptr<QWidget> m_widget;
    runtime::ViewerNotifications* m_notifications = nullptr;
    std::map<QString, core::ComError> m_failures;
};

} // namespace fakeruntime
