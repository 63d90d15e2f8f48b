#pragma once

#include "reportrt/document/reportdocument.h"

#include <QByteArray>
#include <QString>

namespace reportrt {

/// Reads report documents (.rpt, docs/report-format.md). Every fault is raised as
/// core::ComError naming the file and the line and column of the fault: OpenReportFailed
/// when the file cannot be read, InvalidDocument when it is not a valid report.
class DocumentReader {
public:
    /// Larger files are refused before they are read.
    static constexpr qint64 maxFileSize = 64 * 1024 * 1024;

    static ReportDocument readFile(const QString& path);
    /// fileName only names the source in messages.
    static ReportDocument parse(const QByteArray& data, const QString& fileName);
};

} // namespace reportrt
