#include "viewer/moxviewer115.h"

#include "core/comerror.h"
#include "reports/moxreport115.h"
#include "reports/moxstatus115.h"
#include "runtime/report.h"
#include "runtime/viewercontrol.h"
#include "runtime/viewercontrolfactory.h"
#include "runtime/viewernotifications.h"
#include "viewer/viewerlogging_p.h"

#include <QEventLoop>
#include <QPointer>
#include <QResizeEvent>
#include <QTimer>
#include <array>

using namespace Qt::StringLiterals;

namespace viewer {

namespace {

using core::ErrorNumber::OpenReportFailed;
using core::ErrorNumber::RuntimeFailure;
using core::ErrorNumber::ServerError;
using core::ErrorNumber::ServerErrorRewritten;
using core::ErrorNumber::TableConnectionFailed;

// Report-source errors the host reports itself: the viewer shows no message of its own.
constexpr std::array<int32_t, 6> kQuietErrors { OpenReportFailed, static_cast<int32_t>(0x80043AE2),
    static_cast<int32_t>(0x80043AE5), static_cast<int32_t>(0x80047D51),
    static_cast<int32_t>(0x80043B05), ServerError };

// How long the last-page wait sleeps between two looks at the layout when nothing else
// happens; events that arrive end the sleep at once.
constexpr int kLayoutPollMs = 10;

} // namespace

// The viewer's notifications, handled with the control's corrections and re-raised as its
// events. Host handlers' errors stop at this boundary: they must not unwind through the
// viewer's own event handling.
//
// The original viewer had more notifications than this one: the ones that only set its
// properties 260 and 342 (refresh state, with 347 read as a count) and the step of the
// last-page handler that reads 342 and calls operation 402 have no equivalent here and are
// left out. databaseLogonFailed is the one of them that also marks the next error retryable.
struct MoxViewer115Private : runtime::ViewerNotifications {
    MoxViewer115* q = nullptr;
    std::unique_ptr<runtime::ViewerControl> control;
    std::shared_ptr<reports::MoxReport115> mReport;
    int16_t mCopies = 0;
    bool mConvertNextError = false;
    int notifying = 0;

    // Counts a notification in progress for as long as it lives.
    struct Notifying {
        explicit Notifying(MoxViewer115Private& p)
            : self(p.q)
            , count(p.notifying)
        {
            ++count;
        }
        ~Notifying()
        {
            if (self)
                --count;
        }
        Notifying(const Notifying&) = delete;
        Notifying& operator=(const Notifying&) = delete;
        QPointer<MoxViewer115> self;
        int& count;
    };

    void raise(int32_t dispid, const QString& name, std::span<core::Variant> args)
    {
        try {
            q->core::EventSource::raise(dispid, name, args);
        } catch (const core::ComError& error) {
            qCWarning(lcViewer) << "handler of" << name << "failed:" << error.what();
        } catch (const std::exception& error) {
            qCWarning(lcViewer) << "handler of" << name << "failed:" << error.what();
        }
    }

    // An event with one by-reference UseDefault argument.
    void raiseUseDefault(int32_t dispid, const QString& name, bool& useDefault)
    {
        std::array<core::Variant, 1> args { useDefault };
        raise(dispid, name, args);
        useDefault = args[0].toBoolean();
    }

    void raiseReportSourceError(QString errorMsg, int32_t errorCode, bool useDefault)
    {
        std::array<core::Variant, 3> args { errorMsg, errorCode, useDefault };
        raise(MoxViewer115::OnReportSourceErrorEvent, u"OnReportSourceError"_s, args);
    }

    void printButtonClicked(bool& useDefault) override;
    void downloadStarted(int32_t loadingType) override;
    void downloadFinished(int32_t loadingType) override;
    void searchButtonClicked(QString& searchText, bool& useDefault) override;
    void firstPageButtonClicked(bool& useDefault) override;
    void lastPageButtonClicked(bool& useDefault) override;
    void nextPageButtonClicked(bool& useDefault) override;
    void prevPageButtonClicked(bool& useDefault) override;
    void goToPageNClicked(bool& useDefault, int16_t& pageNumber) override;
    void clicked(int32_t x, int32_t y, core::Variant& eventInfo, bool& useDefault) override;
    void keyDown(int16_t& keyCode, int16_t& shift) override;
    void focusChanged(bool hasFocus) override;
    void gotFocus() override;
    void lostFocus() override;
    void reportSourceError(QString& errorMessage, int32_t& errorCode, bool& useDefault) override;
    void refreshButtonClicked(bool& useDefault) override;
    void databaseLogonFailed(const QString& serverName, const QString& databaseName) override;

    void waitForLayout();
};

void MoxViewer115Private::printButtonClicked(bool& useDefault)
{
    const Notifying guard(*this);
    if (control->activeViewIndex() < 2) {
        raiseUseDefault(MoxViewer115::PrintButtonClickedEvent, u"PrintButtonClicked"_s, useDefault);
        return;
    }
    // A drill-down view: the report prints it, without a dialog, once. An error must not be
    // lost in the viewer's button handler; it reaches the host as report-source errors do.
    try {
        if (!mReport)
            throw core::ComError::basic(core::ErrorNumber::ObjectVariableNotSet);
        const auto report = mReport;
        report->PrintReport(false, 1, true, 0, 0, false, true);
    } catch (const core::ComError& error) {
        raiseReportSourceError(error.description(), error.number(), false);
    }
    useDefault = true;
}

void MoxViewer115Private::downloadStarted(int32_t loadingType)
{
    const Notifying guard(*this);
    std::array<core::Variant, 1> args { loadingType };
    raise(MoxViewer115::DownloadStartedEvent, u"DownloadStarted"_s, args);
}

void MoxViewer115Private::downloadFinished(int32_t loadingType)
{
    const Notifying guard(*this);
    std::array<core::Variant, 1> args { loadingType };
    raise(MoxViewer115::DownloadFinishedEvent, u"DownloadFinished"_s, args);
}

void MoxViewer115Private::searchButtonClicked(QString& searchText, bool& useDefault)
{
    const Notifying guard(*this);
    std::array<core::Variant, 2> args { searchText, useDefault };
    raise(MoxViewer115::SearchButtonClickedEvent, u"SearchButtonClicked"_s, args);
    useDefault = args[1].toBoolean();
}

void MoxViewer115Private::firstPageButtonClicked(bool& useDefault)
{
    const Notifying guard(*this);
    raiseUseDefault(
        MoxViewer115::FirstPageButtonClickedEvent, u"FirstPageButtonClicked"_s, useDefault);
}

void MoxViewer115Private::lastPageButtonClicked(bool& useDefault)
{
    const Notifying guard(*this);
    const QPointer<MoxViewer115> self(q);
    raiseUseDefault(
        MoxViewer115::LastPageButtonClickedEvent, u"LastPageButtonClicked"_s, useDefault);
    if (!self)
        return;
    useDefault = true;
    control->showLastPage();
    waitForLayout();
}

// Waits for the layout to reach the last page, serving events meanwhile. It waits on the
// layout state, not on the busy flag: a viewer that stays busy for another reason, fails
// mid-layout or goes away during the wait ends it.
void MoxViewer115Private::waitForLayout()
{
    const QPointer<MoxViewer115> self(q);
    while (self && control->layoutState() == runtime::ViewerControl::LayoutState::Running) {
        QEventLoop loop;
        QTimer::singleShot(kLayoutPollMs, &loop, &QEventLoop::quit);
        loop.exec();
    }
}

void MoxViewer115Private::nextPageButtonClicked(bool& useDefault)
{
    const Notifying guard(*this);
    raiseUseDefault(
        MoxViewer115::NextPageButtonClickedEvent, u"NextPageButtonClicked"_s, useDefault);
}

void MoxViewer115Private::prevPageButtonClicked(bool& useDefault)
{
    const Notifying guard(*this);
    raiseUseDefault(
        MoxViewer115::PrevPageButtonClickedEvent, u"PrevPageButtonClicked"_s, useDefault);
}

void MoxViewer115Private::goToPageNClicked(bool& useDefault, int16_t& pageNumber)
{
    const Notifying guard(*this);
    std::array<core::Variant, 2> args { useDefault, pageNumber };
    raise(MoxViewer115::GoToPageNClickedEvent, u"GoToPageNClicked"_s, args);
    useDefault = args[0].toBoolean();
}

void MoxViewer115Private::clicked(int32_t x, int32_t y, core::Variant& eventInfo, bool& useDefault)
{
    const Notifying guard(*this);
    std::array<core::Variant, 4> args { x, y, eventInfo, useDefault };
    raise(MoxViewer115::CRViewClickedEvent, u"CRViewClicked"_s, args);
    useDefault = args[3].toBoolean();
}

void MoxViewer115Private::keyDown(int16_t& keyCode, int16_t& shift)
{
    const Notifying guard(*this);
    std::array<core::Variant, 2> args { keyCode, shift };
    raise(MoxViewer115::KeyDownEvent, u"KeyDown"_s, args);
    // Both converted before either is written back: a bad answer leaves both as they were.
    try {
        const int16_t newKeyCode = args[0].toInteger();
        const int16_t newShift = args[1].toInteger();
        keyCode = newKeyCode;
        shift = newShift;
    } catch (const core::ComError& error) {
        qCWarning(lcViewer) << "KeyDown answer ignored:" << error.what();
    }
}

void MoxViewer115Private::focusChanged(bool hasFocus)
{
    const Notifying guard(*this);
    std::array<core::Variant, 1> args { hasFocus };
    raise(MoxViewer115::CRViewFocusChangedEvent, u"CRViewFocusChanged"_s, args);
}

void MoxViewer115Private::gotFocus()
{
    const Notifying guard(*this);
    raise(MoxViewer115::CRViewGotFocusEvent, u"CRViewGotFocus"_s, {});
}

void MoxViewer115Private::lostFocus()
{
    const Notifying guard(*this);
    raise(MoxViewer115::CRViewLostFocusEvent, u"CRViewLostFocus"_s, {});
}

void MoxViewer115Private::reportSourceError(
    QString& errorMessage, int32_t& errorCode, bool& useDefault)
{
    const Notifying guard(*this);
    if (!errorMessage.contains(u"0x80004005"_s, Qt::CaseInsensitive) && errorCode == ServerError)
        errorCode = ServerErrorRewritten;
    if (std::find(kQuietErrors.begin(), kQuietErrors.end(), errorCode) != kQuietErrors.end())
        useDefault = false;
    if (mConvertNextError) {
        if (errorCode == TableConnectionFailed)
            errorCode = ServerError;
        useDefault = false;
        mConvertNextError = false;
    }
    std::array<core::Variant, 3> args { errorMessage, errorCode, useDefault };
    raise(MoxViewer115::OnReportSourceErrorEvent, u"OnReportSourceError"_s, args);
    useDefault = args[2].toBoolean();
}

// Every step on its own, errors ignored: a step that fails does not stop the next. A
// progress that cannot be read counts as not in progress, so the view is laid out again.
void MoxViewer115Private::refreshButtonClicked(bool& useDefault)
{
    const Notifying guard(*this);
    const auto report = mReport;
    bool inProgress = false;
    if (report) {
        try {
            if (const auto runtimeReport = report->GetReport())
                runtimeReport->setEnableParameterPrompting(false);
        } catch (const core::ComError& error) {
            qCDebug(lcViewer) << "refresh: prompting not switched off:" << error.what();
        }
        try {
            bool cancelled = false;
            report->SetParameters(cancelled, false);
        } catch (const core::ComError& error) {
            qCDebug(lcViewer) << "refresh: parameters not set:" << error.what();
        }
        try {
            inProgress = report->Status()->Progress == reports::eppPrintingInProgress;
        } catch (const core::ComError& error) {
            qCDebug(lcViewer) << "refresh: progress not read:" << error.what();
        }
    }
    useDefault = false;
    if (!inProgress) {
        try {
            control->refreshView(false);
        } catch (const core::ComError& error) {
            qCDebug(lcViewer) << "refresh: view not laid out again:" << error.what();
        }
    }
}

void MoxViewer115Private::databaseLogonFailed(const QString&, const QString&)
{
    mConvertNextError = true;
}

std::shared_ptr<MoxViewer115> MoxViewer115::create(QWidget* parent)
{
    auto control = runtime::ViewerControlFactory::create();
    return std::shared_ptr<MoxViewer115>(
        new MoxViewer115(std::move(control), parent), [](MoxViewer115* viewer) {
            // Not while the viewer's own code is on the stack: it goes once that returns.
            if (viewer->isNotifying())
                viewer->deleteLater();
            else
                delete viewer;
        });
}

MoxViewer115::MoxViewer115(std::unique_ptr<runtime::ViewerControl> control, QWidget* parent)
    : QWidget(parent)
    , d(std::make_unique<MoxViewer115Private>())
{
    d->q = this;
    d->control = std::move(control);
    QWidget* view = d->control->widget();
    view->setParent(this);
    view->setObjectName(u"CRView"_s);
    view->setGeometry(rect());
    view->show();
    d->control->setNotifications(d.get());
    traceViewer(u"MoxViewer_Initialize"_s);
}

MoxViewer115::~MoxViewer115()
{
    d->control->setNotifications(nullptr);
    // The widget belongs to the control object, not to this widget's children.
    if (QWidget* view = d->control->widget())
        view->setParent(nullptr);
    d->control.reset();
    traceViewer(u"MoxViewer_Terminate"_s);
}

int32_t MoxViewer115::hWnd()
{
    return static_cast<int32_t>(static_cast<uint32_t>(winId()));
}

std::shared_ptr<reports::MoxReport115> MoxViewer115::Report() const
{
    return d->mReport;
}

void MoxViewer115::Report(const std::shared_ptr<reports::MoxReport115>& value)
{
    d->mReport = value;
}

bool MoxViewer115::ShowReport()
{
    int16_t copies = 0;
    return ShowReport(copies);
}

bool MoxViewer115::ShowReport(int16_t& Copies)
{
    const MoxViewer115Private::Notifying guard(*d);
    const QPointer<MoxViewer115> self(this);
    // Held for the whole call: a handler may replace the control's report meanwhile.
    const std::shared_ptr<reports::MoxReport115> report = d->mReport;
    int32_t errorNumber = 0;
    try {
        bool noDialog = true;
        if (report && report->LoadReport(true, noDialog)) {
            d->mCopies = Copies;
            try {
                bool cancelled = false;
                report->SetParameters(cancelled, false);
            } catch (const core::ComError& error) {
                // A cancelled dialog raises "User Cancelled" and sets UnloadRequest; it is
                // answered below as a cancel. Anything else goes on to the error report.
                if (error.number() != core::ErrorNumber::UserCancelled || !report->UnloadRequest())
                    throw;
            }
            if (report->UnloadRequest()) {
                report->UnloadRequest(false);
                d->raiseReportSourceError(QString(), OpenReportFailed, false);
            } else {
                d->control->setReportSource(report->GetReport());
                d->control->setZoom(100);
                d->control->viewReport();
            }
        }
    } catch (const core::ComError& error) {
        errorNumber = error.number();
    } catch (const std::exception& error) {
        qCWarning(lcViewer) << "ShowReport failed:" << error.what();
        errorNumber = RuntimeFailure;
    }
    if (self && report && report->UnloadRequest()) {
        report->UnloadRequest(false);
        const bool connectionFailed
            = errorNumber == ServerError || errorNumber == TableConnectionFailed;
        d->raiseReportSourceError(
            QString(), connectionFailed ? ServerError : RuntimeFailure, false);
    }
    return false;
}

int32_t MoxViewer115::GetCurrentPageNumber()
{
    return d->control->currentPageNumber();
}

void MoxViewer115::ShowFirstPage()
{
    d->control->showFirstPage();
}

void MoxViewer115::ShowLastPage()
{
    d->control->showLastPage();
}

void MoxViewer115::ShowNextPage()
{
    d->control->showNextPage();
}

void MoxViewer115::ShowPreviousPage()
{
    d->control->showPreviousPage();
}

void MoxViewer115::ShowNthPage(int16_t PageNumber)
{
    d->control->showNthPage(PageNumber);
}

int16_t MoxViewer115::ActiveViewIndex() const
{
    return static_cast<int16_t>(d->control->activeViewIndex());
}

bool MoxViewer115::IsBusy() const
{
    return d->control->isBusy();
}

bool MoxViewer115::Exporting() const
{
    return IsBusy();
}

void MoxViewer115::PrintReport()
{
    d->control->printReport();
}

int16_t MoxViewer115::Copies() const
{
    return d->mCopies;
}

void MoxViewer115::Copies(int16_t Copyes)
{
    d->mCopies = Copyes;
}

runtime::ViewerControl& MoxViewer115::control() const
{
    return *d->control;
}

bool MoxViewer115::isNotifying() const
{
    return d->notifying > 0;
}

void MoxViewer115::resizeEvent(QResizeEvent* event)
{
    QWidget::resizeEvent(event);
    if (QWidget* view = d->control->widget())
        view->setGeometry(0, 0, event->size().width(), event->size().height());
}

} // namespace viewer
