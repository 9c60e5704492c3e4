// What the user does at the window, as the browser's input events. Pure: takes the numbers of the window messages.
#pragma once

#include <windows.h>

#include <json/value.h>

#include <cstdint>
#include <optional>
#include <string>

namespace engine {

struct Modifiers {
  bool alt = false;
  bool control = false;
  bool shift = false;
};

struct MouseInput {
  UINT message = 0;   // WM_MOUSEMOVE, WM_?BUTTON*, WM_MOUSEWHEEL, WM_MOUSEHWHEEL
  WPARAM wparam = 0;  // of the message
  double x = 0;       // in the page's own unit, from the left top corner of the view
  double y = 0;
  int clicks = 0;  // for a button: 1, or 2 for a double click, and so on
  Modifiers modifiers;
};

// Parameters of Input.dispatchMouseEvent; null for other messages.
Json::Value ToMouseEvent(const MouseInput& input);

struct KeyInput {
  UINT message = 0;   // WM_KEYDOWN, WM_KEYUP, WM_SYSKEYDOWN, WM_SYSKEYUP
  WPARAM wparam = 0;  // virtual key
  LPARAM lparam = 0;
  wchar_t character = 0;  // that the key stands for without modifiers; 0: none
  Modifiers modifiers;
};

// Parameters of Input.dispatchKeyEvent.
Json::Value ToKeyEvent(const KeyInput& input);

// Joins the UTF-16 units of WM_CHAR. Gives the parameters of Input.dispatchKeyEvent when text is complete; control
// characters other than the line end are no text.
class TextInput {
 public:
  std::optional<Json::Value> Add(wchar_t unit);

 private:
  wchar_t m_high = 0;
};

// Counts clicks at one place within the time of a double click.
class ClickCounter {
 public:
  int Press(UINT message, int x, int y, uint32_t time, uint32_t doubleClickTime);
  int Count() const { return m_count; }

 private:
  UINT m_message = 0;
  int m_x = 0;
  int m_y = 0;
  uint32_t m_time = 0;
  int m_count = 0;
};

}  // namespace engine
