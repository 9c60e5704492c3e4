// Notices that a file has changed: a thread that waits for changes in the file's folder. It does not judge whether the
// content is new; the callback reads the file and compares.
#pragma once

#include <functional>
#include <string>

#include "core/scoped.h"

namespace logfile {

class SettingsWatcher {
 public:
  // Called on the watcher's thread after something in the folder changed and the changes have paused, and called again,
  // a little later, as long as it returns false (a file that is just being written): a few times, then with `last` set,
  // when the answer no longer matters. It must not throw and must not destroy the watcher.
  using Changed = std::function<bool(bool last)>;

  // `path` is absolute. A folder that is not there or cannot be watched is looked at every two seconds.
  SettingsWatcher(const std::wstring& path, Changed changed);
  // Ends the thread and waits for it. Not from DllMain.
  ~SettingsWatcher();
  SettingsWatcher(const SettingsWatcher&) = delete;
  SettingsWatcher& operator=(const SettingsWatcher&) = delete;

  bool IsRunning() const { return static_cast<bool>(m_thread); }

 private:
  static DWORD WINAPI ThreadMain(void* self);
  void Run();
  void Arm();
  bool WaitForChange();
  bool Stopped(DWORD milliseconds) const { return WaitForSingleObject(m_stop.Get(), milliseconds) == WAIT_OBJECT_0; }

  const std::wstring m_folder;
  const Changed m_changed;
  KernelHandle m_stop;
  ChangeNotification m_notification;  // used by the thread only, once it runs
  KernelHandle m_thread;
};

}  // namespace logfile
