// From the file that the user names to an archive in memory: a package is decrypted, a plain archive taken as it is.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace report {

// The program's exit codes; scripts rely on them.
enum class ExitCode { kNothingFound = 0, kFindings = 1, kBadInput = 2, kWrongKey = 3 };

enum class InputKind { kArchive, kPackage, kUnknown };

inline constexpr uint64_t kLargestInput = uint64_t{512} << 20;  // bytes of a package or archive
inline constexpr uint64_t kLargestKeyFile = uint64_t{64} << 10;

// By the first bytes alone.
InputKind KindOfInput(std::string_view bytes);

struct ArchiveInput {
  std::string archive;
  uint64_t fileSize = 0;  // of the file that was named, in bytes
};

// `keyFile` may be empty: none was named. On failure `message` says what is wrong and what to do; the code is
// kBadInput, or kWrongKey for a package that the key does not open. Else kNothingFound.
ExitCode ReadArchiveBytes(const std::wstring& inputFile, const std::wstring& keyFile, ArchiveInput& input,
                          std::string& message);

}  // namespace report
