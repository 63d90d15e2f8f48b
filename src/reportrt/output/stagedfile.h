#pragma once

#include <QFile>
#include <QString>

namespace reportrt {

/// A file written under a hidden temporary name in its target's folder and renamed over
/// the target only once it is complete, so a reader never sees half a file and a failed
/// export leaves an older file as it was.
///
/// The temporary file is removed by the destructor unless commit() succeeded. Renaming
/// replaces a read-only target as well (what counts is the folder's write permission).
class StagedFile {
public:
    /// Checks the target and creates the temporary file; raises Error::ExportFailed when
    /// the path is empty or a folder, its folder is missing, or nothing can be created
    /// there. what names the kind of file in messages ("Excel", "HTML").
    StagedFile(const QString& target, const QString& what);
    ~StagedFile();
    StagedFile(const StagedFile&) = delete;
    StagedFile& operator=(const StagedFile&) = delete;

    /// The temporary file, open for writing.
    QFile& file() { return m_file; }
    /// The temporary file's path, for writers that open the file themselves.
    QString temporaryPath() const { return m_file.fileName(); }
    QString target() const { return m_target; }

    /// Flushes the file to disk and closes it; raises Error::ExportFailed on a write error.
    void finish();
    /// Renames the finished file over the target; raises Error::ExportFailed on failure.
    void commit();
    /// Raises Error::ExportFailed naming the target and reason.
    [[noreturn]] void fail(const QString& reason) const;

private:
    QString m_target;
    QString m_what;
    QFile m_file;
    bool m_committed = false;
};

} // namespace reportrt
