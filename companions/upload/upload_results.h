// The sentences behind qxskylane_text.
#pragma once

#include <cstdint>

namespace qxlink {

const char* TextOfResult(int32_t result);  // never null, for ever valid

}  // namespace qxlink
