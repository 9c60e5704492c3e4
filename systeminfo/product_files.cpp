#include "systeminfo/product_files.h"

#include <windows.h>

#include <string_view>
#include <vector>

#include "core/logging.h"
#include "core/text.h"
#include "core/walk_dir.h"
#include "systeminfo/collector.h"
#include "systeminfo/utils/file_md5.h"
#include "systeminfo/utils/file_version.h"

namespace systeminfo {
namespace {

Json::Value FileRecord(const std::string& path, const std::string& md5, const std::string& version) {
  if (version.empty()) {
    LOG_ERROR(L"systeminfo::GetFileInformation", L"Failed to get version for file %s", ToWide(path).c_str());
  }
  Json::Value record(Json::objectValue);
  record["path"] = path;
  record["md5"] = md5;
  record["version"] = version;
  return record;
}

}  // namespace

Json::Value GetFileInformation(const std::wstring& path) {
  const std::string utf8Path = ToUtf8(path);
  return FileRecord(utf8Path, utils::GetFileMD5(utf8Path), utils::GetFileVersion(path));
}

Json::Value GetProductFileInformation(const std::wstring& installFolder, const std::atomic<bool>* cancel) {
  std::vector<std::string> paths;
  const bool isWalked = WalkDir(installFolder, [&](const qx::PathString& path, uint32_t attributes) {
    const std::wstring_view text(path);
    const bool isProgram = text.ends_with(L".exe") || text.ends_with(L".dll");
    if (isProgram && (attributes & FILE_ATTRIBUTE_DIRECTORY) == 0) paths.push_back(ToUtf8(text));
    return IsCancelled(cancel) ? kWalkStop : kWalkContinue;
  });
  if (!isWalked) LOG_ERROR(L"systeminfo::GetProductFileInformation", L"WalkDir returned false");

  std::vector<std::string> versions(paths.size());  // each element is written by one thread only
  const std::vector<std::string> digests = utils::GetFileMD5s(
      paths, cancel, [&versions](size_t index, HANDLE file) { versions[index] = utils::GetFileVersion(file); });
  Json::Value records(Json::arrayValue);
  for (size_t i = 0; i < paths.size() && !IsCancelled(cancel); ++i)
    records.append(FileRecord(paths[i], digests[i], versions[i]));
  return records;
}

}  // namespace systeminfo
