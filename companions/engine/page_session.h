// The conversation with the one page of a browser: loads it, answers its requests for resources, carries calls between
// its script and native code, sends it input and receives its picture. Knows no window; all of it happens on the thread
// that calls it, but for ReleaseFunction.
#pragma once

#include <atomic>
#include <chrono>
#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <vector>

#include "companions/engine/devtools_client.h"
#include "companions/engine/resource_address.h"
#include "companions/engine/script_value.h"
#include "interfaces/html_engine.h"

namespace engine {

// What a page wants of its window. Called from within the session's functions; may call back into it.
class PageHost {
 public:
  struct Supply {
    bool isDiscarded = false;
    std::optional<std::string> bytes;  // none: the engine shall load it
  };

  virtual ~PageHost() = default;
  virtual Supply LoadData(const std::wstring& uri) = 0;
  virtual void DataLoaded(const std::wstring& uri, const std::string* bytes) = 0;  // null: failed
  virtual bool ScriptCall(const std::string& name, const std::vector<ScriptValue>& arguments, ScriptValue& result) = 0;
  virtual void Report(HtmlSubsystem subsystem, HtmlSeverity severity, const std::wstring& text) = 0;
  virtual void ShowFrame(const std::string& base64) = 0;  // PNG
  virtual void OnNotice(const Json::Value& notice) = 0;   // page_bridge.js says which there are
  virtual void PageLost() = 0;                            // the page that was shown is gone for good, or hangs
};

// How long the browser may take.
struct PageTimeouts {
  std::chrono::milliseconds command{5000};
  std::chrono::milliseconds load{15000};
  std::chrono::milliseconds script{15000};     // a call into the page
  std::chrono::milliseconds slowScript{1000};  // the same, after one that was not answered
  std::chrono::milliseconds input{15000};      // to take what the user does, until it is given up
};

class PageSession : public FunctionHome, public std::enable_shared_from_this<PageSession> {
 public:
  // `wake` is called on any thread when Drain has something to do. The host calls the session only while it lives
  // itself; CallFunction, which others call, does nothing when the host is gone.
  PageSession(const std::shared_ptr<PageHost>& host, std::function<void()> wake, PageTimeouts timeouts = {})
      : m_hostLife(host), m_host(*host), m_wake(std::move(wake)), m_timeouts(timeouts) {}

  // Takes the browser's page over. False after a report.
  bool Begin(std::unique_ptr<Transport> transport);

  bool Load(const std::wstring& address);            // until the page and what it loads with are there
  void Resize(int width, int height, double scale);  // in pixels; `scale` pixels are one of the page's
  void BeginFrames();
  void SetFocus(bool hasFocus);
  void SendInput(const char* method, const Json::Value& params);
  void Drain();
  void End();

  bool IsLost() const { return m_client == nullptr || m_client->IsLost(); }

  bool CallByName(const std::string& name, const std::vector<ScriptValue>& arguments, ScriptValue& result);
  bool CallOwn(const char* function, const std::vector<ScriptValue>& arguments, ScriptValue& result);
  bool CallFunction(uint64_t id, const std::vector<ScriptValue>& arguments, ScriptValue& result) override;
  void ReleaseFunction(uint64_t id) noexcept override;

 private:
  // A call of the page that waits for native code. While a function of the page runs on its behalf it has no request.
  struct WaitingCall {
    std::string requestId;
    std::optional<Json::Value> outcome;  // of that function
  };

  bool Attach();
  bool Prepare();
  bool Command(const char* method, const Json::Value& params = {});
  void OnEvent(const DevToolsMessage& event);
  void OnRequest(const Json::Value& params);
  void OnNativeCall(const std::string& requestId, const Json::Value& message);
  Json::Value ReplyTo(const Json::Value& message, const std::shared_ptr<WaitingCall>& call);
  void OnFrame(const Json::Value& params);
  void OnNavigated(const Json::Value& frame);
  void GiveUp(const std::wstring& why);
  void Supply(const std::string& requestId, const std::wstring& uri, const char* refusal);
  std::optional<std::string> LoadResource(const std::wstring& uri, bool& isDiscarded);
  void Answer(const std::string& requestId, std::string_view type, const std::string& body);
  void Refuse(const std::string& requestId, const char* reason);
  bool RunInPage(Json::Value job, const std::vector<ScriptValue>& arguments, ScriptValue& result);
  std::optional<Json::Value> RunByEvaluation(const Json::Value& job);
  std::optional<Json::Value> RunByWaitingCall(const Json::Value& job);
  void ReleaseFunctionsOfPage();
  void Complain(const std::wstring& text);

  const std::weak_ptr<PageHost> m_hostLife;
  PageHost& m_host;
  const std::function<void()> m_wake;
  const PageTimeouts m_timeouts;
  std::unique_ptr<DevToolsClient> m_client;
  PageAddress m_page;
  bool m_isLoaded = false;
  bool m_isShown = false;  // the page was loaded once
  int m_departures = 0;    // how often it went to where nothing of the program is
  bool m_isLossReported = false;
  bool m_isLossTold = false;
  bool m_isSlow = false;  // the page let a call time out and has answered none since
  std::vector<std::shared_ptr<WaitingCall>> m_waiting;
  std::mutex m_releaseLock;
  std::vector<uint64_t> m_released;
};

}  // namespace engine
