#include "app/output_folder.h"

#include <windows.h>

#include <shlobj.h>

#include <algorithm>

#include "core/files.h"
#include "core/logging.h"
#include "core/paths.h"
#include "core/program_path.h"
#include "core/scoped.h"

namespace {

constexpr wchar_t kScope[] = L"st::OutputFolder";
constexpr std::wstring_view kLocalPrefix = L"\\\\?\\";
constexpr std::wstring_view kNetworkPrefix = L"\\\\?\\UNC\\";

struct FolderPlace {
  std::wstring_view path;  // behind the prefix
  size_t rootParts;        // parts of the path that name its root; 0 when it is neither on a drive nor on a share
};

FolderPlace PlaceOf(std::wstring_view folder) {
  if (folder.starts_with(kNetworkPrefix)) return {folder.substr(kNetworkPrefix.size()), 2};  // server, share
  if (!folder.starts_with(kLocalPrefix)) return {folder, 0};
  folder.remove_prefix(kLocalPrefix.size());
  constexpr std::wstring_view kVolume = L"Volume{";
  const bool isDrive = folder.size() >= 2 && folder[1] == L':' && (folder.size() == 2 || folder[2] == L'\\');
  return {folder, isDrive || EqualNames(folder.substr(0, kVolume.size()), kVolume) ? size_t{1} : size_t{0}};
}

struct KnownFolder {
  const KNOWNFOLDERID& id;
  const wchar_t* what;
};

const KnownFolder kKnownFolders[] = {
    {FOLDERID_Profile, L"the user's profile"},
    {FOLDERID_Desktop, L"the desktop"},
    {FOLDERID_Documents, L"the user's documents"},
    {FOLDERID_Downloads, L"the user's downloads"},
    {FOLDERID_Pictures, L"the user's pictures"},
    {FOLDERID_Music, L"the user's music"},
    {FOLDERID_Videos, L"the user's videos"},
    {FOLDERID_RoamingAppData, L"the user's program data"},
    {FOLDERID_LocalAppData, L"the user's local program data"},
    {FOLDERID_ProgramData, L"the programs' common data"},
    {FOLDERID_ProgramFiles, L"the programs folder"},
    {FOLDERID_ProgramFilesX86, L"the 32-bit programs folder"},
    {FOLDERID_Windows, L"the Windows folder"},
    {FOLDERID_System, L"the Windows system folder"},
};

struct TaskMemoryTraits {
  using Type = wchar_t*;
  static bool IsValid(wchar_t* memory) { return memory != nullptr; }
  static void Close(wchar_t* memory) { CoTaskMemFree(memory); }
};
using TaskMemoryText = Scoped<TaskMemoryTraits>;

KernelHandle OpenForAttributes(const std::wstring& extended, DWORD flags) {
  return KernelHandle(CreateFileW(extended.c_str(), FILE_READ_ATTRIBUTES,
                                  FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE, nullptr, OPEN_EXISTING, flags,
                                  nullptr));
}

}  // namespace

std::wstring OutputFolderRefusal(std::wstring_view folder, const std::vector<ProtectedFolder>& protectedFolders) {
  if (folder.empty()) return L"no folder is named";
  if (folder.find(L'\0') != std::wstring_view::npos) return L"the name holds a zero character";
  const FolderPlace place = PlaceOf(folder);
  if (place.rootParts == 0) return L"it is not on a drive or a network share";
  const std::wstring_view path = WithoutEndSeparators(place.path);
  const auto separators = static_cast<size_t>(std::count(path.begin(), path.end(), L'\\'));
  if (separators < place.rootParts) return L"it is the root of a drive or a network share";
  for (const ProtectedFolder& entry : protectedFolders) {
    if (!entry.path.empty() && FolderContains(folder, entry.path))
      return std::wstring(L"it is, or holds, ") + entry.what;
  }
  return {};
}

std::wstring NormalFolder(std::wstring_view folder) {
  std::wstring extended = ExtendedPath(folder);
  if (extended.find(L'\0') != std::wstring::npos) return extended;
  const KernelHandle handle = OpenForAttributes(extended, FILE_FLAG_BACKUP_SEMANTICS);
  std::wstring final = handle ? FinalPath(handle.Get()) : std::wstring();
  if (final.empty()) {
    const DWORD error = GetLastError();
    if (handle || (error != ERROR_FILE_NOT_FOUND && error != ERROR_PATH_NOT_FOUND)) {
      LOG_WARNING(kScope, L"the system does not say where %s leads, error %u", extended.c_str(), error);
    }
  }
  return final.starts_with(kLocalPrefix) ? final : extended;
}

bool IsFolderLink(std::wstring_view folder) {
  const KernelHandle handle =
      OpenForAttributes(ExtendedPath(folder), FILE_FLAG_BACKUP_SEMANTICS | FILE_FLAG_OPEN_REPARSE_POINT);
  if (!handle) return false;
  FILE_ATTRIBUTE_TAG_INFO info{};
  if (!GetFileInformationByHandleEx(handle.Get(), FileAttributeTagInfo, &info, sizeof info)) {
    LOG_ERROR(kScope, L"the folder does not say whether it is a link, error %u", GetLastError());
    return true;
  }
  return (info.FileAttributes & FILE_ATTRIBUTE_REPARSE_POINT) != 0 && IsReparseTagNameSurrogate(info.ReparseTag);
}

std::vector<ProtectedFolder> ProtectedFolders() {
  std::vector<ProtectedFolder> folders;
  folders.push_back({NormalFolder(L"."), L"the current directory"});
  folders.push_back({NormalFolder(ProgramFolder()), L"the program's folder"});
  for (const KnownFolder& known : kKnownFolders) {
    TaskMemoryText path;
    const HRESULT status = SHGetKnownFolderPath(known.id, KF_FLAG_DONT_VERIFY, nullptr, path.Receive());
    if (SUCCEEDED(status)) {
      folders.push_back({NormalFolder(path.Get()), known.what});
    } else {
      LOG_TRACE(kScope, L"the system does not name %s, error %x", known.what, static_cast<unsigned>(status));
    }
  }
  wchar_t temporary[MAX_PATH + 2] = {};
  if (GetTempPathW(MAX_PATH + 1, temporary) != 0) {
    folders.push_back({NormalFolder(temporary), L"the temporary folder"});
  } else {
    LOG_WARNING(kScope, L"the system does not name the temporary folder, error %u", GetLastError());
  }
  return folders;
}
