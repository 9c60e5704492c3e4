// The program's side of logging: binds `log.dll`, which lies in the program's folder, and is the one way to write a log
// line. Without the library logging is simply off. Any thread may log, at any time.
//
//   LOG_ERROR(L"st::CollectData", L"submission to tessaro failed");
//   LOG_INFO(kScope, L"Creating zip archive %s", path.c_str());
//
// The first argument is the fully qualified name of the calling function; formats have Microsoft's meaning (%s wide, %S
// narrow). Arguments of a line are not evaluated while logging is off.
#pragma once

#include <atomic>
#include <cstdint>
#include <memory>
#include <mutex>
#include <string>
#include <type_traits>
#include <vector>

#include "core/dynamic_library.h"
#include "interfaces/log_api.h"

namespace logging {

enum class Level : uint32_t {
  kFatal = LOG_LEVEL_FATAL,
  kCritical = LOG_LEVEL_CRITICAL,
  kError = LOG_LEVEL_ERROR,
  kWarning = LOG_LEVEL_WARNING,
  kInfo = LOG_LEVEL_INFO,
  kTrace = LOG_LEVEL_TRACE,
};

// The bound library. One instance for the process, made on first use, shared by reference count; the last reference to
// go calls LogDeinit and frees the library, and the next one binds it anew.
class CLogDLL {
 public:
  // Adds a reference. The facade is always there; ask IsBound whether a library stands behind it.
  static std::shared_ptr<CLogDLL> Get();

  CLogDLL();
  ~CLogDLL();
  CLogDLL(const CLogDLL&) = delete;
  CLogDLL& operator=(const CLogDLL&) = delete;

  bool IsBound() const { return m_write != nullptr; }

  // Both do nothing when the library, or that export of it, is missing.
  void ApplySettingsFile(const wchar_t* path) const;
  void MonitorSettings() const;

 private:
  friend bool IsEnabled();
  friend class Route;

  DynamicLibrary m_library;
  // The entry points, in the order in which they are resolved.
  decltype(&LogInit) m_init = nullptr;
  decltype(&LogApplySettings) m_applySettings = nullptr;
  decltype(&LogSetSettingsFile) m_setSettingsFile = nullptr;
  decltype(&LogEnable) m_enable = nullptr;
  decltype(&LogSetLevel) m_setLevel = nullptr;
  decltype(&LogSetPath) m_setPath = nullptr;
  decltype(&LogSetType) m_setType = nullptr;
  decltype(&LogSetMode) m_setMode = nullptr;
  decltype(&LogSetMaxSize) m_setMaxSize = nullptr;
  decltype(&LogSetDepth) m_setDepth = nullptr;
  decltype(&LogWrite) m_write = nullptr;
  decltype(&LogIsEnabled) m_isEnabled = nullptr;
  decltype(&LogMonitorSettings) m_monitorSettings = nullptr;
  decltype(&LogGetLevel) m_getLevel = nullptr;
  decltype(&LogUninitDeskMetrics) m_uninitDeskMetrics = nullptr;
  decltype(&LogTrackEvent) m_trackEvent = nullptr;
  decltype(&LogTrackEventData) m_trackEventData = nullptr;
  decltype(&LogRemoveModule) m_removeModule = nullptr;
};

// True when a line would go anywhere: the library is bound and enabled, or an ErrorCapture listens.
bool IsEnabled();

// While one lives, the formatted text of every line of the whole process that is at least as grave as `least` is kept
// as well as written, also when no library is bound. Captures nest: each gets every line. They are destroyed in the
// reverse order of their making.
class ErrorCapture {
 public:
  enum class Keep { kFirst, kLast };  // the first kMostLines lines, or only the last one

  explicit ErrorCapture(Level least = Level::kError, Keep keep = Keep::kFirst);
  ~ErrorCapture();
  ErrorCapture(const ErrorCapture&) = delete;
  ErrorCapture& operator=(const ErrorCapture&) = delete;

  // The lines since construction or the last call, oldest first: "<function>: <text>". At most kMostLines are kept
  // between two calls; one more line then says how many were dropped.
  std::vector<std::wstring> Take();

  static constexpr size_t kMostLines = 200;

 private:
  friend class Route;
  bool Wants(Level level) const { return static_cast<uint32_t>(level) <= static_cast<uint32_t>(m_least); }
  void Add(const std::wstring& line);

  const Level m_least;
  const Keep m_keep;
  ErrorCapture* m_outer = nullptr;  // fixed once this one listens
  std::mutex m_mutex;
  std::vector<std::wstring> m_lines;
  size_t m_dropped = 0;
};

// While one lives, no capture keeps what its thread logs once `isClosed` is set: the lines of a thread that was left
// behind do not belong to those who are captured now. They are written to the log all the same. One for each thread;
// made and destroyed on it.
class CaptureGate {
 public:
  explicit CaptureGate(const std::atomic<bool>& isClosed);
  ~CaptureGate();
  CaptureGate(const CaptureGate&) = delete;
  CaptureGate& operator=(const CaptureGate&) = delete;
};

// Where one line goes. While it lives neither the library nor the capture can go away.
class Route {
 public:
  explicit Route(Level level);
  ~Route();
  Route(const Route&) = delete;
  Route& operator=(const Route&) = delete;

  decltype(&LogWrite) LibraryWrite() const;  // null when no library is bound
  bool Captures() const { return m_captures; }
  void Capture(const wchar_t* function, const wchar_t* format, ...) const noexcept;

 private:
  Level m_level;
  bool m_captures = false;
};

// A log argument as it passes through an ellipsis. A scoped enumeration is not promoted there as an integer is.
template <class Argument>
auto Promoted(Argument argument) {
  if constexpr (std::is_enum_v<Argument>) {
    return +static_cast<std::underlying_type_t<Argument>>(argument);
  } else {
    return argument;
  }
}

// Writes one line, whatever IsEnabled says. What may stand for a printf conversion is a number, an enumeration or a
// pointer: a std::wstring cannot pass by mistake.
template <class... Arguments>
void Write(int16_t step, Level level, const wchar_t* function, const wchar_t* format, Arguments... arguments) {
  static_assert(((std::is_arithmetic_v<Arguments> || std::is_enum_v<Arguments> || std::is_pointer_v<Arguments>)&&...),
                "a log argument is a number or a pointer; pass text as .c_str()");
  const Route route(level);
  if (const auto write = route.LibraryWrite()) {
    const LogRecord record = {static_cast<uint32_t>(level)};
    write(step, &record, GetModuleHandleW(nullptr), function, format, Promoted(arguments)...);
  }
  if (route.Captures()) route.Capture(function, format, Promoted(arguments)...);
}

}  // namespace logging

#define ST_LOG(level, function, ...)                                                   \
  do {                                                                                 \
    if (::logging::IsEnabled()) ::logging::Write(0, (level), (function), __VA_ARGS__); \
  } while (false)

#define LOG_FATAL(function, ...) ST_LOG(::logging::Level::kFatal, function, __VA_ARGS__)
#define LOG_CRITICAL(function, ...) ST_LOG(::logging::Level::kCritical, function, __VA_ARGS__)
#define LOG_ERROR(function, ...) ST_LOG(::logging::Level::kError, function, __VA_ARGS__)
#define LOG_WARNING(function, ...) ST_LOG(::logging::Level::kWarning, function, __VA_ARGS__)
#define LOG_INFO(function, ...) ST_LOG(::logging::Level::kInfo, function, __VA_ARGS__)
#define LOG_TRACE(function, ...) ST_LOG(::logging::Level::kTrace, function, __VA_ARGS__)
