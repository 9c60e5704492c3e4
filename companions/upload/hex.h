// Bytes as lower-case hexadecimal digits.
#pragma once

#include <span>
#include <string>

namespace qxlink {

inline std::string HexText(std::span<const unsigned char> bytes) {
  constexpr char kDigits[] = "0123456789abcdef";
  std::string text;
  text.reserve(bytes.size() * 2);
  for (const unsigned char byte : bytes) {
    text += kDigits[byte >> 4];
    text += kDigits[byte & 0xF];
  }
  return text;
}

}  // namespace qxlink
