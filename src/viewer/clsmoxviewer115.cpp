#include "viewer/clsmoxviewer115.h"

#include "core/comerror.h"
#include "engine/moxengine115.h"
#include "platform/twips.h"
#include "platform/windowhandles.h"
#include "reports/moxreport115.h"
#include "reports/moxreports115.h"
#include "viewer/ludmoxviewerformsdi.h"
#include "viewer/moxviewer115.h"
#include "viewer/viewerlogging_p.h"
#include "viewer/windowembedding.h"

#include <QtMath>
#include <array>

using namespace Qt::StringLiterals;

namespace viewer {

namespace {

// The control's events under this class's dispatch ids; CRViewResized has none here.
int32_t forwardedDispid(int32_t viewerDispid)
{
    switch (viewerDispid) {
    case MoxViewer115::OnReportSourceErrorEvent:
        return clsMoxViewer115::OnReportSourceErrorEvent;
    case MoxViewer115::CRViewClickedEvent:
        return clsMoxViewer115::CRViewClickedEvent;
    case MoxViewer115::KeyDownEvent:
        return clsMoxViewer115::KeyDownEvent;
    case MoxViewer115::CRViewFocusChangedEvent:
        return clsMoxViewer115::CRViewFocusChangedEvent;
    case MoxViewer115::CRViewGotFocusEvent:
        return clsMoxViewer115::CRViewGotFocusEvent;
    case MoxViewer115::CRViewLostFocusEvent:
        return clsMoxViewer115::CRViewLostFocusEvent;
    case MoxViewer115::CRViewResizedEvent:
        return 0;
    default:
        return viewerDispid;
    }
}

int32_t handleArgument(const core::Variant& value)
{
    return value.isEmpty() || value.isMissing() ? 0 : value.toLong();
}

} // namespace

clsMoxViewer115::clsMoxViewer115()
{
    traceViewer(u"clsMoxViewer_Initialize"_s);
}

clsMoxViewer115::~clsMoxViewer115()
{
    // A host that never called Destroy would otherwise leave a hidden window and its report
    // behind for the rest of the process.
    release();
    traceViewer(u"clsMoxViewer_Terminate"_s);
}

std::shared_ptr<IMoxViewer115> clsMoxViewer115::CRView() const
{
    return oCRView;
}

void clsMoxViewer115::CRView(const std::shared_ptr<IMoxViewer115>& value)
{
    auto view = std::dynamic_pointer_cast<MoxViewer115>(value);
    if (value && !view)
        throw core::ComError::basic(core::ErrorNumber::TypeMismatch);
    disconnectView();
    oCRView = std::move(view);
    connectView();
}

int32_t clsMoxViewer115::SetOwner(const core::Variant& HwndtoUse, const core::Variant& HwndofOwner)
{
    return WindowEmbedding::setOwner(handleArgument(HwndtoUse), handleArgument(HwndofOwner));
}

void clsMoxViewer115::ParentResize(int32_t& x, int32_t& y, int32_t& width, int32_t& height)
{
    if (!mForm)
        return;
    const qreal perPixelX = platform::twipsPerPixelX(mForm.get());
    const qreal perPixelY = platform::twipsPerPixelY(mForm.get());
    mForm->setGeometry(qRound(x / perPixelX), qRound(y / perPixelY),
        qMax(0, qRound(width / perPixelX)), qMax(0, qRound(height / perPixelY)));
    // A hidden form gets its resize event only when shown; the control must follow now.
    mForm->placeView();
}

void clsMoxViewer115::Destroy()
{
    release();
}

void clsMoxViewer115::release()
{
    try {
        if (mForm && oCRView) {
            mForm->hide();
            mForm->embedding().restore(oCRView.get(), mForm.get());
            if (oCRView->internalWinId() != 0)
                WindowEmbedding::setOwner(oCRView->hWnd(), GetFHwnd());
        }
    } catch (const core::ComError& error) {
        qCDebug(lcViewer) << "Destroy: control not moved back:" << error.what();
    }
    if (mForm)
        mForm->Destroy();
    disconnectView();
    oCRView.reset();
    mForm.reset();
}

int32_t clsMoxViewer115::GetFHwnd()
{
    return mForm ? platform::WindowHandles::handle(mForm.get()) : 0;
}

int32_t clsMoxViewer115::CreateViewerForm(int32_t& owner)
{
    // A second form replaces the first, which must not stay behind hidden.
    if (mForm)
        release();
    try {
        auto form = std::make_unique<LUDMoxViewerFormSDI>();
        mForm = std::move(form);
        mOwner = owner;
        const int32_t handle = GetFHwnd();
        CRView(mForm->GetCRView());
        return handle;
    } catch (const core::ComError& error) {
        throw core::ComError(error.number(), u"CreateViewerForm"_s,
            u"CreateViewerForm:0\r\n"_s + error.description());
    }
}

void clsMoxViewer115::MainWindowHandle(int32_t& value)
{
    if (!oCRView)
        return;
    const auto report = oCRView->Report();
    const auto collection = report ? report->GetParent() : nullptr;
    const auto engine = collection ? collection->GetEngine() : nullptr;
    if (!engine)
        return;
    try {
        engine->MainWindowHandle(value);
    } catch (const core::ComError& error) {
        qCDebug(lcViewer) << "MainWindowHandle not passed on:" << error.what();
    }
}

int32_t clsMoxViewer115::ShowReport(int16_t& Copies, int32_t& owner)
{
    try {
        if (!mForm || !oCRView)
            throw core::ComError::basic(core::ErrorNumber::ObjectVariableNotSet);
        // Held for the call: a handler of the control's events may call Destroy.
        const std::shared_ptr<MoxViewer115> view = oCRView;
        if (owner != 0) {
            // Only a window of its own has an owner slot; a child control takes its parent.
            if (view->internalWinId() != 0)
                WindowEmbedding::setOwner(view->hWnd(), owner);
            if (!mForm->embedding().embed(view.get(), owner))
                qCWarning(lcViewer) << "ShowReport: the control stays in its form; window" << owner
                                    << "cannot take it";
            mForm->placeView();
        }
        mForm->ShowReport(view->Report(), Copies);
    } catch (const core::ComError& error) {
        traceViewer(u"ShowReport error "_s + error.description());
        std::array<core::Variant, 3> args { error.description(), error.number(), false };
        raise(OnReportSourceErrorEvent, u"OnReportSourceError"_s, args);
    }
    return 0;
}

LUDMoxViewerFormSDI* clsMoxViewer115::form() const
{
    return mForm.get();
}

void clsMoxViewer115::connectView()
{
    if (!oCRView)
        return;
    m_viewCookie = oCRView->core::EventSource::connect(
        [this](int32_t dispid, const QString& name, std::span<core::Variant> args) {
            forward(dispid, name, args);
        });
}

void clsMoxViewer115::disconnectView()
{
    if (oCRView && m_viewCookie != 0)
        oCRView->core::EventSource::disconnect(m_viewCookie);
    m_viewCookie = 0;
}

// The same argument list goes on, so by-reference answers reach the control as they are.
void clsMoxViewer115::forward(int32_t dispid, const QString& name, std::span<core::Variant> args)
{
    const int32_t forwarded = forwardedDispid(dispid);
    if (forwarded != 0)
        raise(forwarded, name, args);
}

} // namespace viewer
