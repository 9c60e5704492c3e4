#include "companions/engine/view.h"

#include <algorithm>
#include <map>
#include <mutex>
#include <thread>

#include "companions/engine/base64.h"
#include "companions/engine/browser_finder.h"
#include "companions/engine/value_table.h"
#include "core/format.h"
#include "core/lock.h"
#include "core/text.h"

namespace engine {
namespace {

constexpr SIZE kLargestLayout = {4096, 4096};  // pixels

// Before it is shown, a host may have made its window of any size: the page is laid out for the screen on which it will
// be.
SIZE LargestLayout(HWND window) {
  MONITORINFO monitor{};
  monitor.cbSize = sizeof monitor;
  if (IsWindowVisible(window) || !GetMonitorInfoW(MonitorFromWindow(window, MONITOR_DEFAULTTOPRIMARY), &monitor)) {
    return kLargestLayout;
  }
  return {monitor.rcWork.right - monitor.rcWork.left, monitor.rcWork.bottom - monitor.rcWork.top};
}

struct Views {
  SharedLock lock;
  std::map<HWND, std::shared_ptr<View>> views;
};

Views& AllViews() {
  static Views s_views;
  return s_views;
}

bool HasElevatedRights() {
  KernelHandle token;
  TOKEN_ELEVATION elevation{};
  DWORD size = 0;
  return !OpenProcessToken(GetCurrentProcess(), TOKEN_QUERY, token.Receive()) ||
         !GetTokenInformation(token.Get(), TokenElevation, &elevation, sizeof elevation, &size) ||
         elevation.TokenIsElevated != 0;
}

UINT WakeMessage() {
  static const UINT s_message = RegisterWindowMessageW(L"st-engine-wake");
  return s_message;
}

std::vector<HtmlValue> ToRecords(const std::vector<ScriptValue>& values) {
  std::vector<HtmlValue> records(values.size());
  for (size_t i = 0; i < values.size(); ++i)
    WriteValue(values[i], records[i]);
  return records;
}

}  // namespace

EngineSettings& Settings() {
  static EngineSettings s_settings;
  return s_settings;
}

std::shared_ptr<View> View::Find(HWND window) {
  Views& all = AllViews();
  const std::lock_guard guard(all.lock);
  const auto found = all.views.find(window);
  return found == all.views.end() ? nullptr : found->second;
}

std::shared_ptr<View> View::Create(HWND window) {
  auto view = std::make_shared<View>(window);
  Views& all = AllViews();
  {
    const std::lock_guard guard(all.lock);
    all.views[window] = view;
  }
  view->StartBrowser(false);
  return view;
}

View::~View() = default;

void View::StartBrowser(bool usePort) {
  const std::wstring& chosen = Settings().browser;
  const std::wstring program = chosen.empty() ? FindBrowser() : chosen;
  if (program.empty()) {
    m_startError = L"no browser of the Chromium family was found on this machine";
  } else {
    m_browser.Start(program, usePort, m_startError);
  }
}

bool View::ConnectBrowser() {
  if (m_session != nullptr) return !m_session->IsLost();
  for (;;) {
    std::wstring error = m_startError;
    auto transport = error.empty() ? m_browser.Connect(error) : nullptr;
    if (transport == nullptr) {
      Report(HTML_SUBSYSTEM_DOM, HTML_ERROR, error);
      return false;
    }
    if (m_browser.RunsWithoutSandbox()) {
      Report(HTML_SUBSYSTEM_DOM, HTML_WARNING, L"the browser runs without its sandbox, because the user is root");
    }
    const auto session = std::make_shared<PageSession>(
        shared_from_this(), [window = m_window] { PostMessageW(window, WakeMessage(), 0, 0); });
    m_session = session;
    if (session->Begin(std::move(transport))) return true;
    session->End();
    if (m_browser.UsesPort() || m_isDestroyed) return false;
    // Whoever speaks with a browser's port has the browser's rights.
    if (HasElevatedRights()) {
      Report(HTML_SUBSYSTEM_DOM, HTML_ERROR, L"the browser takes no pipes, and a port would lend others these rights");
      return false;
    }
    Report(HTML_SUBSYSTEM_DOM, HTML_WARNING, L"the browser takes no pipes; it is started again with a port");
    m_browser.End();
    m_session = nullptr;
    StartBrowser(true);
  }
}

bool View::Load(const std::wstring& address) {
  const auto self = shared_from_this();
  if (m_isDestroyed || !ConnectBrowser()) return false;
  OnSize();
  return m_session->Load(address);
}

void View::Destroy() {
  if (std::exchange(m_isDestroyed, true)) return;
  const auto session = m_session;  // stays for calls that are on their way
  if (session != nullptr) session->End();
  m_browser.End();
  NotifyHost(HTML_ENGINE_DESTROYED);
  // It was the last: calls that are still on their way tell nobody any more.
  m_host = nullptr;
  m_debugOutput = nullptr;
  m_eventHandlers.clear();
}

void View::NotifyHost(HtmlNotificationCode code) {
  if (m_host == nullptr) return;
  HtmlNotification notification{static_cast<uint32_t>(code), m_window};
  m_host(&notification, m_hostParam);
}

void View::PageLost() {
  NotifyHost(HTML_GRAPHICS_FAILURE);
}

// --- The host's callbacks

PageHost::Supply View::LoadData(const std::wstring& uri) {
  if (m_host == nullptr) return {};
  HtmlLoadData data{};
  data.header = {HTML_LOAD_DATA, m_window};
  data.uri = uri.c_str();
  m_awaitedUri = &uri;
  m_suppliedData.reset();
  const uint32_t answer = m_host(&data.header, m_hostParam);
  m_awaitedUri = nullptr;
  Supply supply;
  // Nobody could complete a delayed request: that function is not in the table.
  supply.isDiscarded = answer != HTML_LOAD_BY_ENGINE;
  supply.bytes = std::exchange(m_suppliedData, {});
  if (!supply.isDiscarded && !supply.bytes && data.outData != nullptr) {
    supply.bytes.emplace(reinterpret_cast<const char*>(data.outData), data.outSize);
  }
  return supply;
}

bool View::SupplyData(const std::wstring& uri, const uint8_t* bytes, uint32_t size) {
  if (m_awaitedUri == nullptr || *m_awaitedUri != uri || (bytes == nullptr && size != 0)) return false;
  m_suppliedData.emplace(reinterpret_cast<const char*>(bytes), bytes == nullptr ? 0 : size);
  return true;
}

void View::DataLoaded(const std::wstring& uri, const std::string* bytes) {
  if (m_host == nullptr) return;
  HtmlDataLoaded loaded{};
  loaded.header = {HTML_DATA_LOADED, m_window};
  loaded.uri = uri.c_str();
  if (bytes != nullptr) {
    loaded.data = reinterpret_cast<const uint8_t*>(bytes->data());
    loaded.size = static_cast<uint32_t>(bytes->size());
    loaded.status = 200;
  }
  m_host(&loaded.header, m_hostParam);
}

bool View::ScriptCall(const std::string& name, const std::vector<ScriptValue>& arguments, ScriptValue& result) {
  std::vector<HtmlValue> records = ToRecords(arguments);
  HtmlScriptCall call{name.c_str(), records.data(), static_cast<uint32_t>(records.size()), {}};
  bool isHandled = false;
  const auto handlers = m_eventHandlers;  // a handler may detach itself
  for (const EventHandler& handler : handlers) {
    isHandled = handler.proc(handler.tag, m_window, HTML_EVENTS_SCRIPT_CALL, &call) != FALSE;
    if (isHandled) break;
  }
  if (isHandled) result = ReadValue(call.result);
  ClearValue(call.result);
  for (HtmlValue& record : records)
    ClearValue(record);
  return isHandled;
}

void View::AttachEvents(HtmlEventProc proc, void* tag) {
  m_eventHandlers.push_back({proc, tag});
}

bool View::DetachEvents(HtmlEventProc proc, void* tag) {
  const auto found = std::find_if(m_eventHandlers.begin(), m_eventHandlers.end(), [&](const EventHandler& handler) {
    return handler.proc == proc && handler.tag == tag;
  });
  if (found == m_eventHandlers.end()) return false;
  m_eventHandlers.erase(found);
  return true;
}

void View::Report(HtmlSubsystem subsystem, HtmlSeverity severity, const std::wstring& text) {
  const HtmlDebugOutput output = m_debugOutput != nullptr ? m_debugOutput : Settings().debugOutput;
  void* const param = m_debugOutput != nullptr ? m_debugParam : Settings().debugParam;
  if (output != nullptr) output(param, subsystem, severity, text.c_str(), static_cast<uint32_t>(text.size()));
}

// --- Calls into the page

bool View::Call(const std::string& function, const std::vector<ScriptValue>& arguments, ScriptValue& result) {
  const auto self = shared_from_this();
  if (m_session != nullptr && !m_isDestroyed) return m_session->CallByName(function, arguments, result);
  Report(HTML_SUBSYSTEM_SCRIPT, HTML_ERROR, L"a page function cannot be called: there is no page");
  return false;
}

bool View::RootBox(uint32_t areas, RECT& box) {
  static constexpr const wchar_t* kBoxes[] = {L"content", L"padding", L"border", L"margin"};
  ScriptValue result;
  const ScriptValue name(Text{kBoxes[(areas >> 4) & 3]});
  if (m_session == nullptr || !m_session->CallOwn("rootBox", {name}, result)) return false;
  const auto* edges = result.AsArray();
  LONG values[4] = {};
  if (edges == nullptr || edges->size() != 4) return false;
  for (size_t i = 0; i < 4; ++i) {
    const auto* edge = (*edges)[i].As<int32_t>();
    values[i] = edge == nullptr ? 0 : *edge;
  }
  box = {values[0], values[1], values[2], values[3]};
  if ((areas & 0xF) == HTML_AREA_SELF_RELATIVE) OffsetRect(&box, -box.left, -box.top);
  return true;
}

bool View::IntrinsicWidths(int& minimum, int& maximum) {
  ScriptValue result;
  if (m_session == nullptr || !m_session->CallOwn("widths", {}, result)) return false;
  const auto* widths = result.AsArray();
  if (widths == nullptr || widths->size() != 2) return false;
  const auto* low = (*widths)[0].As<int32_t>();
  const auto* high = (*widths)[1].As<int32_t>();
  if (low == nullptr || high == nullptr) return false;
  minimum = *low;
  maximum = *high;
  return true;
}

bool View::HeightAt(int width, int& height) {
  ScriptValue result;
  if (m_session == nullptr || !m_session->CallOwn("heightAt", {ScriptValue(width)}, result)) return false;
  const auto* value = result.As<int32_t>();
  if (value == nullptr) return false;
  height = *value;
  return true;
}

// --- What the page wants of the window

void View::ShowFrame(const std::string& base64) {
  auto png = FromBase64(base64);
  const HRESULT result = png ? m_surface.Decode(*png) : E_INVALIDARG;
  if (FAILED(result)) {
    Report(HTML_SUBSYSTEM_DOM, HTML_ERROR, Format(L"a frame of the browser cannot be decoded, error 0x%08x", result));
    return;
  }
  Present();
}

void View::OnNotice(const Json::Value& notice) {
  if (notice.isMember("close")) PostMessageW(m_window, WM_CLOSE, 0, 0);
  if (notice.isMember("minimize")) ShowWindow(m_window, SW_MINIMIZE);
  if (notice.isMember("drag") && GetKeyState(VK_LBUTTON) < 0) {
    ReleaseCapture();
    PostMessageW(m_window, WM_SYSCOMMAND, SC_MOVE | HTCAPTION, 0);
  }
  const std::string cursor = TextOf(notice, "cursor");
  if (cursor.empty()) return;
  m_cursor = cursor == "text"          ? IDC_IBEAM
             : cursor == "pointer"     ? IDC_HAND
             : cursor == "wait"        ? IDC_WAIT
             : cursor == "not-allowed" ? IDC_NO
                                       : IDC_ARROW;
}

// --- The window

bool View::IsLayered() const {
  return (GetWindowLongPtrW(m_window, GWL_EXSTYLE) & WS_EX_LAYERED) != 0;
}

SIZE View::ClientSize() const {
  RECT client{};
  GetClientRect(m_window, &client);
  return {client.right, client.bottom};
}

double View::Scale() const {
  const UINT dpi = GetDpiForWindow(m_window);
  return dpi == 0 ? 1 : dpi / static_cast<double>(USER_DEFAULT_SCREEN_DPI);
}

void View::OnSize() {
  // A minimised window has the size of a title: neither the page's layout nor the picture is to follow it there.
  if (m_session == nullptr || m_isDestroyed || IsIconic(m_window)) return;
  const SIZE size = ClientSize();
  const SIZE largest = LargestLayout(m_window);
  m_session->Resize(std::min(size.cx, largest.cx), std::min(size.cy, largest.cy), Scale());
  // Frames cost time and are of no use before the window can be seen.
  if (!m_hasFrames && IsWindowVisible(m_window)) {
    m_hasFrames = true;
    m_session->BeginFrames();
  }
}

void View::Present() {
  if (m_surface.IsEmpty() || m_isDestroyed || IsIconic(m_window)) return;
  if (!IsLayered()) {
    InvalidateRect(m_window, nullptr, FALSE);
  } else if (!m_surface.ShowLayered(m_window, ClientSize())) {
    Report(HTML_SUBSYSTEM_DOM, HTML_ERROR, Format(L"the window cannot be painted, error %u", GetLastError()));
  }
}

void View::PaintWindow() {
  PAINTSTRUCT paint{};
  if (const HDC dc = BeginPaint(m_window, &paint)) m_surface.Paint(dc);
  EndPaint(m_window, &paint);
}

std::optional<LRESULT> View::OnMessage(UINT message, WPARAM wparam, LPARAM lparam) {
  const auto self = shared_from_this();
  if (message == WM_DESTROY) {
    Destroy();
  } else if (message == WM_NCDESTROY) {
    Destroy();
    Views& all = AllViews();
    const std::lock_guard guard(all.lock);
    all.views.erase(m_window);
  }
  if (m_isDestroyed) return {};
  if (message == WakeMessage()) {
    if (m_session != nullptr) m_session->Drain();
    return 0;
  }
  if (message >= WM_MOUSEFIRST && message <= WM_MOUSELAST) return OnMouse(message, wparam, lparam);
  if (message >= WM_KEYFIRST && message <= WM_KEYLAST) return OnKey(message, wparam, lparam);
  return OnFrameMessage(message, wparam, lparam);
}

std::optional<LRESULT> View::OnFrameMessage(UINT message, WPARAM wparam, LPARAM lparam) {
  switch (message) {
    case WM_SIZE:
    case WM_SHOWWINDOW:
    case WM_WINDOWPOSCHANGED:
    case WM_DPICHANGED:
      OnSize();
      if (message == WM_SIZE && std::exchange(m_isMinimized, wparam == SIZE_MINIMIZED)) Present();
      return {};
    case WM_PAINT:
      if (IsLayered()) return {};
      PaintWindow();
      return 0;
    case WM_ERASEBKGND:
      return 1;
    case WM_SETFOCUS:
    case WM_KILLFOCUS:
      if (m_session != nullptr) m_session->SetFocus(message == WM_SETFOCUS);
      return {};
    case WM_MOUSELEAVE:
      OnMouseLeave();
      return {};
    case WM_SETCURSOR:
      return OnCursor(lparam) ? std::optional<LRESULT>(TRUE) : std::nullopt;
    // A layered window has no frame of the system's: all of it is the page.
    case WM_NCCALCSIZE:
      return IsLayered() && wparam != 0 ? std::optional<LRESULT>(0) : std::nullopt;
    case WM_NCHITTEST:
      return IsLayered() ? std::optional<LRESULT>(HTCLIENT) : std::nullopt;
    default:
      return {};
  }
}

bool View::OnCursor(LPARAM lparam) const {
  if (LOWORD(lparam) != HTCLIENT) return false;
  SetCursor(LoadCursorW(nullptr, m_cursor == nullptr ? IDC_ARROW : m_cursor));
  return true;
}

}  // namespace engine
