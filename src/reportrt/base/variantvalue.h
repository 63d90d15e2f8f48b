#pragma once

#include "core/variant.h"
#include "reportrt/base/value.h"

#include <optional>

namespace reportrt::variantvalue {

/// A runtime value as the host sees it: numbers Double, currency Currency, dates Date,
/// text String, Null as Null.
core::Variant toVariant(const Value& value);

/// A parameter value (type code 1..16) as the host sees it: 1, 2 Byte; 3, 4 Integer;
/// 5, 6 Long; 7 Double; 8 Currency; 9 Boolean; 10, 11, 16 Date; 12..15 String.
core::Variant parameterVariant(const Value& value, int valueTypeCode);

/// A host value for a parameter of that type code, converted by the Basic rules (which
/// raise Type mismatch or Overflow when the value does not fit).
Value parameterValue(const core::Variant& value, int valueTypeCode);

} // namespace reportrt::variantvalue
