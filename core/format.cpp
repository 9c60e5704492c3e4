#include "core/format.h"

#include <cwchar>

std::wstring FormatV(const wchar_t* format, va_list arguments) {
  // _vsnwprintf returns a negative number both for "does not fit" and for "cannot be formatted" (a narrow argument that
  // the locale cannot convert); the limit ends the second case.
  constexpr size_t kFirstSize = 256;
  constexpr size_t kLimit = size_t{16} << 20;
  for (size_t size = kFirstSize; size <= kLimit; size *= 4) {
    std::wstring text(size, L'\0');
    va_list copy;
    va_copy(copy, arguments);
    const int written = _vsnwprintf(text.data(), size, format, copy);
    va_end(copy);
    if (written >= 0 && static_cast<size_t>(written) <= size) {
      text.resize(static_cast<size_t>(written));
      return text;
    }
  }
  return std::wstring(L"(cannot be formatted) ") + format;
}

std::wstring Format(const wchar_t* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  std::wstring text = FormatV(format, arguments);
  va_end(arguments);
  return text;
}
