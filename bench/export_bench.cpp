// Times reading the records and exporting to PDF, Excel or HTML of a grouped list with
// eight columns over a generated database of the given number of orders, and the peak
// memory of that.
//
//   export_bench [--rows N]... [--format pdf|xlsx|html]... [--keep FOLDER [--reuse]]

#include "core/comerror.h"
#include "core/variant.h"
#include "reportrt/report.h"
#include "reportrt/viewer/registerruntime.h"
#include "runtime/databasetable.h"
#include "runtime/exportoptions.h"

#include <QCommandLineParser>
#include <QDate>
#include <QDir>
#include <QElapsedTimer>
#include <QFile>
#include <QGuiApplication>
#include <QProcess>
#include <QRandomGenerator>
#include <QSqlDatabase>
#include <QSqlError>
#include <QSqlQuery>
#include <QTemporaryDir>
#include <cstdio>
#include <sys/resource.h>

namespace {

void fail(const QString& text)
{
    std::fprintf(stderr, "export_bench: %s\n", qPrintable(text));
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

double cpuSeconds()
{
    rusage usage {};
    getrusage(RUSAGE_SELF, &usage);
    return static_cast<double>(usage.ru_utime.tv_sec + usage.ru_stime.tv_sec)
        + static_cast<double>(usage.ru_utime.tv_usec + usage.ru_stime.tv_usec) / 1e6;
}

/// The peak resident memory since the last reset, in MiB.
double peakMiB()
{
    QFile status(QStringLiteral("/proc/self/status"));
    if (!status.open(QIODevice::ReadOnly))
        return -1;
    for (const QByteArray& line : status.readAll().split('\n')) {
        if (line.startsWith("VmHWM:"))
            return line.mid(6).trimmed().split(' ').front().toDouble() / 1024.0;
    }
    return -1;
}

void resetPeak()
{
    // "5" resets the peak resident set size (Linux 4.0 and later).
    QFile file(QStringLiteral("/proc/self/clear_refs"));
    if (file.open(QIODevice::WriteOnly))
        file.write("5");
}

} // namespace

int main(int argc, char* argv[])
{
    if (qEnvironmentVariableIsEmpty("QT_QPA_PLATFORM"))
        qputenv("QT_QPA_PLATFORM", "offscreen");
    QGuiApplication application(argc, argv);
    reportrt::registerRuntime();
    QCommandLineParser parser;
    parser.addHelpOption();
    parser.addOption({ QStringLiteral("rows"), QStringLiteral("Orders in the database."),
        QStringLiteral("count") });
    parser.addOption({ QStringLiteral("keep"), QStringLiteral("Keep the database and PDF here."),
        QStringLiteral("folder") });
    parser.addOption({ QStringLiteral("reuse"),
        QStringLiteral("Reuse databases kept in the --keep folder by an earlier run.") });
    parser.addOption({ QStringLiteral("report"), QStringLiteral("The report to export."),
        QStringLiteral("file"), QStringLiteral(LUDMOX_BENCH_REPORT) });
    parser.addOption({ QStringLiteral("format"),
        QStringLiteral("pdf, xlsx or html; all three when not given."), QStringLiteral("name") });
    parser.process(application);
    struct Format {
        QString name;
        int code;
    };
    std::vector<Format> formats;
    QStringList names = parser.values(QStringLiteral("format"));
    if (names.isEmpty())
        names
            = QStringList { QStringLiteral("pdf"), QStringLiteral("xlsx"), QStringLiteral("html") };
    for (const QString& name : names) {
        if (name == u"pdf")
            formats.push_back({ name, 31 });
        else if (name == u"xlsx")
            formats.push_back({ name, 38 });
        else if (name == u"html")
            formats.push_back({ name, 32 });
        else
            fail(QStringLiteral("--format takes pdf, xlsx or html, not %1").arg(name));
    }
    QStringList counts = parser.values(QStringLiteral("rows"));
    if (counts.isEmpty())
        counts << QStringLiteral("100000");

    QTemporaryDir scratch;
    const QString folder = parser.isSet(QStringLiteral("keep"))
        ? parser.value(QStringLiteral("keep"))
        : scratch.path();
    QDir().mkpath(folder);
    std::printf("%6s %10s %8s %9s %9s %9s %8s %9s %9s %8s\n", "format", "rows", "pages", "read s",
        "export s", "rows/s", "pages/s", "cpu s", "cpu rows/s", "peak MiB");
    for (const QString& count : counts) {
        bool ok = false;
        const int rows = count.toInt(&ok);
        if (!ok || rows < 1)
            fail(QStringLiteral("--rows takes a positive number, not %1").arg(count));
        const QString database = QDir(folder).filePath(QStringLiteral("bench-%1.db").arg(rows));
        if (!parser.isSet(QStringLiteral("reuse")) || !QFile::exists(database)) {
            QFile::remove(database);
            makeDatabase(database, rows);
        }
        for (const Format& format : formats) {
            const QString output
                = QDir(folder).filePath(QStringLiteral("bench-%1.%2").arg(rows).arg(format.name));
            resetPeak();
            const double cpuStart = cpuSeconds();
            QElapsedTimer timer;
            timer.start();
            try {
                auto report = reportrt::Report::open(parser.value(QStringLiteral("report")));
                relocate(*report, database);
                report->readRecords();
                const double read = static_cast<double>(timer.nsecsElapsed()) / 1e9;
                const auto options = report->exportOptions();
                options->setFormatType(format.code);
                options->setDestinationType(1);
                options->setDiskFileName(output);
                if (format.code == 38) {
                    // As the component sets them.
                    options->setExcelAreaType(4);
                    options->setExcelConstantColumnWidth(true);
                    options->setExcelTabHasColumnHeadings(true);
                    options->setExcelUseWorksheetFunctions(false);
                    options->setExcelPageBreaks(true);
                    options->setExcelExportAllPages(true);
                }
                options->setHtmlSeparatePages(false);
                report->exportReport(false);
                const double total = static_cast<double>(timer.nsecsElapsed()) / 1e9;
                const double cpu = cpuSeconds() - cpuStart;
                const auto status = report->printingStatus();
                std::printf("%6s %10d %8d %9.2f %9.2f %9.0f %8.0f %9.2f %9.0f %8.1f\n",
                    qPrintable(format.name), status.recordsPrinted, status.pageCount, read,
                    total - read, rows / total, status.pageCount / total, cpu, rows / cpu,
                    peakMiB());
                std::fflush(stdout);
            } catch (const core::ComError& error) {
                fail(error.description());
            }
            if (!parser.isSet(QStringLiteral("keep")))
                QFile::remove(output);
        }
        if (!parser.isSet(QStringLiteral("keep")))
            QFile::remove(database);
    }
    return 0;
}
