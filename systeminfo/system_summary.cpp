#include "systeminfo/system_summary.h"

#include <charconv>

#include "core/logging.h"
#include "core/text.h"

namespace systeminfo {
namespace {

using RowOf = WMIWrapper::Row SummaryInputs::*;

struct SummaryQuery {
  RowOf row;
  const wchar_t* query;
  WMIWrapper::Names names;
};

const SummaryQuery kQueries[] = {
    {&SummaryInputs::operatingSystem,
     L"SELECT * FROM Win32_OperatingSystem",
     // CurrentTimeZone is asked for and not written; kept.
     {L"Caption", L"Version", L"InstallDate", L"CSDVersion", L"BuildNumber", L"Manufacturer", L"WindowsDirectory",
      L"SystemDirectory", L"Locale", L"CurrentTimeZone", L"BootDevice"}},
    {&SummaryInputs::computerSystem,
     L"SELECT * FROM Win32_ComputerSystem",
     {L"Name", L"Manufacturer", L"Model", L"SystemType", L"UserName"}},
    {&SummaryInputs::timeZone, L"SELECT * FROM Win32_TimeZone", {L"Caption"}},
    {&SummaryInputs::bios, L"SELECT * FROM Win32_BIOS", {L"Manufacturer", L"SMBIOSBIOSVersion", L"ReleaseDate"}},
    {&SummaryInputs::processor,
     L"SELECT * FROM Win32_Processor",
     {L"Name", L"NumberOfCores", L"NumberOfLogicalProcessors"}},
    {&SummaryInputs::pageFileUsage, L"SELECT * FROM Win32_PageFileUsage", {L"Name"}},
    {&SummaryInputs::baseBoard, L"SELECT * FROM Win32_BaseBoard", {L"Manufacturer", L"Model", L"Name"}},
};

struct SummaryKey {
  const char* key;
  RowOf row;
  const wchar_t* property;
};

constexpr SummaryKey kKeys[] = {
    {"OS Name", &SummaryInputs::operatingSystem, L"Caption"},
    {"OS Version", &SummaryInputs::operatingSystem, L"Version"},
    {"OS CSD Version", &SummaryInputs::operatingSystem, L"CSDVersion"},
    {"OS Build Number", &SummaryInputs::operatingSystem, L"BuildNumber"},
    {"OS Manufacturer", &SummaryInputs::operatingSystem, L"Manufacturer"},
    {"OS installation date", &SummaryInputs::operatingSystem, L"InstallDate"},
    {"System Name", &SummaryInputs::computerSystem, L"Name"},
    {"System Manufacturer", &SummaryInputs::computerSystem, L"Manufacturer"},
    {"System Model", &SummaryInputs::computerSystem, L"Model"},
    {"System Type", &SummaryInputs::computerSystem, L"SystemType"},
    {"Windows Directory", &SummaryInputs::operatingSystem, L"WindowsDirectory"},
    {"System Directory", &SummaryInputs::operatingSystem, L"SystemDirectory"},
    {"Boot Device", &SummaryInputs::operatingSystem, L"BootDevice"},
    {"User Name", &SummaryInputs::computerSystem, L"UserName"},
    {"Time Zone", &SummaryInputs::timeZone, L"Caption"},
    {"BIOS Manufacturer", &SummaryInputs::bios, L"Manufacturer"},
    {"BIOS Version", &SummaryInputs::bios, L"SMBIOSBIOSVersion"},
    {"BIOS Release Date", &SummaryInputs::bios, L"ReleaseDate"},
    {"CPU Name", &SummaryInputs::processor, L"Name"},
    {"CPU cores", &SummaryInputs::processor, L"NumberOfCores"},
    {"CPU logical processors", &SummaryInputs::processor, L"NumberOfLogicalProcessors"},
    {"Page File", &SummaryInputs::pageFileUsage, L"Name"},
    {"BaseBoard Manufacturer", &SummaryInputs::baseBoard, L"Manufacturer"},
    {"BaseBoard Model", &SummaryInputs::baseBoard, L"Model"},
    {"BaseBoard Name", &SummaryInputs::baseBoard, L"Name"},
};

Json::Value ValueOf(const WMIWrapper::Row& row, const wchar_t* property) {
  const auto found = row.find(property);
  return found == row.end() ? Json::Value() : found->second;
}

// The blanks in the namespace are kept: the call fails with them, and what existing reports say rests on that.
DWORD TestFirmware() {
  return GetFirmwareEnvironmentVariableW(L"", L"{00000000 - 0000 - 0000 - 0000 - 000000000000}", nullptr, 0);
}

bool HasBattery(WMIWrapper& wmi) {
  WMIWrapper::Table batteries;
  wmi.ExecuteQuery(L"SELECT * FROM Win32_Battery", {L"Name"}, batteries);
  return !batteries.empty();
}

std::optional<MEMORYSTATUSEX> ReadMemoryStatus() {
  MEMORYSTATUSEX status{};
  status.dwLength = sizeof status;
  static_assert(sizeof status == 64);
  if (GlobalMemoryStatusEx(&status)) return status;
  LOG_ERROR(L"systeminfo::SystemSummary::Start", L"GlobalMemoryStatusEx() %ud", GetLastError());
  return std::nullopt;
}

}  // namespace

void SystemSummary::Start(const std::shared_ptr<CollectingSettings>&, const std::shared_ptr<WMIWrapper>& wmi,
                          const std::atomic<bool>*) {
  SummaryInputs inputs;
  for (const SummaryQuery& query : kQueries)
    wmi->ExecuteQuery(query.query, query.names, inputs.*query.row);
  inputs.firmwareTest = TestFirmware();
  inputs.hasBattery = HasBattery(*wmi);
  inputs.memory = ReadMemoryStatus();
  m_data = BuildSystemSummary(inputs);
}

Json::Value BuildSystemSummary(const SummaryInputs& inputs) {
  Json::Value summary(Json::objectValue);
  for (const SummaryKey& key : kKeys)
    summary[key.key] = ValueOf(inputs.*key.row, key.property);
  summary["Locale"] = LocaleName(ValueOf(inputs.operatingSystem, L"Locale"));
  // By the return value, not by the last error; kept, as existing reports rest on it.
  summary["BIOS Mode"] = inputs.firmwareTest == 1 ? "Legacy" : "UEFI";
  summary["Platform Role"] = inputs.hasBattery ? "Laptop" : "Desktop";
  if (inputs.memory) {
    summary["Installed Physical Memory"] = static_cast<double>(inputs.memory->ullTotalPhys);
    summary["Available Physical Memory"] = static_cast<double>(inputs.memory->ullAvailPhys);
    summary["Total Virtual Memory"] = static_cast<double>(inputs.memory->ullTotalVirtual);
    summary["Available Virtual Memory"] = static_cast<double>(inputs.memory->ullAvailVirtual);
    summary["Page File Space"] = static_cast<double>(inputs.memory->ullTotalPageFile);
  }
  return summary;
}

Json::Value LocaleName(const Json::Value& wmiLocale) {
  if (!wmiLocale.isString()) return {};
  const std::string text = wmiLocale.asString();
  LCID identifier = 0;
  const auto result = std::from_chars(text.data(), text.data() + text.size(), identifier, 16);
  if (result.ec != std::errc()) return "";
  const int size = GetLocaleInfoW(identifier, LOCALE_SNAME, nullptr, 0);
  std::wstring name(static_cast<size_t>(size), L'\0');
  const int written = size == 0 ? 0 : GetLocaleInfoW(identifier, LOCALE_SNAME, name.data(), size);
  if (written < 1) {
    LOG_WARNING(L"systeminfo::SystemSummary::Start", L"the locale %x has no name, error %u", identifier,
                GetLastError());
    return "";
  }
  name.resize(static_cast<size_t>(written) - 1);  // without the terminator
  return ToUtf8(name);
}

}  // namespace systeminfo
