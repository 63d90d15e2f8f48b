#pragma once

// The locale's date and time patterns, and dates and times written through Format$
// patterns (CStr, Format$, the short-date pattern).

#include <QDate>
#include <QLocale>
#include <QString>
#include <QTime>
#include <vector>

namespace core::detail {

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
