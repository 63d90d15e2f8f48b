#pragma once

#include "runtime/exportformat.h"

#include <QString>
#include <functional>

namespace reportrt {

class ExportOptions;
class Report;

/// The export writers by format code. Each writer lays the report out and writes the file
/// at path whole or not at all (the old file stays when it fails), and returns the number
/// of pages. The runtime's own writers are added when it is registered; a format without a
/// writer cannot be exported.
class WriterTable {
public:
    using Writer
        = std::function<int(Report& report, const ExportOptions& options, const QString& path)>;

    static void add(runtime::ExportFormat format, Writer writer);
    /// The writer of a format code; nullptr when there is none.
    static const Writer* find(int32_t formatCode);
};

} // namespace reportrt
