#include "systeminfo/utils/version_resource.h"

#include <windows.h>

#include <gtest/gtest.h>

#include "core/files.h"
#include "core/paths.h"
#include "core/program_path.h"
#include "systeminfo/utils/file_version.h"

namespace systeminfo::utils {
namespace {

std::string VersionIn(const std::string& file) {
  return FixedInfoVersion(FindFixedVersionInfo([&file](uint64_t offset, size_t size, std::string& bytes) {
    if (offset > file.size() || size > file.size() - offset) return false;
    bytes = file.substr(static_cast<size_t>(offset), size);
    return true;
  }));
}

std::string ReadFileAt(const std::wstring& path) {
  std::string bytes;
  EXPECT_EQ(ReadWholeFile(path, 1 << 28, bytes), ERROR_SUCCESS);
  return bytes;
}

// As the system's own functions say it.
std::string SystemVersion(const std::wstring& path) {
  DWORD ignored = 0;
  std::string resource(GetFileVersionInfoSizeW(path.c_str(), &ignored), '\0');
  void* block = nullptr;
  UINT length = 0;
  EXPECT_TRUE(GetFileVersionInfoW(path.c_str(), 0, static_cast<DWORD>(resource.size()), resource.data()) &&
              VerQueryValueW(resource.data(), L"\\", &block, &length));
  return FixedInfoVersion({static_cast<const char*>(block), length});
}

const std::wstring& PartPath() {
  static const std::wstring s_path(JoinPath(ProgramFolder(), L"product_part.dll"));
  return s_path;
}

TEST(VersionResource, IsWhatTheSystemFinds) {
  wchar_t folder[MAX_PATH] = {};
  ASSERT_NE(GetSystemDirectoryW(folder, MAX_PATH), 0u);
  for (const wchar_t* name : {L"kernel32.dll", L"user32.dll", L"advapi32.dll"}) {
    const std::wstring path(JoinPath(folder, name));
    EXPECT_EQ(VersionIn(ReadFileAt(path)), SystemVersion(path)) << std::string(path.begin(), path.end());
  }
  EXPECT_EQ(VersionIn(ReadFileAt(PartPath())), "4.30.65535.1");
  EXPECT_EQ(SystemVersion(PartPath()), "4.30.65535.1");
}

TEST(VersionResource, FileThatEndsEarlyHasNone) {
  const std::string whole = ReadFileAt(PartPath());
  std::string version = VersionIn(whole);
  size_t versions = 0;
  for (size_t size = 0; size < whole.size(); size += size < 4096 ? 1 : 97) {
    const std::string cut = VersionIn(whole.substr(0, size));
    EXPECT_TRUE(cut.empty() || cut == version) << size;
    versions += cut.empty() ? 0 : 1;
  }
  EXPECT_GT(versions, 0u) << "what follows the resources does not matter";
}

TEST(VersionResource, DamagedFilesDoNoHarm) {
  const std::string whole = ReadFileAt(PartPath());
  const size_t resources = whole.find(std::string("V\0S\0_\0V\0E\0R\0", 12));
  ASSERT_NE(resources, std::string::npos);
  const std::pair<size_t, size_t> ranges[] = {{0, 1024}, {resources - 600, resources + 100}};  // headers, resources
  for (const auto& [begin, end] : ranges) {
    for (size_t at = begin; at < end; ++at) {
      for (const char damage : {'\0', '\x7F', '\xFF'}) {
        std::string damaged = whole;
        damaged[at] = damage;
        VersionIn(damaged);  // whatever it says: it ends, and reads nothing that is not there
      }
    }
  }
  std::string noSignature = whole;
  noSignature[resources + 34] = '\0';
  EXPECT_EQ(VersionIn(noSignature), "");
}

}  // namespace
}  // namespace systeminfo::utils
