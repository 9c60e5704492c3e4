#include "systeminfo/product_settings.h"

#include "core/files.h"
#include "core/logging.h"
#include "core/paths.h"
#include "core/text.h"
#include "systeminfo/product_xml.h"

namespace systeminfo {
namespace {

constexpr uint64_t kLargestXmlFile = uint64_t{4} << 20;  // the product's have a few kilobytes

// False when there is no text to parse; the caller logs that nothing was loaded.
bool ReadXmlFile(const wchar_t* scope, const std::wstring& path, std::string& xml) {
  const DWORD error = ReadWholeFile(path, kLargestXmlFile, xml);
  if (error != ERROR_SUCCESS) LOG_WARNING(scope, L"%s cannot be read, error %u", path.c_str(), error);
  return error == ERROR_SUCCESS;
}

}  // namespace

std::wstring GetDumpFullPath(const std::wstring& settingsFile) {
  constexpr wchar_t kScope[] = L"systeminfo::GetDumpFullPath";
  DumpPathText path{XmlOutcome::kNotXml, {}};
  std::string xml;
  if (ReadXmlFile(kScope, settingsFile, xml)) path = ParseDumpPath(xml);
  if (path.outcome == XmlOutcome::kNotXml) LOG_ERROR(kScope, L"Can't get dump path from %s", settingsFile.c_str());
  if (path.outcome == XmlOutcome::kMissing) {
    LOG_ERROR(kScope, L"Couldn't not find DumpPath in the xml %s", settingsFile.c_str());
  }
  return ToWide(path.text);
}

Json::Value GetLastUpdate(std::wstring_view folder) {
  constexpr wchar_t kScope[] = L"systeminfo::GetLastUpdate";
  const std::wstring path(JoinPath(folder, L"update_statistics.xml"));
  if (!PathExists(path)) {
    LOG_ERROR(kScope, L"Can not find update_statistics.xml");
    return Json::Value(Json::objectValue);
  }
  UpdateStatistics statistics;
  statistics.outcome = XmlOutcome::kNotXml;
  std::string xml;
  if (ReadXmlFile(kScope, path, xml)) statistics = ParseUpdateStatistics(xml);
  if (statistics.outcome == XmlOutcome::kNotXml) {
    LOG_ERROR(kScope, L"Can't load update statistics from %s", path.c_str());
  }
  if (statistics.outcome == XmlOutcome::kMissing) {
    LOG_ERROR(kScope, L"Invalid update_settings xml file %s", path.c_str());
  }
  for (const std::string& name : statistics.invalidElements) {
    LOG_ERROR(kScope, L"Invalid element");
    LOG_TRACE(kScope, L"%s is left out", ToWide(name).c_str());
  }
  for (const std::string& name : statistics.missingTimes)
    LOG_WARNING(kScope, L"%s has no time", ToWide(name).c_str());
  return statistics.elements;
}

}  // namespace systeminfo
