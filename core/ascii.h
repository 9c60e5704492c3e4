// Comparisons of words whose case does not count: keys, units, schemes, names in protocols. Only ASCII letters have a
// case here; names of files are compared as the system does it, by EqualNames in core/paths.h.
#pragma once

#include <algorithm>
#include <string_view>

template <class Char>
constexpr Char LowerAscii(Char c) {
  return c >= Char{'A'} && c <= Char{'Z'} ? static_cast<Char>(c - Char{'A'} + Char{'a'}) : c;
}

template <class Char>
bool EqualLowerAscii(std::basic_string_view<Char> a, std::basic_string_view<Char> b) {
  return std::equal(a.begin(), a.end(), b.begin(), b.end(),
                    [](Char one, Char other) { return LowerAscii(one) == LowerAscii(other); });
}

inline bool EqualIgnoringCase(std::string_view a, std::string_view b) {
  return EqualLowerAscii(a, b);
}
inline bool EqualIgnoringCase(std::wstring_view a, std::wstring_view b) {
  return EqualLowerAscii(a, b);
}

inline bool StartsWithIgnoringCase(std::string_view text, std::string_view prefix) {
  return EqualLowerAscii(text.substr(0, prefix.size()), prefix);
}
inline bool StartsWithIgnoringCase(std::wstring_view text, std::wstring_view prefix) {
  return EqualLowerAscii(text.substr(0, prefix.size()), prefix);
}
