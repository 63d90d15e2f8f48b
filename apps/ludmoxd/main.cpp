// ludmoxd: the component's automation server. A host starts it and talks JSON-RPC 2.0 with
// it over standard input and output, one message per line.

#include "automation/registry.h"
#include "automation/server.h"
#include "dialogcanceller.h"
#include "ludmox/version.h"
#include "reportrt/viewer/registerruntime.h"

#include <QApplication>
#include <QCommandLineParser>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <malloc.h>
#include <unistd.h>

namespace {

/// Answers --help and --version on standard output and ends the process; refuses anything
/// else on the command line. The server itself takes no arguments.
void answerCommandLine(int argc, char* argv[])
{
    const QCoreApplication application(argc, argv);
    QCoreApplication::setApplicationName(QStringLiteral("ludmoxd"));
    QCoreApplication::setApplicationVersion(QStringLiteral(LUDMOX_VERSION_STRING));
    QCommandLineParser parser;
    parser.setApplicationDescription(QStringLiteral(
        "The automation server of the LUD Mox reporting component. A host starts it and "
        "talks JSON-RPC 2.0 with it over standard input and output, one JSON object per "
        "line; standard error carries diagnostics only. The host sends typelib, create, "
        "invoke, enumerate, connect, disconnect, release and shutdown; the server sends "
        "event and serves the host's calls made from inside its event handlers.\n"
        "\n"
        "The server ends when its input closes or after shutdown, releasing every object "
        "the host still held, with exit code 0; 1 means it could not start. Without a "
        "display its windows and dialogs run offscreen, and a dialog nobody can answer "
        "counts as cancelled.\n"
        "\n"
        "Settings: ~/.config/ludmox/ludmox.conf over /etc/xdg/ludmox/ludmox.conf, with "
        "LUDMOX_* variables over both."));
    parser.addHelpOption();
    parser.addVersionOption();
    parser.process(application);
    if (!parser.positionalArguments().isEmpty()) {
        std::fputs("ludmoxd: takes no arguments; try --help\n", stderr);
        std::exit(1);
    }
}

} // namespace

int main(int argc, char* argv[])
{
    // This process is ours, not a host's: large page buffers come and go with every page of
    // an export, and returning them to the system each time costs a third of the CPU.
    mallopt(M_MMAP_THRESHOLD, 32 * 1024 * 1024);
    mallopt(M_TRIM_THRESHOLD, 64 * 1024 * 1024);
    // Before standard output becomes the protocol's: help goes where the user reads it.
    if (argc > 1)
        answerCommandLine(argc, argv);

    // Dialogs and preview windows need a platform; without a display they run offscreen.
    if (qEnvironmentVariableIsEmpty("DISPLAY") && qEnvironmentVariableIsEmpty("WAYLAND_DISPLAY")
        && qEnvironmentVariableIsEmpty("QT_QPA_PLATFORM"))
        qputenv("QT_QPA_PLATFORM", "offscreen");

    // A host that goes away must not kill the server in the middle of releasing objects;
    // a failed write ends the session instead.
    std::signal(SIGPIPE, SIG_IGN);

    // Standard output carries only protocol messages: anything else that writes to it (a
    // library's stray printf) goes to standard error instead.
    std::fflush(stdout);
    const int protocolOutput = ::dup(STDOUT_FILENO);
    if (protocolOutput < 0 || ::dup2(STDERR_FILENO, STDOUT_FILENO) < 0) {
        std::perror("ludmoxd: cannot set up standard output");
        return 1;
    }

    QApplication application(argc, argv);
    reportrt::registerRuntime();
    QApplication::setApplicationName(QStringLiteral("ludmoxd"));
    QApplication::setQuitOnLastWindowClosed(false);

    automation::Server server(STDIN_FILENO, protocolOutput, automation::Registry::instance());
    // A host that goes away while a dialog of the component is open cannot answer it: the
    // dialogs are cancelled so that the calls waiting on them return and the server ends.
    DialogCanceller canceller;
    server.setInputEndedHandler([&canceller] { canceller.cancelAll(); });
    const int exitCode = server.run();
    ::close(protocolOutput);
    return exitCode;
}
