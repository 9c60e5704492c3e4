// The version resource of a program's file.
#include "systeminfo/utils/version_resource.h"

#include "tests/fuzz/fuzz.h"

void FuzzOne(std::string_view bytes) {
  uint64_t asked = 0;
  const std::string info = systeminfo::utils::FindFixedVersionInfo([&](uint64_t offset, size_t size, std::string& out) {
    asked += size;
    if (offset > bytes.size() || size > bytes.size() - offset) return false;
    out = bytes.substr(static_cast<size_t>(offset), size);
    return true;
  });
  PROMISE(info.empty() || info.size() == systeminfo::utils::kFixedVersionInfoSize);
  PROMISE(asked < 8 << 20);  // whatever the file claims
}
