// Collectors whose peers never answer. The peers let go when a test ends, so that nothing of it is left.
#include "systeminfo/collector_thread.h"

#include <windows.h>

#include <gmock/gmock.h>

#include <vector>

#include "core/logging.h"
#include "core/scope_exit.h"
#include "systeminfo/collecting_settings.h"
#include "systeminfo/utils/file_md5.h"
#include "systeminfo/wmi_wrapper.h"
#include "tests/support/fake_collector.h"
#include "tests/support/fake_wmi.h"
#include "tests/support/test_folder.h"

namespace systeminfo {
namespace {

using std::chrono::milliseconds;
using testing::ElementsAre;
using testing::EndsWith;
using testing::HasSubstr;
using testing::IsEmpty;

constexpr wchar_t kQuery[] = L"SELECT * FROM Win32_Service";

class HangingPeers : public testing::Test {
 protected:
  HangingPeers() {
    m_settings->SetValue(L"output_folder", std::string(m_output.begin(), m_output.end()));
    m_settings->SetValue(L"collector_timeout", 0.3);
    m_wmi.answers[kQuery].instances = {{{L"Name", fake_wmi::Text(L"first")}}};
  }
  // Whoever was left behind comes back before the peers are gone.
  ~HangingPeers() override {
    SetEvent(m_release.Get());
    for (int i = 0; i < 500 && m_hanging > 0; ++i)
      Sleep(10);
    Sleep(100);
    EXPECT_EQ(m_hanging, 0);
  }

  TimeLimits m_limits{milliseconds(0), milliseconds(200), milliseconds(100)};  // the budget is the settings'

  int Collect(const CollectorList& collectors) {
    m_runner = std::make_unique<DataCollectorImpl>(m_settings, m_connect, m_limits);
    return m_runner->RunCollectors(&m_cancel, nullptr, collectors);
  }

  // Does not come back before the test ends, whatever anybody asks.
  void Hang() {
    ++m_hanging;
    WaitForSingleObject(m_release.Get(), INFINITE);
    --m_hanging;
  }

  PlannedCollector Querying(std::wstring name) {
    return Fake(std::move(name), [](WMIWrapper& wmi) {
      WMIWrapper::Rows rows;
      wmi.ExecuteQuery(kQuery, {L"Name"}, rows);
      Json::Value data(Json::arrayValue);
      for (WMIWrapper::Row& row : rows)
        data.append(row[L"Name"]);
      return data;
    });
  }

  std::string File(std::wstring_view name) const {
    std::string text;
    ReadWholeFile(std::wstring(JoinPath(m_output, name)) + L".json", 1'000'000, text);
    return text;
  }

  const CollectorOutcome& OutcomeOf(size_t index) const { return m_runner->Outcomes().at(index); }

  TestFolder m_folder;
  std::wstring m_output = m_folder.Path(L"out");
  KernelHandle m_release{CreateEventW(nullptr, TRUE, FALSE, nullptr)};
  std::atomic<int> m_hanging{0};
  std::atomic<int> m_connections{0};
  std::atomic<bool> m_cancel{false};
  FakeWmi m_wmi;
  WmiMaker m_connect = [this] {
    ++m_connections;
    return std::make_shared<WMIWrapper>(m_wmi.Services());
  };
  std::shared_ptr<CollectingSettings> m_settings = std::make_shared<CollectingSettings>();
  std::unique_ptr<DataCollectorImpl> m_runner;
};

TEST_F(HangingPeers, CollectorThatEndsWhenItIsAskedKeepsWhatItHadGathered) {
  const auto patient = FakeWithCancel(L"patient", [](Json::Value& data, WMIWrapper&, const std::atomic<bool>& cancel) {
    for (data.append("begun"); !cancel;)
      Sleep(5);
    LOG_ERROR(L"f", L"broken off");
  });
  EXPECT_EQ(Collect({patient, Fake(L"next", Json::Value(1))}), kRunDone);
  EXPECT_EQ(File(L"patient"), "[\"begun\"]\n");
  EXPECT_EQ(File(L"next"), "1\n") << "is not asked to end with the one before";
  EXPECT_EQ(OutcomeOf(0).outcome, Outcome::kTimedOut);
  EXPECT_EQ(OutcomeOf(0).reason, L"it took longer than 0.3 seconds; what it had gathered is kept");
  EXPECT_EQ(OutcomeOf(0).records, 1u);
  EXPECT_GE(OutcomeOf(0).milliseconds, 300u);
  EXPECT_THAT(OutcomeOf(0).errors, ElementsAre(L"f: broken off", HasSubstr(L"The collector of patient timed out: ")));
  EXPECT_EQ(OutcomeOf(1).outcome, Outcome::kData);
  EXPECT_EQ(m_connections, 1);
}

TEST_F(HangingPeers, FileThatNeverAnswersCostsItsCollectorAlone) {
  const std::wstring pipe = L"\\\\.\\pipe\\st_silent_" + std::to_wstring(GetCurrentProcessId());
  KernelHandle server(CreateNamedPipeW(pipe.c_str(), PIPE_ACCESS_DUPLEX, PIPE_TYPE_BYTE, 1, 0, 0, 0, nullptr));
  ASSERT_TRUE(server);
  const ScopeExit hangUp([&] {
    server.Reset();
    for (int i = 0; i < 500 && m_hanging > 0; ++i)
      Sleep(10);
  });
  const auto reader = FakeWithCancel(L"reader", [&](Json::Value& data, WMIWrapper&, const std::atomic<bool>&) {
    data.append("never to be seen");
    ++m_hanging;
    utils::GetFileMD5(std::string(pipe.begin(), pipe.end()));
    LOG_ERROR(L"f", L"out of time");
    --m_hanging;
  });
  const auto releasing = Fake(L"releasing", [&](WMIWrapper&) {
    server.Reset();
    while (m_hanging > 0)
      Sleep(5);
    return Json::Value(2);
  });
  EXPECT_EQ(Collect({reader, releasing}), kRunDone);
  EXPECT_EQ(File(L"reader"), "");
  EXPECT_EQ(File(L"releasing"), "2\n");
  EXPECT_EQ(OutcomeOf(0).outcome, Outcome::kTimedOut);
  EXPECT_EQ(OutcomeOf(0).reason, L"it took longer than 0.3 seconds, does not answer and was left behind");
  EXPECT_EQ(OutcomeOf(0).records, 0u);
  EXPECT_THAT(OutcomeOf(1).errors, IsEmpty()) << "the lines of the one that came back too late are nobody's";
  EXPECT_EQ(m_connections, 2);
}

TEST_F(HangingPeers, RowsThatWmiGaveBeforeItFellSilentAreKept) {
  m_limits.grace = std::chrono::seconds(10);  // a query hears only now and then that it shall end
  m_wmi.answers[kQuery].end = [](LONG timeout) {
    EXPECT_GT(timeout, 0) << "nobody could stop a wait without a limit";
    Sleep(timeout);
    return HRESULT{WBEM_S_TIMEDOUT};
  };
  EXPECT_EQ(Collect({Querying(L"services")}), kRunDone);
  EXPECT_EQ(File(L"services"), "[\"first\"]\n");
  EXPECT_EQ(OutcomeOf(0).outcome, Outcome::kTimedOut);
  EXPECT_THAT(OutcomeOf(0).reason, EndsWith(L"what it had gathered is kept"));
}

TEST_F(HangingPeers, WmiThatNeverAnswersIsLeftBehindWithItsConnection) {
  for (const bool whenQueried : {true, false}) {
    m_connections = 0;
    fake_wmi::Answer& answer = m_wmi.answers[kQuery];
    answer.whenQueried = [this, whenQueried] {
      if (whenQueried && m_connections == 1) Hang();
    };
    answer.end = [this, whenQueried](LONG) {
      if (!whenQueried && m_connections == 1) Hang();
      return HRESULT{WBEM_S_FALSE};
    };
    EXPECT_EQ(Collect({Querying(L"silent"), Querying(L"services")}), kRunDone);
    EXPECT_EQ(OutcomeOf(0).outcome, Outcome::kTimedOut);
    EXPECT_EQ(File(L"silent"), "");
    EXPECT_EQ(File(L"services"), "[\"first\"]\n");
    EXPECT_EQ(m_connections, 2);
    SetEvent(m_release.Get());
    while (m_hanging > 0)
      Sleep(5);
    Sleep(100);  // its connection goes with the thread
    ResetEvent(m_release.Get());
    m_output += L"2";
    m_settings->SetValue(L"output_folder", std::string(m_output.begin(), m_output.end()));
  }
}

TEST_F(HangingPeers, ConnectionThatIsNotMadeInTimeEndsTheRunOnlyAtItsBeginning) {
  const WmiMaker connect = std::exchange(m_connect, [this] {
    Hang();
    return nullptr;
  });
  EXPECT_EQ(Collect({Fake(L"one", Json::Value(1))}), kRunNoWmi);
  EXPECT_THAT(m_runner->Outcomes(), IsEmpty());

  DeleteFolder(m_output, true);
  m_connect = [this, connect] {
    if (m_connections > 0) Hang();
    return connect();
  };
  const auto hanging = Fake(L"hanging", [this](WMIWrapper&) {
    Hang();
    return Json::Value();
  });
  EXPECT_EQ(Collect({hanging, Querying(L"services"), Fake(L"last", Json::Value(3))}), kRunDone);
  EXPECT_EQ(File(L"services"), "[]\n");
  EXPECT_EQ(File(L"last"), "3\n");
  EXPECT_THAT(OutcomeOf(1).errors,
              ElementsAre(HasSubstr(L"the run goes on without it"), HasSubstr(L"Invalid pSvc pointer")));
}

TEST_F(HangingPeers, CancelledRunDoesNotWaitForACollectorsWholeBudget) {
  m_settings->SetValue(L"collector_timeout", 600);
  const auto hanging = Fake(L"hanging", [this](WMIWrapper&) {
    m_cancel = true;
    Hang();
    return Json::Value();
  });
  const ULONGLONG start = GetTickCount64();
  EXPECT_EQ(Collect({hanging, Fake(L"next", Json::Value(1))}), kRunCancelled);
  EXPECT_LT(GetTickCount64() - start, 60'000u);
  EXPECT_EQ(m_runner->Outcomes().size(), 1u);
}

TEST_F(HangingPeers, WithoutABudgetACollectorTakesAsLongAsItTakes) {
  m_settings->SetValue(L"collector_timeout", 0);
  const auto slow = Fake(L"slow", [](WMIWrapper&) {
    Sleep(700);  // longer than all the limits together
    return Json::Value(1);
  });
  EXPECT_EQ(Collect({slow}), kRunDone);
  EXPECT_EQ(OutcomeOf(0).outcome, Outcome::kData);
}

}  // namespace
}  // namespace systeminfo
