// The exported functions: each finds the logger, does its job there and lets nothing escape.
#include <atomic>
#include <cstdarg>
#include <memory>
#include <mutex>
#include <new>
#include <shared_mutex>

#include "companions/log/logger.h"
#include "core/lock.h"
#include "core/text.h"
#include "interfaces/log_api.h"

namespace {

using logfile::Logger;
using logfile::Settings;

// Shared while any function is at work, exclusive while the logger comes and goes.
SharedLock g_lifetime;
std::unique_ptr<Logger> g_logger;  // guarded by g_lifetime

// One LogInit or LogDeinit at a time; taken before g_lifetime.
SharedLock g_initialising;
unsigned g_references = 0;  // guarded by g_initialising

std::atomic<uint32_t> g_wanted{0};

// Runs `job(logger)`, which returns a Windows error number. ERROR_NOT_READY before LogInit and after LogDeinit.
template <class Job>
int32_t WithLogger(Job job) noexcept {
  try {
    const std::shared_lock lock(g_lifetime);
    if (!g_logger) return ERROR_NOT_READY;
    return static_cast<int32_t>(job(*g_logger));
  } catch (const std::bad_alloc&) {
    return ERROR_NOT_ENOUGH_MEMORY;
  } catch (...) {
    return ERROR_INTERNAL_ERROR;
  }
}

template <class Change>
int32_t ChangeSettings(Change change) noexcept {
  return WithLogger([&change](Logger& logger) {
    logger.ChangeSettings(change);
    return ERROR_SUCCESS;
  });
}

bool IsText(const wchar_t* text) {
  return text != nullptr && *text != L'\0';
}

}  // namespace

int32_t LogInit() {
  try {
    const std::lock_guard initialising(g_initialising);
    if (g_references == 0) {
      auto logger = std::make_unique<Logger>(g_wanted);
      const std::lock_guard lock(g_lifetime);
      g_logger = std::move(logger);
    }
    ++g_references;
    return ERROR_SUCCESS;
  } catch (const std::bad_alloc&) {
    return ERROR_NOT_ENOUGH_MEMORY;
  }
}

int32_t LogDeinit() {
  const std::lock_guard initialising(g_initialising);
  if (g_references == 0) return ERROR_NOT_READY;
  if (--g_references > 0) return ERROR_SUCCESS;
  std::unique_ptr<Logger> last;
  {
    const std::lock_guard lock(g_lifetime);
    last = std::move(g_logger);
  }
  // Nobody is inside the logger any more. Its watcher is waited for without g_lifetime: the end of a thread needs the
  // loader's lock, and who holds that may be waiting to write a line.
  int32_t error = ERROR_SUCCESS;
  try {
    last->Finish();
  } catch (const std::bad_alloc&) {
    error = ERROR_NOT_ENOUGH_MEMORY;
  }
  last.reset();
  g_wanted = 0;
  return error;
}

int32_t LogSetSettingsFile(const wchar_t* path) {
  if (!IsText(path)) return ERROR_INVALID_PARAMETER;
  return WithLogger([path](Logger& logger) { return logger.SetSettingsFile(path); });
}

int32_t LogApplySettings() {
  return WithLogger([](Logger& logger) { return logger.ApplySettingsFile(); });
}

int32_t LogMonitorSettings(int32_t on) {
  return WithLogger([on](Logger& logger) { return logger.MonitorSettings(on != 0); });
}

int32_t LogEnable(int32_t on) {
  return ChangeSettings([on](Settings& settings) { settings.enabled = on != 0; });
}

int32_t LogSetLevel(uint32_t mask) {
  if ((mask & ~uint32_t{LOG_LEVEL_ALL}) != 0) return ERROR_INVALID_PARAMETER;
  return ChangeSettings([mask](Settings& settings) { settings.levels = mask; });
}

int32_t LogSetPath(const wchar_t* folder) {
  if (!IsText(folder)) return ERROR_INVALID_PARAMETER;
  return ChangeSettings([folder](Settings& settings) { settings.folder = ToUtf8(folder); });
}

int32_t LogSetType(uint32_t type) {
  if ((type & ~uint32_t{LOG_TYPE_FILE | LOG_TYPE_DEBUGGER}) != 0) return ERROR_INVALID_PARAMETER;
  return ChangeSettings([type](Settings& settings) { settings.types = type; });
}

int32_t LogSetMode(uint32_t mode) {
  if (mode > LOG_MODE_OVERWRITE) return ERROR_INVALID_PARAMETER;
  return ChangeSettings([mode](Settings& settings) { settings.mode = mode; });
}

int32_t LogSetMaxSize(uint64_t bytes) {
  return ChangeSettings([bytes](Settings& settings) { settings.maxBytes = bytes; });
}

int32_t LogSetDepth(uint32_t depth) {
  if (depth > LOG_DEPTH_MODULE) return ERROR_INVALID_PARAMETER;
  return ChangeSettings([depth](Settings& settings) { settings.depth = depth; });
}

uint32_t LogGetLevel() {
  uint32_t mask = 0;
  WithLogger([&mask](const Logger& logger) {
    mask = logger.Levels();
    return ERROR_SUCCESS;
  });
  return mask;
}

int32_t LogIsEnabled() {
  return g_wanted.load(std::memory_order_relaxed) != 0 ? 1 : 0;
}

void LogWrite(int16_t step, const LogRecord* record, HMODULE module, const wchar_t* function, const wchar_t* format,
              ...) {
  const DWORD error = GetLastError();  // a line that is written between a failure and its handling must not disturb it
  va_list arguments;
  va_start(arguments, format);
  WithLogger([&](Logger& logger) {
    logger.Write(step, record == nullptr ? uint32_t{LOG_LEVEL_TRACE} : record->level, module, function, format,
                 arguments);
    return ERROR_SUCCESS;
  });
  va_end(arguments);
  SetLastError(error);
}

int32_t LogTrackEvent(const wchar_t* category, const wchar_t* name) {
  if (category == nullptr || name == nullptr) return ERROR_INVALID_PARAMETER;
  return WithLogger([category, name](Logger& logger) {
    logger.TrackEvent(category, name, nullptr);
    return ERROR_SUCCESS;
  });
}

int32_t LogTrackEventData(const wchar_t* category, const wchar_t* name, const wchar_t* data) {
  if (category == nullptr || name == nullptr || data == nullptr) return ERROR_INVALID_PARAMETER;
  return WithLogger([category, name, data](Logger& logger) {
    logger.TrackEvent(category, name, data);
    return ERROR_SUCCESS;
  });
}

int32_t LogUninitDeskMetrics() {
  return WithLogger([](Logger& logger) {
    logger.WriteEventCounts();
    return ERROR_SUCCESS;
  });
}

int32_t LogRemoveModule(HMODULE module) {
  return WithLogger([module](Logger& logger) {
    logger.RemoveModule(module);
    return ERROR_SUCCESS;
  });
}
