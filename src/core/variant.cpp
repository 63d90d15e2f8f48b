#include "core/variant.h"

#include "core/comerror.h"
#include "core/dateformatting_p.h"
#include "core/dateparsing_p.h"
#include "core/numbertext_p.h"

#include <cmath>
#include <limits>
#include <new>
#include <ostream>

namespace core {

bool isNumberType(VariantType type)
{
    switch (type) {
    case VariantType::Byte:
    case VariantType::Integer:
    case VariantType::Long:
    case VariantType::Single:
    case VariantType::Double:
    case VariantType::Currency:
        return true;
    default:
        return false;
    }
}

namespace {

/// DISP_E_PARAMNOTFOUND: the error value of an omitted optional argument.
constexpr int32_t ParamNotFound = static_cast<int32_t>(0x80020004);

[[noreturn]] void raise(int32_t number)
{
    throw ComError::basic(number);
}

[[noreturn]] void raiseNotConvertible(const Variant& value)
{
    switch (value.type()) {
    case VariantType::Null:
        raise(ErrorNumber::InvalidUseOfNull);
    case VariantType::Object:
        // An object converts through its default member, which ours do not have.
        raise(value.toObject() ? ErrorNumber::ObjectDoesNotSupport
                               : ErrorNumber::ObjectVariableNotSet);
    default:
        raise(ErrorNumber::TypeMismatch);
    }
}

double roundHalfEven(double value)
{
    const double rounded = std::round(value);
    return std::fabs(rounded - value) == 0.5 ? 2.0 * std::round(value / 2.0) : rounded;
}

template <class T> T roundedInteger(const Variant& value)
{
    constexpr auto low = static_cast<double>(std::numeric_limits<T>::min());
    constexpr auto high = static_cast<double>(std::numeric_limits<T>::max());
    if (value.type() == VariantType::Currency) {
        const int64_t scaled = value.toCurrency().scaled;
        int64_t units = scaled / 10000;
        const int64_t rest = scaled % 10000;
        if (rest > 5000 || (rest == 5000 && units % 2 != 0))
            ++units;
        else if (rest < -5000 || (rest == -5000 && units % 2 != 0))
            --units;
        if (units < std::numeric_limits<T>::min() || units > std::numeric_limits<T>::max())
            raise(ErrorNumber::Overflow);
        return static_cast<T>(units);
    }
    const double rounded = roundHalfEven(value.toDouble());
    if (!(rounded >= low && rounded <= high)) // also NaN
        raise(ErrorNumber::Overflow);
    return static_cast<T>(rounded);
}

void raiseFor(detail::ParseStatus status)
{
    if (status == detail::ParseStatus::Overflow)
        raise(ErrorNumber::Overflow);
    if (status == detail::ParseStatus::Invalid)
        raise(ErrorNumber::TypeMismatch);
}

QString dateText(double oleDate, const QLocale& locale)
{
    QDate date;
    QTime time;
    detail::splitOleDate(oleDate, 1000, &date, &time);
    // Like CStr: no time part at midnight, no date part on day 0 (a time of day).
    if (date == detail::oleBaseDate())
        return detail::formatDateTime(date, time, detail::timeDisplayPattern(locale), locale);
    if (time == QTime(0, 0))
        return detail::formatDateTime(date, time, detail::dateDisplayPattern(locale), locale);
    return detail::formatDateTime(date, time,
        detail::dateDisplayPattern(locale) + u' ' + detail::timeDisplayPattern(locale), locale);
}

QString invariantDateText(double oleDate)
{
    QDate date;
    QTime time;
    detail::splitOleDate(oleDate, 1000, &date, &time);
    const QString pattern = time == QTime(0, 0) ? QStringLiteral("yyyy-mm-dd")
                                                : QStringLiteral("yyyy-mm-dd hh:nn:ss");
    return detail::formatDateTime(date, time, pattern, QLocale::c());
}

// What arithmetic accepts as a number: Basic converts dates, Booleans and Empty too.
bool isNumericType(VariantType type)
{
    return isNumberType(type) || type == VariantType::Date || type == VariantType::Boolean
        || type == VariantType::Empty;
}

Variant defaultElement(VariantType type)
{
    switch (type) {
    case VariantType::Boolean:
        return Variant(false);
    case VariantType::Byte:
        return Variant(uint8_t(0));
    case VariantType::Integer:
        return Variant(int16_t(0));
    case VariantType::Long:
        return Variant(int32_t(0));
    case VariantType::Single:
        return Variant(0.0f);
    case VariantType::Double:
        return Variant(0.0);
    case VariantType::Currency:
        return Variant(Currency {});
    case VariantType::Date:
        return Variant::fromDate(0.0);
    case VariantType::String:
        return Variant(QString());
    case VariantType::Object:
        return Variant(ObjectPtr());
    default:
        return Variant();
    }
}

const char* typeName(VariantType type)
{
    switch (type) {
    case VariantType::Empty:
        return "Empty";
    case VariantType::Null:
        return "Null";
    case VariantType::Integer:
        return "Integer";
    case VariantType::Long:
        return "Long";
    case VariantType::Single:
        return "Single";
    case VariantType::Double:
        return "Double";
    case VariantType::Currency:
        return "Currency";
    case VariantType::Date:
        return "Date";
    case VariantType::String:
        return "String";
    case VariantType::Object:
        return "Object";
    case VariantType::Error:
        return "Error";
    case VariantType::Boolean:
        return "Boolean";
    case VariantType::Variant:
        return "Variant";
    case VariantType::Byte:
        return "Byte";
    case VariantType::Array:
        return "Array";
    }
    return "?";
}

} // namespace

// ---- Variant ---------------------------------------------------------------------------

Variant::Variant(bool value)
    : m_type(VariantType::Boolean)
{
    m_bool = value;
}

Variant::Variant(uint8_t value)
    : m_type(VariantType::Byte)
{
    m_byte = value;
}

Variant::Variant(int16_t value)
    : m_type(VariantType::Integer)
{
    m_int16 = value;
}

Variant::Variant(int32_t value)
    : m_type(VariantType::Long)
{
    m_int32 = value;
}

Variant::Variant(float value)
    : m_type(VariantType::Single)
{
    m_single = value;
}

Variant::Variant(double value)
    : m_type(VariantType::Double)
{
    m_double = value;
}

Variant::Variant(Currency value)
    : m_type(VariantType::Currency)
{
    m_currency = value.scaled;
}

Variant::Variant(const QString& value)
    : m_type(VariantType::String)
    , m_text(value)
{ }

Variant::Variant(const char16_t* value)
    : m_type(VariantType::String)
    , m_text(QString::fromUtf16(value))
{ }

Variant::Variant(ObjectPtr value)
    : m_type(VariantType::Object)
    , m_object(std::move(value))
{ }

Variant::Variant(const VariantArray& value)
    : m_type(VariantType::Array)
    , m_array(std::make_shared<VariantArray>(value))
{ }

Variant Variant::null()
{
    Variant value;
    value.m_type = VariantType::Null;
    return value;
}

Variant Variant::fromDate(double oleDate)
{
    if (!detail::isValidOleDate(oleDate))
        raise(ErrorNumber::Overflow);
    Variant value;
    value.m_type = VariantType::Date;
    value.m_double = oleDate;
    return value;
}

Variant Variant::fromDateTime(const QDateTime& value)
{
    if (!value.isValid())
        return null();
    const QDateTime local = value.toLocalTime();
    return fromDate(detail::toOleDate(local.date(), local.time()));
}

Variant Variant::fromDate(const QDate& value)
{
    if (!value.isValid())
        return null();
    return fromDate(detail::toOleDate(value, QTime(0, 0)));
}

Variant Variant::missing()
{
    return error(ParamNotFound);
}

Variant Variant::error(int32_t scode)
{
    Variant value;
    value.m_type = VariantType::Error;
    value.m_int32 = scode;
    return value;
}

int16_t Variant::varType() const
{
    if (m_type == VariantType::Array)
        return static_cast<int16_t>(static_cast<int16_t>(VariantType::Array)
            | static_cast<int16_t>(m_array->elementType()));
    return static_cast<int16_t>(m_type);
}

bool Variant::isMissing() const
{
    return m_type == VariantType::Error && m_int32 == ParamNotFound;
}

bool Variant::isNumeric() const
{
    if (m_type == VariantType::String) {
        double value = 0.0;
        return detail::parseDouble(m_text, QLocale(), &value) == detail::ParseStatus::Ok;
    }
    return m_type != VariantType::Date && isNumericType(m_type);
}

bool Variant::isDate() const
{
    if (m_type == VariantType::String) {
        double value = 0.0;
        return detail::parseDate(m_text, QLocale(), &value);
    }
    return m_type == VariantType::Date;
}

bool Variant::toBoolean() const
{
    switch (m_type) {
    case VariantType::Empty:
        return false;
    case VariantType::Boolean:
        return m_bool;
    case VariantType::Currency:
        return m_currency != 0;
    case VariantType::String: {
        const QString text = m_text.trimmed();
        if (text.compare(u"True", Qt::CaseInsensitive) == 0)
            return true;
        if (text.compare(u"False", Qt::CaseInsensitive) == 0)
            return false;
        return toDouble() != 0.0;
    }
    default:
        return toDouble() != 0.0;
    }
}

uint8_t Variant::toByte() const
{
    return roundedInteger<uint8_t>(*this);
}

int16_t Variant::toInteger() const
{
    return roundedInteger<int16_t>(*this);
}

int32_t Variant::toLong() const
{
    return roundedInteger<int32_t>(*this);
}

float Variant::toSingle() const
{
    if (m_type == VariantType::Single)
        return m_single;
    const double value = toDouble();
    // Halfway between the largest float and the next power of two: anything from there on
    // rounds to infinity.
    const double limit = std::ldexp(2.0 - std::ldexp(1.0, -24), 127);
    if (std::fabs(value) >= limit)
        raise(ErrorNumber::Overflow);
    return static_cast<float>(value);
}

double Variant::toDouble() const
{
    switch (m_type) {
    case VariantType::Empty:
        return 0.0;
    case VariantType::Boolean:
        return m_bool ? -1.0 : 0.0;
    case VariantType::Byte:
        return m_byte;
    case VariantType::Integer:
        return m_int16;
    case VariantType::Long:
        return m_int32;
    case VariantType::Single:
        return m_single;
    case VariantType::Double:
    case VariantType::Date:
        return m_double;
    case VariantType::Currency:
        return static_cast<double>(m_currency) / 10000.0;
    case VariantType::String: {
        double value = 0.0;
        raiseFor(detail::parseDouble(m_text, QLocale(), &value));
        return value;
    }
    default:
        raiseNotConvertible(*this);
    }
}

Currency Variant::toCurrency() const
{
    switch (m_type) {
    case VariantType::Currency:
        return { m_currency };
    case VariantType::Empty:
    case VariantType::Boolean:
    case VariantType::Byte:
    case VariantType::Integer:
    case VariantType::Long:
        return { static_cast<int64_t>(toDouble()) * 10000 };
    case VariantType::String: {
        Currency value;
        raiseFor(detail::parseCurrency(m_text, QLocale(), &value.scaled));
        return value;
    }
    default: {
        const double scaled = roundHalfEven(toDouble() * 10000.0);
        constexpr double limit = 9223372036854775808.0; // 2^63
        if (!(scaled >= -limit && scaled < limit))
            raise(ErrorNumber::Overflow);
        return { static_cast<int64_t>(scaled) };
    }
    }
}

double Variant::toDate() const
{
    switch (m_type) {
    case VariantType::Date:
        return m_double;
    case VariantType::String: {
        double value = 0.0;
        if (!detail::parseDate(m_text, QLocale(), &value))
            raise(ErrorNumber::TypeMismatch);
        return value;
    }
    default: {
        const double value = toDouble();
        if (!detail::isValidOleDate(value))
            raise(ErrorNumber::Overflow);
        return value;
    }
    }
}

QDateTime Variant::toDateTime() const
{
    QDate date;
    QTime time;
    detail::splitOleDate(toDate(), 1, &date, &time);
    return QDateTime(date, time);
}

QString Variant::toText() const
{
    const QLocale locale;
    switch (m_type) {
    case VariantType::Single:
        return detail::numberText(m_single, 7, locale.decimalPoint());
    case VariantType::Double:
        return detail::numberText(m_double, 15, locale.decimalPoint());
    case VariantType::Currency:
        return detail::currencyText(m_currency, locale.decimalPoint());
    case VariantType::Date:
        return dateText(m_double, locale);
    default:
        return toInvariantText();
    }
}

QString Variant::toInvariantText() const
{
    switch (m_type) {
    case VariantType::Empty:
        return QString();
    case VariantType::Boolean:
        return m_bool ? QStringLiteral("True") : QStringLiteral("False");
    case VariantType::Byte:
        return QString::number(m_byte);
    case VariantType::Integer:
        return QString::number(m_int16);
    case VariantType::Long:
        return QString::number(m_int32);
    case VariantType::Single:
        return detail::numberText(m_single, 7, QStringLiteral("."));
    case VariantType::Double:
        return detail::numberText(m_double, 15, QStringLiteral("."));
    case VariantType::Currency:
        return detail::currencyText(m_currency, QStringLiteral("."));
    case VariantType::Date:
        return invariantDateText(m_double);
    case VariantType::String:
        return m_text;
    case VariantType::Error:
        return u"Error " + QString::number(m_int32);
    default:
        raiseNotConvertible(*this);
    }
}

ObjectPtr Variant::toObject() const
{
    if (m_type != VariantType::Object)
        raise(ErrorNumber::TypeMismatch);
    return m_object;
}

int32_t Variant::errorCode() const
{
    if (m_type != VariantType::Error)
        raise(ErrorNumber::TypeMismatch);
    return m_int32;
}

const VariantArray& Variant::array() const
{
    if (m_type != VariantType::Array)
        raise(ErrorNumber::TypeMismatch);
    return *m_array;
}

VariantArray& Variant::array()
{
    if (m_type != VariantType::Array)
        raise(ErrorNumber::TypeMismatch);
    if (m_array.use_count() > 1)
        m_array = std::make_shared<VariantArray>(*m_array);
    return *m_array;
}

Variant Variant::convertedTo(VariantType type) const
{
    switch (type) {
    case VariantType::Empty:
        return Variant();
    case VariantType::Null:
        return null();
    case VariantType::Boolean:
        return Variant(toBoolean());
    case VariantType::Byte:
        return Variant(toByte());
    case VariantType::Integer:
        return Variant(toInteger());
    case VariantType::Long:
        return Variant(toLong());
    case VariantType::Single:
        return Variant(toSingle());
    case VariantType::Double:
        return Variant(toDouble());
    case VariantType::Currency:
        return Variant(toCurrency());
    case VariantType::Date:
        return fromDate(toDate());
    case VariantType::String:
        return Variant(toText());
    case VariantType::Object:
        return Variant(toObject());
    case VariantType::Variant:
        return *this;
    case VariantType::Error:
    case VariantType::Array:
        if (m_type != type)
            raise(ErrorNumber::TypeMismatch);
        return *this;
    }
    raise(ErrorNumber::TypeMismatch);
}

bool operator==(const Variant& a, const Variant& b)
{
    const VariantType ta = a.m_type;
    const VariantType tb = b.m_type;
    // Empty is 0 next to a number and "" next to text.
    if (ta == VariantType::Empty && tb == VariantType::String)
        return b.m_text.isEmpty();
    if (tb == VariantType::Empty && ta == VariantType::String)
        return a.m_text.isEmpty();
    if (isNumericType(ta) && isNumericType(tb)) {
        if (ta == VariantType::Currency && tb == VariantType::Currency)
            return a.m_currency == b.m_currency;
        return a.toDouble() == b.toDouble();
    }
    if (ta != tb)
        return false;
    switch (ta) {
    case VariantType::Null:
        return true;
    case VariantType::String:
        return a.m_text == b.m_text;
    case VariantType::Object:
        return a.m_object == b.m_object;
    case VariantType::Error:
        return a.m_int32 == b.m_int32;
    case VariantType::Array:
        return a.m_array == b.m_array || *a.m_array == *b.m_array;
    default:
        return false;
    }
}

void PrintTo(const Variant& value, std::ostream* out)
{
    *out << typeName(value.type());
    switch (value.type()) {
    case VariantType::Empty:
    case VariantType::Null:
        break;
    case VariantType::String:
        *out << " \"" << value.toInvariantText().toStdString() << '"';
        break;
    case VariantType::Object:
        *out << (value.toObject() ? " " + value.toObject()->className().toStdString()
                                  : std::string(" Nothing"));
        break;
    case VariantType::Error:
        *out << ' ' << value.errorCode();
        break;
    case VariantType::Array: {
        const VariantArray& array = value.array();
        *out << '(';
        for (int dimension = 1; dimension <= array.dimensions(); ++dimension)
            *out << (dimension > 1 ? ", " : "") << array.lbound(dimension) << " To "
                 << array.ubound(dimension);
        *out << ") {";
        for (size_t i = 0; i < array.values().size(); ++i) {
            *out << (i > 0 ? ", " : "");
            PrintTo(array.values()[i], out);
        }
        *out << '}';
        break;
    }
    default:
        *out << ' ' << value.toInvariantText().toStdString();
        break;
    }
}

// ---- VariantArray ----------------------------------------------------------------------

VariantArray::VariantArray(std::vector<Bound> bounds, VariantType elementType)
    : m_bounds(std::move(bounds))
    , m_elementType(elementType)
{
    if (m_bounds.empty())
        raise(ErrorNumber::InvalidProcedureCall);
    int64_t count = 1;
    for (const Bound& bound : m_bounds) {
        count *= std::max<int64_t>(0, int64_t(bound.upper) - bound.lower + 1);
        if (count > std::numeric_limits<int32_t>::max())
            raise(ErrorNumber::OutOfMemory);
    }
    try {
        m_values.assign(static_cast<size_t>(count), defaultElement(elementType));
    } catch (const std::bad_alloc&) {
        raise(ErrorNumber::OutOfMemory);
    }
}

VariantArray VariantArray::fromList(const std::vector<Variant>& values, int32_t lower)
{
    const auto count = static_cast<int64_t>(values.size());
    if (int64_t(lower) + count - 1 > std::numeric_limits<int32_t>::max())
        raise(ErrorNumber::Overflow);
    VariantArray array;
    array.m_bounds = { Bound { lower, static_cast<int32_t>(lower + count - 1) } };
    array.m_values = values;
    return array;
}

int32_t VariantArray::lbound(int dimension) const
{
    if (dimension < 1 || dimension > dimensions())
        raise(ErrorNumber::SubscriptOutOfRange);
    return m_bounds[static_cast<size_t>(dimension - 1)].lower;
}

int32_t VariantArray::ubound(int dimension) const
{
    if (dimension < 1 || dimension > dimensions())
        raise(ErrorNumber::SubscriptOutOfRange);
    return m_bounds[static_cast<size_t>(dimension - 1)].upper;
}

const Variant& VariantArray::at(std::initializer_list<int32_t> indices) const
{
    return m_values[offset(indices)];
}

Variant& VariantArray::at(std::initializer_list<int32_t> indices)
{
    return m_values[offset(indices)];
}

size_t VariantArray::offset(std::initializer_list<int32_t> indices) const
{
    if (indices.size() != m_bounds.size())
        raise(ErrorNumber::SubscriptOutOfRange);
    size_t offset = 0;
    size_t stride = 1;
    auto bound = m_bounds.begin();
    for (const int32_t index : indices) {
        if (index < bound->lower || index > bound->upper)
            raise(ErrorNumber::SubscriptOutOfRange);
        offset += static_cast<size_t>(int64_t(index) - bound->lower) * stride;
        stride *= static_cast<size_t>(int64_t(bound->upper) - bound->lower + 1);
        ++bound;
    }
    return offset;
}

} // namespace core
