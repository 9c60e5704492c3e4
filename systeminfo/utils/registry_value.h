// One registry value, and the text that reports show for it. The registry promises nothing about the bytes of a value:
// a text may be unterminated or have an odd number of bytes, a number may be too short. Whatever they are, they become
// text here. Pure functions; no Windows header.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "systeminfo/utils/folder_variables.h"

namespace utils {

struct RegistryValue {
  std::wstring name;  // in lower case; empty for the key's default value
  uint32_t type = 0;  // REG_SZ and so on
  std::string data;   // as stored
};

using TextExpander = std::wstring (*)(std::wstring_view text);

// By type:
//   REG_SZ         the text up to its first zero character
//   REG_EXPAND_SZ  the same, after `expand`
//   REG_BINARY     every byte in lower-case hexadecimal, with neither separator nor zero padding
//   REG_DWORD      the number, unsigned and decimal; empty when there are fewer than four bytes
//   REG_MULTI_SZ   the whole text, each zero character as a blank, and one blank more
//   any other      "Not implemented"
// A byte too many at the end of a text is dropped.
std::wstring ValueText(const RegistryValue& value, TextExpander expand = &ExpandFolderVariables);

// The text as it is stored, up to its first zero character; nothing is expanded.
std::wstring StoredText(std::string_view data);

// Only ASCII letters are changed. Two values of one key never get the same name by it, since the registry tells such
// names apart by more than their case.
std::wstring LowerCase(std::wstring_view text);

}  // namespace utils
