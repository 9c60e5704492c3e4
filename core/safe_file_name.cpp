#include "core/safe_file_name.h"

#include <algorithm>
#include <cstdint>

#include "core/ascii.h"

namespace {

bool IsForbidden(wchar_t c) {
  return c < L' ' || std::wstring_view(L"<>:\"/\\|?*").find(c) != std::wstring_view::npos;
}

// "nul.txt" is the device as well as "NUL" is.
bool IsDeviceName(std::wstring_view name) {
  std::wstring stem(name.substr(0, name.find(L'.')));
  stem.erase(stem.find_last_not_of(L' ') + 1);
  std::transform(stem.begin(), stem.end(), stem.begin(), &LowerAscii<wchar_t>);
  constexpr std::wstring_view kDevices[] = {L"con", L"prn", L"aux", L"nul", L"conin$", L"conout$"};
  if (std::find(std::begin(kDevices), std::end(kDevices), stem) != std::end(kDevices)) return true;
  constexpr std::wstring_view kDigits = L"0123456789\u00B9\u00B2\u00B3";
  return stem.size() == 4 && (stem.starts_with(L"com") || stem.starts_with(L"lpt")) &&
         kDigits.find(stem.back()) != std::wstring_view::npos;
}

std::wstring Digits(std::wstring_view text) {
  uint32_t hash = 2166136261U;  // FNV-1a
  for (const wchar_t c : text) {
    hash = (hash ^ (static_cast<uint32_t>(c) & 0xFF)) * 16777619U;
    hash = (hash ^ (static_cast<uint32_t>(c) >> 8)) * 16777619U;
  }
  std::wstring digits(8, L'0');
  for (size_t i = digits.size(); i > 0; --i, hash >>= 4)
    digits[i - 1] = L"0123456789abcdef"[hash & 0xF];
  return digits;
}

}  // namespace

std::wstring SafeFileName(std::wstring_view text, std::wstring_view suffix) {
  std::wstring name(text);
  if (name.size() > kLongestFileText) {
    const bool splitsPair = name[kLongestFileText - 1] >= 0xD800 && name[kLongestFileText - 1] < 0xDC00;
    name.resize(kLongestFileText - (splitsPair ? 1 : 0));
  }
  std::replace_if(name.begin(), name.end(), IsForbidden, L'_');
  if (IsDeviceName(name + std::wstring(suffix))) name.insert(0, 1, L'_');
  if (name != text) name += L'-' + Digits(text);
  return name.append(suffix);
}
