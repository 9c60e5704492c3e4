// What portable sources ask of the system, in the native build.
#include <windows.h>

#include <string_view>

#include "systeminfo/utils/folder_variables.h"

namespace {

wchar_t Upper(wchar_t c) {
  const bool isSmall = (c >= L'a' && c <= L'z') || (c >= 0xE0 && c <= 0xFE && c != 0xF7);
  return isSmall ? static_cast<wchar_t>(c - 0x20) : c;
}

}  // namespace

// Of the letters only those of Latin-1 are folded.
int CompareStringOrdinal(const wchar_t* left, int leftLength, const wchar_t* right, int rightLength, BOOL ignoreCase) {
  const std::wstring_view a(left, static_cast<size_t>(leftLength));
  const std::wstring_view b(right, static_cast<size_t>(rightLength));
  for (size_t i = 0; i < a.size() && i < b.size(); ++i) {
    const wchar_t one = ignoreCase != FALSE ? Upper(a[i]) : a[i];
    const wchar_t other = ignoreCase != FALSE ? Upper(b[i]) : b[i];
    if (one != other) return one < other ? CSTR_EQUAL - 1 : CSTR_EQUAL + 1;
  }
  return a.size() == b.size() ? CSTR_EQUAL : a.size() < b.size() ? CSTR_EQUAL - 1 : CSTR_EQUAL + 1;
}

// There are no such folders here.
std::wstring utils::ExpandFolderVariables(std::wstring_view text) {
  return std::wstring(text);
}
