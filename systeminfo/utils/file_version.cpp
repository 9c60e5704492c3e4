#include "systeminfo/utils/file_version.h"

#include <windows.h>

#include <algorithm>
#include <cstring>

#include "core/files.h"
#include "core/scoped.h"
#include "systeminfo/utils/version_resource.h"

namespace systeminfo::utils {
namespace {

// Small pieces of a file, which mostly lie close together.
class FilePieces {
 public:
  explicit FilePieces(HANDLE file) : m_file(file) {}

  bool Read(uint64_t offset, size_t size, std::string& bytes) {
    const bool isHeld = offset >= m_offset && offset - m_offset <= m_window.size() &&
                        size <= m_window.size() - static_cast<size_t>(offset - m_offset);
    if (!isHeld && !Fill(offset, size)) return false;
    bytes.assign(m_window, static_cast<size_t>(offset - m_offset), size);
    return true;
  }

 private:
  bool Fill(uint64_t offset, size_t size) {
    constexpr size_t kWindow = size_t{16} << 10;
    LARGE_INTEGER position{};
    position.QuadPart = static_cast<LONGLONG>(offset);
    m_offset = offset;
    m_window.clear();
    return SetFilePointerEx(m_file, position, nullptr, FILE_BEGIN) &&
           ReadBytes(m_file, std::max(size, kWindow), m_window) == ERROR_SUCCESS && m_window.size() >= size;
  }

  const HANDLE m_file;
  uint64_t m_offset = 0;
  std::string m_window;  // the bytes of the file from there on
};

}  // namespace

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
  const KernelHandle file = OpenForReading(path);
  return file ? GetFileVersion(file.Get()) : std::string();
}

std::string GetFileVersion(HANDLE file) {
  FilePieces pieces(file);
  SetLastError(ERROR_RESOURCE_DATA_NOT_FOUND);
  return FixedInfoVersion(FindFixedVersionInfo(
      [&pieces](uint64_t offset, size_t size, std::string& bytes) { return pieces.Read(offset, size, bytes); }));
}

}  // namespace systeminfo::utils
