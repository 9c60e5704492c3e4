#include "companions/upload/http_text.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <limits>

#include "core/ascii.h"
#include "core/text.h"

namespace qxlink {
namespace {

constexpr size_t kLongestAddress = 2000;

bool IsPrintable(unsigned char c) {
  return c > ' ' && c < 0x7F;
}

// "host", "host:port", "[address]:port". False when it is none of them.
bool ParseAuthority(std::string_view text, HttpAddress& address) {
  size_t hostEnd = text.find(':');
  if (text.starts_with('[')) {
    const size_t bracket = text.find(']');
    if (bracket == std::string_view::npos) return false;
    address.host = text.substr(1, bracket - 1);
    hostEnd = bracket + 1 == text.size() ? std::string_view::npos : bracket + 1;
    if (hostEnd != std::string_view::npos && text[hostEnd] != ':') return false;
  } else {
    address.host = text.substr(0, hostEnd);
  }
  if (address.host.empty() || address.host.find_first_of("@[]") != std::string::npos) return false;
  if (hostEnd == std::string_view::npos) return true;
  const auto port = ParseCount(text.substr(hostEnd + 1));
  if (!port || *port == 0 || *port > std::numeric_limits<uint16_t>::max()) return false;
  address.port = static_cast<uint16_t>(*port);
  return true;
}

// Days since 1970-01-01 of a day of the Gregorian calendar.
int64_t DaysSinceEpoch(int64_t year, unsigned month, unsigned day) {
  year -= month <= 2 ? 1 : 0;
  const int64_t era = year / 400;
  const auto yearOfEra = static_cast<unsigned>(year - era * 400);
  const unsigned dayOfYear = (153 * (month + (month > 2 ? -3U : 9U)) + 2) / 5 + day - 1;
  const unsigned dayOfEra = yearOfEra * 365 + yearOfEra / 4 - yearOfEra / 100 + dayOfYear;
  return era * 146097 + static_cast<int64_t>(dayOfEra) - 719468;
}

// "Sun, 06 Nov 1994 08:49:37 GMT", the one form of a date that servers may send.
std::optional<uint64_t> ParseHttpDate(std::string_view text) {
  constexpr std::array<std::string_view, 12> kMonths = {"Jan", "Feb", "Mar", "Apr", "May", "Jun",
                                                        "Jul", "Aug", "Sep", "Oct", "Nov", "Dec"};
  if (text.size() != 29 || !text.ends_with(" GMT") || text.substr(3, 2) != ", ") return std::nullopt;
  const auto month = std::find(kMonths.begin(), kMonths.end(), text.substr(8, 3));
  const auto day = ParseCount(text.substr(5, 2));
  const auto year = ParseCount(text.substr(12, 4));
  const auto hour = ParseCount(text.substr(17, 2));
  const auto minute = ParseCount(text.substr(20, 2));
  const auto second = ParseCount(text.substr(23, 2));
  if (month == kMonths.end() || !day || !year || !hour || !minute || !second) return std::nullopt;
  if (*year < 1970 || *day == 0 || *day > 31 || *hour > 23 || *minute > 59 || *second > 60) return std::nullopt;
  const int64_t days = DaysSinceEpoch(static_cast<int64_t>(*year), static_cast<unsigned>(month - kMonths.begin()) + 1,
                                      static_cast<unsigned>(*day));
  return static_cast<uint64_t>(days) * 86400 + *hour * 3600 + *minute * 60 + *second;
}

}  // namespace

std::optional<HttpAddress> ParseHttpAddress(std::string_view text) {
  if (text.size() > kLongestAddress || !std::all_of(text.begin(), text.end(), IsPrintable)) return std::nullopt;
  if (text.find('#') != std::string_view::npos) return std::nullopt;
  HttpAddress address;
  if (StartsWithIgnoringCase(text, "https://")) {
    address.port = 443;
    text.remove_prefix(8);
  } else if (StartsWithIgnoringCase(text, "http://")) {
    address.isSecure = false;
    address.port = 80;
    text.remove_prefix(7);
  } else {
    return std::nullopt;
  }
  const size_t authorityEnd = text.find_first_of("/?");
  if (!ParseAuthority(text.substr(0, authorityEnd), address)) return std::nullopt;
  if (authorityEnd != std::string_view::npos) address.target = text.substr(authorityEnd);
  if (!address.target.starts_with('/')) address.target.insert(0, 1, '/');
  return address;
}

std::string AddressText(const HttpAddress& server, std::string_view target) {
  const bool isIpv6 = server.host.find(':') != std::string::npos;
  std::string text = server.isSecure ? "https://" : "http://";
  text.append(isIpv6 ? "[" : "").append(server.host).append(isIpv6 ? "]" : "");
  return text.append(":").append(std::to_string(server.port)).append(target);
}

std::optional<std::string> ResolveLocation(const HttpAddress& base, std::string_view location) {
  std::string text(Trimmed(location));
  if (text.starts_with("//")) text.insert(0, base.isSecure ? "https:" : "http:");
  if (StartsWithIgnoringCase(text, "http://") || StartsWithIgnoringCase(text, "https://")) {
    const auto other = ParseHttpAddress(text);
    const bool isSame = other && other->isSecure == base.isSecure && other->port == base.port &&
                        EqualIgnoringCase(other->host, base.host);
    return isSame ? std::optional(other->target) : std::nullopt;
  }
  if (text.empty() || text.size() > kLongestAddress || !std::all_of(text.begin(), text.end(), IsPrintable) ||
      text.find('#') != std::string::npos) {
    return std::nullopt;
  }
  if (text.starts_with('/')) return text;
  // Another scheme would have a colon before the first slash.
  if (text.substr(0, text.find('/')).find(':') != std::string::npos) return std::nullopt;
  const std::string path = base.target.substr(0, base.target.find('?'));
  return path.substr(0, path.rfind('/') + 1) + text;
}

HttpHeaders ParseHeaderLines(std::string_view text) {
  HttpHeaders headers;
  while (!text.empty()) {
    const size_t end = std::min(text.find('\n'), text.size());
    const std::string_view line = text.substr(0, end);
    const size_t colon = line.find(':');
    if (colon != std::string_view::npos && IsHeaderName(line.substr(0, colon))) {
      headers.emplace_back(line.substr(0, colon), Trimmed(line.substr(colon + 1)));
    }
    text.remove_prefix(std::min(end + 1, text.size()));
  }
  return headers;
}

std::optional<std::string> FindHeader(const HttpHeaders& headers, std::string_view name) {
  std::optional<std::string> found;
  for (const auto& [otherName, value] : headers) {
    if (EqualIgnoringCase(name, otherName)) found = found ? *found + ", " + value : value;
  }
  return found;
}

std::optional<uint64_t> ParseCount(std::string_view text) {
  uint64_t number = 0;
  const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
  const bool isWhole = error == std::errc() && end == text.data() + text.size();
  if (!isWhole || number > static_cast<uint64_t>(std::numeric_limits<int64_t>::max())) return std::nullopt;
  return number;
}

std::optional<uint64_t> ParseRetryAfter(std::string_view text, uint64_t now) {
  if (const auto seconds = ParseCount(text)) return seconds;
  const auto date = ParseHttpDate(text);
  if (!date) return std::nullopt;
  return *date > now ? *date - now : 0;
}

bool ListHolds(std::string_view list, std::string_view item) {
  while (!list.empty()) {
    const size_t comma = std::min(list.find(','), list.size());
    if (EqualIgnoringCase(Trimmed(list.substr(0, comma)), item)) return true;
    list.remove_prefix(std::min(comma + 1, list.size()));
  }
  return false;
}

std::string Base64(std::string_view bytes) {
  constexpr char kAlphabet[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
  std::string text;
  text.reserve((bytes.size() + 2) / 3 * 4);
  for (size_t i = 0; i < bytes.size(); i += 3) {
    const size_t count = std::min<size_t>(3, bytes.size() - i);
    uint32_t group = 0;
    for (size_t k = 0; k < 3; ++k)
      group = group << 8 | (k < count ? static_cast<unsigned char>(bytes[i + k]) : 0U);
    for (size_t k = 0; k < 4; ++k)
      text += k <= count ? kAlphabet[group >> (18 - 6 * k) & 0x3F] : '=';
  }
  return text;
}

std::string LoggableText(std::string_view text) {
  constexpr size_t kLongest = 200;
  std::string result;
  for (const char c : Trimmed(text).substr(0, kLongest))
    result += c == ' ' || IsPrintable(static_cast<unsigned char>(c)) ? c : '.';
  return result;
}

bool IsHeaderName(std::string_view name) {
  static constexpr std::string_view kOthers = "!#$%&'*+-.^_`|~";
  return !name.empty() && std::all_of(name.begin(), name.end(), [](char c) {
    const char lower = LowerAscii(c);
    return (lower >= 'a' && lower <= 'z') || (c >= '0' && c <= '9') || kOthers.find(c) != std::string_view::npos;
  });
}

bool IsHeaderValue(std::string_view value) {
  return std::all_of(value.begin(), value.end(),
                     [](char c) { return c == ' ' || IsPrintable(static_cast<unsigned char>(c)); });
}

}  // namespace qxlink
