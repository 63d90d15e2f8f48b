#include "automation/dispatcherror.h"
#include "automation/jsontext.h"
#include "automation/server.h"
#include "gadget.h"

#include <QCborArray>
#include <QCborMap>
#include <QTemporaryFile>
#include <fcntl.h>
#include <gtest/gtest.h>
#include <thread>
#include <unistd.h>

using automation::JsonText;

namespace {

/// Runs a server over a scripted host: every line is written before any answer is read
/// (the answers to events included, since the server numbers its events 1, 2, ...), the
/// input is then closed and the answers are collected. A thread writes the lines, so they
/// may be larger than the pipe.
class ScriptedHost {
public:
    std::vector<QCborMap> run(const QList<QByteArray>& lines)
    {
        int input[2];
        EXPECT_EQ(::pipe(input), 0);
        std::thread writer([&lines, fd = input[1]] {
            for (const QByteArray& line : lines) {
                if (!writeAll(fd, line) || !writeAll(fd, "\n"))
                    break;
            }
            ::close(fd);
        });
        QTemporaryFile output;
        EXPECT_TRUE(output.open());
        {
            automation::Server server(input[0], output.handle(), automationtest::gadgetRegistry());
            server.run();
            heldAfterRun = server.heldObjects();
        }
        writer.join();
        ::close(input[0]);
        output.seek(0);
        std::vector<QCborMap> messages;
        for (const QByteArray& line : output.readAll().split('\n')) {
            if (line.isEmpty())
                continue;
            const std::optional<QCborValue> message = JsonText::parse(line);
            EXPECT_TRUE(message && message->isMap()) << line.constData();
            if (message)
                messages.push_back(message->toMap());
        }
        return messages;
    }

    size_t heldAfterRun = 1;

private:
    static bool writeAll(int fd, QByteArrayView data)
    {
        while (!data.isEmpty()) {
            const ssize_t written = ::write(fd, data.data(), size_t(data.size()));
            if (written <= 0)
                return false;
            data = data.sliced(written);
        }
        return true;
    }
};

QByteArray request(int id, const char* method, const QByteArray& params = "{}")
{
    return QByteArray(R"({"jsonrpc":"2.0","id":)") + QByteArray::number(id) + R"(,"method":")"
        + method + R"(","params":)" + params + '}';
}

QCborValue resultOf(const std::vector<QCborMap>& messages, int id)
{
    for (const QCborMap& message : messages) {
        if (message.value(QStringLiteral("id")) == QCborValue(id))
            return message.value(QStringLiteral("result"));
    }
    return QCborValue(QCborValue::Undefined);
}

QCborMap errorOf(const std::vector<QCborMap>& messages, int id)
{
    for (const QCborMap& message : messages) {
        if (message.value(QStringLiteral("id")) == QCborValue(id))
            return message.value(QStringLiteral("error")).toMap();
    }
    return {};
}

const QByteArray createGadget = request(1, "create", R"({"class":"Gadget"})");

TEST(Server, MalformedInputIsAnsweredAndServingGoesOn)
{
    ScriptedHost host;
    const auto messages = host.run({ "this is not json", "[1,2]", "", R"({"id":5})",
        R"({"id":6,"method":7})", request(7, "nope"), request(8, "invoke", "[]"),
        request(9, "invoke", R"({"object":42,"member":"Add"})"),
        request(10, "create", R"({"class":"MoxNothing"})"), createGadget,
        request(11, "invoke", R"({"object":1,"member":"Add","args":[1,2],"kind":"sideways"})"),
        request(12, "invoke", R"({"object":1,"member":"Add","args":[{"$weird":1},2]})"),
        request(13, "invoke", R"({"object":1,"member":"Add","args":[{"$object":9},2]})"),
        request(14, "invoke", R"({"object":1,"member":"Add","args":[1,2]})") });
    // Blank lines are skipped; every other line gets exactly one answer.
    ASSERT_EQ(messages.size(), 13u);
    EXPECT_EQ(
        messages[0].value(QStringLiteral("error"))[QStringLiteral("code")].toInteger(), -32700);
    EXPECT_TRUE(messages[0].value(QStringLiteral("id")).isNull());
    EXPECT_EQ(
        messages[1].value(QStringLiteral("error"))[QStringLiteral("code")].toInteger(), -32600);
    EXPECT_EQ(errorOf(messages, 5).value(QStringLiteral("code")).toInteger(), -32600);
    EXPECT_EQ(errorOf(messages, 6).value(QStringLiteral("code")).toInteger(), -32600);
    EXPECT_EQ(errorOf(messages, 7).value(QStringLiteral("code")).toInteger(), -32601);
    EXPECT_EQ(errorOf(messages, 8).value(QStringLiteral("code")).toInteger(), -32602);
    EXPECT_EQ(errorOf(messages, 9).value(QStringLiteral("code")).toInteger(), -32602);
    EXPECT_EQ(
        errorOf(messages, 10).value(QStringLiteral("data"))[QStringLiteral("number")].toInteger(),
        automation::DispatchNumber::ClassNotRegistered);
    EXPECT_EQ(errorOf(messages, 11).value(QStringLiteral("code")).toInteger(), -32602);
    EXPECT_EQ(
        errorOf(messages, 12).value(QStringLiteral("data"))[QStringLiteral("number")].toInteger(),
        automation::DispatchNumber::TypeMismatch);
    EXPECT_EQ(errorOf(messages, 13).value(QStringLiteral("code")).toInteger(), -32602);
    EXPECT_EQ(resultOf(messages, 14)[QStringLiteral("value")].toInteger(), 3);
}

TEST(Server, AnOverlongLineIsRefusedAndTheNextOneServed)
{
    // 200 MB, far over the limit: refused without being kept, and the request after it
    // still gets its answer.
    QByteArray huge(200 * 1000 * 1000, 'x');
    huge.prepend(R"({"jsonrpc":"2.0","id":1,"method":"create","params":{"class":")");
    ScriptedHost host;
    const auto messages = host.run({ huge, request(2, "create", R"({"class":"Gadget"})") });
    huge.clear();
    ASSERT_EQ(messages.size(), 2u);
    const QCborMap error = messages[0].value(QStringLiteral("error")).toMap();
    EXPECT_EQ(error.value(QStringLiteral("code")).toInteger(), -32700);
    EXPECT_EQ(error.value(QStringLiteral("message")).toString(),
        QStringLiteral("Parse error: line too long"));
    EXPECT_TRUE(messages[0].value(QStringLiteral("id")).isNull());
    EXPECT_EQ(resultOf(messages, 2)[QStringLiteral("object")].toInteger(), 1);
}

TEST(Server, ComponentErrorsCarryNumberSourceAndDescription)
{
    ScriptedHost host;
    const auto messages
        = host.run({ createGadget, request(2, "invoke", R"({"object":1,"member":"Fail"})"),
            request(3, "invoke", R"({"object":1,"member":"CallMissingMember"})") });
    const QCborMap error = errorOf(messages, 2);
    EXPECT_EQ(error.value(QStringLiteral("code")).toInteger(), -32000);
    EXPECT_EQ(JsonText::serialize(error.value(QStringLiteral("data"))),
        QByteArray(R"({"number":1234,"source":"Gadget.Fail","description":"Broken on purpose"})"));
    // A binding failure inside the component is the component's error.
    EXPECT_EQ(errorOf(messages, 3).value(QStringLiteral("code")).toInteger(), -32000);
}

TEST(Server, HandlesAreCountedPerHandOut)
{
    ScriptedHost host;
    const auto messages
        = host.run({ createGadget, request(2, "invoke", R"({"object":1,"member":"Child"})"),
            request(3, "invoke", R"({"object":1,"member":"Child"})"),
            request(4, "release", R"({"object":2})"),
            request(5, "invoke", R"({"object":2,"member":"Counter"})"),
            request(6, "release", R"({"object":2})"),
            request(7, "invoke", R"({"object":2,"member":"Counter"})"),
            request(8, "release", R"({"object":2})"),
            // A notification is served without an answer.
            R"({"jsonrpc":"2.0","method":"release","params":{"object":1}})",
            request(9, "invoke", R"({"object":1,"member":"Counter"})") });
    EXPECT_EQ(
        resultOf(messages, 2)[QStringLiteral("value")][QStringLiteral("$object")].toInteger(), 2);
    EXPECT_EQ(
        resultOf(messages, 3)[QStringLiteral("value")][QStringLiteral("$object")].toInteger(), 2);
    EXPECT_EQ(resultOf(messages, 5)[QStringLiteral("value")].toInteger(), 0);
    EXPECT_EQ(errorOf(messages, 7).value(QStringLiteral("code")).toInteger(), -32602);
    EXPECT_EQ(errorOf(messages, 8).value(QStringLiteral("code")).toInteger(), -32602);
    EXPECT_EQ(errorOf(messages, 9).value(QStringLiteral("code")).toInteger(), -32602);
    EXPECT_EQ(messages.size(), 9u);
}

TEST(Server, EventsApplyByReferenceResultsAndServeNestedCalls)
{
    ScriptedHost host;
    const auto messages = host.run({ createGadget, request(2, "connect", R"({"object":1})"),
        request(3, "invoke", R"({"object":1,"member":"Ask","args":["Question"]})"),
        // While the server waits for the answer to event 1 it serves this call.
        request(4, "invoke", R"({"object":1,"member":"Counter","kind":"put","args":[5]})"),
        // The answer changes the by-reference prompt; the by-value count is ignored.
        R"({"jsonrpc":"2.0","id":1,"result":{"args":["Answer",99]}})",
        request(5, "disconnect", R"({"object":1})"),
        request(6, "invoke", R"({"object":1,"member":"Ask","args":["Alone"]})"),
        request(7, "invoke", R"({"object":1,"member":"Counter"})") });
    ASSERT_GE(messages.size(), 4u);
    const QCborMap event = messages[2];
    EXPECT_EQ(event.value(QStringLiteral("method")).toString(), QStringLiteral("event"));
    EXPECT_EQ(JsonText::serialize(event.value(QStringLiteral("params"))),
        QByteArray(R"({"object":1,"name":"Asked","dispid":1,"args":["Question",7]})"));
    // The nested call was answered before the outer one.
    EXPECT_EQ(messages[3].value(QStringLiteral("id")).toInteger(), 4);
    EXPECT_EQ(resultOf(messages, 3)[QStringLiteral("value")].toString(), QStringLiteral("Answer"));
    EXPECT_EQ(resultOf(messages, 6)[QStringLiteral("value")].toString(), QStringLiteral("Alone"));
    EXPECT_EQ(resultOf(messages, 7)[QStringLiteral("value")].toInteger(), 5);
}

TEST(Server, AnErrorAnswerOrAMissingAnswerLeavesArgumentsAlone)
{
    ScriptedHost host;
    const auto messages = host.run({ createGadget, request(2, "connect", R"({"object":1})"),
        request(3, "invoke", R"({"object":1,"member":"Ask","args":["Q1"]})"),
        R"({"jsonrpc":"2.0","id":1,"error":{"code":-1,"message":"handler failed"}})",
        request(4, "invoke", R"({"object":1,"member":"Ask","args":["Q2"]})"),
        R"({"jsonrpc":"2.0","id":2,"result":{}})",
        request(5, "invoke", R"({"object":1,"member":"Ask","args":["Q3"]})"),
        R"({"jsonrpc":"2.0","id":3,"result":{"args":[{"$date":"never"}]}})",
        // The input ends while the server waits for the answer to event 4.
        request(6, "invoke", R"({"object":1,"member":"Ask","args":["Q4"]})") });
    EXPECT_EQ(resultOf(messages, 3)[QStringLiteral("value")].toString(), QStringLiteral("Q1"));
    EXPECT_EQ(resultOf(messages, 4)[QStringLiteral("value")].toString(), QStringLiteral("Q2"));
    EXPECT_EQ(resultOf(messages, 5)[QStringLiteral("value")].toString(), QStringLiteral("Q3"));
    EXPECT_EQ(resultOf(messages, 6)[QStringLiteral("value")].toString(), QStringLiteral("Q4"));
    EXPECT_EQ(host.heldAfterRun, 0u);
}

TEST(Server, ShutdownAnswersThenStops)
{
    ScriptedHost host;
    const auto messages = host.run({ createGadget, request(2, "shutdown"),
        request(3, "invoke", R"({"object":1,"member":"Counter"})") });
    ASSERT_EQ(messages.size(), 2u);
    EXPECT_TRUE(resultOf(messages, 2).isMap());
    EXPECT_EQ(host.heldAfterRun, 0u);
}

TEST(Server, EndOfInputReleasesEveryObject)
{
    ScriptedHost host;
    host.run({ createGadget, request(2, "invoke", R"({"object":1,"member":"Child"})"),
        request(3, "invoke", R"({"object":1,"member":"Child"})") });
    EXPECT_EQ(host.heldAfterRun, 0u);
}

TEST(Server, TypeLibraryAndEnumeration)
{
    ScriptedHost host;
    const auto messages = host.run(
        { request(1, "typelib"), request(2, "create", R"({"class":"scripting.dictionary"})"),
            request(3, "invoke", R"({"object":1,"member":"Add","args":["k",{"$currency":"1.5"}]})"),
            request(4, "enumerate", R"({"object":1})"),
            request(5, "invoke", R"({"object":1,"dispid":0,"args":["k"]})") });
    const QCborValue library = resultOf(messages, 1);
    EXPECT_EQ(library[QStringLiteral("classes")].toArray().size(), 1) << "Gadget only";
    EXPECT_EQ(JsonText::serialize(resultOf(messages, 4)), QByteArray(R"({"items":["k"]})"));
    EXPECT_EQ(JsonText::serialize(resultOf(messages, 5)[QStringLiteral("value")]),
        QByteArray(R"({"$currency":"1.5000"})"));
}

} // namespace
