#pragma once

#include "core/comerror.h"

#include <cstdint>
#include <optional>

namespace automation {

/// Dispatch error numbers, as the signed 32-bit values a host sees.
namespace DispatchNumber {
constexpr int32_t MemberNotFound = static_cast<int32_t>(0x80020003);
constexpr int32_t TypeMismatch = static_cast<int32_t>(0x80020005);
constexpr int32_t BadParamCount = static_cast<int32_t>(0x8002000E);
constexpr int32_t ParamNotOptional = static_cast<int32_t>(0x8002000F);
constexpr int32_t ClassNotRegistered = static_cast<int32_t>(0x80040154);
} // namespace DispatchNumber

/// A call that never reached the member: no such member, the wrong number of arguments, or
/// an argument that does not convert to its declared type. It is a ComError so that late-
/// bound callers inside the component can trap it like any other error; the server answers
/// it as invalid parameters rather than as an error of the component.
class DispatchError : public core::ComError {
public:
    DispatchError(int32_t number, const QString& description,
        std::optional<int> argumentIndex = std::nullopt);

    static DispatchError memberNotFound(const QString& className, const QString& member);
    static DispatchError badParamCount(const QString& member, int given, int declared);
    static DispatchError paramNotOptional(const QString& member, int argumentIndex);
    /// An argument that failed to convert (out of range, Null, no number...): Type
    /// mismatch, with the conversion's own description.
    static DispatchError conversion(const core::ComError& cause, int argumentIndex);
    static DispatchError typeMismatch(int argumentIndex, const QString& detail);

    /// 0-based position of the offending argument, when one is to blame.
    std::optional<int> argumentIndex() const { return m_argumentIndex; }

private:
    std::optional<int> m_argumentIndex;
};

} // namespace automation
