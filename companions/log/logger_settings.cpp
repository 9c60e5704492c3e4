// The half of the logger that deals with its settings and with counted events.
#include <shared_mutex>

#include "companions/log/logger.h"
#include "core/files.h"
#include "core/paths.h"
#include "core/text.h"

namespace logfile {
namespace {

constexpr uint64_t kMostSettingsBytes = uint64_t{1} << 20;
constexpr size_t kMostEvents = 1000;  // different ones; more are counted together

// Absolute and without the prefix "\\?\", behind which "/" and ".." of a relative log folder would be taken literally.
std::wstring FullPath(std::wstring_view path) {
  constexpr std::wstring_view kNetworkPrefix = L"\\\\?\\UNC\\";
  constexpr std::wstring_view kLocalPrefix = L"\\\\?\\";
  const std::wstring full = ExtendedPath(path);
  if (full.starts_with(kNetworkPrefix)) return L"\\\\" + full.substr(kNetworkPrefix.size());
  return full.starts_with(kLocalPrefix) ? full.substr(kLocalPrefix.size()) : full;
}

}  // namespace

DWORD Logger::SetSettingsFile(std::wstring_view path) {
  const std::lock_guard watcherLock(m_watcherLock);
  const bool monitored = m_watcher != nullptr;
  m_watcher.reset();
  {
    const std::lock_guard reloadLock(m_reloadLock);
    m_lastRead = {kNothingRead, {}};
    const std::lock_guard lock(m_lock);
    m_settingsPath = FullPath(path);
  }
  if (monitored) m_watcher = std::make_unique<SettingsWatcher>(FullPath(path), WatcherCallback());
  return ERROR_SUCCESS;
}

DWORD Logger::ApplySettingsFile() {
  return ReadSettingsFile(Reading::kAlways);
}

DWORD Logger::MonitorSettings(bool on) {
  const std::lock_guard watcherLock(m_watcherLock);
  if (!on) {
    m_watcher.reset();
    return ERROR_SUCCESS;
  }
  if (m_watcher) return ERROR_SUCCESS;
  std::wstring path;
  {
    const std::shared_lock lock(m_lock);
    path = m_settingsPath;
  }
  if (path.empty()) return ERROR_FILE_NOT_FOUND;
  m_watcher = std::make_unique<SettingsWatcher>(path, WatcherCallback());
  if (!m_watcher->IsRunning()) {
    m_watcher.reset();
    return ERROR_NO_SYSTEM_RESOURCES;
  }
  ReadSettingsFile(Reading::kIfChanged);  // changes from before the watcher began
  return ERROR_SUCCESS;
}

SettingsWatcher::Changed Logger::WatcherCallback() {
  return [this](bool last) {
    try {
      return ReadSettingsFile(last ? Reading::kIfChanged : Reading::kIfChangedAndSound) != ERROR_RETRY;
    } catch (const std::bad_alloc&) {
      return false;
    }
  };
}

DWORD Logger::ReadSettingsFile(Reading reading) {
  const std::lock_guard reloadLock(m_reloadLock);
  std::wstring path;
  {
    const std::shared_lock lock(m_lock);
    path = m_settingsPath;
  }
  if (path.empty()) return ERROR_FILE_NOT_FOUND;
  std::string content;
  const DWORD error = ReadWholeFile(path, kMostSettingsBytes, content);
  if (error != ERROR_SUCCESS) content.clear();
  if (reading != Reading::kAlways && m_lastRead == std::pair(error, content)) return ERROR_SUCCESS;

  ParsedSettings parsed;
  if (error == ERROR_SUCCESS)
    parsed = ParseSettings(content);
  else
    parsed.problems.push_back("error " + std::to_string(error));
  if (!parsed.settings && reading == Reading::kIfChangedAndSound) return ERROR_RETRY;
  m_lastRead = {error, content};
  if (!parsed.settings) {
    WriteOwn(LOG_LEVEL_WARNING,
             ToUtf8(path) + " cannot be used, the settings in force stay: " + parsed.problems.front());
    return error != ERROR_SUCCESS ? error : ERROR_INVALID_DATA;
  }
  ChangeSettings([&parsed](Settings& settings) { settings = *parsed.settings; });
  if (reading != Reading::kAlways) WriteOwn(LOG_LEVEL_INFO, ToUtf8(path) + " has changed and is in force now");
  for (const std::string& problem : parsed.problems)
    WriteOwn(LOG_LEVEL_WARNING, ToUtf8(path) + ": " + problem);
  return ERROR_SUCCESS;
}

// Makes the files follow the settings. Called with m_lock held.
void Logger::UseSettings() {
  const std::wstring base(ParentFolder(m_settingsPath.empty() ? m_program : m_settingsPath));
  const std::wstring folder = logging::ResolveLogFolder(ExpandEnvironment(ToWide(m_settings.folder)), base);
  if (folder != m_folderInUse || m_settings.depth != m_depthInUse) {
    DroppedLines missing;
    for (const auto& [stem, channel] : m_channels)
      missing.Add(channel.dropped);
    m_channels.clear();
    m_folderInUse = folder;
    m_depthInUse = m_settings.depth;
    ChannelOf(L"").dropped.Add(missing);
  }
  for (auto& [stem, channel] : m_channels)
    channel.file.SetLimits(m_settings.maxBytes, m_settings.oldFiles);
  m_wanted = m_settings.enabled && m_settings.types != 0 ? m_settings.levels : 0;
}

void Logger::TrackEvent(const wchar_t* category, const wchar_t* name, const wchar_t* data) {
  {
    const std::lock_guard lock(m_lock);
    std::pair<std::wstring, std::wstring> event(category, name);
    if (m_events.size() >= kMostEvents && m_events.count(event) == 0) event = {L"", L"(other events)"};
    ++m_events[event];
  }
  if (data == nullptr) return;
  WriteOwn(LOG_LEVEL_INFO, "event " + ToUtf8(category) + "/" + ToUtf8(name) + ": " + ToUtf8(data));
}

void Logger::WriteEventCounts() {
  std::map<std::pair<std::wstring, std::wstring>, uint64_t> events;
  {
    const std::lock_guard lock(m_lock);
    events.swap(m_events);
  }
  for (const auto& [event, count] : events) {
    WriteOwn(LOG_LEVEL_INFO, "event " + ToUtf8(event.first) + "/" + ToUtf8(event.second) + " happened " +
                                 std::to_string(count) + " times");
  }
}

}  // namespace logfile
