#include "platform/windowhandles.h"
#include "runtime/viewercontrolfactory.h"
#include "runtime/viewernotifications.h"
#include "viewer/clsmoxviewer115.h"
#include "viewer/ludmoxviewerformsdi.h"
#include "viewer/moxviewer115.h"
#include "viewerfixture.h"

#include <QApplication>
#include <QCloseEvent>
#include <QWidget>
#include <QWindow>

using namespace Qt::StringLiterals;
using fakeruntime::ScriptedViewerControl;
using viewer::clsMoxViewer115;
using viewer::MoxViewer115;

namespace {

class ViewerWindow : public viewertest::ViewerTest {
protected:
    void SetUp() override
    {
        ViewerTest::SetUp();
        recordViewerEvents(*window, [this](const QString& name, std::span<core::Variant> args) {
            if (answer)
                answer(name, args);
        });
    }

    /// CreateViewerForm(0) and the scripted control inside.
    ScriptedViewerControl& createForm()
    {
        int32_t owner = 0;
        window->CreateViewerForm(owner);
        return *ScriptedViewerControl::last();
    }

    std::shared_ptr<MoxViewer115> view() const
    {
        return std::dynamic_pointer_cast<MoxViewer115>(window->CRView());
    }

    int32_t showReport(int32_t owner, int16_t copies = 1)
    {
        return window->ShowReport(copies, owner);
    }

    static int formsAlive()
    {
        int count = 0;
        for (QWidget* widget : QApplication::allWidgets())
            count += dynamic_cast<viewer::LUDMoxViewerFormSDI*>(widget) != nullptr;
        return count;
    }

    std::shared_ptr<clsMoxViewer115> window = std::make_shared<clsMoxViewer115>();
    std::function<void(const QString&, std::span<core::Variant>)> answer;
};

TEST_F(ViewerWindow, TheFormHandleExistsOnlyBetweenCreateAndDestroy)
{
    EXPECT_EQ(window->GetFHwnd(), 0);
    EXPECT_EQ(window->CRView(), nullptr);
    int32_t owner = 0;
    const int32_t handle = window->CreateViewerForm(owner);
    EXPECT_NE(handle, 0);
    EXPECT_EQ(window->GetFHwnd(), handle);
    EXPECT_FALSE(window->form()->isVisible());
    EXPECT_EQ(platform::WindowHandles::findWidget(handle), window->form());
    ASSERT_NE(view(), nullptr);
    EXPECT_EQ(view()->parentWidget(), window->form());
    window->Destroy();
    EXPECT_EQ(window->GetFHwnd(), 0);
    EXPECT_EQ(window->CRView(), nullptr);
    EXPECT_EQ(formsAlive(), 0);
    // Twice is harmless.
    EXPECT_NO_THROW(window->Destroy());
}

TEST_F(ViewerWindow, CreateViewerFormRaisesWithItsOwnSource)
{
    auto previous = runtime::ViewerControlFactory::install({});
    int32_t owner = 0;
    try {
        window->CreateViewerForm(owner);
        ADD_FAILURE() << "no error raised";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), 429);
        EXPECT_EQ(error.source(), u"CreateViewerForm"_s);
        EXPECT_EQ(
            error.description(), u"CreateViewerForm:0\r\nActiveX component can't create object"_s);
    }
    runtime::ViewerControlFactory::install(std::move(previous));
    EXPECT_EQ(window->GetFHwnd(), 0);
    EXPECT_EQ(formsAlive(), 0);
}

TEST_F(ViewerWindow, ClosingTheShownFormOnlyHidesIt)
{
    createForm();
    auto* form = window->form();
    form->show();
    EXPECT_FALSE(form->close());
    EXPECT_FALSE(form->isVisible());
    EXPECT_FALSE(form->isUnloaded());
    EXPECT_EQ(window->form(), form);
    EXPECT_NE(window->GetFHwnd(), 0);
}

TEST_F(ViewerWindow, ShowReportWithoutOwnerShowsTheReportInsideTheForm)
{
    auto& control = createForm();
    auto report = loadableReport();
    view()->Report(report);
    EXPECT_EQ(showReport(0, 2), 0);
    EXPECT_EQ(view()->parentWidget(), window->form());
    EXPECT_EQ(control.source, report->GetReport());
    EXPECT_EQ(view()->Copies(), 2);
    EXPECT_TRUE(raised.empty());
}

TEST_F(ViewerWindow, ShowReportMovesTheControlIntoTheHostWindowAndDestroyMovesItBack)
{
    QWidget host;
    host.resize(400, 300);
    host.show();
    const int32_t hostHandle = platform::WindowHandles::handle(&host);
    auto& control = createForm();
    view()->Report(loadableReport());
    showReport(hostHandle);
    EXPECT_EQ(view()->parentWidget(), &host);
    EXPECT_TRUE(view()->isVisible());
    EXPECT_TRUE(control.calls.contains(u"viewReport()"_s));

    // The host sizes the form, in twips; the control follows it inside the host.
    int32_t x = 150, y = 150, width = 3000, height = 1500;
    window->ParentResize(x, y, width, height);
    EXPECT_EQ(view()->geometry(), QRect(0, 0, 200, 100));

    auto shown = view();
    window->Destroy();
    EXPECT_EQ(shown->parentWidget(), nullptr);
    EXPECT_FALSE(shown->isVisible());
    EXPECT_TRUE(host.findChildren<MoxViewer115*>().isEmpty());
    EXPECT_EQ(shown->Report(), nullptr);
}

TEST_F(ViewerWindow, AHandleNoWindowAnswersToLeavesTheControlInItsForm)
{
    auto& control = createForm();
    view()->Report(loadableReport());
    EXPECT_EQ(showReport(0x7ffffff0), 0);
    EXPECT_EQ(view()->parentWidget(), window->form());
    EXPECT_TRUE(control.calls.contains(u"viewReport()"_s));
    EXPECT_TRUE(raised.empty());
}

TEST_F(ViewerWindow, ShowReportFailuresArriveAsReportSourceErrors)
{
    // Without a form.
    showReport(0);
    ASSERT_EQ(raised.size(), 1u);
    EXPECT_EQ(raised[0].dispid, clsMoxViewer115::OnReportSourceErrorEvent);
    EXPECT_EQ(raised[0].args[1].toLong(), 91);
    EXPECT_EQ(raised[0].args[0].toText(), u"Object variable or With block variable not set"_s);
    EXPECT_FALSE(raised[0].args[2].toBoolean());
}

TEST_F(ViewerWindow, TheControlsEventsReachTheHostUnderTheWindowsIds)
{
    auto& control = createForm();
    answer = [](const QString& name, std::span<core::Variant> args) {
        if (name == u"KeyDown"_s)
            args[0] = int16_t(0);
        else if (name == u"OnReportSourceError"_s)
            args[2] = false;
        else if (name == u"SearchButtonClicked"_s)
            args[1] = false;
    };
    runtime::ViewerNotifications& notify = *control.notifications();
    QString text = u"Riga"_s;
    bool useDefault = true;
    notify.searchButtonClicked(text, useDefault);
    EXPECT_FALSE(useDefault);
    int16_t key = 13, shift = 1;
    notify.keyDown(key, shift);
    EXPECT_EQ(key, 0);
    QString message = u"Failed"_s;
    int32_t code = static_cast<int32_t>(0x80040309);
    useDefault = true;
    notify.reportSourceError(message, code, useDefault);
    EXPECT_FALSE(useDefault);
    core::Variant info;
    notify.clicked(1, 2, info, useDefault);
    notify.focusChanged(false);
    notify.gotFocus();
    notify.lostFocus();
    notify.resized();

    QStringList names;
    for (const Event& event : raised)
        names << u"%1 %2"_s.arg(event.dispid).arg(event.name);
    EXPECT_EQ(names,
        (QStringList { u"4 SearchButtonClicked"_s, u"13 KeyDown"_s, u"11 OnReportSourceError"_s,
            u"12 CRViewClicked"_s, u"14 CRViewFocusChanged"_s, u"15 CRViewGotFocus"_s,
            u"16 CRViewLostFocus"_s }));
    EXPECT_EQ(raised[0].args[0].toText(), u"Riga"_s);
}

TEST_F(ViewerWindow, AHostMayDestroyTheWindowFromInsideAnEvent)
{
    auto& control = createForm();
    answer = [this](const QString&, std::span<core::Variant>) { window->Destroy(); };
    bool useDefault = true;
    control.notifications()->printButtonClicked(useDefault);
    EXPECT_EQ(window->GetFHwnd(), 0);
    QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
    EXPECT_EQ(formsAlive(), 0);
}

TEST_F(ViewerWindow, MainWindowHandleGoesToTheEngineOfTheShownReport)
{
    int32_t handle = 4711;
    EXPECT_NO_THROW(window->MainWindowHandle(handle));
    createForm();
    // No report yet: nothing happens.
    EXPECT_NO_THROW(window->MainWindowHandle(handle));
    EXPECT_TRUE(moxEngine->Properties(u"MDIHandle"_s).isEmpty()
        || moxEngine->Properties(u"MDIHandle"_s).toLong() == 0);

    // A report outside any collection has no engine.
    view()->Report(std::make_shared<reports::MoxReport115>());
    EXPECT_NO_THROW(window->MainWindowHandle(handle));

    view()->Report(loadableReport());
    window->MainWindowHandle(handle);
    EXPECT_EQ(moxEngine->Properties(u"MDIHandle"_s).toLong(), 4711);
}

TEST_F(ViewerWindow, CRViewTakesOnlyPreviewControls)
{
    createForm();
    EXPECT_THROW(window->CRView(std::make_shared<viewer::IMoxViewer115>()), core::ComError);
    ASSERT_NE(view(), nullptr);
    auto kept = view();
    window->CRView(nullptr);
    // Events of a control let go of no longer reach the host.
    bool useDefault = true;
    ScriptedViewerControl::last()->notifications()->printButtonClicked(useDefault);
    EXPECT_TRUE(raised.empty());
}

TEST_F(ViewerWindow, SetOwnerReturnsThePreviousOwner)
{
    QWidget first, second, owned;
    for (QWidget* widget : { &first, &second, &owned })
        widget->show();
    const int32_t ownedHandle = platform::WindowHandles::handle(&owned);
    const int32_t firstHandle = platform::WindowHandles::handle(&first);
    EXPECT_EQ(window->SetOwner(ownedHandle, firstHandle), 0);
    EXPECT_EQ(window->SetOwner(ownedHandle, platform::WindowHandles::handle(&second)), firstHandle);
    EXPECT_EQ(owned.windowHandle()->transientParent(), second.windowHandle());
    // A window of no one here changes nothing.
    EXPECT_EQ(window->SetOwner(0x7ffffff0, firstHandle), 0);
}

TEST_F(ViewerWindow, LettingGoWithoutDestroyReleasesTheFormAndTheReport)
{
    auto& control = createForm();
    std::weak_ptr<reports::MoxReport115> report;
    {
        auto shown = loadableReport();
        report = shown;
        view()->Report(shown);
        showReport(0);
        collection->Remove(u"orders.rpt"_s);
    }
    std::weak_ptr<MoxViewer115> control115 = view();
    EXPECT_FALSE(report.expired());
    Q_UNUSED(control);
    window.reset();
    QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
    EXPECT_TRUE(control115.expired());
    EXPECT_TRUE(report.expired());
    EXPECT_EQ(formsAlive(), 0);
}

} // namespace
