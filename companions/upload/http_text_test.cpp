#include "companions/upload/http_text.h"

#include <gtest/gtest.h>

namespace {

using namespace qxlink;

TEST(ParseHttpAddress, TakesAddressesApart) {
  struct {
    const char* text;
    HttpAddress address;
  } const rows[] = {
      {"https://uploads.example/files", {true, "uploads.example", 443, "/files"}},
      {"HTTP://uploads.example", {false, "uploads.example", 80, "/"}},
      {"https://uploads.example:8443?a=b", {true, "uploads.example", 8443, "/?a=b"}},
      {"https://[::1]:8443/files/", {true, "::1", 8443, "/files/"}},
      {"https://[2001:db8::7]", {true, "2001:db8::7", 443, "/"}},
  };
  for (const auto& row : rows)
    EXPECT_EQ(ParseHttpAddress(row.text), row.address) << row.text;
  for (const std::string text :
       {"", "https://", "https:///files", "ftp://a", "a.example", "https://user@a.example", "https://a:b@a.example",
        "https://a.example:0", "https://a.example:65536", "https://a.example:", "https://a.example:+1", "https://[::1",
        "https://[::1]x", "https://a.example/#part", "https://a.example/a b", "https://a.example/\r\nHost: b",
        "https://a.ex\xC3\xA4mple"}) {
    EXPECT_EQ(ParseHttpAddress(text), std::nullopt) << text;
  }
  EXPECT_EQ(ParseHttpAddress("https://a.example/" + std::string(3000, 'a')), std::nullopt);
}

TEST(ResolveLocation, StaysOnTheServer) {
  const HttpAddress base{true, "uploads.example", 443, "/in/files?x=1"};
  struct {
    const char* location;
    const char* target;  // null: refused
  } const rows[] = {
      {"/files/1", "/files/1"},
      {" /files/1\r", "/files/1"},
      {"1", "/in/1"},
      {"a/b?c=d:e", "/in/a/b?c=d:e"},
      {"https://uploads.example/files/1", "/files/1"},
      {"https://UPLOADS.example:443/files/1", "/files/1"},
      {"//uploads.example/files/1", "/files/1"},
      {"http://uploads.example/files/1", nullptr},
      {"https://uploads.example:8443/files/1", nullptr},
      {"https://uploads.example.evil/files/1", nullptr},
      {"https://uploads.example@evil/files/1", nullptr},
      {"//evil/files/1", nullptr},
      {"javascript:1", nullptr},
      {"", nullptr},
      {"/files/1#x", nullptr},
      {"/files/a b", nullptr},
      {"/files/\xFF", nullptr},
  };
  for (const auto& row : rows) {
    const auto target = ResolveLocation(base, row.location);
    EXPECT_EQ(target, row.target == nullptr ? std::nullopt : std::optional<std::string>(row.target)) << row.location;
  }
  EXPECT_EQ(AddressText({false, "::1", 80, "/"}, "/files/1"), "http://[::1]:80/files/1");
}

TEST(HttpHeaders, AreFoundByNameAndJoined) {
  const auto headers =
      ParseHeaderLines("HTTP/1.1 200 OK\r\nUpload-Offset:  5 \r\nX-A: 1\r\nbroken\r\n x: y\r\nx-a: 2\nE:");
  EXPECT_EQ(headers.size(), 4u);
  EXPECT_EQ(FindHeader(headers, "upload-offset"), "5");
  EXPECT_EQ(FindHeader(headers, "X-A"), "1, 2");
  EXPECT_EQ(FindHeader(headers, "e"), "");
  EXPECT_EQ(FindHeader(headers, "x"), std::nullopt);
  EXPECT_TRUE(ListHolds("creation, Checksum ,expiration", "checksum"));
  EXPECT_FALSE(ListHolds("creation,checksum-trailer", "checksum"));
}

TEST(ParseCount, TakesNothingButDigits) {
  EXPECT_EQ(ParseCount("0"), 0u);
  EXPECT_EQ(ParseCount("9223372036854775807"), 9223372036854775807u);
  for (const char* text :
       {"", "-1", "+1", " 1", "1 ", "0x1", "1.0", "9223372036854775808", "18446744073709551616", "1,2"})
    EXPECT_EQ(ParseCount(text), std::nullopt) << text;
}

TEST(ParseRetryAfter, TakesSecondsAndDates) {
  struct {
    const char* text;
    std::optional<uint64_t> seconds;
  } const rows[] = {
      {"120", 120},
      {"Thu, 01 Jan 1970 00:01:40 GMT", 0},
      {"Fri, 31 Dec 1999 23:59:59 GMT", 60},
      {"Tue, 29 Feb 2000 00:00:00 GMT", 60 + 1 + 59 * 86400},
      {"Sun, 06 Nov 1994 08:49:37 GMT", 0},
      {"Fri, 31 Dec 1999 24:59:59 GMT", std::nullopt},
      {"Fri, 31 Foo 1999 23:59:59 GMT", std::nullopt},
      {"soon", std::nullopt},
      {"-5", std::nullopt},
  };
  for (const auto& row : rows)
    EXPECT_EQ(ParseRetryAfter(row.text, 946684739), row.seconds) << row.text;  // 1999-12-31 23:58:59
}

TEST(Base64, PadsWhatIsLeft) {
  EXPECT_EQ(Base64(""), "");
  EXPECT_EQ(Base64("f"), "Zg==");
  EXPECT_EQ(Base64("fo"), "Zm8=");
  EXPECT_EQ(Base64("foo"), "Zm9v");
  EXPECT_EQ(Base64("\xFF\xFE\xFD"), "//79");
}

TEST(LoggableText, IsOneShortLine) {
  EXPECT_EQ(LoggableText("\r\nno\nway \xC3\xA4\n"), "no.way ..");
  EXPECT_EQ(LoggableText(std::string(1000, 'a')).size(), 200u);
}

}  // namespace
