// core/text.h without Windows. A wchar_t of this machine has 32 bits; it holds one UTF-16 unit all the same, so that
// the sources above see the surrogates, lengths and positions that they see on Windows. A number that is no UTF-16 unit
// can only come from a fault of those sources, and ends the program.
#include "core/text.h"

#include <bit>
#include <cstdint>
#include <cstdlib>

namespace {

constexpr uint32_t kReplacement = 0xFFFD;

void AppendUtf8(std::string& utf8, uint32_t codepoint) {
  const auto put = [&utf8](uint32_t byte) { utf8 += static_cast<char>(byte); };
  if (codepoint < 0x80) return put(codepoint);
  if (codepoint < 0x800) {
    put(0xC0 | codepoint >> 6);
  } else {
    if (codepoint < 0x10000) {
      put(0xE0 | codepoint >> 12);
    } else {
      put(0xF0 | codepoint >> 18);
      put(0x80 | (codepoint >> 12 & 0x3F));
    }
    put(0x80 | (codepoint >> 6 & 0x3F));
  }
  put(0x80 | (codepoint & 0x3F));
}

// Takes one character from the front, or as many bytes as could have begun one, which become U+FFFD.
uint32_t TakeCharacter(std::string_view& utf8) {
  const auto byte = [&utf8](size_t index) { return static_cast<unsigned char>(utf8[index]); };
  const uint32_t first = byte(0);
  const size_t length = first < 0x80   ? 1
                        : first < 0xC2 ? 0
                        : first < 0xE0 ? 2
                        : first < 0xF0 ? 3
                        : first < 0xF5 ? 4
                                       : 0;
  uint32_t codepoint = length < 2 ? first : first & (0x7Fu >> length);
  size_t taken = 1;
  for (; taken < length && taken < utf8.size(); ++taken) {
    // Of the second byte some leave room only for overlong forms, surrogates, or what is beyond Unicode.
    const uint32_t least = taken > 1 ? 0x80 : first == 0xE0 ? 0xA0 : first == 0xF0 ? 0x90 : 0x80;
    const uint32_t most = taken > 1 ? 0xBF : first == 0xED ? 0x9F : first == 0xF4 ? 0x8F : 0xBF;
    if (byte(taken) < least || byte(taken) > most) break;
    codepoint = codepoint << 6 | (byte(taken) & 0x3F);
  }
  utf8.remove_prefix(taken);
  return taken == length ? codepoint : kReplacement;
}

}  // namespace

std::string ToUtf8(std::wstring_view text) {
  std::string utf8;
  utf8.reserve(text.size());
  for (size_t i = 0; i < text.size(); ++i) {
    const auto unit = std::bit_cast<uint32_t>(text[i]);
    if (unit > 0xFFFF) std::abort();
    const uint32_t next = i + 1 < text.size() ? std::bit_cast<uint32_t>(text[i + 1]) : 0;
    if ((unit & 0xFC00) == 0xD800 && (next & 0xFFFFFC00) == 0xDC00) {
      AppendUtf8(utf8, 0x10000 + ((unit & 0x3FF) << 10 | (next & 0x3FF)));
      ++i;
    } else {
      AppendUtf8(utf8, (unit & 0xF800) == 0xD800 ? kReplacement : unit);
    }
  }
  return utf8;
}

std::wstring ToWide(std::string_view utf8) {
  std::wstring text;
  text.reserve(utf8.size());
  while (!utf8.empty()) {
    const uint32_t codepoint = TakeCharacter(utf8);
    if (codepoint >= 0x10000) {
      text += static_cast<wchar_t>(0xD800 | (codepoint - 0x10000) >> 10);
      text += static_cast<wchar_t>(0xDC00 | (codepoint & 0x3FF));
    } else {
      text += static_cast<wchar_t>(codepoint);
    }
  }
  return text;
}
