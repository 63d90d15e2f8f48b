#pragma once

#include "core/eventsource.h"
#include "core/ludmoxexport.h"
#include "viewer/imoxviewer115.h"

#include <QWidget>
#include <cstdint>
#include <memory>

namespace runtime {
class ViewerControl;
}

namespace viewer {

struct MoxViewer115Private;

/// The component's preview control: a widget whose only child is the report runtime's viewer
/// control (named "CRView"), filling it. It loads its report, asks for the report's
/// parameters, hands the runtime report to the viewer and re-raises the viewer's
/// notifications as its own events (EventId, arguments in declaration order; a handler's
/// answer in a by-reference argument reaches the viewer). Lives on the GUI thread.
///
/// Objects come from create(): shared, and destroyed only once no notification of theirs is
/// running, so a host may let go of the control from inside one of its events.
class LUDMOX_EXPORT MoxViewer115 : public QWidget, public IMoxViewer115, public core::EventSource {
public:
    /// Dispatch ids of the outgoing interface, in declaration order.
    enum EventId : int32_t {
        PrintButtonClickedEvent = 1,
        DownloadStartedEvent,
        ViewChangedEvent,
        SearchButtonClickedEvent,
        DownloadFinishedEvent,
        LastPageButtonClickedEvent,
        GoToPageNClickedEvent,
        FirstPageButtonClickedEvent,
        NextPageButtonClickedEvent,
        PrevPageButtonClickedEvent,
        CRViewClickedEvent,
        KeyDownEvent,
        CRViewFocusChangedEvent,
        CRViewGotFocusEvent,
        CRViewLostFocusEvent,
        CRViewResizedEvent,
        OnReportSourceErrorEvent,
    };

    /// A control over a new runtime viewer control (runtime::ViewerControlFactory). Raises
    /// what the factory raises (429 when no viewer is installed).
    static std::shared_ptr<MoxViewer115> create(QWidget* parent = nullptr);
    ~MoxViewer115() override;

    QString className() const override { return QStringLiteral("MoxViewer115"); }

    /// The control's own native window id as a Long; creates the native window.
    int32_t hWnd();

    std::shared_ptr<reports::MoxReport115> Report() const override;
    /// Replaces the report; nothing else happens until ShowReport.
    void Report(const std::shared_ptr<reports::MoxReport115>& value) override;

    /// Loads the report, fills its parameters (with the dialog) and shows it. Never raises:
    /// failures and a cancelled dialog arrive as OnReportSourceError. Always false.
    bool ShowReport(int16_t& Copies);
    bool ShowReport();

    int32_t GetCurrentPageNumber() override;
    void ShowFirstPage() override;
    void ShowLastPage() override;
    void ShowNextPage() override;
    void ShowPreviousPage() override;
    void ShowNthPage(int16_t PageNumber);
    int16_t ActiveViewIndex() const override;
    bool IsBusy() const override;
    bool Exporting() const override;
    /// The viewer's own print operation.
    void PrintReport();
    int16_t Copies() const override;
    void Copies(int16_t Copyes) override;

    /// The runtime viewer control inside, owned by this control.
    runtime::ViewerControl& control() const;
    /// Whether a notification of the viewer is being handled right now.
    bool isNotifying() const;

protected:
    void resizeEvent(QResizeEvent* event) override;

private:
    explicit MoxViewer115(std::unique_ptr<runtime::ViewerControl> control, QWidget* parent);

    friend struct MoxViewer115Private;
    std::unique_ptr<MoxViewer115Private> d;
};

} // namespace viewer
