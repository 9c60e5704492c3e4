// A top-level window whose whole area is a view of the HTML engine. It loads a page, takes its size, and lets page and
// program call each other.
#pragma once

#include <windows.h>

#include <atomic>
#include <exception>
#include <initializer_list>
#include <optional>
#include <string>
#include <string_view>

#include "core/value.h"
#include "gui/ui_thread.h"
#include "interfaces/html_engine.h"

namespace qx::gui {

// Made, used and destroyed on one thread, which runs the message loop; other threads reach it by Ui(). Virtual
// operations are called by the engine and by Windows: what they throw is kept and comes out of RunMessageLoop.
class Window {
 public:
  // `engine` outlives the window. `name` is for the log.
  Window(const HtmlEngineApi& engine, std::wstring name);
  virtual ~Window();
  Window(const Window&) = delete;
  Window& operator=(const Window&) = delete;

  // False when there is no window at all. A page that cannot be loaded ends in OnLoadFailed and a posted WM_CLOSE.
  bool CreateFromFile(const std::wstring& path, HWND parent = nullptr);

  HWND Handle() const { return m_window; }  // null before creation and after destruction
  UiThread& Ui() { return m_ui; }

  // Until the quit message. Throws what a posted callable, or one of the operations below, has thrown.
  void RunMessageLoop();

 protected:
  // The first to see a message. The base passes it to the engine; true when that, or the override, has handled it.
  virtual bool OnMessage(UINT message, WPARAM wparam, LPARAM lparam, LRESULT& result);
  virtual void OnDestroyed() {}
  virtual void OnLoadFailed() {}
  virtual void OnPageLost() {}  // the page that was shown is gone for good; in the message loop

  // A call of the page's script; the answer becomes the call's result.
  virtual Value on_script_call(const std::wstring& name, uint32_t count, const HtmlValue* arguments);

  const HtmlEngineApi& Api() const { return m_engine; }

  // Calls a function of the page, on the window's thread. Nothing when there is no page, it has no such function, or
  // the arguments cannot be passed on.
  std::optional<Value> CallPage(std::wstring_view function, std::initializer_list<const Value*> arguments);

 private:
  static LRESULT CALLBACK Procedure(HWND window, UINT message, WPARAM wparam, LPARAM lparam);
  static uint32_t CALLBACK OnNotification(HtmlNotification* notification, void* param);
  static BOOL CALLBACK OnEngineEvent(void* tag, HtmlElement element, uint32_t group, void* params);
  static void CALLBACK DebugOutput(void* param, uint32_t subsystem, uint32_t severity, const wchar_t* text,
                                   uint32_t chars);

  LRESULT Dispatch(HWND window, UINT message, WPARAM wparam, LPARAM lparam);
  void Answer(HtmlScriptCall& call);
  void SetUpEngine();
  bool LoadPage(const std::wstring& path);
  void SizeAndCentre();
  SIZE PageSize() const;
  void LoadResource(const HtmlLoadData& request) const;
  void PostPageLost();
  void RethrowFailure();

  const HtmlEngineApi& m_engine;
  const std::wstring m_name;
  UiThread m_ui;
  std::atomic<HWND> m_window{nullptr};  // written on its thread only
  std::exception_ptr m_failure;
};

}  // namespace qx::gui
