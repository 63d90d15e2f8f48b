#include "reportrt/layout/valueformatter.h"

#include <QDate>
#include <charconv>
#include <cmath>
#include <string>

namespace reportrt {

namespace {

constexpr int maximumDecimals = 10;
constexpr int dateCacheLimit = 4096;

bool isDigitPlace(QChar c)
{
    return c == u'0' || c == u'#';
}

/// A Qt date pattern from a locale's, with four-digit years.
QString withFullYear(QString pattern)
{
    if (!pattern.contains(QStringLiteral("yyyy")))
        pattern.replace(QStringLiteral("yy"), QStringLiteral("yyyy"));
    return pattern;
}

} // namespace

ValueFormatter::ValueFormatter(const QLocale& locale)
    : m_locale(locale)
    , m_decimal(locale.decimalPoint().isEmpty() ? QChar(u'.') : locale.decimalPoint().front())
    , m_group(locale.groupSeparator())
    , m_minus(locale.negativeSign().isEmpty() ? QStringLiteral("-") : locale.negativeSign())
    , m_shortDate(withFullYear(locale.dateFormat(QLocale::ShortFormat)))
{ }

ValueFormatter::NumberPattern ValueFormatter::numberPattern(const QString& pattern)
{
    NumberPattern p;
    qsizetype first = -1;
    qsizetype last = -1;
    for (qsizetype i = 0; i < pattern.size(); ++i) {
        if (isDigitPlace(pattern.at(i))) {
            if (first < 0)
                first = i;
            last = i;
        }
    }
    if (first < 0)
        return p;
    // A decimal point right after the last place still belongs to the number ("0.").
    qsizetype end = last + 1;
    if (end < pattern.size() && pattern.at(end) == u'.')
        ++end;
    const QString body = pattern.mid(first, end - first);
    for (const QChar c : body) {
        if (!isDigitPlace(c) && c != u',' && c != u'.')
            return p;
    }
    if (body.count(u'.') > 1)
        return p;
    p.prefix = pattern.left(first);
    p.suffix = pattern.mid(end);
    const qsizetype point = body.indexOf(u'.');
    p.decimals = point < 0 ? 0 : static_cast<int>(body.size() - point - 1);
    p.decimals = std::min(p.decimals, maximumDecimals);
    p.grouped = body.left(point < 0 ? body.size() : point).contains(u',');
    p.valid = true;
    return p;
}

QString ValueFormatter::formatNumber(double value, const NumberPattern& pattern) const
{
    if (!std::isfinite(value))
        return QString::number(value);
    // The shortest digits that give the value back, rounded half away from zero to the
    // decimals shown: 2.675 shows as 2.68, as the user reads the number, although the
    // double is a hair below it.
    char digits[400];
    const auto result = std::to_chars(
        digits, digits + sizeof digits - 1, std::fabs(value), std::chars_format::fixed);
    if (result.ec != std::errc())
        return QString::number(value);
    std::string text(digits, static_cast<size_t>(result.ptr - digits));
    size_t point = text.find('.');
    if (point == std::string::npos) {
        point = text.size();
        text += '.';
    }
    const size_t keep = point + 1 + static_cast<size_t>(pattern.decimals);
    if (text.size() < keep)
        text.append(keep - text.size(), '0');
    if (text.size() > keep) {
        const bool up = text[keep] >= '5';
        text.resize(keep);
        if (up) {
            // Carry from the last kept digit leftwards, over the point.
            size_t i = keep;
            while (i-- > 0) {
                if (text[i] == '.')
                    continue;
                if (text[i] == '9') {
                    text[i] = '0';
                    continue;
                }
                ++text[i];
                break;
            }
            if (i == static_cast<size_t>(-1)) {
                text.insert(text.begin(), '1');
                ++point;
            }
        }
    }
    const std::string_view whole(text.data(), point);
    const std::string_view fraction(text.data() + point + 1, static_cast<size_t>(pattern.decimals));
    const bool isZero = whole.find_first_not_of('0') == std::string_view::npos
        && fraction.find_first_not_of('0') == std::string_view::npos;

    QString out;
    out.reserve(static_cast<qsizetype>(text.size() * 2 + pattern.prefix.size() + 8));
    if (value < 0 && !isZero)
        out += m_minus;
    out += pattern.prefix;
    for (size_t i = 0; i < whole.size(); ++i) {
        if (pattern.grouped && i > 0 && (whole.size() - i) % 3 == 0)
            out += m_group;
        out += QLatin1Char(whole[i]);
    }
    if (!fraction.empty()) {
        out += m_decimal;
        out += QLatin1StringView(fraction.data(), static_cast<qsizetype>(fraction.size()));
    }
    out += pattern.suffix;
    return out;
}

QString ValueFormatter::dateTimePattern(const QString& pattern) const
{
    // Basic's letters to Qt's; everything else is quoted so Qt takes it literally.
    QString qt;
    QString literal;
    const auto flushLiteral = [&] {
        if (literal.isEmpty())
            return;
        qt += u'\'' + QString(literal).replace(u'\'', QStringLiteral("''")) + u'\'';
        literal.clear();
    };
    qsizetype i = 0;
    while (i < pattern.size()) {
        const QChar c = pattern.at(i).toLower();
        qsizetype run = 1;
        while (i + run < pattern.size() && pattern.at(i + run).toLower() == c)
            ++run;
        QString token;
        switch (c.unicode()) {
        case u'd':
            token = run >= 4 ? QStringLiteral("dddd")
                : run == 3   ? QStringLiteral("ddd")
                : run == 2   ? QStringLiteral("dd")
                             : QStringLiteral("d");
            break;
        case u'm':
            token = run >= 4 ? QStringLiteral("MMMM")
                : run == 3   ? QStringLiteral("MMM")
                : run == 2   ? QStringLiteral("MM")
                             : QStringLiteral("M");
            break;
        case u'y':
            token = run >= 3 ? QStringLiteral("yyyy") : QStringLiteral("yy");
            break;
        case u'h':
            token = run >= 2 ? QStringLiteral("HH") : QStringLiteral("H");
            break;
        case u'n':
            token = run >= 2 ? QStringLiteral("mm") : QStringLiteral("m");
            break;
        case u's':
            token = run >= 2 ? QStringLiteral("ss") : QStringLiteral("s");
            break;
        default:
            literal += pattern.mid(i, run);
            i += run;
            continue;
        }
        flushLiteral();
        qt += token;
        i += run;
    }
    flushLiteral();
    return qt;
}

QString ValueFormatter::format(const Value& value, const QString& pattern)
{
    switch (value.type()) {
    case ValueType::Null:
    case ValueType::Binary:
        return {};
    case ValueType::String:
        return value.text();
    case ValueType::Boolean:
        return value.toBoolean() ? QStringLiteral("True") : QStringLiteral("False");
    case ValueType::Number:
    case ValueType::Currency: {
        NumberPattern p;
        if (!pattern.isEmpty()) {
            auto found = m_numberPatterns.constFind(pattern);
            if (found == m_numberPatterns.constEnd())
                found = m_numberPatterns.insert(pattern, numberPattern(pattern));
            p = *found;
        }
        if (!p.valid) {
            const double v = value.numeric();
            p.valid = true;
            p.grouped = true;
            p.decimals = value.type() == ValueType::Number && std::floor(v) == v ? 0 : 2;
        }
        return formatNumber(value.numeric(), p);
    }
    case ValueType::Date:
    case ValueType::Time:
    case ValueType::DateTime: {
        QString qtPattern;
        if (!pattern.isEmpty() && !numberPattern(pattern).valid) {
            auto found = m_datePatterns.constFind(pattern);
            if (found == m_datePatterns.constEnd())
                found = m_datePatterns.insert(pattern, dateTimePattern(pattern));
            qtPattern = *found;
        } else if (value.type() == ValueType::Date) {
            qtPattern = m_shortDate;
        } else if (value.type() == ValueType::Time) {
            qtPattern = QStringLiteral("HH:mm:ss");
        } else {
            qtPattern = m_shortDate + QStringLiteral(" HH:mm:ss");
        }
        const qint64 key = value.type() == ValueType::Date ? value.julianDay()
            : value.type() == ValueType::Time              ? value.msecsOfDay()
                                                           : value.dateTimeMsecs();
        QHash<qint64, QString>& cache = m_dates[qtPattern];
        const auto found = cache.constFind(key);
        if (found != cache.constEnd())
            return *found;
        QString text;
        if (value.type() == ValueType::Date)
            text = m_locale.toString(value.toQDate(), qtPattern);
        else if (value.type() == ValueType::Time)
            text = m_locale.toString(value.toQTime(), qtPattern);
        else
            text = m_locale.toString(value.toQDateTime(), qtPattern);
        if (cache.size() >= dateCacheLimit)
            cache.clear();
        cache.insert(key, text);
        return text;
    }
    }
    return {};
}

} // namespace reportrt
