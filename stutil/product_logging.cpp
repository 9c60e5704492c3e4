#include "stutil/product_logging.h"

#include <windows.h>

#include <mutex>

#include "core/files.h"
#include "core/lock.h"
#include "core/logging.h"
#include "core/paths.h"
#include "core/program_path.h"
#include "core/text.h"
#include "stutil/control_block.h"
#include "stutil/logger_xml.h"
#include "stutil/raised_logging.h"

namespace stutil {
namespace {

constexpr wchar_t kScope[] = L"stutil::SetEndpontLogLevel";
constexpr wchar_t kActivateScope[] = L"stutil::ActivateProductLogging";
constexpr wchar_t kDisableScope[] = L"stutil::DisableProductLogging";
constexpr wchar_t kRestoreScope[] = L"stutil::RestoreProductLogging";

constexpr uint32_t kRaisedLevel = 2;
constexpr uint32_t kLoweredLevel = 0;
constexpr wchar_t kRaisedDepth[] = L"MODULE";
constexpr wchar_t kRaisedLevels[] = L"FATAL | CRITICAL | ERROR | WARNING | INFO | TRACE";
constexpr wchar_t kLoweredDepth[] = L"EXE";
constexpr wchar_t kLoweredLevels[] = L"FATAL | CRITICAL | ERROR | WARNING";

constexpr uint64_t kLargestFile = 16 << 20;

SharedLock g_lock;

LoggerLevels Levels(const std::wstring& depth, const std::wstring& level) {
  return {ToUtf8(depth), ToUtf8(level)};
}

}  // namespace

bool ActivateCSTLogs(uint32_t level) {
  return ChangeControlBlock([level](size_t, const std::string&, uint32_t) { return level; });
}

bool SetEndpontLogLevel(const std::wstring& depth, const std::wstring& level) {
  const std::lock_guard lock(g_lock);
  return ProductLogging(ProgramFolder()).SetLogLevel(depth, level);
}

bool ActivateProductLogging() {
  return ProductLogging(ProgramFolder()).Activate();
}

bool DisableProductLogging() {
  return ProductLogging(ProgramFolder()).Disable();
}

bool RestoreProductLogging() {
  return ProductLogging(ProgramFolder()).Restore();
}

ProductLogging::ProductLogging(const std::wstring& folder)
    : m_loggerXml(JoinPath(folder, L"Logger.xml")), m_marker(m_loggerXml + L".raised") {}

bool ProductLogging::Activate() const {
  const std::lock_guard lock(g_lock);
  bool isFileKept = true;
  const bool kept = KeepFormer(isFileKept);
  const bool block = ActivateCSTLogs(kRaisedLevel);
  const bool file = isFileKept && SetLogLevel(kRaisedDepth, kRaisedLevels);
  LOG_TRACE(kActivateScope, L"enabled logs");
  return kept && block && file;
}

bool ProductLogging::Disable() const {
  const std::lock_guard lock(g_lock);
  std::string marker;
  const bool isKnown = ReadWholeFile(m_marker, kLargestFile, marker) == ERROR_SUCCESS;
  const bool done = isKnown ? PutBack(marker) : LowerToDefaults();
  LOG_TRACE(kDisableScope, L"disabled logs");
  return done;
}

bool ProductLogging::Restore() const {
  const std::lock_guard lock(g_lock);
  std::string marker;
  const DWORD error = ReadWholeFile(m_marker, kLargestFile, marker);
  if (error == ERROR_FILE_NOT_FOUND || error == ERROR_PATH_NOT_FOUND) return true;
  if (error != ERROR_SUCCESS && error != ERROR_FILE_TOO_LARGE) {  // it may be sound: the next start tries again
    LOG_ERROR(kRestoreScope, L"the marker %s cannot be read, error %d", m_marker.c_str(), error);
    return false;
  }
  LOG_INFO(kRestoreScope, L"the product's logging was left raised and is put back [marker %s]", m_marker.c_str());
  return PutBack(marker);
}

// Before the first change. A marker that is there already tells of the settings before an earlier activation: it stays.
// `isFileKept` is false when the file is there and could not be read: raised a moment later, it could not be put back.
bool ProductLogging::KeepFormer(bool& isFileKept) const {
  if (PathExists(m_marker)) return true;
  RaisedLogging former;
  ChangeControlBlock([&former](size_t, const std::string& name, uint32_t level) {
    former.components.push_back({name, level});
    return level;
  });
  std::string loggerXml;
  const DWORD readError = ReadWholeFile(m_loggerXml, kLargestFile, loggerXml);
  if (readError == ERROR_SUCCESS) former.loggerXml = std::move(loggerXml);
  isFileKept = readError == ERROR_SUCCESS || readError == ERROR_FILE_NOT_FOUND;
  if (!isFileKept) {
    LOG_ERROR(kScope, L"Can't load endpoint logs [path %s], error %d; they stay as they are", m_loggerXml.c_str(),
              readError);
  }
  const DWORD error = WriteWholeFile(m_marker, WriteRaisedLogging(former));
  if (error == ERROR_SUCCESS) return true;
  LOG_ERROR(kActivateScope, L"the former settings cannot be kept in %s, error %d", m_marker.c_str(), error);
  return false;
}

// The marker goes when everything it tells of is back; else it stays for the next start to try.
bool ProductLogging::PutBack(const std::string& marker) const {
  const std::optional<RaisedLogging> former = ReadRaisedLogging(marker);
  bool done = false;
  bool isSettled = true;
  if (!former) {
    LOG_ERROR(kRestoreScope, L"the marker %s is damaged; the usual settings are written", m_marker.c_str());
    done = LowerToDefaults();
  } else {
    const bool block = ChangeControlBlock(
        [&former](size_t index, const std::string& name, uint32_t) { return FormerLevel(*former, index, name); });
    const bool file =
        former->loggerXml ? PutBackLoggerXml(*former->loggerXml) : SetLogLevel(kLoweredDepth, kLoweredLevels);
    done = block && file;
    isSettled = block && (file || !former->loggerXml);
  }
  if (isSettled && !DeleteFileW(ExtendedPath(m_marker).c_str())) {
    LOG_ERROR(kRestoreScope, L"the marker %s cannot be deleted, error %d", m_marker.c_str(), GetLastError());
  }
  return done;
}

// The very bytes of before, unless somebody has changed the file meanwhile: then only the two settings.
bool ProductLogging::PutBackLoggerXml(const std::string& former) const {
  std::string present;
  const DWORD error = ReadWholeFile(m_loggerXml, kLargestFile, present);
  if (error != ERROR_SUCCESS && error != ERROR_FILE_NOT_FOUND) {
    LOG_ERROR(kScope, L"Can't load endpoint logs [path %s]", m_loggerXml.c_str());
    return false;
  }
  const std::optional<std::string> raised = WithLoggerLevels(former, Levels(kRaisedDepth, kRaisedLevels));
  if (present == former) return true;
  if (!raised || present == *raised || error == ERROR_FILE_NOT_FOUND) return Write(former);
  const std::optional<LoggerXml> before = ReadLoggerXml(former);
  const std::optional<std::string> lowered = before ? WithLoggerLevels(present, before->levels) : std::nullopt;
  if (lowered) return Write(*lowered);
  LOG_ERROR(kScope, L"Can't load endpoint logs [path %s]", m_loggerXml.c_str());
  return Write(former);  // what is there now is no configuration at all
}

bool ProductLogging::SetLogLevel(const std::wstring& depth, const std::wstring& level) const {
  std::string text;
  const bool isRead = ReadWholeFile(m_loggerXml, kLargestFile, text) == ERROR_SUCCESS;
  const std::optional<LoggerXml> settings = isRead ? ReadLoggerXml(text) : std::nullopt;
  const std::optional<std::string> changed = settings ? WithLoggerLevels(text, Levels(depth, level)) : std::nullopt;
  if (!changed) {
    LOG_ERROR(kScope, L"Can't load endpoint logs [path %s]", m_loggerXml.c_str());
    return false;
  }
  LOG_TRACE(kScope, L"log folder %S", settings->folder.c_str());
  LOG_TRACE(kScope, L"set logs [depth %s] [level %s]", depth.c_str(), level.c_str());
  return Write(*changed);
}

bool ProductLogging::Write(const std::string& text) const {
  if (WriteWholeFile(m_loggerXml, text) == ERROR_SUCCESS) return true;
  LOG_ERROR(kScope, L"can't save endpoint log file [path %s]", m_loggerXml.c_str());
  return false;
}

bool ProductLogging::LowerToDefaults() const {
  const bool block = ActivateCSTLogs(kLoweredLevel);
  const bool file = SetLogLevel(kLoweredDepth, kLoweredLevels);
  return block && file;
}

}  // namespace stutil
