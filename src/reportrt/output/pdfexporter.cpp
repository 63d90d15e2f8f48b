#include "reportrt/output/pdfexporter.h"

#include "reportrt/base/durablefile_p.h"
#include "reportrt/base/runtimeerror.h"
#include "reportrt/layout/pagination.h"
#include "reportrt/output/allocatortuning_p.h"
#include "reportrt/output/pdfwriter.h"
#include "reportrt/report.h"

#include <QDir>
#include <QFileInfo>
#include <condition_variable>
#include <deque>
#include <mutex>
#include <optional>
#include <thread>

namespace reportrt {

namespace {

/// Pages on their way from the layout to the painting thread. Bounded, so a fast layout
/// waits for the painter instead of piling pages up.
class PageQueue {
public:
    static constexpr size_t capacity = 4;

    /// False once the painter gave up: the layout should stop.
    bool push(Page&& page)
    {
        std::unique_lock lock(m_mutex);
        m_changed.wait(lock, [&] { return m_pages.size() < capacity || m_aborted; });
        if (m_aborted)
            return false;
        m_pages.push_back(std::move(page));
        m_changed.notify_all();
        return true;
    }

    /// The next page; nothing once the layout closed the queue or either side aborted.
    std::optional<Page> pop()
    {
        std::unique_lock lock(m_mutex);
        m_changed.wait(lock, [&] { return !m_pages.empty() || m_closed || m_aborted; });
        if (m_aborted || m_pages.empty())
            return std::nullopt;
        Page page = std::move(m_pages.front());
        m_pages.pop_front();
        m_changed.notify_all();
        return page;
    }

    void close()
    {
        const std::lock_guard lock(m_mutex);
        m_closed = true;
        m_changed.notify_all();
    }

    void abort()
    {
        const std::lock_guard lock(m_mutex);
        m_aborted = true;
        m_pages.clear();
        m_changed.notify_all();
    }

    bool isAborted()
    {
        const std::lock_guard lock(m_mutex);
        return m_aborted;
    }

private:
    std::mutex m_mutex;
    std::condition_variable m_changed;
    std::deque<Page> m_pages;
    bool m_closed = false;
    bool m_aborted = false;
};

struct Job {
    QString path;
    QString title;
    const FontTable* fonts = nullptr;
    PageQueue queue;
    QString error; // set by the painting thread when it failed
};

/// The painting thread: everything that touches the file and the PDF writer runs here.
void paint(Job& job)
{
    DurableFile file(job.path);
    if (!file.start()) {
        job.error = file.failure();
        job.queue.abort();
        return;
    }
    PdfWriter writer(file, *job.fonts);
    writer.setTitle(job.title);
    bool first = true;
    while (std::optional<Page> page = job.queue.pop()) {
        first = false;
        if (!writer.addPage(*page)) {
            job.error = writer.error();
            job.queue.abort();
            break;
        }
    }
    if (!job.queue.isAborted() && !first && !writer.finish()) {
        job.error = writer.error();
        job.queue.abort();
    }
    if (job.queue.isAborted() || first) {
        file.abandon();
        return;
    }
    if (!file.finish())
        job.error = file.failure();
}

/// Thrown through the layout when the painting thread stopped.
struct PainterStopped { };

} // namespace

int PdfExporter::exportTo(Report& report, const QString& path)
{
    if (path.trimmed().isEmpty())
        raiseError(Error::ExportFailed, QStringLiteral("The export has no file name."));
    const QFileInfo target(path);
    if (target.isDir())
        raiseError(Error::ExportFailed,
            QStringLiteral("Cannot export to %1: it is a folder.")
                .arg(QDir::toNativeSeparators(path)));
    if (!target.absoluteDir().exists())
        raiseError(Error::ExportFailed,
            QStringLiteral("Cannot export to %1: the folder %2 does not exist.")
                .arg(QDir::toNativeSeparators(path),
                    QDir::toNativeSeparators(target.absolutePath())));
    if (!report.result())
        report.readRecords();

    tuneAllocatorForPdf();
    Pagination pagination(report);
    if (pagination.showsTotalPages())
        pagination.countPages();

    Job job;
    job.path = target.absoluteFilePath();
    job.title = report.title();
    job.fonts = &pagination.fonts();
    std::thread painter([&job] { paint(job); });

    int pages = 0;
    try {
        pages = pagination.run([&job](Page&& page) {
            if (!job.queue.push(std::move(page)))
                throw PainterStopped();
        });
        job.queue.close();
    } catch (const PainterStopped&) {
        job.queue.abort();
    } catch (...) {
        job.queue.abort();
        painter.join();
        throw;
    }
    painter.join();
    if (!job.error.isEmpty())
        raiseError(Error::ExportFailed,
            QStringLiteral("Cannot write the PDF file %1: %2")
                .arg(QDir::toNativeSeparators(path), job.error));
    return pages;
}

} // namespace reportrt
