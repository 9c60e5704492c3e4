#include "companions/log/logger.h"

#include <cstdint>
#include <shared_mutex>

#include "core/format.h"
#include "core/paths.h"
#include "core/program_path.h"
#include "core/text.h"

namespace logfile {
namespace {

constexpr char kOwnFunction[] = "log";
constexpr size_t kMostModules = 1000;

std::wstring_view StemOf(std::wstring_view path) {
  const std::wstring_view name = LastPathComponent(path);
  return name.substr(0, name.find_last_of(L'.'));
}

LocalTime Now() {
  SYSTEMTIME now{};
  GetLocalTime(&now);
  return {now.wYear, now.wMonth, now.wDay, now.wHour, now.wMinute, now.wSecond, now.wMilliseconds};
}

std::wstring PathOfModule(HMODULE module) {
  constexpr DWORD kLongestPath = 32767;
  for (DWORD size = MAX_PATH; size <= kLongestPath + 1; size *= 4) {
    std::wstring path(size, L'\0');
    const DWORD length = GetModuleFileNameW(module, path.data(), size);
    if (length < size) return path.substr(0, length);
  }
  return {};
}

}  // namespace

ThreadDepth::~ThreadDepth() {
  if (m_slot != TLS_OUT_OF_INDEXES) TlsFree(m_slot);
}

unsigned ThreadDepth::Step(int step) const {
  if (m_slot == TLS_OUT_OF_INDEXES) return 0;
  const Indent indent = ApplyStep(static_cast<unsigned>(reinterpret_cast<uintptr_t>(TlsGetValue(m_slot))), step);
  if (step != 0) TlsSetValue(m_slot, reinterpret_cast<void*>(static_cast<uintptr_t>(indent.after)));
  return indent.ofLine;
}

Logger::Logger(std::atomic<uint32_t>& wanted) : m_wanted(wanted), m_program(ProgramPath()) {
  const std::lock_guard lock(m_lock);
  UseSettings();
}

void Logger::Finish() {
  MonitorSettings(false);
  WriteEventCounts();
}

void Logger::Write(int step, uint32_t level, HMODULE module, const wchar_t* function, const wchar_t* format,
                   va_list arguments) {
  const unsigned depth = m_depth.Step(step);
  level = EffectiveLevel(level);
  if ((m_wanted.load(std::memory_order_relaxed) & level) == 0) return;
  const std::string text = format == nullptr ? "(no text)" : ToUtf8(FormatV(format, arguments));
  WriteText(level, ModuleOf(module), depth, function == nullptr ? "?" : ToUtf8(function), text);
}

void Logger::WriteOwn(uint32_t level, std::string_view text) {
  if ((m_wanted.load(std::memory_order_relaxed) & level) != 0)
    WriteText(level, {"log.dll", L""}, 0, kOwnFunction, text);
}

void Logger::WriteText(uint32_t level, const Module& module, unsigned depth, std::string_view function,
                       std::string_view text) {
  Line line{{}, level, GetCurrentProcessId(), GetCurrentThreadId(), module.name, function, text, depth};
  std::string formatted;
  uint32_t types = 0;
  {
    const std::lock_guard lock(m_lock);
    types = m_settings.types;
    line.time = Now();  // under the lock: the lines of a file are in the order of their times
    formatted = FormatLine(line);
    if ((types & LOG_TYPE_FILE) != 0) {
      WriteToFile(module, formatted, [&line](uint64_t count, uint32_t error) {
        Line notice = line;
        const std::string what =
            std::to_string(count) + " lines could not be written and are missing here: error " + std::to_string(error);
        notice.level = LOG_LEVEL_WARNING;
        notice.module = "log.dll";
        notice.function = kOwnFunction;
        notice.depth = 0;
        notice.text = what;
        return FormatLine(notice);
      });
    }
  }
  if ((types & LOG_TYPE_DEBUGGER) != 0) OutputDebugStringW(ToWide(formatted).c_str());
}

void Logger::WriteToFile(const Module& module, const std::string& line, const DroppedLines::NoticeFunction& notice) {
  const std::wstring stem = m_depthInUse == LOG_DEPTH_MODULE ? module.stem : std::wstring();
  Channel& channel = ChannelOf(stem);
  if (!std::exchange(channel.isBegun, true)) {
    const bool isFirst = m_begun.insert(m_folderInUse + L"|" + stem).second;
    if (isFirst && m_settings.mode == LOG_MODE_OVERWRITE) channel.file.BeginAnew();
  }
  channel.dropped.Write(
      line, [&channel](std::string_view bytes) { return channel.file.Append(bytes); }, notice);
}

Logger::Channel& Logger::ChannelOf(const std::wstring& stem) {
  const auto found = m_channels.find(stem);
  if (found != m_channels.end()) return found->second;
  LogFile file(m_folderInUse, std::wstring(StemOf(m_program)), stem);
  file.SetLimits(m_settings.maxBytes, m_settings.oldFiles);
  return m_channels.emplace(stem, Channel{std::move(file)}).first->second;
}

// The system is asked for a module's name while no lock is held: it takes the loader's lock, which a thread that logs
// from its DllMain holds.
Logger::Module Logger::ModuleOf(HMODULE module) {
  {
    const std::shared_lock lock(m_lock);
    const auto found = m_modules.find(module);
    if (found != m_modules.end()) return found->second;
  }
  const std::wstring path = PathOfModule(module);
  if (path.empty()) return {"?", L""};
  Module result{ToUtf8(LastPathComponent(path)), path == m_program ? L"" : std::wstring(StemOf(path))};
  const std::lock_guard lock(m_lock);
  if (m_modules.size() < kMostModules) m_modules.emplace(module, result);
  return result;
}

void Logger::RemoveModule(HMODULE module) {
  const std::lock_guard lock(m_lock);
  const auto found = m_modules.find(module);
  if (found == m_modules.end()) return;
  const std::wstring stem = found->second.stem;
  m_modules.erase(found);
  if (const auto channel = m_channels.find(stem); channel != m_channels.end() && !stem.empty()) {
    const DroppedLines dropped = channel->second.dropped;
    m_channels.erase(channel);
    ChannelOf(L"").dropped.Add(dropped);
  }
}

uint32_t Logger::Levels() const {
  const std::shared_lock lock(m_lock);
  return m_settings.levels;
}

}  // namespace logfile
