#pragma once

#include <cstdint>

namespace runtime {

/// The value type codes of ParameterField::valueType.
enum class ParameterValueType : int16_t {
    SignedByte = 1,
    Byte = 2,
    SignedShort = 3,
    Short = 4,
    SignedLong = 5,
    Long = 6,
    Number = 7,
    Currency = 8,
    Boolean = 9,
    Date = 10,
    Time = 11,
    Text = 12,
    LongText = 13,
    TemporaryText = 14,
    Other = 15, // values pass without conversion
    DateTime = 16,
};

} // namespace runtime
