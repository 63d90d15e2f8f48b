#pragma once

#include "reportrt/document/reportdocument.h"

#include <QByteArray>
#include <QString>

namespace reportrt {

/// Writes report documents. Passwords among the connection properties are never written.
class DocumentWriter {
public:
    static QByteArray serialize(const ReportDocument& document, bool withSavedData);
    /// Writes through a temporary file that replaces the target only once it is complete
    /// and synced to the disk, so a failure (a full disk, a file size limit) leaves the old
    /// file byte for byte as it was and no temporary file behind. Raises Error::SaveFailed
    /// naming the file and the cause.
    static void writeFile(const ReportDocument& document, const QString& path, bool withSavedData);
};

} // namespace reportrt
