#include "automation/linechannel.h"

#include <QCoreApplication>
#include <QSocketNotifier>
#include <cerrno>
#include <poll.h>
#include <unistd.h>

namespace automation {

LineChannel::LineChannel(int input, int output, QObject* parent)
    : QObject(parent)
    , m_input(input)
    , m_output(output)
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
    m_partial.append(buffer, count);
    splitLines();
}

void LineChannel::splitLines()
{
    qsizetype newline;
    while ((newline = m_partial.indexOf('\n')) >= 0) {
        QByteArray text = m_partial.left(newline);
        m_partial.remove(0, newline + 1);
        if (m_discarding) {
            m_discarding = false;
            m_lines.push_back({ QByteArray(), true });
            continue;
        }
        if (text.endsWith('\r'))
            text.chop(1);
        m_lines.push_back({ std::move(text), false });
    }
    if (m_partial.size() > maxLineLength) {
        m_partial.clear();
        m_discarding = true;
    }
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
            if (m_discarding) {
                m_discarding = false;
                return Line { QByteArray(), true };
            }
            if (!m_partial.isEmpty()) {
                Line line { std::exchange(m_partial, QByteArray()), false };
                if (line.text.endsWith('\r'))
                    line.text.chop(1);
                return line;
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
