#pragma once

#include "core/ludmoxexport.h"
#include "runtime/printingprogress.h"

#include <cstdint>

namespace runtime {

/// The report's printing status.
struct LUDMOX_EXPORT PrintingStatus {
    int32_t recordsRead = 0;
    int32_t recordsSelected = 0;
    int32_t recordsPrinted = 0;
    int16_t progress = static_cast<int16_t>(PrintingProgress::NotStarted); // a progress code
    int32_t pageCount = 0;

    bool is(PrintingProgress value) const { return progress == static_cast<int16_t>(value); }
    void setProgress(PrintingProgress value) { progress = static_cast<int16_t>(value); }
};

} // namespace runtime
