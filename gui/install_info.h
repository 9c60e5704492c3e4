// Reads the settings that the product's installer left, a YAML document, into the program's value. Whatever is in the
// file is bounded: its size, its depth, and what its aliases stand for. No Windows header.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

#include "core/value.h"

namespace qx {

inline constexpr size_t kLargestInstallInfo = 1 << 20;  // bytes

// False when the text is no YAML document or goes beyond the limits (100 levels, 1,000 anchors, 50,000 values with
// every alias counted as what it stands for, 4,096 members in one mapping); `error` says why, with the line where it is
// known. Scalars are strings, whatever they look like; of keys that are no scalars nothing is kept. Of several
// documents the first counts; without one the value is null.
bool ParseYaml(std::string_view text, Value& value, std::string& error);

}  // namespace qx
