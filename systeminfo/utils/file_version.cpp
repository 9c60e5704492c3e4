#include "systeminfo/utils/file_version.h"

#include <windows.h>

#include <cstring>
#include <vector>

#include "core/files.h"

namespace systeminfo::utils {

std::string FixedInfoVersion(std::string_view fixedInfo) {
  VS_FIXEDFILEINFO info;
  if (fixedInfo.size() < sizeof info) return {};
  std::memcpy(&info, fixedInfo.data(), sizeof info);
  if (info.dwSignature != VS_FFI_SIGNATURE) return {};
  std::string version;
  for (const WORD number : {HIWORD(info.dwFileVersionMS), LOWORD(info.dwFileVersionMS), HIWORD(info.dwFileVersionLS),
                            LOWORD(info.dwFileVersionLS)}) {
    if (!version.empty()) version += '.';
    version += std::to_string(number);
  }
  return version;
}

std::string GetFileVersion(std::wstring_view path) {
  const std::wstring extended = ExtendedPath(path);
  DWORD ignored = 0;
  const DWORD size = GetFileVersionInfoSizeW(extended.c_str(), &ignored);
  if (size == 0) return {};
  std::vector<char> resource(size);
  if (!GetFileVersionInfoW(extended.c_str(), 0, size, resource.data())) return {};
  void* block = nullptr;
  UINT length = 0;
  SetLastError(ERROR_RESOURCE_DATA_NOT_FOUND);
  if (!VerQueryValueW(resource.data(), L"\\", &block, &length) || block == nullptr) return {};
  std::string version = FixedInfoVersion({static_cast<const char*>(block), length});
  if (version.empty()) SetLastError(ERROR_RESOURCE_DATA_NOT_FOUND);
  return version;
}

}  // namespace systeminfo::utils
