#include "systeminfo/product_log_folders.h"

#include <json/value.h>

#include <algorithm>

#include "core/files.h"
#include "core/json.h"
#include "core/logging.h"
#include "core/paths.h"
#include "core/text.h"
#include "systeminfo/product_settings.h"

namespace systeminfo {
namespace {

constexpr wchar_t kScope[] = L"systeminfo::WriteLogFoldersConsidered";
constexpr wchar_t kMakersFolder[] = L"Quorvex";

// The crash handler reads its settings beside itself; some products keep them with the others.
std::wstring CrashSettingsFile(const std::wstring& installLocation) {
  std::wstring besideLibrary(JoinPath(installLocation, L"qxch.xml"));
  std::wstring withOthers(JoinPath(installLocation, L"settings\\qxch.xml"));
  return !PathExists(besideLibrary) && PathExists(withOthers) ? withOthers : besideLibrary;
}

}  // namespace

std::vector<std::wstring> CandidateLogFolders(const ProductPlaces& places) {
  const std::wstring data(JoinPath(places.commonData, kMakersFolder));
  std::vector<std::wstring> folders{std::wstring(JoinPath(data, L"Logs")), std::wstring(JoinPath(data, L"QXLogging")),
                                    std::wstring(JoinPath(places.installLocation, L"settings"))};
  if (!places.dumpFolder.empty()) folders.push_back(places.dumpFolder);
  for (std::wstring& folder : folders)
    folder = ShownPath(ExtendPath(folder, places.installLocation));
  return folders;
}

LogFolderChoice ChooseLogFolders(const std::vector<std::wstring>& candidates, std::wstring_view outputFolder,
                                 const std::function<bool(const std::wstring&)>& exists) {
  LogFolderChoice choice;
  std::vector<std::wstring> usable;
  for (const std::wstring& folder : candidates) {
    if (!exists(folder)) continue;
    const bool holdsAnything = IsVolumeRoot(ExtendPath(folder, {})) || FolderContains(folder, outputFolder);
    (holdsAnything ? choice.refused : usable).push_back(folder);
  }
  for (const std::wstring& folder : usable) {
    const bool isCovered = std::any_of(usable.begin(), usable.end(), [&](const std::wstring& other) {
      // Of two names for one folder the first stays.
      return FolderContains(other, folder) && (&other < &folder || !FolderContains(folder, other));
    });
    if (!isCovered) choice.folders.push_back(folder);
  }
  return choice;
}

void WriteLogFoldersConsidered(const std::wstring& installLocation, const std::wstring& outputFolder) {
  const ProductPlaces places{ExpandEnvironment(L"%programData%"), installLocation,
                             ExpandEnvironment(GetDumpFullPath(CrashSettingsFile(installLocation)))};
  const LogFolderChoice choice =
      ChooseLogFolders(CandidateLogFolders(places), ShownPath(ExtendedPath(outputFolder)), &FolderExists);
  for (const std::wstring& folder : choice.refused)
    LOG_WARNING(kScope, L"%s holds more than the product's logs and is not packed", folder.c_str());
  Json::Value list(Json::arrayValue);
  for (const std::wstring& folder : choice.folders)
    list.append(ToUtf8(folder));
  const std::wstring path(JoinPath(outputFolder, L"log_folders_considered.json"));
  if (const DWORD error = WriteWholeFile(path, WriteStyledJson(list)); error != ERROR_SUCCESS) {
    LOG_ERROR(kScope, L"%s cannot be written, error %u", path.c_str(), error);
  }
}

}  // namespace systeminfo
