// ludmoxd: the component's automation server. A host starts it and talks JSON-RPC 2.0 with
// it over standard input and output, one message per line.

#include "automation/registry.h"
#include "automation/server.h"
#include "dialogcanceller.h"
#include "reportrt/output/registerruntime.h"

#include <QApplication>
#include <csignal>
#include <cstdio>
#include <unistd.h>

int main(int argc, char* argv[])
{
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
