// The window as a child of the system's message-only window: it is a window in every respect but being seen.
#include "gui/window.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <stdexcept>
#include <thread>

#include "core/logging.h"
#include "tests/support/fake_html_engine.h"
#include "tests/support/message_pump.h"
#include "tests/support/test_folder.h"

namespace {

using qx::Value;
using qx::gui::UiThread;
using testing::ElementsAre;
using testing::HasSubstr;

class TestWindow : public qx::gui::Window {
 public:
  explicit TestWindow(FakeHtmlEngine& engine) : Window(engine.Api(), L"test") {}
  bool failed = false;
  bool destroyed = false;
  UINT throwsAt = 0;

 protected:
  bool OnMessage(UINT message, WPARAM wparam, LPARAM lparam, LRESULT& result) override {
    if (message == throwsAt) throw std::runtime_error("from the hook");
    if (message == WM_APP) {
      result = 77;
      return true;
    }
    return Window::OnMessage(message, wparam, lparam, result);
  }
  void OnDestroyed() override {
    destroyed = true;
    PostQuitMessage(0);
  }
  void OnLoadFailed() override { failed = true; }
  Value on_script_call(const std::wstring& name, uint32_t count, const HtmlValue*) override {
    if (name == L"throw") throw std::runtime_error("from the script call");
    Value answer;
    answer.SetMember(name, count);
    return answer;
  }
};

class WindowTest : public testing::Test {
 protected:
  void Create() { ASSERT_TRUE(m_window.CreateFromFile(m_page, HWND_MESSAGE)); }

  TestFolder m_folder;
  std::wstring m_page = m_folder.MakeFile(L"page.html");
  FakeHtmlEngine m_engine;
  TestWindow m_window{m_engine};
};

}  // namespace

TEST_F(WindowTest, TakesThePagesSizeAndPlace) {
  logging::ErrorCapture log(logging::Level::kTrace);
  Create();
  EXPECT_THAT(m_engine.loaded, ElementsAre(L"file://" + m_page));
  RECT place{};
  RECT area{};
  GetWindowRect(m_window.Handle(), &place);
  SystemParametersInfoW(SPI_GETWORKAREA, 0, &area, 0);
  EXPECT_EQ(place.right - place.left, 640);
  EXPECT_EQ(place.bottom - place.top, 480);
  EXPECT_EQ(place.left, (area.right - area.left) / 2 - 320);
  EXPECT_EQ(SendMessageW(m_window.Handle(), WM_APP, 0, 0), 77);
  EXPECT_FALSE(m_window.failed);
  DestroyWindow(m_window.Handle());
  EXPECT_TRUE(m_window.destroyed);
  EXPECT_EQ(m_window.Handle(), nullptr);
  const auto lines = log.Take();
  EXPECT_THAT(lines.front(), HasSubstr(L"-> Created window "));
  EXPECT_THAT(lines.back(), HasSubstr(L"<- Destroyed window "));
  EXPECT_THAT(lines.back(), HasSubstr(L"[window_name test]"));
}

TEST_F(WindowTest, PageThatCannotBeLoadedClosesTheWindow) {
  m_engine.loads = false;
  Create();
  EXPECT_TRUE(m_window.failed);
  m_window.RunMessageLoop();
  EXPECT_TRUE(m_window.destroyed);
}

TEST_F(WindowTest, PageFileThatIsNotThereIsNotAskedFor) {
  ASSERT_TRUE(m_window.CreateFromFile(m_folder.Path(L"none.html"), HWND_MESSAGE));
  EXPECT_TRUE(m_window.failed);
  EXPECT_TRUE(m_engine.loaded.empty());
}

TEST_F(WindowTest, PostedWorkRunsOnTheWindowsThreadInOrder) {
  Create();
  std::vector<int> ran;
  const DWORD own = GetCurrentThreadId();
  std::thread([&] {
    for (int i = 0; i < 10'000; ++i) {
      m_window.Ui().Post([&ran, i, own] {
        if (GetCurrentThreadId() == own) ran.push_back(i);
      });
    }
  }).detach();
  ASSERT_TRUE(PumpUntil([&] { return ran.size() == 10'000; }));
  EXPECT_TRUE(std::is_sorted(ran.begin(), ran.end()));
}

// A queue of Windows holds 10,000 messages.
TEST_F(WindowTest, PostingWaitsForAWindowThatIsBusy) {
  Create();
  std::atomic<int> posted{0};
  int ran = 0;
  std::thread poster([&] {
    for (int i = 0; i < 12'000; ++i)
      posted += m_window.Ui().Post([&ran] { ++ran; }) ? 1 : 0;
  });
  Sleep(300);
  EXPECT_TRUE(PumpUntil([&] { return posted == 12'000 && ran == 12'000; }));
  poster.join();
}

TEST_F(WindowTest, NothingPostedOutlivesTheWindow) {
  Create();
  const auto alive = std::make_shared<int>(1);
  bool ran = false;
  m_window.Ui().Post([alive, &ran] { ran = true; });
  std::atomic<int> called{-1};
  std::thread waiter([&] { called = m_window.Ui().Call([&ran] { ran = true; }) ? 1 : 0; });
  Sleep(50);
  EXPECT_EQ(called, -1);
  DestroyWindow(m_window.Handle());
  waiter.join();  // let go
  EXPECT_EQ(called, 0);
  EXPECT_EQ(alive.use_count(), 1);
  EXPECT_FALSE(m_window.Ui().Post([&ran] { ran = true; }));
  EXPECT_FALSE(m_window.Ui().Call([&ran] { ran = true; }));
  m_window.RunMessageLoop();
  EXPECT_FALSE(ran);
}

TEST_F(WindowTest, CloseRequestReachesTheLoopWithAndWithoutAWindow) {
  Create();
  m_window.Ui().PostClose([this] { DestroyWindow(m_window.Handle()); });
  m_window.RunMessageLoop();
  EXPECT_TRUE(m_window.destroyed);
  std::thread([this] { m_window.Ui().PostClose([] { PostQuitMessage(0); }); }).join();
  m_window.RunMessageLoop();
}

TEST_F(WindowTest, EmptyCallableRaisesTheBadCallError) {
  Create();
  m_window.Ui().Post({});
  EXPECT_THROW(m_window.RunMessageLoop(), std::bad_function_call);
}

TEST_F(WindowTest, WhatAnOperationThrowsComesOutOfTheLoop) {
  Create();
  m_window.throwsAt = WM_APP + 1;
  PostMessageW(m_window.Handle(), WM_APP + 1, 0, 0);
  EXPECT_THROW(m_window.RunMessageLoop(), std::runtime_error);
  m_engine.CallNative("throw", {});
  PostMessageW(m_window.Handle(), WM_NULL, 0, 0);
  EXPECT_THROW(m_window.RunMessageLoop(), std::runtime_error);
}

// Any process of the desktop may send any message.
TEST_F(WindowTest, PrivateMessagesWithAddressesOfOthersDoNothing) {
  Create();
  for (const WPARAM address : {WPARAM{0}, WPARAM{1}, reinterpret_cast<WPARAM>(&m_window), ~WPARAM{0}}) {
    SendMessageW(m_window.Handle(), UiThread::kRunMessage, address, 0);
    SendMessageW(m_window.Handle(), UiThread::kCloseMessage, address, 0);
  }
  EXPECT_NE(m_window.Handle(), nullptr);
}

TEST_F(WindowTest, EngineGetsItsAnswers) {
  logging::ErrorCapture log(logging::Level::kTrace);
  Create();
  uint32_t groups = 0;
  EXPECT_TRUE(m_engine.eventProc(m_engine.eventTag, nullptr, HTML_EVENTS_SUBSCRIBE, &groups));
  EXPECT_EQ(groups, HTML_EVENTS_SCRIPT_CALL);
  EXPECT_FALSE(m_engine.eventProc(m_engine.eventTag, nullptr, 1, &groups));
  EXPECT_EQ(m_engine.CallNative("f", {FakeHtmlEngine::Node::Int(1)}).ToText(), L"{ \"f\" : 1 }");
  log.Take();
  m_engine.debugOutput(m_engine.debugParam, 3, HTML_WARNING, L"a text, cut", 6);
  m_engine.debugOutput(m_engine.debugParam, 9, HTML_ERROR, nullptr, 5);
  EXPECT_THAT(log.Take(),
              ElementsAre(L"qx::gui::Window::DebugOutput: script: a text", L"qx::gui::Window::DebugOutput: html: "));
  HtmlLoadData request{};
  request.header.code = HTML_LOAD_DATA;
  for (const wchar_t* uri : {L"res:none.htm", L"file://x", static_cast<const wchar_t*>(nullptr)}) {
    request.uri = uri;
    EXPECT_EQ(m_engine.callback(&request.header, m_engine.callbackParam), 0u);
  }
  EXPECT_EQ(m_engine.supplied, "");
  request.uri = L"res://page.HTM";  // of this test program
  m_engine.callback(&request.header, m_engine.callbackParam);
  EXPECT_EQ(m_engine.supplied, "<p>resource</p>");
}
