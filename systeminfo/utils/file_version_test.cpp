#include "systeminfo/utils/file_version.h"

#include <windows.h>

#include <gtest/gtest.h>

#include "tests/support/test_folder.h"

namespace systeminfo::utils {
namespace {

std::string Bytes(const VS_FIXEDFILEINFO& info) {
  return {reinterpret_cast<const char*>(&info), sizeof info};
}

TEST(FixedInfoVersion, FourWordsHighOneFirst) {
  VS_FIXEDFILEINFO info{};
  info.dwSignature = 0xFEEF04BD;
  info.dwFileVersionMS = 0x000A'FFFF;
  info.dwFileVersionLS = 0x47BA'0000;
  info.dwProductVersionMS = 1;
  EXPECT_EQ(FixedInfoVersion(Bytes(info)), "10.65535.18362.0");
  EXPECT_EQ(FixedInfoVersion(Bytes(info).substr(1)), "");
  EXPECT_EQ(FixedInfoVersion({}), "");
  info.dwSignature = 0xFEEF04BE;
  EXPECT_EQ(FixedInfoVersion(Bytes(info)), "");
}

TEST(FileVersion, KernelLibraryHasTheVersionOfItsResource) {
  wchar_t path[MAX_PATH] = {};
  ASSERT_NE(GetSystemDirectoryW(path, MAX_PATH), 0u);
  const std::string version = GetFileVersion(std::wstring(path) + L"\\kernel32.dll");
  unsigned major = 0;
  unsigned minor = 0;
  unsigned build = 0;
  unsigned revision = 0;
  char rest = 0;
  EXPECT_EQ(std::sscanf(version.c_str(), "%u.%u.%u.%u%c", &major, &minor, &build, &revision, &rest), 4) << version;
  EXPECT_GE(major, 6u);
}

TEST(FileVersion, FilesWithoutAVersionHaveAnEmptyOneAndAnErrorCode) {
  const TestFolder folder;
  for (const std::wstring& path : {folder.MakeFile(L"text.dll", "no library"), folder.MakeFile(L"cut.exe", "MZ"),
                                   folder.Path(L"absent.exe"), folder.Path(), std::wstring()}) {
    SetLastError(ERROR_SUCCESS);
    EXPECT_EQ(GetFileVersion(path), "");
    EXPECT_NE(GetLastError(), static_cast<DWORD>(ERROR_SUCCESS)) << std::string(path.begin(), path.end());
  }
}

}  // namespace
}  // namespace systeminfo::utils
