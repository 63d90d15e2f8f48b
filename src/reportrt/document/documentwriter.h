#pragma once

#include "reportrt/document/reportdocument.h"

#include <QByteArray>
#include <QString>

namespace reportrt {

/// Writes report documents. Passwords among the connection properties are never written.
class DocumentWriter {
public:
    static QByteArray serialize(const ReportDocument& document, bool withSavedData);
    /// Writes through a temporary file that replaces the target only when complete, so a
    /// failure leaves the old file as it was. Raises Error::SaveFailed.
    static void writeFile(const ReportDocument& document, const QString& path, bool withSavedData);
};

} // namespace reportrt
