#include "automation/valuecodec.h"

#include <QCborArray>
#include <QCborMap>
#include <QDate>
#include <QRegularExpression>
#include <QTime>
#include <cmath>
#include <cstdlib>
#include <limits>

namespace automation {

namespace {
const QString emptyKey = QStringLiteral("$empty");
const QString currencyKey = QStringLiteral("$currency");
const QString dateKey = QStringLiteral("$date");
const QString objectKey = QStringLiteral("$object");
const QString arrayKey = QStringLiteral("$array");
const QString missingKey = QStringLiteral("$missing");
const QString errorKey = QStringLiteral("$error");
const QString lboundKey = QStringLiteral("lbound");
const QString boundsKey = QStringLiteral("bounds");

constexpr int64_t millisecondsPerDay = 86'400'000;
const QDate oleEpoch(1899, 12, 30);

[[noreturn]] void badValue(const QString& message)
{
    throw ValueError(ValueError::Kind::BadValue, message);
}

int32_t int32Of(const QCborValue& value, const char* what)
{
    if (!value.isInteger() || value.toInteger() < std::numeric_limits<int32_t>::min()
        || value.toInteger() > std::numeric_limits<int32_t>::max())
        badValue(QStringLiteral("%1 must be a 32-bit integer").arg(QLatin1String(what)));
    return static_cast<int32_t>(value.toInteger());
}

// The shortest decimal that reads back as the same float, so that a Single of 0.1 goes
// out as 0.1 rather than as the double nearest to the float.
double shortestSingle(float value)
{
    if (!std::isfinite(value))
        return value;
    for (int precision = 1; precision < 9; ++precision) {
        const QByteArray text = QByteArray::number(double(value), 'g', precision);
        const double candidate = text.toDouble();
        if (static_cast<float>(candidate) == value)
            return candidate;
    }
    return value;
}
} // namespace

ValueError::ValueError(Kind kind, const QString& message)
    : std::runtime_error(message.toStdString())
    , m_kind(kind)
{ }

ValueCodec::ValueCodec(HandleTable& handles)
    : m_handles(handles)
{ }

QCborValue ValueCodec::encode(const core::Variant& value)
{
    using core::VariantType;
    switch (value.type()) {
    case VariantType::Empty:
        return QCborMap { { emptyKey, true } };
    case VariantType::Null:
        return QCborValue(nullptr);
    case VariantType::Boolean:
        return QCborValue(value.toBoolean());
    case VariantType::Byte:
    case VariantType::Integer:
    case VariantType::Long:
        return QCborValue(qint64(value.toLong()));
    case VariantType::Single:
        return QCborValue(shortestSingle(value.toSingle()));
    case VariantType::Double:
        return QCborValue(value.toDouble());
    case VariantType::Currency:
        return QCborMap { { currencyKey, currencyText(value.toCurrency()) } };
    case VariantType::Date:
        return QCborMap { { dateKey, dateText(value.toDate()) } };
    case VariantType::String:
        return QCborValue(value.toText());
    case VariantType::Object:
        return QCborMap { { objectKey, m_handles.handOut(value.toObject()) } };
    case VariantType::Error:
        if (value.isMissing())
            return QCborMap { { missingKey, true } };
        return QCborMap { { errorKey, qint64(value.errorCode()) } };
    case VariantType::Array:
        return encodeArray(value.array());
    case VariantType::Variant:
        break;
    }
    return QCborValue(nullptr);
}

QCborValue ValueCodec::encodeArray(const core::VariantArray& array)
{
    const std::vector<core::VariantArray::Bound>& bounds = array.bounds();
    const std::vector<core::Variant>& values = array.values();
    // Elements are stored with the first index varying fastest; the protocol nests rows
    // over the first dimension, so walk with strides.
    std::vector<size_t> extent;
    std::vector<size_t> stride;
    size_t step = 1;
    for (const core::VariantArray::Bound& bound : bounds) {
        const size_t count = bound.upper < bound.lower
            ? 0
            : static_cast<size_t>(int64_t(bound.upper) - bound.lower + 1);
        extent.push_back(count);
        stride.push_back(step);
        step *= count;
    }
    auto nested = [&](auto&& self, size_t level, size_t base) -> QCborArray {
        QCborArray list;
        for (size_t i = 0; i < extent[level]; ++i) {
            const size_t offset = base + i * stride[level];
            if (level + 1 == extent.size())
                list.append(encode(values.at(offset)));
            else
                list.append(self(self, level + 1, offset));
        }
        return list;
    };
    QCborMap map;
    map.insert(arrayKey, extent.empty() ? QCborArray {} : nested(nested, 0, 0));
    if (bounds.size() == 1) {
        map.insert(lboundKey, bounds.front().lower);
    } else {
        QCborArray pairs;
        for (const core::VariantArray::Bound& bound : bounds)
            pairs.append(QCborArray { bound.lower, bound.upper });
        map.insert(boundsKey, pairs);
    }
    return map;
}

core::Variant ValueCodec::decode(const QCborValue& value) const
{
    switch (value.type()) {
    case QCborValue::Null:
        return core::Variant::null();
    case QCborValue::True:
        return core::Variant(true);
    case QCborValue::False:
        return core::Variant(false);
    case QCborValue::Integer: {
        const qint64 integer = value.toInteger();
        if (integer >= std::numeric_limits<int32_t>::min()
            && integer <= std::numeric_limits<int32_t>::max())
            return core::Variant(static_cast<int32_t>(integer));
        return core::Variant(static_cast<double>(integer));
    }
    case QCborValue::Double:
        return core::Variant(value.toDouble());
    case QCborValue::String:
        return core::Variant(value.toString());
    case QCborValue::Array: {
        std::vector<core::Variant> elements;
        for (const QCborValue& element : value.toArray())
            elements.push_back(decode(element));
        return core::Variant(core::VariantArray::fromList(elements));
    }
    case QCborValue::Map:
        break;
    default:
        badValue(QStringLiteral("not a protocol value"));
    }

    const QCborMap map = value.toMap();
    if (map.contains(emptyKey))
        return core::Variant();
    if (map.contains(missingKey))
        return core::Variant::missing();
    if (map.contains(objectKey)) {
        const QCborValue handle = map.value(objectKey);
        if (!handle.isInteger() || handle.toInteger() < 0)
            badValue(QStringLiteral("$object must be a handle"));
        if (handle.toInteger() == 0)
            return core::Variant(core::ObjectPtr());
        core::ObjectPtr object = m_handles.object(handle.toInteger());
        if (!object)
            throw ValueError(ValueError::Kind::UnknownHandle,
                QStringLiteral("unknown object handle %1").arg(handle.toInteger()));
        return core::Variant(object);
    }
    if (map.contains(currencyKey)) {
        const QCborValue amount = map.value(currencyKey);
        std::optional<core::Currency> currency;
        if (amount.isString())
            currency = parseCurrency(amount.toString());
        else if (amount.isInteger() || amount.isDouble())
            currency = parseCurrency(QString::number(amount.toDouble(), 'f', 6));
        if (!currency)
            badValue(QStringLiteral("$currency must be a decimal number in range"));
        return core::Variant(*currency);
    }
    if (map.contains(dateKey)) {
        const std::optional<double> date = parseDate(map.value(dateKey).toString());
        if (!date)
            badValue(QStringLiteral("$date must be a local date and time (yyyy-mm-ddThh:mm:ss)"));
        return core::Variant::fromDate(*date);
    }
    if (map.contains(arrayKey))
        return decodeArray(map);
    if (map.contains(errorKey))
        return core::Variant::error(int32Of(map.value(errorKey), "$error"));
    badValue(QStringLiteral("an object that is no protocol value"));
}

core::Variant ValueCodec::decodeArray(const QCborMap& map) const
{
    const QCborValue rows = map.value(arrayKey);
    if (!rows.isArray())
        badValue(QStringLiteral("$array must be a list"));
    if (!map.contains(boundsKey)) {
        const int32_t lower = map.contains(lboundKey) ? int32Of(map.value(lboundKey), "lbound") : 0;
        const QCborArray list = rows.toArray();
        if (lower > 0 && list.size() > std::numeric_limits<int32_t>::max() - lower + 1)
            badValue(QStringLiteral("array bounds out of range"));
        std::vector<core::Variant> elements;
        elements.reserve(static_cast<size_t>(list.size()));
        for (const QCborValue& element : list)
            elements.push_back(decode(element));
        return core::Variant(core::VariantArray::fromList(elements, lower));
    }

    const QCborValue boundsValue = map.value(boundsKey);
    if (!boundsValue.isArray() || boundsValue.toArray().isEmpty()
        || boundsValue.toArray().size() > 2)
        badValue(QStringLiteral("bounds must list one or two [lower, upper] pairs"));
    std::vector<core::VariantArray::Bound> bounds;
    std::vector<qsizetype> extent;
    for (const QCborValue& pair : boundsValue.toArray()) {
        if (!pair.isArray() || pair.toArray().size() != 2)
            badValue(QStringLiteral("bounds must list [lower, upper] pairs"));
        const core::VariantArray::Bound bound { int32Of(pair.toArray().at(0), "lower bound"),
            int32Of(pair.toArray().at(1), "upper bound") };
        bounds.push_back(bound);
        extent.push_back(bound.upper < bound.lower ? 0 : qsizetype(bound.upper) - bound.lower + 1);
    }
    // Check the shape against the bounds before allocating: the bounds alone could ask for
    // far more elements than the text holds.
    const QCborArray outer = rows.toArray();
    if (outer.size() != extent[0])
        badValue(QStringLiteral("$array does not match its bounds"));
    if (bounds.size() == 2) {
        for (const QCborValue& row : outer) {
            if (!row.isArray() || row.toArray().size() != extent[1])
                badValue(QStringLiteral("$array does not match its bounds"));
        }
    }
    core::VariantArray array(bounds);
    for (qsizetype i = 0; i < extent[0]; ++i) {
        const int32_t first = bounds[0].lower + static_cast<int32_t>(i);
        if (bounds.size() == 1) {
            array.at(first) = decode(outer.at(i));
            continue;
        }
        const QCborArray row = outer.at(i).toArray();
        for (qsizetype j = 0; j < extent[1]; ++j)
            array.at({ first, bounds[1].lower + static_cast<int32_t>(j) }) = decode(row.at(j));
    }
    return core::Variant(array);
}

QString ValueCodec::dateText(double oleDate)
{
    // Days count from 1899-12-30 in the whole part; the fraction is the time of day even
    // for negative dates (-1.25 is 1899-12-29 06:00).
    const double days = std::trunc(oleDate);
    int64_t milliseconds = std::llround(std::fabs(oleDate - days) * millisecondsPerDay);
    QDate date = oleEpoch.addDays(static_cast<qint64>(days));
    if (milliseconds >= millisecondsPerDay) {
        milliseconds -= millisecondsPerDay;
        date = date.addDays(1);
    }
    const QTime time = QTime::fromMSecsSinceStartOfDay(static_cast<int>(milliseconds));
    QString text = date.toString(QStringLiteral("yyyy-MM-dd")) + u'T'
        + time.toString(QStringLiteral("HH:mm:ss"));
    if (time.msec() != 0)
        text += u'.' + QString::number(time.msec()).rightJustified(3, u'0');
    return text;
}

std::optional<double> ValueCodec::parseDate(const QString& text)
{
    static const QRegularExpression pattern(QStringLiteral(
        "^(\\d{4})-(\\d{2})-(\\d{2})(?:[T ](\\d{2}):(\\d{2})(?::(\\d{2})(?:\\.(\\d{1,3}))?)?)?$"));
    const QRegularExpressionMatch match = pattern.match(text);
    if (!match.hasMatch())
        return std::nullopt;
    const QDate date(
        match.captured(1).toInt(), match.captured(2).toInt(), match.captured(3).toInt());
    if (!date.isValid())
        return std::nullopt;
    int milliseconds = 0;
    if (match.hasCaptured(4)) {
        QString fraction = match.captured(7);
        const QTime time(match.captured(4).toInt(), match.captured(5).toInt(),
            match.captured(6).toInt(), fraction.leftJustified(3, u'0').toInt());
        if (!time.isValid())
            return std::nullopt;
        milliseconds = time.msecsSinceStartOfDay();
    }
    const double days = static_cast<double>(oleEpoch.daysTo(date));
    const double fraction = double(milliseconds) / double(millisecondsPerDay);
    return days < 0 ? days - fraction : days + fraction;
}

QString ValueCodec::currencyText(core::Currency value)
{
    // Through the unsigned magnitude: the most negative amount has no positive twin.
    const bool negative = value.scaled < 0;
    const uint64_t magnitude
        = negative ? 0 - static_cast<uint64_t>(value.scaled) : static_cast<uint64_t>(value.scaled);
    return (negative ? QStringLiteral("-") : QString()) + QString::number(magnitude / 10000) + u'.'
        + QString::number(magnitude % 10000).rightJustified(4, u'0');
}

std::optional<core::Currency> ValueCodec::parseCurrency(const QString& text)
{
    static const QRegularExpression pattern(
        QStringLiteral("^\\s*([+-]?)(\\d+)(?:\\.(\\d*))?\\s*$"));
    const QRegularExpressionMatch match = pattern.match(text);
    if (!match.hasMatch())
        return std::nullopt;
    const bool negative = match.captured(1) == u'-';
    const QString whole = match.captured(2);
    const QString fraction = match.captured(3);
    // Accumulate the magnitude in units of 1/10000 with overflow checks; rounding is half to
    // even on the digits beyond the fourth, as CCur rounds.
    constexpr uint64_t limit = uint64_t(std::numeric_limits<int64_t>::max()) + 1;
    uint64_t magnitude = 0;
    auto push = [&](int digit) {
        if (magnitude > (limit - uint64_t(digit)) / 10)
            return false;
        magnitude = magnitude * 10 + uint64_t(digit);
        return true;
    };
    for (const QChar c : whole) {
        if (!push(c.digitValue()))
            return std::nullopt;
    }
    for (int i = 0; i < 4; ++i) {
        if (!push(i < fraction.size() ? fraction.at(i).digitValue() : 0))
            return std::nullopt;
    }
    if (fraction.size() > 4) {
        const int next = fraction.at(4).digitValue();
        bool beyondHalf = false;
        for (qsizetype i = 5; i < fraction.size(); ++i)
            beyondHalf = beyondHalf || fraction.at(i) != u'0';
        const bool roundUp = next > 5 || (next == 5 && (beyondHalf || magnitude % 2 == 1));
        if (roundUp && ++magnitude > limit)
            return std::nullopt;
    }
    if (!negative && magnitude == limit)
        return std::nullopt;
    const int64_t scaled
        = negative ? static_cast<int64_t>(0 - magnitude) : static_cast<int64_t>(magnitude);
    return core::Currency { scaled };
}

} // namespace automation
