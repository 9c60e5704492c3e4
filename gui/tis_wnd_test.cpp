// The issue-report window with an engine that a test plays the page of: bridge, workflow, submission, language.
#include "gui/tis_wnd.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <ctime>

#include "core/files.h"
#include "core/json.h"
#include "core/logging.h"
#include "core/scoped.h"
#include "core/text.h"
#include "tests/support/fake_html_engine.h"
#include "tests/support/message_pump.h"
#include "tests/support/test_folder.h"

namespace {

using Node = FakeHtmlEngine::Node;
using qx::Value;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;

Value Object(std::initializer_list<std::pair<const wchar_t*, Value>> members) {
  Value object = Value::EmptyObject();
  for (const auto& [key, member] : members)
    object.SetMember(key, member);
  return object;
}

class Translator : public qx::ILanguageManager {
 public:
  uint32_t Translate(const std::wstring& text, std::wstring& translation) const override {
    if (text != L"hello") return ERROR_NOT_FOUND;
    translation = L"salut";
    return 0;
  }
};

class TisWndTest : public testing::Test {
 protected:
  TisWndTest() {
    for (const wchar_t* page : {L"gui\\new\\support_tool_en.html", L"gui\\new\\support_tool_ro.html"})
      m_folder.MakeFile(page);
    m_engine.functions["on_api_notif"] = [this](const std::vector<Value>& arguments) {
      m_notified.push_back(std::wstring(arguments.at(0).AsString()) + L" " + arguments.at(1).ToText());
      return Value();
    };
  }
  ~TisWndTest() override {
    m_window.reset();
    EXPECT_EQ(m_engine.callsFromOtherThreads, 0u);
  }

  qx::TisServices Services() {
    qx::TisServices services;
    services.engine = &m_engine.Api();
    services.bus = m_bus;
    services.programFolder = m_folder.Path();
    services.collectData = [this](const std::atomic<bool>& cancel, const qx::CollectionProgress& progress,
                                  const qx::CollectionFolderReady& ready) {
      return m_collect(cancel, progress, ready);
    };
    services.activateLogging = [this] { return Logging("activate"); };
    services.disableLogging = [this] { return Logging("disable"); };
    services.restoreLogging = [this] { return Logging("restore"); };
    services.languageManager = [this](const std::wstring& catalogue) {
      m_catalogue = catalogue;
      return m_translator;
    };
    services.productConfig = [] { return nullptr; };
    return services;
  }
  void Create() {
    m_window = std::make_unique<TisWnd>(Services());
    m_window->SetStopEvent(m_stop.Get());
    ASSERT_TRUE(m_window->Init(HWND_MESSAGE));
  }
  bool Logging(const char* what) {
    const std::lock_guard lock(m_loggingMutex);
    m_logging.emplace_back(what);
    return m_loggingWorks;
  }
  Value Call(const std::string& name, const Value& request) { return m_engine.CallNative(name, {Node::From(request)}); }
  std::string Succeeds(const std::string& name, const Value& request) {
    return m_engine.CallNative(name, {Node::From(request)}).ToJsonText();
  }

  TestFolder m_folder;
  FakeHtmlEngine m_engine;
  std::shared_ptr<qx::PubSub> m_bus = std::make_shared<qx::PubSub>();
  const KernelHandle m_stop{CreateEventW(nullptr, FALSE, FALSE, nullptr)};
  std::function<int(const std::atomic<bool>&, const qx::CollectionProgress&, const qx::CollectionFolderReady&)>
      m_collect;
  std::mutex m_loggingMutex;
  std::vector<std::string> m_logging;
  bool m_loggingWorks = true;
  std::shared_ptr<qx::ILanguageManager> m_translator = std::make_shared<Translator>();
  std::wstring m_catalogue;
  std::vector<std::wstring> m_notified;
  std::unique_ptr<TisWnd> m_window;
};

constexpr char kYes[] = "{\"success\":true}\n";
constexpr char kNo[] = "{\"success\":false}\n";

}  // namespace

// --- The bridge

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

// --- The workflow

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

// --- The submission

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

// --- Window and language

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
  m_window->RunMessageLoop();
  EXPECT_EQ(m_window->Handle(), nullptr);
  EXPECT_EQ(WaitForSingleObject(m_stop.Get(), 0), WAIT_OBJECT_0);
}
