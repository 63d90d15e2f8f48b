#include "automation/linechannel.h"

#include <QCoreApplication>
#include <QSocketNotifier>
#include <cerrno>
#include <poll.h>
#include <unistd.h>
#include <utility>

namespace automation {

LineChannel::LineChannel(int input, int output, QObject* parent, qsizetype lineLimit)
    : QObject(parent)
    , m_input(input)
    , m_output(output)
    , m_lineLimit(lineLimit)
    , m_notifier(std::make_unique<QSocketNotifier>(input, QSocketNotifier::Read))
{
    connect(m_notifier.get(), &QSocketNotifier::activated, this, &LineChannel::readAvailable);
}

LineChannel::~LineChannel() = default;

void LineChannel::readAvailable()
{
    if (m_inputEnded)
        return;
    pollfd ready { m_input, POLLIN, 0 };
    const int polled = ::poll(&ready, 1, 0);
    if (polled <= 0)
        return;
    char buffer[65536];
    const ssize_t count = ::read(m_input, buffer, sizeof buffer);
    if (count < 0 && (errno == EINTR || errno == EAGAIN))
        return;
    if (count <= 0) {
        m_inputEnded = true;
        m_notifier->setEnabled(false);
        Q_EMIT inputEnded();
        return;
    }
    take(QByteArrayView(buffer, count));
}

// Every byte read is looked at once: only the new bytes are searched for line breaks, and
// the line is appended to (amortised constant time per byte), so a long line costs time in
// proportion to its length.
void LineChannel::take(QByteArrayView data)
{
    while (!data.isEmpty()) {
        const qsizetype newline = data.indexOf('\n');
        const QByteArrayView piece = newline < 0 ? data : data.first(newline);
        if (!m_discarding) {
            // One byte of slack for the CR of a CR LF, which is not part of the line.
            if (m_partial.size() + piece.size() > m_lineLimit + 1) {
                m_partial = QByteArray();
                m_discarding = true;
            } else {
                m_partial.append(piece);
            }
        }
        if (newline < 0)
            return;
        finishLine();
        data = data.sliced(newline + 1);
    }
}

void LineChannel::finishLine()
{
    if (std::exchange(m_discarding, false)) {
        m_lines.push_back({ QByteArray(), true });
        return;
    }
    // A fresh buffer for the next line: a long line's memory goes with it.
    QByteArray text = std::exchange(m_partial, QByteArray());
    if (text.endsWith('\r'))
        text.chop(1);
    if (text.size() > m_lineLimit)
        m_lines.push_back({ QByteArray(), true });
    else
        m_lines.push_back({ std::move(text), false });
}

std::optional<LineChannel::Line> LineChannel::readLine()
{
    while (true) {
        if (m_stopped)
            return std::nullopt;
        if (!m_lines.empty()) {
            Line line = std::move(m_lines.front());
            m_lines.pop_front();
            return line;
        }
        if (m_inputEnded) {
            // A final line without a line break.
            if (m_discarding || !m_partial.isEmpty()) {
                finishLine();
                continue;
            }
            return std::nullopt;
        }
        readAvailable();
        if (!m_lines.empty() || m_inputEnded)
            continue;
        if (QCoreApplication::instance()) {
            // Runs timers, windows and dialogs until something happens; the notifier on
            // the input is one of the things that can.
            QCoreApplication::processEvents(QEventLoop::AllEvents | QEventLoop::WaitForMoreEvents);
        } else {
            pollfd ready { m_input, POLLIN, 0 };
            ::poll(&ready, 1, -1);
        }
    }
}

bool LineChannel::writeLine(const QByteArray& line)
{
    if (m_outputBroken)
        return false;
    QByteArray data = line;
    data.append('\n');
    const char* pending = data.constData();
    qsizetype left = data.size();
    while (left > 0) {
        const ssize_t written = ::write(m_output, pending, static_cast<size_t>(left));
        if (written < 0 && errno == EINTR)
            continue;
        if (written <= 0) {
            // Nobody reads the answers any more: stop reading requests as well.
            m_outputBroken = true;
            m_stopped = true;
            return false;
        }
        pending += written;
        left -= written;
    }
    return true;
}

void LineChannel::stop()
{
    m_stopped = true;
}

} // namespace automation
