#include "engine/luderrorhandler.h"
#include "enginefixture.h"
#include "reports/moxreports115.h"

#include <QFile>
#include <sys/mman.h>
#include <unistd.h>

#ifdef __SANITIZE_ADDRESS__
#include <sanitizer/lsan_interface.h>
#endif

namespace enginetest {
namespace {

using EngineLifecycle = EngineTest;

TEST_F(EngineLifecycle, CreationAndTerminationKeepTheEngineCountAndWriteNoTraceFile)
{
    const int32_t before = engine::gEngineCount;
    auto first = makeEngine();
    ASSERT_TRUE(engine::gInstanceLogFile.endsWith(u"/LUDMoxViewer115Log.txt"_s));
    QFile::remove(engine::gInstanceLogFile);
    {
        auto second = makeEngine();
        EXPECT_EQ(engine::gEngineCount, before + 2);
    }
    EXPECT_EQ(engine::gEngineCount, before + 1);
    first.reset();
    EXPECT_EQ(engine::gEngineCount, before);
    // Every trace point is switched off.
    EXPECT_FALSE(QFile::exists(engine::gInstanceLogFile));
}

TEST_F(EngineLifecycle, SecondInitChangesWhatDialogsOfTheFirstEngineSee)
{
    auto first = makeEngine();
    auto second = makeEngine();
    first->Init(3, false, 0x0000FF, 100);
    second->Init(5, true, 0x00FF00, 200);

    EXPECT_EQ(engine::gLanguage, 5);
    EXPECT_TRUE(engine::gXPStyle);
    EXPECT_EQ(engine::gBackColor, 0x00FF00);
    // The main window is each engine's own.
    EXPECT_EQ(first->Properties(u"MDIHandle"_s), core::Variant(int32_t { 100 }));
    EXPECT_EQ(second->Properties(u"MDIHandle"_s), core::Variant(int32_t { 200 }));
}

TEST_F(EngineLifecycle, MainWindowHandleAndInitWriteTheSameWindow)
{
    auto engine = makeEngine();
    engine->MainWindowHandle(42);
    EXPECT_EQ(engine->Properties(u"mdihandle"_s), core::Variant(int32_t { 42 }));
    engine->Init(3, false, 0, 7);
    EXPECT_EQ(engine->Properties(u"MDIHandle"_s), core::Variant(int32_t { 7 }));
}

TEST_F(EngineLifecycle, TerminatingOneEngineDropsTheSharedApplicationForAll)
{
    auto survivor = loggedOnEngine();
    ASSERT_TRUE(survivor->LogOn());
    auto other = makeEngine();
    ASSERT_EQ(fake.liveApplications().size(), 1u);

    other.reset();
    EXPECT_EQ(engine::gApplication, nullptr);
    EXPECT_TRUE(fake.liveApplications().empty());

    // The survivor's next use of the runtime gets a fresh application object.
    EXPECT_TRUE(survivor->CanUnload());
    EXPECT_EQ(fake.applicationsCreated(), 2);
    EXPECT_EQ(fake.liveApplications().size(), 1u);
}

TEST_F(EngineLifecycle, LogoffLogsOffWithTheLogonDataOnceAndOnlyWhenLoggedOn)
{
    auto engine = loggedOnEngine();
    engine->Logoff();
    EXPECT_TRUE(fake.calls(u"Application.logOff"_s).isEmpty()) << "never logged on";
    EXPECT_FALSE(engine::ExceptionFilterInstalled());

    ASSERT_TRUE(engine->LogOn());
    engine->Logoff();
    engine->Logoff();
    EXPECT_EQ(fake.calls(u"Application.logOff"_s),
        QStringList {
            uR"(Application.logOffServer("PDSOLEDB.DLL","srv","Shop","sa","Secr3t"))"_s });
    EXPECT_FALSE(engine::ExceptionFilterInstalled());

    // Logged off: the next logon goes to the server again.
    fake.clearLog();
    ASSERT_TRUE(engine->LogOn());
    EXPECT_EQ(fake.calls(u"Application.logOnServer"_s).size(), 1);
}

TEST_F(EngineLifecycle, CanUnloadAsksTheRuntimeUntilALogoffFailed)
{
    auto engine = loggedOnEngine();
    fake.setCanClose(false);
    EXPECT_FALSE(engine->CanUnload());
    engine->Logoff(); // not logged on: nothing fails
    EXPECT_FALSE(engine->CanUnload());

    ASSERT_TRUE(engine->LogOn());
    fake.failOn(u"Application.logOffServer"_s, runtimeError(RuntimeFailure));
    engine->Logoff();
    fake.clearLog();
    EXPECT_TRUE(engine->CanUnload());
    EXPECT_TRUE(fake.calls(u"Application.canClose"_s).isEmpty());
    EXPECT_FALSE(engine::ExceptionFilterInstalled());
}

TEST_F(EngineLifecycle, CrashInsideTheServerLogoffIsCaughtAndRemembered)
{
    auto engine = loggedOnEngine();
    ASSERT_TRUE(engine->LogOn());
    fake.setCanClose(false);
    // A page the process owns but may not touch: a real access fault that no sanitizer
    // reports first.
    const auto pageSize = static_cast<size_t>(sysconf(_SC_PAGESIZE));
    void* page = mmap(nullptr, pageSize, PROT_NONE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    ASSERT_NE(page, MAP_FAILED);
    fake.onCall(u"Application.logOffServer"_s, [page] { *static_cast<volatile int*>(page) = 1; });

    {
#ifdef __SANITIZE_ADDRESS__
        // The crash unwinds the fake's frames without destructors; what they held is lost
        // on purpose.
        __lsan::ScopedDisabler lostByTheCrash;
#endif
        engine->Logoff();
    }
    munmap(page, pageSize);

    EXPECT_TRUE(engine->CanUnload());
    EXPECT_FALSE(engine::ExceptionFilterInstalled());
}

TEST_F(EngineLifecycle, CanUnloadIsFalseWhenTheRuntimeCannotBeAsked)
{
    auto engine = makeEngine();
    fake.failOn(u"ApplicationFactory.create"_s, core::ComError(429, u"x"_s, u"no runtime"_s));
    EXPECT_FALSE(engine->CanUnload());
}

TEST_F(EngineLifecycle, EveryGetReportsGivesAnotherEmptyCollectionThatKeepsTheEngine)
{
    const int32_t before = engine::gEngineCount;
    auto engine = makeEngine();
    const std::weak_ptr<engine::MoxEngine115> weakEngine = engine;
    auto first = engine->GetReports();
    auto second = engine->GetReports();
    ASSERT_NE(first, nullptr);
    ASSERT_NE(second, nullptr);
    EXPECT_NE(first, second);
    first->Item(u"orders.rpt"_s);
    EXPECT_EQ(first->NewEnum().size(), 1u);
    EXPECT_TRUE(second->NewEnum().empty());
    EXPECT_EQ(second->GetEngine(), engine);

    // The host lets go of the engine; its collections keep it.
    engine.reset();
    first.reset();
    EXPECT_FALSE(weakEngine.expired());
    second.reset();
    EXPECT_TRUE(weakEngine.expired());
    EXPECT_EQ(engine::gEngineCount, before);
}

TEST_F(EngineLifecycle, EngineNotSharedGivesNoCollection)
{
    engine::MoxEngine115 engine;
    EXPECT_EQ(engine.GetReports(), nullptr);
}

} // namespace
} // namespace enginetest
