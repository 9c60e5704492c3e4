#include "systeminfo/data_collector.h"

#include <windows.h>

#include <gmock/gmock.h>

#include <stdexcept>

#include "core/json.h"
#include "core/logging.h"
#include "systeminfo/collector_table.h"
#include "systeminfo/wmi_wrapper.h"
#include "tests/support/fake_collector.h"
#include "tests/support/test_folder.h"

namespace systeminfo {
namespace {

using testing::Contains;
using testing::ElementsAre;
using testing::EndsWith;
using testing::IsEmpty;
using testing::Pair;

class Run : public testing::Test {
 protected:
  Run() { m_settings->SetValue(L"output_folder", ToJson(m_output)); }

  int Collect(const CollectorList& collectors) {
    return m_runner.RunCollectors(
        &m_cancel, [this](int current, int total) { m_progress.emplace_back(current, total); }, collectors);
  }

  // The whole file of a collector; empty when there is none.
  std::string File(std::wstring_view name) const {
    std::string text;
    ReadWholeFile(std::wstring(JoinPath(m_output, name)) + L".json", 1'000'000, text);
    return text;
  }

  static Json::Value ToJson(const std::wstring& path) { return std::string(path.begin(), path.end()); }

  TestFolder m_folder;
  std::wstring m_output = m_folder.Path(L"out");
  std::shared_ptr<CollectingSettings> m_settings = std::make_shared<CollectingSettings>();
  DataCollectorImpl m_runner{m_settings};
  std::atomic<bool> m_cancel{false};
  std::vector<std::pair<int, int>> m_progress;
  logging::ErrorCapture m_log{logging::Level::kTrace};
};

TEST_F(Run, CollectorsRunInOrderOnOneConnectionAndWriteTheirFiles) {
  std::vector<std::wstring> order;
  const auto body = [&order](const wchar_t* name) {
    return [&order, name](WMIWrapper& wmi) {
      order.emplace_back(name);
      WMIWrapper::Row row;
      EXPECT_EQ(wmi.ExecuteQuery(L"SELECT * FROM Win32_ComputerSystem", {L"Name"}, row), 0);
      return Json::Value(Json::arrayValue);
    };
  };
  EXPECT_EQ(Collect({Fake(L"one", body(L"one")), Fake(L"two", body(L"two"))}), 0);
  EXPECT_THAT(order, ElementsAre(L"one", L"two"));
  EXPECT_EQ(File(L"one"), "[]\n");
  EXPECT_EQ(File(L"two"), "[]\n");
  EXPECT_THAT(m_progress, ElementsAre(Pair(1, 2), Pair(2, 2)));
  const std::wstring scope = L"systeminfo::DataCollectorImpl::RunCollectors: ";
  EXPECT_THAT(m_log.Take(),
              ElementsAre(testing::StartsWith(L"systeminfo::CollectingSettings::Print: {"),
                          scope + L"Collecting data for : ['one', 'two']", scope + L"Collecting data for one ...",
                          scope + L"Collecting data for two ..."));
}

TEST_F(Run, LayoutFollowsPrettyPrint) {
  Json::Value data;
  data["a"] = "\xC3\xA4";
  m_settings->SetValue(L"pretty_print", "yes");  // no boolean
  EXPECT_EQ(Collect({Fake(L"one", data)}), 0);
  EXPECT_EQ(File(L"one"), WriteCompactJson(data));

  m_settings->SetValue(L"pretty_print", true);
  m_settings->SetValue(L"output_folder", ToJson(m_output = m_folder.Path(L"pretty")));
  EXPECT_EQ(Collect({Fake(L"one", data)}), 0);
  EXPECT_EQ(File(L"one"), WriteStyledJson(data));
}

TEST_F(Run, CollectorWithoutDataWritesNoFileAndCountsAsProgress) {
  EXPECT_EQ(Collect({Fake(L"none", Json::Value()), Fake(L"empty", Json::Value(Json::objectValue))}), 0);
  EXPECT_FALSE(PathExists(m_folder.Path(L"out\\none.json")));
  EXPECT_EQ(File(L"empty"), "{}\n");
  EXPECT_THAT(m_progress, ElementsAre(Pair(1, 2), Pair(2, 2)));
  EXPECT_THAT(m_log.Take(), Contains(L"systeminfo::DataCollectorImpl::RunCollectors: No data collected for none"));
  EXPECT_EQ(m_runner.Outcomes()[0].outcome, Outcome::kNoData);
  EXPECT_EQ(m_runner.Outcomes()[0].reason, L"nothing was found");
  EXPECT_EQ(m_runner.Outcomes()[1].reason, L"");
}

TEST_F(Run, WhatACollectorWithoutDataSaidLastIsItsReason) {
  const auto silent = Fake(L"silent", [](WMIWrapper&) {
    LOG_WARNING(L"Start", L"the door is closed");
    LOG_TRACE(L"Start", L"there is no product");
    return Json::Value();
  });
  EXPECT_EQ(Collect({silent, Fake(L"none", Json::Value())}), 0);
  EXPECT_EQ(m_runner.Outcomes()[0].reason, L"Start: there is no product");
  EXPECT_EQ(m_runner.Outcomes()[1].reason, L"nothing was found");
}

TEST_F(Run, ThrowingCollectorIsLoggedAndTheRunGoesOn) {
  const auto first = Fake(L"first", [](WMIWrapper&) -> Json::Value { throw std::runtime_error("broken"); });
  const auto second = Fake(L"second", [](WMIWrapper&) -> Json::Value { throw 7; });
  const auto third = Fake(L"third", [](WMIWrapper&) { return Json::Value("text")["member of a string"]; });
  EXPECT_EQ(Collect({first, second, third, Fake(L"last", Json::Value(1))}), 0);
  EXPECT_EQ(File(L"last"), "1\n");
  ASSERT_EQ(m_runner.Outcomes().size(), 4u);
  for (int i = 0; i < 3; ++i) {
    const CollectorOutcome& outcome = m_runner.Outcomes()[i];
    EXPECT_EQ(outcome.outcome, Outcome::kFailed) << i;
    EXPECT_FALSE(PathExists(m_folder.Path(L"out\\" + outcome.name + L".json"))) << i;
    EXPECT_EQ(outcome.errors.size(), 1u) << i;
  }
  EXPECT_EQ(m_runner.Outcomes()[0].reason, L"broken");
  EXPECT_THAT(m_runner.Outcomes()[0].errors, ElementsAre(EndsWith(L"The collector of first failed: broken")));
  EXPECT_EQ(m_progress.size(), 4u);
}

TEST_F(Run, LaterCollectorOfTheSameNameReplacesTheFile) {
  EXPECT_EQ(Collect({Fake(L"network", Json::Value("adapters")), Fake(L"network", Json::Value("connections"))}), 0);
  EXPECT_EQ(File(L"network"), "\"connections\"\n");
  EXPECT_EQ(m_runner.Outcomes().size(), 2u);
}

TEST_F(Run, FileThatCannotBeWrittenIsReportedAndTheRunGoesOn) {
  const auto blocked = Fake(L"blocked", [this](WMIWrapper&) {
    m_folder.MakeFolder(L"out\\blocked.json");
    return Json::Value(Json::arrayValue);
  });
  EXPECT_EQ(Collect({blocked, Fake(L"last", Json::Value(1))}), 0);
  EXPECT_EQ(File(L"last"), "1\n");
  const CollectorOutcome& outcome = m_runner.Outcomes()[0];
  EXPECT_EQ(outcome.outcome, Outcome::kNotWritten);
  EXPECT_EQ(outcome.reason, L"error 5");
  EXPECT_THAT(outcome.errors, ElementsAre(EndsWith(L"blocked.json, error 5")));
  EXPECT_FALSE(PathExists(m_folder.Path(L"out\\blocked.json.partial")));
}

TEST_F(Run, OutcomesHoldCountsTimesAndTheErrorsOfTheirOwnCollector) {
  const auto slow = Fake(L"slow", [](WMIWrapper&) {
    LOG_ERROR(L"f", L"inside %d", 1);
    LOG_WARNING(L"f", L"a warning");
    Sleep(30);
    Json::Value data(Json::arrayValue);
    data.append(1);
    data.append(2);
    return data;
  });
  EXPECT_EQ(Collect({slow, Fake(L"quick", Json::Value(1))}), 0);
  const CollectorOutcome& outcome = m_runner.Outcomes()[0];
  EXPECT_EQ(outcome.name, L"slow");
  EXPECT_EQ(outcome.className, L"Fake");
  EXPECT_EQ(outcome.outcome, Outcome::kData);
  EXPECT_EQ(outcome.records, 2u);
  EXPECT_EQ(outcome.bytes, File(L"slow").size());
  EXPECT_GE(outcome.milliseconds, 25u);
  EXPECT_THAT(outcome.errors, ElementsAre(L"f: inside 1"));
  EXPECT_THAT(m_runner.Outcomes()[1].errors, IsEmpty());
}

TEST_F(Run, CancelBeforeTheRunStartsNoCollectorButMakesTheFolder) {
  m_cancel = true;
  EXPECT_EQ(Collect({Fake(L"one", Json::Value(1))}), 2);
  EXPECT_TRUE(FolderExists(m_output));
  EXPECT_EQ(File(L"one"), "");
  EXPECT_THAT(m_progress, IsEmpty());
  EXPECT_THAT(m_runner.Outcomes(), IsEmpty());
  EXPECT_THAT(m_log.Take(), Contains(L"systeminfo::DataCollectorImpl::RunCollectors: cancel, early exit"));
}

TEST_F(Run, CancelDuringACollectorKeepsItsFileAndStopsBeforeTheNext) {
  const auto cancelling = Fake(L"one", [this](WMIWrapper&) {
    m_cancel = true;
    return Json::Value(1);
  });
  EXPECT_EQ(Collect({cancelling, Fake(L"two", Json::Value(2))}), 2);
  EXPECT_EQ(File(L"one"), "1\n");
  EXPECT_EQ(File(L"two"), "");
  EXPECT_THAT(m_progress, ElementsAre(Pair(1, 2)));

  m_cancel = false;
  m_settings->SetValue(L"output_folder", ToJson(m_output = m_folder.Path(L"last")));
  EXPECT_EQ(Collect({cancelling}), 2) << "during the last collector";
  EXPECT_EQ(File(L"one"), "1\n");
  EXPECT_EQ(m_progress.size(), 2u);
}

TEST_F(Run, FolderThatIsThereOrCannotBeMadeIsRefused) {
  const CollectorList collectors = {Fake(L"one", Json::Value(1))};
  const std::wstring scope = L"systeminfo::DataCollectorImpl::CreateOutputFolder: ";
  m_folder.MakeFile(L"out\\old");
  EXPECT_EQ(Collect(collectors), 4);
  EXPECT_EQ(File(L"one"), "");
  EXPECT_THAT(m_log.Take(), Contains(scope + L"output_folder already exists. doing nothing"));

  const std::wstring deep = m_folder.Path(L"no parent\\out");
  m_settings->SetValue(L"output_folder", ToJson(deep));
  EXPECT_EQ(Collect(collectors), 4);
  EXPECT_THAT(m_log.Take(), Contains(scope + L"failed to create output folder " + deep));
}

TEST_F(Run, SettingsWithoutAUsableOutputFolderAreRefused) {
  const std::wstring scope = L"systeminfo::DataCollectorImpl::GetOutputFolder: ";
  m_settings->SetValue(L"output_folder", 5);
  EXPECT_EQ(Collect({}), 4);
  EXPECT_THAT(m_log.Take(), Contains(scope + L"output_folder does not have string type"));
  m_settings->SetValue(L"output_folder", "");
  EXPECT_EQ(Collect({}), 4);

  const auto empty = std::make_shared<CollectingSettings>();
  EXPECT_EQ(DataCollectorImpl(empty).CollectAll(nullptr, nullptr), 4);
  EXPECT_THAT(m_log.Take(), Contains(scope + L"output_folder not set"));
}

TEST_F(Run, WmiThatCannotBeStartedEndsTheRunAfterTheFolder) {
  DataCollectorImpl runner(m_settings, [] { return nullptr; });
  EXPECT_EQ(runner.RunCollectors(&m_cancel, nullptr, {Fake(L"one", Json::Value(1))}), 5);
  EXPECT_TRUE(FolderExists(m_output));
  EXPECT_EQ(File(L"one"), "");
  EXPECT_THAT(m_log.Take(),
              Contains(L"systeminfo::DataCollectorImpl::RunCollectors: wmiwrapper init failed; will not continue"));
}

TEST_F(Run, NothingEnabledStillMakesTheFolderAndSucceeds) {
  EXPECT_EQ(m_runner.CollectAll(nullptr, nullptr), 0);
  EXPECT_TRUE(FolderExists(m_output));
  EXPECT_THAT(m_log.Take(), Contains(L"systeminfo::DataCollectorImpl::RunCollectors: Collecting data for : []"));
}

TEST_F(Run, EnabledCollectorsOfTheTableAreCollectedLive) {
  m_settings->SetValue(L"system_summary", true);
  EXPECT_EQ(m_runner.CollectAll(&m_cancel, [this](int current, int total) { m_progress.emplace_back(current, total); }),
            0);
  EXPECT_THAT(m_progress, ElementsAre(Pair(1, 1)));
  Json::Value summary;
  std::string error;
  ASSERT_TRUE(ParseJson(File(L"system_summary"), summary, error)) << error;
  EXPECT_TRUE(summary.isMember("OS Name"));
}

TEST_F(Run, MistypedKeysAreWarnedOfUpToALimit) {
  const std::wstring scope = L"systeminfo::DataCollectorImpl::BuildCollectors: ";
  m_settings->SetValue(L"system_sumary", true);
  m_settings->SetValue(L"something", 1);
  EXPECT_TRUE(m_runner.BuildCollectors().empty());
  EXPECT_THAT(m_log.Take(),
              ElementsAre(scope + L"The settings key something names no collector",
                          scope + L"The settings key system_sumary names no collector; nearest is system_summary"));
  for (int i = 0; i < 100; ++i)
    m_settings->SetValue(L"key" + std::to_wstring(i), true);
  EXPECT_TRUE(m_runner.BuildCollectors().empty());
  const std::vector<std::wstring> lines = m_log.Take();
  ASSERT_EQ(lines.size(), 21u);
  EXPECT_EQ(lines.back(), scope + L"82 more settings keys name no collector");
}

TEST(CollectorTable, AllCollectorsBuildsEveryRowUnderItsOwnName) {
  const auto settings = std::make_shared<CollectingSettings>();
  settings->SetValue(L"all_collectors", true);
  const CollectorList collectors = DataCollectorImpl(settings).BuildCollectors();
  ASSERT_EQ(collectors.size(), CollectorTable().size());
  for (size_t i = 0; i < collectors.size(); ++i) {
    EXPECT_EQ(collectors[i].collector->GetName(), CollectorTable()[i].key);
    EXPECT_EQ(collectors[i].className, CollectorTable()[i].className);
    EXPECT_TRUE(collectors[i].collector->GetData().isNull());
  }
}

}  // namespace
}  // namespace systeminfo
