#include "companions/log/settings_watcher.h"

#include "core/files.h"
#include "core/paths.h"

namespace logfile {
namespace {

constexpr DWORD kPollInterval = 2000;  // milliseconds, as the rest
constexpr DWORD kQuietTime = 100;      // an editor's writes come in bursts
constexpr DWORD kRetryTime = 100;
constexpr int kMostBursts = 10;  // then it is looked at although it goes on changing
constexpr int kTries = 5;

// The module that holds this code. The thread keeps a reference of it, so that the code stays loaded while it runs.
HMODULE ReferenceToOwnModule() {
  HMODULE module = nullptr;
  GetModuleHandleExW(GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS, reinterpret_cast<const wchar_t*>(&ReferenceToOwnModule),
                     &module);
  return module;
}

}  // namespace

SettingsWatcher::SettingsWatcher(const std::wstring& path, Changed changed)
    : m_folder(ParentFolder(path)), m_changed(std::move(changed)), m_stop(CreateEventW(nullptr, TRUE, FALSE, nullptr)) {
  if (!m_stop) return;
  Arm();  // here, so that a change right after the constructor returns is noticed
  m_thread.Reset(CreateThread(nullptr, 0, &ThreadMain, this, 0, nullptr));
}

SettingsWatcher::~SettingsWatcher() {
  if (!m_thread) return;
  SetEvent(m_stop.Get());
  WaitForSingleObject(m_thread.Get(), INFINITE);
}

DWORD WINAPI SettingsWatcher::ThreadMain(void* self) {
  const HMODULE module = ReferenceToOwnModule();
  static_cast<SettingsWatcher*>(self)->Run();
  // One step for both, which no owner type can take: code after a mere FreeLibrary might be gone.
  if (module != nullptr) FreeLibraryAndExitThread(module, 0);
  return 0;
}

void SettingsWatcher::Arm() {
  if (m_notification && FindNextChangeNotification(m_notification.Get())) return;
  constexpr DWORD kWhat = FILE_NOTIFY_CHANGE_FILE_NAME | FILE_NOTIFY_CHANGE_LAST_WRITE | FILE_NOTIFY_CHANGE_SIZE;
  m_notification.Reset(FindFirstChangeNotificationW(ExtendedPath(m_folder).c_str(), FALSE, kWhat));
}

// False when the thread is to end.
bool SettingsWatcher::WaitForChange() {
  const HANDLE handles[] = {m_stop.Get(), m_notification.Get()};
  if (!m_notification) {
    if (Stopped(kPollInterval)) return false;
    Arm();
    return true;
  }
  if (WaitForMultipleObjects(2, handles, FALSE, INFINITE) != WAIT_OBJECT_0 + 1) return false;
  Arm();
  for (int burst = 0; burst < kMostBursts && m_notification; ++burst) {
    const HANDLE again[] = {m_stop.Get(), m_notification.Get()};
    const DWORD waited = WaitForMultipleObjects(2, again, FALSE, kQuietTime);
    if (waited == WAIT_TIMEOUT) break;
    if (waited != WAIT_OBJECT_0 + 1) return false;
    Arm();
  }
  return true;
}

void SettingsWatcher::Run() {
  while (WaitForChange()) {
    for (int attempt = 1; !m_changed(attempt == kTries) && attempt < kTries; ++attempt) {
      if (Stopped(kRetryTime)) return;
    }
  }
}

}  // namespace logfile
