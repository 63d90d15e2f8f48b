#pragma once

#include <QByteArray>
#include <QDate>
#include <QDateTime>
#include <QString>
#include <QTime>
#include <cstdint>
#include <new>
#include <utility>

namespace reportrt {

/// The types of the formula language and of database fields.
enum class ValueType : uint8_t {
    Null,
    Number,
    Currency,
    String,
    Boolean,
    Date,
    Time,
    DateTime,
    Binary
};

/// The name a report author uses for a type ("number", "date-time"...).
QString valueTypeName(ValueType type);

/// One value of a record or of a formula. 32 bytes, so a million records of a few fields
/// stay compact; text and binary are implicitly shared, so copying a value never copies
/// its characters.
///
/// Dates are Julian day numbers, times milliseconds since midnight, date-times
/// milliseconds since the start of Julian day 0 (a plain calendar value without a time
/// zone: it is what the database holds). Currency is the amount times 10,000.
class Value {
public:
    Value() noexcept
        : m_int(0)
    { }
    ~Value() { destroy(); }
    Value(const Value& other) { copyFrom(other); }
    Value(Value&& other) noexcept { moveFrom(std::move(other)); }
    Value& operator=(const Value& other)
    {
        if (this != &other) {
            destroy();
            copyFrom(other);
        }
        return *this;
    }
    Value& operator=(Value&& other) noexcept
    {
        if (this != &other) {
            destroy();
            moveFrom(std::move(other));
        }
        return *this;
    }

    static Value number(double value);
    static Value currency(int64_t scaled);
    static Value string(const QString& value);
    static Value boolean(bool value);
    static Value date(int64_t julianDay);
    static Value time(int32_t msecsOfDay);
    static Value dateTime(int64_t msecs);
    static Value binary(const QByteArray& value);

    static Value fromDate(const QDate& date);
    static Value fromTime(const QTime& time);
    static Value fromDateTime(const QDateTime& dateTime); // its date and time, zone ignored

    ValueType type() const { return m_type; }
    bool isNull() const { return m_type == ValueType::Null; }

    double toNumber() const { return m_number; } // Number
    int64_t currencyScaled() const { return m_int; } // Currency
    /// Number or Currency as a double.
    double numeric() const
    {
        return m_type == ValueType::Currency ? static_cast<double>(m_int) / 10000.0 : m_number;
    }
    bool toBoolean() const { return m_bool; }
    const QString& text() const { return m_string; } // String only
    const QByteArray& bytes() const { return m_bytes; } // Binary only
    int64_t julianDay() const { return m_int; } // Date
    int32_t msecsOfDay() const { return static_cast<int32_t>(m_int); } // Time
    int64_t dateTimeMsecs() const { return m_int; } // DateTime

    QDate toQDate() const; // Date or DateTime
    QTime toQTime() const; // Time or DateTime
    QDateTime toQDateTime() const; // Date, Time or DateTime, as local time

    /// Same type and value (Null equals Null); for tests and saved-data comparisons.
    friend bool operator==(const Value& a, const Value& b);

    static constexpr int64_t msecsPerDay = 86400000;

private:
    void destroy() noexcept
    {
        if (m_type == ValueType::String)
            m_string.~QString();
        else if (m_type == ValueType::Binary)
            m_bytes.~QByteArray();
        m_type = ValueType::Null;
    }
    void copyFrom(const Value& other)
    {
        m_type = other.m_type;
        if (m_type == ValueType::String)
            new (&m_string) QString(other.m_string);
        else if (m_type == ValueType::Binary)
            new (&m_bytes) QByteArray(other.m_bytes);
        else
            m_int = other.m_int;
    }
    void moveFrom(Value&& other) noexcept
    {
        m_type = other.m_type;
        if (m_type == ValueType::String)
            new (&m_string) QString(std::move(other.m_string));
        else if (m_type == ValueType::Binary)
            new (&m_bytes) QByteArray(std::move(other.m_bytes));
        else
            m_int = other.m_int;
    }

    ValueType m_type = ValueType::Null;
    union {
        double m_number;
        int64_t m_int;
        bool m_bool;
        QString m_string;
        QByteArray m_bytes;
    };
};

} // namespace reportrt
