#include "systeminfo/utils/registry_json.h"

#include <gmock/gmock.h>

#include "core/dynamic_library.h"
#include "core/logging.h"
#include "tests/support/test_registry.h"

namespace utils {
namespace {

using namespace std::string_literals;
using testing::ElementsAre;
using testing::HasSubstr;

TEST(RegistryJson, ADumpHoldsValuesAndSubkeysAndNoEmptyMembers) {
  const TestRegistryKey test;
  test.SetText({}, L"Text", L"top");
  test.SetText({}, L"Path", L"%st_test_absent%\\x", REG_EXPAND_SZ);
  test.SetValue(L"Full\\Deep", L"Bytes", REG_BINARY, "\x0A\xFF");
  test.SetValue(L"Full\\Deep", L"", REG_MULTI_SZ, "a\0\0\0\0\0"s);
  test.MakeKey(L"Empty");

  Json::Value expected;
  expected["values"]["text"] = "top";
  expected["values"]["path"] = "%st_test_absent%\\x";
  expected["subkeys"]["Full"]["subkeys"]["Deep"]["values"]["bytes"] = "aff";
  expected["subkeys"]["Full"]["subkeys"]["Deep"]["values"][""] = "a   ";
  expected["subkeys"]["Empty"] = Json::objectValue;
  EXPECT_EQ(DumpKey(RegistryKey(test.Path()), nullptr), expected);
  EXPECT_EQ(ValuesAsJson(RegistryKey(test.Path())), expected["values"]);
  EXPECT_EQ(ValuesAsJson(RegistryKey(L"HKLM\\absent")), Json::Value(Json::objectValue));
}

TEST(RegistryJson, TenThousandValuesAreAllThere) {
  const TestRegistryKey test;
  constexpr int kCount = 10'000;
  const RegistryKeyHandle key = test.MakeKey({});
  for (int i = 0; i < kCount; ++i)
    RegSetValueExW(key.Get(), std::to_wstring(i).c_str(), 0, REG_DWORD, reinterpret_cast<const BYTE*>(&i), sizeof i);
  const Json::Value values = DumpKey(RegistryKey(test.Path()), nullptr)["values"];
  ASSERT_EQ(values.size(), unsigned{kCount});
  for (int i = 0; i < kCount; ++i)
    ASSERT_EQ(values[std::to_string(i)], std::to_string(i));
}

TEST(RegistryJson, ADumpThatIsCancelledEndsBeforeTheNextSubkey) {
  const TestRegistryKey test;
  test.SetText(L"Sub", L"x", L"x");
  test.SetText({}, L"x", L"x");
  const std::atomic<bool> cancel{true};
  const Json::Value dump = DumpKey(RegistryKey(test.Path()), &cancel);
  EXPECT_TRUE(dump.isMember("values"));
  EXPECT_FALSE(dump.isMember("subkeys"));
}

TEST(RegistryJson, ATreeDeeperThanAReaderTakesIsCutWithAWarning) {
  const TestRegistryKey test;
  RegistryKeyHandle key = test.MakeKey({});
  for (int i = 0; i < kDeepestDump + 5; ++i) {
    RegistryKeyHandle below;
    ASSERT_EQ(RegCreateKeyExW(key.Get(), L"d", 0, nullptr, 0, KEY_ALL_ACCESS, nullptr, below.Receive(), nullptr), 0);
    key = std::move(below);
  }
  logging::ErrorCapture log(logging::Level::kWarning);
  const Json::Value dump = DumpKey(RegistryKey(test.Path()), nullptr);
  int depth = 0;
  for (const Json::Value* level = &dump; level->isMember("subkeys"); level = &(*level)["subkeys"]["d"])
    ++depth;
  EXPECT_EQ(depth, kDeepestDump);
  EXPECT_THAT(log.Take(), ElementsAre(HasSubstr(L"The subkeys of a key 480 levels down are left out")));
}

// A link that leads to the key that holds it.
TEST(RegistryJson, LinksInACircleAreFollowedOnce) {
  const TestRegistryKey test;
  test.SetText({}, L"x", L"here");
  const RegistryKeyHandle link = test.MakeKey(L"Link", REG_OPTION_CREATE_LINK | REG_OPTION_VOLATILE);
  const DynamicLibrary ntdll(L"ntdll.dll");
  const auto queryKey = ntdll.Resolve<LONG(WINAPI*)(HANDLE, int, void*, ULONG, ULONG*)>("NtQueryKey");
  const auto deleteKey = ntdll.Resolve<LONG(WINAPI*)(HANDLE)>("NtDeleteKey");
  constexpr int kNameInformation = 3;  // a length in bytes, then the full name
  wchar_t name[512] = {};
  ULONG size = 0;
  ASSERT_EQ(queryKey(test.MakeKey({}).Get(), kNameInformation, name, sizeof name, &size), 0);
  const std::wstring_view target(name + 2, (size - 4) / sizeof(wchar_t));
  const std::string_view bytes = TestRegistryKey::Bytes(target);
  ASSERT_EQ(RegSetValueExW(link.Get(), L"SymbolicLinkValue", 0, REG_LINK, reinterpret_cast<const BYTE*>(bytes.data()),
                           static_cast<DWORD>(bytes.size())),
            0);

  Json::Value expected;
  expected["values"]["x"] = "here";
  expected["subkeys"]["Link"]["values"]["x"] = "here";
  EXPECT_TRUE(RegistryKey(test.Path()).IsLink(L"Link"));
  EXPECT_EQ(DumpKey(RegistryKey(test.Path()), nullptr), expected);
  deleteKey(link.Get());
}

}  // namespace
}  // namespace utils
