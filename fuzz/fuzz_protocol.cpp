// Fuzz target: the automation server's line handling. The input is what a host writes to
// the server, one or more request lines, served by the real server with the component's
// classes. Every input must end with the server answering in well-formed messages and
// letting go of every object, never in a crash, a hang or a leak.
//
// The component can write files and send mail when asked to: the target runs in a scratch
// directory and, where it may, without a network.

#include "apps/ludmoxd/dialogcanceller.h"
#include "automation/jsontext.h"
#include "automation/registry.h"
#include "automation/server.h"
#include "reportrt/viewer/registerruntime.h"

#include <QApplication>
#include <QByteArray>
#include <QDir>
#include <QTemporaryDir>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <sched.h>
#include <sys/mman.h>
#include <thread>
#include <unistd.h>

namespace {

void check(bool condition)
{
    if (!condition)
        __builtin_trap();
}

DialogCanceller* canceller = nullptr;

void setUp()
{
    static bool done = false;
    if (done)
        return;
    done = true;
    qputenv("QT_QPA_PLATFORM", "offscreen");
    if (::unshare(CLONE_NEWNET) != 0)
        std::fprintf(stderr, "fuzz_protocol: runs with the network (no new namespace)\n");
    static QTemporaryDir scratch;
    if (!scratch.isValid() || !QDir::setCurrent(scratch.path()))
        std::abort();
    static int argc = 1;
    static char name[] = "fuzz_protocol";
    static char* argv[] = { name, nullptr };
    static QApplication application(argc, argv);
    reportrt::registerRuntime();
    QApplication::setQuitOnLastWindowClosed(false);
    // Nobody can answer a dialog here: every one is cancelled as it shows.
    canceller = new DialogCanceller(&application);
    canceller->cancelAll();
}

bool writeAll(int fd, QByteArrayView data)
{
    while (!data.isEmpty()) {
        const ssize_t written = ::write(fd, data.data(), size_t(data.size()));
        if (written <= 0)
            return false;
        data = data.sliced(written);
    }
    return true;
}

QByteArray readAll(int fd)
{
    QByteArray text;
    if (::lseek(fd, 0, SEEK_SET) != 0)
        return text;
    char buffer[65536];
    ssize_t got = 0;
    while ((got = ::read(fd, buffer, sizeof buffer)) > 0)
        text.append(buffer, got);
    return text;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    setUp();
    int input[2];
    check(::pipe(input) == 0);
    const int output = ::memfd_create("fuzz_protocol", MFD_CLOEXEC);
    check(output >= 0);
    const QByteArray lines(reinterpret_cast<const char*>(data), static_cast<qsizetype>(size));
    std::thread writer([&lines, fd = input[1]] {
        writeAll(fd, lines);
        ::close(fd);
    });
    size_t held = 0;
    {
        automation::Server server(input[0], output, automation::Registry::instance());
        server.run();
        held = server.heldObjects();
    }
    writer.join();
    ::close(input[0]);
    // Once the input has ended the host holds nothing any more.
    check(held == 0);
    for (const QByteArray& line : readAll(output).split('\n')) {
        if (line.isEmpty())
            continue;
        const std::optional<QCborValue> message = automation::JsonText::parse(line);
        check(message && message->isMap());
    }
    ::close(output);
    return 0;
}
