#include "automation/jsontext.h"
#include "automation/valuecodec.h"
#include "core/dictionary.h"
#include "rowname.h"

#include <QCborMap>
#include <gtest/gtest.h>

using automation::HandleTable;
using automation::JsonText;
using automation::ValueCodec;
using automation::ValueError;
using core::Variant;
using core::VariantArray;
using core::VariantType;

namespace {

double oleDate(int year, int month, int day, int hour = 0, int minute = 0, int second = 0)
{
    return static_cast<double>(QDate(1899, 12, 30).daysTo(QDate(year, month, day)))
        + (hour * 3600 + minute * 60 + second) / 86400.0;
}

Variant matrix()
{
    // 2 rows (1 To 2) by 3 columns (0 To 2); element (i, j) = 10 * i + j.
    VariantArray array({ { 1, 2 }, { 0, 2 } });
    for (int32_t i = 1; i <= 2; ++i) {
        for (int32_t j = 0; j <= 2; ++j)
            array.at({ i, j }) = Variant(10 * i + j);
    }
    return Variant(array);
}

struct RoundTrip {
    const char* name;
    Variant value;
    QByteArray json;
    /// What reads back, when it differs from the value (numbers come back as Long).
    std::optional<Variant> back = std::nullopt;
};

class ValueRoundTrip : public ::testing::TestWithParam<RoundTrip> { };

TEST_P(ValueRoundTrip, EncodesAndDecodes)
{
    HandleTable handles;
    ValueCodec codec(handles);
    const QByteArray json = JsonText::serialize(codec.encode(GetParam().value));
    EXPECT_EQ(json, GetParam().json);
    const Variant back = codec.decode(*JsonText::parse(json));
    const Variant expected = GetParam().back.value_or(GetParam().value);
    EXPECT_EQ(back.varType(), expected.varType());
    EXPECT_EQ(back, expected);
}

INSTANTIATE_TEST_SUITE_P(EveryKind, ValueRoundTrip,
    ::testing::Values(RoundTrip { "empty", Variant(), R"({"$empty":true})" },
        RoundTrip { "null", Variant::null(), "null" }, RoundTrip { "true", Variant(true), "true" },
        RoundTrip { "false", Variant(false), "false" },
        RoundTrip { "byte", Variant(uint8_t(200)), "200", Variant(int32_t(200)) },
        RoundTrip { "integer", Variant(int16_t(-5)), "-5", Variant(int32_t(-5)) },
        RoundTrip { "long", Variant(int32_t(-2147483647 - 1)), "-2147483648" },
        RoundTrip { "single_shortest", Variant(0.1f), "0.1", Variant(0.1) },
        RoundTrip { "double", Variant(2.5), "2.5" },
        RoundTrip { "integral_double", Variant(3.0), "3.0" },
        RoundTrip { "currency", Variant(core::Currency { 123400 }), R"({"$currency":"12.3400"})" },
        RoundTrip {
            "negative_currency", Variant(core::Currency { -5 }), R"({"$currency":"-0.0005"})" },
        RoundTrip { "date_time", Variant::fromDate(oleDate(2026, 12, 6, 14, 30)),
            R"({"$date":"2026-12-06T14:30:00"})" },
        RoundTrip {
            "date_before_epoch", Variant::fromDate(-1.25), R"({"$date":"1899-12-29T06:00:00"})" },
        RoundTrip { "string", Variant(QStringLiteral("Tere, €")), "\"Tere, \xe2\x82\xac\"" },
        RoundTrip { "nothing", Variant(core::ObjectPtr()), R"({"$object":0})" },
        RoundTrip { "missing", Variant::missing(), R"({"$missing":true})" },
        RoundTrip { "error_value", Variant::error(5), R"({"$error":5})" },
        RoundTrip { "array_with_lower_bound",
            Variant(VariantArray::fromList({ Variant(QStringLiteral("a")), Variant(true) }, 1)),
            R"({"$array":["a",true],"lbound":1})" },
        RoundTrip { "empty_array", Variant(VariantArray()), R"({"$array":[],"lbound":0})" },
        RoundTrip { "two_dimensions_rows_over_first", matrix(),
            R"({"$array":[[10,11,12],[20,21,22]],"bounds":[[1,2],[0,2]]})" },
        RoundTrip { "nested_array",
            Variant(VariantArray::fromList({ Variant(VariantArray::fromList({ Variant(1) })) })),
            R"({"$array":[{"$array":[1],"lbound":0}],"lbound":0})" }),
    automationtest::RowName {});

TEST(ValueCodecObjects, TheSameObjectKeepsItsHandleAndCountsEachHandOut)
{
    HandleTable handles;
    ValueCodec codec(handles);
    auto dictionary = std::make_shared<core::Dictionary>();
    const QCborValue first = codec.encode(Variant(core::ObjectPtr(dictionary)));
    const QCborValue second = codec.encode(Variant(core::ObjectPtr(dictionary)));
    EXPECT_EQ(first, second);
    const qint64 handle = first.toMap().value(QStringLiteral("$object")).toInteger();
    EXPECT_GT(handle, 0);
    EXPECT_EQ(handles.hostReferences(handle), 2);
    EXPECT_EQ(codec.decode(first).toObject(), dictionary);
}

struct BadValue {
    const char* name;
    QByteArray json;
    ValueError::Kind kind = ValueError::Kind::BadValue;
};

class ValueReject : public ::testing::TestWithParam<BadValue> { };

TEST_P(ValueReject, RaisesValueError)
{
    HandleTable handles;
    ValueCodec codec(handles);
    const std::optional<QCborValue> value = JsonText::parse(GetParam().json);
    ASSERT_TRUE(value);
    try {
        codec.decode(*value);
        FAIL() << "decoded";
    } catch (const ValueError& error) {
        EXPECT_EQ(error.kind(), GetParam().kind) << error.what();
    }
}

INSTANTIATE_TEST_SUITE_P(Bad, ValueReject,
    ::testing::Values(BadValue { "unknown_marker", R"({"$thing":1})" },
        BadValue { "plain_object", R"({"a":1})" },
        BadValue { "currency_text", R"({"$currency":"12,34"})" },
        BadValue { "currency_overflow", R"({"$currency":"922337203685478"})" },
        BadValue { "date_with_zone", R"({"$date":"2026-12-06T14:30:00Z"})" },
        BadValue { "date_impossible", R"({"$date":"2026-02-30"})" },
        BadValue { "time_impossible", R"({"$date":"2026-12-06T25:00:00"})" },
        BadValue { "date_not_text", R"({"$date":46000})" },
        BadValue { "negative_handle", R"({"$object":-1})" },
        BadValue { "unknown_handle", R"({"$object":77})", ValueError::Kind::UnknownHandle },
        BadValue { "array_not_list", R"({"$array":5})" },
        BadValue { "lbound_not_integer", R"({"$array":[],"lbound":"x"})" },
        BadValue { "rows_shorter_than_bounds", R"({"$array":[[1],[2]],"bounds":[[0,1],[0,1]]})" },
        // The bounds alone must not make the server allocate: the shape is checked first.
        BadValue { "huge_bounds_few_rows", R"({"$array":[[1]],"bounds":[[0,0],[0,2000000000]]})" },
        BadValue { "three_dimensions", R"({"$array":[],"bounds":[[0,-1],[0,-1],[0,-1]]})" }),
    automationtest::RowName {});

struct CurrencyCase {
    const char* name;
    const char* text;
    std::optional<int64_t> scaled;
};

class CurrencyText : public ::testing::TestWithParam<CurrencyCase> { };

TEST_P(CurrencyText, ParsesWithHalfEvenRounding)
{
    const std::optional<core::Currency> value
        = ValueCodec::parseCurrency(QString::fromLatin1(GetParam().text));
    ASSERT_EQ(value.has_value(), GetParam().scaled.has_value());
    if (value) {
        EXPECT_EQ(value->scaled, *GetParam().scaled);
    }
}

INSTANTIATE_TEST_SUITE_P(Cases, CurrencyText,
    ::testing::Values(CurrencyCase { "whole", "12", 120000 },
        CurrencyCase { "four_decimals", "-0.0001", -1 },
        CurrencyCase { "half_rounds_to_even_down", "0.00005", 0 },
        CurrencyCase { "half_rounds_to_even_up", "0.00015", 2 },
        CurrencyCase { "above_half_rounds_up", "0.000051", 1 },
        CurrencyCase { "largest", "922337203685477.5807", INT64_MAX },
        CurrencyCase { "smallest", "-922337203685477.5808", INT64_MIN },
        CurrencyCase { "one_past_largest", "922337203685477.5808", std::nullopt },
        CurrencyCase { "rounding_past_largest", "922337203685477.58075", std::nullopt },
        CurrencyCase { "letters", "12a", std::nullopt },
        CurrencyCase { "empty", "", std::nullopt }),
    automationtest::RowName {});

TEST(CurrencyText, MostNegativeAmountPrints)
{
    EXPECT_EQ(ValueCodec::currencyText(core::Currency { INT64_MIN }),
        QStringLiteral("-922337203685477.5808"));
}

TEST(DateText, MillisecondsAndDayRollover)
{
    EXPECT_EQ(ValueCodec::dateText(oleDate(2026, 1, 1) + 0.5 / 86400.0),
        QStringLiteral("2026-01-01T00:00:00.500"));
    // A fraction that rounds to a whole day moves to the next day's midnight.
    EXPECT_EQ(ValueCodec::dateText(oleDate(2026, 1, 1) + (86400.0 - 0.0001) / 86400.0),
        QStringLiteral("2026-01-02T00:00:00"));
    EXPECT_EQ(ValueCodec::parseDate(QStringLiteral("2026-01-01")), oleDate(2026, 1, 1));
}

} // namespace
