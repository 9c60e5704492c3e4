// File names from text that a user wrote for another purpose. No Windows header.
#pragma once

#include <string>
#include <string_view>

// `text` followed by `suffix`, which is fit for a file name and holds its extension. Text that a file name can hold
// stays as it is. Otherwise each character that it cannot hold, separators included, becomes "_", a name of a device
// gets "_" in front, what is longer than kLongestFileText is cut, and "-" with 8 hexadecimal digits made from the whole
// text follows, so that different texts keep different names.
std::wstring SafeFileName(std::wstring_view text, std::wstring_view suffix);

inline constexpr size_t kLongestFileText = 200;  // leaves room for the suffix in a file name's 255 characters
