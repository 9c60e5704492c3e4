// The issue-report window with an engine whose page the test plays. What the window asks of the rest of the program is
// recorded here, or answered by what the test sets.
#pragma once

#include <windows.h>

#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <utility>
#include <vector>

#include "core/scoped.h"
#include "gui/tis_wnd.h"
#include "tests/support/fake_html_engine.h"
#include "tests/support/message_pump.h"
#include "tests/support/test_folder.h"

inline qx::Value Object(std::initializer_list<std::pair<const wchar_t*, qx::Value>> members) {
  qx::Value object = qx::Value::EmptyObject();
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
    m_engine.functions["on_api_notif"] = [this](const std::vector<qx::Value>& arguments) {
      m_notified.push_back(std::wstring(arguments.at(0).AsString()) + L" " + arguments.at(1).ToText());
      return qx::Value();
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
    services.showMessage = [this](HWND owner, const std::wstring& text) {
      EXPECT_EQ(owner, m_window->Handle());
      m_messages.push_back(text);
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
  qx::Value Call(const std::string& name, const qx::Value& request) {
    return m_engine.CallNative(name, {FakeHtmlEngine::Node::From(request)});
  }
  std::string Succeeds(const std::string& name, const qx::Value& request) {
    return m_engine.CallNative(name, {FakeHtmlEngine::Node::From(request)}).ToJsonText();
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
  std::vector<std::wstring> m_messages;
  std::unique_ptr<TisWnd> m_window;
};

inline constexpr char kYes[] = "{\"success\":true}\n";
inline constexpr char kNo[] = "{\"success\":false}\n";
