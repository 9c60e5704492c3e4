#include "companions/engine/input_events.h"

#include <cstdlib>
#include <iterator>

#include "core/text.h"

namespace engine {
namespace {

constexpr int kClickDistance = 4;     // pixels between the presses of a double click
constexpr double kWheelStep = 100;    // of the page's unit, for one notch
constexpr LPARAM kWasDown = 1 << 30;  // in the lparam of a key message
constexpr LPARAM kIsExtended = 1 << 24;

struct MouseMessage {
  UINT message;
  const char* type;
  const char* button;
};

constexpr MouseMessage kMouseMessages[] = {
    {WM_MOUSEMOVE, "mouseMoved", "none"},         {WM_MOUSEWHEEL, "mouseWheel", "none"},
    {WM_MOUSEHWHEEL, "mouseWheel", "none"},       {WM_LBUTTONDOWN, "mousePressed", "left"},
    {WM_LBUTTONDBLCLK, "mousePressed", "left"},   {WM_LBUTTONUP, "mouseReleased", "left"},
    {WM_RBUTTONDOWN, "mousePressed", "right"},    {WM_RBUTTONDBLCLK, "mousePressed", "right"},
    {WM_RBUTTONUP, "mouseReleased", "right"},     {WM_MBUTTONDOWN, "mousePressed", "middle"},
    {WM_MBUTTONDBLCLK, "mousePressed", "middle"}, {WM_MBUTTONUP, "mouseReleased", "middle"},
};

struct NamedKey {
  WPARAM key;
  const char* name;
};

// The keys that have a name instead of a character.
constexpr NamedKey kNamedKeys[] = {
    {VK_BACK, "Backspace"},  {VK_TAB, "Tab"},          {VK_RETURN, "Enter"},    {VK_SHIFT, "Shift"},
    {VK_CONTROL, "Control"}, {VK_MENU, "Alt"},         {VK_PAUSE, "Pause"},     {VK_CAPITAL, "CapsLock"},
    {VK_ESCAPE, "Escape"},   {VK_PRIOR, "PageUp"},     {VK_NEXT, "PageDown"},   {VK_END, "End"},
    {VK_HOME, "Home"},       {VK_LEFT, "ArrowLeft"},   {VK_UP, "ArrowUp"},      {VK_RIGHT, "ArrowRight"},
    {VK_DOWN, "ArrowDown"},  {VK_INSERT, "Insert"},    {VK_DELETE, "Delete"},   {VK_LWIN, "Meta"},
    {VK_RWIN, "Meta"},       {VK_APPS, "ContextMenu"}, {VK_NUMLOCK, "NumLock"}, {VK_SCROLL, "ScrollLock"},
};

int BitsOf(const Modifiers& modifiers) {
  return (modifiers.alt ? 1 : 0) | (modifiers.control ? 2 : 0) | (modifiers.shift ? 8 : 0);
}

// The buttons that are down, from the key state of a mouse message.
int ButtonsOf(WPARAM wparam) {
  return ((wparam & MK_LBUTTON) != 0 ? 1 : 0) | ((wparam & MK_RBUTTON) != 0 ? 2 : 0) |
         ((wparam & MK_MBUTTON) != 0 ? 4 : 0);
}

std::string NameOfKey(const KeyInput& input) {
  for (const NamedKey& named : kNamedKeys) {
    if (named.key == input.wparam) return named.name;
  }
  if (input.wparam >= VK_F1 && input.wparam <= VK_F24) return "F" + std::to_string(input.wparam - VK_F1 + 1);
  if (input.character == 0) return "Unidentified";
  wchar_t character = input.character;
  if (!input.modifiers.shift && character >= L'A' && character <= L'Z') character += L'a' - L'A';
  return ToUtf8({&character, 1});
}

}  // namespace

Json::Value ToMouseEvent(const MouseInput& input) {
  for (const MouseMessage& known : kMouseMessages) {
    if (known.message != input.message) continue;
    Json::Value event(Json::objectValue);
    event["type"] = known.type;
    event["x"] = input.x;
    event["y"] = input.y;
    event["modifiers"] = BitsOf(input.modifiers);
    event["button"] = known.button;
    event["buttons"] = ButtonsOf(LOWORD(input.wparam));
    event["clickCount"] = input.clicks;
    const double notches = static_cast<short>(HIWORD(input.wparam)) / static_cast<double>(WHEEL_DELTA);
    if (input.message == WM_MOUSEWHEEL || input.message == WM_MOUSEHWHEEL) {
      event["deltaX"] = input.message == WM_MOUSEHWHEEL ? notches * kWheelStep : 0;
      event["deltaY"] = input.message == WM_MOUSEWHEEL ? -notches * kWheelStep : 0;
    }
    return event;
  }
  return {};
}

Json::Value ToKeyEvent(const KeyInput& input) {
  const bool isDown = input.message == WM_KEYDOWN || input.message == WM_SYSKEYDOWN;
  Json::Value event(Json::objectValue);
  event["type"] = isDown ? "rawKeyDown" : "keyUp";
  event["modifiers"] = BitsOf(input.modifiers);
  event["windowsVirtualKeyCode"] = static_cast<int>(input.wparam);
  event["nativeVirtualKeyCode"] = static_cast<int>(input.wparam);
  event["key"] = NameOfKey(input);
  event["autoRepeat"] = isDown && (input.lparam & kWasDown) != 0;
  event["isSystemKey"] = input.message == WM_SYSKEYDOWN || input.message == WM_SYSKEYUP;
  // Enter and the keys with arrows: the extended ones are not on the number block, but for Enter.
  const bool isExtended = (input.lparam & kIsExtended) != 0;
  event["isKeypad"] = input.wparam >= VK_NUMPAD0 ? input.wparam <= VK_DIVIDE : input.wparam == VK_RETURN && isExtended;
  return event;
}

std::optional<Json::Value> TextInput::Add(wchar_t unit) {
  std::wstring text;
  if (unit >= 0xD800 && unit <= 0xDBFF) {
    m_high = unit;
    return {};
  }
  if (unit >= 0xDC00 && unit <= 0xDFFF) {
    if (m_high == 0) return {};
    text = {m_high, unit};
  } else if (unit == L'\r' || (unit >= L' ' && unit != 0x7F)) {
    text = {unit};
  }
  m_high = 0;
  if (text.empty()) return {};
  Json::Value event(Json::objectValue);
  event["type"] = "char";
  event["text"] = ToUtf8(text);
  event["unmodifiedText"] = event["text"];
  return event;
}

int ClickCounter::Press(UINT message, int x, int y, uint32_t time, uint32_t doubleClickTime) {
  // A window class may or may not ask for the message of a double click; both are a press.
  if (message == WM_LBUTTONDBLCLK) message = WM_LBUTTONDOWN;
  if (message == WM_RBUTTONDBLCLK) message = WM_RBUTTONDOWN;
  if (message == WM_MBUTTONDBLCLK) message = WM_MBUTTONDOWN;
  const bool isNear = std::abs(x - m_x) <= kClickDistance && std::abs(y - m_y) <= kClickDistance;
  m_count = message == m_message && isNear && time - m_time <= doubleClickTime ? m_count + 1 : 1;
  m_message = message;
  m_x = x;
  m_y = y;
  m_time = time;
  return m_count;
}

}  // namespace engine
