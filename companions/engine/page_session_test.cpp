// The engine against browsers that behave badly: copies of engine_peer.exe, over real pipes and with real processes.
#include "companions/engine/page_session.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "companions/engine/browser_process.h"
#include "core/program_path.h"
#include "core/text.h"
#include "tests/support/test_folder.h"

namespace engine {
namespace {

using testing::HasSubstr;

constexpr PageTimeouts kShort{std::chrono::milliseconds(1000), std::chrono::milliseconds(1000),
                              std::chrono::milliseconds(1000), std::chrono::milliseconds(100),
                              std::chrono::milliseconds(1500)};

class RecordingHost : public PageHost {
 public:
  Supply LoadData(const std::wstring&) override { return {}; }
  void DataLoaded(const std::wstring&, const std::string*) override {}
  bool ScriptCall(const std::string& name, const std::vector<ScriptValue>&, ScriptValue&) override {
    if (name == "throw") throw std::bad_alloc();
    if (onCall) onCall();
    return false;
  }
  void Report(HtmlSubsystem, HtmlSeverity severity, const std::wstring& text) override {
    if (severity == HTML_ERROR) reports += ToUtf8(text) + "\n";
  }
  void ShowFrame(const std::string& base64) override { frames += base64; }
  void OnNotice(const Json::Value&) override {}
  void PageLost() override { ++losses; }

  std::string reports;
  std::string frames;
  int losses = 0;
  std::function<void()> onCall;
};

class PageSessionTest : public testing::Test {
 protected:
  PageSessionTest() {
    SetEnvironmentVariableW(L"TMP", m_folder.MakeFolder(L"tmp").c_str());
    m_session = std::make_shared<PageSession>(
        m_hostOwner, [] {}, kShort);
  }
  ~PageSessionTest() override {
    m_session->End();
    m_browser.End();
    m_session.reset();
    SetEnvironmentVariableW(L"TMP", nullptr);
  }

  bool BeginWith(const wchar_t* manner) {
    const std::wstring peer = m_folder.Path(std::wstring(L"engine_peer_") + manner + L".exe");
    CopyFileW((ProgramFolder() + L"\\engine_peer.exe").c_str(), peer.c_str(), FALSE);
    std::wstring error;
    if (!m_browser.Start(peer, false, error)) throw std::runtime_error(ToUtf8(error));
    return m_session->Begin(m_browser.Connect(error));
  }

  size_t ProfileCount() const {
    WIN32_FIND_DATAW data{};
    const FindHandle find(FindFirstFileW(m_folder.Path(L"tmp\\st-engine-*").c_str(), &data));
    size_t count = find ? 1 : 0;
    while (count != 0 && FindNextFileW(find.Get(), &data))
      ++count;
    return count;
  }

  const TestFolder m_folder;
  std::shared_ptr<RecordingHost> m_hostOwner = std::make_shared<RecordingHost>();
  RecordingHost& m_host = *m_hostOwner;
  BrowserProcess m_browser;
  std::shared_ptr<PageSession> m_session;
  ScriptValue m_result;
};

TEST_F(PageSessionTest, ABrowserThatIsNoneIsGivenUpWithAReason) {
  const struct {
    const wchar_t* manner;
    const char* reason;
  } cases[] = {
      {L"ending", "the browser's pipe has ended"},
      {L"garbage", "the browser speaks no DevTools protocol"},
      {L"endless", "the browser sends a message that is too large"},
      {L"refusing", "Target.getTargets: I will not"},
      {L"silent", "it does not do what it is told"},
  };
  for (const auto& one : cases) {
    m_host.reports.clear();
    // Only the silent one is to be waited for; the others show themselves sooner or later.
    PageTimeouts timeouts = kShort;
    if (one.manner != std::wstring(L"silent")) timeouts.command = std::chrono::seconds(30);
    const auto wake = [] {};
    m_session = std::make_shared<PageSession>(m_hostOwner, wake, timeouts);
    EXPECT_FALSE(BeginWith(one.manner)) << one.reason;
    EXPECT_THAT(m_host.reports, HasSubstr(one.reason));
    EXPECT_FALSE(m_session->Load(L"res:page.htm"));
    m_session->End();
    m_browser.End();
    EXPECT_EQ(ProfileCount(), 0u) << one.reason;
  }
}

TEST_F(PageSessionTest, NonsenseBetweenTheMessagesDoesNoHarm) {
  ASSERT_TRUE(BeginWith(L"good"));
  EXPECT_EQ(ProfileCount(), 2u);  // the folder and its mark
  ASSERT_TRUE(m_session->Load(L"res:page.htm"));
  EXPECT_THAT(m_host.reports, HasSubstr("the browser sends what is no message"));
  EXPECT_EQ(m_host.frames, "!!!");  // decoding is the window's part
  EXPECT_TRUE(m_session->CallByName("f", {}, m_result));
  ASSERT_NE(m_result.Find(ScriptValue(Text{L"answer"})), nullptr);
  EXPECT_FALSE(m_session->CallByName("nothingAsked", {}, m_result));
  EXPECT_TRUE(m_result.As<Text>()->isError);
}

TEST_F(PageSessionTest, APageThatNeverLoadsEndsTheWait) {
  ASSERT_TRUE(BeginWith(L"good"));
  EXPECT_FALSE(m_session->Load(L"res:never.htm"));
  EXPECT_THAT(m_host.reports, HasSubstr("'res:never.htm' cannot be loaded: it takes too long"));
}

TEST_F(PageSessionTest, ABrowserThatDiesInACallEndsTheCall) {
  ASSERT_TRUE(BeginWith(L"good"));
  EXPECT_FALSE(m_session->CallByName("pleaseDie", {}, m_result));
  EXPECT_TRUE(m_result.As<Text>()->isError);
  EXPECT_TRUE(m_session->IsLost());
  m_session->Drain();
  EXPECT_THAT(m_host.reports, HasSubstr("the browser is gone: the browser's pipe has ended"));
  EXPECT_EQ(m_host.losses, 0);  // nothing had been shown
  EXPECT_FALSE(m_session->CallByName("f", {}, m_result));
  EXPECT_FALSE(m_session->Load(L"res:page.htm"));
}

TEST_F(PageSessionTest, APageThatHangsIsWaitedForOnceAndThenOnlyShortly) {
  ASSERT_TRUE(BeginWith(L"good"));
  EXPECT_FALSE(m_session->CallByName("pleaseHang", {}, m_result));
  EXPECT_THAT(m_host.reports, HasSubstr("the page does not answer"));
  const auto start = std::chrono::steady_clock::now();
  EXPECT_FALSE(m_session->CallByName("pleaseHang", {}, m_result));
  EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(900));
  EXPECT_TRUE(m_session->CallByName("f", {}, m_result));
}

TEST_F(PageSessionTest, AShownPageThatIsLostIsToldOnce) {
  ASSERT_TRUE(BeginWith(L"good"));
  ASSERT_TRUE(m_session->Load(L"res:page.htm"));
  EXPECT_FALSE(m_session->CallByName("pleaseDie", {}, m_result));
  m_session->Drain();
  m_session->Drain();
  EXPECT_EQ(m_host.losses, 1);
}

TEST_F(PageSessionTest, APageThatTakesNoInputIsGivenUp) {
  ASSERT_TRUE(BeginWith(L"good"));
  ASSERT_TRUE(m_session->Load(L"res:page.htm"));
  for (const char* method : {"Input.taken", "Input.pleaseHang"}) {
    m_session->SendInput(method, {});
    Sleep(2000);
    m_session->Drain();
    EXPECT_FALSE(m_session->IsLost());
  }
  m_session->SendInput("Input.taken", {});
  m_session->Drain();
  EXPECT_THAT(m_host.reports, HasSubstr("the page hangs"));
  EXPECT_EQ(m_host.losses, 1);
}

TEST_F(PageSessionTest, APageThatGoesAwayIsFetchedBackThreeTimes) {
  ASSERT_TRUE(BeginWith(L"good"));
  ASSERT_TRUE(m_session->Load(L"res:leaving.htm"));
  for (int i = 0; i < 200 && m_host.losses == 0; ++i) {
    Sleep(10);
    m_session->Drain();
  }
  EXPECT_EQ(m_host.losses, 1);
  EXPECT_THAT(m_host.reports, HasSubstr("the page went to 'about:blank'; it is loaded again"));
  EXPECT_THAT(m_host.reports, HasSubstr("the page does not stay"));
}

TEST_F(PageSessionTest, ACallThatFailsIsAnsweredAllTheSame) {
  ASSERT_TRUE(BeginWith(L"good"));
  ASSERT_TRUE(m_session->Load(L"res:page.htm"));
  // The page function "calls" ends when native code has answered the call that it makes.
  EXPECT_TRUE(m_session->CallByName("calls_throw", {}, m_result));
  EXPECT_THAT(m_host.reports, HasSubstr("a call of the page has failed"));
  EXPECT_TRUE(m_session->CallByName("calls_throw", {}, m_result));
}

TEST_F(PageSessionTest, AHostMayGoInACallOfAFunction) {
  ASSERT_TRUE(BeginWith(L"good"));
  m_host.onCall = [this] {
    m_session->End();
    m_hostOwner.reset();
  };
  const auto self = m_session;
  EXPECT_FALSE(self->CallFunction(7, {}, m_result));
  EXPECT_EQ(m_hostOwner, nullptr);
  EXPECT_FALSE(self->CallFunction(7, {}, m_result));
}

TEST_F(PageSessionTest, TheBrowserEndsWithItsOwnerWithinAMoment) {
  ASSERT_TRUE(BeginWith(L"good"));
  const auto start = std::chrono::steady_clock::now();
  m_session->End();
  m_browser.End();
  EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(2));
  EXPECT_EQ(ProfileCount(), 0u);
  EXPECT_FALSE(m_session->CallByName("f", {}, m_result));
}

TEST_F(PageSessionTest, WhatAKilledProcessLeftIsDeletedByTheNextOne) {
  m_folder.MakeFile(L"tmp\\st-engine-old\\deep\\file");
  ASSERT_TRUE(BeginWith(L"good"));
  EXPECT_EQ(ProfileCount(), 2u);  // its own, and the mark of that
  BrowserProcess other;
  std::wstring error;
  ASSERT_TRUE(other.Start(m_folder.Path(L"engine_peer_good.exe"), false, error));
  EXPECT_EQ(ProfileCount(), 4u);
  other.End();
  EXPECT_EQ(ProfileCount(), 2u);
}

TEST(BrowserProcess, AProgramThatIsMissingCannotBeStarted) {
  BrowserProcess browser;
  std::wstring error;
  EXPECT_FALSE(browser.Start(L"C:\\nowhere\\browser.exe", false, error));
  EXPECT_THAT(ToUtf8(error), HasSubstr("cannot be started, error "));
}

}  // namespace
}  // namespace engine
