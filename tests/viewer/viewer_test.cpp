#include "core/comerror.h"
#include "core/dictionary.h"
#include "layoutfixture.h"
#include "platform/currentprinter.h"
#include "platform/printers.h"
#include "reportrt/base/runtimeerror.h"
#include "reportrt/viewer/pageview.h"
#include "reportrt/viewer/reportviewer.h"
#include "reportrt/viewer/viewerpages.h"
#include "runtime/databasetable.h"
#include "runtime/viewercontrolfactory.h"
#include "runtime/viewernotifications.h"

#include <QAction>
#include <QDir>
#include <QElapsedTimer>
#include <QLineEdit>
#include <QScrollBar>
#include <QSet>
#include <QSqlDatabase>
#include <QSqlQuery>
#include <QTest>
#include <QTimer>
#include <gtest/gtest.h>

using namespace Qt::StringLiterals;
using namespace reportrt::layouttest;
using LayoutState = runtime::ViewerControl::LayoutState;

namespace reportrt {
namespace {

/// Records every notification and answers as the test sets it up.
class Recorder : public runtime::ViewerNotifications {
public:
    QStringList events;
    bool refuse = false; // leaves every useDefault false
    bool swallowKeys = false; // sets every key code to 0
    QString replaceSearch; // the search text the handler puts in, when set
    bool cancelSearch = false;
    bool showOwnMessage = true;
    int32_t errorCode = 0;
    QString errorMessage;
    core::Variant lastClickInfo;
    std::function<void()> onDownloadStarted;

    void printButtonClicked(bool& useDefault) override { answer(u"print"_s, useDefault); }
    void downloadStarted(int32_t) override
    {
        events << u"downloadStarted"_s;
        if (onDownloadStarted)
            onDownloadStarted();
    }
    void downloadFinished(int32_t) override { events << u"downloadFinished"_s; }
    void viewChanged(int32_t oldIndex, int32_t newIndex) override
    {
        events << u"viewChanged %1 %2"_s.arg(oldIndex).arg(newIndex);
    }
    void searchButtonClicked(QString& text, bool& useDefault) override
    {
        events << u"search "_s + text;
        if (!replaceSearch.isEmpty())
            text = replaceSearch;
        if (cancelSearch)
            useDefault = false;
    }
    void firstPageButtonClicked(bool& useDefault) override { answer(u"first"_s, useDefault); }
    void lastPageButtonClicked(bool& useDefault) override { answer(u"last"_s, useDefault); }
    void nextPageButtonClicked(bool& useDefault) override { answer(u"next"_s, useDefault); }
    void prevPageButtonClicked(bool& useDefault) override { answer(u"previous"_s, useDefault); }
    void goToPageNClicked(bool& useDefault, int16_t& page) override
    {
        answer(u"goto %1"_s.arg(page), useDefault);
    }
    void clicked(int32_t, int32_t, core::Variant& info, bool&) override
    {
        events << u"clicked"_s;
        lastClickInfo = info;
    }
    void keyDown(int16_t& code, int16_t& shift) override
    {
        events << u"key %1 %2"_s.arg(code).arg(shift);
        if (swallowKeys)
            code = 0;
    }
    void reportSourceError(QString& message, int32_t& code, bool& useDefault) override
    {
        events << u"reportSourceError"_s;
        errorMessage = message;
        errorCode = code;
        useDefault = showOwnMessage;
    }
    void databaseLogonFailed(const QString&, const QString&) override
    {
        events << u"databaseLogonFailed"_s;
    }

private:
    void answer(const QString& name, bool& useDefault)
    {
        events << name;
        if (refuse)
            useDefault = false;
    }
};

/// Waits, serving events, until the viewer's layout is no longer running.
bool waitForLayout(const ReportViewer& viewer, int timeoutMs = 120000)
{
    QElapsedTimer timer;
    timer.start();
    while (viewer.layoutState() == LayoutState::Running && timer.elapsed() < timeoutMs)
        QCoreApplication::processEvents(QEventLoop::AllEvents, 20);
    return viewer.layoutState() != LayoutState::Running;
}

QJsonArray groupedSections()
{
    return { section(u"GH1"_s, 300, { fieldObject(u"{Items.Grp}"_s, 0, 0) }),
        section(u"D"_s, 300,
            { fieldObject(u"{Items.Name}"_s, 0, 0), fieldObject(u"{Items.Amount}"_s, 2500, 0) }),
        section(u"GF1"_s, 300, { textObject(u"End of group"_s, 0, 0) }) };
}

const QJsonArray byGroup { QJsonObject { { u"field"_s, u"{Items.Grp}"_s } } };

class Viewer : public testing::Test {
protected:
    void SetUp() override
    {
        viewer = std::make_unique<ReportViewer>();
        viewer->setNotifications(&recorder);
        viewer->widget()->resize(900, 700);
        viewer->widget()->show();
    }

    /// 150 items of 300 twips in the details, under a page header: four pages on A4.
    std::shared_ptr<Report> listReport(int count = 150)
    {
        return openReport(
            writeReport(m_dir,
                itemsReport({ section(u"PH"_s, 500, { textObject(u"Heading"_s, 0, 0) }),
                    section(u"D"_s, 300, { fieldObject(u"{Items.Name}"_s, 0, 0) }) })),
            itemsDatabase(m_dir, count));
    }
    std::shared_ptr<Report> groupedReport(int count, int perGroup)
    {
        return openReport(
            writeReport(m_dir, itemsReport(groupedSections(), byGroup), u"grouped.rpt"_s),
            itemsDatabase(m_dir, count, perGroup));
    }
    void show(const std::shared_ptr<Report>& report)
    {
        viewer->setReportSource(report);
        viewer->viewReport();
        ASSERT_TRUE(waitForLayout(*viewer));
    }
    QAction* action(const QString& name) { return viewer->widget()->findChild<QAction*>(name); }

    QTemporaryDir m_dir;
    Recorder recorder;
    std::unique_ptr<ReportViewer> viewer;
};

TEST_F(Viewer, TheRegisteredFactoryCreatesTheRuntimeControl)
{
    const auto control = runtime::ViewerControlFactory::create();
    ASSERT_NE(dynamic_cast<ReportViewer*>(control.get()), nullptr);
    EXPECT_EQ(control->layoutState(), LayoutState::Idle);
    EXPECT_EQ(control->pageCount(), 0);
}

TEST_F(Viewer, ShowsEveryPageTheLayoutMakes)
{
    auto report = listReport();
    const auto expected = layOut(*report);
    show(report);
    EXPECT_EQ(viewer->layoutState(), LayoutState::Complete);
    ASSERT_EQ(viewer->pageCount(), static_cast<int>(expected.size()));
    ASSERT_GE(expected.size(), 3u);
    EXPECT_EQ(viewer->currentPageNumber(), 1);
    EXPECT_TRUE(viewer->statusText().startsWith(u"Page 1 of %1 "_s.arg(expected.size())))
        << viewer->statusText().toStdString();
    EXPECT_TRUE(viewer->statusText().contains(u"150 read, 150 selected"_s));
    EXPECT_EQ(allTexts(viewer->activePages()->pages()), allTexts(expected));
    EXPECT_TRUE(recorder.events.contains(u"downloadStarted"_s));
    EXPECT_TRUE(recorder.events.contains(u"downloadFinished"_s));
}

struct NavigationCase {
    const char* name;
    const char* button; // toolbar action, or "" for the page box
    int from; // page shown before
    int expected; // page shown after, when the container leaves the default
    const char* event;
};

class Navigation : public Viewer, public testing::WithParamInterface<NavigationCase> { };

TEST_P(Navigation, MovesUnlessTheContainerHandlesTheButton)
{
    const NavigationCase& c = GetParam();
    show(listReport());
    const int last = viewer->pageCount();
    const auto resolve = [last](int page) { return page < 0 ? last + 1 + page : page; };
    for (bool refuse : { true, false }) {
        viewer->showNthPage(resolve(c.from));
        ASSERT_EQ(viewer->currentPageNumber(), resolve(c.from));
        recorder.refuse = refuse;
        recorder.events.clear();
        if (QString::fromLatin1(c.button).isEmpty()) {
            auto* box = viewer->widget()->findChild<QLineEdit*>(u"pageBox"_s);
            box->setText(QString::number(resolve(c.expected)));
            Q_EMIT box->returnPressed();
        } else {
            action(QString::fromLatin1(c.button))->trigger();
        }
        const QString event = QString::fromLatin1(c.event);
        EXPECT_EQ(recorder.events.value(0),
            event.contains(u"%1"_s) ? event.arg(resolve(c.expected)) : event);
        EXPECT_EQ(viewer->currentPageNumber(), refuse ? resolve(c.from) : resolve(c.expected))
            << (refuse ? "refused" : "default");
    }
}

// Negative pages count from the last one (-1 is the last).
INSTANTIATE_TEST_SUITE_P(Buttons, Navigation,
    testing::Values(NavigationCase { "next", "nextPage", 1, 2, "next" },
        NavigationCase { "nextOnTheLastStays", "nextPage", -1, -1, "next" },
        NavigationCase { "previous", "previousPage", 3, 2, "previous" },
        NavigationCase { "previousOnTheFirstStays", "previousPage", 1, 1, "previous" },
        NavigationCase { "first", "firstPage", 3, 1, "first" },
        NavigationCase { "last", "lastPage", 1, -1, "last" },
        NavigationCase { "goToPageN", "", 1, 3, "goto %1" }),
    [](const auto& param) { return std::string(param.param.name); });

TEST_F(Viewer, ShowNthPageIgnoresPagesTheReportDoesNotHave)
{
    show(listReport());
    viewer->showNthPage(2);
    for (int page : { 0, -1, viewer->pageCount() + 1, 32767 }) {
        viewer->showNthPage(page);
        EXPECT_EQ(viewer->currentPageNumber(), 2) << page;
    }
}

struct KeyCase {
    const char* name;
    Qt::Key key;
    Qt::KeyboardModifiers modifiers;
    int from;
    int expected;
    const char* event;
};

class Keys : public Viewer, public testing::WithParamInterface<KeyCase> { };

TEST_P(Keys, RaiseKeyDownAndObeyASwallowedKey)
{
    const KeyCase& c = GetParam();
    show(listReport());
    const int last = viewer->pageCount();
    const auto resolve = [last](int page) { return page < 0 ? last + 1 + page : page; };
    for (bool swallow : { true, false }) {
        viewer->showNthPage(resolve(c.from));
        recorder.swallowKeys = swallow;
        recorder.events.clear();
        QTest::keyClick(viewer->pageView(), c.key, c.modifiers);
        EXPECT_EQ(recorder.events.value(0), QString::fromLatin1(c.event));
        EXPECT_EQ(viewer->currentPageNumber(), swallow ? resolve(c.from) : resolve(c.expected));
    }
}

// Key codes: PgUp 33, PgDn 34, End 35, Home 36; shift state 2 is Ctrl.
INSTANTIATE_TEST_SUITE_P(Navigation, Keys,
    testing::Values(KeyCase { "pageDown", Qt::Key_PageDown, {}, 1, 2, "key 34 0" },
        KeyCase { "pageUp", Qt::Key_PageUp, {}, 3, 2, "key 33 0" },
        KeyCase { "home", Qt::Key_Home, {}, 3, 1, "key 36 0" },
        KeyCase { "ctrlEnd", Qt::Key_End, Qt::ControlModifier, 1, -1, "key 35 2" }),
    [](const auto& param) { return std::string(param.param.name); });

TEST_F(Viewer, ZoomFitsTheWidthAndTheWholePage)
{
    show(listReport());
    PageView* view = viewer->pageView();
    const QSizeF paper = viewer->activePages()->pages().front().size; // twips
    const double pixelsPerPercent = view->logicalDpiX() / 1440.0 / 100.0;

    viewer->setZoom(1);
    EXPECT_EQ(viewer->zoom(), 1);
    const double width = paper.width() * viewer->effectiveZoom() * pixelsPerPercent;
    EXPECT_LE(width, view->viewport()->width());
    EXPECT_GE(width, view->viewport()->width() - 60); // the gaps and the scroll bar

    viewer->setZoom(2);
    const double height = paper.height() * viewer->effectiveZoom() * pixelsPerPercent;
    EXPECT_LE(height, view->viewport()->height() + 1);
    EXPECT_LE(
        paper.width() * viewer->effectiveZoom() * pixelsPerPercent, view->viewport()->width());

    for (const auto& [asked, shown] : std::vector<std::pair<int, int>> {
             { 10, 25 }, { 25, 25 }, { 150, 150 }, { 400, 400 }, { 1000, 400 } }) {
        viewer->setZoom(asked);
        EXPECT_EQ(viewer->zoom(), shown) << asked;
        EXPECT_EQ(viewer->effectiveZoom(), shown) << asked;
    }
}

TEST_F(Viewer, CtrlWheelZoomsWithinItsLimits)
{
    show(listReport());
    PageView* view = viewer->pageView();
    const auto wheel = [&](int steps) {
        QWheelEvent event(QPointF(100, 100), view->viewport()->mapToGlobal(QPointF(100, 100)),
            QPoint(), QPoint(0, 120 * steps), Qt::NoButton, Qt::ControlModifier, Qt::NoScrollPhase,
            false);
        QCoreApplication::sendEvent(view->viewport(), &event);
    };
    viewer->setZoom(100);
    wheel(1);
    EXPECT_EQ(viewer->zoom(), 110);
    const int scroll = view->verticalScrollBar()->value();
    for (int i = 0; i < 40; ++i)
        wheel(1);
    EXPECT_EQ(viewer->zoom(), 400);
    for (int i = 0; i < 60; ++i)
        wheel(-1);
    EXPECT_EQ(viewer->zoom(), 25);
    EXPECT_GE(scroll, 0);
    // From a fitted zoom, the wheel starts at what is shown.
    viewer->setZoom(1);
    const int fitted = viewer->effectiveZoom();
    wheel(1);
    EXPECT_NEAR(viewer->zoom(), fitted * 1.1, 1.0);
}

TEST_F(Viewer, SearchFindsEveryMatchOnEveryPage)
{
    auto report = listReport();
    show(report);
    // "item 1" matches Item 1, Item 10..19 and Item 100..150: once each, in the layout's
    // own text.
    int expected = 0;
    for (const QString& text : allTexts(layOut(*report)))
        expected += static_cast<int>(text.count(u"item 1"_s, Qt::CaseInsensitive));
    ASSERT_EQ(expected, 1 + 10 + 51);
    EXPECT_EQ(viewer->searchForText(u"item 1"_s), expected);
    const auto& hits = viewer->searchHits();
    std::set<int> pages;
    for (const auto& hit : hits) {
        const Page& page = viewer->activePages()->pages()[static_cast<size_t>(hit.page)];
        const QString shown = page.texts[static_cast<size_t>(hit.text)].text->source;
        EXPECT_EQ(shown.mid(hit.from, hit.length).compare(u"ITEM 1"_s, Qt::CaseInsensitive), 0);
        pages.insert(hit.page);
    }
    EXPECT_GE(pages.size(), 3u) << "the hits lie on several pages";
    EXPECT_EQ(viewer->currentHit(), 0);
    EXPECT_TRUE(viewer->statusText().contains(u"1 of %1"_s.arg(expected)));

    // F3 steps on and wraps at the end; Shift+F3 wraps back at the start.
    for (int i = 1; i < expected; ++i)
        QTest::keyClick(viewer->pageView(), Qt::Key_F3);
    EXPECT_EQ(viewer->currentHit(), expected - 1);
    EXPECT_EQ(viewer->currentPageNumber(), hits.back().page + 1);
    QTest::keyClick(viewer->pageView(), Qt::Key_F3);
    EXPECT_EQ(viewer->currentHit(), 0);
    QTest::keyClick(viewer->pageView(), Qt::Key_F3, Qt::ShiftModifier);
    EXPECT_EQ(viewer->currentHit(), expected - 1);

    EXPECT_EQ(viewer->searchForText(u"no such text"_s), 0);
    EXPECT_TRUE(viewer->statusText().contains(u"No matches"_s));
    EXPECT_EQ(viewer->searchForText(u"   "_s), 0);
}

TEST_F(Viewer, TheSearchButtonLetsTheContainerChangeOrCancelTheText)
{
    show(listReport());
    auto* box = viewer->widget()->findChild<QLineEdit*>(u"searchBox"_s);
    box->setText(u"Heading"_s);
    recorder.replaceSearch = u"Item 15"_s;
    action(u"find"_s)->trigger();
    EXPECT_TRUE(recorder.events.contains(u"search Heading"_s));
    // "Item 15" and "Item 150".
    EXPECT_EQ(viewer->searchHits().size(), 2u);

    recorder.replaceSearch.clear();
    recorder.cancelSearch = true;
    box->setText(u"Heading"_s);
    action(u"find"_s)->trigger();
    EXPECT_EQ(viewer->searchHits().size(), 2u) << "a cancelled search keeps the last hits";
}

/// The item names a view's pages show.
QStringList itemNames(const std::vector<Page>& pages)
{
    return allTexts(pages).filter(QRegularExpression(u"^Item \\d+$"_s));
}

TEST_F(Viewer, DoubleClickOnAGroupHeaderOpensAViewOfThatGroupOnly)
{
    show(groupedReport(60, 5));
    // The second group header on page 1: G02 holds items 6 to 10.
    const Page& page = viewer->activePages()->pages().front();
    std::vector<Page::Band> headers;
    for (const auto& band : page.bands) {
        if (band.groupNode >= 0)
            headers.push_back(band);
    }
    ASSERT_GE(headers.size(), 2u);
    PageView* view = viewer->pageView();
    viewer->setZoom(100);
    viewer->showFirstPage();
    const double scale = view->logicalDpiX() / 1440.0;
    const QRectF paper(QPointF(0, 0), page.size * scale);
    // Where page 1 sits: centred across, below the gap.
    const double left
        = (std::max<double>(view->viewport()->width(), paper.width() + 24) - paper.width()) / 2
        - view->horizontalScrollBar()->value();
    const double top = 12 - view->verticalScrollBar()->value();
    const QPointF inHeader = headers[1].rect.center() * scale + QPointF(left, top);
    ASSERT_EQ(view->pageAt(inHeader.toPoint(), nullptr), 0);
    recorder.events.clear();
    QTest::mouseDClick(view->viewport(), Qt::LeftButton, {}, inHeader.toPoint());
    EXPECT_EQ(viewer->activeViewIndex(), 2);
    EXPECT_EQ(viewer->viewCount(), 2);
    EXPECT_TRUE(recorder.events.contains(u"viewChanged 1 2"_s));
    ASSERT_TRUE(waitForLayout(*viewer));
    EXPECT_EQ(itemNames(viewer->activePages()->pages()),
        (QStringList { u"Item 6"_s, u"Item 7"_s, u"Item 8"_s, u"Item 9"_s, u"Item 10"_s }));
    const QStringList texts = allTexts(viewer->activePages()->pages());
    EXPECT_EQ(texts.count(u"G02"_s), 1);
    EXPECT_EQ(texts.count(u"End of group"_s), 1);

    // Search covers the active view only.
    EXPECT_EQ(viewer->searchForText(u"Item 1"_s), 1); // Item 10

    recorder.events.clear();
    viewer->closeView(2);
    EXPECT_EQ(viewer->activeViewIndex(), 1);
    EXPECT_EQ(viewer->viewCount(), 1);
    EXPECT_TRUE(recorder.events.contains(u"viewChanged 2 1"_s));
    EXPECT_EQ(itemNames(viewer->activePages()->pages()).size(), 60);
}

TEST_F(Viewer, ClickDescribesWhatIsUnderTheMouse)
{
    show(groupedReport(10, 5));
    const Page& page = viewer->activePages()->pages().front();
    PageView* view = viewer->pageView();
    viewer->setZoom(100);
    const double scale = view->logicalDpiX() / 1440.0;
    const double left = (std::max<double>(view->viewport()->width(), page.size.width() * scale + 24)
                            - page.size.width() * scale)
        / 2;
    // The first detail's name field.
    const Page::Band* detail = nullptr;
    for (const auto& band : page.bands) {
        if (band.section == u"D") {
            detail = &band;
            break;
        }
    }
    ASSERT_NE(detail, nullptr);
    const QPointF onName = (detail->rect.topLeft() + QPointF(300, 150)) * scale + QPointF(left, 12);
    QTest::mouseClick(view->viewport(), Qt::LeftButton, {}, onName.toPoint());
    ASSERT_TRUE(recorder.events.contains(u"clicked"_s));
    auto info = std::dynamic_pointer_cast<core::Dictionary>(recorder.lastClickInfo.toObject());
    ASSERT_NE(info, nullptr);
    EXPECT_EQ(info->item(core::Variant(u"section"_s)).toText(), u"D"_s);
    EXPECT_EQ(info->item(core::Variant(u"text"_s)).toText(), u"Item 1"_s);

    // Blank paper, outside every section: Empty.
    recorder.events.clear();
    QTest::mouseClick(view->viewport(), Qt::LeftButton, {},
        QPointF(left + page.size.width() * scale - 5, 12 + page.size.height() * scale - 5)
            .toPoint());
    ASSERT_TRUE(recorder.events.contains(u"clicked"_s));
    EXPECT_TRUE(recorder.lastClickInfo.isEmpty());
}

/// Prints into a PDF printer folder of its own and puts the printer state back.
class ViewerPrinting : public Viewer {
protected:
    void SetUp() override
    {
        Viewer::SetUp();
        m_previousFolder = qEnvironmentVariable("LUDMOX_PDF_PRINTER_DIR");
        qputenv("LUDMOX_PDF_PRINTER_DIR", m_printed.path().toUtf8());
        m_previousPrinter = platform::CurrentPrinter::instance().printer();
        platform::CurrentPrinter::instance().select(platform::Printers::virtualPdfPrinter());
    }
    void TearDown() override
    {
        platform::CurrentPrinter::instance().select(m_previousPrinter);
        if (m_previousFolder.isEmpty())
            qunsetenv("LUDMOX_PDF_PRINTER_DIR");
        else
            qputenv("LUDMOX_PDF_PRINTER_DIR", m_previousFolder.toUtf8());
        Viewer::TearDown();
    }
    QString printedFile() const
    {
        const QStringList files = QDir(m_printed.path()).entryList({ u"*.pdf"_s }, QDir::Files);
        return files.size() == 1 ? QDir(m_printed.path()).filePath(files.front()) : QString();
    }

    QTemporaryDir m_printed;
    QString m_previousFolder;
    platform::PrinterInfo m_previousPrinter;
};

TEST_F(ViewerPrinting, ADrillDownViewPrintsOnlyItsGroup)
{
    show(groupedReport(300, 100));
    // G02: items 101 to 200, over more than one page.
    int node = -1;
    const auto& groups = viewer->activePages()->report().result()->groups;
    for (size_t i = 0; i < groups.size(); ++i) {
        if (groups[i].firstRecord == 100)
            node = static_cast<int>(i);
    }
    ASSERT_GE(node, 0);
    EXPECT_EQ(viewer->drillDown(node), 2);
    ASSERT_TRUE(waitForLayout(*viewer));
    const int pages = viewer->pageCount();
    ASSERT_GE(pages, 2);
    viewer->printReport();
    const QString pdf = printedFile();
    ASSERT_FALSE(pdf.isEmpty());
    EXPECT_EQ(pdfPageCount(pdf), pages);
    const QString text = pdfText(pdf);
    QStringList names;
    for (const auto& match : QRegularExpression(u"Item (\\d+)"_s).globalMatch(text))
        names << match.captured(1);
    EXPECT_EQ(names.size(), 100);
    EXPECT_EQ(names.front(), u"101"_s);
    EXPECT_EQ(names.back(), u"200"_s);
    EXPECT_FALSE(text.contains(u"G01"_s));
    EXPECT_FALSE(text.contains(u"G03"_s));

    EXPECT_THROW(viewer->drillDown(static_cast<int>(groups.size())), core::ComError);
}

/// A report of 100,000 items in groups of 50.
class LargeReport : public Viewer {
protected:
    static void SetUpTestSuite()
    {
        s_dir = std::make_unique<QTemporaryDir>();
        s_database = itemsDatabase(*s_dir, 100000, 50);
        s_file = writeReport(*s_dir, itemsReport(groupedSections(), byGroup));
    }
    static void TearDownTestSuite() { s_dir.reset(); }
    static std::shared_ptr<Report> open() { return openReport(s_file, s_database); }

    static inline std::unique_ptr<QTemporaryDir> s_dir;
    static inline QString s_database;
    static inline QString s_file;
};

TEST_F(LargeReport, ShowsTheFirstPageWhileTheRestIsLaidOut)
{
    viewer->setReportSource(open());
    viewer->viewReport();
    EXPECT_EQ(viewer->layoutState(), LayoutState::Running);
    EXPECT_TRUE(viewer->isBusy());
    struct Seen {
        bool firstPage = false;
        QString status;
        int pages = 0;
    } seen;
    QTimer probe;
    QObject::connect(&probe, &QTimer::timeout, [&] {
        if (!seen.firstPage && viewer->pageCount() > 0
            && viewer->layoutState() == LayoutState::Running) {
            seen.firstPage = viewer->currentPageNumber() == 1;
            seen.status = viewer->statusText();
            seen.pages = viewer->pageCount();
        }
    });
    probe.start(1);
    ASSERT_TRUE(waitForLayout(*viewer, 300000));
    EXPECT_TRUE(seen.firstPage);
    EXPECT_TRUE(seen.status.startsWith(u"Page 1 of %1+"_s.arg(seen.pages)))
        << seen.status.toStdString();
    EXPECT_EQ(viewer->layoutState(), LayoutState::Complete);
    EXPECT_GT(viewer->pageCount(), seen.pages);
    EXPECT_FALSE(viewer->statusText().contains(u'+'));
    EXPECT_EQ(viewer->searchForText(u"Item 99999"_s), 1);
}

TEST_F(LargeReport, RefreshDuringLayoutStartsOverAndCompletes)
{
    viewer->setReportSource(open());
    viewer->viewReport();
    bool refreshed = false;
    QTimer probe;
    QObject::connect(&probe, &QTimer::timeout, [&] {
        if (!refreshed && viewer->pageCount() >= 2) {
            refreshed = true;
            viewer->refreshView(false);
        }
    });
    probe.start(1);
    ASSERT_TRUE(waitForLayout(*viewer, 300000));
    EXPECT_TRUE(refreshed);
    EXPECT_EQ(viewer->layoutState(), LayoutState::Complete);
    // Every record once: no page of the stopped layout is left among the new ones.
    const QStringList names = itemNames(viewer->activePages()->pages());
    EXPECT_EQ(names.size(), 100000);
    EXPECT_EQ(QSet<QString>(names.begin(), names.end()).size(), 100000);
}

TEST_F(LargeReport, DestroyingTheControlDuringLayoutStopsIt)
{
    viewer->setReportSource(open());
    viewer->viewReport();
    bool destroyed = false;
    QTimer probe;
    QObject::connect(&probe, &QTimer::timeout, [&] {
        if (!destroyed && viewer && viewer->pageCount() >= 2) {
            destroyed = true;
            viewer.reset();
        }
    });
    probe.start(1);
    QElapsedTimer timer;
    timer.start();
    while (!destroyed && timer.elapsed() < 300000)
        QCoreApplication::processEvents(QEventLoop::AllEvents, 20);
    EXPECT_TRUE(destroyed);
    // The layout unwinds when the event loop returns to it; nothing of the control is used.
    QCoreApplication::processEvents();
    QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
    EXPECT_EQ(recorder.events.count(u"downloadFinished"_s), 0);
}

TEST_F(LargeReport, ANewSourceDuringLayoutReplacesTheOldOne)
{
    viewer->setReportSource(open());
    viewer->viewReport();
    bool replaced = false;
    auto small = listReport(20);
    QTimer probe;
    QObject::connect(&probe, &QTimer::timeout, [&] {
        if (!replaced && viewer->pageCount() >= 2) {
            replaced = true;
            viewer->setReportSource(small);
            viewer->viewReport();
        }
    });
    probe.start(1);
    QElapsedTimer timer;
    timer.start();
    while ((!replaced || viewer->layoutState() == LayoutState::Running) && timer.elapsed() < 300000)
        QCoreApplication::processEvents(QEventLoop::AllEvents, 20);
    EXPECT_TRUE(replaced);
    EXPECT_EQ(viewer->layoutState(), LayoutState::Complete);
    EXPECT_EQ(itemNames(viewer->activePages()->pages()).size(), 20);
}

TEST_F(Viewer, AMissingTableIsAReportSourceErrorWithItsNumber)
{
    QJsonObject document
        = itemsReport({ section(u"D"_s, 300, { fieldObject(u"{Items.Name}"_s, 0, 0) }) });
    const QString database = itemsDatabase(m_dir, 5);
    auto report = openReport(writeReport(m_dir, document), database);
    {
        // The table goes away after the report was pointed at it.
        QSqlDatabase db = QSqlDatabase::addDatabase(u"QSQLITE"_s, u"drop"_s);
        db.setDatabaseName(database);
        ASSERT_TRUE(db.open());
        ASSERT_TRUE(QSqlQuery(db).exec(u"DROP TABLE Items"_s));
        db.close();
    }
    QSqlDatabase::removeDatabase(u"drop"_s);
    int32_t expected = 0;
    try {
        report->readRecords();
    } catch (const core::ComError& error) {
        expected = error.number();
    }
    ASSERT_NE(expected, 0) << "reading a missing table fails";

    for (bool own : { true, false }) {
        recorder.events.clear();
        recorder.showOwnMessage = own;
        show(report);
        EXPECT_EQ(viewer->layoutState(), LayoutState::Failed);
        EXPECT_FALSE(viewer->isBusy());
        EXPECT_EQ(recorder.errorCode, expected);
        EXPECT_FALSE(recorder.errorMessage.isEmpty());
        EXPECT_EQ(recorder.events.contains(u"databaseLogonFailed"_s),
            expected == Error::TableConnectionFailed);
        if (expected == Error::TableConnectionFailed) {
            EXPECT_LT(recorder.events.indexOf(u"databaseLogonFailed"_s),
                recorder.events.indexOf(u"reportSourceError"_s));
        }
        EXPECT_EQ(viewer->messageText().isEmpty(), !own);
    }
}

TEST_F(Viewer, ViewingWithoutASourceIsAnError)
{
    viewer->viewReport();
    EXPECT_EQ(recorder.errorCode, Error::RuntimeFailure);
    EXPECT_FALSE(viewer->messageText().isEmpty());
    EXPECT_EQ(viewer->pageCount(), 0);
    EXPECT_THROW(viewer->printReport(), core::ComError);
}

TEST_F(Viewer, DestroyingTheControlInsideANotificationIsSafe)
{
    show(listReport());
    recorder.onDownloadStarted = [&] { viewer.reset(); };
    auto* raw = viewer.get();
    raw->refreshView(false);
    QElapsedTimer timer;
    timer.start();
    while (viewer && timer.elapsed() < 10000)
        QCoreApplication::processEvents(QEventLoop::AllEvents, 20);
    EXPECT_FALSE(viewer);
    QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
}

} // namespace
} // namespace reportrt
