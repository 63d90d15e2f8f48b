#include "core/numbertext_p.h"

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

} // namespace core::detail
