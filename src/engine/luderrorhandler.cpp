#include "engine/luderrorhandler.h"

#include "core/comerror.h"

#include <algorithm>
#include <array>
#include <atomic>
#include <csetjmp>
#include <csignal>
#include <cstdlib>
#include <memory>
#include <mutex>
#include <ucontext.h>
#include <unistd.h>

namespace engine {

namespace {

constexpr std::array<int, 5> kGuardedSignals { SIGSEGV, SIGFPE, SIGILL, SIGBUS, SIGTRAP };

// A fault this close to the interrupted stack pointer means the stack ran into its guard
// area: ordinary stack memory near the stack pointer is always mapped.
constexpr uintptr_t kStackOverflowReach = 64 * 1024;

constexpr uint32_t kStackOverflowCode = 0xC00000FD;
constexpr uint32_t kNonContinuable = 1;

// One active GuardedCall on one thread; nested calls form a chain through `outer`.
struct GuardFrame {
    sigjmp_buf jump;
    ExceptionRecord record;
    GuardFrame* outer = nullptr;
};

// Thread-local on purpose: a signal is only ever turned into an error on the thread whose
// GuardedCall caught it, so siglongjmp never crosses threads.
thread_local GuardFrame* tInnermostFrame = nullptr;

std::atomic<bool> gFilterInstalled { false };
std::mutex gInstallMutex;
// Written before our handlers are registered, read by the handler only while they are.
std::array<struct sigaction, kGuardedSignals.size()> gPreviousActions {};

size_t signalSlot(int signal)
{
    const auto* found = std::find(kGuardedSignals.begin(), kGuardedSignals.end(), signal);
    return static_cast<size_t>(found - kGuardedSignals.begin());
}

uintptr_t interruptedStackPointer(const void* context)
{
    const auto* uc = static_cast<const ucontext_t*>(context);
#if defined(__x86_64__)
    return static_cast<uintptr_t>(uc->uc_mcontext.gregs[REG_RSP]);
#elif defined(__aarch64__)
    return static_cast<uintptr_t>(uc->uc_mcontext.sp);
#else
    (void)uc;
    return 0;
#endif
}

bool isStackOverflow(const siginfo_t* info, const void* context)
{
    const uintptr_t stackPointer = interruptedStackPointer(context);
    if (stackPointer == 0)
        return false;
    const auto faultAddress = reinterpret_cast<uintptr_t>(info->si_addr);
    const uintptr_t distance
        = faultAddress > stackPointer ? faultAddress - stackPointer : stackPointer - faultAddress;
    return distance < kStackOverflowReach;
}

// Hands a signal we do not turn into an error to whatever handled it before us. The
// default action is restored and the signal raised again: it stays blocked until this
// handler returns, then ends the process as it would have without the guard.
void forwardToPrevious(int signal, siginfo_t* info, void* context)
{
    const struct sigaction& previous = gPreviousActions[signalSlot(signal)];
    if (previous.sa_flags & SA_SIGINFO) {
        if (previous.sa_sigaction) {
            previous.sa_sigaction(signal, info, context);
            return;
        }
    } else if (previous.sa_handler != SIG_DFL && previous.sa_handler != SIG_IGN) {
        previous.sa_handler(signal);
        return;
    }
    // A fault the kernel raised cannot be ignored: returning would only repeat the faulting
    // instruction, so an ignored fault ends the process as the kernel would end it.
    if (previous.sa_handler == SIG_IGN && info->si_code <= 0)
        return;
    struct sigaction defaultAction { };
    defaultAction.sa_handler = SIG_DFL;
    sigemptyset(&defaultAction.sa_mask);
    sigaction(signal, &defaultAction, nullptr);
    raise(signal);
}

void crashHandler(int signal, siginfo_t* info, void* context)
{
    GuardFrame* frame = tInnermostFrame;
    // Only a fault of the guarded code itself becomes an error: a signal sent by kill() or
    // another thread (si_code <= 0) arrives at an arbitrary point and is forwarded.
    if (frame == nullptr || info->si_code <= 0
        || !gFilterInstalled.load(std::memory_order_relaxed)) {
        forwardToPrevious(signal, info, context);
        return;
    }
    ExceptionRecord& record = frame->record;
    record = ExceptionRecord {};
    record.code = signal == SIGSEGV && isStackOverflow(info, context)
        ? kStackOverflowCode
        : ExceptionCodeForSignal(signal, info->si_code);
    record.flags = kNonContinuable;
    record.address = reinterpret_cast<uintptr_t>(info->si_addr);
    if (signal == SIGSEGV || signal == SIGBUS) {
        // The faulting data address, as an access violation carries it in its second slot.
        record.parameterCount = 2;
        record.parameters[1] = record.address;
    }
    siglongjmp(frame->jump, 1);
}

void registerHandlers()
{
    struct sigaction action { };
    action.sa_sigaction = crashHandler;
    action.sa_flags = SA_SIGINFO | SA_ONSTACK;
    sigemptyset(&action.sa_mask);
    for (size_t i = 0; i < kGuardedSignals.size(); ++i)
        sigaction(kGuardedSignals[i], nullptr, &gPreviousActions[i]);
    for (int signal : kGuardedSignals)
        sigaction(signal, &action, nullptr);
}

void restoreHandlers()
{
    for (size_t i = 0; i < kGuardedSignals.size(); ++i)
        sigaction(kGuardedSignals[i], &gPreviousActions[i], nullptr);
}

size_t alternateStackSize()
{
    const long systemSize = sysconf(_SC_SIGSTKSZ);
    return std::max<size_t>(64 * 1024, systemSize > 0 ? 4 * static_cast<size_t>(systemSize) : 0);
}

// Gives the thread an alternate signal stack for the duration of a GuardedCall, so that a
// stack overflow can still run the handler. A stack the thread already has is kept.
class AlternateStackScope {
public:
    AlternateStackScope()
    {
        stack_t current {};
        if (sigaltstack(nullptr, &current) != 0)
            return;
        const size_t size = alternateStackSize();
        if (!(current.ss_flags & SS_DISABLE) && current.ss_size >= size)
            return;
        if (!tStack)
            tStack = std::make_unique<char[]>(size);
        stack_t replacement {};
        replacement.ss_sp = tStack.get();
        replacement.ss_size = size;
        if (sigaltstack(&replacement, nullptr) == 0) {
            m_previous = current;
            m_replaced = true;
        }
    }
    ~AlternateStackScope()
    {
        if (m_replaced)
            sigaltstack(&m_previous, nullptr);
    }
    AlternateStackScope(const AlternateStackScope&) = delete;
    AlternateStackScope& operator=(const AlternateStackScope&) = delete;

private:
    static thread_local std::unique_ptr<char[]> tStack;
    stack_t m_previous {};
    bool m_replaced = false;
};

thread_local std::unique_ptr<char[]> AlternateStackScope::tStack;

class FrameScope {
public:
    explicit FrameScope(GuardFrame& frame)
        : m_frame(frame)
    {
        m_frame.outer = tInnermostFrame;
    }
    void activate() { tInnermostFrame = &m_frame; }
    ~FrameScope() { tInnermostFrame = m_frame.outer; }
    FrameScope(const FrameScope&) = delete;
    FrameScope& operator=(const FrameScope&) = delete;

private:
    GuardFrame& m_frame;
};

} // namespace

void InstallExceptionFilter()
{
    const std::lock_guard lock(gInstallMutex);
    // Installing again re-registers: the handlers saved as "previous" must never be our own,
    // or removing would leave the guard in place and forwarding would loop.
    if (gFilterInstalled.load())
        restoreHandlers();
    registerHandlers();
    gFilterInstalled.store(true);
}

void RemoveExceptionFilter()
{
    const std::lock_guard lock(gInstallMutex);
    if (!gFilterInstalled.load())
        return;
    restoreHandlers();
    gFilterInstalled.store(false);
}

bool ExceptionFilterInstalled()
{
    return gFilterInstalled.load();
}

void GuardedCall(const std::function<void()>& call)
{
    if (!gFilterInstalled.load()) {
        call();
        return;
    }
    const AlternateStackScope alternateStack;
    GuardFrame frame;
    FrameScope scope(frame);
    // Whatever the guarded call had built when it faulted is abandoned without destructors:
    // the fault left it in an unknown state, and the caller only learns that it failed.
    if (sigsetjmp(frame.jump, 1) == 0) {
        scope.activate();
        call();
        return;
    }
    ExceptionFilter(frame.record);
}

void ExceptionFilter(const ExceptionRecord& record)
{
    throw core::ComError(
        core::ErrorNumber::GuardedCrash, QString(), ExceptionName(InnermostRecord(record).code));
}

QString ExceptionName(uint32_t code)
{
    switch (code) {
    case 0x80000001:
        return QStringLiteral("Guard Page Violation");
    case 0x80000002:
        return QStringLiteral("Datatype misalignment");
    case 0x80000003:
        return QStringLiteral("Breakpoint");
    case 0x80000004:
        return QStringLiteral("Single step");
    case 0xC0000005:
        return QStringLiteral("Access violation");
    case 0xC0000006:
        return QStringLiteral("In Page Error");
    case 0xC0000008:
        return QStringLiteral("Invalid Handle");
    case 0xC000001D:
        return QStringLiteral("Illegal Instruction");
    case 0xC0000025:
        return QStringLiteral("Non Continuable Exception");
    case 0xC0000026:
        return QStringLiteral("Invalid Disposition");
    case 0xC000008C:
        return QStringLiteral("Array bounds exceeded");
    case 0xC000008D:
        return QStringLiteral("Float Denormal Operand");
    case 0xC000008E:
        return QStringLiteral("Divide By Zero");
    case 0xC000008F:
        return QStringLiteral("Floating Point Inexact Result");
    case 0xC0000090:
        return QStringLiteral("Invalid Operation");
    case 0xC0000091:
        return QStringLiteral("Float Overflow");
    case 0xC0000092:
        return QStringLiteral("Float Stack Check");
    case 0xC0000093:
        return QStringLiteral("Float Underflow");
    case 0xC0000094:
        return QStringLiteral("Integer Divide By Zero");
    case 0xC0000095:
        return QStringLiteral("Integer Overflow");
    case 0xC0000096:
        return QStringLiteral("Privileged Instruction");
    case 0xC00000FD:
        return QStringLiteral("Stack Overflow");
    case 0xC000013A:
        return QStringLiteral("Control-C Exit");
    default:
        return QString();
    }
}

uint32_t ExceptionCodeForSignal(int signal, int signalCode)
{
    switch (signal) {
    case SIGSEGV:
        return 0xC0000005;
    case SIGBUS:
        return signalCode == BUS_ADRALN ? 0x80000002 : 0xC0000006;
    case SIGFPE:
        switch (signalCode) {
        case FPE_INTDIV:
            return 0xC0000094;
        case FPE_INTOVF:
            return 0xC0000095;
        case FPE_FLTDIV:
            return 0xC000008E;
        case FPE_FLTOVF:
            return 0xC0000091;
        case FPE_FLTUND:
            return 0xC0000093;
        case FPE_FLTRES:
            return 0xC000008F;
        case FPE_FLTSUB:
            // A subscript out of range is what the array-bounds exception reports.
            return 0xC000008C;
        default:
            // FPE_FLTINV and codes of newer kernels: an invalid floating-point operation.
            return 0xC0000090;
        }
    case SIGILL:
        return signalCode == ILL_PRVOPC || signalCode == ILL_PRVREG ? 0xC0000096 : 0xC000001D;
    case SIGTRAP:
        // x86 reports int3 as SI_KERNEL rather than TRAP_BRKPT; it is still a breakpoint.
        return signalCode == TRAP_TRACE ? 0x80000004 : 0x80000003;
    default:
        return 0;
    }
}

const ExceptionRecord& InnermostRecord(const ExceptionRecord& record)
{
    // The slow pointer moves every second step, so a chain that loops back on itself (a
    // corrupted record) ends the walk instead of hanging the handler.
    const ExceptionRecord* current = &record;
    const ExceptionRecord* slow = &record;
    bool moveSlow = false;
    while (current->nested != nullptr) {
        current = current->nested;
        if (moveSlow)
            slow = slow->nested;
        moveSlow = !moveSlow;
        if (current == slow)
            break;
    }
    return *current;
}

} // namespace engine
