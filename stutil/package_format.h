// The framing of an encrypted package: the length of the wrapped session key (8 bytes, little-endian), the wrapped
// session key, the cipher text up to the end of the file. There is no magic number, version or checksum. Pure functions
// over bytes: no Windows header.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace stutil {

inline constexpr size_t kKeyBlobLengthSize = 8;

// Views into the package that was split; they live as long as its bytes.
struct PackageParts {
  std::string_view keyBlob;
  std::string_view cipherText;
};

// Nothing when the package ends within the length, or before the end of the key blob that the length claims.
std::optional<PackageParts> SplitPackage(std::string_view package);

// The first 8 bytes of a package whose key blob has this length.
std::string PackageHeader(uint32_t keyBlobLength);

}  // namespace stutil
