// Makes unhandled exceptions, which a crash handler sees, of the failures for which the C and C++ run-time libraries
// end a process by themselves: abort, std::terminate, a pure virtual call, an invalid parameter. Their codes stand in
// interfaces/crash_handler_api.h. A run-time library that is linked into a module serves that module alone, so the
// program installs its hooks itself; the crash handler library cannot do it from outside.
#pragma once

#include <cstdint>

// Puts the hooks in place. Called once, from the main thread. The terminate handler holds, with some run-time
// libraries, for the calling thread only; elsewhere std::terminate then ends in abort, which every thread has.
void InstallRuntimeFailureHooks();

// Takes away those hooks that nobody has replaced meanwhile.
void RemoveRuntimeFailureHooks();

// Hands an exception of this code to the process's unhandled-exception filter, not to any handler of the functions that
// are running, and ends the process with the code in any case. With a debugger attached, stops there first.
[[noreturn]] void FailUnhandled(uint32_t code);
