#pragma once

// Locale-aware number text as the Basic conversion functions read and write it (CDbl,
// CCur, CStr).

#include <QLocale>
#include <QString>
#include <cstdint>

namespace core::detail {

enum class ParseStatus { Ok, Invalid, Overflow };

ParseStatus parseDouble(const QString& text, const QLocale& locale, double* value);
/// Exact decimal parsing into the currency's scaled integer, so that the full range
/// (±922337203685477.5807) survives the round trip through text.
ParseStatus parseCurrency(const QString& text, const QLocale& locale, int64_t* scaled);

/// A number in Basic's printed form with the given significant digits (15 for Double,
/// 7 for Single): no trailing zeros, exponent form "1E+20" / "1E-05" outside 1E-4..1E15.
QString numberText(double value, int significantDigits, const QString& decimalPoint);
QString currencyText(int64_t scaled, const QString& decimalPoint);

} // namespace core::detail
