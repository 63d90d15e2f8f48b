#pragma once

// Dates as the Basic conversion functions read them (CDate, IsDate), and OLE automation
// dates.

#include <QDate>
#include <QLocale>
#include <QString>
#include <QTime>

namespace core::detail {

/// CDate / IsDate text: dates in the locale's field order (ISO year-first always works),
/// month names, times with ":" or the locale's time separator, AM/PM. Gives an OLE date.
bool parseDate(const QString& text, const QLocale& locale, double* oleDate);

/// OLE automation dates: days since 1899-12-30; the fraction is the time of day, also for
/// negative days (-1.25 is 1899-12-29 06:00).
constexpr double MinOleDate = -657435.0; // exclusive: before 0100-01-01
constexpr double MaxOleDate = 2958466.0; // exclusive: after 9999-12-31 23:59:59.999
QDate oleBaseDate();
bool isValidOleDate(double value);
/// Splits an OLE date into a calendar date and a time rounded to `resolutionMs`.
void splitOleDate(double value, int resolutionMs, QDate* date, QTime* time);
double toOleDate(const QDate& date, const QTime& time);

} // namespace core::detail
