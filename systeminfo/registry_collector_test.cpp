#include "systeminfo/registry_collector.h"

#include <gmock/gmock.h>

#include "core/logging.h"
#include "core/text.h"
#include "systeminfo/collecting_settings.h"
#include "tests/support/test_registry.h"

namespace systeminfo {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

constexpr wchar_t kScope[] = L"systeminfo::RegistryCollector::Start: ";

class RegistryCollectorTest : public testing::Test {
 protected:
  Json::Value Collect(const Json::Value& paths, const std::atomic<bool>* cancel = nullptr) {
    const auto settings = std::make_shared<CollectingSettings>();
    settings->SetValue(L"registry", paths);
    RegistryCollector collector(L"registry");
    collector.Start(settings, nullptr, cancel);
    return collector.GetData();
  }
  static Json::Value List(std::initializer_list<Json::Value> paths) {
    Json::Value list(Json::arrayValue);
    for (const Json::Value& path : paths)
      list.append(path);
    return list;
  }
  std::string Path() const { return ToUtf8(m_test.Path()); }

  TestRegistryKey m_test;
  logging::ErrorCapture m_log{logging::Level::kTrace};
};

TEST_F(RegistryCollectorTest, ASettingThatIsNoListIsNoData) {
  for (const Json::Value& setting : {Json::Value(), Json::Value(true), Json::Value(Path()), Json::Value(5)}) {
    EXPECT_TRUE(Collect(setting).isNull());
    EXPECT_THAT(m_log.Take(), ElementsAre(kScope + std::wstring(L"No registry keys to query found")));
  }
  EXPECT_TRUE(Collect(Json::arrayValue).isNull());
  EXPECT_TRUE(Collect(Json::objectValue).isNull());
  EXPECT_THAT(m_log.Take(), IsEmpty());
}

TEST_F(RegistryCollectorTest, EachListedKeyIsDumpedUnderItsOwnSpelling) {
  m_test.SetText(L"Sub", L"Name", L"S\x00FC\x6771");
  m_test.MakeKey(L"Empty");
  const std::string longSpelling = "HKEY_CURRENT_USER" + Path().substr(4);
  const Json::Value data = Collect(List({Path(), longSpelling, Path() + "\\Empty"}));
  EXPECT_THAT(data.getMemberNames(), ElementsAre(Path(), Path() + "\\Empty", longSpelling));
  EXPECT_EQ(data[Path()]["subkeys"]["Sub"]["values"]["name"], ToUtf8(L"S\x00FC\x6771"));
  EXPECT_EQ(data[Path()], data[longSpelling]);
  EXPECT_EQ(data[Path() + "\\Empty"], Json::Value(Json::objectValue));
  EXPECT_THAT(m_log.Take(), IsEmpty());

  Json::Value object;
  object["any"] = Path();
  EXPECT_THAT(Collect(object).getMemberNames(), ElementsAre(Path()));
}

TEST_F(RegistryCollectorTest, WhatIsNoKeyIsLoggedAndTheOthersAreDumped) {
  const Json::Value data = Collect(List({7, "hkcu\\Software", Json::Value(), "HKCU\\Software\\st_absent", Path()}));
  EXPECT_THAT(data.getMemberNames(), ElementsAre(Path()));
  const std::wstring scope = kScope;
  EXPECT_THAT(m_log.Take(),
              ElementsAre(scope + L"registry key is not a string. skipping",
                          scope + L"hkcu\\Software is not a valid registry key", scope + L"error 123",
                          scope + L"registry key is not a string. skipping",
                          scope + L"HKCU\\Software\\st_absent is not a valid registry key", scope + L"error 2"));
  EXPECT_TRUE(Collect(List({"HKCU\\Software\\st_absent"})).isNull());
}

TEST_F(RegistryCollectorTest, CancelStopsBeforeTheNextKeyIsOpened) {
  const std::atomic<bool> cancel{true};
  EXPECT_TRUE(Collect(List({7, Path()}), &cancel).isNull());
  EXPECT_THAT(m_log.Take(), IsEmpty());
}

}  // namespace
}  // namespace systeminfo
