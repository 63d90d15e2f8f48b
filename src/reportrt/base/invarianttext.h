#pragma once

#include "reportrt/base/value.h"

#include <QString>
#include <optional>

namespace reportrt::invarianttext {

/// The value type of a parameter value type code (1..16); nullopt for other codes.
std::optional<ValueType> parameterValueType(int code);

/// Invariant text forms used in report files, SQL literals and ToText:
/// numbers with up to 17 significant digits ("5", "2.5", "1e+20"), currency with four
/// decimals ("12.3400"), dates "2026-12-06", times "14:30:00" or "14:30:00.250",
/// date-times "2026-12-06T14:30:00" (".250" when there are milliseconds).
QString formatNumber(double value);
QString formatCurrency(int64_t scaled);
QString formatDate(int64_t julianDay);
QString formatTime(int32_t msecsOfDay);
QString formatDateTime(int64_t msecs, QChar separator = u'T');

/// Strict parsers of those forms; nullopt when the text is not exactly one of them.
/// Date-times also accept a space instead of "T" and no seconds; fractions of a second
/// round to the nearest millisecond.
std::optional<double> parseNumber(const QString& text);
std::optional<int64_t> parseCurrency(const QString& text);
std::optional<int64_t> parseDate(const QString& text);
std::optional<int32_t> parseTime(const QString& text);
std::optional<int64_t> parseDateTime(const QString& text);

/// Currency from a double: the amount rounded half away from zero to four decimals;
/// nullopt when out of range.
std::optional<int64_t> currencyFromDouble(double value);

} // namespace reportrt::invarianttext
