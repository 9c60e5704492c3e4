// The resources of the built program, which lies beside this test.
#include <windows.h>

#include <gtest/gtest.h>

#include <string_view>

#include "core/program_path.h"
#include "core/scoped.h"

namespace {

std::string_view Resource(const ScopedModule& program, const wchar_t* type, int id) {
  const HRSRC found = FindResourceW(program.Get(), MAKEINTRESOURCEW(id), type);
  if (found == nullptr) return {};
  return {static_cast<const char*>(LockResource(LoadResource(program.Get(), found))),
          SizeofResource(program.Get(), found)};
}

}  // namespace

TEST(Resources, ProgramCarriesItsIconItsManifestAndItsVersion) {
  const ScopedModule program(LoadLibraryExW((ProgramFolder() + L"\\support_tool.exe").c_str(), nullptr,
                                            LOAD_LIBRARY_AS_DATAFILE | LOAD_LIBRARY_AS_IMAGE_RESOURCE));
  ASSERT_TRUE(program) << GetLastError();
  EXPECT_FALSE(Resource(program, RT_GROUP_ICON, 102).empty());
  const std::string_view manifest = Resource(program, RT_MANIFEST, 1);
  for (const char* text : {"asInvoker", "longPathAware", "PerMonitorV2", "Microsoft.Windows.Common-Controls",
                           "{8e0f7a12-bfb3-4fe8-b9a5-48fd50a15a9a}"}) {
    EXPECT_NE(manifest.find(text), std::string_view::npos) << text;
  }
  EXPECT_EQ(manifest.find("activeCodePage"), std::string_view::npos);
  const std::string_view version = Resource(program, RT_VERSION, VS_VERSION_INFO);
  const std::wstring_view product(L"ProductName\0\0Quorvex Support Tool", 33);
  EXPECT_NE(version.find({reinterpret_cast<const char*>(product.data()), product.size() * sizeof(wchar_t)}),
            std::string_view::npos);
}
