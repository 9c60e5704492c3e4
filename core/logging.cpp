#include "core/logging.h"

#include <atomic>
#include <cstdarg>
#include <new>

#include "core/format.h"
#include "core/program_path.h"

namespace logging {
namespace {

// Shared while a line is written, exclusive while the instance or the capture comes or goes: nobody is inside the
// library when it is freed.
SRWLOCK g_lock = SRWLOCK_INIT;
CLogDLL* g_instance = nullptr;      // guarded by g_lock
ErrorCapture* g_capture = nullptr;  // the innermost one; guarded by g_lock

std::mutex g_bindMutex;
std::weak_ptr<CLogDLL> g_shared;  // guarded by g_bindMutex

// False while nobody could possibly want a line: the test that every log statement makes first.
std::atomic<bool> g_anyListener{false};

// What the thread's CaptureGate looks at. A slot of the system's and not a thread_local variable: it costs the threads
// that have none nothing, and needs no destructor in a library that may be gone by then.
DWORD GateSlot() {
  static const DWORD s_slot = TlsAlloc();
  return s_slot;
}

bool IsCaptureClosed() {
  const auto* const isClosed = static_cast<const std::atomic<bool>*>(TlsGetValue(GateSlot()));
  return isClosed != nullptr && *isClosed;
}

// Runs `change` while no line is being written.
template <class Change>
void ChangeListeners(Change change) {
  AcquireSRWLockExclusive(&g_lock);
  change();
  g_anyListener = (g_instance != nullptr && g_instance->IsBound()) || g_capture != nullptr;
  ReleaseSRWLockExclusive(&g_lock);
}

}  // namespace

std::shared_ptr<CLogDLL> CLogDLL::Get() {
  const std::lock_guard lock(g_bindMutex);
  std::shared_ptr<CLogDLL> instance = g_shared.lock();
  if (!instance) {
    instance = std::make_shared<CLogDLL>();
    g_shared = instance;
  }
  return instance;
}

CLogDLL::CLogDLL() : m_library((ProgramFolder() + L"\\log.dll").c_str()) {
  m_init = m_library.Resolve<decltype(&LogInit)>("LogInit");
  m_applySettings = m_library.Resolve<decltype(&LogApplySettings)>("LogApplySettings");
  m_setSettingsFile = m_library.Resolve<decltype(&LogSetSettingsFile)>("LogSetSettingsFile");
  m_enable = m_library.Resolve<decltype(&LogEnable)>("LogEnable");
  m_setLevel = m_library.Resolve<decltype(&LogSetLevel)>("LogSetLevel");
  m_setPath = m_library.Resolve<decltype(&LogSetPath)>("LogSetPath");
  m_setType = m_library.Resolve<decltype(&LogSetType)>("LogSetType");
  m_setMode = m_library.Resolve<decltype(&LogSetMode)>("LogSetMode");
  m_setMaxSize = m_library.Resolve<decltype(&LogSetMaxSize)>("LogSetMaxSize");
  m_setDepth = m_library.Resolve<decltype(&LogSetDepth)>("LogSetDepth");
  m_write = m_library.Resolve<decltype(&LogWrite)>("LogWrite");
  m_isEnabled = m_library.Resolve<decltype(&LogIsEnabled)>("LogIsEnabled");
  m_monitorSettings = m_library.Resolve<decltype(&LogMonitorSettings)>("LogMonitorSettings");
  m_getLevel = m_library.Resolve<decltype(&LogGetLevel)>("LogGetLevel");
  m_uninitDeskMetrics = m_library.Resolve<decltype(&LogUninitDeskMetrics)>("LogUninitDeskMetrics");
  m_trackEvent = m_library.Resolve<decltype(&LogTrackEvent)>("LogTrackEvent");
  m_trackEventData = m_library.Resolve<decltype(&LogTrackEventData)>("LogTrackEventData");
  m_removeModule = m_library.Resolve<decltype(&LogRemoveModule)>("LogRemoveModule");
  if (m_init != nullptr) m_init();
  ChangeListeners([this] { g_instance = this; });
}

CLogDLL::~CLogDLL() {
  // A new instance may have been bound already while this one, the last reference gone, waited for its turn.
  ChangeListeners([this] {
    if (g_instance == this) g_instance = nullptr;
  });
  if (const auto deinit = m_library.Resolve<decltype(&LogDeinit)>("LogDeinit")) deinit();
}

void CLogDLL::ApplySettingsFile(const wchar_t* path) const {
  if (m_setSettingsFile == nullptr || m_applySettings == nullptr) return;
  m_setSettingsFile(path);
  m_applySettings();
}

void CLogDLL::MonitorSettings() const {
  if (m_monitorSettings != nullptr) m_monitorSettings(1);
}

bool IsEnabled() {
  if (!g_anyListener.load(std::memory_order_relaxed)) return false;
  AcquireSRWLockShared(&g_lock);
  const bool enabled = g_capture != nullptr || (g_instance != nullptr && g_instance->IsBound() &&
                                                (g_instance->m_isEnabled == nullptr || g_instance->m_isEnabled() != 0));
  ReleaseSRWLockShared(&g_lock);
  return enabled;
}

Route::Route(Level level) : m_level(level) {
  AcquireSRWLockShared(&g_lock);
  if (g_capture == nullptr || IsCaptureClosed()) return;
  for (const ErrorCapture* capture = g_capture; capture != nullptr; capture = capture->m_outer) {
    m_captures = m_captures || capture->Wants(level);
  }
}

Route::~Route() {
  ReleaseSRWLockShared(&g_lock);
}

decltype(&LogWrite) Route::LibraryWrite() const {
  return g_instance == nullptr ? nullptr : g_instance->m_write;
}

void Route::Capture(const wchar_t* function, const wchar_t* format, ...) const noexcept {
  if (function == nullptr || format == nullptr) return;
  va_list arguments;
  va_start(arguments, format);
  try {
    const std::wstring line = std::wstring(function) + L": " + FormatV(format, arguments);
    for (ErrorCapture* capture = g_capture; capture != nullptr; capture = capture->m_outer) {
      if (capture->Wants(m_level)) capture->Add(line);
    }
  } catch (const std::bad_alloc&) {
    // A log line must never be what ends the program.
  }
  va_end(arguments);
}

CaptureGate::CaptureGate(const std::atomic<bool>& isClosed) {
  TlsSetValue(GateSlot(), const_cast<std::atomic<bool>*>(&isClosed));
}

CaptureGate::~CaptureGate() {
  TlsSetValue(GateSlot(), nullptr);
}

ErrorCapture::ErrorCapture(Level least, Keep keep) : m_least(least), m_keep(keep) {
  ChangeListeners([this] { m_outer = std::exchange(g_capture, this); });
}

ErrorCapture::~ErrorCapture() {
  ChangeListeners([this] { g_capture = m_outer; });
}

void ErrorCapture::Add(const std::wstring& line) {
  const std::lock_guard lock(m_mutex);
  if (m_keep == Keep::kLast) m_lines.clear();
  if (m_lines.size() < kMostLines) {
    m_lines.push_back(line);
  } else {
    ++m_dropped;
  }
}

std::vector<std::wstring> ErrorCapture::Take() {
  const std::lock_guard lock(m_mutex);
  std::vector<std::wstring> lines = std::exchange(m_lines, {});
  if (const size_t dropped = std::exchange(m_dropped, 0); dropped != 0) {
    lines.push_back(L"(" + std::to_wstring(dropped) + L" more lines)");
  }
  return lines;
}

}  // namespace logging
