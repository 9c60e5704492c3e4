// A window on the engine's table, as small as a host can be. It says on its standard output what happens, one line
// each, and does what the lines of its standard input tell it.
//
//   engine_host.exe LIBRARY PAGE [--browser PATH] [--size W H] [--plain] [--temporary FOLDER]
//
// Commands: call NAME JSON-ARRAY    post MESSAGE WPARAM LPARAM    pixel X Y    size W H    measure    abort    close
// Native functions for the page: echo(value), kind(value), print(text), invoke(function, value) and later(function,
// value), pageCall(name, value), refuse(), closeWindow().
#include <windows.h>

#include <objbase.h>

#include <cstdio>
#include <cstdlib>
#include <iostream>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include "core/dynamic_library.h"
#include "core/text.h"
#include "interfaces/html_engine.h"

namespace {

constexpr UINT kCommand = WM_APP;
constexpr UINT kLater = WM_APP + 1;
const HtmlEngineApi* g_engine = nullptr;
HWND g_window = nullptr;
HtmlValue g_laterFunction{};
HtmlValue g_laterArgument{};
ULONGLONG g_start = 0;

template <class... Parts>
void Say(const Parts&... parts) {
  std::ostringstream line;
  ((line << parts << ' '), ...);
  line << '\n';
  std::fputs(line.str().c_str(), stdout);
  std::fflush(stdout);
}

class Value {
 public:
  Value() { g_engine->ValueInit(&m_value); }
  explicit Value(const std::wstring& json) : Value() {
    g_engine->ValueFromString(&m_value, json.c_str(), static_cast<uint32_t>(json.size()), HTML_CONVERT_JSON_LITERAL);
  }
  ~Value() { g_engine->ValueClear(&m_value); }
  Value(const Value&) = delete;
  Value& operator=(const Value&) = delete;
  HtmlValue* Get() { return &m_value; }

  std::string Literal() {
    Value copy;
    g_engine->ValueCopy(copy.Get(), &m_value);
    g_engine->ValueToString(copy.Get(), HTML_CONVERT_JSON_LITERAL);
    const wchar_t* text = L"";
    uint32_t chars = 0;
    g_engine->ValueStringData(copy.Get(), &text, &chars);
    return ToUtf8({text, chars});
  }

 private:
  HtmlValue m_value{};
};

std::string TextOf(const HtmlValue& value) {
  const wchar_t* text = L"";
  uint32_t chars = 0;
  g_engine->ValueStringData(&value, &text, &chars);
  return ToUtf8({text, chars});
}

BOOL OnScriptCall(HtmlScriptCall& call) {
  const std::string name = call.name;
  const HtmlValue* first = call.argc > 0 ? &call.argv[0] : nullptr;
  const HtmlValue* second = call.argc > 1 ? &call.argv[1] : nullptr;
  if (name == "echo") {
    if (first != nullptr) g_engine->ValueCopy(&call.result, first);
  } else if (name == "kind") {
    g_engine->ValueIntDataSet(&call.result, static_cast<int32_t>(first->type * 10 + first->unit), HTML_VALUE_INT, 0);
  } else if (name == "print") {
    Say("print", first == nullptr ? "" : TextOf(*first), GetTickCount64() - g_start);
  } else if (name == "invoke" && second != nullptr) {
    const uint32_t result = g_engine->ValueInvoke(first, nullptr, 1, second, &call.result, nullptr);
    if (result != HTML_VALUE_OK) Say("invoke failed", result);
  } else if (name == "later" && second != nullptr) {
    g_engine->ValueCopy(&g_laterFunction, first);
    g_engine->ValueCopy(&g_laterArgument, second);
    PostMessageW(g_window, kLater, 0, 0);
  } else if (name == "pageCall" && second != nullptr) {
    if (!g_engine->SciterCall(g_window, TextOf(*first).c_str(), 1, second, &call.result)) Say("pageCall failed");
  } else if (name == "closeWindow") {
    DestroyWindow(g_window);
  } else {
    return FALSE;
  }
  return TRUE;
}

BOOL CALLBACK OnEvent(void*, HtmlElement, uint32_t group, void* params) {
  if (group == HTML_EVENTS_SUBSCRIBE) {
    *static_cast<uint32_t*>(params) = HTML_EVENTS_SCRIPT_CALL;
    return TRUE;
  }
  return group == HTML_EVENTS_SCRIPT_CALL ? OnScriptCall(*static_cast<HtmlScriptCall*>(params)) : FALSE;
}

uint32_t CALLBACK OnNotification(HtmlNotification* notification, void*) {
  if (notification->code == HTML_ENGINE_DESTROYED) Say("engine destroyed");
  if (notification->code != HTML_LOAD_DATA) return 0;
  const auto& load = *reinterpret_cast<HtmlLoadData*>(notification);
  const std::wstring uri = load.uri;
  Say("load", ToUtf8(uri));
  if (uri == L"res:discarded.js") return HTML_LOAD_DISCARD;
  if (uri == L"res:style.css" || uri == L"this://app/style.css") {
    const std::string css = uri[0] == L'r' ? "p { padding: 3px }" : "p { margin-left: 7px }";
    g_engine->SciterDataReady(notification->window, load.uri, reinterpret_cast<const uint8_t*>(css.data()),
                              static_cast<uint32_t>(css.size()));
  }
  return HTML_LOAD_BY_ENGINE;
}

void CALLBACK OnDebug(void*, uint32_t subsystem, uint32_t severity, const wchar_t* text, uint32_t chars) {
  Say("debug", subsystem, severity, ToUtf8({text, chars}));
}

void OnLater() {
  Value result;
  g_engine->ValueInvoke(&g_laterFunction, nullptr, 1, &g_laterArgument, result.Get(), nullptr);
  g_engine->ValueClear(&g_laterFunction);
  g_engine->ValueClear(&g_laterArgument);
  Say("later", result.Literal());
}

void Measure() {
  HtmlElement root = nullptr;
  RECT box{};
  g_engine->SciterGetRootElement(g_window, &root);
  g_engine->SciterGetElementLocation(root, &box, HTML_AREA_ROOT_RELATIVE | HTML_AREA_BORDER_BOX);
  int low = 0;
  int high = 0;
  g_engine->SciterGetElementIntrinsicWidths(root, &low, &high);
  Say("measure", box.left, box.top, box.right, box.bottom, low, high, g_engine->SciterGetMinHeight(g_window, 300));
}

void OnCommand(const std::string& line) {
  std::istringstream words(line);
  std::string command;
  words >> command;
  if (command == "call") {
    std::string name;
    std::string json;
    words >> name;
    std::getline(words, json);
    Value arguments(ToWide(json));
    int32_t count = 0;
    g_engine->ValueElementsCount(arguments.Get(), &count);
    std::vector<HtmlValue> argv(static_cast<size_t>(count));
    for (int32_t i = 0; i < count; ++i)
      g_engine->ValueNthElementValue(arguments.Get(), i, &argv[static_cast<size_t>(i)]);
    Value result;
    const BOOL isDone =
        g_engine->SciterCall(g_window, name.c_str(), static_cast<uint32_t>(count), argv.data(), result.Get());
    Say("called", isDone, result.Literal());
    for (HtmlValue& argument : argv)
      g_engine->ValueClear(&argument);
  } else if (command == "post") {
    UINT message = 0;
    WPARAM wparam = 0;
    LPARAM lparam = 0;
    words >> message >> wparam >> lparam;
    PostMessageW(g_window, message, wparam, lparam);
  } else if (command == "pixel") {
    RECT window{};
    GetWindowRect(g_window, &window);
    int x = 0;
    int y = 0;
    words >> x >> y;
    const HDC screen = GetDC(nullptr);
    const COLORREF color = GetPixel(screen, window.left + x, window.top + y);
    ReleaseDC(nullptr, screen);
    Say("pixel", static_cast<int>(GetRValue(color)), static_cast<int>(GetGValue(color)),
        static_cast<int>(GetBValue(color)));
  } else if (command == "size") {
    int width = 0;
    int height = 0;
    words >> width >> height;
    SetWindowPos(g_window, nullptr, 20, 20, width, height, SWP_NOZORDER | SWP_SHOWWINDOW);
  } else if (command == "measure") {
    Measure();
  } else if (command == "abort") {
    TerminateProcess(GetCurrentProcess(), 3);
  } else if (command == "close") {
    PostMessageW(g_window, WM_CLOSE, 0, 0);
  }
}

LRESULT CALLBACK WindowProc(HWND window, UINT message, WPARAM wparam, LPARAM lparam) {
  BOOL isHandled = FALSE;
  const LRESULT result = g_engine->SciterProcND(window, message, wparam, lparam, &isHandled);
  if (isHandled) return result;
  switch (message) {
    case kCommand: {
      const std::unique_ptr<std::string> line(reinterpret_cast<std::string*>(lparam));
      OnCommand(*line);
      return 0;
    }
    case kLater:
      OnLater();
      return 0;
    case WM_DESTROY:
      PostQuitMessage(0);
      return 0;
    default:
      return DefWindowProcW(window, message, wparam, lparam);
  }
}

HWND MakeWindow(bool isLayered) {
  WNDCLASSEXW windowClass{};
  windowClass.cbSize = sizeof windowClass;
  windowClass.lpfnWndProc = &WindowProc;
  windowClass.hInstance = GetModuleHandleW(nullptr);
  windowClass.lpszClassName = L"engine_host";
  RegisterClassExW(&windowClass);
  return CreateWindowExW(isLayered ? WS_EX_LAYERED : 0, L"engine_host", nullptr, WS_CLIPCHILDREN | WS_CLIPSIBLINGS,
                         CW_USEDEFAULT, CW_USEDEFAULT, 10000, 10000, nullptr, nullptr, windowClass.hInstance, nullptr);
}

void ReadCommands() {
  for (std::string line; std::getline(std::cin, line);)
    PostMessageW(g_window, kCommand, 0, reinterpret_cast<LPARAM>(std::make_unique<std::string>(line).release()));
}

struct Arguments {
  std::wstring library;
  std::wstring page;
  std::wstring browser;
  int width = 0;
  int height = 0;
  bool isLayered = true;
};

Arguments ReadArguments(int argc, wchar_t** argv) {
  Arguments arguments;
  for (int i = 1; i < argc; ++i) {
    const std::wstring word = argv[i];
    if (word == L"--browser" && i + 1 < argc) {
      arguments.browser = argv[++i];
    } else if (word == L"--size" && i + 2 < argc) {
      arguments.width = _wtoi(argv[++i]);
      arguments.height = _wtoi(argv[++i]);
    } else if (word == L"--temporary" && i + 1 < argc) {
      SetEnvironmentVariableW(L"TMP", argv[++i]);
    } else if (word == L"--plain") {
      arguments.isLayered = false;
    } else {
      (arguments.library.empty() ? arguments.library : arguments.page) = word;
    }
  }
  return arguments;
}

}  // namespace

int wmain(int argc, wchar_t** argv) {
  g_start = GetTickCount64();
  const Arguments arguments = ReadArguments(argc, argv);
  CoInitializeEx(nullptr, COINIT_APARTMENTTHREADED);
  const DynamicLibrary library(arguments.library.c_str());
  const auto table = library.Resolve<decltype(&SciterAPI)>("SciterAPI");
  if (table == nullptr) return 2;
  g_engine = table();
  if (!arguments.browser.empty()) {
    g_engine->SciterSetOption(nullptr, HTML_OPTION_BROWSER, reinterpret_cast<uintptr_t>(arguments.browser.c_str()));
  }
  g_engine->SciterSetupDebugOutput(nullptr, nullptr, &OnDebug);
  g_window = MakeWindow(arguments.isLayered);
  if (g_window == nullptr) return 3;
  g_engine->SciterSetCallback(g_window, &OnNotification, nullptr);
  g_engine->SciterWindowAttachEventHandler(g_window, &OnEvent, nullptr, HTML_EVENTS_SCRIPT_CALL);
  const bool isLoaded = g_engine->SciterLoadFile(g_window, arguments.page.c_str()) != FALSE;
  Say("loaded", isLoaded, GetTickCount64() - g_start);
  if (!isLoaded) {
    DestroyWindow(g_window);
    return 1;
  }
  RECT box{0, 0, arguments.width, arguments.height};
  HtmlElement root = nullptr;
  if (arguments.width == 0 && g_engine->SciterGetRootElement(g_window, &root) == 0) {
    g_engine->SciterGetElementLocation(root, &box, HTML_AREA_ROOT_RELATIVE | HTML_AREA_BORDER_BOX);
  }
  SetWindowPos(g_window, nullptr, 20, 20, box.right, box.bottom, SWP_NOZORDER | SWP_SHOWWINDOW);
  SetForegroundWindow(g_window);
  Say("shown", box.right, box.bottom, GetTickCount64() - g_start);
  std::thread(ReadCommands).detach();
  MSG message{};
  while (GetMessageW(&message, nullptr, 0, 0) > 0) {
    TranslateMessage(&message);
    DispatchMessageW(&message);
  }
  Say("ended");
  std::_Exit(0);  // the thread that reads commands may wait for ever
}
