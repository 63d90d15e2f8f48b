// How much CPU the automation server spends on one long request line: lines of the given
// sizes in MB (default 16 64 200 272) are sent through a pipe, each followed by a short
// request, and the server thread's CPU time is reported per line. Lines under the limit
// are parsed as JSON (a request with one long string); longer ones are refused.

#include "automation/registry.h"
#include "automation/server.h"

#include <QByteArray>
#include <QCoreApplication>
#include <QTemporaryFile>
#include <cstdio>
#include <ctime>
#include <thread>
#include <unistd.h>

namespace {

double threadCpuSeconds()
{
    timespec now {};
    ::clock_gettime(CLOCK_THREAD_CPUTIME_ID, &now);
    return double(now.tv_sec) + double(now.tv_nsec) / 1e9;
}

bool writeAll(int fd, const char* data, size_t size)
{
    while (size > 0) {
        const ssize_t written = ::write(fd, data, size);
        if (written <= 0)
            return false;
        data += written;
        size -= size_t(written);
    }
    return true;
}

void measure(qsizetype megabytes)
{
    const qsizetype size = megabytes * 1000 * 1000;
    int input[2];
    if (::pipe(input) != 0)
        return;
    std::thread writer([fd = input[1], size] {
        const QByteArray head = R"({"jsonrpc":"2.0","id":1,"method":"typelib","params":{"x":")";
        const QByteArray tail = "\"}}\n";
        const QByteArray block(1 << 20, 'x');
        writeAll(fd, head.constData(), size_t(head.size()));
        for (qsizetype left = size - head.size() - tail.size(); left > 0; left -= block.size())
            writeAll(fd, block.constData(), size_t(std::min(left, block.size())));
        writeAll(fd, tail.constData(), size_t(tail.size()));
        const QByteArray next = R"({"jsonrpc":"2.0","id":2,"method":"typelib","params":{}})"
                                "\n";
        writeAll(fd, next.constData(), size_t(next.size()));
        ::close(fd);
    });
    QTemporaryFile output;
    if (!output.open())
        return;
    automation::Registry registry;
    const double before = threadCpuSeconds();
    {
        automation::Server server(input[0], output.handle(), registry);
        server.run();
    }
    const double seconds = threadCpuSeconds() - before;
    writer.join();
    ::close(input[0]);
    output.seek(0);
    const QByteArray answers = output.readAll();
    const bool refused = answers.contains("line too long");
    std::printf("%6lld MB  %-8s  server CPU %.3f s\n", static_cast<long long>(megabytes),
        refused ? "refused" : "parsed", seconds);
}

} // namespace

int main(int argc, char* argv[])
{
    QCoreApplication application(argc, argv);
    QList<qsizetype> sizes;
    for (int i = 1; i < argc; ++i)
        sizes.append(QByteArray(argv[i]).toLongLong());
    if (sizes.isEmpty())
        sizes = { 16, 64, 200, 272 };
    for (const qsizetype megabytes : sizes)
        measure(megabytes);
    return 0;
}
