#include "gui/user_details.h"

#include <algorithm>

namespace qx {
namespace {

bool IsLetter(wchar_t c) {
  return c >= L'a' && c <= L'z';
}

bool IsDomainCharacter(wchar_t c) {
  return IsLetter(c) || (c >= L'0' && c <= L'9') || c == L'-';
}

bool IsLocalCharacter(wchar_t c) {
  return IsDomainCharacter(c) || c == L'_';
}

// One label or more, separated by points, none of them empty.
template <class IsCharacter>
bool AreLabels(std::wstring_view text, IsCharacter isCharacter) {
  wchar_t before = L'.';
  for (const wchar_t c : text) {
    if (c == L'.' ? before == L'.' : !isCharacter(c)) return false;
    before = c;
  }
  return before != L'.';
}

}  // namespace

bool IsEmailAddress(std::wstring_view text) {
  const size_t at = text.find(L'@');
  const size_t point = text.rfind(L'.');
  if (at == std::wstring_view::npos || point == std::wstring_view::npos || point < at) return false;
  const std::wstring_view last = text.substr(point + 1);
  return AreLabels(text.substr(0, at), IsLocalCharacter) &&
         AreLabels(text.substr(at + 1, point - at - 1), IsDomainCharacter) && last.size() >= 2 && last.size() <= 4 &&
         std::all_of(last.begin(), last.end(), IsLetter);
}

}  // namespace qx
