// ludmox: the command-line host of LUD Mox. It drives the component as a host application
// does and exports, mails or prints reports from the shell; `ludmox --help` tells how.

#include "exportcommand.h"
#include "logon.h"
#include "ludmox/version.h"
#include "mailcommand.h"
#include "previewcommand.h"
#include "printcommand.h"
#include "reporthost.h"
#include "reportrt/viewer/registerruntime.h"

#include <QApplication>
#include <QCommandLineParser>
#include <cstdio>
#include <malloc.h>

int main(int argc, char* argv[])
{
    // This process is ours, not a host's: large page buffers come and go with every page of
    // an export, and returning them to the system each time costs a third of the CPU.
    mallopt(M_MMAP_THRESHOLD, 32 * 1024 * 1024);
    mallopt(M_TRIM_THRESHOLD, 64 * 1024 * 1024);
    // Fonts need a GUI application; without a display it runs offscreen.
    if (qEnvironmentVariableIsEmpty("DISPLAY") && qEnvironmentVariableIsEmpty("WAYLAND_DISPLAY")
        && qEnvironmentVariableIsEmpty("QT_QPA_PLATFORM"))
        qputenv("QT_QPA_PLATFORM", "offscreen");
    // A widget application: the component's windows (message boxes, dialog owners) are
    // widgets, even where the command line never shows one.
    QApplication application(argc, argv);
    QApplication::setApplicationName(QStringLiteral("ludmox"));
    reportrt::registerRuntime();

    QApplication::setApplicationVersion(QStringLiteral(LUDMOX_VERSION_STRING));

    const QStringList arguments = QApplication::arguments();
    if (arguments.value(1) == u"export")
        return exportCommand(arguments);
    if (arguments.value(1) == u"mail")
        return mailCommand(arguments);
    if (arguments.value(1) == u"preview")
        return previewCommand(arguments);

    QCommandLineParser parser;
    parser.setApplicationDescription(QStringLiteral(
        "Exports, mails and prints LUD Mox reports, driving the component as a host "
        "application does.\n"
        "\n"
        "Commands (COMMAND --help tells every option):\n"
        "  export REPORT...  write PDF, Excel or HTML files (--format, --output)\n"
        "  mail REPORT       mail a report as an attachment (--to, --subject, --format)\n"
        "  preview REPORT    show a report in the preview window until it is closed\n"
        "  print REPORT      print on a printer (--printer, --copies, --pages, --paper)\n"
        "  printers          list the printers, the current one marked\n"
        "\n"
        "Every report command takes --logon (sqlite:FILE, postgres://... or odbc://...) or "
        "--database FILE, --param NAME=VALUE (repeatable) and --selection FORMULA.\n"
        "\n"
        "Exit codes: 0 everything was written, sent, printed or shown; 1 a report failed (one "
        "line on standard error for each); 2 the command line or the database was wrong, or "
        "preview found no display; nothing was done.\n"
        "\n"
        "Settings: ~/.config/ludmox/ludmox.conf over /etc/xdg/ludmox/ludmox.conf, with "
        "LUDMOX_* variables over both."));
    parser.addHelpOption();
    parser.addVersionOption();
    parser.addPositionalArgument(
        QStringLiteral("command"), QStringLiteral("export, mail, preview, print or printers"));
    Logon::addOptions(parser);
    parser.addOption({ QStringLiteral("param"), QStringLiteral("A parameter value for the report."),
        QStringLiteral("name=value") });
    ludmox::addPrintOptions(parser);
    parser.process(application);

    const QString command = parser.positionalArguments().value(0);
    if (command == u"print")
        return ludmox::printReport(parser);
    if (command == u"printers")
        return ludmox::listPrinters();
    ReportHost::printError(command.isEmpty()
            ? QStringLiteral("no command; try --help")
            : QStringLiteral("unknown command %1; try --help").arg(command));
    return 2;
}
