// The exported table. Each entry checks its arguments, finds its window's view and lets nothing escape.
#include <string>

#include "companions/engine/value_table.h"
#include "companions/engine/view.h"

namespace engine {
namespace {

constexpr int kOk = 0;
constexpr int kInvalidWindow = 1;
constexpr int kInvalidElement = 2;
constexpr uint32_t kVersion = 9;

// Runs `job` with the view of the window. `otherwise` when there is none, or when anything is thrown.
template <class Result, class Job>
Result WithView(HWND window, Result otherwise, Job job) noexcept {
  try {
    const auto view = View::Find(window);
    return view == nullptr ? otherwise : job(*view);
  } catch (...) {
    return otherwise;
  }
}

// The only element that is handed out is a window's root; it is named by its window.
HWND WindowOf(HtmlElement element) {
  return static_cast<HWND>(element);
}

LRESULT CALLBACK ProcND(HWND window, UINT message, WPARAM wparam, LPARAM lparam, BOOL* handled) {
  if (handled != nullptr) *handled = FALSE;
  try {
    const auto view = message == WM_CREATE ? View::Create(window) : View::Find(window);
    const auto result = view == nullptr ? std::nullopt : view->OnMessage(message, wparam, lparam);
    if (result && handled != nullptr) *handled = TRUE;
    return result.value_or(0);
  } catch (...) {
    return 0;
  }
}

LRESULT CALLBACK Proc(HWND window, UINT message, WPARAM wparam, LPARAM lparam) {
  BOOL isHandled = FALSE;
  const LRESULT result = ProcND(window, message, wparam, lparam, &isHandled);
  return isHandled ? result : DefWindowProcW(window, message, wparam, lparam);
}

BOOL CALLBACK DataReady(HWND window, const wchar_t* uri, const uint8_t* bytes, uint32_t size) {
  if (uri == nullptr) return FALSE;
  return WithView(window, FALSE, [&](View& view) -> BOOL { return view.SupplyData(uri, bytes, size); });
}

BOOL CALLBACK LoadFile(HWND window, const wchar_t* address) {
  if (address == nullptr) return FALSE;
  return WithView(window, FALSE, [&](View& view) -> BOOL { return view.Load(address); });
}

void CALLBACK SetCallback(HWND window, HtmlHostCallback callback, void* param) {
  WithView(window, 0, [&](View& view) { return view.SetHost(callback, param), 0; });
}

uint32_t CALLBACK GetMinWidth(HWND window) {
  return WithView(window, 0u, [](View& view) {
    int minimum = 0;
    int maximum = 0;
    return view.IntrinsicWidths(minimum, maximum) && minimum > 0 ? static_cast<uint32_t>(minimum) : 0u;
  });
}

uint32_t CALLBACK GetMinHeight(HWND window, uint32_t width) {
  return WithView(window, 0u, [&](View& view) {
    int height = 0;
    return view.HeightAt(static_cast<int>(width & INT32_MAX), height) && height > 0 ? static_cast<uint32_t>(height)
                                                                                    : 0u;
  });
}

BOOL CALLBACK Call(HWND window, const char* function, uint32_t argc, const HtmlValue* argv, HtmlValue* result) {
  if (function == nullptr || (argv == nullptr && argc != 0)) return FALSE;
  return WithView(window, FALSE, [&](View& view) -> BOOL {
    ScriptValue::Array arguments;
    for (uint32_t i = 0; i < argc; ++i)
      arguments.push_back(ReadValue(argv[i]));
    ScriptValue answer;
    const bool isDone = view.Call(function, arguments, answer);
    if (result != nullptr) WriteValue(answer, *result);
    return isDone;
  });
}

BOOL CALLBACK SetOption(HWND, uint32_t option, uintptr_t value) {
  if (option != HTML_OPTION_BROWSER) return TRUE;  // the options of other engines mean nothing here
  try {
    const auto* path = reinterpret_cast<const wchar_t*>(value);
    Settings().browser = path == nullptr ? L"" : path;
    return TRUE;
  } catch (...) {
    return FALSE;
  }
}

void CALLBACK SetupDebugOutput(HWND window, void* param, HtmlDebugOutput output) {
  if (window == nullptr) {
    Settings().debugOutput = output;
    Settings().debugParam = param;
    return;
  }
  WithView(window, 0, [&](View& view) { return view.SetDebugOutput(output, param), 0; });
}

int CALLBACK UseElement(HtmlElement element) {
  return WithView(WindowOf(element), kInvalidElement, [](View&) { return kOk; });
}

int CALLBACK GetRootElement(HWND window, HtmlElement* element) {
  if (element == nullptr) return kInvalidElement;
  *element = nullptr;
  return WithView(window, kInvalidWindow, [&](View&) { return *element = window, kOk; });
}

int CALLBACK GetElementLocation(HtmlElement element, RECT* location, uint32_t areas) {
  if (location == nullptr) return kInvalidElement;
  *location = RECT{};
  return WithView(WindowOf(element), kInvalidElement,
                  [&](View& view) { return view.RootBox(areas, *location) ? kOk : kInvalidElement; });
}

int CALLBACK GetElementIntrinsicWidths(HtmlElement element, int* minimum, int* maximum) {
  if (minimum == nullptr || maximum == nullptr) return kInvalidElement;
  return WithView(WindowOf(element), kInvalidElement,
                  [&](View& view) { return view.IntrinsicWidths(*minimum, *maximum) ? kOk : kInvalidElement; });
}

int CALLBACK GetElementIntrinsicHeight(HtmlElement element, int width, int* height) {
  if (height == nullptr) return kInvalidElement;
  return WithView(WindowOf(element), kInvalidElement,
                  [&](View& view) { return view.HeightAt(width, *height) ? kOk : kInvalidElement; });
}

int CALLBACK AttachEventHandler(HWND window, HtmlEventProc proc, void* tag, uint32_t) {
  if (proc == nullptr) return kInvalidElement;
  return WithView(window, kInvalidWindow, [&](View& view) { return view.AttachEvents(proc, tag), kOk; });
}

int CALLBACK DetachEventHandler(HWND window, HtmlEventProc proc, void* tag) {
  return WithView(window, kInvalidWindow,
                  [&](View& view) { return view.DetachEvents(proc, tag) ? kOk : kInvalidElement; });
}

HtmlEngineApi MakeTable() {
  HtmlEngineApi api{};
  api.version = kVersion;
  api.SciterDataReady = &DataReady;
  api.SciterProc = &Proc;
  api.SciterProcND = &ProcND;
  api.SciterLoadFile = &LoadFile;
  api.SciterSetCallback = &SetCallback;
  api.SciterGetMinWidth = &GetMinWidth;
  api.SciterGetMinHeight = &GetMinHeight;
  api.SciterCall = &Call;
  api.SciterSetOption = &SetOption;
  api.SciterSetupDebugOutput = &SetupDebugOutput;
  api.Sciter_UseElement = &UseElement;
  api.Sciter_UnuseElement = &UseElement;
  api.SciterGetRootElement = &GetRootElement;
  api.SciterGetElementLocation = &GetElementLocation;
  api.SciterWindowAttachEventHandler = &AttachEventHandler;
  api.SciterWindowDetachEventHandler = &DetachEventHandler;
  api.SciterGetElementIntrinsicWidths = &GetElementIntrinsicWidths;
  api.SciterGetElementIntrinsicHeight = &GetElementIntrinsicHeight;
  FillValueTable(api);
  return api;
}

}  // namespace
}  // namespace engine

const HtmlEngineApi* CALLBACK SciterAPI(void) {
  static const HtmlEngineApi s_table = engine::MakeTable();
  return &s_table;
}
