// Times reading the records and exporting to PDF, Excel or HTML of a grouped list with
// eight columns over a generated database of the given number of orders, and the peak
// memory of that.
//
//   export_bench [--rows N]... [--format pdf|xlsx|html]... [--keep FOLDER [--reuse]]

#include "benchdatabase.h"
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
            bench::fail(QStringLiteral("--format takes pdf, xlsx or html, not %1").arg(name));
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
            bench::fail(QStringLiteral("--rows takes a positive number, not %1").arg(count));
        const QString database = QDir(folder).filePath(QStringLiteral("bench-%1.db").arg(rows));
        if (!parser.isSet(QStringLiteral("reuse")) || !QFile::exists(database)) {
            QFile::remove(database);
            bench::makeDatabase(database, rows);
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
                bench::relocate(*report, database);
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
                bench::fail(error.description());
            }
            if (!parser.isSet(QStringLiteral("keep")))
                QFile::remove(output);
        }
        if (!parser.isSet(QStringLiteral("keep")))
            QFile::remove(database);
    }
    return 0;
}
