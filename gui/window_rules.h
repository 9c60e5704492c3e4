// What the host window decides without asking anybody: where it stands, and which resource an address means.
#pragma once

#include <windows.h>

#include <optional>
#include <string>
#include <string_view>

namespace qx::gui {

// The window's place for a page of that size. The work area's origin is left out on purpose: with a task bar on the
// left or at the top the window stands off the centre by the bar's size.
RECT CentredPlace(SIZE page, const RECT& workArea);

struct ResourceAddress {
  std::wstring name;  // at most 260 characters
  std::wstring type;  // the extension as it is written; empty when there is none
  bool isHtml = false;
};

// Which resource of the program "res:name.ext", "res://name.ext" or "this://app/name.ext" means; of the last one the
// whole address is the name. Nothing for all other addresses: they are the engine's.
std::optional<ResourceAddress> ParseResourceAddress(std::wstring_view address);

// The engine's name for a part of itself in its diagnostics.
const wchar_t* SubsystemName(uint32_t subsystem);

}  // namespace qx::gui
