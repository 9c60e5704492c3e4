// The collector "running_tasks": every running process as WMI lists it, with what WMI does not tell: whether its
// executable is signed, its hash, its account, its kind of image, its modules and its open handles. A fact that cannot
// be had is empty or left out and costs nothing else.
#pragma once

#include <windows.h>

#include <optional>
#include <string>
#include <unordered_map>
#include <vector>

#include "systeminfo/account_name.h"
#include "systeminfo/collector.h"
#include "systeminfo/handle_snapshot.h"
#include "systeminfo/md5_cache.h"
#include "systeminfo/module_list.h"
#include "systeminfo/trust_check.h"
#include "systeminfo/wmi_wrapper.h"

namespace systeminfo {

class ProcessCollector : public ICollector {
 public:
  using ICollector::ICollector;

  // Reads no settings. Polls `cancel` between processes; the data then end with the last one that was finished. They
  // stay null when the processes cannot be listed.
  void Start(const std::shared_ptr<CollectingSettings>& settings, const std::shared_ptr<WMIWrapper>& wmi,
             const std::atomic<bool>* cancel) override;

  // Each path is checked once.
  bool IsSigned(const std::wstring& path);

  // See ImageTypeLabel. Empty when the process does not tell.
  static std::wstring GetImageType(DWORD processId);

  std::wstring GetProcessUserName(DWORD processId) { return m_accounts.OfProcess(processId); }

 private:
  std::vector<std::string> ExecutableDigests(const std::vector<Json::Value>& processes,
                                             const std::atomic<bool>* cancel);
  void AddSystemFacts(Json::Value& process, ProcessHandlerHelper& handles);

  CertVerifier m_verifier;
  std::unordered_map<std::wstring, bool> m_signed;  // by path
  MD5Cache m_digests;
  AccountNames m_accounts;
  ModulesHelper m_modules;
};

// One object for each row of values, which stand in the order of `names`; a name of `all` that is not among them is
// null. Nothing, and a log line, when a row has not as many values as there are names.
std::optional<std::vector<Json::Value>> ProcessObjects(const WMIWrapper::Table& rows, const WMIWrapper::Names& names,
                                                       const WMIWrapper::Names& all);

// "x64" for an image that runs under WOW64 (the flag is exactly 1), else "x32": the wrong way round, and to stay so.
const wchar_t* ImageTypeLabel(BOOL isWow64);

// A process id as WMI gives it, a number or the text of one. Nothing, and a log line, for anything else.
std::optional<DWORD> ProcessIdOf(const Json::Value& value);

Json::Value ModulesToJson(const std::vector<std::wstring>& modules);
Json::Value HandlesToJson(const std::vector<HandleInfo>& handles);

}  // namespace systeminfo
