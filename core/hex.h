// Bytes as hexadecimal digits, two for each.
#pragma once

#include <span>
#include <string>

enum class HexCase { kLower, kUpper };

inline std::string HexText(std::span<const unsigned char> bytes, HexCase letters = HexCase::kLower) {
  const char* const digits = letters == HexCase::kLower ? "0123456789abcdef" : "0123456789ABCDEF";
  std::string text;
  text.reserve(bytes.size() * 2);
  for (const unsigned char byte : bytes) {
    text += digits[byte >> 4];
    text += digits[byte & 0xF];
  }
  return text;
}
