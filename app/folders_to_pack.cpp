#include "app/folders_to_pack.h"

#include <windows.h>

#include "core/delete_folder.h"
#include "core/files.h"
#include "core/folder_entries.h"
#include "core/json.h"
#include "core/logging.h"
#include "core/paths.h"
#include "core/text.h"
#include "core/walk_dir.h"

namespace st {
namespace {

constexpr wchar_t kGetFoldersToCopy[] = L"st::GetFoldersToCopy";
constexpr wchar_t kCopyInstallLogs[] = L"st::CopyInstallLogs";

// The product collector writes a handful of paths.
constexpr uint64_t kLargestFolderList = uint64_t{1} << 20;

std::wstring FolderOfElement(const Json::Value& element) {
  if (!element.isString()) return {};
  std::wstring folder = ToWide(element.asString());
  // An empty path would mean the root of the current drive, and the system would see only what precedes a zero.
  return folder.find(L'\0') == std::wstring::npos ? folder : std::wstring();
}

// The files to copy, in the order of the walk.
std::vector<std::wstring> FindInstallLogs(const std::wstring& temporaryFolder, const std::wstring& outputFolder) {
  const std::wstring ownFolder = ExtendedPath(outputFolder);
  std::vector<std::wstring> files;
  WalkDir(temporaryFolder, [&](const qx::PathString& path, const WIN32_FIND_DATAW& entry) {
    const std::wstring_view text(path);
    if (EqualNames(ExtendedPath(text), ownFolder)) {
      return kWalkSkip;
    }
    if (!IsLink(entry) && text.find(L"qxinst.") != std::wstring_view::npos) files.emplace_back(text);
    return kWalkContinue;
  });
  return files;
}

}  // namespace

std::vector<std::wstring> GetFoldersToCopy(const std::wstring& outputFolder) {
  const std::wstring list(JoinPath(outputFolder, L"log_folders_considered.json"));
  if (!PathExists(list)) {
    LOG_INFO(kGetFoldersToCopy, L"no folders to copy found");
    return {};
  }
  std::string bytes;
  if (const DWORD error = ReadWholeFile(list, kLargestFolderList, bytes)) {
    LOG_ERROR(kGetFoldersToCopy, L"cannot read %s, error %u", list.c_str(), error);
    return {};
  }
  Json::Value root;
  std::string message;
  if (!ParseJson(bytes, root, message)) {
    LOG_ERROR(kGetFoldersToCopy, L"%s is not JSON: %s", list.c_str(), ToWide(message).c_str());
  }
  if (!root.isArray()) {
    LOG_ERROR(kGetFoldersToCopy, L"Expected array, got %d", root.type());
    return {};
  }
  std::vector<std::wstring> folders;
  for (Json::ArrayIndex i = 0; i < root.size(); ++i) {
    std::wstring folder = FolderOfElement(root[i]);
    if (folder.empty()) {
      LOG_ERROR(kGetFoldersToCopy, L"element %u of %s is no folder path", i, list.c_str());
    } else {
      folders.push_back(std::move(folder));
    }
  }
  return folders;
}

std::wstring GetUserTempPath() {
  constexpr wchar_t kScope[] = L"st::GetUserTempPath";
  constexpr DWORD kRoom = MAX_PATH + 1;  // the longest answer of the system, and its zero
  wchar_t path[kRoom + 1] = {};
  const DWORD length = GetTempPathW(kRoom + 1, path);
  if (length == 0 || length > kRoom) {
    LOG_ERROR(kScope, L"Can't get temp path, [err %d]", length == 0 ? GetLastError() : ERROR_INSUFFICIENT_BUFFER);
    return {};
  }
  LOG_TRACE(kScope, L"temp path %s", &path[0]);
  return path;
}

std::wstring CopyInstallLogs(const std::wstring& outputFolder) {
  std::wstring target(JoinPath(outputFolder, L"install_logs"));
  if (!IsAbsent(target)) DeleteFolder(target, true);
  if (!CreateDirectoryW(ExtendedPath(target).c_str(), nullptr)) {
    const DWORD error = GetLastError();
    LOG_ERROR(kCopyInstallLogs, L"can't create install logs folder");
    LOG_TRACE(kCopyInstallLogs, L"error %u", error);
    return {};
  }
  LOG_TRACE(kCopyInstallLogs, L"install_logs folder %s", target.c_str());
  const std::wstring temporaryFolder = GetUserTempPath();
  if (temporaryFolder.empty()) return {};
  const std::vector<std::wstring> files = FindInstallLogs(temporaryFolder, outputFolder);
  LOG_TRACE(kCopyInstallLogs, L"qxinst.* files to copy %u", static_cast<uint32_t>(files.size()));
  for (const std::wstring& file : files) {
    const std::wstring copy(JoinPath(target, LastPathComponent(file)));
    if (!CopyFileW(ExtendedPath(file).c_str(), ExtendedPath(copy).c_str(), FALSE)) {
      const DWORD error = GetLastError();
      LOG_ERROR(kCopyInstallLogs, L"Failed to copy file from %s to %s ", file.c_str(), copy.c_str());
      LOG_TRACE(kCopyInstallLogs, L"error %u", error);
    }
  }
  return target;
}

}  // namespace st
