#include "core/paths.h"

#include <windows.h>

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
  path = WithoutEndSeparators(path);
  return path.substr(path.find_last_of(kSeparators) + 1);
}

std::wstring_view ParentFolder(std::wstring_view path) {
  const size_t separator = path.find_last_of(kSeparators);
  return separator == std::wstring_view::npos ? std::wstring_view() : path.substr(0, separator);
}

bool IsAbsolutePath(std::wstring_view path) {
  const auto isSeparator = [](wchar_t c) { return c == L'\\' || c == L'/'; };
  if (path.size() >= 2 && isSeparator(path[0]) && isSeparator(path[1])) return true;
  return path.size() >= 3 && path[1] == L':' && isSeparator(path[2]);
}

std::wstring_view WithoutEndSeparators(std::wstring_view path) {
  return path.substr(0, path.find_last_not_of(kSeparators) + 1);
}

bool IsVolumeRoot(std::wstring_view extendedPath) {
  constexpr std::wstring_view kNetworkPrefix = L"\\\\?\\UNC\\";
  constexpr std::wstring_view kLocalPrefix = L"\\\\?\\";
  const bool isNetwork = extendedPath.starts_with(kNetworkPrefix);
  extendedPath.remove_prefix(std::min((isNetwork ? kNetworkPrefix : kLocalPrefix).size(), extendedPath.size()));
  extendedPath = WithoutEndSeparators(extendedPath);
  const auto separators = std::count(extendedPath.begin(), extendedPath.end(), L'\\');
  return separators <= (isNetwork ? 1 : 0);  // "server\share", "C:"
}

bool EqualNames(std::wstring_view a, std::wstring_view b) {
  return CompareStringOrdinal(a.data(), static_cast<int>(a.size()), b.data(), static_cast<int>(b.size()), TRUE) ==
         CSTR_EQUAL;
}

bool FolderContains(std::wstring_view outer, std::wstring_view inner) {
  outer = WithoutEndSeparators(outer);
  inner = WithoutEndSeparators(inner);
  if (inner.size() < outer.size() || (inner.size() > outer.size() && inner[outer.size()] != L'\\')) return false;
  return EqualNames(outer, inner.substr(0, outer.size()));
}
