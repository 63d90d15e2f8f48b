#pragma once

#include "core/ludmoxexport.h"

#include <QDateTime>
#include <QString>

namespace core::text {

/// Basic comparison modes.
enum class Compare { Binary, Text };

/// Text comparison (Option Compare Text): case-insensitive equality.
LUDMOX_EXPORT bool equalsText(const QString& a, const QString& b);

/// InStr: 1-based position of `find` in `text` from `start` (1-based), 0 when absent;
/// `start` below 1 raises 5.
LUDMOX_EXPORT int inStr(
    int start, const QString& text, const QString& find, Compare compare = Compare::Binary);
LUDMOX_EXPORT int inStr(
    const QString& text, const QString& find, Compare compare = Compare::Binary);
/// InStrRev: searches backwards from `start` (-1 = end); 1-based, 0 when absent; a match
/// must end at or before `start`. `start` 0 or below -1 raises 5.
LUDMOX_EXPORT int inStrRev(
    const QString& text, const QString& find, int start = -1, Compare compare = Compare::Binary);

/// Trim / LTrim / RTrim: spaces (U+0020) only, not tabs or line breaks.
LUDMOX_EXPORT QString trimSpaces(const QString& text);
LUDMOX_EXPORT QString trimLeftSpaces(const QString& text);
LUDMOX_EXPORT QString trimRightSpaces(const QString& text);

/// Basic Left$, Right$, Mid$ (1-based start, length -1 = to the end); never raise.
LUDMOX_EXPORT QString left(const QString& text, int length);
LUDMOX_EXPORT QString right(const QString& text, int length);
LUDMOX_EXPORT QString mid(const QString& text, int start, int length = -1);

/// Replace$ of every occurrence.
LUDMOX_EXPORT QString replace(const QString& text, const QString& find, const QString& with,
    Compare compare = Compare::Binary);

/// The Like operator: ? one character, * any run, # one digit, [list] and [!list] with
/// ranges. Binary compare is case-sensitive; Text is not. An unclosed "[" or a descending
/// range raises 93 ("Invalid pattern string").
LUDMOX_EXPORT bool like(
    const QString& text, const QString& pattern, Compare compare = Compare::Binary);

/// Format$ for dates with the pattern letters d, dd, m, mm (month; minutes after h),
/// yy, yyyy, h, hh, n, nn, s, ss, in any letter case, and "/" (the locale date separator)
/// ":" "." "-" " " as literals. Example: format(dt, "DDYYMMHHNNSS") -> "042612224831".
/// Also: ddd/dddd and mmm/mmmm (locale day and month names), y (day of the year),
/// AM/PM, am/pm, A/P, a/p and AMPM (locale designators) for a 12-hour clock, "quoted" and
/// \escaped literals. An invalid date-time gives "".
LUDMOX_EXPORT QString format(const QDateTime& value, const QString& pattern);

/// The date separator of the user's short-date format (what Format$(date, "/") gives).
LUDMOX_EXPORT QString dateSeparator();

/// The user's short-date pattern in Basic letters with a four-digit year, e.g. "dd.mm.yyyy".
LUDMOX_EXPORT QString shortDatePattern();

} // namespace core::text
