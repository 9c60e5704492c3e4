#include "stutil/package_format.h"

namespace stutil {

std::optional<PackageParts> SplitPackage(std::string_view package) {
  if (package.size() < kKeyBlobLengthSize) return std::nullopt;
  uint64_t length = 0;
  for (size_t i = kKeyBlobLengthSize; i-- > 0;)
    length = length << 8 | static_cast<unsigned char>(package[i]);
  package.remove_prefix(kKeyBlobLengthSize);
  // Windows takes the length as 32 bits: a larger one must not get through by losing its upper half.
  if (length > package.size() || length > UINT32_MAX) return std::nullopt;
  const size_t keyBlobLength = static_cast<size_t>(length);
  return PackageParts{package.substr(0, keyBlobLength), package.substr(keyBlobLength)};
}

std::string PackageHeader(uint32_t keyBlobLength) {
  std::string header(kKeyBlobLengthSize, '\0');
  for (size_t i = 0; i < sizeof keyBlobLength; ++i)
    header[i] = static_cast<char>(keyBlobLength >> (8 * i) & 0xFF);
  return header;
}

}  // namespace stutil
