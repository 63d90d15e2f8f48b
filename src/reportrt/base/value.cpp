#include "reportrt/base/value.h"

namespace reportrt {

QString valueTypeName(ValueType type)
{
    switch (type) {
    case ValueType::Null:
        return QStringLiteral("null");
    case ValueType::Number:
        return QStringLiteral("number");
    case ValueType::Currency:
        return QStringLiteral("currency");
    case ValueType::String:
        return QStringLiteral("string");
    case ValueType::Boolean:
        return QStringLiteral("boolean");
    case ValueType::Date:
        return QStringLiteral("date");
    case ValueType::Time:
        return QStringLiteral("time");
    case ValueType::DateTime:
        return QStringLiteral("datetime");
    case ValueType::Binary:
        return QStringLiteral("binary");
    }
    return {};
}

Value Value::number(double value)
{
    Value v;
    v.m_type = ValueType::Number;
    v.m_number = value == 0 ? 0.0 : value; // no negative zero: it would print as "-0"
    return v;
}

Value Value::currency(int64_t scaled)
{
    Value v;
    v.m_type = ValueType::Currency;
    v.m_int = scaled;
    return v;
}

Value Value::string(const QString& value)
{
    Value v;
    v.m_type = ValueType::String;
    new (&v.m_string) QString(value);
    return v;
}

Value Value::boolean(bool value)
{
    Value v;
    v.m_int = 0;
    v.m_type = ValueType::Boolean;
    v.m_bool = value;
    return v;
}

Value Value::date(int64_t julianDay)
{
    Value v;
    v.m_type = ValueType::Date;
    v.m_int = julianDay;
    return v;
}

Value Value::time(int32_t msecsOfDay)
{
    Value v;
    v.m_type = ValueType::Time;
    v.m_int = msecsOfDay;
    return v;
}

Value Value::dateTime(int64_t msecs)
{
    Value v;
    v.m_type = ValueType::DateTime;
    v.m_int = msecs;
    return v;
}

Value Value::binary(const QByteArray& value)
{
    Value v;
    v.m_type = ValueType::Binary;
    new (&v.m_bytes) QByteArray(value);
    return v;
}

Value Value::fromDate(const QDate& date)
{
    return date.isValid() ? Value::date(date.toJulianDay()) : Value();
}

Value Value::fromTime(const QTime& time)
{
    return time.isValid() ? Value::time(time.msecsSinceStartOfDay()) : Value();
}

Value Value::fromDateTime(const QDateTime& dateTime)
{
    if (!dateTime.isValid())
        return {};
    return Value::dateTime(
        dateTime.date().toJulianDay() * msecsPerDay + dateTime.time().msecsSinceStartOfDay());
}

QDate Value::toQDate() const
{
    if (m_type == ValueType::Date)
        return QDate::fromJulianDay(m_int);
    if (m_type == ValueType::DateTime) {
        int64_t day = m_int / msecsPerDay;
        if (m_int % msecsPerDay < 0)
            --day;
        return QDate::fromJulianDay(day);
    }
    return {};
}

QTime Value::toQTime() const
{
    if (m_type == ValueType::Time)
        return QTime::fromMSecsSinceStartOfDay(static_cast<int>(m_int));
    if (m_type == ValueType::DateTime) {
        int64_t ms = m_int % msecsPerDay;
        if (ms < 0)
            ms += msecsPerDay;
        return QTime::fromMSecsSinceStartOfDay(static_cast<int>(ms));
    }
    return {};
}

QDateTime Value::toQDateTime() const
{
    switch (m_type) {
    case ValueType::Date:
        return QDateTime(toQDate(), QTime(0, 0));
    case ValueType::Time:
        return QDateTime(QDate(1899, 12, 30), toQTime());
    case ValueType::DateTime:
        return QDateTime(toQDate(), toQTime());
    default:
        return {};
    }
}

bool operator==(const Value& a, const Value& b)
{
    if (a.m_type != b.m_type)
        return false;
    switch (a.m_type) {
    case ValueType::Null:
        return true;
    case ValueType::Number:
        return a.m_number == b.m_number;
    case ValueType::Boolean:
        return a.m_bool == b.m_bool;
    case ValueType::String:
        return a.m_string == b.m_string;
    case ValueType::Binary:
        return a.m_bytes == b.m_bytes;
    default:
        return a.m_int == b.m_int;
    }
}

} // namespace reportrt
