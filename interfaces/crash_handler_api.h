// The C interface of the crash handler library, `qxch.dll`. The program loads it first thing and keeps it loaded until
// it ends; from EnableCrashHandler on an unhandled exception in any thread leaves a minidump and ends the process with
// the exception's code. Freeing the library ends that.
#pragma once

#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

#ifdef ST_CRASH_HANDLER_EXPORTS
#define ST_CRASH_HANDLER_API __declspec(dllexport)
#else
#define ST_CRASH_HANDLER_API
#endif

// Codes of the failures that the run-time libraries end a process for and that are no exceptions of the system. A
// program raises them by core/runtime_failures.h; they are the exit code and stand in the dump's exception record.
#define CRASH_CODE_ABORT 0xE0535401u      // abort()
#define CRASH_CODE_TERMINATE 0xE0535402u  // std::terminate, an uncaught C++ exception of a GCC build among others
#define CRASH_CODE_PURE_CALL 0xE0535403u  // a pure virtual function was called
#define CRASH_CODE_INVALID_PARAMETER 0xE0535404u  // a C run-time function was given a parameter that it does not take

// Installs the handler for the calling process. The arguments are reserved and passed as zero. 0 on success, otherwise
// a Windows error number. A second call does nothing and returns 0. Not to be called from DllMain.
ST_CRASH_HANDLER_API int32_t EnableCrashHandler(uint32_t reserved, const void* reservedOptions, void* reservedContext);

#ifdef __cplusplus
}
#endif
