// The library behind the C interface: the settings in force, the log files, and what is kept for each thread and
// module. Every function may be called by any thread at any time.
#pragma once

#include <atomic>
#include <cstdarg>
#include <map>
#include <memory>
#include <mutex>
#include <set>
#include <string>
#include <utility>

#include "companions/log/dropped_lines.h"
#include "companions/log/log_file.h"
#include "companions/log/log_line.h"
#include "companions/log/log_settings.h"
#include "companions/log/settings_watcher.h"
#include "core/lock.h"
#include "interfaces/log_api.h"

namespace logfile {

// A number for each thread, zero at first. A slot of the system's and not a thread_local variable: it needs neither
// memory nor a destructor per thread, so that the library can be unloaded while threads that logged go on.
class ThreadDepth {
 public:
  ThreadDepth() : m_slot(TlsAlloc()) {}
  ~ThreadDepth();
  ThreadDepth(const ThreadDepth&) = delete;
  ThreadDepth& operator=(const ThreadDepth&) = delete;

  // Takes the step for the calling thread; returns the depth of its line.
  unsigned Step(int step) const;

 private:
  const DWORD m_slot;
};

class Logger {
 public:
  // `wanted` is kept up to date for readers that may not lock: the levels that would be written now, 0 while off.
  explicit Logger(std::atomic<uint32_t>& wanted);
  Logger(const Logger&) = delete;
  Logger& operator=(const Logger&) = delete;

  void Write(int step, uint32_t level, HMODULE module, const wchar_t* function, const wchar_t* format,
             va_list arguments);

  DWORD SetSettingsFile(std::wstring_view path);
  DWORD ApplySettingsFile();
  DWORD MonitorSettings(bool on);

  // Changes the settings in force by `change(Settings&)`.
  template <class Change>
  void ChangeSettings(Change change) {
    const std::lock_guard lock(m_lock);
    change(m_settings);
    UseSettings();
  }
  uint32_t Levels() const;

  void TrackEvent(const wchar_t* category, const wchar_t* name, const wchar_t* data);
  void WriteEventCounts();
  void RemoveModule(HMODULE module);

  // Ends the watcher and writes the event counts: the last call before the logger is destroyed.
  void Finish();

 private:
  struct Module {
    std::string name;   // "support_tool.exe", UTF-8
    std::wstring stem;  // in file names; empty for the program itself
  };
  // One file of the log and what could not be written to it.
  struct Channel {
    LogFile file;
    DroppedLines dropped = {};
    bool isBegun = false;
  };

  Module ModuleOf(HMODULE module);
  void WriteText(uint32_t level, const Module& module, unsigned depth, std::string_view function,
                 std::string_view text);
  void WriteOwn(uint32_t level, std::string_view text);
  void WriteToFile(const Module& module, const std::string& line, const DroppedLines::NoticeFunction& notice);
  Channel& ChannelOf(const std::wstring& stem);

  enum class Reading { kAlways, kIfChanged, kIfChangedAndSound };
  DWORD ReadSettingsFile(Reading reading);
  SettingsWatcher::Changed WatcherCallback();
  void UseSettings();

  static constexpr DWORD kNothingRead = ~DWORD{0};

  std::atomic<uint32_t>& m_wanted;
  const ThreadDepth m_depth;
  const std::wstring m_program;  // full path

  SharedLock m_watcherLock;  // taken before m_lock; never by the watcher's thread
  std::unique_ptr<SettingsWatcher> m_watcher;

  SharedLock m_reloadLock;  // taken before m_lock: one reading of the settings file at a time
  std::pair<DWORD, std::string> m_lastRead{kNothingRead, {}};  // error and content that were judged last

  mutable SharedLock m_lock;  // guards all below
  Settings m_settings;
  std::wstring m_settingsPath;  // absolute; empty while there is none
  std::wstring m_folderInUse;
  uint32_t m_depthInUse = LOG_DEPTH_EXE;
  std::map<std::wstring, Channel> m_channels;  // by Module::stem
  std::set<std::wstring> m_begun;              // files that this process has written to, "<folder>|<stem>"
  std::map<HMODULE, Module> m_modules;
  std::map<std::pair<std::wstring, std::wstring>, uint64_t> m_events;  // by category and name
};

}  // namespace logfile
