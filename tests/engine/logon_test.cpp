#include "enginefixture.h"

#include <QRegularExpression>

namespace enginetest {
namespace {

using Logon = EngineTest;

struct LogonData {
    engine::MoxServerTypes type = engine::ecstMSSQL;
    QString server = u"Srv"_s;
    QString base = u"Shop"_s;
    QString user = u"Sales"_s;
    QString password = u"Secr3t"_s;
};

void setLogonInfo(engine::MoxEngine115& engine, const LogonData& data)
{
    EXPECT_TRUE(engine.SetLogonInfo(data.type, data.server, data.base, data.user, data.password));
}

struct ChangeCase {
    const char* name;
    LogonData second;
    bool logsOnAgain;
};

class LogonChange : public EngineTest, public ::testing::WithParamInterface<ChangeCase> { };

TEST_P(LogonChange, DecidesWhetherTheNextLogOnGoesToTheServer)
{
    auto engine = makeEngine();
    setLogonInfo(*engine, LogonData {});
    ASSERT_TRUE(engine->LogOn());
    setLogonInfo(*engine, GetParam().second);
    fake.clearLog();

    ASSERT_TRUE(engine->LogOn());

    EXPECT_EQ(fake.calls(u"Application.logOnServer"_s).size(), GetParam().logsOnAgain ? 1 : 0)
        << fake.dump().toStdString();
}

LogonData with(void (*change)(LogonData&))
{
    LogonData data;
    change(data);
    return data;
}

INSTANTIATE_TEST_SUITE_P(Engine, LogonChange,
    ::testing::Values(ChangeCase { "SameValues", LogonData {}, false },
        ChangeCase { "ServerCaseOnly", with([](LogonData& d) { d.server = u"SRV"_s; }), false },
        ChangeCase { "DatabaseCaseOnly", with([](LogonData& d) { d.base = u"shop"_s; }), false },
        ChangeCase { "UserCaseOnly", with([](LogonData& d) { d.user = u"sales"_s; }), false },
        // Passwords are case-sensitive on the server: another case is another password.
        ChangeCase {
            "PasswordCaseOnly", with([](LogonData& d) { d.password = u"secr3t"_s; }), true },
        ChangeCase { "PasswordChanged", with([](LogonData& d) { d.password = u"other"_s; }), true },
        ChangeCase { "ServerChanged", with([](LogonData& d) { d.server = u"Srv2"_s; }), true },
        ChangeCase { "UserChanged", with([](LogonData& d) { d.user = u"Admin"_s; }), true },
        ChangeCase {
            "TypeChanged", with([](LogonData& d) { d.type = engine::ecstMSJET40; }), true }),
    [](const auto& row) { return std::string(row.param.name); });

TEST_F(Logon, CaseOnlyChangeKeepsTheStoredSpellingWhilePasswordCaseIsTaken)
{
    auto engine = makeEngine();
    setLogonInfo(*engine, LogonData {});
    setLogonInfo(*engine, with([](LogonData& d) {
        d.server = u"SRV"_s;
        d.password = u"SECR3T"_s;
    }));

    ASSERT_TRUE(engine->LogOn());

    const QStringList calls = fake.calls(u"Application.logOnServer"_s);
    ASSERT_EQ(calls.size(), 1);
    EXPECT_TRUE(calls[0].startsWith(
        uR"(Application.logOnServer("PDSOLEDB.DLL","Srv","Shop","Sales","SECR3T","SQLOLEDB",)"_s))
        << calls[0].toStdString();
}

TEST_F(Logon, ServerTypeIsPublishedOnlyWhenThisEngineChangesIt)
{
    auto first = makeEngine();
    auto second = makeEngine();
    first->SetLogonInfo(engine::ecstMSSQL, u"a"_s, u"b"_s, u"c"_s, u"d"_s);
    second->SetLogonInfo(engine::ecstMSJET, u"a"_s, u"b"_s, u"c"_s, u"d"_s);
    EXPECT_EQ(engine::gServerType, engine::ecstMSJET);
    first->SetLogonInfo(engine::ecstMSSQL, u"other"_s, u"b"_s, u"c"_s, u"d"_s);
    EXPECT_EQ(engine::gServerType, engine::ecstMSJET);
}

struct ConnectionCase {
    const char* name;
    engine::MoxServerTypes type;
    QString user;
    QString expectedTail; // after "App=LUDMoxViewer115.<n>"
};

class LogonConnection : public EngineTest, public ::testing::WithParamInterface<ConnectionCase> { };

TEST_P(LogonConnection, LogsOnThroughTheOleDbDriverWithTheConnectionString)
{
    const ConnectionCase& row = GetParam();
    auto engine = makeEngine();
    engine->SetLogonInfo(row.type, u"srv"_s, u"Shop"_s, row.user, u"pw"_s);

    ASSERT_TRUE(engine->LogOn());

    const QStringList calls = fake.calls(u"Application."_s);
    ASSERT_EQ(calls.size(), 2) << fake.dump().toStdString();
    EXPECT_EQ(calls[0], u"Application.setMatchLogOnInfo(True)"_s);
    const QRegularExpression expected(
        u"^Application\\.logOnServer\\(\"PDSOLEDB\\.DLL\",\"srv\",\"Shop\",\""_s
        + QRegularExpression::escape(row.user) + u"\",\"pw\",\"SQLOLEDB\","_s
        + u"\"Provider=SQLOLEDB;Server=srv;Database=Shop;App=LUDMoxViewer115\\.(\\d+)"_s
        + QRegularExpression::escape(row.expectedTail) + u"\"\\)$"_s);
    const QRegularExpressionMatch match = expected.match(calls[1]);
    ASSERT_TRUE(match.hasMatch()) << calls[1].toStdString();
    EXPECT_LE(match.captured(1).toInt(), 9999);
}

INSTANTIATE_TEST_SUITE_P(Engine, LogonConnection,
    ::testing::Values(ConnectionCase { "EmptyUserUsesIntegratedSecurity", engine::ecstMSSQL, u""_s,
                          u";UID=;PWD=pw;Integrated Security=True;Persist Security Info=False;"_s },
        ConnectionCase { "DomainUserUsesIntegratedSecurity", engine::ecstMSSQL, u"CORP\\ann"_s,
            u";UID=CORP\\ann;PWD=pw;Integrated Security=True;Persist Security Info=False;"_s },
        ConnectionCase { "PlainUserLogsOnWithPassword", engine::ecstMSSQL, u"sa"_s,
            u";UID=sa;PWD=pw;Persist Security Info=False;"_s },
        // Jet databases get the same server logon call; only their tables differ.
        ConnectionCase { "JetLogsOnLikeSqlServer", engine::ecstMSJET, u"admin"_s,
            u";UID=admin;PWD=pw;Persist Security Info=False;"_s }),
    [](const auto& row) { return std::string(row.param.name); });

TEST_F(Logon, NoServerTypeFailsWithoutTouchingTheRuntime)
{
    auto engine = makeEngine();
    engine->SetLogonInfo(engine::ecstNone, u"srv"_s, u"db"_s, u"u"_s, u"p"_s);
    engine->ConnectionFailed(true);

    EXPECT_FALSE(engine->LogOn());

    EXPECT_EQ(engine->LastError(), u"0, , "_s);
    EXPECT_FALSE(engine->ConnectionFailed());
    EXPECT_TRUE(fake.allCalls().isEmpty());
}

TEST_F(Logon, ConnectionFailureSetsTheFlagAndTheNextLogOnTriesAgain)
{
    auto engine = loggedOnEngine();
    fake.failOn(u"Application.logOnServer"_s, runtimeError(LogOnFailed, u"Server not found"_s));

    EXPECT_FALSE(engine->LogOn());
    EXPECT_TRUE(engine->ConnectionFailed());
    EXPECT_EQ(engine->LastError(), u"-2147189155, Crystal Reports, Server not found"_s);

    EXPECT_TRUE(engine->LogOn());
    EXPECT_FALSE(engine->ConnectionFailed());
    EXPECT_EQ(engine->LastError(), u""_s);
    EXPECT_EQ(fake.calls(u"Application.logOnServer"_s).size(), 2);
}

TEST_F(Logon, OtherFailuresOnlySetLastError)
{
    auto engine = loggedOnEngine();
    fake.failOn(u"Application.setMatchLogOnInfo"_s, runtimeError(RuntimeFailure, u"Busy"_s));

    EXPECT_FALSE(engine->LogOn());
    EXPECT_FALSE(engine->ConnectionFailed());
    EXPECT_EQ(engine->LastError(), u"-2147220727, Crystal Reports, Busy"_s);
}

TEST_F(Logon, MissingRuntimeIsReportedInLastError)
{
    auto engine = loggedOnEngine();
    runtime::ApplicationFactory::install(nullptr);

    EXPECT_FALSE(engine->LogOn());
    EXPECT_TRUE(engine->LastError().startsWith(u"429, "_s)) << engine->LastError().toStdString();
}

TEST_F(Logon, PasswordNeverReachesLastError)
{
    auto engine = loggedOnEngine();
    fake.failOn(u"Application.logOnServer"_s,
        core::ComError(LogOnFailed, u"Provider Secr3t"_s,
            u"Login failed: Provider=SQLOLEDB;UID=sa;PWD=Secr3t;"_s));

    EXPECT_FALSE(engine->LogOn());

    EXPECT_FALSE(engine->LastError().contains(u"Secr3t"_s)) << engine->LastError().toStdString();
    EXPECT_TRUE(engine->LastError().contains(u"UID=sa;PWD=********;"_s));
}

} // namespace
} // namespace enginetest
