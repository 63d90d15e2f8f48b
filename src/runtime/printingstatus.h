#pragma once

#include <cstdint>

namespace runtime {

/// The report's printing status. progress: 1 not started, 2 in progress, 3 completed,
/// 4 failed, 5 cancelled, 6 halted.
struct PrintingStatus {
    int32_t recordsRead = 0;
    int32_t recordsSelected = 0;
    int32_t recordsPrinted = 0;
    int16_t progress = 1;
    int32_t pageCount = 0;
};

} // namespace runtime
