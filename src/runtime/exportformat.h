#pragma once

#include <cstdint>

namespace runtime {

/// The export format codes of ExportOptions::formatType.
enum class ExportFormat : int32_t {
    PDF = 31,
    HTML = 32,
    Excel = 38, // an XLSX workbook
};

} // namespace runtime
