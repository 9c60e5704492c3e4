#include "core/logger_config.h"

#include <tinyxml2.h>

#include "core/files.h"
#include "core/log_folder.h"
#include "core/logging.h"
#include "core/paths.h"
#include "core/program_path.h"
#include "core/text.h"

namespace logging {
namespace {

constexpr wchar_t kFunction[] = L"logging::LoggerConfig::Init";
constexpr uint64_t kMostBytes = uint64_t{1} << 20;

std::wstring FindConfiguration() {
  const std::wstring ofProgram = ProgramLoggerPath(ProgramPath());
  return PathExists(ofProgram) ? ofProgram : ProgramFolder() + L"\\Logger.xml";
}

// Reads the folder that the configuration names. False, and logged, when the file is not a configuration.
bool ReadFolder(const std::wstring& path, std::wstring& folder) {
  std::string text;
  if (const DWORD error = ReadWholeFile(path, kMostBytes, text); error != ERROR_SUCCESS) {
    LOG_WARNING(kFunction, L"Can't read %s: %u", path.c_str(), error);
    return false;
  }
  tinyxml2::XMLDocument document;
  document.Parse(text.data(), text.size());
  const tinyxml2::XMLElement* configuration = document.FirstChildElement("configuration");
  if (document.Error() || configuration == nullptr) {
    LOG_WARNING(kFunction, L"%s is not a logger configuration: %S", path.c_str(),
                document.Error() ? document.ErrorStr() : "no element \"configuration\"");
    return false;
  }
  const std::wstring settingsFolder(ParentFolder(path));
  folder = ResolveLogFolder(ExpandEnvironment(ToWide(ConfiguredLogFolder(*configuration))), settingsFolder);
  return true;
}

}  // namespace

std::wstring ProgramLoggerPath(std::wstring_view programPath) {
  const size_t separator = programPath.find_last_of(L"\\/");
  const size_t dot = programPath.find_last_of(L'.');
  const bool hasExtension = dot != std::wstring_view::npos && (separator == std::wstring_view::npos || dot > separator);
  return std::wstring(programPath.substr(0, hasExtension ? dot : programPath.size())) + L".logger.xml";
}

bool LoggerConfig::Init() {
  const std::shared_ptr<CLogDLL> library = CLogDLL::Get();
  const std::wstring path = FindConfiguration();
  std::wstring folder;
  if (!ReadFolder(path, folder)) return false;
  library->ApplySettingsFile(path.c_str());
  library->MonitorSettings();
  LOG_TRACE(kFunction, L"Configured by %s", path.c_str());
  LOG_TRACE(kFunction, L"Log folder is %s", folder.c_str());
  return true;
}

}  // namespace logging
