#include "companions/engine/page_session.h"

#include <algorithm>
#include <cmath>

#include "companions/engine/base64.h"
#include "companions/engine/console_message.h"
#include "companions/engine/embedded_text.h"
#include "companions/engine/page_document.h"
#include "companions/engine/value_json.h"
#include "core/files.h"
#include "core/json.h"
#include "core/scope_exit.h"
#include "core/text.h"

namespace engine {
namespace {

using Clock = DevToolsClient::Clock;
using Outcome = DevToolsClient::Outcome;

constexpr uint64_t kLargestResource = uint64_t{32} << 20;
constexpr int kMostDepartures = 3;  // a page that goes away each time it is loaded would do nothing else

Json::Value With(const char* name, Json::Value value) {
  Json::Value object(Json::objectValue);
  object[name] = std::move(value);
  return object;
}

}  // namespace

bool PageSession::Begin(std::unique_ptr<Transport> transport) {
  DevToolsClient::Listener listener;
  listener.onEvent = [this](const DevToolsMessage& event) { OnEvent(event); };
  listener.onComplaint = [this](const std::wstring& text) { Complain(text); };
  listener.wake = m_wake;
  m_client = std::make_unique<DevToolsClient>(std::move(transport), std::move(listener));
  if (Attach() && Prepare()) return true;
  Complain(L"the browser cannot be used: " + (IsLost() ? m_client->LostBecause() : L"it does not do what it is told"));
  return false;
}

bool PageSession::Attach() {
  const auto deadline = Clock::now() + m_timeouts.command;
  std::string target;
  while (target.empty() && Clock::now() < deadline) {
    Json::Value result;
    if (m_client->Call("Target.getTargets", {}, result, m_timeouts.command) != Outcome::kDone) return false;
    for (const Json::Value& info : MemberOf(result, "targetInfos")) {
      if (TextOf(info, "type") == "page") target = TextOf(info, "targetId");
    }
    if (target.empty()) m_client->Drain(Clock::now() + std::chrono::milliseconds(20));  // it opens its page in a moment
  }
  Json::Value params = With("targetId", target);
  params["flatten"] = true;
  Json::Value result;
  if (m_client->Call("Target.attachToTarget", params, result, m_timeouts.command) != Outcome::kDone) return false;
  m_client->UseSession(TextOf(result, "sessionId"));
  return !TextOf(result, "sessionId").empty();
}

bool PageSession::Prepare() {
  for (const char* const domain : {"Page.enable", "Runtime.enable", "Log.enable"})
    m_client->Send(domain);
  m_client->Send("Page.setDownloadBehavior", With("behavior", "deny"));
  // Answers come in the order of the commands: with this one, all are done.
  Json::Value patterns(Json::arrayValue);
  patterns.append(With("urlPattern", "*"));
  return Command("Fetch.enable", With("patterns", patterns));
}

bool PageSession::Command(const char* method, const Json::Value& params) {
  Json::Value result;
  return m_client->Call(method, params, result, m_timeouts.command) == Outcome::kDone;
}

bool PageSession::Load(const std::wstring& address) {
  const auto page = ToPageAddress(address);
  if (!page || IsLost()) {
    Complain(L"the page '" + address + (page ? L"' cannot be loaded: there is no browser" : L"' has no valid address"));
    return false;
  }
  m_page = *page;
  m_isLoaded = false;
  const auto deadline = Clock::now() + m_timeouts.load;
  Json::Value result;
  Outcome outcome = m_client->Call("Page.navigate", With("url", page->browserUrl), result, m_timeouts.load);
  const std::string error = TextOf(result, "errorText");
  if (outcome == Outcome::kDone && error.empty()) {
    while (!m_isLoaded && m_client->Drain(deadline)) {
    }
    m_isShown = m_isShown || m_isLoaded;
    if (m_isLoaded) return true;
    outcome = IsLost() ? Outcome::kLost : Outcome::kTimedOut;
  }
  const std::wstring why = outcome == Outcome::kLost       ? m_client->LostBecause()
                           : outcome == Outcome::kTimedOut ? L"it takes too long"
                                                           : ToWide(error);
  Complain(L"the page '" + address + L"' cannot be loaded: " + why);
  return false;
}

void PageSession::Resize(int width, int height, double scale) {
  if (m_client == nullptr || width <= 0 || height <= 0) return;
  Json::Value params(Json::objectValue);
  params["width"] = static_cast<int>(std::lround(width / scale));
  params["height"] = static_cast<int>(std::lround(height / scale));
  params["deviceScaleFactor"] = scale;
  params["mobile"] = false;
  m_client->Send("Emulation.setDeviceMetricsOverride", params);
}

void PageSession::BeginFrames() {
  if (m_client != nullptr) m_client->Send("Page.startScreencast", With("format", "png"));
}

void PageSession::SetFocus(bool hasFocus) {
  if (m_client != nullptr) m_client->Send("Emulation.setFocusEmulationEnabled", With("enabled", hasFocus));
}

void PageSession::SendInput(const char* method, const Json::Value& params) {
  if (m_client == nullptr) return;
  // While the page waits for native code it can take nothing.
  const auto silentSince = m_waiting.empty() ? m_client->SilentSince() : std::nullopt;
  if (silentSince && Clock::now() - *silentSince > m_timeouts.input) return GiveUp(L"the page hangs");
  m_client->SendWatched(method, params);
}

void PageSession::GiveUp(const std::wstring& why) {
  if (!std::exchange(m_isLossReported, true)) Complain(why);
  m_client->Close();
}

void PageSession::Drain() {
  if (m_client == nullptr) return;
  ReleaseFunctionsOfPage();
  m_client->Drain();
  if (!IsLost() || std::exchange(m_isLossTold, true)) return;
  if (!m_isLossReported) Complain(L"the browser is gone: " + m_client->LostBecause());
  if (m_isShown) m_host.PageLost();
}

void PageSession::End() {
  m_isLossTold = true;
  if (m_client == nullptr) return;
  m_client->Send("Browser.close");
  m_client->Close();
}

void PageSession::Complain(const std::wstring& text) {
  m_host.Report(HTML_SUBSYSTEM_DOM, HTML_ERROR, text);
}

// --- What the browser tells

void PageSession::OnEvent(const DevToolsMessage& event) {
  const Json::Value& params = event.content;
  if (event.method == "Fetch.requestPaused") {
    OnRequest(params);
  } else if (event.method == "Page.screencastFrame") {
    OnFrame(params);
  } else if (event.method == "Page.loadEventFired") {
    m_isLoaded = true;
  } else if (event.method == "Page.javascriptDialogOpening") {  // of a frame, or before unloading
    m_host.Report(HTML_SUBSYSTEM_SCRIPT, HTML_WARNING, L"a dialog was not shown: " + ToWide(TextOf(params, "message")));
    m_client->Send("Page.handleJavaScriptDialog", With("accept", TextOf(params, "type") == "alert"));
  } else if (event.method == "Inspector.targetCrashed" || event.method == "Inspector.detached") {
    GiveUp(L"the page has crashed");
  } else if (event.method == "Page.frameNavigated") {
    OnNavigated(MemberOf(params, "frame"));
  } else if (const auto message = ReadConsoleMessage(event)) {
    m_host.Report(message->subsystem, message->severity, message->text);
  }
}

// Only what needs no request gets here: "about:blank", a blob. All else was refused before.
void PageSession::OnNavigated(const Json::Value& frame) {
  const std::string url = TextOf(frame, "url");
  if (!m_isShown || frame.isMember("parentId") || ToEngineUri(url)) return;
  if (++m_departures > kMostDepartures) return GiveUp(L"the page does not stay");
  Complain(L"the page went to '" + ToWide(url) + L"'; it is loaded again");
  m_client->Send("Page.navigate", With("url", m_page.browserUrl));
}

void PageSession::OnFrame(const Json::Value& params) {
  m_host.ShowFrame(TextOf(params, "data"));
  // The next frame comes only after this.
  m_client->Send("Page.screencastFrameAck", With("sessionId", MemberOf(params, "sessionId")));
}

void PageSession::OnRequest(const Json::Value& params) {
  const std::string requestId = TextOf(params, "requestId");
  const Json::Value& request = MemberOf(params, "request");
  const std::string url = TextOf(request, "url");
  if (IsNativeCall(url)) {
    Json::Value message;
    std::string error;
    if (ParseJson(TextOf(request, "postData"), message, error) && message.isObject()) {
      return OnNativeCall(requestId, message);
    }
    return Answer(requestId, "application/json", R"({"error":"native code cannot read this call"})");
  }
  // Every browser asks for an icon of the site, which no page here has.
  if (IsSiteIcon(url)) return Answer(requestId, "image/x-icon", {});
  // A page that wants to go elsewhere stays where it is.
  const char* const refusal = TextOf(params, "resourceType") == "Document" ? "Aborted" : "BlockedByClient";
  if (const auto uri = ToEngineUri(url)) return Supply(requestId, *uri, refusal);
  m_host.Report(HTML_SUBSYSTEM_DOM, HTML_ERROR, L"refused, because it lies outside of the page: " + ToWide(url));
  Refuse(requestId, refusal);
}

void PageSession::Supply(const std::string& requestId, const std::wstring& uri, const char* refusal) {
  bool isDiscarded = false;
  const auto bytes = LoadResource(uri, isDiscarded);
  m_host.DataLoaded(uri, bytes ? &*bytes : nullptr);
  if (bytes) {
    const std::string_view type = MimeTypeOf(uri);
    const bool isPage = type.starts_with("text/html");
    return Answer(requestId, type, isPage ? WithLeadingScript(*bytes, kPageBridgeScript) : *bytes);
  }
  if (!isDiscarded) {
    m_host.Report(HTML_SUBSYSTEM_DOM, HTML_ERROR, L"cannot be loaded: " + uri);
  }
  Refuse(requestId, isDiscarded ? "Aborted" : refusal);
}

std::optional<std::string> PageSession::LoadResource(const std::wstring& uri, bool& isDiscarded) {
  PageHost::Supply supply = m_host.LoadData(uri);
  isDiscarded = supply.isDiscarded;
  if (isDiscarded || supply.bytes) return std::move(supply.bytes);
  const auto path = PathInside(uri, m_page.folder);
  std::string bytes;
  if (!path || ReadWholeFile(*path, kLargestResource, bytes) != ERROR_SUCCESS) return {};
  return bytes;
}

void PageSession::Answer(const std::string& requestId, std::string_view type, const std::string& body) {
  Json::Value headers(Json::arrayValue);
  const auto add = [&](const char* name, const std::string& value) {
    Json::Value header = With("name", name);
    header["value"] = value;
    headers.append(header);
  };
  add("Content-Type", std::string(type));
  add("Cache-Control", "no-store");
  add("Access-Control-Allow-Origin", "*");
  Json::Value params = With("requestId", requestId);
  params["responseCode"] = 200;
  params["responseHeaders"] = headers;
  params["body"] = ToBase64(body);
  m_client->Send("Fetch.fulfillRequest", params);
}

void PageSession::Refuse(const std::string& requestId, const char* reason) {
  Json::Value params = With("requestId", requestId);
  params["errorReason"] = reason;
  m_client->Send("Fetch.failRequest", params);
}

// --- Calls between the page and native code

void PageSession::OnNativeCall(const std::string& requestId, const Json::Value& message) {
  if (message.isMember("notice")) {
    Answer(requestId, "application/json", "{}");
    return m_host.OnNotice(message["notice"]);
  }
  if (!message.isMember("call")) {
    // The outcome of a function that ran for the innermost waiting call.
    if (m_waiting.empty() || !m_waiting.back()->requestId.empty()) return Refuse(requestId, "Aborted");
    m_waiting.back()->requestId = requestId;
    m_waiting.back()->outcome = message;
    return;
  }
  const auto self = shared_from_this();  // native code may close the window
  const auto call = std::make_shared<WaitingCall>();
  call->requestId = requestId;
  Json::Value reply;
  try {
    reply = ReplyTo(message, call);
  } catch (const std::exception& exception) {  // no memory; without an answer the page would wait for ever
    reply = With("error", "native code has failed");
    Complain(L"a call of the page has failed: " + ToWide(exception.what()));
  }
  if (!call->requestId.empty()) Answer(call->requestId, "application/json", WriteCompactJson(reply));
}

Json::Value PageSession::ReplyTo(const Json::Value& message, const std::shared_ptr<WaitingCall>& call) {
  std::vector<ScriptValue> arguments;
  for (const Json::Value& argument : MemberOf(message, "args"))
    arguments.push_back(FromWire(argument, weak_from_this()));
  const std::string name = TextOf(message, "call");
  ScriptValue result;
  bool isHandled = false;
  {
    m_waiting.push_back(call);
    const ScopeExit end([this] { m_waiting.pop_back(); });
    isHandled = m_host.ScriptCall(name, arguments, result);
  }
  m_client->NoteLife();
  if (!isHandled) {
    m_host.Report(HTML_SUBSYSTEM_SCRIPT, HTML_ERROR, L"the page calls '" + ToWide(name) + L"', which nobody handles");
    return With("error", "there is no native function '" + name + "'");
  }
  const Text* error = result.As<Text>();
  return error != nullptr && error->isError ? With("error", ToUtf8(error->text)) : With("value", ToWire(result));
}

bool PageSession::CallByName(const std::string& name, const std::vector<ScriptValue>& arguments, ScriptValue& result) {
  return RunInPage(With("name", name), arguments, result);
}

bool PageSession::CallOwn(const char* function, const std::vector<ScriptValue>& arguments, ScriptValue& result) {
  return RunInPage(With("own", function), arguments, result);
}

bool PageSession::CallFunction(uint64_t id, const std::vector<ScriptValue>& arguments, ScriptValue& result) {
  const auto host = m_hostLife.lock();
  if (host != nullptr) return RunInPage(With("id", Json::UInt64{id}), arguments, result);
  result = ScriptValue::Error(L"there is no page");
  return false;
}

bool PageSession::RunInPage(Json::Value job, const std::vector<ScriptValue>& arguments, ScriptValue& result) {
  const auto self = shared_from_this();  // the page may call native code that closes the window
  if (IsLost()) {
    result = ScriptValue::Error(L"there is no page");
    Complain(L"a page function cannot be called: there is no page");
    return false;
  }
  ReleaseFunctionsOfPage();
  job["args"] = ToWire(ScriptValue::Of(arguments));
  const auto outcome = m_waiting.empty() ? RunByEvaluation(job) : RunByWaitingCall(job);
  m_isSlow = !outcome;
  const std::string error = outcome ? TextOf(*outcome, "threw") : "the page does not answer";
  if (error.empty()) {
    result = FromWire(MemberOf(*outcome, "returned"), weak_from_this());
    return true;
  }
  result = ScriptValue::Error(ToWide(error));
  m_host.Report(HTML_SUBSYSTEM_SCRIPT, HTML_ERROR, L"a call into the page failed: " + ToWide(error));
  return false;
}

std::optional<Json::Value> PageSession::RunByEvaluation(const Json::Value& job) {
  Json::Value params = With("expression", "stEngine.perform(" + WriteCompactJson(job) + ")");
  params["returnByValue"] = true;
  Json::Value answer;
  const auto timeout = m_isSlow ? m_timeouts.slowScript : m_timeouts.script;
  const Outcome outcome = m_client->Call("Runtime.evaluate", params, answer, timeout);
  if (outcome == Outcome::kTimedOut || outcome == Outcome::kLost) return {};
  const Json::Value& value = MemberOf(MemberOf(answer, "result"), "value");
  if (value.isObject()) return value;
  return With("threw", "the document that is shown is no page of the program");
}

std::optional<Json::Value> PageSession::RunByWaitingCall(const Json::Value& job) {
  const auto call = m_waiting.back();
  if (call->requestId.empty()) return {};  // a function that it runs has timed out
  Answer(std::exchange(call->requestId, {}), "application/json", WriteCompactJson(With("run", job)));
  const auto start = Clock::now();
  const auto timeout = m_isSlow ? m_timeouts.slowScript : m_timeouts.script;
  while (!call->outcome && m_client->Drain(std::max(start, m_client->LastLife()) + timeout)) {
  }
  return std::exchange(call->outcome, {});
}

void PageSession::ReleaseFunction(uint64_t id) noexcept {
  bool isFirst = false;
  {
    const std::lock_guard guard(m_releaseLock);
    isFirst = m_released.empty();
    m_released.push_back(id);
  }
  if (isFirst) m_wake();
}

void PageSession::ReleaseFunctionsOfPage() {
  Json::Value ids(Json::arrayValue);
  {
    const std::lock_guard guard(m_releaseLock);
    for (const uint64_t id : std::exchange(m_released, {}))
      ids.append(Json::UInt64{id});
  }
  if (ids.empty()) return;
  m_client->Send("Runtime.evaluate", With("expression", "stEngine.release(" + WriteCompactJson(ids) + ")"));
}

}  // namespace engine
