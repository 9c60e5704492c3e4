#include "companions/engine/resource_address.h"

#include <algorithm>
#include <charconv>

#include "core/ascii.h"
#include "core/text.h"

namespace engine {
namespace {

struct Scheme {
  std::wstring_view engine;  // how the engine's address begins
  std::string_view browser;  // how the browser's does
  bool isFile;
};

// The top-level name "invalid" is reserved: it belongs to nobody.
constexpr Scheme kSchemes[] = {
    {L"file://", "https://file.engine.invalid/", true},
    {L"this://app/", "https://app.engine.invalid/", false},
    {L"res:", "https://res.engine.invalid/", false},
};

struct MimeType {
  std::wstring_view extension;
  std::string_view type;
};

constexpr MimeType kMimeTypes[] = {
    {L"htm", "text/html; charset=utf-8"},
    {L"html", "text/html; charset=utf-8"},
    {L"css", "text/css; charset=utf-8"},
    {L"js", "text/javascript; charset=utf-8"},
    {L"mjs", "text/javascript; charset=utf-8"},
    {L"json", "application/json; charset=utf-8"},
    {L"txt", "text/plain; charset=utf-8"},
    {L"svg", "image/svg+xml"},
    {L"png", "image/png"},
    {L"jpg", "image/jpeg"},
    {L"jpeg", "image/jpeg"},
    {L"gif", "image/gif"},
    {L"webp", "image/webp"},
    {L"ico", "image/x-icon"},
    {L"woff", "font/woff"},
    {L"woff2", "font/woff2"},
    {L"ttf", "font/ttf"},
};

bool IsPlain(char c) {
  const bool isLetter = (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z');
  return isLetter || (c >= '0' && c <= '9') || std::string_view("-_.~/:!$&'()*+,;=@").find(c) != std::string_view::npos;
}

std::string Encode(std::wstring_view text) {
  static constexpr char kDigits[] = "0123456789ABCDEF";
  std::string encoded;
  for (const char c : ToUtf8(text)) {
    if (IsPlain(c)) {
      encoded += c;
    } else {
      encoded += {'%', kDigits[static_cast<unsigned char>(c) >> 4], kDigits[static_cast<unsigned char>(c) & 15]};
    }
  }
  return encoded;
}

std::optional<std::wstring> Decode(std::string_view encoded) {
  std::string text;
  for (size_t i = 0; i < encoded.size(); ++i) {
    if (encoded[i] != '%') {
      text += encoded[i];
      continue;
    }
    unsigned value = 0;
    if (i + 2 >= encoded.size()) return {};
    const char* const end = encoded.data() + i + 3;
    if (std::from_chars(encoded.data() + i + 1, end, value, 16).ptr != end || value == 0) return {};
    text += static_cast<char>(value);
    i += 2;
  }
  return ToWide(text);
}

bool HasParentStep(std::wstring_view path) {
  for (size_t begin = 0; begin <= path.size();) {
    const size_t end = std::min(path.find_first_of(L"\\/", begin), path.size());
    if (path.substr(begin, end - begin) == L"..") return true;
    begin = end + 1;
  }
  return false;
}

// Exactly this name under one of the hosts.
bool IsAtRoot(std::string_view browserUrl, std::string_view name) {
  return std::any_of(std::begin(kSchemes), std::end(kSchemes), [&](const Scheme& scheme) {
    return browserUrl.starts_with(scheme.browser) && browserUrl.substr(scheme.browser.size()) == name;
  });
}

}  // namespace

std::optional<PageAddress> ToPageAddress(std::wstring_view address) {
  for (const Scheme& scheme : kSchemes) {
    const bool isPath = scheme.isFile && address.size() > 2 && (address[1] == L':' || address.starts_with(L"\\\\"));
    if (!isPath && !StartsWithIgnoringCase(address, scheme.engine)) continue;
    std::wstring rest(isPath ? address : address.substr(scheme.engine.size()));
    if (!scheme.isFile && rest.starts_with(L"//")) rest.erase(0, 2);
    PageAddress page;
    if (scheme.isFile) {
      if (rest.size() > 2 && rest[0] == L'/' && rest[2] == L':') rest.erase(0, 1);  // file:///C:/...
      std::replace(rest.begin(), rest.end(), L'\\', L'/');
      const size_t end = rest.rfind(L'/');
      if (end == std::wstring::npos || HasParentStep(rest)) return {};
      page.folder = rest.substr(0, end);
      std::replace(page.folder.begin(), page.folder.end(), L'/', L'\\');
    }
    if (rest.empty()) return {};
    page.browserUrl = std::string(scheme.browser) + Encode(rest);
    return page;
  }
  return {};
}

std::optional<std::wstring> ToEngineUri(std::string_view browserUrl) {
  browserUrl = browserUrl.substr(0, browserUrl.find_first_of("?#"));
  for (const Scheme& scheme : kSchemes) {
    // A page may also name resources by the engine's own addresses.
    const std::string engineForm = ToUtf8(scheme.engine);
    const bool isDirect = !scheme.isFile && browserUrl.starts_with(engineForm);
    if (!isDirect && !browserUrl.starts_with(scheme.browser)) continue;
    auto rest = Decode(browserUrl.substr(isDirect ? engineForm.size() : scheme.browser.size()));
    if (!rest || rest->empty()) return {};
    if (isDirect && rest->starts_with(L"//")) rest->erase(0, 2);
    return std::wstring(scheme.engine) + *rest;
  }
  return {};
}

std::optional<std::wstring> PathInside(std::wstring_view uri, std::wstring_view folder) {
  if (folder.empty() || !StartsWithIgnoringCase(uri, kSchemes[0].engine)) return {};
  std::wstring path(uri.substr(kSchemes[0].engine.size()));
  std::replace(path.begin(), path.end(), L'/', L'\\');
  const bool isInside =
      StartsWithIgnoringCase(path, folder) && path.size() > folder.size() + 1 && path[folder.size()] == L'\\';
  // Nothing that leads out of the folder, and no stream of a file.
  if (!isInside || HasParentStep(path) || path.find(L':', folder.size()) != std::wstring::npos) return {};
  return path;
}

bool IsNativeCall(std::string_view browserUrl) {
  return IsAtRoot(browserUrl, ".native-call");
}

bool IsSiteIcon(std::string_view browserUrl) {
  return IsAtRoot(browserUrl, "favicon.ico");
}

std::string_view MimeTypeOf(std::wstring_view uri) {
  const size_t point = uri.rfind(L'.');
  const std::wstring_view extension = point == std::wstring_view::npos ? std::wstring_view() : uri.substr(point + 1);
  for (const MimeType& mime : kMimeTypes) {
    if (EqualIgnoringCase(mime.extension, extension)) return mime.type;
  }
  return "application/octet-stream";
}

}  // namespace engine
