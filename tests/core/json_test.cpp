#include "core/jsonreader.h"
#include "core/jsonwriter.h"

#include <gtest/gtest.h>

using core::JsonNode;
using core::JsonReader;
using core::JsonWriter;
using namespace Qt::StringLiterals;

namespace {

JsonNode parsed(QByteArrayView text, const JsonReader::Limits& limits = JsonReader::Limits())
{
    JsonNode root;
    JsonReader::Failure failure;
    EXPECT_TRUE(JsonReader::parse(text, root, failure, limits)) << qPrintable(failure.message);
    return root;
}

JsonReader::Failure failureOf(
    QByteArrayView text, const JsonReader::Limits& limits = JsonReader::Limits())
{
    JsonNode root;
    JsonReader::Failure failure;
    EXPECT_FALSE(JsonReader::parse(text, root, failure, limits));
    return failure;
}

} // namespace

TEST(JsonReader, KeepsIntegersApartFromNumbersWithAFraction)
{
    const JsonNode root = parsed("[2, 2.0, 1e3, -9223372036854775808, 123456789012345678901]");
    ASSERT_EQ(root.items.size(), 5u);
    EXPECT_TRUE(root.items[0].isInteger);
    EXPECT_EQ(root.items[0].integer, 2);
    EXPECT_FALSE(root.items[1].isInteger);
    EXPECT_FALSE(root.items[2].integer.has_value());
    EXPECT_EQ(root.items[3].integer, std::numeric_limits<int64_t>::min());
    // Written as an integer but beyond 64 bits: only the double is exact enough to keep.
    EXPECT_TRUE(root.items[4].isInteger);
    EXPECT_FALSE(root.items[4].integer.has_value());
    EXPECT_DOUBLE_EQ(root.items[4].number, 1.2345678901234568e20);
}

TEST(JsonReader, NamesTheLineAndColumnOfAFault)
{
    const auto failure = failureOf("{\n  \"a\": 1,\n  \"b\": tru\n}");
    EXPECT_EQ(failure.position.line, 3);
    EXPECT_EQ(failure.position.column, 8);
}

TEST(JsonReader, LimitsDecideNestingAndRepeatedKeys)
{
    const QByteArray deep = QByteArray(100, '[') + QByteArray(100, ']');
    EXPECT_TRUE(failureOf(deep).message.contains(u"deeper than 64"));
    EXPECT_EQ(parsed(deep, { 512, false }).kind, JsonNode::Kind::Array);

    EXPECT_TRUE(failureOf(R"({"a":1,"a":2})").message.contains(u"duplicate key"));
    const JsonNode kept = parsed(R"({"a":1,"a":2})", { 64, true });
    EXPECT_EQ(kept.member(u"a"_s)->integer, 2);
}

TEST(JsonReader, RefusesInvalidUtf8WhereItStands)
{
    const auto failure = failureOf("[\"ok\",\n \"\xff\"]");
    EXPECT_EQ(failure.position.line, 2);
    EXPECT_TRUE(failure.message.contains(u"UTF-8"));
}

TEST(JsonWriter, KeepsMemberOrderAndNumberKinds)
{
    JsonNode root = JsonNode::object();
    root.insert(u"zeta"_s, JsonNode::fromInteger(1));
    root.insert(u"alpha"_s, JsonNode::fromDouble(2.0));
    JsonNode& list = root.insert(u"list"_s, JsonNode::array());
    list.append(JsonNode::fromDouble(0.5));
    list.append(JsonNode::fromBool(true));
    list.append(JsonNode::null());
    list.append(JsonNode::fromDouble(std::numeric_limits<double>::quiet_NaN()));
    EXPECT_EQ(JsonWriter::write(root), R"({"zeta":1,"alpha":2.0,"list":[0.5,true,null,null]})");
}

TEST(JsonWriter, IndentsForPeopleAndReadsBackTheSame)
{
    JsonNode root = JsonNode::object();
    root.insert(u"name"_s, JsonNode::fromString(u"Orders \"2026\"\n\u20ac"_s));
    root.insert(u"empty"_s, JsonNode::array());
    JsonNode& inner = root.insert(u"inner"_s, JsonNode::object());
    inner.insert(u"n"_s, JsonNode::fromInteger(-7));
    const QByteArray text = JsonWriter::write(root, JsonWriter::Style::Indented);
    EXPECT_EQ(text,
        QByteArray("{\n    \"name\": \"Orders \\\"2026\\\"\\n\xe2\x82\xac\",\n    \"empty\": [],\n"
                   "    \"inner\": {\n        \"n\": -7\n    }\n}\n"));
    const JsonNode back = parsed(text);
    EXPECT_EQ(back.member(u"name"_s)->text, root.member(u"name"_s)->text);
    EXPECT_EQ(back.members.front().first, u"name"_s);
}

TEST(JsonWriter, EscapesWhatUtf8CannotCarry)
{
    QString text = u"a\u0001b"_s;
    text.append(QChar(0xD800)); // a lone surrogate
    EXPECT_EQ(JsonWriter::write(JsonNode::fromString(text)), R"("a\u0001b\ud800")");
    JsonNode back = parsed(JsonWriter::write(JsonNode::fromString(text)));
    EXPECT_EQ(back.text, text);
}
