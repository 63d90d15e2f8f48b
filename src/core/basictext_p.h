#pragma once

// Locale-aware number and date text as the Basic conversion functions read and write it.
// Shared by Variant (CStr, CDbl, CDate...) and the text helpers (Format$, short-date pattern).

#include <QDate>
#include <QLocale>
#include <QString>
#include <QTime>
#include <cstdint>
#include <vector>

namespace core::detail {

enum class ParseStatus { Ok, Invalid, Overflow };

ParseStatus parseDouble(const QString& text, const QLocale& locale, double* value);
/// Exact decimal parsing into the currency's scaled integer, so that the full range
/// (±922337203685477.5807) survives the round trip through text.
ParseStatus parseCurrency(const QString& text, const QLocale& locale, int64_t* scaled);
/// CDate / IsDate text: dates in the locale's field order (ISO year-first always works),
/// month names, times with ":" or the locale's time separator, AM/PM. Gives an OLE date.
bool parseDate(const QString& text, const QLocale& locale, double* oleDate);

/// A number in Basic's printed form with the given significant digits (15 for Double,
/// 7 for Single): no trailing zeros, exponent form "1E+20" / "1E-05" outside 1E-4..1E15.
QString numberText(double value, int significantDigits, const QString& decimalPoint);
QString currencyText(int64_t scaled, const QString& decimalPoint);

/// OLE automation dates: days since 1899-12-30; the fraction is the time of day, also for
/// negative days (-1.25 is 1899-12-29 06:00).
constexpr double MinOleDate = -657435.0; // exclusive: before 0100-01-01
constexpr double MaxOleDate = 2958466.0; // exclusive: after 9999-12-31 23:59:59.999
QDate oleBaseDate();
bool isValidOleDate(double value);
/// Splits an OLE date into a calendar date and a time rounded to `resolutionMs`.
void splitOleDate(double value, int resolutionMs, QDate* date, QTime* time);
double toOleDate(const QDate& date, const QTime& time);

/// The fields of the locale's short date, in order, with the separators between them.
struct DateLayout {
    struct Field {
        char kind; // 'd', 'm' or 'y'
        int width; // letters in the locale's format ("M" 1, "MM" 2, "MMM" 3)
    };
    std::vector<Field> fields;
    std::vector<QString> separators; // separators[i] sits between fields[i] and fields[i + 1]
};
DateLayout shortDateLayout(const QLocale& locale);

/// The separator between hour and minute of the locale's short time.
QString timeSeparator(const QLocale& locale);

/// Basic Format$ patterns of the locale's date and time as CStr prints them: the short
/// date with a four-digit year, the time with seconds.
QString dateDisplayPattern(const QLocale& locale);
QString timeDisplayPattern(const QLocale& locale);

QString formatDateTime(
    const QDate& date, const QTime& time, const QString& pattern, const QLocale& locale);

} // namespace core::detail
