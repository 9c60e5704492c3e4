// Base 64, by the system's functions.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace engine {

std::string ToBase64(std::string_view bytes);  // without line ends
std::optional<std::string> FromBase64(std::string_view text);

}  // namespace engine
