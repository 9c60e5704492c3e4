// An HTML engine without HTML, in the process of the test: it keeps script values, remembers what the host asked of it,
// calls the host as a page would, and lets the test write the page's functions. One lives at a time.
#pragma once

#include <windows.h>

#include <functional>
#include <map>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "core/value.h"
#include "interfaces/html_engine.h"

class FakeHtmlEngine {
 public:
  using Function = std::function<qx::Value(const std::vector<qx::Value>&)>;

  // A value as a page has it, beyond what qx::Value can say.
  struct Node {
    uint32_t type = HTML_VALUE_UNDEFINED;
    uint32_t unit = 0;
    double number = 0;
    std::wstring text;
    std::vector<Node> elements;
    std::vector<std::pair<std::wstring, Node>> members;
    Function function;

    // Out of line: the members hold the type itself.
    Node();
    Node(const Node& other);
    Node(Node&& other) noexcept;
    Node& operator=(const Node& other);
    Node& operator=(Node&& other) noexcept;
    ~Node();

    static Node From(const qx::Value& value);
    static Node Int(int value);
    static Node Callable(Function function);
    qx::Value ToValue() const;
  };

  FakeHtmlEngine();
  ~FakeHtmlEngine();
  FakeHtmlEngine(const FakeHtmlEngine&) = delete;
  FakeHtmlEngine& operator=(const FakeHtmlEngine&) = delete;

  const HtmlEngineApi& Api() const { return m_api; }

  // A page's script calls native code; the call's result.
  qx::Value CallNative(const std::string& name, const std::vector<Node>& arguments);

  // Values that the host has not cleared.
  size_t LiveValues() const { return m_values.size(); }
  HtmlValue Make(const Node& node);
  const Node& Of(const HtmlValue& value) const;
  void Clear(HtmlValue& value);

  // What the test sets.
  bool loads = true;
  RECT root = {0, 0, 640, 480};
  std::map<std::string, Function> functions;  // of the page

  // What the host did.
  std::vector<std::wstring> loaded;
  HtmlHostCallback callback = nullptr;
  void* callbackParam = nullptr;
  HtmlDebugOutput debugOutput = nullptr;
  void* debugParam = nullptr;
  HtmlEventProc eventProc = nullptr;
  void* eventTag = nullptr;
  std::string supplied;  // with SciterDataReady
  size_t callsFromOtherThreads = 0;

 private:
  friend struct FakeHtmlEngineTable;

  HtmlEngineApi m_api{};
  const std::thread::id m_thread = std::this_thread::get_id();
  std::map<uint64_t, Node> m_values;
  uint64_t m_lastId = 0;
};
