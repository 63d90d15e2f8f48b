#include "core/collection.h"
#include "core/dictionary.h"
#include "core/eventsource.h"
#include "corefixture.h"

using core::Collection;
using core::Currency;
using core::Dictionary;
using core::Variant;
using coretest::errorOf;
namespace errors = core::ErrorNumber;

TEST(Dictionary, KeysFollowTheCompareMode)
{
    Dictionary binary;
    binary.add(u"Name", 1.0);
    binary.add(u"NAME", 2.0);
    EXPECT_EQ(binary.count(), 2);
    EXPECT_FALSE(binary.exists(u"name"));

    Dictionary textual(Dictionary::TextCompare);
    textual.add(u"Name", 1.0);
    EXPECT_TRUE(textual.exists(u"NAME"));
    EXPECT_EQ(textual.value(u"nAmE"), Variant(1.0));
    EXPECT_EQ(errorOf([&] { textual.add(u"NAME", 2.0); }), errors::DuplicateKey);
}

TEST(Dictionary, NumericKeysCompareByValueButNotWithText)
{
    Dictionary dictionary;
    dictionary.add(static_cast<int16_t>(1), u"one");
    EXPECT_TRUE(dictionary.exists(1.0));
    EXPECT_TRUE(dictionary.exists(Currency { 10000 }));
    EXPECT_FALSE(dictionary.exists(u"1"));
    EXPECT_EQ(errorOf([&] { dictionary.add(int32_t(1), u"again"); }), errors::DuplicateKey);
    dictionary.add(u"1", u"text one");
    EXPECT_EQ(dictionary.count(), 2);
    EXPECT_EQ(
        errorOf([&] { dictionary.add(Variant(core::VariantArray()), 1.0); }), errors::TypeMismatch);
}

TEST(Dictionary, ReadingAMissingItemAddsIt)
{
    Dictionary dictionary;
    EXPECT_TRUE(dictionary.value(u"a").isEmpty());
    EXPECT_EQ(dictionary.count(), 0);
    EXPECT_TRUE(dictionary.item(u"a").isEmpty());
    EXPECT_EQ(dictionary.count(), 1);
    EXPECT_EQ(errorOf([&] { dictionary.add(u"a", 1.0); }), errors::DuplicateKey);
    dictionary.setItem(u"a", 2.0);
    dictionary.setItem(u"b", 3.0);
    EXPECT_EQ(dictionary.item(u"a"), Variant(2.0));
    EXPECT_EQ(dictionary.count(), 2);
}

TEST(Dictionary, RemoveKeepsOrderAndReportsMissingKeys)
{
    Dictionary dictionary;
    for (const char16_t* key : { u"a", u"b", u"c" })
        dictionary.add(key, key);
    dictionary.remove(u"b");
    EXPECT_EQ(dictionary.keys(), (std::vector<Variant> { u"a", u"c" }));
    EXPECT_EQ(dictionary.items(), (std::vector<Variant> { u"a", u"c" }));
    EXPECT_EQ(errorOf([&] { dictionary.remove(u"b"); }), errors::ElementNotFound);
    EXPECT_EQ(core::ComError::basic(errors::ElementNotFound).description(), u"Element not found");
    dictionary.removeAll();
    EXPECT_EQ(dictionary.count(), 0);
}

TEST(Dictionary, CompareModeOnlyChangesWhileEmpty)
{
    Dictionary dictionary;
    dictionary.setCompareMode(Dictionary::TextCompare);
    dictionary.add(u"a", 1.0);
    EXPECT_EQ(errorOf([&] { dictionary.setCompareMode(Dictionary::BinaryCompare); }),
        errors::InvalidProcedureCall);
    EXPECT_EQ(dictionary.compareMode(), Dictionary::TextCompare);
    EXPECT_EQ(errorOf([&] { dictionary.remove(u"A"); }), 0);
    EXPECT_EQ(errorOf([] { Dictionary(static_cast<Dictionary::CompareMode>(7)); }),
        errors::InvalidProcedureCall);
}

TEST(Collection, PositionsAreOneBasedAndKeysIgnoreCase)
{
    Collection collection;
    collection.add(u"first", QStringLiteral("One"));
    collection.add(u"second");
    collection.add(u"third", QStringLiteral("three"));
    EXPECT_EQ(collection.count(), 3);
    EXPECT_EQ(collection.item(int32_t(1)), Variant(u"first"));
    EXPECT_EQ(collection.item(2.0), Variant(u"second"));
    EXPECT_EQ(collection.item(u"ONE"), Variant(u"first"));
    EXPECT_EQ(collection.find(QStringLiteral("THREE")), 3);
    EXPECT_FALSE(collection.find(QStringLiteral("two")).has_value());

    EXPECT_EQ(errorOf([&] { collection.item(int32_t(0)); }), errors::SubscriptOutOfRange);
    EXPECT_EQ(errorOf([&] { collection.item(int32_t(4)); }), errors::SubscriptOutOfRange);
    EXPECT_EQ(errorOf([&] { collection.item(u"two"); }), errors::InvalidProcedureCall);
    EXPECT_EQ(
        errorOf([&] { collection.add(u"again", QStringLiteral("ONE")); }), errors::DuplicateKey);
    EXPECT_EQ(errorOf([&] { collection.item(Variant::null()); }), errors::InvalidUseOfNull);

    collection.remove(u"one");
    EXPECT_EQ(collection.item(int32_t(1)), Variant(u"second"));
    EXPECT_EQ(collection.find(QStringLiteral("three")), 2);
    collection.remove(int32_t(2));
    EXPECT_EQ(collection.items(), (std::vector<Variant> { u"second" }));
    EXPECT_EQ(errorOf([&] { collection.remove(u"three"); }), errors::InvalidProcedureCall);
}

namespace {

class Source : public core::EventSource {
public:
    void fire(std::span<Variant> args) { raise(7, QStringLiteral("Changed"), args); }
    void fireOther() { raise(8, QStringLiteral("Other"), {}); }
};

} // namespace

TEST(EventSource, HandlersRunInOrderAndSeeEarlierResults)
{
    Source source;
    std::vector<int> calls;
    source.connect([&](int32_t dispid, const QString& name, std::span<Variant> args) {
        EXPECT_EQ(dispid, 7);
        EXPECT_EQ(name, u"Changed");
        calls.push_back(1);
        args[0] = args[0].toLong() + 1;
    });
    source.connect([&](int32_t, const QString&, std::span<Variant> args) {
        calls.push_back(2);
        args[0] = args[0].toLong() * 10;
    });
    Variant args[] = { int32_t(1) };
    source.fire(args);
    EXPECT_EQ(calls, (std::vector<int> { 1, 2 }));
    EXPECT_EQ(args[0], Variant(int32_t(20)));
}

TEST(EventSource, HandlersMayChangeConnectionsWhileTheEventRuns)
{
    Source source;
    std::vector<int> calls;
    int second = 0;
    int added = 0;
    const int first = source.connect([&](int32_t, const QString&, std::span<Variant>) {
        calls.push_back(1);
        source.disconnect(second);
        if (added == 0)
            added = source.connect(
                [&](int32_t, const QString&, std::span<Variant>) { calls.push_back(3); });
    });
    second
        = source.connect([&](int32_t, const QString&, std::span<Variant>) { calls.push_back(2); });
    source.fire({});
    // The disconnected handler is skipped; the new one waits for the next event.
    EXPECT_EQ(calls, (std::vector<int> { 1 }));
    source.disconnect(first);
    source.fire({});
    EXPECT_EQ(calls, (std::vector<int> { 1, 3 }));
    source.disconnect(added);
    EXPECT_FALSE(source.hasHandlers());
    source.disconnect(12345);
}

TEST(EventSource, HandlersTakeTheEventsTheyNamed)
{
    Source source;
    std::vector<int32_t> named;
    std::vector<int32_t> every;
    source.connect(
        [&](int32_t dispid, const QString&, std::span<Variant>) { named.push_back(dispid); },
        std::vector<int32_t> { 8 });
    source.connect(
        [&](int32_t dispid, const QString&, std::span<Variant>) { every.push_back(dispid); });
    source.fire({});
    source.fireOther();
    EXPECT_EQ(named, std::vector<int32_t> { 8 });
    EXPECT_EQ(every, (std::vector<int32_t> { 7, 8 }));
    // Only a handler that named the event answers for it; one for every event may not.
    EXPECT_TRUE(source.hasHandlerFor(8));
    EXPECT_FALSE(source.hasHandlerFor(7));

    Source none;
    none.connect([](int32_t, const QString&, std::span<Variant>) {}, std::vector<int32_t> {});
    EXPECT_TRUE(none.hasHandlers());
    EXPECT_FALSE(none.hasHandlerFor(7)) << "an empty list takes nothing";
}

TEST(EventSource, AHandlerMayDestroyTheSource)
{
    auto source = std::make_unique<Source>();
    int later = 0;
    source->connect([&](int32_t, const QString&, std::span<Variant>) { source.reset(); });
    source->connect([&](int32_t, const QString&, std::span<Variant>) { ++later; });
    source->fire({});
    EXPECT_EQ(source, nullptr);
    EXPECT_EQ(later, 0);
}
