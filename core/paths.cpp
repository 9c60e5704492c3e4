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

bool IsVolumeRoot(std::wstring_view extendedPath) {
  constexpr std::wstring_view kNetworkPrefix = L"\\\\?\\UNC\\";
  constexpr std::wstring_view kLocalPrefix = L"\\\\?\\";
  const bool isNetwork = extendedPath.starts_with(kNetworkPrefix);
  extendedPath.remove_prefix(std::min((isNetwork ? kNetworkPrefix : kLocalPrefix).size(), extendedPath.size()));
  extendedPath = extendedPath.substr(0, extendedPath.find_last_not_of(kSeparators) + 1);
  const auto separators = std::count(extendedPath.begin(), extendedPath.end(), L'\\');
  return separators <= (isNetwork ? 1 : 0);  // "server\share", "C:"
}
