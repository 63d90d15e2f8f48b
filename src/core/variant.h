#pragma once

#include "core/ludmoxexport.h"
#include "core/object.h"

#include <QDateTime>
#include <QLocale>
#include <QString>
#include <cstdint>
#include <iosfwd>
#include <memory>
#include <vector>

namespace core {

class VariantArray;

/// Fixed-point currency: the value times 10,000, as the automation currency type.
struct LUDMOX_EXPORT Currency {
    int64_t scaled = 0;
    friend bool operator==(Currency, Currency) = default;
};

/// The kinds of value, numbered as the Basic VarType function numbers them.
enum class VariantType : int16_t {
    Empty = 0,
    Null = 1,
    Integer = 2,
    Long = 3,
    Single = 4,
    Double = 5,
    Currency = 6,
    Date = 7,
    String = 8,
    Object = 9,
    Error = 10,
    Boolean = 11,
    Variant = 12,
    Byte = 17,
    Array = 0x2000,
};

/// Whether values of the type are numbers: Byte, Integer, Long, Single, Double, Currency.
LUDMOX_EXPORT bool isNumberType(VariantType type);

/// An automation value with the Basic conversion rules.
///
/// Conversions (toBoolean, toByte, ... toText) follow CBool, CByte, CInt, CLng, CSng, CDbl,
/// CCur, CDate and CStr: numbers round half to even, out-of-range values raise ComError 6
/// (Overflow), values that do not convert raise ComError 13 (Type mismatch), Null raises 94
/// except where Basic allows it. Text converts with the current default QLocale (the
/// user's locale); the invariant forms are for text that goes into formulas and SQL.
///
/// Arrays have value semantics (copying a Variant copies the array, copy-on-write).
class LUDMOX_EXPORT Variant {
public:
    Variant() = default; // Empty
    Variant(bool value);
    Variant(uint8_t value);
    Variant(int16_t value);
    Variant(int32_t value);
    Variant(float value);
    Variant(double value);
    Variant(Currency value);
    Variant(const QString& value);
    Variant(const char16_t* value);
    Variant(ObjectPtr value); // a null pointer is Nothing
    Variant(const VariantArray& value);
    /// Any other pointer (a char literal, a raw object pointer) would silently become a
    /// Boolean: refuse it at compile time.
    template <class T> Variant(const T*) = delete;

    static Variant null();
    /// Days since 1899-12-30, the fraction being the time of day (for negative days too:
    /// -1.25 is 1899-12-29 06:00). Overflow (6) outside 0100-01-01 to 9999-12-31.
    static Variant fromDate(double oleDate);
    static Variant fromDateTime(const QDateTime& value); // local time; invalid gives Null
    static Variant fromDate(const QDate& value); // invalid gives Null
    /// The error value Basic passes for an omitted optional argument.
    static Variant missing();
    static Variant error(int32_t scode);

    VariantType type() const { return m_type; }
    /// VarType: the type, or Array | element type for arrays.
    int16_t varType() const;

    bool isEmpty() const { return m_type == VariantType::Empty; }
    bool isNull() const { return m_type == VariantType::Null; }
    bool isArray() const { return m_type == VariantType::Array; }
    bool isObject() const { return m_type == VariantType::Object; }
    bool isMissing() const;
    /// IsNumeric: numbers, Booleans, Empty, and text that parses as a number in the locale.
    bool isNumeric() const;
    /// IsDate: dates and text that parses as a date in the locale.
    bool isDate() const;

    bool toBoolean() const;
    uint8_t toByte() const;
    int16_t toInteger() const;
    int32_t toLong() const;
    float toSingle() const;
    double toDouble() const;
    Currency toCurrency() const;
    double toDate() const; // OLE date
    QDateTime toDateTime() const; // local time
    /// CStr, locale-aware: Doubles with up to 15 significant digits ("0.1", "1E+20"), dates
    /// as the short date with a four-digit year and/or the time with seconds.
    QString toText() const;
    /// Like toText but with invariant number and date forms ("5.5", "2026-12-06"): for
    /// text that goes into formulas or SQL.
    QString toInvariantText() const;
    ObjectPtr toObject() const; // Type mismatch unless an Object (Nothing gives null)
    int32_t errorCode() const; // only for Error values

    template <class T> std::shared_ptr<T> objectAs() const
    {
        return std::dynamic_pointer_cast<T>(toObject());
    }

    const VariantArray& array() const; // Type mismatch unless an array
    VariantArray& array(); // detaches

    /// Converts to the given scalar type with the rules above.
    Variant convertedTo(VariantType type) const;

    /// Equality as Basic's "=" for two non-Null scalars (text compared binary); arrays and
    /// objects compare by identity/content for tests.
    friend LUDMOX_EXPORT bool operator==(const Variant& a, const Variant& b);

private:
    VariantType m_type = VariantType::Empty;
    union {
        bool m_bool;
        uint8_t m_byte;
        int16_t m_int16;
        int32_t m_int32; // Long and Error
        float m_single;
        double m_double; // Double and Date
        int64_t m_currency = 0;
    };
    QString m_text;
    ObjectPtr m_object;
    std::shared_ptr<VariantArray> m_array;
};

/// Prints the type and value ("Integer 5", "String \"abc\"") in test failure messages.
void PrintTo(const Variant& value, std::ostream* out);

/// A Basic array of Variants with any lower bound per dimension, one or more dimensions.
/// Elements are stored with the first index varying fastest (column-major, as SAFEARRAY).
class LUDMOX_EXPORT VariantArray {
public:
    struct Bound {
        int32_t lower = 0;
        int32_t upper = -1; // upper < lower: no elements in that dimension
        friend bool operator==(Bound, Bound) = default;
    };

    VariantArray() = default; // one dimension, no elements (0 To -1)
    explicit VariantArray(
        std::vector<Bound> bounds, VariantType elementType = VariantType::Variant);
    /// A one-dimensional array (lower To lower + size - 1) of the given values.
    static VariantArray fromList(const std::vector<Variant>& values, int32_t lower = 0);

    VariantType elementType() const { return m_elementType; }
    int dimensions() const { return static_cast<int>(m_bounds.size()); }
    /// LBound / UBound; dimension is 1-based; Subscript out of range (9) when absent.
    int32_t lbound(int dimension = 1) const;
    int32_t ubound(int dimension = 1) const;
    const std::vector<Bound>& bounds() const { return m_bounds; }
    size_t size() const { return m_values.size(); }

    /// Element by indices, one per dimension; Subscript out of range (9) when outside.
    const Variant& at(std::initializer_list<int32_t> indices) const;
    Variant& at(std::initializer_list<int32_t> indices);
    const Variant& at(int32_t index) const { return at({ index }); }
    Variant& at(int32_t index) { return at({ index }); }

    /// Elements in storage order.
    const std::vector<Variant>& values() const { return m_values; }

    friend bool operator==(const VariantArray&, const VariantArray&) = default;

private:
    size_t offset(std::initializer_list<int32_t> indices) const;

    std::vector<Bound> m_bounds { Bound {} };
    VariantType m_elementType = VariantType::Variant;
    std::vector<Variant> m_values;
};

} // namespace core
