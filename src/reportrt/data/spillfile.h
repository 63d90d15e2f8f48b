#pragma once

#include <QByteArray>
#include <QString>
#include <cstdint>

namespace reportrt {

/// A scratch file for records that do not stay in memory, in the component's private
/// temporary folder. It has no name from the moment it is made (unlinked, or never linked
/// at all), so it cannot outlive the object that holds it: not when a report fails, and not
/// when the process ends without cleaning up.
class SpillFile {
public:
    /// folder empty: the process-wide private temporary folder. Raises
    /// Error::RuntimeFailure, naming the folder, when no file can be made there.
    explicit SpillFile(const QString& folder = QString());
    ~SpillFile();
    SpillFile(const SpillFile&) = delete;
    SpillFile& operator=(const SpillFile&) = delete;

    /// Appends bytes and returns where they start. Raises Error::RuntimeFailure with the
    /// system's reason (a full disk, a file size limit) when they cannot all be written.
    int64_t append(const QByteArray& bytes);
    /// Reads size bytes from offset into buffer (resized to fit). Raises
    /// Error::RuntimeFailure when they cannot be read.
    void read(int64_t offset, qsizetype size, QByteArray& buffer) const;

private:
    int m_descriptor = -1;
    int64_t m_size = 0;
};

} // namespace reportrt
