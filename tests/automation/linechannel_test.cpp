#include "automation/linechannel.h"

#include <QByteArray>
#include <gtest/gtest.h>
#include <random>
#include <thread>
#include <unistd.h>
#include <vector>

using automation::LineChannel;

namespace {

/// A pipe whose write end a thread feeds in pieces of the given sizes (cycled), closing it
/// at the end, while the test reads the lines on its own thread.
class FedPipe {
public:
    FedPipe(QByteArray data, std::vector<qsizetype> pieceSizes)
    {
        EXPECT_EQ(::pipe(m_fds), 0);
        m_writer = std::thread([this, data = std::move(data), sizes = std::move(pieceSizes)] {
            qsizetype offset = 0;
            size_t next = 0;
            while (offset < data.size()) {
                const qsizetype size = std::min(sizes[next++ % sizes.size()], data.size() - offset);
                const ssize_t written
                    = ::write(m_fds[1], data.constData() + offset, static_cast<size_t>(size));
                if (written <= 0)
                    break;
                offset += written;
            }
            ::close(m_fds[1]);
        });
    }
    ~FedPipe()
    {
        m_writer.join();
        ::close(m_fds[0]);
    }
    int readEnd() const { return m_fds[0]; }

private:
    int m_fds[2] = { -1, -1 };
    std::thread m_writer;
};

struct Read {
    QByteArray text;
    bool tooLong;
    bool operator==(const Read&) const = default;
};

void PrintTo(const Read& read, std::ostream* out)
{
    *out << (read.tooLong ? "<too long>" : '"' + read.text.toStdString() + '"');
}

std::vector<Read> readAll(LineChannel& channel)
{
    std::vector<Read> lines;
    while (const auto line = channel.readLine())
        lines.push_back({ line->text, line->tooLong });
    return lines;
}

std::vector<Read> readThrough(
    const QByteArray& data, std::vector<qsizetype> pieces, qsizetype limit = 16)
{
    FedPipe pipe(data, std::move(pieces));
    LineChannel channel(pipe.readEnd(), -1, nullptr, limit);
    std::vector<Read> lines = readAll(channel);
    EXPECT_TRUE(channel.atEnd());
    return lines;
}

const QByteArray sixteen = "0123456789abcdef";

TEST(LineChannel, LinesAreTheSameHoweverTheInputIsCut)
{
    const QByteArray data = "first\nsecond\r\n\nthird line\r\n" + sixteen + "\r\nlast";
    const std::vector<Read> expected = { { "first", false }, { "second", false }, { "", false },
        { "third line", false }, { sixteen, false }, { "last", false } };
    const struct {
        const char* name;
        std::vector<qsizetype> pieces;
    } cuts[] = {
        { "all at once", { 1 << 20 } },
        { "byte by byte", { 1 } },
        // Cuts between CR and LF and in the middle of the line at the limit.
        { "uneven pieces", { 3, 1, 7, 2, 5 } },
    };
    for (const auto& cut : cuts) {
        SCOPED_TRACE(cut.name);
        EXPECT_EQ(readThrough(data, cut.pieces), expected);
    }
}

TEST(LineChannel, LinesOverTheLimitAreRefusedAndReadingGoesOn)
{
    const struct {
        const char* name;
        QByteArray data;
        std::vector<Read> expected;
    } cases[] = {
        { "exactly at the limit", sixteen + "\n", { { sixteen, false } } },
        { "at the limit with CR LF", sixteen + "\r\n", { { sixteen, false } } },
        { "one byte over", sixteen + "x\nnext\n", { { "", true }, { "next", false } } },
        // The CR is only slack when it ends the line.
        { "one byte over with CR", sixteen + "x\r\nnext\n", { { "", true }, { "next", false } } },
        { "a CR inside is counted", sixteen + "\rx\nnext\n", { { "", true }, { "next", false } } },
        { "far over, twice", sixteen.repeated(100) + "\n" + sixteen.repeated(3) + "\nok\n",
            { { "", true }, { "", true }, { "ok", false } } },
        { "over the limit at the end of input", "ok\n" + sixteen.repeated(2),
            { { "ok", false }, { "", true } } },
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        EXPECT_EQ(readThrough(c.data, { 1 << 20 }), c.expected);
        EXPECT_EQ(readThrough(c.data, { 1 }), c.expected);
    }
}

TEST(LineChannel, RandomlyCutInputGivesBackEveryLine)
{
    std::mt19937 random(20240611);
    std::vector<Read> expected;
    QByteArray data;
    for (int i = 0; i < 2000; ++i) {
        const int length = std::uniform_int_distribution<int>(0, 5000)(random);
        QByteArray line(length, char('a' + i % 26));
        data += line + (i % 3 == 0 ? "\r\n" : "\n");
        expected.push_back({ line, false });
    }
    std::vector<qsizetype> pieces;
    for (int i = 0; i < 97; ++i)
        pieces.push_back(std::uniform_int_distribution<qsizetype>(1, 70000)(random));
    EXPECT_EQ(readThrough(data, pieces, 5000), expected);
}

} // namespace
