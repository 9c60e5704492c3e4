#include "core/paths.h"

#include <algorithm>

namespace {
constexpr wchar_t kSeparators[] = L"\\/";
}  // namespace

qx::PathString JoinPath(std::wstring_view base, std::wstring_view part) {
  qx::PathString path(base);
  if (!base.empty() && base.back() != L'\\' && base.back() != L'/') path += L'\\';
  path += part.substr(std::min(part.find_first_not_of(kSeparators), part.size()));
  return path;
}

std::wstring_view LastPathComponent(std::wstring_view path) {
  path = path.substr(0, path.find_last_not_of(kSeparators) + 1);
  return path.substr(path.find_last_of(kSeparators) + 1);
}
