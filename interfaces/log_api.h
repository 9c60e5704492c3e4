// The C interface of the logging library, `log.dll`. The library writes log files; which ones, where and how much of
// them is said by its settings, an XML file (docs/log.md). Any thread may call any function at any time between
// LogInit and LogDeinit; the library serialises writes itself. Strings are UTF-16 and zero-terminated and are copied
// before a function returns. Unless said otherwise a function returns 0 on success and a Windows error number
// otherwise.
#pragma once

#include <windows.h>

#include <stdint.h>

#include "interfaces/log_constants.h"

#ifdef __cplusplus
extern "C" {
#endif

#ifdef ST_LOG_EXPORTS
#define ST_LOG_API __declspec(dllexport)
#else
#define ST_LOG_API
#endif

// What is known of a line besides its text. Later versions may add fields behind `level`.
typedef struct LogRecord {
  uint32_t level;
} LogRecord;

// Prepares the library for this process, with its default settings; counts its calls. LogDeinit undoes one call; the
// last one ends the watching of the settings and closes the files, after which the library may be freed. Neither may be
// called from DllMain. Before the first LogInit and after the last LogDeinit every other function does nothing.
ST_LOG_API int32_t LogInit(void);
ST_LOG_API int32_t LogDeinit(void);

// Names the settings file; reads nothing. LogApplySettings reads it and puts it to use, keeping the settings in force
// when the file cannot be read. LogMonitorSettings(non-zero) applies it anew whenever it changes; zero ends that.
ST_LOG_API int32_t LogSetSettingsFile(const wchar_t* path);
ST_LOG_API int32_t LogApplySettings(void);
ST_LOG_API int32_t LogMonitorSettings(int32_t on);

// One setting each, until the settings file is applied again.
ST_LOG_API int32_t LogEnable(int32_t on);
ST_LOG_API int32_t LogSetLevel(uint32_t mask);
ST_LOG_API int32_t LogSetPath(const wchar_t* folder);
ST_LOG_API int32_t LogSetType(uint32_t type);
ST_LOG_API int32_t LogSetMode(uint32_t mode);
ST_LOG_API int32_t LogSetMaxSize(uint64_t bytes);  // of one file; 0: no limit
ST_LOG_API int32_t LogSetDepth(uint32_t depth);

ST_LOG_API uint32_t LogGetLevel(void);  // the mask in force
ST_LOG_API int32_t LogIsEnabled(void);  // 1 or 0; one atomic read

// Writes one line; no argument may make it fail (without a record the line is a trace line). `step` is +1 for a scope
// entry, -1 for a scope exit, 0 otherwise, and indents the calling thread's lines. `format` has Microsoft's meaning: %s
// is wide, %S narrow. When the call returns, the line has been handed to the system: it is in the file even if the
// process is killed right after.
ST_LOG_API void LogWrite(int16_t step, const LogRecord* record, HMODULE module, const wchar_t* function,
                         const wchar_t* format, ...);

// Counts a named event; the counts are written as info lines by LogUninitDeskMetrics and LogDeinit. The second form
// also writes `data` as an info line at once.
ST_LOG_API int32_t LogTrackEvent(const wchar_t* category, const wchar_t* name);
ST_LOG_API int32_t LogTrackEventData(const wchar_t* category, const wchar_t* name, const wchar_t* data);
ST_LOG_API int32_t LogUninitDeskMetrics(void);

// Forgets what is kept for a module that is about to be unloaded (its name, its open file).
ST_LOG_API int32_t LogRemoveModule(HMODULE module);

#ifdef __cplusplus
}
#endif
