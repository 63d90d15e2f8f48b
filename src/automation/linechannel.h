#pragma once

#include <QByteArray>
#include <QObject>
#include <deque>
#include <memory>
#include <optional>

class QSocketNotifier;

namespace automation {

/// One line of text per message over a pair of file descriptors (the server's standard
/// input and output). Waiting for a line keeps the Qt event loop running, so windows and
/// dialogs stay alive while the server waits for its host.
class LineChannel : public QObject {
    Q_OBJECT
public:
    /// The longest line taken, in bytes without its line break (64 MiB). A longer line is
    /// dropped as soon as it grows past the limit and reported as one bad line once its line
    /// break arrives; its bytes are never kept, so a host cannot make the server buffer more.
    static constexpr qsizetype maxLineLength = 64 * 1024 * 1024;

    /// Reads from `input` and writes to `output`; neither is closed by the channel.
    /// `lineLimit` is the longest line taken, in bytes (see maxLineLength).
    LineChannel(
        int input, int output, QObject* parent = nullptr, qsizetype lineLimit = maxLineLength);
    ~LineChannel() override;

    struct Line {
        QByteArray text; // without its line break
        bool tooLong = false; // dropped for its length; text is empty
    };
    /// Waits for the next line (a final line without a line break included). Nothing once
    /// the input has ended and every line was taken, or after stop().
    std::optional<Line> readLine();

    /// Writes one line (a line break is added), also after stop(). False when the output is
    /// gone; from then on the channel counts as stopped.
    bool writeLine(const QByteArray& line);

    /// Makes every waiting and later readLine() return nothing.
    void stop();
    bool isStopped() const { return m_stopped; }
    bool atEnd() const
    {
        return m_inputEnded && m_lines.empty() && m_partial.isEmpty() && !m_discarding;
    }

Q_SIGNALS:
    /// The input has closed. Emitted once, possibly from inside a modal loop that runs while
    /// the server waits (a dialog): such a loop must end for the server to end.
    void inputEnded();

private:
    void readAvailable();
    void take(QByteArrayView data);
    void finishLine();

    int m_input;
    int m_output;
    qsizetype m_lineLimit; // in bytes, without the line break
    std::unique_ptr<QSocketNotifier> m_notifier;
    QByteArray m_partial; // the line read so far, only the bytes not yet split off
    bool m_discarding = false; // inside an over-long line
    std::deque<Line> m_lines;
    bool m_inputEnded = false;
    bool m_stopped = false;
    bool m_outputBroken = false;
};

} // namespace automation
