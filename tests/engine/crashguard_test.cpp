#include "core/comerror.h"
#include "engine/luderrorhandler.h"

#include <csignal>
#include <exception>
#include <functional>
#include <gtest/gtest.h>
#include <stdexcept>
#include <sys/mman.h>
#include <thread>
#include <unistd.h>

using namespace Qt::StringLiterals;

namespace {

constexpr int32_t kGuardedCrash = static_cast<int32_t>(0x8004029A);

// The faults below are deliberate. The sanitizers would report the division and the null
// write themselves before the processor faults, so they are told to look away.

__attribute__((noinline, no_sanitize("undefined"))) void writeThroughNull()
{
    volatile int* volatile target = nullptr;
    *target = 1;
}

__attribute__((noinline, no_sanitize("undefined"))) int divideIntegers(int dividend, int divisor)
{
    volatile int a = dividend;
    volatile int b = divisor;
    return a / b;
}

// A page the process owns but may not touch: the fault is an access error, not a missing
// mapping, and no sanitizer considers the address invalid.
class ProtectedPage {
public:
    ProtectedPage()
        : m_size(static_cast<size_t>(sysconf(_SC_PAGESIZE)))
        , m_page(mmap(nullptr, m_size, PROT_NONE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0))
    { }
    ~ProtectedPage() { munmap(m_page, m_size); }
    ProtectedPage(const ProtectedPage&) = delete;
    ProtectedPage& operator=(const ProtectedPage&) = delete;

    void write() const { *static_cast<volatile int*>(m_page) = 1; }

private:
    size_t m_size;
    void* m_page;
};

volatile bool gStopRecursion = false;

// The frame's address is handed down, so the compiler cannot turn the recursion into a loop.
__attribute__((noinline)) int recurseForever(volatile char* parent)
{
    volatile char frame[512];
    frame[0] = static_cast<char>(parent ? parent[0] + 1 : 0);
    if (gStopRecursion)
        return frame[0];
    return recurseForever(frame) + frame[1];
}

struct CrashOutcome {
    bool raised = false;
    int32_t number = 0;
    QString source;
    QString description;
};

CrashOutcome runGuarded(const std::function<void()>& call)
{
    CrashOutcome outcome;
    try {
        engine::GuardedCall(call);
    } catch (const core::ComError& error) {
        outcome.raised = true;
        outcome.number = error.number();
        outcome.source = error.source();
        outcome.description = error.description();
    }
    return outcome;
}

bool sameDisposition(const struct sigaction& a, const struct sigaction& b)
{
    if ((a.sa_flags & SA_SIGINFO) != (b.sa_flags & SA_SIGINFO))
        return false;
    return (a.sa_flags & SA_SIGINFO) ? a.sa_sigaction == b.sa_sigaction
                                     : a.sa_handler == b.sa_handler;
}

struct sigaction currentDisposition(int signal)
{
    struct sigaction action { };
    sigaction(signal, nullptr, &action);
    return action;
}

class CrashGuard : public ::testing::Test {
protected:
    static void SetUpTestSuite()
    {
        // Death tests below start threads; the threadsafe style re-runs the binary instead of
        // forking a process that holds other threads' locks.
        GTEST_FLAG_SET(death_test_style, "threadsafe");
    }
    void TearDown() override { engine::RemoveExceptionFilter(); }
};

struct FaultRow {
    const char* name;
    std::function<void()> fault;
    const char* description;
};

TEST_F(CrashGuard, RealFaultsBecomeTheGuardedCrashErrorAndTheProcessGoesOn)
{
    const ProtectedPage page;
    const std::vector<FaultRow> rows
    {
        { "null write", writeThroughNull, "Access violation" },
            { "write to a protected page", [&page] { page.write(); }, "Access violation" },
            { "integer division by zero", [] { divideIntegers(7, 0); }, "Integer Divide By Zero" },
            { "stack overflow", [] { recurseForever(nullptr); }, "Stack Overflow" },
#if defined(__x86_64__)
            { "undefined instruction", [] { __builtin_trap(); }, "Illegal Instruction" },
            { "breakpoint instruction", [] { asm volatile("int3"); }, "Breakpoint" },
#endif
    };
    engine::InstallExceptionFilter();
    // Each fault several times in a row: the guard must be intact after unwinding, with the
    // signal unblocked again and the alternate stack reusable.
    for (int round = 0; round < 3; ++round) {
        for (const FaultRow& row : rows) {
            SCOPED_TRACE(testing::Message() << row.name << ", round " << round);
            const CrashOutcome outcome = runGuarded(row.fault);
            ASSERT_TRUE(outcome.raised);
            EXPECT_EQ(outcome.number, kGuardedCrash);
            EXPECT_TRUE(outcome.source.isEmpty());
            EXPECT_EQ(outcome.description, QString::fromLatin1(row.description));
        }
    }
}

TEST_F(CrashGuard, GuardedCallPassesResultsAndOrdinaryExceptionsThrough)
{
    engine::InstallExceptionFilter();
    int result = 0;
    engine::GuardedCall([&result] { result = divideIntegers(42, 6); });
    EXPECT_EQ(result, 7);
    EXPECT_THROW(
        engine::GuardedCall([] { throw std::runtime_error("not a crash"); }), std::runtime_error);
    // The exception must have taken its guard frame with it: the next fault is still caught
    // by a guard that is alive, not by the one the exception left.
    EXPECT_EQ(runGuarded(writeThroughNull).description, u"Access violation"_s);
}

TEST_F(CrashGuard, NestedGuardsEachCatchTheirOwnFault)
{
    engine::InstallExceptionFilter();
    CrashOutcome inner;
    const CrashOutcome outer = runGuarded([&inner] {
        inner = runGuarded([] { divideIntegers(1, 0); });
        writeThroughNull();
    });
    EXPECT_EQ(inner.description, u"Integer Divide By Zero"_s);
    EXPECT_EQ(outer.description, u"Access violation"_s);
}

TEST_F(CrashGuard, FaultOnAnotherThreadIsCaughtByThatThreadsGuard)
{
    engine::InstallExceptionFilter();
    CrashOutcome outcome;
    std::thread worker([&outcome] { outcome = runGuarded([] { recurseForever(nullptr); }); });
    worker.join();
    EXPECT_EQ(outcome.number, kGuardedCrash);
    EXPECT_EQ(outcome.description, u"Stack Overflow"_s);
}

TEST_F(CrashGuard, InstallingTwiceLeavesOneRegistrationThatRemoveUndoes)
{
    const struct sigaction before = currentDisposition(SIGSEGV);
    engine::InstallExceptionFilter();
    const struct sigaction installed = currentDisposition(SIGSEGV);
    engine::InstallExceptionFilter();
    EXPECT_TRUE(engine::ExceptionFilterInstalled());
    EXPECT_TRUE(sameDisposition(currentDisposition(SIGSEGV), installed));
    engine::RemoveExceptionFilter();
    EXPECT_FALSE(engine::ExceptionFilterInstalled());
    for (int signal : { SIGSEGV, SIGFPE, SIGILL, SIGBUS, SIGTRAP })
        EXPECT_FALSE(sameDisposition(currentDisposition(signal), installed)) << signal;
    EXPECT_TRUE(sameDisposition(currentDisposition(SIGSEGV), before));
    engine::RemoveExceptionFilter();
    EXPECT_FALSE(engine::ExceptionFilterInstalled());
}

// The former disposition of SIGSEGV is the default action, or AddressSanitizer's report in
// the sanitizer build; either way the process must end because of the SIGSEGV.
#if defined(__SANITIZE_ADDRESS__)
#define EXPECT_ENDS_WITH_SEGV(statement) EXPECT_DEATH(statement, "SEGV")
#else
#define EXPECT_ENDS_WITH_SEGV(statement)                                                           \
    EXPECT_EXIT(statement, ::testing::KilledBySignal(SIGSEGV), "")
#endif

TEST_F(CrashGuard, SignalsTheGuardDoesNotOwnKeepTheirFormerDisposition)
{
    EXPECT_ENDS_WITH_SEGV({
        engine::InstallExceptionFilter();
        engine::InstallExceptionFilter();
        engine::RemoveExceptionFilter();
        writeThroughNull();
    }) << "a fault after removing the filter";
    EXPECT_ENDS_WITH_SEGV({
        engine::InstallExceptionFilter();
        engine::RemoveExceptionFilter();
        engine::GuardedCall(writeThroughNull);
    }) << "a guarded call while no filter is installed";
    EXPECT_ENDS_WITH_SEGV({
        engine::InstallExceptionFilter();
        writeThroughNull();
    }) << "a fault outside any guarded call";
    EXPECT_ENDS_WITH_SEGV({
        engine::InstallExceptionFilter();
        engine::GuardedCall([] { std::thread(writeThroughNull).join(); });
    }) << "a fault on a thread without a guard while another thread is guarded";
    EXPECT_ENDS_WITH_SEGV({
        engine::InstallExceptionFilter();
        engine::GuardedCall([] { raise(SIGSEGV); });
    }) << "a signal sent rather than raised by a fault";
}

TEST(ExceptionCodes, SignalsMapToTheExceptionTable)
{
    struct Row {
        const char* name;
        int signal;
        int signalCode;
        uint32_t code;
        const char* description;
    };
    const Row rows[] = {
        { "unmapped address", SIGSEGV, SEGV_MAPERR, 0xC0000005, "Access violation" },
        { "protected address", SIGSEGV, SEGV_ACCERR, 0xC0000005, "Access violation" },
        { "misaligned access", SIGBUS, BUS_ADRALN, 0x80000002, "Datatype misalignment" },
        { "missing file page", SIGBUS, BUS_ADRERR, 0xC0000006, "In Page Error" },
        { "integer division", SIGFPE, FPE_INTDIV, 0xC0000094, "Integer Divide By Zero" },
        { "integer overflow", SIGFPE, FPE_INTOVF, 0xC0000095, "Integer Overflow" },
        // The float division has its own, shorter text; the two are easily swapped.
        { "float division", SIGFPE, FPE_FLTDIV, 0xC000008E, "Divide By Zero" },
        { "float overflow", SIGFPE, FPE_FLTOVF, 0xC0000091, "Float Overflow" },
        { "float underflow", SIGFPE, FPE_FLTUND, 0xC0000093, "Float Underflow" },
        { "float inexact", SIGFPE, FPE_FLTRES, 0xC000008F, "Floating Point Inexact Result" },
        { "float invalid", SIGFPE, FPE_FLTINV, 0xC0000090, "Invalid Operation" },
        { "float subscript", SIGFPE, FPE_FLTSUB, 0xC000008C, "Array bounds exceeded" },
        { "privileged opcode", SIGILL, ILL_PRVOPC, 0xC0000096, "Privileged Instruction" },
        { "privileged register", SIGILL, ILL_PRVREG, 0xC0000096, "Privileged Instruction" },
        { "illegal opcode", SIGILL, ILL_ILLOPC, 0xC000001D, "Illegal Instruction" },
        { "breakpoint", SIGTRAP, TRAP_BRKPT, 0x80000003, "Breakpoint" },
        { "x86 int3", SIGTRAP, SI_KERNEL, 0x80000003, "Breakpoint" },
        { "single step", SIGTRAP, TRAP_TRACE, 0x80000004, "Single step" },
        { "unguarded signal", SIGTERM, 0, 0, "" },
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(row.name);
        const uint32_t code = engine::ExceptionCodeForSignal(row.signal, row.signalCode);
        EXPECT_EQ(code, row.code);
        EXPECT_EQ(engine::ExceptionName(code), QString::fromLatin1(row.description));
    }
}

TEST(ExceptionCodes, CodesWithoutASignalStillHaveTheirNames)
{
    EXPECT_EQ(engine::ExceptionName(0x80000001), u"Guard Page Violation"_s);
    EXPECT_EQ(engine::ExceptionName(0xC00000FD), u"Stack Overflow"_s);
    EXPECT_EQ(engine::ExceptionName(0xC000013A), u"Control-C Exit"_s);
    EXPECT_EQ(engine::ExceptionName(0xC0000097), QString());
    EXPECT_EQ(engine::ExceptionName(0), QString());
}

CrashOutcome filterOutcome(const engine::ExceptionRecord& record)
{
    return runGuarded([&record] { engine::ExceptionFilter(record); });
}

TEST(ExceptionFilter, NamesTheInnermostNestedRecord)
{
    engine::ExceptionRecord innermost;
    innermost.code = 0xC0000094;
    engine::ExceptionRecord middle;
    middle.code = 0xC0000005;
    middle.nested = &innermost;
    engine::ExceptionRecord outer;
    outer.code = 0x80000003;
    outer.nested = &middle;

    const CrashOutcome outcome = filterOutcome(outer);
    EXPECT_EQ(outcome.number, kGuardedCrash);
    EXPECT_TRUE(outcome.source.isEmpty());
    EXPECT_EQ(outcome.description, u"Integer Divide By Zero"_s);
}

TEST(ExceptionFilter, UnknownInnermostCodeGivesAnEmptyDescription)
{
    engine::ExceptionRecord innermost;
    innermost.code = 0xE06D7363;
    engine::ExceptionRecord outer;
    outer.code = 0xC0000005;
    outer.nested = &innermost;

    const CrashOutcome outcome = filterOutcome(outer);
    EXPECT_TRUE(outcome.raised);
    EXPECT_EQ(outcome.number, kGuardedCrash);
    EXPECT_TRUE(outcome.description.isEmpty());
}

TEST(ExceptionFilter, ALoopingChainEndsTheWalk)
{
    engine::ExceptionRecord first;
    first.code = 0xC0000005;
    engine::ExceptionRecord second;
    second.code = 0xC0000094;
    first.nested = &second;
    second.nested = &first;
    const engine::ExceptionRecord& found = engine::InnermostRecord(first);
    EXPECT_TRUE(&found == &first || &found == &second);

    engine::ExceptionRecord selfNested;
    selfNested.nested = &selfNested;
    EXPECT_EQ(&engine::InnermostRecord(selfNested), &selfNested);
}

} // namespace
