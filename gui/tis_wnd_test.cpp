// The issue-report window: bridge and language.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <thread>

#include "core/logging.h"
#include "gui/window_messages.h"
#include "tests/support/tis_wnd_fixture.h"

namespace {

using Node = FakeHtmlEngine::Node;
using qx::Value;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;

}  // namespace

TEST_F(TisWndTest, ScriptCallsAreAnsweredByTheirArgumentCount) {
  Create();
  m_bus->Subscribe(L"tis_echo", [](Value& message) { message.Member(L"response") = message.Member(L"request"); });
  EXPECT_EQ(m_engine.CallNative("echo", {Node::Int(5)}).ToText(), L"5");
  EXPECT_EQ(m_engine.CallNative("echo", {}).ToText(), L"null");
  EXPECT_EQ(m_engine.CallNative("no_such_function", {Node::Int(5)}).ToText(), L"{  }");
  EXPECT_EQ(m_engine.CallNative("echo", {Node::Int(1), Node::Int(2), Node::Int(3)}).ToText(),
            L"{ \"error\" : \"Expecting 0/1 arguments for sync calls or 2 for async calls.\" }");
  EXPECT_THAT(m_engine.CallNative("echo", {Node::Int(1), Node::Int(2)}).ToText(), HasSubstr(L"not a function"));
}

TEST_F(TisWndTest, AsynchronousCallRunsElsewhereAndAnswersOnTheWindowsThread) {
  Create();
  std::atomic<DWORD> handlerThread{0};
  m_bus->Subscribe(L"tis_slow", [&](Value& message) {
    handlerThread = GetCurrentThreadId();
    message.Member(L"response") = message.Member(L"request");
  });
  std::wstring answer;
  const auto callback = [&](const std::vector<Value>& arguments) {
    answer = arguments.at(0).ToText();
    return Value();
  };
  EXPECT_EQ(m_engine.CallNative("slow", {Node::Int(5), Node::Callable(callback)}).GetType(), Value::kNull);
  EXPECT_EQ(answer, L"");
  EXPECT_TRUE(PumpUntil([&] { return answer == L"5"; }));
  EXPECT_NE(handlerThread, GetCurrentThreadId());
  EXPECT_EQ(m_engine.LiveValues(), 0u);
}

TEST_F(TisWndTest, TenThousandCallsInARowAreAllAnswered) {
  Create();
  int answers = 0;
  for (int i = 0; i < 10'000; ++i) {
    Call("select_issue", Object({{L"issue", L"slow"}, {L"description", i}}));
    m_engine.CallNative("select_issue", {Node::Int(i), Node::Callable([&](const std::vector<Value>&) {
                                           ++answers;
                                           return Value();
                                         })});
  }
  EXPECT_TRUE(PumpUntil([&] { return answers == 10'000; }));
  EXPECT_EQ(m_engine.LiveValues(), 0u);
}

TEST_F(TisWndTest, AnswersThatComeAfterTheWindowAreDropped) {
  Create();
  const KernelHandle go(CreateEventW(nullptr, TRUE, FALSE, nullptr));
  m_bus->Subscribe(L"tis_slow", [&](Value&) { WaitForSingleObject(go.Get(), INFINITE); });
  bool answered = false;
  m_engine.CallNative("slow", {Node::Int(5), Node::Callable([&](const std::vector<Value>&) {
                                 answered = true;
                                 return Value();
                               })});
  DestroyWindow(m_window->Handle());
  EXPECT_EQ(m_engine.LiveValues(), 0u);
  SetEvent(go.Get());
  m_window.reset();
  EXPECT_FALSE(answered);
}

TEST_F(TisWndTest, MessagesOfAnyShapeAreAnswered) {
  Create();
  Node deep = Node::Int(1);
  for (int i = 0; i < 900; ++i) {
    Node outer;
    outer.type = HTML_VALUE_ARRAY;
    outer.elements.push_back(std::move(deep));
    deep = std::move(outer);
  }
  std::vector<Node> shapes{Node(),
                           Node::Int(1),
                           Node::From(true),
                           Node::From(L"text"),
                           Node::From(Value::EmptyArray()),
                           Node::From(Value::EmptyObject()),
                           Node::From(std::wstring(1 << 20, L'x')),
                           std::move(deep),
                           Node::Callable([](const std::vector<Value>&) { return Value(); }),
                           Node::From(Object({{L"user_name", 1}, {L"user_email", L"a@b.cc"}, {L"agreed_licence", 1}})),
                           Node::From(Object({{L"issue", L"x"}, {L"description", Value()}}))};
  for (const char* name : {"notif", "call_function", "validate_user_details", "select_issue", "translate", "", "\xFF",
                           "get_state", "cancel"}) {
    for (const Node& shape : shapes) {
      const Value answer = m_engine.CallNative(name, {shape});
      EXPECT_EQ(answer.GetType(), Value::kObject) << name;
      if (answer.HasMember(L"success") && name != std::string("get_state")) {
        EXPECT_FALSE(answer.Member(L"success").IsTrue()) << name;
      }
    }
  }
  EXPECT_EQ(m_window->ReportData().GetType(), Value::kNull);
  EXPECT_EQ(m_engine.LiveValues(), 0u);
}

TEST_F(TisWndTest, NativeCodeNotifiesAndCallsThePageFromAnyThread) {
  logging::ErrorCapture log(logging::Level::kTrace);
  Create();
  m_engine.functions["sum"] = [](const std::vector<Value>& arguments) {
    return arguments.at(0).Element(0).AsNumber() + arguments.at(0).Element(1).AsNumber();
  };
  qx::TisComm comm(m_bus);
  Value numbers;
  numbers.Append(40);
  numbers.Append(2);
  EXPECT_EQ(comm.Call(L"sum", numbers).AsNumber(), 42);
  EXPECT_EQ(comm.Call(L"none", numbers).GetType(), Value::kNull);
  std::atomic<double> sum{0};
  std::thread other([&] {
    sum = comm.Call(L"sum", numbers).AsNumber();
    comm.Notify(L"on_finished");
    comm.Notify(L"on_error", L"unknown");
  });
  EXPECT_TRUE(PumpUntil([&] { return m_notified.size() == 2; }));
  other.join();
  EXPECT_EQ(sum, 42);
  EXPECT_THAT(m_notified, ElementsAre(L"on_finished {  }", L"on_error \"unknown\""));
  EXPECT_THAT(log.Take(), Contains(HasSubstr(L"on_api_notif [functionName on_error] [param \"unknown\"]")));
  Value incomplete = Object({{L"functionName", L"sum"}});
  m_bus->Publish(L"tis_call_function", incomplete);
  EXPECT_THAT(log.Take(), Contains(HasSubstr(L"TisWnd::TisCallFunction: invalid call_function json [exception: key not "
                                             L"found [args]")));
}

TEST_F(TisWndTest, ScriptCallIsLoggedWithItsArguments) {
  logging::ErrorCapture log(logging::Level::kTrace);
  Create();
  m_engine.CallNative("none", {Node::From(Object({{L"a", 1}}))});
  EXPECT_THAT(log.Take(), Contains(L"TisWnd::on_script_call: [functionName = none] [n_params = 1] [params = [param0 = "
                                   L"{ \"a\" : 1 }]]"));
}

TEST_F(TisWndTest, ClosingSignalsTheStopEvent) {
  Create();
  EXPECT_EQ(Succeeds("close", Value()), kYes);
  EXPECT_EQ(WaitForSingleObject(m_stop.Get(), 0), WAIT_OBJECT_0);
  DestroyWindow(m_window->Handle());
  EXPECT_EQ(WaitForSingleObject(m_stop.Get(), 0), WAIT_OBJECT_0);
  m_window->RunMessageLoop();
}

TEST_F(TisWndTest, PageFollowsTheInstallersLanguage) {
  const std::string big(50 << 20, ' ');
  const struct {
    const char* yaml;
    const wchar_t* page;
    std::vector<std::wstring> lines;
  } cases[] = {
      {nullptr,
       L"en",
       {L"TisWnd::GetInstallInfo: could not find install info file from kit installer",
        L"TisWnd::Init: could not find language from install info. loading default language [language "
        L"english]"}},
      {"UserPreferences: {language: romana}", L"ro", {}},
      {"UserPreferences:\n  language: \"English\"", L"en", {}},
      {"UserPreferences: {}",
       L"en",
       {L"TisWnd::GetLanguageFromInstallInfo: can't find language chosen in the installer "
        L"[exception: key not found [language], [{  }]]"}},
      {"UserPreferences: {language: [romana]}",
       L"en",
       {L"TisWnd::GetLanguageFromInstallInfo: can't find language chosen "
        L"in the installer [exception: invalid type [string != array], "
        L"[[ \"romana\" ]]]"}},
      {"",
       L"en",
       {L"TisWnd::GetLanguageFromInstallInfo: can't find language chosen in the installer [exception: invalid "
        L"type [dict != null] for [key UserPreferences], [null]]"}},
      {"a: [",
       L"en",
       {L"TisWnd::Init: could not find language from install info. loading default language [language "
        L"english]"}},
      {big.c_str(),
       L"en",
       {L"TisWnd::Init: could not find language from install info. loading default language [language "
        L"english]"}},
  };
  for (const auto& one : cases) {
    SCOPED_TRACE(one.yaml == nullptr ? "no file" : std::string(one.yaml).substr(0, 40));
    if (one.yaml != nullptr) m_folder.MakeFile(L"kitinstaller\\settings\\install_info.yaml", one.yaml);
    logging::ErrorCapture log(logging::Level::kTrace);
    m_engine.loaded.clear();
    Create();
    EXPECT_THAT(m_engine.loaded,
                ElementsAre(L"file://" + m_folder.Path() + L"\\gui\\new\\support_tool_" + one.page + L".html"));
    const std::vector<std::wstring> lines = log.Take();
    for (const std::wstring& line : one.lines)
      EXPECT_THAT(lines, Contains(line));
    if (one.lines.empty()) {
      EXPECT_THAT(lines, Not(Contains(HasSubstr(L"could not find language"))));
    }
  }
}

TEST_F(TisWndTest, MissingPageIsSaidAndTheWindowCloses) {
  logging::ErrorCapture errors;
  DeleteFileW(m_folder.Path(L"gui\\new\\support_tool_en.html").c_str());
  Create();
  EXPECT_THAT(errors.Take(), ElementsAre(L"TisWnd::Init: Failed to create window from file '" + m_folder.Path() +
                                         L"\\gui\\new\\support_tool_en.html'"));
  EXPECT_THAT(m_messages, ElementsAre(qx::kPageFailedText));
  m_window->RunMessageLoop();
  EXPECT_EQ(m_window->Handle(), nullptr);
  EXPECT_EQ(WaitForSingleObject(m_stop.Get(), 0), WAIT_OBJECT_0);
}

TEST_F(TisWndTest, PageThatIsLostIsToldAfterLoggingIsBackAndTheWindowCloses) {
  Create();
  Call("start_issue_reproduction", Value());
  HtmlNotification lost{HTML_GRAPHICS_FAILURE, m_window->Handle()};
  m_engine.callback(&lost, m_engine.callbackParam);
  EXPECT_TRUE(m_messages.empty());  // the engine does not wait for the user
  m_window->RunMessageLoop();
  EXPECT_EQ(m_window->Handle(), nullptr);
  EXPECT_THAT(m_messages, ElementsAre(qx::kPageLostText));
  EXPECT_THAT(m_logging, ElementsAre("activate", "restore"));
}
