// The block of memory, shared by name with the running components of the product, through which they learn how much to
// log. It is theirs: this program only rewrites the levels of the components that have registered.
#pragma once

#include <cstdint>
#include <functional>
#include <string>

namespace stutil {

inline constexpr wchar_t kControlBlockName[] = L"QX_CST_DBG_INFO_CTRL";

// As it lies in memory, little-endian. Another program may write at any time, and may write anything.
struct ControlBlock {
  static constexpr uint32_t kMostComponents = 256;

  struct Component {
    uint32_t level;
    char name[36];  // zero-terminated, unless it fills the field
  };

  uint32_t componentCount;
  uint32_t reserved[2];
  Component components[kMostComponents];
};
static_assert(sizeof(ControlBlock) == 10252);

// Sets each registered component's level to what `choose` answers for its index, name and present level. A block that
// is not there is created, empty. False when the block cannot be opened.
using LevelChoice = std::function<uint32_t(size_t index, const std::string& name, uint32_t level)>;
bool ChangeControlBlock(const LevelChoice& choose);

}  // namespace stutil
