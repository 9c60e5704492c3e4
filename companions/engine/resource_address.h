// How the engine's addresses ("file://...", "res:...", "this://app/...") and the browser's stand to each other. A page
// is shown under an https address of a host that does not exist; every request for it is answered by the engine, so
// that the browser itself loads nothing. Includes no Windows header.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace engine {

struct PageAddress {
  std::string browserUrl;  // what the browser is sent to; UTF-8, percent-encoded
  std::wstring folder;     // of a file: the folder that its resources must lie in; else empty
};

// `address` is an address of the engine or an absolute path.
std::optional<PageAddress> ToPageAddress(std::wstring_view address);

// The engine's address of what the browser asks for: "res:name", "this://app/name" or "file://path" with "/". Nothing
// for an address that is none of a page's, or that is not well encoded.
std::optional<std::wstring> ToEngineUri(std::string_view browserUrl);

// The path, with "\", of a "file://" uri, when it lies inside `folder`. Nothing otherwise.
std::optional<std::wstring> PathInside(std::wstring_view uri, std::wstring_view folder);

bool IsNativeCall(std::string_view browserUrl);
bool IsSiteIcon(std::string_view browserUrl);

std::string_view MimeTypeOf(std::wstring_view uri);  // by the extension; with the character set for text

}  // namespace engine
