// The issue-report window: the workflow's handlers and the submission.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <ctime>
#include <stdexcept>

#include "core/files.h"
#include "core/json.h"
#include "core/logging.h"
#include "tests/support/tis_wnd_fixture.h"

namespace {

using qx::Value;
using testing::Contains;
using testing::ElementsAre;

}  // namespace

TEST_F(TisWndTest, UserDetailsAreStoredOnlyWhenTheyAreValid) {
  logging::ErrorCapture log(logging::Level::kTrace);
  Create();
  const auto details = [](const wchar_t* name, const wchar_t* email, bool agreed) {
    return Object({{L"user_name", name}, {L"user_email", email}, {L"agreed_licence", agreed}});
  };
  EXPECT_EQ(Succeeds("validate_user_details", details(L" Ana ", L"ana.pop@mail.info ", true)), kYes);
  const std::wstring stored = L"{ \"user_details\" : { \"email\" : \"ana.pop@mail.info\", \"name\" : \"Ana\" } }";
  EXPECT_EQ(m_window->ReportData().ToText(), stored);
  const struct {
    Value request;
    const wchar_t* line;
  } cases[] = {{details(L"  ", L"a@b.cc", true), L"0 1 1"},
               {details(L"Ana", L"A@b.cc", true), L"1 0 1"},
               {details(L"Ana", L"a@b.ccccc", true), L"1 0 1"},
               {details(L"Ana", L"a@b.cc", false), L"1 1 0"}};
  for (const auto& one : cases) {
    EXPECT_EQ(Succeeds("validate_user_details", one.request), kNo);
    EXPECT_THAT(log.Take(), Contains(std::wstring(L"TisWnd::TisValidateUserDetails: ") + one.line));
  }
  EXPECT_EQ(m_window->ReportData().ToText(), stored);
}

TEST_F(TisWndTest, IssueAndItsReproductionAreStoredStepByStep) {
  Create();
  const double before = static_cast<double>(std::time(nullptr));
  EXPECT_EQ(Succeeds("stop_issue_reproduction", Value()), kYes);  // without having started
  EXPECT_EQ(Succeeds("select_issue", Object({{L"issue", L"slow"}, {L"description", L"since today"}})), kYes);
  EXPECT_EQ(Succeeds("start_issue_reproduction", Value()), kYes);
  EXPECT_EQ(Succeeds("select_issue", Object({{L"issue", L"other"}, {L"description", L""}})), kYes);
  const Value issue = m_window->ReportData().Member(L"issue");
  EXPECT_EQ(issue.Member(L"name").AsString(), L"other");
  EXPECT_EQ(issue.Member(L"description").AsString(), L"");
  for (const wchar_t* key : {L"reproduce_start_time", L"reproduce_stop_time"}) {
    EXPECT_GE(issue.Member(key).AsNumber(), before);
    EXPECT_LE(issue.Member(key).AsNumber(), before + 60);
  }
  EXPECT_THAT(m_logging, ElementsAre("disable", "activate"));
}

TEST_F(TisWndTest, LoggingThatCannotBeChangedIsSaidAndNothingIsStored) {
  logging::ErrorCapture errors;
  m_loggingWorks = false;
  Create();
  EXPECT_EQ(Succeeds("start_issue_reproduction", Value()), kNo);
  EXPECT_EQ(Succeeds("stop_issue_reproduction", Value()), kNo);
  EXPECT_THAT(errors.Take(), ElementsAre(L"TisWnd::TisStartIssueReproduction: Could not activate product logging",
                                         L"TisWnd::TisStopIssueReproduction: Could not disable product logging"));
  EXPECT_THAT(m_logging, ElementsAre("activate", "restore", "disable"));  // nothing stays half raised
  EXPECT_EQ(m_window->ReportData().GetType(), Value::kNull);
}

TEST_F(TisWndTest, RaisedLoggingIsPutBackWhenTheWindowCloses) {
  for (const bool byMessage : {true, false}) {
    m_logging.clear();
    Create();
    Call("start_issue_reproduction", Value());
    if (byMessage) {
      SendMessageW(m_window->Handle(), WM_ENDSESSION, TRUE, 0);
      EXPECT_THAT(m_logging, ElementsAre("activate", "restore"));
    }
    SendMessageW(m_window->Handle(), WM_CLOSE, 0, 0);
    m_window.reset();
    EXPECT_THAT(m_logging, ElementsAre("activate", "restore"));
  }
}

TEST_F(TisWndTest, TranslationComesFromTheLanguageManager) {
  Create();
  EXPECT_EQ(Call("translate", L"hello").ToText(), L"{ \"success\" : true, \"translation\" : \"salut\" }");
  EXPECT_EQ(Succeeds("translate", L"unknown"), kNo);
  EXPECT_EQ(Succeeds("translate", 7), kNo);
  EXPECT_EQ(m_catalogue, L"en");
  m_translator = nullptr;
  Create();
  EXPECT_EQ(Succeeds("translate", L"hello"), kNo);
}

TEST_F(TisWndTest, SubmissionPacksTheReportAndTellsThePage) {
  const std::wstring folder = m_folder.MakeFolder(L"collected");
  m_collect = [&](const std::atomic<bool>&, const qx::CollectionProgress& progress,
                  const qx::CollectionFolderReady& ready) {
    progress(25, 100);
    EXPECT_TRUE(ready(folder));
    progress(100, 100);
    return 0;
  };
  Create();
  Call("select_issue", Object({{L"issue", L"slow"}, {L"description", L"\u0103"}}));
  Call("start_issue_reproduction", Value());
  EXPECT_EQ(Succeeds("submit", Object({{L"issue_reproduced", true}})), kYes);
  ASSERT_TRUE(PumpUntil([&] { return m_notified.size() == 3; }));
  EXPECT_THAT(m_notified, ElementsAre(L"on_submit_progress { \"step\" : 25, \"steps\" : 100 }",
                                      L"on_submit_progress { \"step\" : 100, \"steps\" : 100 }", L"on_finished {  }"));
  std::string text;
  ReadWholeFile(folder + L"\\guiData.json", 1 << 20, text);
  Json::Value report;
  std::string error;
  ASSERT_TRUE(ParseJson(text, report, error)) << error;
  EXPECT_EQ(report["issue"]["description"].asString(), "\xC4\x83");
  EXPECT_TRUE(report["issue"]["can_be_reproduced"].asBool());
  EXPECT_THAT(m_logging, ElementsAre("activate", "restore"));  // the reproduction had not been stopped
  m_folder.MakeFile(L"collected.zip");
  EXPECT_EQ(Call("get_state", Value()).Member(L"package").AsString(), folder + L".zip");
}

TEST_F(TisWndTest, EachResultHasItsNotification) {
  const struct {
    int result;
    const wchar_t* notified;
    const wchar_t* line;
  } cases[] = {{0, L"on_finished {  }", L"COLLECT_SUCCESS"},
               {1, L"on_error \"collect_failed\"", L"COLLECT_FAILED"},
               {2, L"on_error \"collect_canceled\"", L"COLLECT_CANCELED"},
               {3, L"on_error \"compression_failed\"", L"COMPRESSION_FAILED"},
               {4, L"on_error \"submission_failed\"", L"SUBMISSION_FAILED"},
               {5, L"on_error \"unknown\"", L"[error 5]"},
               {-1, L"on_error \"unknown\"", L"[error -1]"}};
  logging::ErrorCapture log(logging::Level::kTrace);
  Create();
  for (const auto& one : cases) {
    m_notified.clear();
    m_collect = [&one](const auto&, const auto&, const auto&) { return one.result; };
    EXPECT_EQ(Succeeds("submit", Object({{L"issue_reproduced", false}})), kYes);
    ASSERT_TRUE(PumpUntil([&] { return !m_notified.empty(); }));
    EXPECT_THAT(m_notified, ElementsAre(one.notified));
    EXPECT_THAT(log.Take(), Contains(std::wstring(L"TisWnd::SubmitData: ") + one.line));
  }
  m_notified.clear();
  m_collect = [](const auto&, const auto&, const auto&) -> int { throw std::runtime_error("broken"); };
  EXPECT_EQ(Succeeds("submit", Value()), kYes);  // without its member
  ASSERT_TRUE(PumpUntil([&] { return !m_notified.empty(); }));
  EXPECT_THAT(m_notified, ElementsAre(L"on_error \"collect_failed\""));
}

TEST_F(TisWndTest, SecondSubmissionWaitsForNoneAndCancelEndsTheFirst) {
  std::atomic<int> runs{0};
  m_collect = [&](const std::atomic<bool>& cancel, const auto&, const auto&) {
    ++runs;
    while (!cancel)
      Sleep(1);
    return 2;
  };
  Create();
  EXPECT_EQ(Succeeds("cancel", Value()), kNo);
  Call("submit", Object({{L"issue_reproduced", false}}));
  Call("submit", Object({{L"issue_reproduced", false}}));
  EXPECT_EQ(Succeeds("cancel", Value()), kYes);
  ASSERT_TRUE(PumpUntil([&] { return !m_notified.empty(); }));
  EXPECT_THAT(m_notified, ElementsAre(L"on_error \"collect_canceled\""));
  EXPECT_EQ(runs, 1);
  Call("submit", Object({{L"issue_reproduced", false}}));  // a new try is not cancelled beforehand
  ASSERT_TRUE(PumpUntil([&] { return runs == 2; }));
  EXPECT_EQ(m_notified.size(), 1u);
  SendMessageW(m_window->Handle(), WM_CLOSE, 0, 0);
  m_window.reset();  // cancels it and waits
}
