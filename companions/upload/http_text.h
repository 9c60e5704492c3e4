// Addresses, header lines and numbers of HTTP as plain text. What comes from a server is checked here; no Windows
// header.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace qxlink {

// An absolute http:// or https:// address, taken apart.
struct HttpAddress {
  bool isSecure = true;
  std::string host;  // an IPv6 address without its brackets
  uint16_t port = 0;
  std::string target;  // path and query, never empty

  bool operator==(const HttpAddress&) const = default;
};

// Nothing when it is no such address, or holds a user name, a fragment, white space or a control character.
std::optional<HttpAddress> ParseHttpAddress(std::string_view text);

// "https://host:port/target" of another target on that server.
std::string AddressText(const HttpAddress& server, std::string_view target);

// The target of the resource that an answer from `base` calls `location`, which may be relative. Nothing when that lies
// at another scheme, host or port, or is no address at all.
std::optional<std::string> ResolveLocation(const HttpAddress& base, std::string_view location);

using HttpHeaders = std::vector<std::pair<std::string, std::string>>;

// The header lines of an answer; the status line and what has no colon are left out.
HttpHeaders ParseHeaderLines(std::string_view text);

// The value of a header, its name compared without case. One that comes several times is joined by ", ".
std::optional<std::string> FindHeader(const HttpHeaders& headers, std::string_view name);

// Decimal digits only, nothing around them, at most 2^63 - 1.
std::optional<uint64_t> ParseCount(std::string_view text);

// How many seconds a "Retry-After" asks to wait: it gives their number, or a date. `now` is in seconds since 1970.
std::optional<uint64_t> ParseRetryAfter(std::string_view text, uint64_t now);

// Whether a comma-separated list holds the item.
bool ListHolds(std::string_view list, std::string_view item);

std::string Base64(std::string_view bytes);

// Text of a server, fit for a log: one line of printable ASCII, at most 200 characters.
std::string LoggableText(std::string_view text);

// Whether they may stand in a request's header without breaking out of it.
bool IsHeaderName(std::string_view name);
bool IsHeaderValue(std::string_view value);

}  // namespace qxlink
