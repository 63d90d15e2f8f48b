#include "reportrt/base/invarianttext.h"

#include "runtime/parametervaluetype.h"

#include <QRegularExpression>
#include <cmath>
#include <limits>

namespace reportrt::invarianttext {

std::optional<ValueType> parameterValueType(int code)
{
    using runtime::ParameterValueType;
    switch (static_cast<ParameterValueType>(code)) {
    case ParameterValueType::SignedByte:
    case ParameterValueType::Byte:
    case ParameterValueType::SignedShort:
    case ParameterValueType::Short:
    case ParameterValueType::SignedLong:
    case ParameterValueType::Long:
    case ParameterValueType::Number:
        return ValueType::Number;
    case ParameterValueType::Currency:
        return ValueType::Currency;
    case ParameterValueType::Boolean:
        return ValueType::Boolean;
    case ParameterValueType::Date:
        return ValueType::Date;
    case ParameterValueType::Time:
        return ValueType::Time;
    case ParameterValueType::Text:
    case ParameterValueType::LongText:
    case ParameterValueType::TemporaryText:
    case ParameterValueType::Other:
        return ValueType::String;
    case ParameterValueType::DateTime:
        return ValueType::DateTime;
    }
    return std::nullopt;
}

QString formatNumber(double value)
{
    if (value == 0)
        return QStringLiteral("0");
    if (std::fabs(value) < 9007199254740992.0 && value == std::trunc(value))
        return QString::number(static_cast<qint64>(value));
    // The shortest text that reads back as the same double.
    QString text = QString::number(value, 'g', QLocale::FloatingPointShortest);
    return text;
}

QString formatCurrency(int64_t scaled)
{
    const bool negative = scaled < 0;
    const uint64_t magnitude
        = negative ? static_cast<uint64_t>(-(scaled + 1)) + 1 : static_cast<uint64_t>(scaled);
    QString text = QString::number(magnitude / 10000) + u'.'
        + QStringLiteral("%1").arg(magnitude % 10000, 4, 10, QChar(u'0'));
    return negative ? u'-' + text : text;
}

QString formatDate(int64_t julianDay)
{
    return QDate::fromJulianDay(julianDay).toString(QStringLiteral("yyyy-MM-dd"));
}

QString formatTime(int32_t msecsOfDay)
{
    const QTime time = QTime::fromMSecsSinceStartOfDay(msecsOfDay);
    return time.toString(time.msec() ? QStringLiteral("HH:mm:ss.zzz") : QStringLiteral("HH:mm:ss"));
}

QString formatDateTime(int64_t msecs, QChar separator)
{
    int64_t day = msecs / Value::msecsPerDay;
    int64_t ms = msecs % Value::msecsPerDay;
    if (ms < 0) {
        ms += Value::msecsPerDay;
        --day;
    }
    return formatDate(day) + separator + formatTime(static_cast<int32_t>(ms));
}

std::optional<double> parseNumber(const QString& text)
{
    static const QRegularExpression pattern(
        QStringLiteral("^[+-]?(\\d+\\.?\\d*|\\.\\d+)([eE][+-]?\\d+)?$"));
    const QString trimmed = text.trimmed();
    if (!pattern.match(trimmed).hasMatch())
        return std::nullopt;
    bool ok = false;
    const double value = trimmed.toDouble(&ok);
    if (!ok || !std::isfinite(value))
        return std::nullopt;
    return value;
}

std::optional<int64_t> currencyFromDouble(double value)
{
    const double scaled = std::round(value * 10000.0);
    if (!std::isfinite(scaled) || std::fabs(scaled) >= 9.2e18)
        return std::nullopt;
    return static_cast<int64_t>(scaled);
}

std::optional<int64_t> parseCurrency(const QString& text)
{
    static const QRegularExpression pattern(
        QStringLiteral("^([+-]?)(\\d{1,15})(?:\\.(\\d{1,4}))?$"));
    const auto match = pattern.match(text.trimmed());
    if (!match.hasMatch())
        return std::nullopt;
    int64_t value = match.captured(2).toLongLong() * 10000;
    QString fraction = match.captured(3);
    fraction = fraction.leftJustified(4, u'0');
    value += fraction.toLongLong();
    return match.captured(1) == u"-" ? -value : value;
}

namespace {
std::optional<int64_t> julianDay(int year, int month, int day)
{
    const QDate date(year, month, day);
    if (!date.isValid())
        return std::nullopt;
    return date.toJulianDay();
}

std::optional<int32_t> msecs(int hour, int minute, const QString& seconds, const QString& fraction)
{
    const int second = seconds.isEmpty() ? 0 : seconds.toInt();
    if (hour > 23 || minute > 59 || second > 59)
        return std::nullopt;
    int ms = 0;
    if (!fraction.isEmpty()) {
        // Round to milliseconds: "1239" is 123.9 ms and becomes 124.
        const double f = QString(u"0." + fraction).toDouble();
        ms = static_cast<int>(std::lround(f * 1000.0));
    }
    return ((hour * 60 + minute) * 60 + second) * 1000 + ms;
}
} // namespace

std::optional<int64_t> parseDate(const QString& text)
{
    // Databases hand over dates as plain ASCII "YYYY-MM-DD", one per record: read those
    // directly; anything else (other digits, other shapes) goes through the pattern.
    if (text.size() == 10 && text[4] == u'-' && text[7] == u'-') {
        int value[3] = { 0, 0, 0 };
        bool ascii = true;
        for (qsizetype i = 0, part = 0; i < 10 && ascii; ++i) {
            const char16_t ch = text[i].unicode();
            if (i == 4 || i == 7) {
                ++part;
                continue;
            }
            ascii = ch >= u'0' && ch <= u'9';
            value[part] = value[part] * 10 + (ch - u'0');
        }
        if (ascii)
            return julianDay(value[0], value[1], value[2]);
    }
    static const QRegularExpression pattern(QStringLiteral("^(\\d{4})-(\\d{2})-(\\d{2})$"));
    const auto match = pattern.match(text);
    if (!match.hasMatch())
        return std::nullopt;
    return julianDay(
        match.captured(1).toInt(), match.captured(2).toInt(), match.captured(3).toInt());
}

std::optional<int32_t> parseTime(const QString& text)
{
    static const QRegularExpression pattern(
        QStringLiteral("^(\\d{2}):(\\d{2})(?::(\\d{2})(?:\\.(\\d{1,9}))?)?$"));
    const auto match = pattern.match(text);
    if (!match.hasMatch())
        return std::nullopt;
    return msecs(
        match.captured(1).toInt(), match.captured(2).toInt(), match.captured(3), match.captured(4));
}

std::optional<int64_t> parseDateTime(const QString& text)
{
    static const QRegularExpression pattern(QStringLiteral(
        "^(\\d{4})-(\\d{2})-(\\d{2})(?:[T ](\\d{2}):(\\d{2})(?::(\\d{2})(?:\\.(\\d{1,9}))?)?)?$"));
    const auto match = pattern.match(text);
    if (!match.hasMatch())
        return std::nullopt;
    const auto day = julianDay(
        match.captured(1).toInt(), match.captured(2).toInt(), match.captured(3).toInt());
    if (!day)
        return std::nullopt;
    std::optional<int32_t> time = 0;
    if (match.hasCaptured(4))
        time = msecs(match.captured(4).toInt(), match.captured(5).toInt(), match.captured(6),
            match.captured(7));
    if (!time)
        return std::nullopt;
    // A rounded fraction may reach the next day (23:59:59.9999).
    return *day * Value::msecsPerDay + *time;
}

} // namespace reportrt::invarianttext
