// Times the preview control on a grouped list with eight columns over a generated database
// of the given number of orders: reading the records alone, the first page shown, layout
// complete, flipping a page (painted at 100 %) and searching the whole document.
//
//   viewer_bench [--rows N] [--report FILE]

#include "benchdatabase.h"
#include "core/comerror.h"
#include "core/variant.h"
#include "reportrt/report.h"
#include "reportrt/viewer/pageview.h"
#include "reportrt/viewer/registerruntime.h"
#include "reportrt/viewer/reportviewer.h"
#include "runtime/databasetable.h"

#include <QApplication>
#include <QCommandLineParser>
#include <QDate>
#include <QDir>
#include <QElapsedTimer>
#include <QRandomGenerator>
#include <QSqlDatabase>
#include <QSqlError>
#include <QSqlQuery>
#include <QTemporaryDir>
#include <QTimer>
#include <algorithm>
#include <cstdio>

namespace {

double milliseconds(const QElapsedTimer& timer)
{
    return static_cast<double>(timer.nsecsElapsed()) / 1e6;
}

} // namespace

int main(int argc, char* argv[])
{
    if (qEnvironmentVariableIsEmpty("QT_QPA_PLATFORM"))
        qputenv("QT_QPA_PLATFORM", "offscreen");
    QApplication application(argc, argv);
    reportrt::registerRuntime();
    QCommandLineParser parser;
    parser.addHelpOption();
    parser.addOption({ QStringLiteral("rows"), QStringLiteral("Orders in the database."),
        QStringLiteral("count"), QStringLiteral("100000") });
    parser.addOption({ QStringLiteral("report"), QStringLiteral("The report to show."),
        QStringLiteral("file"), QStringLiteral(LUDMOX_BENCH_REPORT) });
    parser.addOption({ QStringLiteral("search"), QStringLiteral("The text to search for."),
        QStringLiteral("text"), QStringLiteral("Tallinn") });
    parser.process(application);
    bool ok = false;
    const int rows = parser.value(QStringLiteral("rows")).toInt(&ok);
    if (!ok || rows < 1)
        bench::fail(QStringLiteral("--rows takes a positive number"));
    QTemporaryDir scratch;
    const QString database = scratch.filePath(QStringLiteral("bench.db"));
    bench::makeDatabase(database, rows);
    const QString file = parser.value(QStringLiteral("report"));

    try {
        // Reading alone, for how much of the first page's wait it is.
        QElapsedTimer timer;
        timer.start();
        auto reading = reportrt::Report::open(file);
        bench::relocate(*reading, database);
        reading->readRecords();
        const double read = milliseconds(timer);
        reading.reset();

        reportrt::ReportViewer viewer;
        viewer.widget()->resize(1200, 900);
        viewer.widget()->show();
        auto report = reportrt::Report::open(file);
        bench::relocate(*report, database);
        double firstPage = -1;
        QTimer probe;
        QObject::connect(&probe, &QTimer::timeout, [&] {
            if (firstPage < 0 && viewer.pageCount() > 0) {
                viewer.pageView()->viewport()->repaint();
                firstPage = milliseconds(timer);
            }
        });
        probe.start(1);
        timer.start();
        viewer.setReportSource(report);
        viewer.viewReport();
        while (viewer.isBusy())
            QCoreApplication::processEvents(QEventLoop::AllEvents, 20);
        const double complete = milliseconds(timer);
        probe.stop();
        if (viewer.layoutState() != runtime::ViewerControl::LayoutState::Complete)
            bench::fail(QStringLiteral("the layout did not complete"));

        viewer.setZoom(100);
        const int pages = viewer.pageCount();
        QRandomGenerator random(7);
        double flipTotal = 0;
        double flipWorst = 0;
        constexpr int flips = 50;
        for (int i = 0; i < flips; ++i) {
            timer.start();
            viewer.showNthPage(static_cast<int32_t>(random.bounded(1, pages + 1)));
            viewer.pageView()->viewport()->repaint();
            const double flip = milliseconds(timer);
            flipTotal += flip;
            flipWorst = std::max(flipWorst, flip);
        }
        timer.start();
        const int hits = viewer.searchForText(parser.value(QStringLiteral("search")));
        const double search = milliseconds(timer);

        std::printf("%d rows, %d pages\n", rows, pages);
        std::printf("read records alone      %9.1f ms\n", read);
        std::printf("first page shown        %9.1f ms\n", firstPage);
        std::printf("layout complete         %9.1f ms\n", complete);
        std::printf("flip a page (mean/max)  %9.1f / %.1f ms\n", flipTotal / flips, flipWorst);
        std::printf("search (%d hits)  %9.1f ms\n", hits, search);
    } catch (const core::ComError& error) {
        bench::fail(error.description());
    }
    return 0;
}
