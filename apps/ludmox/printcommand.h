#pragma once

class QCommandLineParser;

namespace ludmox {

/// Adds the options of the print command (--printer, --copies, --pages, --paper) to the
/// command line; --database and --param are shared with the other commands.
void addPrintOptions(QCommandLineParser& parser);

/// `ludmox print REPORT`: prints one report through the component's engine and report
/// object as a host would, silently, on --printer (or the current printer). Parameters
/// come only from --param: the command line shows no dialog, so a report that still needs
/// values fails with a message. Returns the process exit code: 0 printed, 1 the component
/// refused, 2 bad arguments.
int printReport(const QCommandLineParser& parser);

/// `ludmox printers`: lists the installed printers, the current one marked with "*".
int listPrinters();

} // namespace ludmox
