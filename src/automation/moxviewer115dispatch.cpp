#include "automation/classbuilder.h"
#include "automation/registry.h"
#include "automation/tables_p.h"
#include "reports/moxreport115.h"
#include "viewer/clsmoxviewer115.h"
#include "viewer/imoxviewer115.h"
#include "viewer/moxviewer115.h"

namespace automation {

using viewer::clsMoxViewer115;
using viewer::IMoxViewer115;
using viewer::MoxViewer115;

namespace {

using ReportPtr = std::shared_ptr<reports::MoxReport115>;

// The members of _IMoxViewer115 in interface order; the preview control answers them with
// its own members, the bare interface object with nothing.
template <class C> void addViewerInterface(ClassBuilder<C>& c)
{
    c.property(
        QStringLiteral("Report"), 0x68030000, [](IMoxViewer115& view) { return view.Report(); },
        [](IMoxViewer115& view, const ReportPtr& value) { view.Report(value); },
        { .returns = QStringLiteral("MoxReport115") });
    c.get(QStringLiteral("IsBusy"), 0x68030001, [](IMoxViewer115& view) { return view.IsBusy(); });
    c.get(QStringLiteral("Exporting"), 0x68030002,
        [](IMoxViewer115& view) { return view.Exporting(); });
    c.get(QStringLiteral("Copies"), 0x68030003, [](IMoxViewer115& view) { return view.Copies(); });
    c.put(QStringLiteral("Copies"), 0x68030003,
        [](IMoxViewer115& view, int16_t Copyes) { view.Copies(Copyes); },
        { byVal(QStringLiteral("Copyes")) });
    c.method(QStringLiteral("GetCurrentPageNumber"), 0x60030004,
        [](IMoxViewer115& view) { return view.GetCurrentPageNumber(); });
    c.method(QStringLiteral("ShowFirstPage"), 0x60030005,
        [](IMoxViewer115& view) { view.ShowFirstPage(); });
    c.method(QStringLiteral("ShowLastPage"), 0x60030006,
        [](IMoxViewer115& view) { view.ShowLastPage(); });
    c.method(QStringLiteral("ShowNextPage"), 0x60030007,
        [](IMoxViewer115& view) { view.ShowNextPage(); });
    c.method(QStringLiteral("ShowPreviousPage"), 0x60030008,
        [](IMoxViewer115& view) { view.ShowPreviousPage(); });
    c.get(QStringLiteral("ActiveViewIndex"), 0x68030009,
        [](IMoxViewer115& view) { return view.ActiveViewIndex(); });
}

// The control's answers: UseDefault, KeyCode and Shift are by reference, the rest by value.
ParamDescription useDefault()
{
    return param(QStringLiteral("UseDefault"), QStringLiteral("Boolean"));
}
ParamDescription longArg(const QString& name)
{
    return byVal(name, QStringLiteral("Long"));
}

} // namespace

void registerIMoxViewer115(Registry& registry)
{
    ClassBuilder<IMoxViewer115> c(
        QStringLiteral("IMoxViewer115"), QStringLiteral("_IMoxViewer115"));
    c.creatable();
    addViewerInterface(c);
    registry.add(c.take());

    // What CRView hands out: the control itself, seen through the interface above. Hosts
    // cannot create it and its events reach them through clsMoxViewer115.
    ClassBuilder<MoxViewer115> control(
        QStringLiteral("MoxViewer115"), QStringLiteral("_MoxViewer115"));
    control.outsideTypeLibrary();
    addViewerInterface(control);
    registry.add(control.take());
}

// Dispatch ids follow the declaration order: the CRView field first, then the members.
void registerClsMoxViewer115(Registry& registry)
{
    ClassBuilder<clsMoxViewer115> c(
        QStringLiteral("clsMoxViewer115"), QStringLiteral("_clsMoxViewer115"));
    c.creatable();
    c.get(QStringLiteral("CRView"), 0x68030000,
        [](clsMoxViewer115& window) { return window.CRView(); }, {},
        { .returns = QStringLiteral("IMoxViewer115") });
    c.putRef(QStringLiteral("CRView"), 0x68030000,
        [](clsMoxViewer115& window, const std::shared_ptr<IMoxViewer115>& value) {
            window.CRView(value);
        },
        { param(QStringLiteral("RHS"), QStringLiteral("IMoxViewer115")) });
    c.method(QStringLiteral("SetOwner"), 0x60030001, &clsMoxViewer115::SetOwner,
        { param(QStringLiteral("HwndtoUse")), param(QStringLiteral("HwndofOwner")) });
    c.method(QStringLiteral("ParentResize"), 0x60030002, &clsMoxViewer115::ParentResize,
        { param(QStringLiteral("x")), param(QStringLiteral("y")), param(QStringLiteral("width")),
            param(QStringLiteral("height")) });
    c.method(QStringLiteral("Destroy"), 0x60030003, &clsMoxViewer115::Destroy);
    c.method(QStringLiteral("GetFHwnd"), 0x60030004, &clsMoxViewer115::GetFHwnd);
    c.method(QStringLiteral("CreateViewerForm"), 0x60030005, &clsMoxViewer115::CreateViewerForm,
        { param(QStringLiteral("owner")) });
    c.put(QStringLiteral("MainWindowHandle"), 0x68030006, &clsMoxViewer115::MainWindowHandle,
        { param(QStringLiteral("RHS")) });
    c.method(QStringLiteral("ShowReport"), 0x60030007, &clsMoxViewer115::ShowReport,
        { optionalParam(QStringLiteral("Copies"), int16_t(1)),
            optionalParam(QStringLiteral("owner"), int32_t(0)) });

    c.events(QStringLiteral("__clsMoxViewer115"));
    c.event(QStringLiteral("PrintButtonClicked"), clsMoxViewer115::PrintButtonClickedEvent,
        { useDefault() });
    c.event(QStringLiteral("DownloadStarted"), clsMoxViewer115::DownloadStartedEvent,
        { longArg(QStringLiteral("loadingType")) });
    c.event(QStringLiteral("ViewChanged"), clsMoxViewer115::ViewChangedEvent,
        { longArg(QStringLiteral("oldViewIndex")), longArg(QStringLiteral("newViewIndex")) });
    c.event(QStringLiteral("SearchButtonClicked"), clsMoxViewer115::SearchButtonClickedEvent,
        { byVal(QStringLiteral("searchText"), QStringLiteral("String")), useDefault() });
    c.event(QStringLiteral("DownloadFinished"), clsMoxViewer115::DownloadFinishedEvent,
        { longArg(QStringLiteral("loadingType")) });
    c.event(QStringLiteral("LastPageButtonClicked"), clsMoxViewer115::LastPageButtonClickedEvent,
        { useDefault() });
    c.event(QStringLiteral("GoToPageNClicked"), clsMoxViewer115::GoToPageNClickedEvent,
        { useDefault(), byVal(QStringLiteral("PageNumber"), QStringLiteral("Integer")) });
    c.event(QStringLiteral("FirstPageButtonClicked"), clsMoxViewer115::FirstPageButtonClickedEvent,
        { useDefault() });
    c.event(QStringLiteral("NextPageButtonClicked"), clsMoxViewer115::NextPageButtonClickedEvent,
        { useDefault() });
    c.event(QStringLiteral("PrevPageButtonClicked"), clsMoxViewer115::PrevPageButtonClickedEvent,
        { useDefault() });
    c.event(QStringLiteral("OnReportSourceError"), clsMoxViewer115::OnReportSourceErrorEvent,
        { byVal(QStringLiteral("errorMsg"), QStringLiteral("String")),
            longArg(QStringLiteral("errorCode")), useDefault() });
    c.event(QStringLiteral("CRViewClicked"), clsMoxViewer115::CRViewClickedEvent,
        { longArg(QStringLiteral("x")), longArg(QStringLiteral("y")),
            byVal(QStringLiteral("EventInfo"), QStringLiteral("Variant")), useDefault() });
    c.event(QStringLiteral("KeyDown"), clsMoxViewer115::KeyDownEvent,
        { param(QStringLiteral("KeyCode"), QStringLiteral("Integer")),
            param(QStringLiteral("Shift"), QStringLiteral("Integer")) });
    c.event(QStringLiteral("CRViewFocusChanged"), clsMoxViewer115::CRViewFocusChangedEvent,
        { byVal(QStringLiteral("hasFocus"), QStringLiteral("Boolean")) });
    c.event(QStringLiteral("CRViewGotFocus"), clsMoxViewer115::CRViewGotFocusEvent, {});
    c.event(QStringLiteral("CRViewLostFocus"), clsMoxViewer115::CRViewLostFocusEvent, {});
    registry.add(c.take());
}

} // namespace automation
