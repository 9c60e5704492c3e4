// A window that shows a page: joins a window's messages, its browser and its host's callbacks. All of it on the
// window's thread.
#pragma once

#include <windows.h>

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "companions/engine/browser_process.h"
#include "companions/engine/frame_surface.h"
#include "companions/engine/input_events.h"
#include "companions/engine/page_session.h"
#include "interfaces/html_engine.h"

namespace engine {

// Settings of the whole library, until they are changed. Set before a window is made.
struct EngineSettings {
  HtmlDebugOutput debugOutput = nullptr;
  void* debugParam = nullptr;
  std::wstring browser;  // full path; empty: FindBrowser
};
EngineSettings& Settings();

class View : public PageHost, public std::enable_shared_from_this<View> {
 public:
  explicit View(HWND window) : m_window(window) {}
  ~View() override;

  // The view of a window; null when it has none. Any thread may ask, but only for its own windows.
  static std::shared_ptr<View> Find(HWND window);
  static std::shared_ptr<View> Create(HWND window);  // the browser begins to start

  std::optional<LRESULT> OnMessage(UINT message, WPARAM wparam, LPARAM lparam);  // nothing: not handled

  bool Load(const std::wstring& address);
  bool SupplyData(const std::wstring& uri, const uint8_t* bytes, uint32_t size);
  bool Call(const std::string& function, const std::vector<ScriptValue>& arguments, ScriptValue& result);
  bool RootBox(uint32_t areas, RECT& box);
  bool IntrinsicWidths(int& minimum, int& maximum);
  bool HeightAt(int width, int& height);

  void SetHost(HtmlHostCallback callback, void* param) { m_host = callback, m_hostParam = param; }
  void SetDebugOutput(HtmlDebugOutput output, void* param) { m_debugOutput = output, m_debugParam = param; }
  void AttachEvents(HtmlEventProc proc, void* tag);
  bool DetachEvents(HtmlEventProc proc, void* tag);

  PageHost::Supply LoadData(const std::wstring& uri) override;
  void DataLoaded(const std::wstring& uri, const std::string* bytes) override;
  bool ScriptCall(const std::string& name, const std::vector<ScriptValue>& arguments, ScriptValue& result) override;
  void Report(HtmlSubsystem subsystem, HtmlSeverity severity, const std::wstring& text) override;
  void ShowFrame(const std::string& base64) override;
  void OnNotice(const Json::Value& notice) override;
  void PageLost() override;

 private:
  struct EventHandler {
    HtmlEventProc proc;
    void* tag;
  };

  void StartBrowser(bool usePort);
  bool ConnectBrowser();
  void Destroy();
  void NotifyHost(HtmlNotificationCode code);
  bool IsLayered() const;
  SIZE ClientSize() const;
  double Scale() const;
  void OnSize();
  void Present();
  void PaintWindow();
  std::optional<LRESULT> OnMouse(UINT message, WPARAM wparam, LPARAM lparam);
  void OnMouseLeave();
  std::optional<LRESULT> OnKey(UINT message, WPARAM wparam, LPARAM lparam);
  std::optional<LRESULT> OnFrameMessage(UINT message, WPARAM wparam, LPARAM lparam);
  bool OnClipboardKey(WPARAM key);
  bool OnCursor(LPARAM lparam) const;

  const HWND m_window;
  BrowserProcess m_browser;
  std::wstring m_startError;  // kept until somebody listens
  std::shared_ptr<PageSession> m_session;
  FrameSurface m_surface;
  bool m_isDestroyed = false;
  bool m_hasFrames = false;
  bool m_isMinimized = false;
  HtmlHostCallback m_host = nullptr;
  void* m_hostParam = nullptr;
  HtmlDebugOutput m_debugOutput = nullptr;
  void* m_debugParam = nullptr;
  std::vector<EventHandler> m_eventHandlers;
  const std::wstring* m_awaitedUri = nullptr;  // while the host handles a load-data notification
  std::optional<std::string> m_suppliedData;
  ClickCounter m_clicks;
  TextInput m_text;
  LPARAM m_lastMove = -1;
  LPCWSTR m_cursor = nullptr;  // of the system's; null: the arrow
};

}  // namespace engine
