// core/format.h without Windows: Microsoft's formats put into the words of this machine's C library.
#include "core/format.h"

#include <cwchar>
#include <string_view>

namespace {

// "%s" is wide and "%S" narrow there; "%I64u" is "%llu".
std::wstring Translated(std::wstring_view format) {
  std::wstring text;
  while (!format.empty()) {
    const size_t percent = format.find(L'%');
    text += format.substr(0, percent);
    if (percent == std::wstring_view::npos) break;
    const size_t sizeAt = format.find_first_not_of(L"0123456789.-+ #*", percent + 1);
    const size_t kindAt = format.find_first_of(L"diouxXeEfgGaAcCsSpn%", sizeAt);
    if (kindAt == std::wstring_view::npos) return text.append(format.substr(percent));
    text += format.substr(percent, sizeAt - percent);
    const std::wstring_view size = format.substr(sizeAt, kindAt - sizeAt);
    const wchar_t kind = format[kindAt];
    if (kind == L's' || kind == L'c' || kind == L'S' || kind == L'C') {
      const bool isLarge = kind == L'S' || kind == L'C';
      const bool isWide = size == L"h" ? false : size == L"l" || size == L"w" || !isLarge;
      text += isWide ? L"l" : L"";
      text += kind == L's' || kind == L'S' ? L's' : L'c';
    } else {
      text += size == L"I64" ? L"ll" : size;
      text += kind;
    }
    format.remove_prefix(kindAt + 1);
  }
  return text;
}

}  // namespace

std::wstring FormatV(const wchar_t* format, va_list arguments) {
  constexpr size_t kLimit = size_t{16} << 20;
  const std::wstring native = Translated(format);
  for (size_t size = 256; size <= kLimit; size *= 4) {
    std::wstring text(size, L'\0');
    va_list copy;
    va_copy(copy, arguments);
    const int written = std::vswprintf(text.data(), size, native.c_str(), copy);
    va_end(copy);
    if (written < 0) continue;
    text.resize(static_cast<size_t>(written));
    return text;
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
