// The version of an executable or library, from its fixed version resource.
#pragma once

#include <windows.h>

#include <string>
#include <string_view>

namespace systeminfo::utils {

// "major.minor.build.revision" in decimal numbers. Empty when the file cannot be read, has no version resource or a
// damaged one, with the reason as the calling thread's last error; the caller logs.
std::string GetFileVersion(std::wstring_view path);

// The same of a file that is open for reading; where its next read would begin changes.
std::string GetFileVersion(HANDLE file);

// The rule: `fixedInfo` is the root block of a version resource as it came. Empty when it is too short or has not the
// signature of one.
std::string FixedInfoVersion(std::string_view fixedInfo);

}  // namespace systeminfo::utils
