#pragma once

#include <QSaveFile>
#include <QString>

namespace reportrt {

/// A file written in full or not at all. The data goes to a temporary file beside the
/// target, which finish() flushes, syncs to the disk and only then renames over the
/// target. A short or failed write (a full disk, a file size limit), a failed flush, sync
/// or rename leaves the target byte for byte as it was and removes the temporary file.
///
/// QSaveFile alone is not enough: it commits a file whose buffered data never reached the
/// disk, and it ignores a failed sync.
class DurableFile : public QSaveFile {
public:
    explicit DurableFile(const QString& path);
    ~DurableFile() override;

    /// Opens the temporary file for writing; false with failure() when it cannot be made.
    bool start();
    /// Puts the written data in place of the target. False with failure() on any fault on
    /// the way; the target is then unchanged and no temporary file is left.
    bool finish();
    /// Drops what was written; the target stays as it was.
    void abandon();
    /// Why start(), a write or finish() failed ("No space left on device").
    QString failure() const { return m_failure; }

protected:
    qint64 writeData(const char* data, qint64 length) override;

private:
    void fail(const QString& why);

    QString m_failure;
    bool m_failed = false;
};

} // namespace reportrt
