#pragma once

#include <QString>
#include <QTemporaryDir>

namespace reports {

/// Where an export writes a file that is to replace `target` only once it is complete: a
/// hidden private folder beside the target, on the same file system, so that commit() can
/// rename the result over the target in one step. Whatever commit() did not move is removed
/// with the object, so a failed export leaves neither a partial file nor an altered target.
///
/// The export may write further files next to path() (the other pages of an HTML export,
/// pictures beside it); commit() moves them beside the target under the same names.
class StagedTarget {
public:
    /// Raises ComError 75 (Path/File access error) when `target` is empty or its folder
    /// cannot be written.
    explicit StagedTarget(const QString& target);

    /// The path the export writes to: the target's file name inside the hidden folder.
    QString path() const;

    /// Moves every file written into the hidden folder beside the target, the target's own
    /// file last, replacing files of the same names even when they are read-only. Raises
    /// ComError 75 when the export wrote no file at path() or a file cannot be moved.
    void commit();

private:
    QString m_target;
    QTemporaryDir m_folder;
};

} // namespace reports
