// What counts as a user who can be reached. No Windows header.
#pragma once

#include <string_view>

namespace qx {

// The whole text matches "[_a-z0-9-]+(\.[_a-z0-9-]+)*@[a-z0-9-]+(\.[a-z0-9-]+)*(\.[a-z]{2,4})": lower case only, and a
// last label of two to four letters, which is kept so on purpose. Written out because the library's expressions recurse
// once for every character, and a page may send any number of them.
bool IsEmailAddress(std::wstring_view text);

}  // namespace qx
