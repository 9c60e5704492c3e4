// The programs and libraries of the product: path, MD5 and version of each.
#pragma once

#include <json/value.h>

#include <atomic>
#include <string>

namespace systeminfo {

// {"path", "md5", "version"} of one file; digest and version are empty when they cannot be read, which is logged.
Json::Value GetFileInformation(const std::wstring& path);

// An array of such records, one for each file below the folder whose name ends in exactly ".exe" or ".dll". Each file
// is read once, several at a time. When `*cancel` (null: nobody will) is set, the records of files that were not begun
// have neither digest nor version.
Json::Value GetProductFileInformation(const std::wstring& installFolder, const std::atomic<bool>* cancel = nullptr);

}  // namespace systeminfo
