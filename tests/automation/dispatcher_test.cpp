#include "automation/classbuilder.h"
#include "automation/dispatcher.h"
#include "automation/dispatcherror.h"
#include "automation/handletable.h"
#include "automation/jsontext.h"
#include "automation/typelibrary.h"
#include "core/comerror.h"
#include "core/dictionary.h"
#include "gadget.h"
#include "rowname.h"

#include <QCborArray>
#include <gtest/gtest.h>

using automation::Dispatcher;
using automation::DispatchError;
using automation::MemberKind;
using automationtest::Gadget;
using automationtest::gadgetRegistry;
using core::Variant;
namespace DispatchNumber = automation::DispatchNumber;

namespace {

/// The error number a call raises (0 when none), and whether it was a dispatch error.
struct Outcome {
    int32_t number = 0;
    bool isDispatchError = false;
    std::optional<int> argument;
};

template <class F> Outcome outcomeOf(F&& call)
{
    try {
        call();
    } catch (const DispatchError& error) {
        return { error.number(), true, error.argumentIndex() };
    } catch (const core::ComError& error) {
        return { error.number(), false, std::nullopt };
    }
    return {};
}

class GadgetDispatch : public ::testing::Test {
protected:
    Variant invoke(const QString& member, std::vector<Variant> args = {},
        std::optional<MemberKind> kind = std::nullopt)
    {
        lastArgs = std::move(args);
        return dispatcher.invoke(gadget, member, kind, lastArgs);
    }

    Dispatcher dispatcher { gadgetRegistry() };
    std::shared_ptr<Gadget> gadget = std::make_shared<Gadget>();
    std::vector<Variant> lastArgs;
};

TEST_F(GadgetDispatch, ConvertsArgumentsToTheDeclaredTypes)
{
    // Text that reads as a number converts, as Basic converts it for an Integer parameter.
    EXPECT_EQ(invoke(QStringLiteral("Add"), { Variant(QStringLiteral("12")), Variant(2.6) }),
        Variant(int16_t(15)));
    // The final arguments are the values as the member received them.
    EXPECT_EQ(lastArgs[0], Variant(int16_t(12)));
    EXPECT_EQ(lastArgs[1], Variant(int16_t(3)));
}

TEST_F(GadgetDispatch, FindsMembersWithoutRegardToCaseAndByDispatchId)
{
    EXPECT_EQ(invoke(QStringLiteral("aDD"), { Variant(1), Variant(2) }), Variant(int16_t(3)));
    const auto& description = dispatcher.describe(*gadget);
    std::vector<Variant> args { Variant(4), Variant(5) };
    EXPECT_EQ(dispatcher.invoke(gadget, dispatcher.resolve(description, 1, std::nullopt), args),
        Variant(int16_t(9)));
}

TEST_F(GadgetDispatch, WritesByReferenceResultsBack)
{
    invoke(QStringLiteral("Twice"), { Variant(21) });
    EXPECT_EQ(lastArgs[0], Variant(int32_t(42)));
}

TEST_F(GadgetDispatch, OmittedArgumentsTakeTheirDefaults)
{
    EXPECT_EQ(invoke(QStringLiteral("Describe"), { Variant(QStringLiteral("x")) }),
        Variant(QStringLiteral("x/none/3")));
    // A Missing in the middle skips that argument only.
    EXPECT_EQ(invoke(QStringLiteral("Describe"),
                  { Variant(QStringLiteral("x")), Variant::missing(), Variant(9) }),
        Variant(QStringLiteral("x/none/9")));
    EXPECT_TRUE(lastArgs[1].isMissing());
    EXPECT_EQ(invoke(QStringLiteral("Describe"), { Variant(QStringLiteral("x")), Variant(2) }),
        Variant(QStringLiteral("x/2/3")));
}

TEST_F(GadgetDispatch, EnumerationsTravelAsLong)
{
    EXPECT_EQ(invoke(QStringLiteral("SetMode"), { Variant(int16_t(2)) }), Variant(int32_t(1)));
}

TEST_F(GadgetDispatch, PropertiesReadAndWrite)
{
    invoke(QStringLiteral("Name"), { Variant(QStringLiteral("n")) }, MemberKind::Put);
    EXPECT_EQ(invoke(QStringLiteral("Name")), Variant(QStringLiteral("n")));
    // An indexed put: the value is the last argument, the index comes before it.
    invoke(
        QStringLiteral("Label"), { Variant(2), Variant(QStringLiteral("two")) }, MemberKind::Put);
    EXPECT_EQ(invoke(QStringLiteral("Label"), { Variant(2) }), Variant(QStringLiteral("two")));
    // A Variant field takes objects by putref and plain values by put.
    auto other = std::make_shared<Gadget>();
    invoke(QStringLiteral("Value"), { Variant(core::ObjectPtr(other)) }, MemberKind::PutRef);
    EXPECT_EQ(gadget->Value.toObject(), other);
    invoke(QStringLiteral("Counter"), { Variant(QStringLiteral("7")) }, MemberKind::Put);
    EXPECT_EQ(gadget->Counter, 7);
}

TEST_F(GadgetDispatch, KindFallbacksThatDispatchCallersRelyOn)
{
    gadget->Counter = 5;
    // A method call on a property reads it; a put on a put-ref-only property assigns it.
    EXPECT_EQ(invoke(QStringLiteral("Counter"), {}, MemberKind::Method), Variant(int32_t(5)));
    invoke(QStringLiteral("Value"), { Variant(1) }, MemberKind::PutRef);
    EXPECT_EQ(gadget->Value, Variant(int32_t(1)));
}

TEST_F(GadgetDispatch, ObjectArgumentsAndResults)
{
    const auto child = invoke(QStringLiteral("Child")).objectAs<Gadget>();
    ASSERT_TRUE(child);
    EXPECT_EQ(invoke(QStringLiteral("Child")).toObject(), child);
    EXPECT_EQ(invoke(QStringLiteral("Adopt"), { Variant(core::ObjectPtr()) }), Variant(false));
}

TEST_F(GadgetDispatch, EnumeratesThroughTheHiddenMember)
{
    const std::vector<Variant> items = dispatcher.enumerate(gadget);
    ASSERT_EQ(items.size(), 3u);
    EXPECT_EQ(items[0], Variant(QStringLiteral("one")));
    // The enumerator object itself enumerates to the same items.
    std::vector<Variant> none;
    const Variant enumerator
        = dispatcher.invoke(gadget, QStringLiteral("_NewEnum"), std::nullopt, none);
    EXPECT_EQ(dispatcher.enumerate(enumerator.toObject()).size(), 3u);
}

struct CallFailure {
    const char* name;
    const char* member;
    std::vector<Variant> args;
    std::optional<MemberKind> kind;
    int32_t number;
    bool isDispatchError;
    std::optional<int> argument = std::nullopt;
};

class GadgetFailures : public GadgetDispatch, public ::testing::WithParamInterface<CallFailure> { };

TEST_P(GadgetFailures, RaiseTheRightError)
{
    const CallFailure& failure = GetParam();
    const Outcome outcome = outcomeOf(
        [&] { invoke(QString::fromLatin1(failure.member), failure.args, failure.kind); });
    EXPECT_EQ(outcome.number, failure.number);
    EXPECT_EQ(outcome.isDispatchError, failure.isDispatchError);
    EXPECT_EQ(outcome.argument, failure.argument);
}

INSTANTIATE_TEST_SUITE_P(Calls, GadgetFailures,
    ::testing::Values(CallFailure { "unknown_member", "Nope", {}, std::nullopt,
                          DispatchNumber::MemberNotFound, true },
        CallFailure { "read_only_has_no_put", "Child", { Variant(1) }, MemberKind::Put,
            DispatchNumber::MemberNotFound, true },
        CallFailure { "too_many_arguments", "Twice", { Variant(1), Variant(2) }, std::nullopt,
            DispatchNumber::BadParamCount, true },
        CallFailure { "required_argument_missing", "Add", { Variant(1) }, std::nullopt,
            DispatchNumber::ParamNotOptional, true, 1 },
        CallFailure { "required_argument_skipped", "Add", { Variant::missing(), Variant(1) },
            std::nullopt, DispatchNumber::ParamNotOptional, true, 0 },
        CallFailure {
            "put_without_value", "Name", {}, MemberKind::Put, DispatchNumber::BadParamCount, true },
        CallFailure { "text_for_integer", "Add", { Variant(QStringLiteral("abc")), Variant(1) },
            std::nullopt, DispatchNumber::TypeMismatch, true, 0 },
        CallFailure { "null_for_integer", "Add", { Variant(1), Variant::null() }, std::nullopt,
            DispatchNumber::TypeMismatch, true, 1 },
        CallFailure { "out_of_range", "Add", { Variant(70000), Variant(1) }, std::nullopt,
            DispatchNumber::TypeMismatch, true, 0 },
        CallFailure { "object_for_text", "Describe",
            { Variant(core::ObjectPtr(std::make_shared<core::Dictionary>())) }, std::nullopt,
            DispatchNumber::TypeMismatch, true, 0 },
        CallFailure { "object_of_another_class", "Adopt",
            { Variant(core::ObjectPtr(std::make_shared<core::Dictionary>())) }, std::nullopt,
            DispatchNumber::TypeMismatch, true, 0 },
        CallFailure { "array_for_long", "Twice", { Variant(core::VariantArray()) }, std::nullopt,
            DispatchNumber::TypeMismatch, true, 0 },
        // What the member raises passes through as it is.
        CallFailure { "member_raises", "Fail", {}, std::nullopt, 1234, false },
        CallFailure { "member_raises_index", "Label", { Variant(9) }, std::nullopt, 9, false },
        // A late-bound call made by the member is the member's error, not a binding error.
        CallFailure { "nested_binding_failure", "CallMissingMember", {}, std::nullopt,
            DispatchNumber::MemberNotFound, false }),
    automationtest::RowName {});

TEST(Registry, RejectsInconsistentTables)
{
    using automation::ClassBuilder;
    using automation::param;
    automation::Registry registry;
    auto build = [](auto&& declare) {
        ClassBuilder<Gadget> c(QStringLiteral("Gadget"), QStringLiteral("_Gadget"));
        declare(c);
        return c.take();
    };
    auto rejected = [&](auto&& declare) {
        try {
            registry.add(build(declare));
        } catch (const std::logic_error&) {
            return true;
        }
        return false;
    };
    EXPECT_TRUE(rejected([](auto& c) {
        c.method(QStringLiteral("Add"), 1, &Gadget::Add, { param(QStringLiteral("a")) });
    })) << "fewer declared parameters than the callable takes";
    EXPECT_TRUE(rejected([](auto& c) {
        c.method(
            QStringLiteral("Twice"), 1, &Gadget::Twice, { automation::byVal(QStringLiteral("v")) });
    })) << "a parameter the member writes declared ByVal";
    EXPECT_TRUE(rejected([](auto& c) {
        c.method(QStringLiteral("SetMode"), 1, &Gadget::SetMode, { param(QStringLiteral("m")) });
    })) << "an enumeration without its type name";
    EXPECT_TRUE(rejected([](auto& c) {
        c.method(QStringLiteral("Fail"), 1, &Gadget::Fail);
        c.method(QStringLiteral("Tick"), 1, &Gadget::Tick, { param(QStringLiteral("t")) });
    })) << "two names for one dispatch id";
    EXPECT_TRUE(rejected([](auto& c) {
        c.method(QStringLiteral("Fail"), 1, &Gadget::Fail);
        c.method(QStringLiteral("FAIL"), 2, &Gadget::Fail);
    })) << "one name declared twice";
    EXPECT_TRUE(rejected([](auto& c) {
        c.events(QStringLiteral("__Gadget"));
        c.event(QStringLiteral("A"), 1, {});
        c.event(QStringLiteral("B"), 1, {});
    })) << "two events with one dispatch id";
    EXPECT_FALSE(rejected([](auto& c) { c.method(QStringLiteral("Fail"), 1, &Gadget::Fail); }));
    EXPECT_TRUE(rejected([](auto& c) { c.method(QStringLiteral("Fail"), 1, &Gadget::Fail); }))
        << "the class name again";
}

TEST(HandleTable, SameObjectSameHandleUntilItDies)
{
    automation::HandleTable handles;
    std::vector<qint64> dropped;
    handles.setDroppingHandler([&](qint64 handle) { dropped.push_back(handle); });
    auto kept = std::make_shared<Gadget>();
    const qint64 handle = handles.handOut(kept);
    EXPECT_EQ(handles.handOut(kept), handle);
    EXPECT_EQ(handles.handOut(nullptr), 0);
    EXPECT_TRUE(handles.release(handle));
    EXPECT_EQ(handles.object(handle), kept) << "one host reference is left";
    EXPECT_TRUE(handles.release(handle));
    EXPECT_EQ(handles.object(handle), nullptr);
    EXPECT_FALSE(handles.release(handle));
    EXPECT_EQ(dropped, std::vector<qint64> { handle });
    // Still alive elsewhere: handed out again, it is the same object under the same number.
    EXPECT_EQ(handles.handOut(kept), handle);

    std::weak_ptr<Gadget> watched;
    {
        auto temporary = std::make_shared<Gadget>();
        watched = temporary;
        handles.handOut(temporary);
    }
    EXPECT_FALSE(watched.expired()) << "the table holds what the host holds";
    EXPECT_EQ(handles.clear(), 2u);
    EXPECT_TRUE(watched.expired());
}

TEST(ComponentTables, AreConsistentAndResolve)
{
    const automation::Registry& registry = automation::Registry::instance();
    EXPECT_TRUE(registry.unresolvedTypes().isEmpty())
        << qPrintable(registry.unresolvedTypes().join(u'\n'));
}

struct DispidCase {
    const char* className;
    const char* member;
    MemberKind kind;
    int32_t dispid;
};

class ComponentDispids : public ::testing::TestWithParam<DispidCase> { };

TEST_P(ComponentDispids, MatchTheInterface)
{
    const automation::ClassDescription* description
        = automation::Registry::instance().find(QString::fromLatin1(GetParam().className));
    ASSERT_TRUE(description);
    const auto& member = Dispatcher().resolve(
        *description, QString::fromLatin1(GetParam().member), GetParam().kind);
    EXPECT_EQ(member.dispid, GetParam().dispid);
    EXPECT_EQ(member.kind, GetParam().kind);
}

INSTANTIATE_TEST_SUITE_P(Foundation, ComponentDispids,
    ::testing::Values(DispidCase { "MoxEngine115", "Init", MemberKind::Method, 0x60030008 },
        DispidCase { "MoxEngine115", "MainWindowHandle", MemberKind::Put, 0x68030007 },
        DispidCase { "MoxEngine115", "LastError", MemberKind::Get, 0x68030006 },
        DispidCase { "MoxEngine115", "ConnectionFailed", MemberKind::Put, 0x68030005 },
        DispidCase { "MoxEngine115", "SetLogonInfo", MemberKind::Method, 0x60030009 },
        DispidCase { "MoxEngine115", "GetReports", MemberKind::Method, 0x6003000a },
        DispidCase { "MoxEngine115", "PrinterSetup", MemberKind::Method, 0x6003000b },
        DispidCase { "MoxEngine115", "SetProperties", MemberKind::Method, 0x6003000c },
        DispidCase { "MoxEngine115", "Properties", MemberKind::Method, 0x6003000d },
        DispidCase { "MoxEngine115", "SetDialogParentWindow", MemberKind::Method, 0x6003000e },
        DispidCase { "MoxEngine115", "Logoff", MemberKind::Method, 0x60030014 },
        DispidCase { "MoxEngine115", "CanUnload", MemberKind::Method, 0x60030015 },
        DispidCase { "MoxReports115", "Item", MemberKind::Method, 0 },
        DispidCase { "MoxReports115", "Remove", MemberKind::Method, 0x60030001 },
        DispidCase { "MoxReports115", "Destroy", MemberKind::Method, 0x60030002 },
        DispidCase { "MoxReports115", "NewEnum", MemberKind::Get, -4 }),
    [](const ::testing::TestParamInfo<DispidCase>& row) {
        return std::string(row.param.className) + "_" + row.param.member;
    });

TEST(TypeLibrary, ListsTheFoundation)
{
    const QCborMap library = automation::TypeLibrary::describe(automation::Registry::instance());
    EXPECT_EQ(library.value(QStringLiteral("name")).toString(), QStringLiteral("LUDMoxViewer115"));
    EXPECT_EQ(library.value(QStringLiteral("version")).toString(), QStringLiteral("1.0"));
    QStringList names;
    QStringList creatable;
    for (const QCborValue& entry : library.value(QStringLiteral("classes")).toArray()) {
        names.append(entry[QStringLiteral("name")].toString());
        if (entry[QStringLiteral("creatable")].toBool())
            creatable.append(entry[QStringLiteral("name")].toString());
    }
    for (const char* name :
        { "MoxEngine115", "MoxReports115", "MoxStatus115", "MoxEvents115", "MoxReport115" })
        EXPECT_TRUE(names.contains(QString::fromLatin1(name))) << name;
    EXPECT_TRUE(creatable.contains(QStringLiteral("MoxEngine115")));
    EXPECT_FALSE(creatable.contains(QStringLiteral("MoxReports115")));
    // Platform and runtime classes are served but not part of the library.
    EXPECT_FALSE(names.contains(QStringLiteral("Scripting.Dictionary")));
    EXPECT_FALSE(names.contains(QStringLiteral("Report")));

    const QByteArray json = automation::JsonText::serialize(library);
    EXPECT_TRUE(json.contains(
        R"({"name":"Init","dispid":1610809352,"kind":"method","params":[{"name":"Language","type":"Integer","optional":false,"byref":true})"));
    EXPECT_TRUE(json.contains(
        R"("events":{"interface":"__MoxEvents115","members":[{"name":"QueryParameters","dispid":1,)"));
    EXPECT_TRUE(json.contains(
        R"({"name":"enuPrintProgress","members":{"eppNoReport":0,"eppPrintingNotStarted":1,)"));
    EXPECT_TRUE(json.contains(
        R"({"name":"MoxServerTypes","members":{"ecstNone":0,"ecstMSJET":1,"ecstMSSQL":2,"ecstMSJET40":3}})"));
    EXPECT_TRUE(json.contains(
        R"({"name":"NumPages","type":"Integer","optional":true,"byref":true,"default":0})"));
}

TEST(ScriptingDictionary, ServesTheScriptingMembers)
{
    Dispatcher dispatcher;
    const core::ObjectPtr dictionary
        = automation::Registry::instance().find(QStringLiteral("Scripting.Dictionary"))->factory();
    dispatcher.call(
        dictionary, QStringLiteral("Add"), { Variant(QStringLiteral("a")), Variant(1) });
    std::vector<Variant> args { Variant(QStringLiteral("b")), Variant(3) };
    dispatcher.invoke(dictionary, QStringLiteral("Item"), MemberKind::Put, args);
    EXPECT_EQ(dispatcher.get(dictionary, QStringLiteral("Count")), Variant(int32_t(2)));
    EXPECT_EQ(
        dispatcher.call(dictionary, QStringLiteral("Exists"), { Variant(QStringLiteral("b")) }),
        Variant(true));
    EXPECT_EQ(dispatcher.get(dictionary, QStringLiteral("Item"), { Variant(QStringLiteral("b")) }),
        Variant(int32_t(3)));
    const Variant keys = dispatcher.call(dictionary, QStringLiteral("Keys"));
    EXPECT_EQ(keys.array().values(),
        (std::vector<Variant> { Variant(QStringLiteral("a")), Variant(QStringLiteral("b")) }));
    EXPECT_EQ(dispatcher.enumerate(dictionary), keys.array().values());
    // Compare mode can no longer change once the dictionary holds items.
    EXPECT_EQ(outcomeOf([&] {
        dispatcher.put(dictionary, QStringLiteral("CompareMode"), Variant(1));
    }).number,
        core::ErrorNumber::InvalidProcedureCall);
    dispatcher.call(dictionary, QStringLiteral("RemoveAll"));
    dispatcher.put(dictionary, QStringLiteral("CompareMode"), Variant(1));
    dispatcher.call(
        dictionary, QStringLiteral("Add"), { Variant(QStringLiteral("Key")), Variant(1) });
    EXPECT_EQ(
        dispatcher.call(dictionary, QStringLiteral("Exists"), { Variant(QStringLiteral("KEY")) }),
        Variant(true));
}

} // namespace
