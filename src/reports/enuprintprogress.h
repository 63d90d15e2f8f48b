#pragma once

#include <cstdint>

namespace reports {

/// How far printing of a report has got, as the report runtime reports it. Unscoped and
/// 32-bit: hosts see the numbers, and the runtime's values 1 to 6 pass through unchanged.
enum enuPrintProgress : int32_t {
    eppNoReport = 0,
    eppPrintingNotStarted = 1,
    eppPrintingInProgress = 2,
    eppPrintingCompleted = 3,
    eppPrintingFailed = 4,
    eppPrintingCancelled = 5,
    eppPrintingHalted = 6,
};

} // namespace reports
