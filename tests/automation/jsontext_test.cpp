#include "automation/jsontext.h"
#include "rowname.h"

#include <QCborArray>
#include <QCborMap>
#include <gtest/gtest.h>

using automation::JsonText;

namespace {

struct ParseCase {
    const char* name;
    QByteArray text;
    QCborValue expected;
};

class JsonParse : public ::testing::TestWithParam<ParseCase> { };

TEST_P(JsonParse, ReadsTheValue)
{
    QString error;
    const std::optional<QCborValue> value = JsonText::parse(GetParam().text, &error);
    ASSERT_TRUE(value) << qPrintable(error);
    EXPECT_EQ(*value, GetParam().expected);
    // The protocol tells Long from Double by the text, so the kind must survive.
    EXPECT_EQ(value->type(), GetParam().expected.type());
}

INSTANTIATE_TEST_SUITE_P(Values, JsonParse,
    ::testing::Values(ParseCase { "integer", "42", QCborValue(qint64(42)) },
        ParseCase { "negative_integer", "-7", QCborValue(qint64(-7)) },
        ParseCase { "integral_double_stays_double", "2.0", QCborValue(2.0) },
        ParseCase { "exponent_is_double", "1e3", QCborValue(1000.0) },
        ParseCase {
            "beyond_int64_is_double", "123456789012345678901", QCborValue(1.2345678901234568e20) },
        ParseCase {
            "escapes", R"("a\"b\\c\/d\n\t\u00e9")", QCborValue(QStringLiteral("a\"b\\c/d\n\té")) },
        ParseCase { "raw_utf8", "\"\xc3\xa9\xe2\x82\xac\"", QCborValue(QStringLiteral("é€")) },
        ParseCase { "surrogate_pair_escape", R"("\ud83d\ude00")",
            QCborValue(QString::fromUtf8("\xf0\x9f\x98\x80")) },
        ParseCase { "literals", "[true,false,null]", QCborArray { true, false, nullptr } },
        ParseCase { "nested_with_space", " { \"a\" : [ 1 , { } ] } ",
            QCborMap { { QStringLiteral("a"), QCborArray { 1, QCborMap {} } } } }),
    automationtest::RowName {});

struct BadCase {
    const char* name;
    QByteArray text;
};

class JsonReject : public ::testing::TestWithParam<BadCase> { };

TEST_P(JsonReject, ReportsAnError)
{
    QString error;
    EXPECT_FALSE(JsonText::parse(GetParam().text, &error));
    EXPECT_FALSE(error.isEmpty());
}

INSTANTIATE_TEST_SUITE_P(Malformed, JsonReject,
    ::testing::Values(BadCase { "empty", "" }, BadCase { "word", "hello" },
        BadCase { "trailing_text", "{} x" }, BadCase { "unterminated_object", "{\"a\":1" },
        BadCase { "trailing_comma", "[1,]" }, BadCase { "single_quotes", "{'a':1}" },
        BadCase { "leading_zero", "012" }, BadCase { "bare_minus", "-" },
        BadCase { "fraction_without_digits", "1." }, BadCase { "control_character", "\"a\x01\"" },
        BadCase { "bad_escape", R"("\q")" }, BadCase { "short_unicode_escape", R"("\u12")" },
        BadCase { "invalid_utf8", "\"\xff\xfe\"" },
        BadCase { "too_deep", QByteArray(600, '[') + QByteArray(600, ']') }),
    automationtest::RowName {});

TEST(JsonSerialize, KeepsMemberOrderAndKinds)
{
    QCborMap map;
    map.insert(QStringLiteral("z"), 1);
    map.insert(QStringLiteral("a"), 2.0);
    map.insert(QStringLiteral("m"), QCborArray { 0.5, true, nullptr });
    EXPECT_EQ(JsonText::serialize(map), QByteArray(R"({"z":1,"a":2.0,"m":[0.5,true,null]})"));
}

TEST(JsonSerialize, EscapesWhatAUtf8LineCannotCarry)
{
    QString text = QStringLiteral("line\nbreak\t\"q\" \\ é");
    text += QChar(0x01);
    text += QChar(0xD800); // a lone surrogate
    const QByteArray json = JsonText::serialize(QCborValue(text));
    EXPECT_FALSE(json.contains('\n'));
    EXPECT_EQ(json, QByteArray("\"line\\nbreak\\t\\\"q\\\" \\\\ \xc3\xa9\\u0001\\ud800\""));
    // What goes out reads back as the same text.
    EXPECT_EQ(JsonText::parse(json)->toString(), text);
}

TEST(JsonSerialize, NonFiniteDoublesBecomeNull)
{
    EXPECT_EQ(JsonText::serialize(QCborValue(std::numeric_limits<double>::infinity())), "null");
}

TEST(JsonSerialize, DoublesReadBackExactly)
{
    for (double value : { 0.1, -1e-300, 1.7976931348623157e308, 123456.789, 3.0 }) {
        const std::optional<QCborValue> back
            = JsonText::parse(JsonText::serialize(QCborValue(value)));
        ASSERT_TRUE(back);
        EXPECT_TRUE(back->isDouble());
        EXPECT_EQ(back->toDouble(), value);
    }
}

} // namespace
