#include "core/text.h"

#include <windows.h>

#include <algorithm>
#include <climits>

// The system's conversions take an int length. Longer text does not exist in this program (every reader of outside text
// has a limit far below); should it ever, it is cut rather than converted wrongly.
std::string ToUtf8(std::wstring_view text) {
  const int length = static_cast<int>(std::min<size_t>(text.size(), INT_MAX / 4));
  if (length == 0) return {};
  const int size = WideCharToMultiByte(CP_UTF8, 0, text.data(), length, nullptr, 0, nullptr, nullptr);
  std::string utf8(static_cast<size_t>(std::max(size, 0)), '\0');
  WideCharToMultiByte(CP_UTF8, 0, text.data(), length, utf8.data(), size, nullptr, nullptr);
  return utf8;
}

std::wstring ToWide(std::string_view utf8) {
  const int length = static_cast<int>(std::min<size_t>(utf8.size(), INT_MAX / 4));
  if (length == 0) return {};
  const int size = MultiByteToWideChar(CP_UTF8, 0, utf8.data(), length, nullptr, 0);
  std::wstring text(static_cast<size_t>(std::max(size, 0)), L'\0');
  MultiByteToWideChar(CP_UTF8, 0, utf8.data(), length, text.data(), size);
  return text;
}
