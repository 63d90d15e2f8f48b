#include "core/basictext_p.h"

#include <QStringView>
#include <algorithm>
#include <charconv>
#include <climits>
#include <cmath>
#include <limits>
#include <string>

namespace core::detail {

namespace {

// ---- Numbers -----------------------------------------------------------------------

/// A number read from text: mantissa digits with at most one '.', and a power of ten.
struct DecimalNumber {
    bool negative = false;
    std::string digits;
    int exponent = 0;
};

bool takePrefix(QStringView& text, QStringView prefix)
{
    if (prefix.isEmpty() || !text.startsWith(prefix))
        return false;
    text = text.sliced(prefix.size()).trimmed();
    return true;
}

bool takeSuffix(QStringView& text, QStringView suffix)
{
    if (suffix.isEmpty() || !text.endsWith(suffix))
        return false;
    text = text.chopped(suffix.size()).trimmed();
    return true;
}

/// Takes a sign at the front (or the back) of the text; true when one was there.
bool takeSign(QStringView& text, const QLocale& locale, bool atEnd, bool* negative)
{
    const auto take
        = [&](QStringView sign) { return atEnd ? takeSuffix(text, sign) : takePrefix(text, sign); };
    if (take(u"+") || take(locale.positiveSign())) {
        *negative = false;
        return true;
    }
    if (take(u"-") || take(u"\u2212") || take(locale.negativeSign())) {
        *negative = true;
        return true;
    }
    return false;
}

int radixDigit(QChar c)
{
    if (c >= u'0' && c <= u'9')
        return c.unicode() - u'0';
    if (c >= u'a' && c <= u'f')
        return c.unicode() - u'a' + 10;
    if (c >= u'A' && c <= u'F')
        return c.unicode() - u'A' + 10;
    return -1;
}

/// "&Hxxxx" and "&Oxxx" (or "&xxx"): like Basic's literals, a value that fits in 16 bits
/// is an Integer (so "&HFFFF" is -1), a larger one a Long.
ParseStatus readRadixLiteral(QStringView text, DecimalNumber* number)
{
    int base = 8;
    if (text.startsWith(u'h', Qt::CaseInsensitive)) {
        base = 16;
        text = text.sliced(1);
    } else if (text.startsWith(u'o', Qt::CaseInsensitive)) {
        text = text.sliced(1);
    }
    if (text.isEmpty())
        return ParseStatus::Invalid;
    uint64_t value = 0;
    for (const QChar c : text) {
        const int digit = radixDigit(c);
        if (digit < 0 || digit >= base)
            return ParseStatus::Invalid;
        value = value * static_cast<uint64_t>(base) + static_cast<uint64_t>(digit);
        if (value > 0xFFFFFFFFu)
            return ParseStatus::Overflow;
    }
    const int64_t signedValue
        = value <= 0xFFFFu ? static_cast<int16_t>(value) : static_cast<int32_t>(value);
    number->negative = signedValue < 0;
    number->digits = std::to_string(signedValue < 0 ? -signedValue : signedValue);
    number->exponent = 0;
    return ParseStatus::Ok;
}

ParseStatus readExponent(QStringView text, int* exponent)
{
    bool negative = false;
    if (text.startsWith(u'+') || text.startsWith(u'-')) {
        negative = text.front() == u'-';
        text = text.sliced(1);
    }
    if (text.isEmpty())
        return ParseStatus::Invalid;
    int value = 0;
    for (const QChar c : text) {
        if (!c.isDigit())
            return ParseStatus::Invalid;
        // Anything this large over- or underflows every type; stop before int overflows.
        value = std::min(value * 10 + c.digitValue(), 1000000);
    }
    *exponent = negative ? -value : value;
    return ParseStatus::Ok;
}

/// Reads a number as Basic's conversions do in the given locale: surrounding spaces, a
/// sign in front or behind, parentheses for negative numbers, the currency symbol, group
/// separators anywhere before the decimal separator, an exponent, and &H / &O literals.
ParseStatus readNumber(const QString& input, const QLocale& locale, DecimalNumber* number)
{
    QStringView text = QStringView(input).trimmed();
    if (text.startsWith(u'&'))
        return readRadixLiteral(text.sliced(1), number);

    bool negative = false;
    bool hasSign = false;
    if (text.size() >= 2 && text.front() == u'(' && text.back() == u')') {
        negative = hasSign = true;
        text = text.sliced(1, text.size() - 2).trimmed();
    }
    const QString currency = locale.currencySymbol();
    bool hasCurrency = false;
    for (const bool atEnd : { false, true }) {
        for (bool progress = true; progress && !text.isEmpty();) {
            progress = false;
            bool signNegative = false;
            if (!hasSign && takeSign(text, locale, atEnd, &signNegative)) {
                hasSign = progress = true;
                negative = signNegative;
            } else if (!hasCurrency
                && (atEnd ? takeSuffix(text, currency) : takePrefix(text, currency))) {
                hasCurrency = progress = true;
            }
        }
    }

    const QString point = locale.decimalPoint();
    const QString group = locale.groupSeparator();
    // Locales that group with a (no-break) space also get plain spaces typed by users.
    const bool spaceGroups = group.size() == 1 && group.front().isSpace();
    number->negative = negative;
    number->digits.clear();
    number->exponent = 0;
    bool seenPoint = false;
    int mantissaDigits = 0;
    for (qsizetype i = 0; i < text.size();) {
        const QChar c = text[i];
        const QStringView rest = text.sliced(i);
        if (c.isDigit()) {
            number->digits += static_cast<char>('0' + c.digitValue());
            ++mantissaDigits;
            ++i;
        } else if (!seenPoint && rest.startsWith(point)) {
            number->digits += '.';
            seenPoint = true;
            i += point.size();
        } else if (!seenPoint && mantissaDigits > 0 && !group.isEmpty() && rest.startsWith(group)) {
            i += group.size();
        } else if (!seenPoint && mantissaDigits > 0 && spaceGroups && c.isSpace()) {
            ++i;
        } else if ((c == u'e' || c == u'E') && mantissaDigits > 0) {
            return readExponent(text.sliced(i + 1), &number->exponent);
        } else {
            return ParseStatus::Invalid;
        }
    }
    return mantissaDigits > 0 ? ParseStatus::Ok : ParseStatus::Invalid;
}

/// The power of ten of the number's first significant digit; INT_MIN for zero.
int leadingPowerOfTen(const DecimalNumber& number)
{
    const size_t pointAt = std::min(number.digits.find('.'), number.digits.size());
    const size_t first = number.digits.find_first_not_of("0.");
    if (first == std::string::npos)
        return INT_MIN;
    const int power = first < pointAt ? static_cast<int>(pointAt - first) - 1
                                      : -static_cast<int>(first - pointAt);
    return power + number.exponent;
}

bool appendDigit(uint64_t* value, int digit)
{
    return !__builtin_mul_overflow(*value, 10u, value)
        && !__builtin_add_overflow(*value, static_cast<uint64_t>(digit), value);
}

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

// ---- Date and time patterns --------------------------------------------------------

/// The unquoted pieces of a Qt date/time format: runs of one pattern letter and literal
/// text between them. Quoted text (Bulgarian "'г'.") is dropped: it is no part of a date
/// typed or shown in digits.
struct FormatPiece {
    QChar letter; // null for a literal
    qsizetype count;
    QString literal;
};

std::vector<FormatPiece> splitQtFormat(const QString& format, QStringView letters)
{
    std::vector<FormatPiece> pieces;
    bool quoted = false;
    for (qsizetype i = 0; i < format.size();) {
        const QChar c = format[i];
        if (c == u'\'') {
            quoted = !quoted;
            ++i;
        } else if (!quoted && letters.contains(c)) {
            qsizetype end = i;
            while (end < format.size() && format[end] == c)
                ++end;
            pieces.push_back({ c, end - i, {} });
            i = end;
        } else {
            if (!quoted) {
                if (pieces.empty() || !pieces.back().letter.isNull())
                    pieces.push_back({ QChar(), 0, {} });
                pieces.back().literal += c;
            }
            ++i;
        }
    }
    return pieces;
}

QString escaped(const QString& literal)
{
    QString result;
    for (const QChar c : literal) {
        result += u'\\';
        result += c;
    }
    return result;
}

struct TimeLayout {
    int hourWidth = 2;
    QString separator = QStringLiteral(":");
    int dayHalf = 0; // 0 none, -1 before the time, 1 after it
    QString dayHalfGap = QStringLiteral(" ");
};

TimeLayout shortTimeLayout(const QLocale& locale)
{
    const std::vector<FormatPiece> pieces
        = splitQtFormat(locale.timeFormat(QLocale::ShortFormat), u"hHmsapAPt");
    TimeLayout layout;
    qsizetype hourAt = -1;
    qsizetype dayHalfAt = -1;
    for (size_t i = 0; i < pieces.size(); ++i) {
        const QChar letter = pieces[i].letter.toLower();
        if (letter == u'h' && hourAt < 0) {
            hourAt = static_cast<qsizetype>(i);
            layout.hourWidth = pieces[i].count >= 2 ? 2 : 1;
            if (i + 2 < pieces.size() && pieces[i + 1].letter.isNull()
                && pieces[i + 2].letter == u'm')
                layout.separator = pieces[i + 1].literal;
        } else if (letter == u'a' && dayHalfAt < 0) {
            dayHalfAt = static_cast<qsizetype>(i);
        }
    }
    if (dayHalfAt >= 0) {
        // Qt writes AM/PM as "AP": an 'A' run and a 'P' run; the gap lies outside both.
        layout.dayHalf = dayHalfAt < hourAt ? -1 : 1;
        qsizetype gapAt = dayHalfAt - 1;
        const auto size = static_cast<qsizetype>(pieces.size());
        if (layout.dayHalf < 0) {
            gapAt = dayHalfAt + 1;
            while (gapAt < size && pieces[static_cast<size_t>(gapAt)].letter.toLower() == u'p')
                ++gapAt;
        }
        if (gapAt >= 0 && gapAt < size && pieces[static_cast<size_t>(gapAt)].letter.isNull())
            layout.dayHalfGap = pieces[static_cast<size_t>(gapAt)].literal;
    }
    return layout;
}

// ---- Format$ -----------------------------------------------------------------------

struct FormatToken {
    enum Kind { Literal, Day, Month, Minute, Year, Hour, Second, DayHalf } kind;
    qsizetype count = 0;
    QString text; // the literal, or the AM/PM form as written
};

/// AM/PM forms of Format$ at the start of `text`, longest first.
qsizetype dayHalfFormLength(QStringView text)
{
    for (const QStringView form :
        { QStringView(u"am/pm"), QStringView(u"ampm"), QStringView(u"a/p") }) {
        if (text.startsWith(form, Qt::CaseInsensitive))
            return form.size();
    }
    return 0;
}

std::vector<FormatToken> tokenizeFormat(const QString& pattern, const QString& dateSep)
{
    std::vector<FormatToken> tokens;
    const auto addLiteral = [&tokens](QStringView text) {
        if (tokens.empty() || tokens.back().kind != FormatToken::Literal)
            tokens.push_back({ FormatToken::Literal, 0, {} });
        tokens.back().text += text;
    };
    for (qsizetype i = 0; i < pattern.size();) {
        const QChar c = pattern[i];
        const QChar lower = c.toLower();
        if (c == u'"') {
            const qsizetype end = pattern.indexOf(u'"', i + 1);
            const qsizetype stop = end < 0 ? pattern.size() : end;
            addLiteral(QStringView(pattern).sliced(i + 1, stop - i - 1));
            i = stop + 1;
        } else if (c == u'\\') {
            if (i + 1 < pattern.size())
                addLiteral(QStringView(pattern).sliced(i + 1, 1));
            i += 2;
        } else if (c == u'/') {
            addLiteral(dateSep);
            ++i;
        } else if (const qsizetype length = dayHalfFormLength(QStringView(pattern).sliced(i))) {
            tokens.push_back({ FormatToken::DayHalf, 0, pattern.mid(i, length) });
            i += length;
        } else if (QStringView(u"dmyhns").contains(lower)) {
            qsizetype end = i;
            while (end < pattern.size() && pattern[end].toLower() == lower)
                ++end;
            FormatToken::Kind kind = FormatToken::Second;
            switch (lower.unicode()) {
            case u'd':
                kind = FormatToken::Day;
                break;
            case u'm':
                kind = FormatToken::Month;
                break;
            case u'y':
                kind = FormatToken::Year;
                break;
            case u'h':
                kind = FormatToken::Hour;
                break;
            case u'n':
                kind = FormatToken::Minute;
                break;
            default:
                break;
            }
            tokens.push_back({ kind, end - i, {} });
            i = end;
        } else {
            addLiteral(QStringView(pattern).sliced(i, 1));
            ++i;
        }
    }
    // "m" and "mm" are minutes right after an hour or right before seconds ("hh:mm",
    // "mm:ss"), otherwise months.
    for (size_t i = 0; i < tokens.size(); ++i) {
        if (tokens[i].kind != FormatToken::Month || tokens[i].count > 2)
            continue;
        const auto isField
            = [](const FormatToken& token) { return token.kind != FormatToken::Literal; };
        const auto before
            = std::find_if(tokens.rbegin() + static_cast<std::ptrdiff_t>(tokens.size() - i),
                tokens.rend(), isField);
        const auto after = std::find_if(
            tokens.begin() + static_cast<std::ptrdiff_t>(i + 1), tokens.end(), isField);
        if ((before != tokens.rend() && before->kind == FormatToken::Hour)
            || (after != tokens.end() && after->kind == FormatToken::Second))
            tokens[i].kind = FormatToken::Minute;
    }
    return tokens;
}

QString padded(int value, qsizetype width)
{
    return QString::number(value).rightJustified(width, u'0');
}

QString dayHalfText(const QString& form, bool isAm, const QLocale& locale)
{
    if (form.compare(u"ampm", Qt::CaseInsensitive) == 0)
        return isAm ? locale.amText() : locale.pmText();
    // "AM/PM" and "A/P" print the half that is written, in the case it is written in.
    const qsizetype slash = form.indexOf(u'/');
    return isAm ? form.left(slash) : form.mid(slash + 1);
}

} // namespace

ParseStatus parseDouble(const QString& text, const QLocale& locale, double* value)
{
    DecimalNumber number;
    const ParseStatus status = readNumber(text, locale, &number);
    if (status != ParseStatus::Ok)
        return status;
    const std::string cForm = number.digits + 'e' + std::to_string(number.exponent);
    double result = 0.0;
    const auto [end, error] = std::from_chars(cForm.data(), cForm.data() + cForm.size(), result);
    if (error == std::errc::result_out_of_range) {
        if (leadingPowerOfTen(number) > 0)
            return ParseStatus::Overflow;
        result = 0.0;
    } else if (error != std::errc() || end != cForm.data() + cForm.size()) {
        return ParseStatus::Invalid;
    }
    *value = number.negative ? -result : result;
    return ParseStatus::Ok;
}

ParseStatus parseCurrency(const QString& text, const QLocale& locale, int64_t* scaled)
{
    DecimalNumber number;
    const ParseStatus status = readNumber(text, locale, &number);
    if (status != ParseStatus::Ok)
        return status;

    std::string digits;
    int fractionDigits = 0;
    bool afterPoint = false;
    for (const char c : number.digits) {
        if (c == '.') {
            afterPoint = true;
            continue;
        }
        if (!digits.empty() || c != '0')
            digits += c;
        if (afterPoint)
            ++fractionDigits;
    }
    // The digits times 10^shift are the value in units of 1/10000.
    const long shift = static_cast<long>(number.exponent) - fractionDigits + 4;
    const long kept = static_cast<long>(digits.size()) + std::min(shift, 0L);
    if (kept + std::max(shift, 0L) > 19)
        return ParseStatus::Overflow;

    uint64_t magnitude = 0;
    for (long i = 0; i < kept; ++i) {
        if (!appendDigit(&magnitude, digits[static_cast<size_t>(i)] - '0'))
            return ParseStatus::Overflow;
    }
    for (long i = 0; i < shift; ++i) {
        if (!appendDigit(&magnitude, 0))
            return ParseStatus::Overflow;
    }
    if (kept >= 0 && static_cast<size_t>(kept) < digits.size()) {
        // Round half to even on the dropped digits.
        const char first = digits[static_cast<size_t>(kept)];
        const bool restNonZero
            = digits.find_first_not_of('0', static_cast<size_t>(kept) + 1) != std::string::npos;
        if (first > '5' || (first == '5' && (restNonZero || magnitude % 2 == 1)))
            ++magnitude;
    }
    const uint64_t limit
        = static_cast<uint64_t>(std::numeric_limits<int64_t>::max()) + (number.negative ? 1u : 0u);
    if (magnitude > limit)
        return ParseStatus::Overflow;
    *scaled
        = number.negative ? static_cast<int64_t>(0 - magnitude) : static_cast<int64_t>(magnitude);
    return ParseStatus::Ok;
}

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

QString numberText(double value, int significantDigits, const QString& decimalPoint)
{
    if (value == 0.0)
        return QStringLiteral("0"); // also for -0, which Basic never prints with a sign
    char buffer[64];
    const auto [end, error] = std::to_chars(
        buffer, buffer + sizeof buffer, value, std::chars_format::general, significantDigits);
    if (error != std::errc())
        return QString::number(value);
    QString text = QString::fromLatin1(buffer, end - buffer);
    text.replace(u'e', u'E');
    text.replace(QStringLiteral("."), decimalPoint);
    return text;
}

QString currencyText(int64_t scaled, const QString& decimalPoint)
{
    const uint64_t magnitude
        = scaled < 0 ? 0 - static_cast<uint64_t>(scaled) : static_cast<uint64_t>(scaled);
    QString text
        = (scaled < 0 ? QStringLiteral("-") : QString()) + QString::number(magnitude / 10000u);
    if (const uint64_t fraction = magnitude % 10000u) {
        QString digits = QString::number(fraction).rightJustified(4, u'0');
        while (digits.endsWith(u'0'))
            digits.chop(1);
        text += decimalPoint + digits;
    }
    return text;
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

DateLayout shortDateLayout(const QLocale& locale)
{
    const std::vector<FormatPiece> pieces
        = splitQtFormat(locale.dateFormat(QLocale::ShortFormat), u"dMy");
    DateLayout layout;
    QString pending;
    for (const FormatPiece& piece : pieces) {
        if (piece.letter.isNull()) {
            pending += piece.literal;
            continue;
        }
        if (piece.letter == u'd' && piece.count >= 3)
            continue; // a weekday name has no place in a numeric date
        if (!layout.fields.empty())
            layout.separators.push_back(pending);
        pending.clear();
        const char kind = piece.letter == u'd' ? 'd' : piece.letter == u'M' ? 'm' : 'y';
        layout.fields.push_back({ kind, static_cast<int>(piece.count) });
    }
    std::string kinds;
    for (const DateLayout::Field& field : layout.fields)
        kinds += field.kind;
    std::sort(kinds.begin(), kinds.end());
    if (kinds != "dmy") {
        // A locale without a usable numeric short date: fall back to ISO order.
        layout.fields = { { 'y', 4 }, { 'm', 2 }, { 'd', 2 } };
        layout.separators = { QStringLiteral("-"), QStringLiteral("-") };
    }
    return layout;
}

QString timeSeparator(const QLocale& locale)
{
    return shortTimeLayout(locale).separator;
}

QString dateDisplayPattern(const QLocale& locale)
{
    const DateLayout layout = shortDateLayout(locale);
    QString pattern;
    for (size_t i = 0; i < layout.fields.size(); ++i) {
        if (i > 0)
            pattern += escaped(layout.separators[i - 1]);
        const DateLayout::Field& field = layout.fields[i];
        if (field.kind == 'y')
            pattern += u"yyyy";
        else
            pattern += QString(
                std::min(field.width, field.kind == 'd' ? 2 : 4), QLatin1Char(field.kind));
    }
    return pattern;
}

QString timeDisplayPattern(const QLocale& locale)
{
    const TimeLayout layout = shortTimeLayout(locale);
    // Finnish writes times as 9.05.00, which reads back as 9 May 2000; a colon keeps a
    // time of day readable as one.
    const QString separator = escaped(layout.separator == shortDateLayout(locale).separators.front()
            ? QStringLiteral(":")
            : layout.separator);
    const QString time = QString(layout.hourWidth, u'h') + separator + u"nn" + separator + u"ss";
    if (layout.dayHalf < 0)
        return u"ampm" + escaped(layout.dayHalfGap) + time;
    if (layout.dayHalf > 0)
        return time + escaped(layout.dayHalfGap) + u"ampm";
    return time;
}

QString formatDateTime(
    const QDate& date, const QTime& time, const QString& pattern, const QLocale& locale)
{
    const DateLayout layout = shortDateLayout(locale);
    const QString dateSep = layout.separators.empty() ? QString() : layout.separators.front();
    const std::vector<FormatToken> tokens = tokenizeFormat(pattern, dateSep);
    const bool twelveHours = std::any_of(tokens.begin(), tokens.end(),
        [](const FormatToken& token) { return token.kind == FormatToken::DayHalf; });
    // Languages that inflect month names ("4. joulukuuta", but "joulukuu" alone) take the
    // inflected form next to a day number.
    const bool hasDayNumber
        = std::any_of(tokens.begin(), tokens.end(), [](const FormatToken& token) {
              return token.kind == FormatToken::Day && token.count <= 2;
          });
    const auto monthFormat
        = [](qsizetype count) { return count == 3 ? QLocale::ShortFormat : QLocale::LongFormat; };
    QString text;
    for (const FormatToken& token : tokens) {
        switch (token.kind) {
        case FormatToken::Literal:
            text += token.text;
            break;
        case FormatToken::Day:
            if (token.count <= 2)
                text += padded(date.day(), token.count);
            else if (token.count <= 4)
                text += locale.dayName(date.dayOfWeek(),
                    token.count == 3 ? QLocale::ShortFormat : QLocale::LongFormat);
            else if (token.count == 5)
                text += formatDateTime(date, time, dateDisplayPattern(locale), locale);
            else
                text += locale.toString(date, QLocale::LongFormat);
            break;
        case FormatToken::Month:
            if (token.count <= 2)
                text += padded(date.month(), token.count);
            else if (hasDayNumber)
                text += locale.monthName(date.month(), monthFormat(token.count));
            else
                text += locale.standaloneMonthName(date.month(), monthFormat(token.count));
            break;
        case FormatToken::Year:
            if (token.count == 1)
                text += QString::number(date.dayOfYear());
            else if (token.count == 2)
                text += padded(date.year() % 100, 2);
            else if (token.count == 3)
                text += padded(date.year() % 100, 2) + QString::number(date.dayOfYear());
            else
                text += padded(date.year(), 4);
            break;
        case FormatToken::Hour: {
            int hour = time.hour();
            if (twelveHours)
                hour = hour % 12 == 0 ? 12 : hour % 12;
            text += padded(hour, std::min<qsizetype>(token.count, 2));
            break;
        }
        case FormatToken::Minute:
            text += padded(time.minute(), std::min<qsizetype>(token.count, 2));
            break;
        case FormatToken::Second:
            text += padded(time.second(), std::min<qsizetype>(token.count, 2));
            break;
        case FormatToken::DayHalf:
            text += dayHalfText(token.text, time.hour() < 12, locale);
            break;
        }
    }
    return text;
}

} // namespace core::detail
