// The viewer window class through the real automation server, as a host drives it: created
// by its name, its events raised to the host and the host's by-reference answers taken back
// to the (scripted) viewer control.

#include "automation/jsontext.h"
#include "automation/registry.h"
#include "automation/server.h"
#include "engine/moxglobals.h"
#include "runtime/viewernotifications.h"
#include "support/fakeruntime.h"
#include "support/scriptedviewercontrol.h"

#include <QCborArray>
#include <QCborMap>
#include <QTemporaryFile>
#include <gtest/gtest.h>
#include <thread>
#include <unistd.h>

using automation::JsonText;
using fakeruntime::ScriptedViewerControl;

namespace {

QByteArray request(int id, const char* method, const QByteArray& params = "{}")
{
    return QByteArray(R"({"jsonrpc":"2.0","id":)") + QByteArray::number(id) + R"(,"method":")"
        + method + R"(","params":)" + params + '}';
}

QByteArray answer(int eventId, const QByteArray& args)
{
    return QByteArray(R"({"jsonrpc":"2.0","id":)") + QByteArray::number(eventId)
        + R"(,"result":{"args":)" + args + "}}";
}

/// Writes every line (the answers to the server's events among them, numbered 1, 2, ...)
/// before reading, then collects what the server wrote.
std::vector<QCborMap> runServer(const QList<QByteArray>& lines)
{
    int input[2];
    EXPECT_EQ(::pipe(input), 0);
    std::thread writer([&lines, fd = input[1]] {
        for (const QByteArray& line : lines) {
            const QByteArray data = line + '\n';
            if (::write(fd, data.constData(), size_t(data.size())) != data.size())
                break;
        }
        ::close(fd);
    });
    QTemporaryFile output;
    EXPECT_TRUE(output.open());
    {
        automation::Server server(input[0], output.handle(), automation::Registry::instance());
        server.run();
    }
    writer.join();
    ::close(input[0]);
    output.seek(0);
    std::vector<QCborMap> messages;
    for (const QByteArray& line : output.readAll().split('\n')) {
        if (const auto message = JsonText::parse(line); message && message->isMap())
            messages.push_back(message->toMap());
    }
    return messages;
}

QCborMap find(const std::vector<QCborMap>& messages, const QString& key, const QCborValue& id)
{
    for (const QCborMap& message : messages) {
        if (message.contains(key) && message.value(QStringLiteral("id")) == id)
            return message;
    }
    return {};
}

TEST(ViewerServer, EventsReachTheHostAndItsAnswersReachTheViewer)
{
    engine::ReleaseApplication();
    fakeruntime::FakeRuntime fake;
    auto file = fake.addReport(QStringLiteral("orders.rpt"));
    file->addTable(QStringLiteral("Orders"), QStringLiteral("Shop.dbo.Orders"));
    file->addSection(QStringLiteral("D"));

    bool printUseDefault = true;
    int16_t keyCode = 65;
    int16_t shift = 0;
    auto guard = ScriptedViewerControl::install([&](ScriptedViewerControl& control) {
        control.onViewReport = [&control, &printUseDefault, &keyCode, &shift] {
            control.notifications()->keyDown(keyCode, shift);
            control.notifications()->printButtonClicked(printUseDefault);
        };
    });

    // Handles in the order objects reach the host: the window 1, the engine 2, its
    // collection 3, the report 4, the control 5.
    const auto messages = runServer({
        request(1, "create", R"({"class":"clsMoxViewer115"})"),
        request(2, "connect", R"({"object":1})"),
        request(3, "invoke", R"({"object":1,"member":"CreateViewerForm","args":[0]})"),
        request(4, "create", R"({"class":"MoxEngine115"})"),
        request(5, "invoke",
            R"({"object":2,"member":"SetLogonInfo","args":[2,"srv","Shop","sa","pw"]})"),
        request(6, "invoke", R"({"object":2,"member":"GetReports"})"),
        request(7, "invoke", R"({"object":3,"member":"Item","args":["orders.rpt"]})"),
        request(8, "invoke", R"({"object":1,"member":"CRView","kind":"get"})"),
        request(9, "invoke",
            R"({"object":5,"member":"Report","kind":"putref","args":[{"$object":4}]})"),
        request(10, "invoke", R"({"object":1,"member":"ShowReport","args":[1,0]})"),
        answer(1, "[0, 1]"),
        answer(2, "[false]"),
        request(11, "invoke", R"({"object":5,"member":"ActiveViewIndex"})"),
        request(12, "invoke", R"({"object":1,"member":"Destroy"})"),
        request(13, "invoke", R"({"object":1,"member":"GetFHwnd"})"),
    });

    EXPECT_NE(find(messages, QStringLiteral("result"), 3)
                  .value(QStringLiteral("result"))[QStringLiteral("value")]
                  .toInteger(),
        0);
    const QCborMap keyDown = find(messages, QStringLiteral("method"), 1);
    EXPECT_EQ(keyDown.value(QStringLiteral("params"))[QStringLiteral("name")].toString(),
        QStringLiteral("KeyDown"));
    EXPECT_EQ(keyDown.value(QStringLiteral("params"))[QStringLiteral("dispid")].toInteger(), 13);
    const QCborMap print = find(messages, QStringLiteral("method"), 2);
    EXPECT_EQ(print.value(QStringLiteral("params"))[QStringLiteral("name")].toString(),
        QStringLiteral("PrintButtonClicked"));
    EXPECT_EQ(print.value(QStringLiteral("params"))[QStringLiteral("dispid")].toInteger(), 1);
    EXPECT_EQ(keyCode, 0);
    EXPECT_EQ(shift, 1);
    EXPECT_FALSE(printUseDefault);
    EXPECT_EQ(find(messages, QStringLiteral("result"), 11)
                  .value(QStringLiteral("result"))[QStringLiteral("value")]
                  .toInteger(),
        1);
    EXPECT_EQ(find(messages, QStringLiteral("result"), 13)
                  .value(QStringLiteral("result"))[QStringLiteral("value")]
                  .toInteger(),
        0);
    engine::ReleaseApplication();
}

TEST(ViewerServer, TheTypeLibraryListsTheViewerClasses)
{
    const auto messages = runServer({ request(1, "typelib") });
    const QCborArray classes = find(messages, QStringLiteral("result"), 1)
                                   .value(QStringLiteral("result"))[QStringLiteral("classes")]
                                   .toArray();
    QStringList names;
    QCborMap window;
    for (const QCborValue& entry : classes) {
        names << entry[QStringLiteral("name")].toString();
        if (entry[QStringLiteral("name")].toString() == QStringLiteral("clsMoxViewer115"))
            window = entry.toMap();
    }
    EXPECT_TRUE(names.contains(QStringLiteral("IMoxViewer115")));
    EXPECT_FALSE(names.contains(QStringLiteral("MoxViewer115")));
    ASSERT_FALSE(window.isEmpty());
    EXPECT_TRUE(window.value(QStringLiteral("creatable")).toBool());
    const QCborArray events
        = window.value(QStringLiteral("events"))[QStringLiteral("members")].toArray();
    ASSERT_EQ(events.size(), 16);
    EXPECT_EQ(events[10][QStringLiteral("name")].toString(), QStringLiteral("OnReportSourceError"));
    EXPECT_EQ(events[10][QStringLiteral("dispid")].toInteger(), 11);
}

} // namespace
