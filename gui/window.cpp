#include "gui/window.h"

#include <array>
#include <memory>
#include <utility>
#include <vector>

#include "core/files.h"
#include "core/logging.h"
#include "core/text.h"
#include "gui/engine_value.h"
#include "gui/window_rules.h"

namespace qx::gui {
namespace {

constexpr wchar_t kClass[] = L"qx::gui::window";
constexpr wchar_t kScope[] = L"qx::gui::Window";
constexpr int kIcon = 102;               // of the program
constexpr int kProvisionalSize = 10000;  // so that the page is not squeezed before it is measured
constexpr SIZE kUsualSize = {900, 700};  // for a page that does not tell

// Once for the process; windows of the class may come later.
void RegisterWindowClass(WNDPROC procedure) {
  WNDCLASSEXW windowClass{};
  windowClass.cbSize = sizeof windowClass;
  windowClass.lpfnWndProc = procedure;
  windowClass.hInstance = GetModuleHandleW(nullptr);
  windowClass.hIcon = LoadIconW(windowClass.hInstance, MAKEINTRESOURCEW(kIcon));
  windowClass.hCursor = LoadCursorW(nullptr, IDC_ARROW);
  windowClass.lpszClassName = kClass;
  if (RegisterClassExW(&windowClass) == 0 && GetLastError() != ERROR_CLASS_ALREADY_EXISTS) {
    LOG_ERROR(kScope, L"the window class cannot be registered, error %d", GetLastError());
  }
}

logging::Level LevelOf(uint32_t severity) {
  if (severity == HTML_INFORMATION) return logging::Level::kInfo;
  return severity == HTML_WARNING ? logging::Level::kWarning : logging::Level::kError;
}

}  // namespace

Window::Window(const HtmlEngineApi& engine, std::wstring name) : m_engine(engine), m_name(std::move(name)) {}

Window::~Window() {
  if (m_window != nullptr) DestroyWindow(m_window);  // the derived part is gone: only the base's operations are called
}

bool Window::CreateFromFile(const std::wstring& path, HWND parent) {
  RegisterWindowClass(&Window::Procedure);
  const HWND window =
      CreateWindowExW(WS_EX_LAYERED, kClass, L"", WS_CLIPCHILDREN | WS_CLIPSIBLINGS, CW_USEDEFAULT, CW_USEDEFAULT,
                      kProvisionalSize, kProvisionalSize, parent, nullptr, GetModuleHandleW(nullptr), this);
  if (window == nullptr) {
    LOG_ERROR(kScope, L"the window cannot be created, error %d", GetLastError());
    return false;
  }
  LOG_TRACE(kScope, L"-> Created window %p [window_name %s]", window, m_name.c_str());
  SetUpEngine();
  if (LoadPage(path)) {
    SizeAndCentre();
  } else {
    OnLoadFailed();
    PostMessageW(window, WM_CLOSE, 0, 0);
  }
  return true;
}

void Window::SetUpEngine() {
  m_engine.SciterSetCallback(m_window, &Window::OnNotification, this);
  m_engine.SciterSetupDebugOutput(m_window, this, &Window::DebugOutput);
  m_engine.SciterWindowAttachEventHandler(m_window, &Window::OnEngineEvent, this, HTML_EVENTS_SCRIPT_CALL);
}

bool Window::LoadPage(const std::wstring& path) {
  if (!PathExists(path)) return false;  // an engine may show a page of its own instead
  return m_engine.SciterLoadFile(m_window, (L"file://" + path).c_str()) != FALSE;
}

void Window::SizeAndCentre() {
  RECT workArea{};
  if (!SystemParametersInfoW(SPI_GETWORKAREA, 0, &workArea, 0)) {
    LOG_WARNING(kScope, L"the work area is not known, error %d", GetLastError());
  }
  const SIZE page = PageSize();
  const RECT place = CentredPlace(page, workArea);
  if (!SetWindowPos(m_window, nullptr, place.left, place.top, page.cx, page.cy, SWP_NOZORDER | SWP_SHOWWINDOW)) {
    LOG_ERROR(kScope, L"the window cannot be shown, error %d", GetLastError());
  }
}

SIZE Window::PageSize() const {
  HtmlElement root = nullptr;
  RECT place{};
  if (m_engine.SciterGetRootElement(m_window, &root) == 0 && root != nullptr &&
      m_engine.SciterGetElementLocation(root, &place, HTML_AREA_ROOT_RELATIVE | HTML_AREA_BORDER_BOX) == 0 &&
      place.right > place.left && place.bottom > place.top) {
    return {place.right - place.left, place.bottom - place.top};
  }
  LOG_WARNING(kScope, L"the page does not tell its size");
  return kUsualSize;
}

void Window::RunMessageLoop() {
  MSG message;
  while (GetMessageW(&message, nullptr, 0, 0) > 0) {
    if (message.hwnd == nullptr) m_ui.Run(message.message, message.wParam);
    TranslateMessage(&message);
    DispatchMessageW(&message);
    RethrowFailure();
  }
}

void Window::RethrowFailure() {
  if (m_failure) std::rethrow_exception(std::exchange(m_failure, nullptr));
}

LRESULT CALLBACK Window::Procedure(HWND window, UINT message, WPARAM wparam, LPARAM lparam) {
  if (message == WM_CREATE) {
    auto* const host = static_cast<Window*>(reinterpret_cast<CREATESTRUCTW*>(lparam)->lpCreateParams);
    SetWindowLongPtrW(window, GWLP_USERDATA, reinterpret_cast<LONG_PTR>(host));
    host->m_window = window;
    host->m_ui.Attach(window);
  }
  auto* const host = reinterpret_cast<Window*>(GetWindowLongPtrW(window, GWLP_USERDATA));
  if (host == nullptr) return DefWindowProcW(window, message, wparam, lparam);
  try {
    return host->Dispatch(window, message, wparam, lparam);
  } catch (...) {  // nothing may pass Windows' own frames
    if (!host->m_failure) host->m_failure = std::current_exception();
    return 0;
  }
}

LRESULT Window::Dispatch(HWND window, UINT message, WPARAM wparam, LPARAM lparam) {
  if (m_ui.Run(message, wparam)) return 0;
  LRESULT result = 0;
  const bool isHandled = OnMessage(message, wparam, lparam, result);
  if (message == WM_DESTROY) {
    LOG_TRACE(kScope, L"<- Destroyed window %p [window_name %s]", window, m_name.c_str());
    m_ui.Detach();
    SetWindowLongPtrW(window, GWLP_USERDATA, 0);
    m_window = nullptr;
    OnDestroyed();
    return 0;
  }
  return isHandled ? result : DefWindowProcW(window, message, wparam, lparam);
}

bool Window::OnMessage(UINT message, WPARAM wparam, LPARAM lparam, LRESULT& result) {
  BOOL isHandled = FALSE;
  result = m_engine.SciterProcND(m_window, message, wparam, lparam, &isHandled);
  return isHandled != FALSE;
}

Value Window::on_script_call(const std::wstring&, uint32_t, const HtmlValue*) {
  return {};
}

std::optional<Value> Window::CallPage(std::wstring_view function, std::initializer_list<const Value*> arguments) {
  if (m_window == nullptr) return std::nullopt;
  std::vector<std::unique_ptr<EngineValue>> owners;
  std::vector<HtmlValue> values;
  try {
    for (const Value* argument : arguments) {
      owners.push_back(std::make_unique<EngineValue>(m_engine));
      ToEngine(m_engine, *argument, *owners.back()->Receive());
      values.push_back(*owners.back()->Get());  // borrowed from its owner
    }
    EngineValue result(m_engine);
    if (!m_engine.SciterCall(m_window, ToUtf8(function).c_str(), static_cast<uint32_t>(values.size()), values.data(),
                             result.Receive())) {
      LOG_WARNING(kScope, L"the page has no function %s, or it failed", std::wstring(function).c_str());
      return std::nullopt;
    }
    return FromEngine(m_engine, *result.Get());
  } catch (const ConversionError& error) {
    LOG_ERROR(kScope, L"calling the page's %s: %S", std::wstring(function).c_str(), error.what());
    return std::nullopt;
  }
}

uint32_t CALLBACK Window::OnNotification(HtmlNotification* notification, void* param) {
  if (notification->code == HTML_LOAD_DATA) {
    static_cast<const Window*>(param)->LoadResource(*reinterpret_cast<const HtmlLoadData*>(notification));
  } else if (notification->code == HTML_GRAPHICS_FAILURE) {
    static_cast<Window*>(param)->PostPageLost();
  }
  return HTML_LOAD_BY_ENGINE;
}

// Not now: the engine waits for the notification's end.
void Window::PostPageLost() {
  m_ui.Post([this] { OnPageLost(); });
}

void Window::LoadResource(const HtmlLoadData& request) const {
  const std::optional<ResourceAddress> address = ParseResourceAddress(request.uri == nullptr ? L"" : request.uri);
  if (!address) return;
  const HMODULE program = GetModuleHandleW(nullptr);
  // By its number, written out: RT_HTML is of the kind of text that UNICODE says, which not every header set heeds.
  const wchar_t* const type = address->isHtml ? MAKEINTRESOURCEW(23) : address->type.c_str();
  const HRSRC found = FindResourceW(program, address->name.c_str(), type);
  if (found == nullptr) return;
  const DWORD size = SizeofResource(program, found);
  const void* const bytes = LockResource(::LoadResource(program, found));
  if (bytes == nullptr || size == 0) return;
  m_engine.SciterDataReady(m_window, request.uri, static_cast<const uint8_t*>(bytes), size);
}

BOOL CALLBACK Window::OnEngineEvent(void* tag, HtmlElement, uint32_t group, void* params) {
  if (group == HTML_EVENTS_SUBSCRIBE) {
    *static_cast<uint32_t*>(params) = HTML_EVENTS_SCRIPT_CALL;
    return TRUE;
  }
  if (group != HTML_EVENTS_SCRIPT_CALL) return FALSE;
  auto* const host = static_cast<Window*>(tag);
  try {
    host->Answer(*static_cast<HtmlScriptCall*>(params));
  } catch (...) {  // nothing may pass the engine's frames
    if (!host->m_failure) host->m_failure = std::current_exception();
  }
  return TRUE;
}

void Window::Answer(HtmlScriptCall& call) {
  const Value answer = on_script_call(ToWide(call.name == nullptr ? "" : call.name), call.argc, call.argv);
  try {
    ToEngine(m_engine, answer, call.result);
  } catch (const ConversionError& error) {
    LOG_ERROR(kScope, L"the answer to %S cannot be passed on: %S", call.name, error.what());
  }
}

void CALLBACK Window::DebugOutput(void*, uint32_t subsystem, uint32_t severity, const wchar_t* text, uint32_t chars) {
  const std::wstring message(text == nullptr ? L"" : text, text == nullptr ? 0 : chars);
  ST_LOG(LevelOf(severity), L"qx::gui::Window::DebugOutput", L"%s: %s", SubsystemName(subsystem), message.c_str());
}

}  // namespace qx::gui
