#include "reportrt/viewer/reportviewer.h"

#include "core/comerror.h"
#include "core/dictionary.h"
#include "platform/display.h"
#include "reportrt/base/runtimeerror.h"
#include "reportrt/exportoptions.h"
#include "reportrt/layout/valueformatter.h"
#include "reportrt/output/reportexporter.h"
#include "reportrt/output/reportprinter.h"
#include "reportrt/report.h"
#include "reportrt/section.h"
#include "reportrt/viewer/pageview.h"
#include "reportrt/viewer/viewerlogging_p.h"
#include "reportrt/viewer/viewerpages.h"
#include "runtime/databasetable.h"
#include "runtime/exportdestination.h"
#include "runtime/reportobject.h"
#include "runtime/viewernotifications.h"

#include <QAction>
#include <QApplication>
#include <QComboBox>
#include <QElapsedTimer>
#include <QFileDialog>
#include <QIntValidator>
#include <QKeyEvent>
#include <QLabel>
#include <QLineEdit>
#include <QMenu>
#include <QScrollBar>
#include <QTabBar>
#include <QToolBar>
#include <QToolButton>
#include <QVBoxLayout>
#include <algorithm>

namespace reportrt {

namespace {

/// Thrown from the page sink to stop a layout that is no longer wanted.
struct LayoutCancelled { };

/// How long layout may keep the event loop waiting.
constexpr qint64 sliceMilliseconds = 30;

// Key codes and shift bits as the container's key-down notification carries them.
constexpr int16_t keyPageUp = 33;
constexpr int16_t keyPageDown = 34;
constexpr int16_t keyEnd = 35;
constexpr int16_t keyHome = 36;
constexpr int16_t keyUp = 38;
constexpr int16_t keyDown = 40;
constexpr int16_t keyF = 70;
constexpr int16_t keyP = 80;
constexpr int16_t keyF3 = 114;
constexpr int16_t keyF5 = 116;
constexpr int16_t shiftBit = 1;
constexpr int16_t ctrlBit = 2;
constexpr int16_t altBit = 4;

int16_t keyCodeOf(int key)
{
    if ((key >= Qt::Key_A && key <= Qt::Key_Z) || (key >= Qt::Key_0 && key <= Qt::Key_9))
        return static_cast<int16_t>(key);
    if (key >= Qt::Key_F1 && key <= Qt::Key_F12)
        return static_cast<int16_t>(112 + (key - Qt::Key_F1));
    switch (key) {
    case Qt::Key_Backspace:
        return 8;
    case Qt::Key_Tab:
        return 9;
    case Qt::Key_Return:
    case Qt::Key_Enter:
        return 13;
    case Qt::Key_Escape:
        return 27;
    case Qt::Key_Space:
        return 32;
    case Qt::Key_PageUp:
        return keyPageUp;
    case Qt::Key_PageDown:
        return keyPageDown;
    case Qt::Key_End:
        return keyEnd;
    case Qt::Key_Home:
        return keyHome;
    case Qt::Key_Left:
        return 37;
    case Qt::Key_Up:
        return keyUp;
    case Qt::Key_Right:
        return 39;
    case Qt::Key_Down:
        return keyDown;
    case Qt::Key_Delete:
        return 46;
    default:
        return 0;
    }
}

/// Counts the control's own handlers on the stack, so destroying the control from inside
/// one (a notification handler may) defers deleting the widget that is dispatching.
class DepthGuard {
public:
    explicit DepthGuard(std::shared_ptr<int> depth)
        : m_depth(std::move(depth))
    {
        ++*m_depth;
    }
    ~DepthGuard() { --*m_depth; }
    DepthGuard(const DepthGuard&) = delete;
    DepthGuard& operator=(const DepthGuard&) = delete;

private:
    std::shared_ptr<int> m_depth;
};

QString connectionValue(const runtime::Report& report, std::initializer_list<QStringView> names)
{
    const auto tables = report.databaseTables();
    if (tables.empty())
        return {};
    for (const auto& [name, value] : tables.front()->connectionProperties()) {
        for (QStringView wanted : names) {
            if (name.compare(wanted, Qt::CaseInsensitive) == 0)
                return value.toText();
        }
    }
    return {};
}

} // namespace

ReportViewer::ReportViewer()
{
    if (!qobject_cast<QApplication*>(QCoreApplication::instance()))
        raiseError(Error::RuntimeFailure,
            QStringLiteral("The report viewer needs a QApplication: create one before the "
                           "viewer control."));
    buildWidget();
}

ReportViewer::~ReportViewer()
{
    *m_alive = false;
    for (const auto& view : m_views)
        view->cancel();
    if (m_widget) {
        m_widget->hide();
        // A handler of the widget's own event may be what destroys the control.
        if (*m_eventDepth > 0 || m_runDepth > 0)
            m_widget->deleteLater();
        else
            delete m_widget.data();
    }
}

template <typename Call> bool ReportViewer::notify(Call call)
{
    if (!m_notifications)
        return true;
    const auto alive = m_alive;
    call(*m_notifications);
    return *alive;
}

void ReportViewer::buildWidget()
{
    m_widget = new QWidget;
    m_widget->setObjectName(QStringLiteral("ReportViewer"));
    auto* layout = new QVBoxLayout(m_widget);
    layout->setContentsMargins(0, 0, 0, 0);
    layout->setSpacing(0);

    auto* toolBar = new QToolBar(m_widget);
    const auto guarded = [this](auto handler) {
        return [this, handler, depth = m_eventDepth] {
            const DepthGuard guard(depth);
            handler();
        };
    };
    const auto button = [&](const QString& text, const QString& name, auto handler) {
        QAction* action = toolBar->addAction(text);
        action->setObjectName(name);
        QObject::connect(action, &QAction::triggered, m_widget, guarded(handler));
        return action;
    };
    button(QStringLiteral("|<"), QStringLiteral("firstPage"), [this] {
        bool useDefault = true;
        if (notify([&](auto& n) { n.firstPageButtonClicked(useDefault); }) && useDefault)
            showFirstPage();
    });
    button(QStringLiteral("<"), QStringLiteral("previousPage"), [this] {
        bool useDefault = true;
        if (notify([&](auto& n) { n.prevPageButtonClicked(useDefault); }) && useDefault)
            showPreviousPage();
    });
    m_pageBox = new QLineEdit(toolBar);
    m_pageBox->setObjectName(QStringLiteral("pageBox"));
    m_pageBox->setValidator(new QIntValidator(1, 32767, m_pageBox));
    m_pageBox->setMaximumWidth(60);
    toolBar->addWidget(m_pageBox);
    QObject::connect(
        m_pageBox, &QLineEdit::returnPressed, m_widget, guarded([this] { onPageBox(); }));
    button(QStringLiteral(">"), QStringLiteral("nextPage"), [this] {
        bool useDefault = true;
        if (notify([&](auto& n) { n.nextPageButtonClicked(useDefault); }) && useDefault)
            showNextPage();
    });
    button(QStringLiteral(">|"), QStringLiteral("lastPage"), [this] {
        bool useDefault = true;
        if (notify([&](auto& n) { n.lastPageButtonClicked(useDefault); }) && useDefault)
            showLastPage();
    });
    toolBar->addSeparator();
    button(QStringLiteral("Print"), QStringLiteral("print"), [this] { onPrintButton(); });
    auto* exportMenu = new QMenu(m_widget);
    const auto exportItem = [&](const QString& text, runtime::ExportFormat format) {
        QAction* action = exportMenu->addAction(text);
        QObject::connect(action, &QAction::triggered, m_widget,
            guarded([this, format] { onExportButton(format); }));
    };
    exportItem(QStringLiteral("PDF..."), runtime::ExportFormat::PDF);
    exportItem(QStringLiteral("Excel..."), runtime::ExportFormat::Excel);
    exportItem(QStringLiteral("HTML..."), runtime::ExportFormat::HTML);
    auto* exportButton = new QToolButton(toolBar);
    exportButton->setObjectName(QStringLiteral("export"));
    exportButton->setText(QStringLiteral("Export"));
    exportButton->setMenu(exportMenu);
    exportButton->setPopupMode(QToolButton::InstantPopup);
    toolBar->addWidget(exportButton);
    button(QStringLiteral("Refresh"), QStringLiteral("refresh"), [this] { onRefreshButton(); });
    toolBar->addSeparator();
    m_zoomBox = new QComboBox(toolBar);
    m_zoomBox->setObjectName(QStringLiteral("zoomBox"));
    m_zoomBox->setEditable(true);
    m_zoomBox->addItem(QStringLiteral("Page width"), PageView::fitWidth);
    m_zoomBox->addItem(QStringLiteral("Whole page"), PageView::fitPage);
    for (int percent : { 25, 50, 75, 100, 150, 200, 400 })
        m_zoomBox->addItem(QStringLiteral("%1%").arg(percent), percent);
    m_zoomBox->setCurrentIndex(m_zoomBox->findData(100));
    toolBar->addWidget(m_zoomBox);
    QObject::connect(m_zoomBox, &QComboBox::activated, m_widget, guarded([this] { onZoomBox(); }));
    QAction* continuous = button(QStringLiteral("Continuous"), QStringLiteral("continuous"), [] {});
    continuous->setCheckable(true);
    continuous->setChecked(true);
    QObject::connect(
        continuous, &QAction::toggled, m_widget, [this](bool checked) { setContinuous(checked); });
    toolBar->addSeparator();
    m_searchBox = new QLineEdit(toolBar);
    m_searchBox->setObjectName(QStringLiteral("searchBox"));
    m_searchBox->setPlaceholderText(QStringLiteral("Find"));
    m_searchBox->setMaximumWidth(160);
    toolBar->addWidget(m_searchBox);
    QObject::connect(
        m_searchBox, &QLineEdit::returnPressed, m_widget, guarded([this] { onSearchButton(); }));
    button(QStringLiteral("Find"), QStringLiteral("find"), [this] { onSearchButton(); });
    layout->addWidget(toolBar);

    m_tabs = new QTabBar(m_widget);
    m_tabs->setObjectName(QStringLiteral("views"));
    m_tabs->setTabsClosable(true);
    m_tabs->setVisible(false);
    layout->addWidget(m_tabs);
    QObject::connect(
        m_tabs, &QTabBar::tabBarClicked, m_widget, [this, depth = m_eventDepth](int index) {
            const DepthGuard guard(depth);
            if (index >= 0)
                activate(index + 1);
        });
    QObject::connect(
        m_tabs, &QTabBar::tabCloseRequested, m_widget, [this, depth = m_eventDepth](int index) {
            const DepthGuard guard(depth);
            closeView(index + 1);
        });

    m_message = new QLabel(m_widget);
    m_message->setObjectName(QStringLiteral("message"));
    m_message->setWordWrap(true);
    m_message->setAlignment(Qt::AlignCenter);
    m_message->setVisible(false);
    layout->addWidget(m_message);

    m_pageView = new PageView(m_widget);
    m_pageView->setObjectName(QStringLiteral("pages"));
    layout->addWidget(m_pageView, 1);
    QObject::connect(
        m_pageView, &PageView::currentPageChanged, m_widget, [this] { updateStatus(); });
    QObject::connect(
        m_pageView, &PageView::zoomStepped, m_widget, [this, depth = m_eventDepth](int steps) {
            const DepthGuard guard(depth);
            stepZoom(steps);
        });
    QObject::connect(m_pageView, &PageView::keyPressed, m_widget,
        [this, depth = m_eventDepth](QKeyEvent* event) {
            const DepthGuard guard(depth);
            onKey(event);
        });
    QObject::connect(m_pageView, &PageView::pageClicked, m_widget,
        [this, depth = m_eventDepth](const QPoint& point) {
            const DepthGuard guard(depth);
            onClicked(point);
        });
    QObject::connect(m_pageView, &PageView::pageDoubleClicked, m_widget,
        [this, depth = m_eventDepth](const QPoint& point) {
            const DepthGuard guard(depth);
            onDoubleClicked(point);
        });
    QObject::connect(
        m_pageView, &PageView::focusChanged, m_widget, [this, depth = m_eventDepth](bool hasFocus) {
            const DepthGuard guard(depth);
            if (!notify([&](auto& n) { n.focusChanged(hasFocus); }))
                return;
            if (hasFocus)
                notify([](auto& n) { n.gotFocus(); });
            else
                notify([](auto& n) { n.lostFocus(); });
        });
    QObject::connect(m_pageView, &PageView::resized, m_widget, [this, depth = m_eventDepth] {
        const DepthGuard guard(depth);
        notify([](auto& n) { n.resized(); });
    });

    m_status = new QLabel(m_widget);
    m_status->setObjectName(QStringLiteral("status"));
    layout->addWidget(m_status);
    updateStatus();
}

QWidget* ReportViewer::widget()
{
    return m_widget;
}

void ReportViewer::setNotifications(runtime::ViewerNotifications* notifications)
{
    m_notifications = notifications;
}

std::shared_ptr<runtime::Report> ReportViewer::reportSource() const
{
    return m_source;
}

void ReportViewer::setReportSource(std::shared_ptr<runtime::Report> report)
{
    cancelLayouts();
    const int32_t before = activeViewIndex();
    m_views.clear();
    m_active = 0;
    m_source = std::move(report);
    clearSearch();
    showMessage({});
    if (m_tabs) {
        while (m_tabs->count() > 0)
            m_tabs->removeTab(0);
        m_tabs->setVisible(false);
    }
    showActive();
    if (before > 1)
        notify([&](auto& n) { n.viewChanged(before, 1); });
}

int32_t ReportViewer::zoom() const
{
    return m_zoom;
}

void ReportViewer::setZoom(int32_t percent)
{
    m_zoom = percent == PageView::fitWidth || percent == PageView::fitPage
        ? percent
        : std::clamp<int32_t>(percent, PageView::minimumPercent, PageView::maximumPercent);
    if (m_pageView)
        m_pageView->setZoom(m_zoom);
    if (m_zoomBox) {
        const int index = m_zoomBox->findData(m_zoom);
        if (index >= 0)
            m_zoomBox->setCurrentIndex(index);
        else
            m_zoomBox->setEditText(QStringLiteral("%1%").arg(m_zoom));
    }
}

int32_t ReportViewer::effectiveZoom() const
{
    return m_pageView ? m_pageView->effectivePercent() : m_zoom;
}

void ReportViewer::stepZoom(int steps)
{
    // Each wheel step zooms by a tenth, from what is shown (fitted zooms too).
    double percent = effectiveZoom();
    for (int i = 0; i < std::abs(steps); ++i)
        percent = steps > 0 ? percent * 1.1 : percent / 1.1;
    setZoom(static_cast<int32_t>(std::lround(percent)));
}

void ReportViewer::setContinuous(bool continuous)
{
    if (m_pageView)
        m_pageView->setContinuous(continuous);
}

void ReportViewer::viewReport()
{
    cancelLayouts();
    clearSearch();
    showMessage({});
    if (!m_source) {
        QString message = QStringLiteral("No report source is set.");
        int32_t code = Error::RuntimeFailure;
        bool useDefault = true;
        if (notify([&](auto& n) { n.reportSourceError(message, code, useDefault); }) && useDefault)
            showMessage(message);
        return;
    }
    auto report = std::dynamic_pointer_cast<Report>(m_source);
    if (!report) {
        reportError(core::ComError(Error::RuntimeFailure, errorSource(),
            QStringLiteral("The report source is not a report of this runtime.")));
        return;
    }
    const int32_t before = activeViewIndex();
    m_views.clear();
    m_views.push_back(std::make_shared<ViewerPages>(report, -1, report->title()));
    m_active = 0;
    if (m_tabs) {
        while (m_tabs->count() > 0)
            m_tabs->removeTab(0);
        m_tabs->addTab(report->title().isEmpty() ? QStringLiteral("Report") : report->title());
        m_tabs->setTabButton(0, QTabBar::RightSide, nullptr);
        m_tabs->setVisible(false);
    }
    m_views.front()->setNeedsLayout(true);
    m_views.front()->setState(LayoutState::Running);
    showActive();
    if (before > 1 && !notify([&](auto& n) { n.viewChanged(before, 1); }))
        return;
    scheduleLayout();
}

void ReportViewer::refreshView(bool rereadData)
{
    if (m_views.empty()) {
        viewReport();
        return;
    }
    if (rereadData) {
        // Group nodes of drill-down views mean nothing in the records read anew.
        cancelLayouts();
        active()->report().discardSavedData();
        viewReport();
        return;
    }
    const auto view = active();
    view->cancel();
    view->setNeedsLayout(true);
    view->setState(LayoutState::Running);
    clearSearch();
    showActive();
    scheduleLayout();
}

void ReportViewer::cancelLayouts()
{
    for (const auto& view : m_views) {
        view->cancel();
        view->setNeedsLayout(false);
    }
    m_lastPageWhenDone = false;
}

void ReportViewer::scheduleLayout()
{
    // A layout already running picks the waiting views up when it ends; one that was
    // cancelled unwinds first, so two layouts of one report never interleave.
    if (m_runDepth > 0 || m_scheduled)
        return;
    m_scheduled = true;
    std::weak_ptr<bool> alive = m_alive;
    QMetaObject::invokeMethod(
        QCoreApplication::instance(),
        [this, alive] {
            const auto token = alive.lock();
            if (!token || !*token)
                return;
            m_scheduled = false;
            runLayouts();
        },
        Qt::QueuedConnection);
}

void ReportViewer::runLayouts()
{
    if (m_runDepth > 0)
        return;
    const auto alive = m_alive;
    ++m_runDepth;
    for (;;) {
        const auto next = std::find_if(m_views.begin(), m_views.end(),
            [](const std::shared_ptr<ViewerPages>& view) { return view->needsLayout(); });
        if (next == m_views.end())
            break;
        const std::shared_ptr<ViewerPages> view = *next;
        if (!runLayout(view) || !*alive)
            return; // the control is gone: nothing of it may be touched
    }
    --m_runDepth;
}

bool ReportViewer::runLayout(const std::shared_ptr<ViewerPages>& view)
{
    const auto alive = m_alive;
    view->setState(LayoutState::Running);
    if (!notify([](auto& n) { n.downloadStarted(1); }))
        return false;
    if (view->isCancelRequested() && !view->needsLayout())
        return true;
    std::optional<core::ComError> failure;
    QElapsedTimer slice;
    slice.start();
    bool cancelled = false;
    try {
        view->layOut([&] {
            const bool first = view->pages().size() == 1;
            if (first && view == active())
                pagesGrew();
            if (slice.elapsed() < sliceMilliseconds)
                return;
            if (view == active())
                pagesGrew();
            QCoreApplication::processEvents();
            slice.restart();
            if (!*alive || view->isCancelRequested())
                throw LayoutCancelled();
        });
    } catch (const LayoutCancelled&) {
        cancelled = true;
    } catch (const core::ComError& error) {
        failure = error;
    } catch (const std::exception& error) {
        failure = core::ComError(
            Error::RuntimeFailure, errorSource(), QString::fromLocal8Bit(error.what()));
    }
    if (!*alive)
        return false;
    if (cancelled) {
        qCDebug(lcViewer, "layout of view stopped after %d page(s)",
            static_cast<int>(view->pages().size()));
        if (!view->needsLayout())
            view->setState(LayoutState::Idle);
    } else {
        view->setState(failure ? LayoutState::Failed : LayoutState::Complete);
    }
    if (view == active()) {
        pagesGrew();
        if (m_lastPageWhenDone && view->state() == LayoutState::Complete) {
            m_lastPageWhenDone = false;
            goTo(static_cast<int>(view->pages().size()) - 1);
        }
    }
    if (!notify([](auto& n) { n.downloadFinished(1); }))
        return false;
    if (failure) {
        reportError(*failure);
        return *alive;
    }
    return true;
}

void ReportViewer::reportError(const core::ComError& error)
{
    qCWarning(lcViewer, "the report cannot be shown: %ls (%08x)",
        qUtf16Printable(error.description()), static_cast<uint32_t>(error.number()));
    if (error.number() == Error::TableConnectionFailed && m_source) {
        const QString server = connectionValue(*m_source, { u"Data Source", u"Server" });
        const QString database = connectionValue(*m_source, { u"Initial Catalog", u"Database" });
        if (!notify([&](auto& n) { n.databaseLogonFailed(server, database); }))
            return;
    }
    QString message = error.description();
    int32_t code = error.number();
    bool useDefault = true;
    if (!notify([&](auto& n) { n.reportSourceError(message, code, useDefault); }))
        return;
    if (useDefault)
        showMessage(QStringLiteral("%1\n(error 0x%2)")
                        .arg(message)
                        .arg(static_cast<uint32_t>(code), 8, 16, QChar(u'0')));
}

void ReportViewer::showMessage(const QString& text)
{
    if (!m_message)
        return;
    m_message->setText(text);
    m_message->setVisible(!text.isEmpty());
}

QString ReportViewer::messageText() const
{
    return m_message && m_message->isVisible() ? m_message->text() : QString();
}

std::shared_ptr<ViewerPages> ReportViewer::active() const
{
    return m_active < m_views.size() ? m_views[m_active] : nullptr;
}

const ViewerPages* ReportViewer::activePages() const
{
    return active().get();
}

void ReportViewer::showActive()
{
    if (m_pageView) {
        m_pageView->setPages(active());
        m_pageView->setZoom(m_zoom);
    }
    if (m_tabs && m_active < static_cast<size_t>(m_tabs->count()))
        m_tabs->setCurrentIndex(static_cast<int>(m_active));
    updateStatus();
}

void ReportViewer::pagesGrew()
{
    if (m_pageView)
        m_pageView->pagesChanged();
    updateStatus();
}

void ReportViewer::updateStatus()
{
    if (!m_status)
        return;
    m_status->setText(statusText());
    if (m_pageBox && !m_pageBox->hasFocus())
        m_pageBox->setText(pageCount() > 0 ? QString::number(currentPageNumber()) : QString());
}

QString ReportViewer::statusText() const
{
    const auto view = active();
    if (!view)
        return QStringLiteral("No report");
    const auto count = static_cast<int>(view->pages().size());
    QString text;
    if (count == 0)
        text = view->state() == LayoutState::Running ? QStringLiteral("Laying out pages...")
                                                     : QStringLiteral("No pages");
    else
        text = QStringLiteral("Page %1 of %2%3")
                   .arg(currentPageNumber())
                   .arg(count)
                   .arg(view->state() == LayoutState::Running ? QStringLiteral("+") : QString());
    const runtime::PrintingStatus status = view->report().printingStatus();
    text += QStringLiteral("    Records: %1 read, %2 selected")
                .arg(status.recordsRead)
                .arg(status.recordsSelected);
    if (!m_searchText.isEmpty())
        text += m_hits.empty()
            ? QStringLiteral("    No matches")
            : QStringLiteral("    %1 of %2").arg(m_currentHit + 1).arg(m_hits.size());
    return text;
}

int32_t ReportViewer::currentPageNumber() const
{
    if (!active() || active()->pages().empty() || !m_pageView)
        return 0;
    return m_pageView->currentPage() + 1;
}

int32_t ReportViewer::pageCount() const
{
    return active() ? static_cast<int32_t>(active()->pages().size()) : 0;
}

ReportViewer::LayoutState ReportViewer::layoutState() const
{
    return active() ? active()->state() : LayoutState::Idle;
}

bool ReportViewer::isBusy() const
{
    return layoutState() == LayoutState::Running;
}

void ReportViewer::goTo(int index)
{
    if (m_pageView && pageCount() > 0)
        m_pageView->showPage(std::clamp(index, 0, pageCount() - 1));
    updateStatus();
}

void ReportViewer::showFirstPage()
{
    goTo(0);
}

void ReportViewer::showLastPage()
{
    // The last page is not known before layout ends: show it then.
    if (isBusy())
        m_lastPageWhenDone = true;
    goTo(pageCount() - 1);
}

void ReportViewer::showNextPage()
{
    goTo(currentPageNumber());
}

void ReportViewer::showPreviousPage()
{
    goTo(currentPageNumber() - 2);
}

void ReportViewer::showNthPage(int32_t pageNumber)
{
    if (pageNumber >= 1 && pageNumber <= pageCount())
        goTo(pageNumber - 1);
}

int32_t ReportViewer::activeViewIndex() const
{
    return m_views.empty() ? 1 : static_cast<int32_t>(m_active) + 1;
}

int32_t ReportViewer::viewCount() const
{
    return static_cast<int32_t>(m_views.size());
}

void ReportViewer::setActiveViewIndex(int32_t index)
{
    activate(index);
}

void ReportViewer::activate(int32_t index)
{
    if (index < 1 || index > viewCount() || index == activeViewIndex())
        return;
    const int32_t before = activeViewIndex();
    m_active = static_cast<size_t>(index - 1);
    clearSearch();
    showActive();
    notify([&](auto& n) { n.viewChanged(before, index); });
}

void ReportViewer::closeView(int32_t index)
{
    if (index < 2 || index > viewCount())
        return;
    const int32_t before = activeViewIndex();
    const size_t at = static_cast<size_t>(index - 1);
    m_views[at]->cancel();
    m_views[at]->setNeedsLayout(false);
    m_views.erase(m_views.begin() + static_cast<std::ptrdiff_t>(at));
    if (m_tabs) {
        m_tabs->removeTab(index - 1);
        m_tabs->setVisible(m_views.size() > 1);
    }
    if (before == index)
        m_active = 0;
    else if (before > index)
        --m_active;
    clearSearch();
    showActive();
    if (before == index)
        notify([&](auto& n) { n.viewChanged(before, 1); });
}

int32_t ReportViewer::drillDown(int groupNode)
{
    const auto main = m_views.empty() ? nullptr : m_views.front();
    const RecordProcessor::Result* result = main ? main->report().result() : nullptr;
    if (!result || groupNode < 0 || static_cast<size_t>(groupNode) >= result->groups.size())
        raiseError(Error::RuntimeFailure,
            QStringLiteral("The report shown has no group %1 to drill down into.").arg(groupNode));
    const auto& node = result->groups[static_cast<size_t>(groupNode)];
    const QString title
        = node.key.isNull() ? QStringLiteral("(empty)") : ValueFormatter().format(node.key, {});
    auto view = std::make_shared<ViewerPages>(main->report().self(), groupNode, title);
    view->setNeedsLayout(true);
    view->setState(LayoutState::Running);
    m_views.push_back(view);
    if (m_tabs) {
        m_tabs->addTab(title);
        m_tabs->setVisible(true);
    }
    const auto index = static_cast<int32_t>(m_views.size());
    activate(index);
    scheduleLayout();
    return index;
}

void ReportViewer::printReport()
{
    const auto view = active();
    if (!view)
        raiseError(Error::RuntimeFailure, QStringLiteral("There is no report to print."));
    ReportPrinter::printOut(view->report(), platform::Display::isInteractive(), 1, true,
        std::nullopt, view->groupNode());
}

void ReportViewer::onPrintButton()
{
    bool useDefault = true;
    if (!notify([&](auto& n) { n.printButtonClicked(useDefault); }) || !useDefault)
        return;
    try {
        printReport();
    } catch (const core::ComError& error) {
        showMessage(error.description());
    }
}

void ReportViewer::exportTo(runtime::ExportFormat format, const QString& path)
{
    const auto view = active();
    if (!view)
        raiseError(Error::RuntimeFailure, QStringLiteral("There is no report to export."));
    // Options of its own: the host's export settings of the report stay as they were.
    ExportOptions options;
    options.setFormatType(static_cast<int32_t>(format));
    options.setDestinationType(static_cast<int32_t>(runtime::ExportDestination::DiskFile));
    options.setDiskFileName(path);
    if (format == runtime::ExportFormat::HTML)
        options.setHtmlFileName(path);
    ReportExporter::exportReport(view->report(), options, false);
}

void ReportViewer::onExportButton(runtime::ExportFormat format)
{
    if (!platform::Display::isInteractive()) {
        // Nobody could answer a file dialog.
        showMessage(QStringLiteral("Exporting needs a display to choose the file."));
        return;
    }
    const QString filter = format == runtime::ExportFormat::PDF ? QStringLiteral("PDF (*.pdf)")
        : format == runtime::ExportFormat::Excel                ? QStringLiteral("Excel (*.xlsx)")
                                                                : QStringLiteral("HTML (*.html)");
    const auto alive = m_alive;
    const QString path
        = QFileDialog::getSaveFileName(m_widget, QStringLiteral("Export"), {}, filter);
    if (!*alive || path.isEmpty())
        return;
    try {
        exportTo(format, path);
    } catch (const core::ComError& error) {
        showMessage(error.description());
    }
}

void ReportViewer::onRefreshButton()
{
    bool useDefault = true;
    if (!notify([&](auto& n) { n.refreshButtonClicked(useDefault); }) || !useDefault)
        return;
    refreshView(true);
}

void ReportViewer::clearSearch()
{
    m_searchText.clear();
    m_hits.clear();
    m_currentHit = -1;
    if (m_pageView)
        m_pageView->setHits({}, -1);
}

int32_t ReportViewer::searchForText(const QString& text)
{
    clearSearch();
    const auto view = active();
    if (!view || text.trimmed().isEmpty()) {
        updateStatus();
        return 0;
    }
    m_searchText = text;
    m_hits = PageSearch::find(view->pages(), text);
    if (!m_hits.empty()) {
        // The first hit from the page shown on.
        const int from = m_pageView ? m_pageView->currentPage() : 0;
        const auto next = std::find_if(m_hits.begin(), m_hits.end(),
            [from](const PageSearch::Hit& hit) { return hit.page >= from; });
        m_currentHit = next == m_hits.end() ? 0 : static_cast<int32_t>(next - m_hits.begin());
    }
    if (m_pageView)
        m_pageView->setHits(m_hits, m_currentHit);
    updateStatus();
    return static_cast<int32_t>(m_hits.size());
}

void ReportViewer::findNext(bool backwards)
{
    if (m_hits.empty()) {
        if (m_searchBox && !m_searchBox->text().isEmpty() && m_searchText.isEmpty())
            onSearchButton();
        return;
    }
    const auto count = static_cast<int32_t>(m_hits.size());
    m_currentHit = (m_currentHit + (backwards ? count - 1 : 1)) % count;
    if (m_pageView)
        m_pageView->setHits(m_hits, m_currentHit);
    updateStatus();
}

void ReportViewer::onSearchButton()
{
    QString text = m_searchBox ? m_searchBox->text() : QString();
    bool useDefault = true;
    if (!notify([&](auto& n) { n.searchButtonClicked(text, useDefault); }) || !useDefault)
        return;
    if (m_searchBox)
        m_searchBox->setText(text);
    searchForText(text);
}

void ReportViewer::onPageBox()
{
    bool ok = false;
    const int number = m_pageBox ? m_pageBox->text().toInt(&ok) : 0;
    if (!ok)
        return;
    bool useDefault = true;
    auto page = static_cast<int16_t>(number);
    if (!notify([&](auto& n) { n.goToPageNClicked(useDefault, page); }) || !useDefault)
        return;
    showNthPage(page);
    updateStatus();
}

void ReportViewer::onZoomBox()
{
    if (!m_zoomBox)
        return;
    const QVariant data = m_zoomBox->currentData();
    if (data.isValid()
        && m_zoomBox->currentText() == m_zoomBox->itemText(m_zoomBox->currentIndex())) {
        setZoom(data.toInt());
        return;
    }
    QString text = m_zoomBox->currentText();
    text.remove(u'%');
    bool ok = false;
    const int percent = text.trimmed().toInt(&ok);
    if (ok)
        setZoom(percent);
}

void ReportViewer::onKey(QKeyEvent* event)
{
    int16_t code = keyCodeOf(event->key());
    int16_t shift = 0;
    if (event->modifiers() & Qt::ShiftModifier)
        shift |= shiftBit;
    if (event->modifiers() & Qt::ControlModifier)
        shift |= ctrlBit;
    if (event->modifiers() & Qt::AltModifier)
        shift |= altBit;
    if (code == 0)
        return;
    if (!notify([&](auto& n) { n.keyDown(code, shift); }))
        return;
    QScrollBar* bar = m_pageView ? m_pageView->verticalScrollBar() : nullptr;
    switch (code) {
    case keyPageUp:
        showPreviousPage();
        break;
    case keyPageDown:
        showNextPage();
        break;
    case keyHome:
        showFirstPage();
        break;
    case keyEnd:
        showLastPage();
        break;
    case keyUp:
        if (bar)
            bar->triggerAction(QAbstractSlider::SliderSingleStepSub);
        break;
    case keyDown:
        if (bar)
            bar->triggerAction(QAbstractSlider::SliderSingleStepAdd);
        break;
    case keyF:
        if ((shift & ctrlBit) && m_searchBox) {
            m_searchBox->setFocus();
            m_searchBox->selectAll();
        }
        break;
    case keyP:
        if (shift & ctrlBit)
            onPrintButton();
        break;
    case keyF3:
        findNext(shift & shiftBit);
        break;
    case keyF5:
        onRefreshButton();
        break;
    default:
        break;
    }
}

void ReportViewer::onClicked(const QPoint& point)
{
    const auto view = active();
    core::Variant info;
    QPointF twips;
    const int index = m_pageView && view ? m_pageView->pageAt(point, &twips) : -1;
    if (index >= 0) {
        const Page& page = view->pages()[static_cast<size_t>(index)];
        auto dictionary = std::make_shared<core::Dictionary>();
        for (const Page::Band& band : page.bands) {
            if (!band.rect.contains(twips))
                continue;
            dictionary->add(core::Variant(QStringLiteral("section")), core::Variant(band.section));
            if (band.groupNode >= 0)
                dictionary->add(core::Variant(QStringLiteral("groupNode")),
                    core::Variant(static_cast<int32_t>(band.groupNode)));
            // The object whose designed frame holds the point.
            for (const auto& section : view->report().sections()) {
                if (section->name() != band.section)
                    continue;
                for (const auto& object : section->reportObjects()) {
                    const QRectF frame(band.rect.left() + object->left(),
                        band.rect.top() + object->top(), object->width(), object->height());
                    if (frame.contains(twips)) {
                        dictionary->add(core::Variant(QStringLiteral("objectName")),
                            core::Variant(object->name()));
                        break;
                    }
                }
            }
            break;
        }
        for (const Page::Text& text : page.texts) {
            const QRectF area = PageSearch::area(page,
                { index, static_cast<int>(&text - page.texts.data()), 0, text.glyphCount },
                *view->fonts());
            if (area.contains(twips)) {
                dictionary->add(core::Variant(QStringLiteral("text")),
                    core::Variant(text.text->source.left(text.glyphCount)));
                break;
            }
        }
        dictionary->add(core::Variant(QStringLiteral("page")), core::Variant(index + 1));
        if (dictionary->count() > 1)
            info = core::Variant(core::ObjectPtr(dictionary));
    }
    bool useDefault = true;
    notify([&](auto& n) { n.clicked(point.x(), point.y(), info, useDefault); });
}

void ReportViewer::onDoubleClicked(const QPoint& point)
{
    const auto view = active();
    QPointF twips;
    const int index = m_pageView && view ? m_pageView->pageAt(point, &twips) : -1;
    if (index < 0)
        return;
    for (const Page::Band& band : view->pages()[static_cast<size_t>(index)].bands) {
        if (band.groupNode >= 0 && band.rect.contains(twips)) {
            try {
                drillDown(band.groupNode);
            } catch (const core::ComError& error) {
                showMessage(error.description());
            }
            return;
        }
    }
}

void ReportViewer::takeFocus()
{
    if (m_pageView)
        m_pageView->setFocus();
}

} // namespace reportrt
