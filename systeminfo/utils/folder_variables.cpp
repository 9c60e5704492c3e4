#include "systeminfo/utils/folder_variables.h"

#include <windows.h>

#include <shlobj.h>

#include <map>

#include "core/files.h"
#include "systeminfo/utils/registry_value.h"

namespace utils {
namespace {

struct FolderVariable {
  const wchar_t* name;
  int folder;
};

constexpr FolderVariable kFolderVariables[] = {
    {L"programfiles", CSIDL_PROGRAM_FILES},
    {L"commonprogramfiles", CSIDL_PROGRAM_FILES_COMMON},
    {L"programfiles(x86)", CSIDL_PROGRAM_FILESX86},
    {L"system", CSIDL_SYSTEM},
    {L"commonprogramfiles(x86)", CSIDL_PROGRAM_FILES_COMMONX86},
    {L"windir", CSIDL_WINDOWS},
    {L"system(x86)", CSIDL_SYSTEMX86},
    {L"appdata", CSIDL_APPDATA},
    {L"userprofile", CSIDL_PROFILE},
    {L"localappdata", CSIDL_LOCAL_APPDATA},
    {L"commonappdata", CSIDL_COMMON_APPDATA},
    {L"commondesktop", CSIDL_COMMON_DESKTOPDIRECTORY},
    {L"desktop", CSIDL_DESKTOPDIRECTORY},
    {L"commondocuments", CSIDL_COMMON_DOCUMENTS},
    {L"mydocuments", CSIDL_PERSONAL},
    {L"commonstartmenu", CSIDL_COMMON_STARTMENU},
    {L"startmenu", CSIDL_STARTMENU},
    {L"commonmusic", CSIDL_COMMON_MUSIC},
    {L"mymusic", CSIDL_MYMUSIC},
    {L"commonvideo", CSIDL_COMMON_VIDEO},
    {L"myvideo", CSIDL_MYVIDEO},
    {L"commonpictures", CSIDL_COMMON_PICTURES},
    {L"mypictures", CSIDL_MYPICTURES},
};

using Folders = std::map<std::wstring, std::wstring, std::less<>>;  // by variable name

// A folder that this system does not have is left out.
Folders ReadFolders() {
  Folders folders;
  for (const FolderVariable& variable : kFolderVariables) {
    wchar_t path[MAX_PATH] = {};
    if (SHGetFolderPathW(nullptr, variable.folder, nullptr, SHGFP_TYPE_CURRENT, path) == S_OK) {
      folders.emplace(variable.name, LowerCase(path));
    }
  }
  return folders;
}

std::optional<std::wstring> LookUp(std::wstring_view name) {
  static const Folders folders = ReadFolders();
  const auto folder = folders.find(LowerCase(name));
  if (folder != folders.end()) return folder->second;

  constexpr size_t kLongestName = 32767;  // of an environment variable
  if (name.size() > kLongestName || name.find(L'\0') != std::wstring_view::npos) return std::nullopt;
  const std::wstring variable = L"%" + std::wstring(name) + L"%";
  std::wstring expanded = ExpandEnvironment(variable);
  if (expanded == variable) return std::nullopt;
  return expanded;
}

}  // namespace

std::wstring ExpandFolderVariables(std::wstring_view text) {
  return ExpandVariables(text, &LookUp);
}

std::wstring ExpandVariables(std::wstring_view text, const VariableLookup& lookup) {
  std::wstring expanded;
  size_t position = 0;
  while (position < text.size()) {
    const size_t open = std::min(text.find(L'%', position), text.size());
    expanded += text.substr(position, open - position);
    const size_t close = text.find(L'%', open + 1);
    if (close == std::wstring_view::npos) {
      expanded += text.substr(open);
      break;
    }
    const std::wstring_view name = text.substr(open + 1, close - open - 1);
    const std::optional<std::wstring> value = name.empty() ? std::nullopt : lookup(name);
    if (value) {
      expanded += *value;
    } else {
      expanded += text.substr(open, close - open);
    }
    position = value ? close + 1 : close;
  }
  return expanded;
}

}  // namespace utils
