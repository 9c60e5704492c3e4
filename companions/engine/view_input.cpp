// The view's part that sends input to the page.
#include <windowsx.h>

#include "companions/engine/clipboard.h"
#include "companions/engine/view.h"
#include "core/text.h"

namespace engine {
namespace {

bool IsDown(int key) {
  return GetKeyState(key) < 0;
}

Modifiers CurrentModifiers() {
  return {IsDown(VK_MENU), IsDown(VK_CONTROL), IsDown(VK_SHIFT)};
}

bool IsPress(UINT message) {
  switch (message) {
    case WM_LBUTTONDOWN:
    case WM_LBUTTONDBLCLK:
    case WM_RBUTTONDOWN:
    case WM_RBUTTONDBLCLK:
    case WM_MBUTTONDOWN:
    case WM_MBUTTONDBLCLK:
      return true;
    default:
      return false;
  }
}

}  // namespace

std::optional<LRESULT> View::OnMouse(UINT message, WPARAM wparam, LPARAM lparam) {
  if (m_session == nullptr) return {};
  if (message == WM_MOUSEMOVE) {
    TRACKMOUSEEVENT leaving{sizeof leaving, TME_LEAVE, m_window, 0};
    TrackMouseEvent(&leaving);
  }
  // The system repeats moves that are none, after windows have changed.
  if (message == WM_MOUSEMOVE && std::exchange(m_lastMove, lparam) == lparam) return 0;
  POINT point{GET_X_LPARAM(lparam), GET_Y_LPARAM(lparam)};
  if (message == WM_MOUSEWHEEL || message == WM_MOUSEHWHEEL) ScreenToClient(m_window, &point);
  if (IsPress(message)) {
    m_clicks.Press(message, point.x, point.y, static_cast<uint32_t>(GetMessageTime()), GetDoubleClickTime());
    SetFocus(m_window);
    SetCapture(m_window);
  } else if (message != WM_MOUSEMOVE && (wparam & (MK_LBUTTON | MK_RBUTTON | MK_MBUTTON)) == 0) {
    if (GetCapture() == m_window) ReleaseCapture();
  }
  const double scale = Scale();
  const MouseInput input{message, wparam, point.x / scale, point.y / scale, m_clicks.Count(), CurrentModifiers()};
  const Json::Value event = ToMouseEvent(input);
  if (event.isNull()) return {};
  m_session->SendInput("Input.dispatchMouseEvent", event);
  return 0;
}

// What was under the mouse must not stay highlighted.
void View::OnMouseLeave() {
  m_lastMove = -1;
  if (m_session == nullptr) return;
  m_session->SendInput("Input.dispatchMouseEvent", ToMouseEvent({WM_MOUSEMOVE, 0, -1, -1, 0, CurrentModifiers()}));
}

std::optional<LRESULT> View::OnKey(UINT message, WPARAM wparam, LPARAM lparam) {
  if (m_session == nullptr) return {};
  if (message == WM_CHAR) {
    if (const auto event = m_text.Add(static_cast<wchar_t>(wparam))) {
      m_session->SendInput("Input.dispatchKeyEvent", *event);
    }
    return 0;
  }
  const bool isSystem = message == WM_SYSKEYDOWN || message == WM_SYSKEYUP;
  if (!isSystem && message != WM_KEYDOWN && message != WM_KEYUP) return {};
  if (message == WM_KEYDOWN && OnClipboardKey(wparam)) return 0;
  const auto character = static_cast<wchar_t>(MapVirtualKeyW(static_cast<UINT>(wparam), MAPVK_VK_TO_CHAR) & 0x7FFF);
  m_session->SendInput("Input.dispatchKeyEvent", ToKeyEvent({message, wparam, lparam, character, CurrentModifiers()}));
  if (isSystem) return {};  // Alt+F4 and the like stay the system's
  return 0;
}

// The browser's clipboard is its own; the user means the system's.
bool View::OnClipboardKey(WPARAM key) {
  const Modifiers modifiers = CurrentModifiers();
  const bool isInsert = key == VK_INSERT;
  const bool isPaste = modifiers.control ? key == 'V' : isInsert && modifiers.shift;
  const bool isCopy = modifiers.control && (key == 'C' || isInsert);
  const bool isCut = modifiers.control ? key == 'X' : key == VK_DELETE && modifiers.shift;
  if (modifiers.alt || !(isPaste || isCopy || isCut)) return false;
  if (isPaste) {
    Json::Value text(Json::objectValue);
    text["text"] = ToUtf8(ReadClipboardText(m_window));
    m_session->SendInput("Input.insertText", text);
    return true;
  }
  ScriptValue selection;
  if (!m_session->CallOwn("selection", {ScriptValue(isCut)}, selection)) return true;
  const Text* text = selection.As<Text>();
  if (text != nullptr && !text->text.empty()) WriteClipboardText(m_window, text->text);
  return true;
}

}  // namespace engine
