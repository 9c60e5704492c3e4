#include "systeminfo/process_collector.h"

#include <charconv>

#include "core/files.h"
#include "core/format.h"
#include "core/logging.h"
#include "core/text.h"

namespace systeminfo {
namespace {

constexpr wchar_t kStart[] = L"systeminfo::ProcessCollector::Start";

const WMIWrapper::Names& PropertyNames() {
  static const WMIWrapper::Names names = {L"ProcessId",       L"Name",     L"ExecutablePath", L"CommandLine",
                                          L"ParentProcessId", L"Priority", L"Description"};
  return names;
}

std::optional<std::vector<Json::Value>> ListProcesses(WMIWrapper& wmi) {
  const WMIWrapper::Names names = wmi.PropertiesOf(L"Win32_Process", PropertyNames());
  WMIWrapper::Table rows;
  const bool hasFailed = wmi.ExecuteQuery(L"SELECT * FROM Win32_Process", names, rows) != 0;
  if (hasFailed && rows.empty()) return std::nullopt;
  return ProcessObjects(rows, names, PropertyNames());
}

// Empty when the process has none.
std::string ExecutablePath(const Json::Value& process) {
  const Json::Value& path = process["ExecutablePath"];
  return path.isString() ? path.asString() : std::string();
}

}  // namespace

std::optional<std::vector<Json::Value>> ProcessObjects(const WMIWrapper::Table& rows, const WMIWrapper::Names& names,
                                                       const WMIWrapper::Names& all) {
  std::vector<Json::Value> processes;
  processes.reserve(rows.size());
  for (const std::vector<Json::Value>& row : rows) {
    if (row.size() != names.size()) {
      LOG_TRACE(kStart, L"propertyNames.size() != propertyValues.size()");
      return std::nullopt;
    }
    Json::Value& process = processes.emplace_back(Json::objectValue);
    for (const std::wstring& name : all)
      process[ToUtf8(name)] = Json::Value();
    for (size_t i = 0; i < names.size(); ++i)
      process[ToUtf8(names[i])] = row[i];
  }
  return processes;
}

const wchar_t* ImageTypeLabel(BOOL isWow64) {
  return isWow64 == 1 ? L"x64" : L"x32";
}

std::optional<DWORD> ProcessIdOf(const Json::Value& value) {
  const std::string text = value.isConvertibleTo(Json::stringValue) ? value.asString() : std::string();
  DWORD processId = 0;
  const char* const end = text.data() + text.size();
  const auto [stop, error] = std::from_chars(text.data(), end, processId);
  if (error == std::errc() && stop == end) return processId;
  LOG_TRACE(kStart, L"Failed to get pid %s", ToWide(text).c_str());
  return std::nullopt;
}

Json::Value ModulesToJson(const std::vector<std::wstring>& modules) {
  Json::Value array(Json::arrayValue);
  for (const std::wstring& path : modules)
    array.append(Json::Value(Json::objectValue))["name"] = ToUtf8(path);
  return array;
}

Json::Value HandlesToJson(const std::vector<HandleInfo>& handles) {
  Json::Value array(Json::arrayValue);
  for (const HandleInfo& handle : handles) {
    Json::Value& object = array.append(Json::Value(Json::objectValue));
    object["name"] = ToUtf8(handle.name);
    object["type"] = ToUtf8(handle.type);
    object["value"] = ToUtf8(Format(L"[%#llx]", static_cast<unsigned long long>(handle.value)));
  }
  return array;
}

void ProcessCollector::Start(const std::shared_ptr<CollectingSettings>&, const std::shared_ptr<WMIWrapper>& wmi,
                             const std::atomic<bool>* cancel) {
  const auto processes = ListProcesses(*wmi);
  if (!processes) return;
  ProcessHandlerHelper handles;
  const std::vector<std::string> digests = ExecutableDigests(*processes, cancel);
  Json::Value array(Json::arrayValue);
  for (size_t i = 0; i < processes->size() && !IsCancelled(cancel); ++i) {
    Json::Value process = (*processes)[i];
    if (const std::string path = ExecutablePath(process); !path.empty()) {
      process["signed"] = IsSigned(ToWide(path));
      process["md5"] = digests[i];
    } else {
      LOG_TRACE(kStart, L"exePath is null");
    }
    AddSystemFacts(process, handles);
    array.append(std::move(process));
  }
  m_data = Json::Value(Json::objectValue);
  m_data["processes"] = std::move(array);
}

std::vector<std::string> ProcessCollector::ExecutableDigests(const std::vector<Json::Value>& processes,
                                                             const std::atomic<bool>* cancel) {
  std::vector<std::string> paths;
  std::vector<size_t> owners;
  for (size_t i = 0; i < processes.size(); ++i) {
    std::string path = ExecutablePath(processes[i]);
    if (path.empty()) continue;
    paths.push_back(std::move(path));
    owners.push_back(i);
  }
  std::vector<std::string> digests(processes.size());
  std::vector<std::string> found = m_digests.Get(paths, cancel);
  for (size_t i = 0; i < found.size(); ++i)
    digests[owners[i]] = std::move(found[i]);
  return digests;
}

void ProcessCollector::AddSystemFacts(Json::Value& process, ProcessHandlerHelper& handles) {
  const auto processId = ProcessIdOf(process["ProcessId"]);
  if (!processId) return;
  process["User"] = ToUtf8(GetProcessUserName(*processId));
  process["imageType"] = ToUtf8(GetImageType(*processId));
  std::vector<std::wstring> modules;
  m_modules.GetModulesForProcess(*processId, modules);
  process["modules"] = ModulesToJson(modules);
  std::vector<HandleInfo> open;
  handles.GetHandleInformationForProcess(*processId, open);
  process["handles"] = HandlesToJson(open);
}

bool ProcessCollector::IsSigned(const std::wstring& path) {
  if (const auto known = m_signed.find(path); known != m_signed.end()) return known->second;
  const KernelHandle file(
      CreateFileW(ExtendedPath(path).c_str(), 0, 0, nullptr, OPEN_EXISTING, FILE_ATTRIBUTE_NORMAL, nullptr));
  bool isSigned = false;
  if (file) {
    isSigned = m_verifier.CertTrustVer(path.c_str(), file.Get());
  } else {
    LOG_TRACE(L"systeminfo::ProcessCollector::IsSigned", L"Invalid file handle when checking if it's signed");
  }
  m_signed.emplace(path, isSigned);
  return isSigned;
}

std::wstring ProcessCollector::GetImageType(DWORD processId) {
  const KernelHandle process(OpenProcess(PROCESS_QUERY_INFORMATION, FALSE, processId));
  if (!process) {
    LOG_TRACE(L"systeminfo::ProcessCollector::GetImageType", L"process %u cannot be opened, error %u", processId,
              GetLastError());
    return {};
  }
  BOOL isWow64 = FALSE;
  if (!IsWow64Process(process.Get(), &isWow64)) {
    LOG_TRACE(L"systeminfo::ProcessCollector::GetImageType", L"IsWow64Process failed with %u", GetLastError());
    return {};
  }
  return ImageTypeLabel(isWow64);
}

}  // namespace systeminfo
