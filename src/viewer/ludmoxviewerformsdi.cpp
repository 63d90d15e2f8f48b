#include "viewer/ludmoxviewerformsdi.h"

#include "engine/moxglobals.h"
#include "reports/moxreport115.h"
#include "viewer/moxviewer115.h"
#include "viewer/viewerlogging_p.h"
#include "viewer/windowembedding.h"

#include <QCloseEvent>

using namespace Qt::StringLiterals;

namespace viewer {

LUDMoxViewerFormSDI::LUDMoxViewerFormSDI()
    : m_embedding(std::make_unique<WindowEmbedding>())
{
    setObjectName(u"LUDMoxViewerFormSDI"_s);
    m_view = MoxViewer115::create(this);
    m_view->setObjectName(u"CRView"_s);
    placeView();
    traceViewer(u"LUDMoxViewerFormSDI Form_load"_s, engine::gInstanceLogFile);
}

LUDMoxViewerFormSDI::~LUDMoxViewerFormSDI()
{
    // The control is shared with the window class and the host; it must not go with this
    // widget's children.
    if (m_view) {
        m_embedding->restore(m_view.get(), nullptr);
        m_view->setParent(nullptr);
    }
    traceViewer(u"LUDMoxViewerForm_Terminate"_s, engine::gInstanceLogFile);
}

core::Variant LUDMoxViewerFormSDI::Destroy()
{
    if (m_view)
        m_view->Report(nullptr);
    hide();
    close();
    traceViewer(u"LUDMoxViewerForm_Unload"_s, engine::gInstanceLogFile);
    m_unloaded = true;
    return core::Variant();
}

core::Variant LUDMoxViewerFormSDI::ShowReport(
    const std::shared_ptr<reports::MoxReport115>& Report, int16_t& Copies)
{
    m_view->Report(Report);
    m_view->ShowReport(Copies);
    return core::Variant();
}

std::shared_ptr<MoxViewer115> LUDMoxViewerFormSDI::GetCRView() const
{
    return m_view;
}

int32_t LUDMoxViewerFormSDI::GetCRViewHwnd() const
{
    return m_view ? m_view->hWnd() : 0;
}

WindowEmbedding& LUDMoxViewerFormSDI::embedding() const
{
    return *m_embedding;
}

void LUDMoxViewerFormSDI::placeView()
{
    if (m_view)
        m_view->setGeometry(0, 0, width(), height());
}

void LUDMoxViewerFormSDI::resizeEvent(QResizeEvent* event)
{
    QWidget::resizeEvent(event);
    placeView();
}

void LUDMoxViewerFormSDI::closeEvent(QCloseEvent* event)
{
    // Closed by the user while shown: only hidden, so the host's preview keeps its form.
    const bool cancel = isVisible() && !m_unloaded;
    traceViewer(u"LUDMoxViewerForm_QueryUnload2 "_s + (cancel ? u"-1"_s : u"0"_s),
        engine::gInstanceLogFile);
    if (cancel) {
        hide();
        event->ignore();
        return;
    }
    event->accept();
}

} // namespace viewer
