#include "core/dateformatting_p.h"
#include "core/dateparsing_p.h"

#include <QStringView>
#include <algorithm>
#include <charconv>
#include <climits>
#include <cmath>
#include <limits>
#include <string>

namespace core::detail {

namespace {

// ---- Dates -------------------------------------------------------------------------

struct DateToken {
    enum Kind { Number, Word, Separator } kind;
    QStringView text;
    int value = 0;
};

std::vector<DateToken> tokenizeDate(QStringView text)
{
    std::vector<DateToken> tokens;
    for (qsizetype i = 0; i < text.size();) {
        const qsizetype start = i;
        DateToken token { DateToken::Separator, {}, 0 };
        if (text[i].isDigit()) {
            token.kind = DateToken::Number;
            for (; i < text.size() && text[i].isDigit(); ++i)
                token.value = std::min(token.value * 10 + text[i].digitValue(), 1000000);
        } else if (text[i].isLetter()) {
            token.kind = DateToken::Word;
            while (i < text.size() && text[i].isLetter())
                ++i;
        } else {
            while (i < text.size() && !text[i].isDigit() && !text[i].isLetter())
                ++i;
        }
        token.text = text.sliced(start, i - start);
        tokens.push_back(token);
    }
    return tokens;
}

bool sameName(QStringView word, QString name)
{
    name.remove(u'.');
    return !name.isEmpty() && word.compare(name, Qt::CaseInsensitive) == 0;
}

/// 1..12 for a month name (or an unambiguous start of one, three letters at least) in
/// the locale or in English; 0 otherwise.
int monthFromName(QStringView word, const QLocale& locale)
{
    for (const QLocale& names : { locale, QLocale::c() }) {
        for (int month = 1; month <= 12; ++month) {
            for (const QLocale::FormatType format : { QLocale::LongFormat, QLocale::ShortFormat }) {
                if (sameName(word, names.monthName(month, format))
                    || sameName(word, names.standaloneMonthName(month, format)))
                    return month;
            }
            if (word.size() >= 3
                && names.monthName(month, QLocale::LongFormat)
                       .startsWith(word, Qt::CaseInsensitive))
                return month;
        }
    }
    return 0;
}

bool isWeekdayName(QStringView word, const QLocale& locale)
{
    for (const QLocale& names : { locale, QLocale::c() }) {
        for (int day = 1; day <= 7; ++day) {
            if (sameName(word, names.dayName(day, QLocale::LongFormat))
                || sameName(word, names.dayName(day, QLocale::ShortFormat)))
                return true;
        }
    }
    return false;
}

/// 1 for AM, 2 for PM, 0 for neither.
int dayHalfFromName(QStringView word, const QLocale& locale)
{
    if (sameName(word, locale.amText()) || sameName(word, QStringLiteral("AM"))
        || sameName(word, QStringLiteral("A")))
        return 1;
    if (sameName(word, locale.pmText()) || sameName(word, QStringLiteral("PM"))
        || sameName(word, QStringLiteral("P")))
        return 2;
    return 0;
}

struct DateNumber {
    int value;
    qsizetype digits;
    bool looksLikeYear() const { return digits >= 3 || value > 31; }
};

int expandYear(const DateNumber& year)
{
    // Basic's window for two-digit years: 00-29 are 2000-2029, 30-99 are 1930-1999.
    if (year.digits <= 2)
        return year.value < 30 ? 2000 + year.value : 1900 + year.value;
    return year.value;
}

bool resolveDate(
    const std::vector<DateNumber>& numbers, int monthByName, const DateLayout& layout, QDate* date)
{
    const DateNumber thisYear { QDate::currentDate().year(), 4 };
    DateNumber year = thisYear;
    int month = monthByName;
    int day = 1;
    bool mayBeSwapped = false;
    if (monthByName != 0) {
        if (numbers.size() == 1) {
            if (numbers[0].looksLikeYear())
                year = numbers[0];
            else
                day = numbers[0].value;
        } else if (numbers.size() == 2) {
            const bool yearFirst = numbers[0].looksLikeYear() && !numbers[1].looksLikeYear();
            year = numbers[yearFirst ? 0 : 1];
            day = numbers[yearFirst ? 1 : 0].value;
        } else {
            return false;
        }
    } else if (numbers.size() == 2) {
        if (numbers[1].looksLikeYear()) {
            month = numbers[0].value;
            year = numbers[1];
        } else if (numbers[0].looksLikeYear()) {
            year = numbers[0];
            month = numbers[1].value;
        } else {
            const auto dayAt = std::find_if(layout.fields.begin(), layout.fields.end(),
                [](const DateLayout::Field& f) { return f.kind == 'd'; });
            const auto monthAt = std::find_if(layout.fields.begin(), layout.fields.end(),
                [](const DateLayout::Field& f) { return f.kind == 'm'; });
            const bool dayFirst = dayAt < monthAt;
            day = numbers[dayFirst ? 0 : 1].value;
            month = numbers[dayFirst ? 1 : 0].value;
            mayBeSwapped = true;
        }
    } else if (numbers.size() == 3) {
        if (numbers[0].looksLikeYear() || layout.fields.front().kind == 'y') {
            year = numbers[0];
            month = numbers[1].value;
            day = numbers[2].value;
        } else {
            for (size_t i = 0; i < 3; ++i) {
                switch (layout.fields[i].kind) {
                case 'd':
                    day = numbers[i].value;
                    break;
                case 'm':
                    month = numbers[i].value;
                    break;
                default:
                    year = numbers[i];
                    break;
                }
            }
        }
        mayBeSwapped = true;
    } else {
        return false;
    }
    const int fullYear = expandYear(year);
    if (fullYear < 100 || fullYear > 9999)
        return false;
    // Like Basic, a day and month that only make sense the other way round are swapped
    // (13/12/2026 in a month-first locale is 13 December).
    if (!QDate::isValid(fullYear, month, day) && mayBeSwapped)
        std::swap(day, month);
    *date = QDate(fullYear, month, day);
    return date->isValid();
}

} // namespace

bool parseDate(const QString& text, const QLocale& locale, double* oleDate)
{
    const std::vector<DateToken> tokens = tokenizeDate(QStringView(text).trimmed());
    const QString timeSep = timeSeparator(locale);
    const DateLayout layout = shortDateLayout(locale);
    // Where the decimal point doubles as the date separator (none known), dates win.
    const QString decimalPoint
        = layout.separators.front() == locale.decimalPoint() ? QString() : locale.decimalPoint();

    std::vector<DateNumber> dateNumbers;
    std::vector<int> timeNumbers;
    bool hasTime = false;
    int monthByName = 0;
    int dayHalf = 0;
    const auto dateComplete
        = [&] { return dateNumbers.size() >= 3 || (monthByName != 0 && dateNumbers.size() >= 2); };
    const auto isSpaceSeparator = [](const DateToken& token) {
        return token.kind == DateToken::Separator && token.text.trimmed().isEmpty();
    };

    for (size_t i = 0; i < tokens.size();) {
        const DateToken& token = tokens[i];
        if (token.kind == DateToken::Separator) {
            ++i;
            continue;
        }
        if (token.kind == DateToken::Word) {
            if (const int month = monthFromName(token.text, locale); month != 0 && monthByName == 0)
                monthByName = month;
            else if (const int half = dayHalfFromName(token.text, locale); half != 0 && !dayHalf)
                dayHalf = half;
            else if (!isWeekdayName(token.text, locale))
                return false;
            ++i;
            continue;
        }
        // A group of numbers joined by separators without spaces: "4.12.2026", "14:30:00".
        std::vector<size_t> group { i };
        bool colon = false;
        bool allTimeSeparators = true;
        bool joinedByDecimalPoint = false;
        size_t last = i;
        while (last + 2 < tokens.size() && tokens[last + 1].kind == DateToken::Separator
            && !tokens[last + 1].text.contains(u' ')
            && tokens[last + 2].kind == DateToken::Number) {
            colon = colon || tokens[last + 1].text == u":";
            allTimeSeparators = allTimeSeparators && tokens[last + 1].text == timeSep;
            joinedByDecimalPoint = tokens[last + 1].text == decimalPoint;
            group.push_back(last + 2);
            last += 2;
        }
        i = last + 1;
        size_t next = i;
        while (next < tokens.size() && isSpaceSeparator(tokens[next]))
            ++next;
        const bool dayHalfFollows = next < tokens.size() && tokens[next].kind == DateToken::Word
            && dayHalfFromName(tokens[next].text, locale) != 0;
        // "10 PM" is an hour, but in "2026. 12. 4 PM 10:48" the 4 is the day.
        const bool hourOnly = dayHalfFollows
            && std::none_of(tokens.begin() + static_cast<std::ptrdiff_t>(next), tokens.end(),
                [](const DateToken& t) { return t.kind == DateToken::Number; });
        if (group.size() == 2 && joinedByDecimalPoint)
            return false; // "1,5" in Estonian is a number, not the first of May
        const bool isTime = colon
            || (group.size() > 1 && allTimeSeparators && (dateComplete() || dayHalfFollows))
            || (group.size() == 1 && hourOnly);
        if (isTime) {
            if (hasTime || group.size() > 3)
                return false;
            hasTime = true;
            for (const size_t at : group)
                timeNumbers.push_back(tokens[at].value);
        } else {
            for (const size_t at : group)
                dateNumbers.push_back({ tokens[at].value, tokens[at].text.size() });
        }
    }

    QDate date = oleBaseDate();
    if (!dateNumbers.empty() || monthByName != 0) {
        if (!resolveDate(dateNumbers, monthByName, layout, &date))
            return false;
    } else if (!hasTime) {
        return false;
    }

    QTime time(0, 0);
    if (hasTime) {
        timeNumbers.resize(3, 0);
        int hour = timeNumbers[0];
        if (dayHalf != 0) {
            if (hour > 12)
                return false;
            hour = hour % 12 + (dayHalf == 2 ? 12 : 0);
        }
        if (!QTime::isValid(hour, timeNumbers[1], timeNumbers[2]))
            return false;
        time = QTime(hour, timeNumbers[1], timeNumbers[2]);
    } else if (dayHalf != 0) {
        return false;
    }
    *oleDate = toOleDate(date, time);
    return true;
}

QDate oleBaseDate()
{
    return QDate(1899, 12, 30);
}

bool isValidOleDate(double value)
{
    return value > MinOleDate && value < MaxOleDate;
}

void splitOleDate(double value, int resolutionMs, QDate* date, QTime* time)
{
    constexpr int64_t DayMs = 86400000;
    const double days = std::trunc(value);
    int64_t dayCount = static_cast<int64_t>(days);
    int64_t ms = std::llround(std::fabs(value - days) * static_cast<double>(DayMs) / resolutionMs)
        * resolutionMs;
    if (ms >= DayMs) {
        // Rounded up to midnight: that is the start of the following day, for negative
        // dates too (their fraction runs forward from the start of their day).
        ms -= DayMs;
        ++dayCount;
    }
    *date = oleBaseDate().addDays(dayCount);
    *time = QTime::fromMSecsSinceStartOfDay(static_cast<int>(ms));
}

double toOleDate(const QDate& date, const QTime& time)
{
    const auto days = static_cast<double>(oleBaseDate().daysTo(date));
    const double fraction = time.msecsSinceStartOfDay() / 86400000.0;
    return days >= 0 ? days + fraction : days - fraction;
}

} // namespace core::detail
