// The only conversion between the program's own text (UTF-16) and the UTF-8 of JSON, zip, XML and upload libraries.
// Ill-formed input is never an error: each bad unit becomes U+FFFD, so that text from outside always gets through.
#pragma once

#include <string>
#include <string_view>

std::string ToUtf8(std::wstring_view text);
std::wstring ToWide(std::string_view utf8);

// The text without blanks, tabs and line ends at either end; null counts as empty. Points into `text`.
inline std::string_view Trimmed(std::string_view text) {
  constexpr std::string_view kBlanks = " \t\r\n";
  const size_t first = text.find_first_not_of(kBlanks);
  if (first == std::string_view::npos) return {};
  return text.substr(first, text.find_last_not_of(kBlanks) - first + 1);
}
inline std::string_view Trimmed(const char* text) {
  return text == nullptr ? std::string_view() : Trimmed(std::string_view(text));
}
// Also without no-break spaces, which are easily copied along from a page.
inline std::wstring_view Trimmed(std::wstring_view text) {
  constexpr std::wstring_view kBlanks = L" \t\r\n\u00A0";
  const size_t first = text.find_first_not_of(kBlanks);
  if (first == std::wstring_view::npos) return {};
  return text.substr(first, text.find_last_not_of(kBlanks) - first + 1);
}
