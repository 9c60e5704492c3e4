// MD5 of files, one or many. Paths are UTF-8, as the collected documents have them, of any length; a digest is 32
// lower-case hexadecimal digits. A file that cannot be opened or read to its end has an empty digest and a log line: a
// digest of half a file would be a wrong fact. The file may be open elsewhere for any use.
#pragma once

#include <windows.h>

#include <atomic>
#include <cstddef>
#include <functional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace systeminfo::utils {

std::string GetFileMD5(std::string_view path);

// The digests of all files, in the order of the paths. Uses several threads inside the call, so this is the way to hash
// more than a few; pass each path once. When another thread sets `*cancel` (null: nobody will), the files that were not
// begun have empty digests.
//
// `whileOpen` is called for each file that could be opened, after it was hashed, with its index and its handle: opening
// a file costs more than what is to be read from a small part of it. It runs on any of the threads, on several at once
// for different files, and throws nothing.
using FileVisitor = std::function<void(size_t index, HANDLE file)>;
std::vector<std::string> GetFileMD5s(std::span<const std::string> paths, const std::atomic<bool>* cancel = nullptr,
                                     const FileVisitor& whileOpen = nullptr);

}  // namespace systeminfo::utils
