#pragma once

#include <QString>
#include <cstdint>
#include <functional>

namespace engine {

/// The crash guard. While the filter is installed, SIGSEGV, SIGFPE, SIGILL, SIGBUS and
/// SIGTRAP raised inside GuardedCall on this thread unwind to GuardedCall, which raises
/// ComError 0x8004029A with an empty source and the exception's name as description.
/// Outside a GuardedCall, on a thread without one, with no filter installed, or when the
/// signal was sent rather than raised by a fault (kill, raise), the signal gets the
/// disposition it had before InstallExceptionFilter.

/// Registers the signal handlers (run on an alternate stack, so a stack overflow is reported
/// too); installing twice re-registers once.
void InstallExceptionFilter();
/// Restores the previous handlers; does nothing when not installed.
void RemoveExceptionFilter();
bool ExceptionFilterInstalled();

/// Runs call; a guarded signal inside it becomes ComError 0x8004029A. Objects the call had
/// created on the stack when it faulted are abandoned without their destructors running.
void GuardedCall(const std::function<void()>& call);

/// The exception-code table: code to text, "" for codes not in it.
QString ExceptionName(uint32_t code);

/// The exception code for a signal and its si_code (SIGSEGV -> 0xC0000005 "Access
/// violation", SIGFPE/FPE_INTDIV -> 0xC0000094 "Integer Divide By Zero", ...).
uint32_t ExceptionCodeForSignal(int signal, int signalCode);

/// An exception record as the filter reads it: code, flags, the nested record (null when
/// none), the address and the parameters.
struct ExceptionRecord {
    uint32_t code = 0;
    uint32_t flags = 0;
    const ExceptionRecord* nested = nullptr;
    uintptr_t address = 0;
    uint32_t parameterCount = 0;
    uintptr_t parameters[15] = {};
};

/// Follows the nested-record chain to the innermost record. A chain that loops back on
/// itself ends at the record where the loop is noticed.
const ExceptionRecord& InnermostRecord(const ExceptionRecord& record);

/// What the filter does with an exception: raises ComError 0x8004029A with an empty source
/// and the name of the innermost record's code ("" for a code not in the table).
[[noreturn]] void ExceptionFilter(const ExceptionRecord& record);

} // namespace engine
