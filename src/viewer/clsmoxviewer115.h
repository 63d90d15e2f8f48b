#pragma once

#include "core/eventsource.h"
#include "core/ludmoxexport.h"
#include "core/object.h"
#include "core/variant.h"

#include <QString>
#include <cstdint>
#include <memory>

namespace viewer {

class IMoxViewer115;
class LUDMoxViewerFormSDI;
class MoxViewer115;

/// A report preview inside a host's window. CreateViewerForm makes a hidden form with one
/// preview control; ShowReport moves the control's window into the host's window and shows
/// the report of CRView.Report there; ParentResize sizes it; Destroy moves it back and
/// unloads the form. Every event of the control is raised again here (EventId), with the
/// host's by-reference answers passed back to the control.
///
/// Window handles are native window ids as Long values. A host that lets go of the object
/// without Destroy still gets its form and report released.
class LUDMOX_EXPORT clsMoxViewer115 : public core::Object, public core::EventSource {
public:
    /// Dispatch ids of the outgoing interface.
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
        OnReportSourceErrorEvent,
        CRViewClickedEvent,
        KeyDownEvent,
        CRViewFocusChangedEvent,
        CRViewGotFocusEvent,
        CRViewLostFocusEvent,
    };

    clsMoxViewer115();
    ~clsMoxViewer115() override;
    clsMoxViewer115(const clsMoxViewer115&) = delete;
    clsMoxViewer115& operator=(const clsMoxViewer115&) = delete;

    QString className() const override { return QStringLiteral("clsMoxViewer115"); }

    /// The preview control; nothing before CreateViewerForm and after Destroy.
    std::shared_ptr<IMoxViewer115> CRView() const;
    /// Takes another preview control (its events from now on), or nothing. Raises 13 for an
    /// object that is only the interface.
    void CRView(const std::shared_ptr<IMoxViewer115>& value);

    /// Makes the window HwndofOwner the owner of the window HwndtoUse (0 clears it) and
    /// returns the previous owner; 0 and no change for a window of another process.
    int32_t SetOwner(const core::Variant& HwndtoUse, const core::Variant& HwndofOwner);
    /// Moves and sizes the form, in twips; the control follows the form's size wherever it
    /// lives. Nothing without a form.
    void ParentResize(int32_t& x, int32_t& y, int32_t& width, int32_t& height);
    /// Moves the control back into its form, unloads the form and lets go of both. Errors are
    /// ignored.
    void Destroy();
    /// The form's window handle; 0 without a form.
    int32_t GetFHwnd();
    /// Creates the hidden form and returns its window handle. Raises the failure's number
    /// with source "CreateViewerForm" and description "CreateViewerForm:0" CR LF and the
    /// failure's description.
    int32_t CreateViewerForm(int32_t& owner);
    /// Gives the engine of the shown report's collection its main window. Errors are
    /// ignored; nothing happens without a control.
    void MainWindowHandle(int32_t& value);
    /// Moves the control into the window owner (0 leaves it in the form) and shows the
    /// report of CRView.Report. Failures arrive as OnReportSourceError; the result is 0.
    int32_t ShowReport(int16_t& Copies, int32_t& owner);

    /// The form, or null; owned by this object.
    LUDMoxViewerFormSDI* form() const;

private:
    void connectView();
    void disconnectView();
    void forward(int32_t dispid, const QString& name, std::span<core::Variant> args);
    void release();

    std::shared_ptr<MoxViewer115> oCRView;
    std::unique_ptr<LUDMoxViewerFormSDI> mForm;
    int32_t mOwner = 0;
    int m_viewCookie = 0;
};

} // namespace viewer
