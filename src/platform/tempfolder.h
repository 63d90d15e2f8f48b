#pragma once

#include "core/ludmoxexport.h"

#include <QString>

namespace platform {

/// The component's private per-user temporary folder: a directory of the user's own with
/// mode 0700 under a base directory (the system temporary directory by default), created on
/// demand. Report exports, mail attachments and trace files go here, so no other user may
/// read them or plant files or links in it.
///
/// The folder is "ludmox-<uid>". When that name is taken by something the user cannot trust
/// (a symbolic link, a file, a directory of another user) it is left alone and a fresh
/// private folder with a random suffix is used instead; a folder of the user's own with a
/// wider mode is narrowed to 0700.
class LUDMOX_EXPORT TempFolder {
public:
    /// baseDirectory empty: the system temporary directory (QDir::tempPath()).
    explicit TempFolder(const QString& baseDirectory = QString());

    /// The absolute path of the folder, ending with "/", after making sure it exists and is
    /// private. Raises ComError 75 (Path/File access error) when no private folder can be made.
    QString path() const;

    /// path() of the process-wide folder under the system temporary directory.
    static QString systemPath();

    /// Where a trace or scratch file named in the original platform's notation goes. A path
    /// with a drive ("c:\\ludmox.log", "D:/out.pdf", "c:out.pdf") or one rooted without a
    /// drive ("\\ludmox.log", a "\\\\server\\share\\" path) has no place on this system;
    /// it names the file of the same last name in this folder, never the file system's root
    /// or the current directory. A path that names no file ("c:\\", "c:\\..") gives path().
    /// Any other path is returned unchanged. Raises what path() raises.
    QString scratchPath(const QString& path) const;

    /// scratchPath() in the process-wide folder under the system temporary directory.
    static QString systemScratchPath(const QString& path);

private:
    QString m_baseDirectory;
    mutable QString m_folder; // without the trailing "/"; empty until first used
};

} // namespace platform
