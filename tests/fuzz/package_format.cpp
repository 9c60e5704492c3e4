// The frame of an encrypted package.
#include "stutil/package_format.h"

#include "tests/fuzz/fuzz.h"

void FuzzOne(std::string_view bytes) {
  const auto parts = stutil::SplitPackage(bytes);
  if (!parts) return;
  PROMISE(parts->keyBlob.size() <= UINT32_MAX);
  const std::string header = stutil::PackageHeader(static_cast<uint32_t>(parts->keyBlob.size()));
  PROMISE(header + std::string(parts->keyBlob) + std::string(parts->cipherText) == bytes);
}
