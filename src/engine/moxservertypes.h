#pragma once

#include <cstdint>

namespace engine {

/// The database server a host logs on to. Unscoped and 32-bit: hosts pass the numbers.
enum MoxServerTypes : int32_t {
    ecstNone = 0,
    ecstMSJET = 1,
    ecstMSSQL = 2,
    ecstMSJET40 = 3,
};

} // namespace engine
