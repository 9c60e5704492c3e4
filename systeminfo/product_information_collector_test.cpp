#include "systeminfo/product_information_collector.h"

#include <gmock/gmock.h>
#include <json/writer.h>

#include <map>

#include "core/files.h"
#include "core/logging.h"
#include "core/paths.h"
#include "core/program_path.h"
#include "core/text.h"
#include "systeminfo/collecting_settings.h"
#include "systeminfo/product_files.h"
#include "systeminfo/product_location.h"
#include "systeminfo/product_settings.h"
#include "tests/support/scan_cache_file.h"
#include "tests/support/test_folder.h"
#include "tests/support/test_registry.h"

namespace systeminfo {
namespace {

using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;

constexpr wchar_t kUninstall[] = L"machine\\Software\\Microsoft\\Windows\\CurrentVersion\\Uninstall\\";

TEST(ClassifyUninstallEntry, NeedsThePublisherAndAnAbsoluteLocation) {
  struct {
    Json::Value publisher;
    Json::Value location;
    UninstallEntry expected;
  } const rows[] = {
      {"Quorvex", "C:\\Product", UninstallEntry::kProduct},
      {"Quorvex", "\\\\server\\product", UninstallEntry::kProduct},
      {"Quorvex", Json::Value(), UninstallEntry::kProductWithoutLocation},
      {"Quorvex", "", UninstallEntry::kProductWithoutLocation},
      {"Quorvex", "Product", UninstallEntry::kProductWithoutLocation},
      {"Quorvex", "5", UninstallEntry::kProductWithoutLocation},
      {"Quorvex", 5, UninstallEntry::kProductWithoutLocation},
      {"quorvex", "C:\\Product", UninstallEntry::kOther},
      {"Quorvex Ltd", "C:\\Product", UninstallEntry::kOther},
      {"", "C:\\Product", UninstallEntry::kOther},
      {Json::Value(), "C:\\Product", UninstallEntry::kOther},
  };
  for (const auto& row : rows) {
    Json::Value values;
    values["publisher"] = row.publisher;
    values["installlocation"] = row.location;
    EXPECT_EQ(ClassifyUninstallEntry(values), row.expected) << values;
  }
  EXPECT_EQ(ClassifyUninstallEntry(Json::Value(Json::objectValue)), UninstallEntry::kOther);
}

std::string PartBytes() {
  std::string bytes;
  EXPECT_EQ(ReadWholeFile(JoinPath(ProgramFolder(), L"product_part.dll"), 1 << 28, bytes), ERROR_SUCCESS);
  return bytes;
}

TEST(ProductFiles, ProgramsAndLibrariesOfTheWholeTreeAreDescribed) {
  const TestFolder folder;
  const std::string part = PartBytes();
  folder.MakeFile(L"part.dll", part);
  folder.MakeFile(L"deep\\er \u6771\\tool.exe", "abc");
  // Cut behind its headers: the section with the version is gone.
  folder.MakeFile(L"cut.dll", part.substr(0, 1500));
  for (const wchar_t* other : {L"a.EXE", L"b.Dll", L"c.exe.txt", L"exe", L"d.sys"})
    folder.MakeFile(other, "x");
  folder.MakeFolder(L"folder.exe");

  logging::ErrorCapture errors;
  const Json::Value records = GetProductFileInformation(folder.Path());
  std::map<std::string, Json::Value> byPath;
  for (const Json::Value& record : records)
    byPath[record["path"].asString()] = record;
  ASSERT_EQ(records.size(), 3u) << records;
  const Json::Value& library = byPath[ToUtf8(folder.Path(L"part.dll"))];
  EXPECT_EQ(library["version"], "4.30.65535.1");
  EXPECT_EQ(library["md5"].asString().size(), 32u);
  EXPECT_EQ(library, GetFileInformation(folder.Path(L"part.dll")));
  const Json::Value& tool = byPath[ToUtf8(folder.Path(L"deep\\er \u6771\\tool.exe"))];
  EXPECT_EQ(tool["md5"], "900150983cd24fb0d6963f7d28e17f72");
  EXPECT_EQ(tool["version"], "");
  EXPECT_EQ(byPath[ToUtf8(folder.Path(L"cut.dll"))]["version"], "");
  EXPECT_THAT(errors.Take(),
              testing::UnorderedElementsAre(HasSubstr(L"Failed to get version for file " + folder.Path(L"cut.dll")),
                                            HasSubstr(L"Failed to get version for file ")));

  const Json::Value absent = GetFileInformation(folder.Path(L"absent.exe"));
  EXPECT_EQ(absent["md5"], "");
  EXPECT_EQ(absent.size(), 3u);
  errors.Take();
  EXPECT_EQ(GetProductFileInformation(folder.Path(L"absent")), Json::Value(Json::arrayValue));
  EXPECT_THAT(errors.Take(), ElementsAre(L"systeminfo::GetProductFileInformation: WalkDir returned false"));
}

TEST(GetLastUpdate, FailuresAreAnEmptyObjectAndALogLine) {
  const TestFolder folder;
  const auto linesOfRun = [&] {
    logging::ErrorCapture errors;
    EXPECT_EQ(GetLastUpdate(folder.Path()), Json::Value(Json::objectValue));
    return errors.Take();
  };
  const std::wstring scope = L"systeminfo::GetLastUpdate: ";
  const std::wstring path = folder.Path(L"update_statistics.xml");
  EXPECT_THAT(linesOfRun(), ElementsAre(scope + L"Can not find update_statistics.xml"));
  folder.MakeFile(L"update_statistics.xml", "<UpdateStatistics");
  EXPECT_THAT(linesOfRun(), ElementsAre(scope + L"Can't load update statistics from " + path));
  folder.MakeFile(L"update_statistics.xml", "<UpdateStatistics>" + std::string(50 << 20, ' ') + "</UpdateStatistics>");
  EXPECT_THAT(linesOfRun(), ElementsAre(scope + L"Can't load update statistics from " + path));
  folder.MakeFile(L"update_statistics.xml", "<Settings/>");
  EXPECT_THAT(linesOfRun(), ElementsAre(scope + L"Invalid update_settings xml file " + path));
  folder.MakeFile(L"update_statistics.xml", "<UpdateStatistics><a/></UpdateStatistics>");
  EXPECT_THAT(linesOfRun(), ElementsAre(scope + L"Invalid element"));
}

class ProductInformationTest : public testing::Test {
 protected:
  // What the collector gathers while HKEY_LOCAL_MACHINE is a key of the test.
  Json::Value Collect(const Json::Value& outputFolder, const std::atomic<bool>* cancel = nullptr) {
    const RedirectedHive machine(HKEY_LOCAL_MACHINE, m_registry.MakeKey(L"machine"));
    const auto settings = std::make_shared<CollectingSettings>();
    settings->SetValue(L"product_information", true);
    if (!outputFolder.isNull()) settings->SetValue(L"output_folder", outputFolder);
    ProductInformationCollector collector(L"product_information");
    logging::ErrorCapture lines(logging::Level::kWarning);
    collector.Start(settings, nullptr, cancel);
    m_lines = lines.Take();
    return collector.GetData();
  }

  void AddProduct(const std::wstring& key, const std::wstring& location) {
    m_registry.SetText(kUninstall + key, L"Publisher", L"Quorvex");
    m_registry.SetText(kUninstall + key, L"InstallLocation", location);
  }

  TestFolder m_folder;
  TestRegistryKey m_registry;
  std::vector<std::wstring> m_lines;
};

TEST_F(ProductInformationTest, WithoutAProductThereIsNoDocument) {
  const std::wstring notFound = L"systeminfo::ProductInformationCollector::Start: No installed product was found";
  EXPECT_TRUE(Collect(ToUtf8(m_folder.Path())).isNull());
  EXPECT_THAT(m_lines, ElementsAre(L"systeminfo::GetProductInstallLocation: Could not find Installed product uninstall "
                                   L"key in registry",
                                   notFound));
  m_registry.SetText(std::wstring(kUninstall) + L"other", L"Publisher", L"Other");
  m_registry.SetText(std::wstring(kUninstall) + L"patch", L"Publisher", L"Quorvex");
  EXPECT_TRUE(Collect(ToUtf8(m_folder.Path())).isNull());
  EXPECT_THAT(m_lines,
              ElementsAre(L"systeminfo::GetProductInstallLocation: Found key with publisher QX, but no install "
                          L"location",
                          notFound));
  AddProduct(L"product", m_folder.Path(L"absent"));
  EXPECT_TRUE(Collect(ToUtf8(m_folder.Path())).isNull());
  EXPECT_THAT(m_lines, Contains(notFound));
  EXPECT_FALSE(PathExists(m_folder.Path(L"log_folders_considered.json")));
}

TEST_F(ProductInformationTest, FirstEntryWithALocationIsDescribedCompletely) {
  const std::wstring product = m_folder.MakeFolder(L"product");
  m_registry.SetValue(std::wstring(kUninstall) + L"a", L"Publisher", REG_BINARY, "Quorvex");
  m_registry.SetText(std::wstring(kUninstall) + L"b", L"Publisher", L"Quorvex");
  m_registry.SetNumber(std::wstring(kUninstall) + L"b", L"InstallLocation", 5);
  AddProduct(L"c", product);
  AddProduct(L"d", m_folder.Path(L"absent"));
  m_folder.MakeFile(L"product\\tool.exe", "abc");
  m_folder.MakeFile(L"product\\update_statistics.xml",
                    "<UpdateStatistics><S><Check time='1'/><Update time='2'/></S></UpdateStatistics>");
  m_folder.MakeFile(L"product\\ThreatScanner\\smartdb-ntfs.db", scan_cache_file::FileBytes(1, {ScanCacheRecord()}));

  EXPECT_TRUE(Collect(Json::Value()).isNull());
  EXPECT_THAT(m_lines, Contains(HasSubstr(L"ouput_folder is not set in collector product_information")));

  const Json::Value data = Collect(ToUtf8(m_folder.MakeFolder(L"collected")));
  EXPECT_THAT(data.getMemberNames(), ElementsAre("file_information", "install_location", "last_update", "smart_db"));
  EXPECT_EQ(data["install_location"], ToUtf8(product));
  ASSERT_EQ(data["file_information"].size(), 1u);
  EXPECT_EQ(data["file_information"][0]["md5"], "900150983cd24fb0d6963f7d28e17f72");
  EXPECT_EQ(data["last_update"]["S"]["update"]["time"], "2");
  EXPECT_EQ(data["smart_db"].size(), 1u);
  EXPECT_TRUE(PathExists(m_folder.Path(L"collected\\log_folders_considered.json")));

  const std::atomic<bool> cancelled = true;
  const Json::Value little = Collect(ToUtf8(m_folder.Path(L"collected")), &cancelled);
  EXPECT_EQ(little["file_information"].size() + little["smart_db"].size(), 0u);
}

}  // namespace
}  // namespace systeminfo
