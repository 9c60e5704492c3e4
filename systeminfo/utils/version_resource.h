// Finds the version of a Windows program or library in the bytes of its file. The system's own functions for this map
// the file twice and search for translations, which for a folder of hundreds of files costs more than hashing them all.
// No Windows header; nothing in the file is trusted.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <string>

namespace systeminfo::utils {

// Replaces `bytes` by the `size` bytes at `offset` of the file. False when not all of them are there.
using ReadAt = std::function<bool(uint64_t offset, size_t size, std::string& bytes)>;

// The bytes of the VS_FIXEDFILEINFO of the first version resource in a PE file, whatever they say. Empty when the file
// is none, has no such resource, or ends before it. Asks for a few small pieces, in ascending order but for oddly made
// files.
std::string FindFixedVersionInfo(const ReadAt& readAt);

inline constexpr size_t kFixedVersionInfoSize = 52;

}  // namespace systeminfo::utils
