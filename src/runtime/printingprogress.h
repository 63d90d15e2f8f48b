#pragma once

#include <cstdint>

namespace runtime {

/// The progress codes of PrintingStatus::progress.
enum class PrintingProgress : int16_t {
    NotStarted = 1,
    InProgress = 2,
    Completed = 3,
    Failed = 4,
    Cancelled = 5,
    Halted = 6,
};

} // namespace runtime
