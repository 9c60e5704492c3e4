#include "systeminfo/collecting_settings.h"

#include <gmock/gmock.h>

#include "core/logging.h"
#include "systeminfo/settings_document.h"
#include "tests/support/test_folder.h"

namespace systeminfo {
namespace {

using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;

// Makes a folder the current one while it lives.
class CurrentFolder {
 public:
  explicit CurrentFolder(const std::wstring& folder) {
    GetCurrentDirectoryW(MAX_PATH, m_before);
    EXPECT_TRUE(SetCurrentDirectoryW(folder.c_str()));
  }
  ~CurrentFolder() { SetCurrentDirectoryW(m_before); }
  CurrentFolder(const CurrentFolder&) = delete;
  CurrentFolder& operator=(const CurrentFolder&) = delete;

 private:
  wchar_t m_before[MAX_PATH] = {};
};

class SettingsFile : public testing::Test {
 protected:
  TestFolder m_folder;
  CurrentFolder m_current{m_folder.Path()};
  logging::ErrorCapture m_log{logging::Level::kWarning};
  CollectingSettings m_settings;
};

constexpr wchar_t kNoFile[] =
    L"systeminfo::CollectingSettings::LoadFromFile: No config file with name missing.json found";
constexpr wchar_t kNoDefaultFile[] = L"systeminfo::CollectingSettings::LoadFromFile: No default config file was found";

TEST_F(SettingsFile, GivenFileIsReadWhereverItIs) {
  const std::wstring path = m_folder.MakeFile(L"\u00e4 folder\\settings.json", R"({"pretty_print":true})");
  EXPECT_TRUE(m_settings.LoadFromFile(path));
  EXPECT_TRUE(m_settings.GetPrettyPrint());
  EXPECT_TRUE(m_settings.LoadFromFile(L"\u00e4 folder/settings.json"));
  EXPECT_THAT(m_log.Take(), IsEmpty());
}

TEST_F(SettingsFile, MissingFileFallsBackToTheDefaultFileOfTheCurrentFolder) {
  EXPECT_FALSE(m_settings.LoadFromFile(L"missing.json"));
  EXPECT_THAT(m_log.Take(), ElementsAre(kNoFile, kNoDefaultFile));

  m_folder.MakeFile(L"defaultCollectSystemInfoConfig.json", R"({"storage":true})");
  EXPECT_TRUE(m_settings.LoadFromFile(L"missing.json"));
  EXPECT_TRUE(m_settings.IsTrue(L"storage"));
  EXPECT_THAT(m_log.Take(), ElementsAre(kNoFile));
}

TEST_F(SettingsFile, FileThatIsNoSettingsDocumentIsAnErrorAndKeepsTheOldDocument) {
  m_folder.MakeFile(L"defaultCollectSystemInfoConfig.json", R"({"storage":true})");
  m_settings.SetValue(L"kept", 1);
  const std::string contents[] = {"", "{", "[]", "\xFF\xFE{", std::string(100'000, '[')};
  for (const std::string& content : contents) {
    EXPECT_FALSE(m_settings.LoadFromFile(m_folder.MakeFile(L"bad.json", content)));
    EXPECT_EQ(m_log.Take().size(), 1u) << content.substr(0, 20);
  }
  m_folder.MakeFile(L"bad.json", std::string(kLargestSettingsFile + 1, ' '));
  EXPECT_FALSE(m_settings.LoadFromFile(L"bad.json"));
  EXPECT_THAT(m_log.Take(),
              ElementsAre(L"systeminfo::CollectingSettings::LoadFromFile: Failed to read bad.json, error 223"));
  EXPECT_TRUE(m_settings.HasKey(L"kept"));
  EXPECT_FALSE(m_settings.HasKey(L"storage"));
}

TEST_F(SettingsFile, FileThatCannotBeOpenedSaysWhy) {
  EXPECT_FALSE(m_settings.LoadFromFile(m_folder.MakeFolder(L"a folder")));
  EXPECT_THAT(m_log.Take(), Contains(testing::EndsWith(L"a folder, error 5")));
}

TEST(CollectingSettings, KeysAreWideAndValuesOfAnyTypeAreSafeToAskFor) {
  CollectingSettings settings;
  std::wstring folder = L"before";
  EXPECT_FALSE(settings.HasKey(L"a"));
  EXPECT_TRUE(settings.GetValue(L"a").isNull());
  EXPECT_EQ(settings.GetOutputFolderValue(folder), OutputFolderStatus::kAbsent);

  settings.SetValue(L"\u00e4\U0001F600", Json::Value("x"));
  EXPECT_EQ(settings.GetValue(L"\u00e4\U0001F600"), "x");
  settings.SetValue(L"n", Json::Value());
  EXPECT_TRUE(settings.HasKey(L"n"));
  EXPECT_FALSE(settings.IsTrue(L"n"));

  settings.SetValue(L"output_folder", 5);
  EXPECT_EQ(settings.GetOutputFolderValue(folder), OutputFolderStatus::kNotString);
  EXPECT_EQ(folder, L"before");
  settings.SetValue(L"output_folder", "\xC3\xA4");
  EXPECT_EQ(settings.GetOutputFolderValue(folder), OutputFolderStatus::kFound);
  EXPECT_EQ(folder, L"\u00e4");
}

TEST(CollectingSettings, PrintWritesTheStyledDocument) {
  logging::ErrorCapture log(logging::Level::kTrace);
  CollectingSettings settings;
  settings.SetValue(L"a", 1);
  settings.Print();
  EXPECT_THAT(log.Take(), ElementsAre(L"systeminfo::CollectingSettings::Print: {\n   \"a\" : 1\n}\n"));
}

}  // namespace
}  // namespace systeminfo
