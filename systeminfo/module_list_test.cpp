#include "systeminfo/module_list.h"

#include <gmock/gmock.h>

#include "core/logging.h"
#include "core/text.h"
#include "tests/support/process_child.h"

namespace systeminfo {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

std::vector<std::wstring> ModulesOf(const ModulesHelper& helper, DWORD processId) {
  std::vector<std::wstring> modules;
  helper.GetModulesForProcess(processId, modules);
  return modules;
}

TEST(ModuleList, ModulesOfAnotherProcessAreThoseItHasInTheirOrder) {
  ProcessChild child;
  std::vector<std::string> modules;
  for (const std::wstring& path : ModulesOf(ModulesHelper(), child.processId))
    modules.push_back(ToUtf8(path));
  EXPECT_EQ(modules, child.modules);
  EXPECT_EQ(modules.at(0), ToUtf8(ProcessChild::Path()));
  child.Kill();
  EXPECT_THAT(ModulesOf(ModulesHelper(), child.processId), IsEmpty());
}

TEST(ModuleList, OldLibraryServesAndMoreModulesThanTheBufferHoldsAreAllListed) {
  const ModulesHelper helper(L"fake_psapi.dll");
  const auto modules = ModulesOf(helper, GetCurrentProcessId());
  ASSERT_EQ(modules.size(), 1499u) << "of 1500, one has no name";
  EXPECT_EQ(modules[6], L"g");
  EXPECT_EQ(modules[7], L"i");
  EXPECT_EQ(modules[1498], std::wstring(1, L'a' + 1499 % 26));
}

TEST(ModuleList, InsaneHelperSaysSoAndLeavesTheListAlone) {
  const struct {
    const wchar_t* library;
    const wchar_t* reason;
  } rows[] = {
      {L"st_absent.dll", L"Can't load psapi.dll"},
      {L"version.dll", L"GetProcAddress(EnumProcessModules)"},
      {L"fake_psapi_bare.dll", L"GetProcAddress(GetModuleFileNameExW)"},
  };
  for (const auto& row : rows) {
    logging::ErrorCapture capture(logging::Level::kTrace);
    const ModulesHelper helper(row.library);
    std::vector<std::wstring> modules = {L"kept"};
    helper.GetModulesForProcess(GetCurrentProcessId(), modules);
    EXPECT_THAT(modules, ElementsAre(L"kept"));
    EXPECT_THAT(capture.Take(),
                ElementsAre(std::wstring(L"systeminfo::ModulesHelper::ModulesHelper: ") + row.reason,
                            L"systeminfo::ModulesHelper::GetModulesForProcess: this class is not in a sane state"));
  }
}

}  // namespace
}  // namespace systeminfo
