#include "reportrt/base/variantvalue.h"

#include "core/comerror.h"
#include "reportrt/base/invarianttext.h"

namespace reportrt::variantvalue {

core::Variant toVariant(const Value& value)
{
    switch (value.type()) {
    case ValueType::Null:
        return core::Variant::null();
    case ValueType::Number:
        return core::Variant(value.toNumber());
    case ValueType::Currency:
        return core::Variant(core::Currency { value.currencyScaled() });
    case ValueType::String:
        return core::Variant(value.text());
    case ValueType::Boolean:
        return core::Variant(value.toBoolean());
    case ValueType::Date:
    case ValueType::Time:
    case ValueType::DateTime:
        return core::Variant::fromDateTime(value.toQDateTime());
    case ValueType::Binary: {
        std::vector<core::Variant> bytes;
        bytes.reserve(static_cast<size_t>(value.bytes().size()));
        for (const char b : value.bytes())
            bytes.emplace_back(static_cast<uint8_t>(b));
        return core::Variant(core::VariantArray::fromList(bytes));
    }
    }
    return {};
}

core::Variant parameterVariant(const Value& value, int code)
{
    if (value.isNull())
        return core::Variant::null();
    switch (code) {
    case 1:
    case 2:
        return core::Variant(value.toNumber()).convertedTo(core::VariantType::Byte);
    case 3:
    case 4:
        return core::Variant(value.toNumber()).convertedTo(core::VariantType::Integer);
    case 5:
    case 6:
        return core::Variant(value.toNumber()).convertedTo(core::VariantType::Long);
    default:
        return toVariant(value);
    }
}

Value parameterValue(const core::Variant& value, int code)
{
    if (value.isNull() || value.isArray() || value.isObject())
        throw core::ComError::basic(core::ErrorNumber::TypeMismatch);
    switch (code) {
    case 1:
    case 2:
        return Value::number(value.toByte());
    case 3:
    case 4:
        return Value::number(value.toInteger());
    case 5:
    case 6:
        return Value::number(value.toLong());
    case 7:
        return Value::number(value.toDouble());
    case 8:
        return Value::currency(value.toCurrency().scaled);
    case 9:
        return Value::boolean(value.toBoolean());
    case 10:
        return Value::fromDate(value.toDateTime().date());
    case 11:
        return Value::fromTime(value.toDateTime().time());
    case 16: {
        const QDateTime dt = value.toDateTime();
        return Value::fromDateTime(QDateTime(dt.date(), dt.time()));
    }
    default:
        return Value::string(value.isEmpty() ? QString() : value.toText());
    }
}

} // namespace reportrt::variantvalue
