#include "systeminfo/utils/registry_key.h"

#include <gmock/gmock.h>

#include <map>

#include "core/format.h"
#include "core/logging.h"
#include "tests/support/test_registry.h"

namespace utils {
namespace {

using testing::ElementsAre;
using testing::UnorderedElementsAre;

std::vector<std::wstring> Subkeys(const RegistryKey& key) {
  std::vector<std::wstring> names;
  key.WalkSubkeys([&](const std::wstring& name) {
    names.push_back(name);
    return true;
  });
  return names;
}

TEST(RegistryKey, HivesAreMatchedExactly) {
  for (const wchar_t* path :
       {L"HKEY_CLASSES_ROOT", L"HKCR\\", L"HKEY_CURRENT_USER\\Software", L"HKCU\\SOFTWARE", L"HKEY_LOCAL_MACHINE",
        L"HKLM\\Software\\Microsoft", L"HKEY_USERS", L"HKEY_CURRENT_CONFIG", L"HKCC"}) {
    EXPECT_TRUE(RegistryKey(path)) << path;
  }
  for (const wchar_t* path : {L"", L"\\", L"HKU\\Software", L"hklm\\Software", L"HKLM/Software", L" HKLM\\Software",
                              L"HKLMX\\Software", L"\\HKLM\\Software", L"Software", L"HKEY_USER"}) {
    EXPECT_EQ(RegistryKey(path).OpenError(), DWORD{ERROR_INVALID_NAME}) << path;
  }
  EXPECT_EQ(RegistryKey(L"HKCU\\Software\\st_test_absent").OpenError(), DWORD{ERROR_FILE_NOT_FOUND});
  EXPECT_FALSE(RegistryKey(std::wstring_view(L"HKCU\\Software\0x", 15)));
}

TEST(RegistryKey, AKeyThatIsNotOpenHasNothingAndLogsNothing) {
  logging::ErrorCapture log(logging::Level::kTrace);
  const RegistryKey key(L"HKCU\\Software\\st_test_absent");
  EXPECT_TRUE(key.GetValues().empty());
  EXPECT_FALSE(key.GetValue(L"x"));
  EXPECT_TRUE(Subkeys(key).empty());
  EXPECT_FALSE(key.OpenSubkey(L"x"));
  EXPECT_FALSE(key.IsLink(L"x"));
  EXPECT_TRUE(log.Take().empty());
}

TEST(RegistryKey, ValuesComeWithLowerCaseNamesAndTheBytesAsStored) {
  const TestRegistryKey test;
  const std::string megabyte(1 << 20, 'm');
  test.SetText({}, L"DisplayName", L"S\x00FC\x6771");
  test.SetText({}, L"", L"default");
  test.SetNumber({}, L"\x00C4Number", 0xFFFFFFFF);
  test.SetValue({}, L"Big", REG_BINARY, megabyte);
  test.SetValue({}, L"Odd", 99, "abc");
  test.SetValue({}, L"Empty", REG_BINARY, {});
  test.SetText({}, std::wstring(16383, L'N'), L"longest name");

  std::map<std::wstring, RegistryValue> values;
  for (RegistryValue& value : RegistryKey(test.Path()).GetValues())
    values[value.name] = value;
  EXPECT_EQ(values.size(), 7u);
  EXPECT_EQ(ValueText(values[L"displayname"]), L"S\x00FC\x6771");
  EXPECT_EQ(ValueText(values[L""]), L"default");
  EXPECT_EQ(ValueText(values[L"\x00C4number"]), L"4294967295");
  EXPECT_EQ(values[L"big"].data, megabyte);
  EXPECT_EQ(values[L"odd"].type, 99u);
  EXPECT_EQ(values[L"odd"].data, "abc");
  EXPECT_EQ(values[L"empty"].data, "");
  EXPECT_EQ(ValueText(values[std::wstring(16383, L'n')]), L"longest name");
}

TEST(RegistryKey, OneValueIsFoundInAnyCaseAndWhateverItsSize) {
  const TestRegistryKey test;
  test.SetText({}, L"DisplayName", L"x");
  test.SetText({}, L"", L"default");
  for (const size_t size : {0, 255, 256, 257, 1 << 20})
    test.SetValue({}, Format(L"%u", static_cast<unsigned>(size)), REG_BINARY, std::string(size, 's'));
  const RegistryKey key(test.Path());
  EXPECT_EQ(key.GetValue(L"DISPLAYNAME")->name, L"displayname");
  EXPECT_EQ(ValueText(*key.GetValue(L"")), L"default");
  for (const size_t size : {0, 255, 256, 257, 1 << 20})
    EXPECT_EQ(key.GetValue(Format(L"%u", static_cast<unsigned>(size)))->data, std::string(size, 's'));
  EXPECT_FALSE(key.GetValue(L"absent"));
  EXPECT_FALSE(key.GetValue(std::wstring_view(L"displayname\0", 12)));
}

TEST(RegistryKey, SubkeysAreWalkedAndOpenedUntilTheCallbackHasEnough) {
  const TestRegistryKey test;
  for (const wchar_t* name : {L"First", L"\x00FC\x6771", L"Third\\Below"})
    test.MakeKey(name);
  test.MakeKey(std::wstring(255, L'k'));  // as long as a name may be
  const RegistryKey key(test.Path());
  EXPECT_THAT(Subkeys(key), UnorderedElementsAre(L"First", L"\x00FC\x6771", L"Third", std::wstring(255, L'k')));
  EXPECT_THAT(Subkeys(key.OpenSubkey(L"Third")), ElementsAre(L"Below"));
  EXPECT_FALSE(key.OpenSubkey(L"Below"));

  int calls = 0;
  key.WalkSubkeys([&](const std::wstring&) { return ++calls < 2; });
  EXPECT_EQ(calls, 2);
  key.WalkSubkeys([&](const std::wstring& name) {
    RegDeleteTreeW(HKEY_CURRENT_USER, (test.PathBelowHive() + L"\\" + name).c_str());
    return true;
  });
  EXPECT_TRUE(Subkeys(key).empty());
}

TEST(RegistryKey, ADeletedKeyFailsWithALogLine) {
  const TestRegistryKey test;
  test.SetText(L"Gone", L"x", L"x");
  const RegistryKey key(test.Path(L"Gone"));
  RegDeleteKeyW(HKEY_CURRENT_USER, (test.PathBelowHive() + L"\\Gone").c_str());
  logging::ErrorCapture log;
  EXPECT_TRUE(key.GetValues().empty());
  EXPECT_TRUE(Subkeys(key).empty());
  EXPECT_FALSE(key.GetValue(L"x"));
  EXPECT_THAT(log.Take(), ElementsAre(L"utils::RegistryKey::GetValues: RegQueryInfoKey failed with 1018",
                                      L"utils::RegistryKey::WalkSubkeys: RegEnumKeyEx failed with code 1018",
                                      L"utils::RegistryKey::GetValue: RegQueryValueEx of x failed with code 1018"));
}

TEST(RegistryKey, The32BitViewIsWow6432Node) {
  const auto path = [](const wchar_t* part) { return L"HKLM\\Software\\" + std::wstring(part); };
  const RegistryKey view(path(L"Microsoft"), RegistryView::k32Bit);
  EXPECT_EQ(Subkeys(view), Subkeys(RegistryKey(path(L"Wow6432Node\\Microsoft"))));
  EXPECT_NE(Subkeys(view), Subkeys(RegistryKey(path(L"Microsoft"), RegistryView::k64Bit)));
  EXPECT_EQ(Subkeys(RegistryKey(path(L"Microsoft"))), Subkeys(RegistryKey(path(L"Microsoft"), RegistryView::k64Bit)));
}

}  // namespace
}  // namespace utils
