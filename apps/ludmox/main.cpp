// ludmox: the command-line host of LUD Mox. It drives the component as a host application
// does and exports or prints reports from the shell.
//
//   ludmox export REPORT... --format pdf|xlsx|html --output DIR --database DB
//                [--param NAME=VALUE]... [--selection FORMULA]
//   ludmox mail REPORT --to ADDRESS [--cc ADDRESS] [--bcc ADDRESS] [--subject TEXT]
//                [--message TEXT] [--format pdf|xlsx|html] --database DB
//   ludmox print --database DB [--printer NAME] [--copies N] [--pages FROM-TO] REPORT.rpt

#include "exportcommand.h"
#include "mailcommand.h"
#include "reportrt/install.h"

#include <QCommandLineParser>
#include <QGuiApplication>
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
    QGuiApplication application(argc, argv);
    QGuiApplication::setApplicationName(QStringLiteral("ludmox"));
    reportrt::install();

    const QStringList arguments = QGuiApplication::arguments();
    if (arguments.value(1) == u"export")
        return exportCommand(arguments);
    if (arguments.value(1) == u"mail")
        return mailCommand(arguments);

    QCommandLineParser parser;
    parser.setApplicationDescription(QStringLiteral("Exports and mails LUD Mox reports. Commands: "
                                                    "export, mail; COMMAND --help tells more."));
    parser.addHelpOption();
    parser.addPositionalArgument(QStringLiteral("command"), QStringLiteral("export or mail"));
    parser.process(application);
    printError(QStringLiteral("unknown command %1; try --help")
                   .arg(parser.positionalArguments().value(0)));
    return 2;
}
