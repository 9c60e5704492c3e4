// The C interface of the crash handler library, `qxch.dll`. The program loads it first thing and keeps it loaded until
// it ends; from EnableCrashHandler on the library sees every unhandled exception of the process.
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

// Installs the handler for the calling process. The arguments are reserved and passed as zero. 0 on success, otherwise
// an error number of the library's own. Called once, from the main thread.
ST_CRASH_HANDLER_API int32_t EnableCrashHandler(uint32_t reserved, const void* reservedOptions, void* reservedContext);

#ifdef __cplusplus
}
#endif
