// Text on the system's clipboard.
#pragma once

#include <windows.h>

#include <string>
#include <string_view>

namespace engine {

std::wstring ReadClipboardText(HWND owner);  // empty: there is none
void WriteClipboardText(HWND owner, std::wstring_view text);

}  // namespace engine
