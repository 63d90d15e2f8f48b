// Times the preview control on a grouped list with eight columns over a generated database
// of the given number of orders: reading the records alone, the first page shown, layout
// complete, flipping a page (painted at 100 %) and searching the whole document.
//
//   viewer_bench [--rows N] [--report FILE]

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

void fail(const QString& text)
{
    std::fprintf(stderr, "viewer_bench: %s\n", qPrintable(text));
    std::exit(1);
}

/// Orders as the sample database has them, made quickly and always the same.
void makeDatabase(const QString& path, int rows)
{
    static const char* const cities[][2] = { { "Tallinn", "Estonia" }, { "Tartu", "Estonia" },
        { "Riga", "Latvia" }, { "Liepaja", "Latvia" }, { "Vilnius", "Lithuania" },
        { "Kaunas", "Lithuania" }, { "Helsinki", "Finland" }, { "Turku", "Finland" },
        { "Stockholm", "Sweden" }, { "Gothenburg", "Sweden" }, { "Hamburg", "Germany" },
        { "Berlin", "Germany" }, { "Gdansk", "Poland" }, { "Oslo", "Norway" } };
    static const char* const statuses[] = { "Shipped", "Shipped", "Invoiced", "Open" };
    static const char* const people[]
        = { "A. Tamm", "K. Saar", "J. Ozols", "L. Kalnina", "M. Berg", "E. Virtanen" };
    const QString name = QStringLiteral("bench-setup");
    {
        QSqlDatabase db = QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), name);
        db.setDatabaseName(path);
        if (!db.open())
            fail(db.lastError().text());
        QSqlQuery query(db);
        query.exec(QStringLiteral("PRAGMA journal_mode = OFF"));
        query.exec(QStringLiteral("PRAGMA synchronous = OFF"));
        if (!query.exec(QStringLiteral(
                "CREATE TABLE Orders (OrderID INTEGER PRIMARY KEY, CustomerID INTEGER, "
                "OrderDate TEXT, ShipDate TEXT, Status TEXT, ShipCity TEXT, ShipCountry TEXT, "
                "Salesperson TEXT, Items INTEGER, Amount NUMERIC, Freight NUMERIC)")))
            fail(query.lastError().text());
        QRandomGenerator random(20261206);
        const QDate start(2020, 1, 1);
        db.transaction();
        query.prepare(QStringLiteral("INSERT INTO Orders VALUES (?,?,?,?,?,?,?,?,?,?,?)"));
        for (int id = 1; id <= rows; ++id) {
            const auto& city = cities[random.bounded(14)];
            const QDate day = start.addDays(static_cast<qint64>(id) * 2000 / rows);
            const char* status = statuses[random.bounded(4)];
            query.addBindValue(id);
            query.addBindValue(random.bounded(1, 5000));
            query.addBindValue(day.toString(Qt::ISODate));
            query.addBindValue(qstrcmp(status, "Open") == 0
                    ? QVariant()
                    : QVariant(day.addDays(random.bounded(1, 9)).toString(Qt::ISODate)));
            query.addBindValue(QString::fromLatin1(status));
            query.addBindValue(QString::fromLatin1(city[0]));
            query.addBindValue(QString::fromLatin1(city[1]));
            query.addBindValue(QString::fromLatin1(people[random.bounded(6)]));
            query.addBindValue(random.bounded(1, 120));
            query.addBindValue(random.bounded(100, 5000000) / 100.0);
            query.addBindValue(random.bounded(500, 8000) / 100.0);
            if (!query.exec())
                fail(query.lastError().text());
        }
        db.commit();
        db.close();
    }
    QSqlDatabase::removeDatabase(name);
}

void relocate(runtime::Report& report, const QString& database)
{
    for (const auto& table : report.databaseTables()) {
        table->deleteConnectionProperties();
        table->addConnectionProperty(
            QStringLiteral("Provider"), core::Variant(QStringLiteral("Microsoft.Jet.OLEDB.4.0")));
        table->addConnectionProperty(QStringLiteral("Data Source"), core::Variant(database));
        const QString location = table->location();
        table->setLocation(location.mid(location.lastIndexOf(u'.') + 1), QString(), QString());
    }
}

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
        fail(QStringLiteral("--rows takes a positive number"));
    QTemporaryDir scratch;
    const QString database = scratch.filePath(QStringLiteral("bench.db"));
    makeDatabase(database, rows);
    const QString file = parser.value(QStringLiteral("report"));

    try {
        // Reading alone, for how much of the first page's wait it is.
        QElapsedTimer timer;
        timer.start();
        auto reading = reportrt::Report::open(file);
        relocate(*reading, database);
        reading->readRecords();
        const double read = milliseconds(timer);
        reading.reset();

        reportrt::ReportViewer viewer;
        viewer.widget()->resize(1200, 900);
        viewer.widget()->show();
        auto report = reportrt::Report::open(file);
        relocate(*report, database);
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
            fail(QStringLiteral("the layout did not complete"));

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
        fail(error.description());
    }
    return 0;
}
