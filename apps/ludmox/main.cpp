// ludmox: the command-line host of LUD Mox. It drives the component as a host application
// does and exports, mails or prints reports from the shell.
//
//   ludmox export REPORT... --format pdf|xlsx|html --output DIR --database DB
//                [--param NAME=VALUE]... [--selection FORMULA]
//   ludmox mail REPORT --to ADDRESS [--cc ADDRESS] [--bcc ADDRESS] [--subject TEXT]
//                [--message TEXT] [--format pdf|xlsx|html] --database DB
//   ludmox print --database DB [--printer NAME] [--copies N] [--pages FROM-TO] [--paper CODE]
//                [--param NAME=VALUE]... REPORT.rpt
//   ludmox printers

#include "exportcommand.h"
#include "mailcommand.h"
#include "printcommand.h"
#include "reportrt/output/registerruntime.h"

#include <QApplication>
#include <QCommandLineParser>
#include <cstdio>

namespace {

void printError(const QString& text)
{
    std::fputs(qPrintable(u"ludmox: " + text + u'\n'), stderr);
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
    QApplication::setApplicationName(QStringLiteral("ludmox"));
    reportrt::registerRuntime();

    const QStringList arguments = QApplication::arguments();
    if (arguments.value(1) == u"export")
        return exportCommand(arguments);
    if (arguments.value(1) == u"mail")
        return mailCommand(arguments);

    QCommandLineParser parser;
    parser.setApplicationDescription(
        QStringLiteral("Exports, mails and prints LUD Mox reports. Commands: export, mail, "
                       "print, printers; COMMAND --help tells more."));
    parser.addHelpOption();
    parser.addPositionalArgument(
        QStringLiteral("command"), QStringLiteral("export, mail, print or printers"));
    parser.addOption({ QStringLiteral("database"),
        QStringLiteral("The SQLite database the reports read."), QStringLiteral("file") });
    parser.addOption({ QStringLiteral("param"), QStringLiteral("A parameter value for the report."),
        QStringLiteral("name=value") });
    ludmox::addPrintOptions(parser);
    parser.process(application);

    const QString command = parser.positionalArguments().value(0);
    if (command == u"print")
        return ludmox::printReport(parser);
    if (command == u"printers")
        return ludmox::listPrinters();
    printError(QStringLiteral("unknown command %1; try --help").arg(command));
    return 2;
}
