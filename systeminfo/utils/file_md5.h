// MD5 of files, one or many. Paths are UTF-8, as the collected documents have them, of any length; a digest is 32
// lower-case hexadecimal digits. A file that cannot be opened or read to its end has an empty digest and a log line: a
// digest of half a file would be a wrong fact. The file may be open elsewhere for any use.
#pragma once

#include <atomic>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace systeminfo::utils {

std::string GetFileMD5(std::string_view path);

// The digests of all files, in the order of the paths. Uses several threads inside the call, so this is the way to hash
// more than a few; pass each path once. When another thread sets `*cancel` (null: nobody will), the files that were not
// begun have empty digests.
std::vector<std::string> GetFileMD5s(std::span<const std::string> paths, const std::atomic<bool>* cancel = nullptr);

}  // namespace systeminfo::utils
