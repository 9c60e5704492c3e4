// The string that holds a path: it starts with room for `Size` characters, so that joining names onto an ordinary path
// never allocates again, and grows without limit beyond.
#pragma once

#include <cstddef>
#include <string_view>

#include "core/string.h"

namespace qx {

template <size_t Size>
class PathStringT : public String {
 public:
  PathStringT() { reserve(Size); }
  PathStringT(std::wstring_view text) : PathStringT() { append(text); }
};

using PathString = PathStringT<260>;

}  // namespace qx
