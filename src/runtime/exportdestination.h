#pragma once

#include <cstdint>

namespace runtime {

/// The export destination codes of ExportOptions::destinationType.
enum class ExportDestination : int32_t {
    None = 0, // as DiskFile: a file named by diskFileName
    DiskFile = 1,
    Mail = 2,
};

} // namespace runtime
