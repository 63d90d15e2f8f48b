// ludmox: the command-line host of LUD Mox. It drives the component as a host application
// does and exports or prints reports from the shell.
//
//   ludmox export --database DB --output DIR [--param NAME=VALUE]... [REPORT.rpt]...
//   ludmox print --database DB [--printer NAME] [--copies N] [--pages FROM-TO] [--paper CODE]
//                [--param NAME=VALUE]... REPORT.rpt
//   ludmox printers

#include "core/comerror.h"
#include "core/variant.h"
#include "printcommand.h"
#include "reportrt/output/registerruntime.h"
#include "reportrt/report.h"
#include "runtime/databasetable.h"
#include "runtime/exportoptions.h"
#include "runtime/parameterfield.h"
#include "runtime/reportobject.h"
#include "runtime/section.h"

#include <QApplication>
#include <QCommandLineParser>
#include <QDir>
#include <QElapsedTimer>
#include <QFileInfo>
#include <cstdio>

namespace {

void print(const QString& text)
{
    std::fputs(qPrintable(text + u'\n'), stdout);
    std::fflush(stdout);
}

void printError(const QString& text)
{
    std::fputs(qPrintable(u"ludmox: " + text + u'\n'), stderr);
}

/// Points every table of the report and of its subreports at a SQLite database file, as
/// the engine does for a file database.
void relocate(runtime::Report& report, const QString& database)
{
    for (const auto& table : report.databaseTables()) {
        table->deleteConnectionProperties();
        table->addConnectionProperty(
            QStringLiteral("Provider"), core::Variant(QStringLiteral("Microsoft.Jet.OLEDB.4.0")));
        table->addConnectionProperty(QStringLiteral("Data Source"), core::Variant(database));
        if (table->location().compare(u"Command", Qt::CaseInsensitive) == 0)
            continue;
        const QString location = table->location();
        table->setLocation(location.mid(location.lastIndexOf(u'.') + 1), QString(), QString());
    }
    for (const auto& section : report.sections()) {
        for (const auto& object : section->reportObjects()) {
            if (object->typeName() == u"ISubreportObject")
                relocate(*object->openSubreport(), database);
        }
    }
}

/// NAME=VALUE parameters: the value as text, converted by the parameter's type.
void setParameters(runtime::Report& report, const QStringList& assignments)
{
    for (const QString& assignment : assignments) {
        const qsizetype equals = assignment.indexOf(u'=');
        if (equals <= 0)
            throw core::ComError(5, QStringLiteral("ludmox"),
                QStringLiteral("--param takes NAME=VALUE, not %1").arg(assignment));
        const QString name = assignment.left(equals);
        bool found = false;
        for (const auto& parameter : report.parameterFields()) {
            if (parameter->name().compare(name, Qt::CaseInsensitive) != 0)
                continue;
            parameter->clearCurrentValues();
            parameter->addCurrentValue(core::Variant(assignment.mid(equals + 1)));
            found = true;
        }
        if (!found)
            throw core::ComError(5, QStringLiteral("ludmox"),
                QStringLiteral("the report has no parameter %1").arg(name));
    }
}

int exportReports(const QCommandLineParser& parser)
{
    const QString database = QFileInfo(parser.value(QStringLiteral("database"))).absoluteFilePath();
    const QString output = parser.value(QStringLiteral("output"));
    if (!QFileInfo(database).isFile()) {
        printError(QStringLiteral("the database %1 does not exist").arg(database));
        return 2;
    }
    if (output.isEmpty() || !QDir().mkpath(output)) {
        printError(QStringLiteral("cannot create the output folder %1").arg(output));
        return 2;
    }
    QStringList reports = parser.positionalArguments().mid(1);
    if (reports.isEmpty()) {
        const QDir folder(parser.value(QStringLiteral("reports")));
        for (const QString& name :
            folder.entryList({ QStringLiteral("*.rpt") }, QDir::Files, QDir::Name))
            reports << folder.filePath(name);
    }
    if (reports.isEmpty()) {
        printError(QStringLiteral("no reports to export"));
        return 2;
    }
    int failures = 0;
    for (const QString& path : reports) {
        const QString target
            = QDir(output).filePath(QFileInfo(path).completeBaseName() + QStringLiteral(".pdf"));
        QElapsedTimer timer;
        timer.start();
        try {
            const auto report = reportrt::Report::open(path);
            relocate(*report, database);
            setParameters(*report, parser.values(QStringLiteral("param")));
            report->readRecords();
            const auto options = report->exportOptions();
            options->reset();
            options->setFormatType(31);
            options->setDestinationType(1);
            options->setDiskFileName(target);
            report->exportReport(false);
            const auto status = report->printingStatus();
            print(QStringLiteral("%1: %2 records, %3 pages, %4 ms")
                      .arg(QDir::toNativeSeparators(target))
                      .arg(status.recordsPrinted)
                      .arg(status.pageCount)
                      .arg(timer.elapsed()));
        } catch (const core::ComError& error) {
            printError(QStringLiteral("%1: %2").arg(path, error.description()));
            ++failures;
        }
    }
    return failures == 0 ? 0 : 1;
}

} // namespace

int main(int argc, char* argv[])
{
    // Fonts need a GUI application; without a display it runs offscreen.
    if (qEnvironmentVariableIsEmpty("DISPLAY") && qEnvironmentVariableIsEmpty("WAYLAND_DISPLAY")
        && qEnvironmentVariableIsEmpty("QT_QPA_PLATFORM"))
        qputenv("QT_QPA_PLATFORM", "offscreen");
    // A widget application: the component's windows (message boxes, dialog owners) are
    // widgets, even where the command line never shows one.
    QApplication application(argc, argv);
    QGuiApplication::setApplicationName(QStringLiteral("ludmox"));
    reportrt::registerRuntime();

    QCommandLineParser parser;
    parser.setApplicationDescription(QStringLiteral("Exports LUD Mox reports."));
    parser.addHelpOption();
    parser.addPositionalArgument(QStringLiteral("command"), QStringLiteral("export"));
    parser.addOption({ QStringLiteral("database"),
        QStringLiteral("The SQLite database the reports read."), QStringLiteral("file") });
    parser.addOption({ QStringLiteral("output"), QStringLiteral("The folder for the PDF files."),
        QStringLiteral("folder") });
    parser.addOption({ QStringLiteral("reports"),
        QStringLiteral("The folder of the reports to export when none are named."),
        QStringLiteral("folder"), QStringLiteral("examples/reports") });
    parser.addOption({ QStringLiteral("param"),
        QStringLiteral("A parameter value for every report."), QStringLiteral("name=value") });
    ludmox::addPrintOptions(parser);
    parser.process(application);

    const QStringList arguments = parser.positionalArguments();
    if (arguments.value(0) == u"export")
        return exportReports(parser);
    if (arguments.value(0) == u"print")
        return ludmox::printReport(parser);
    if (arguments.value(0) == u"printers")
        return ludmox::listPrinters();
    printError(QStringLiteral("unknown command %1; try --help").arg(arguments.value(0)));
    return 2;
}
