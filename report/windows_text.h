// Paths and command lines of the customer's machine as texts: compared without regard to the case of ASCII letters,
// never looked up here. Pure functions; no Windows header.
#pragma once

#include <string>
#include <string_view>

namespace report {

std::string LowerAscii(std::string_view text);

bool ContainsNoCase(std::string_view text, std::string_view part);  // false for an empty `part`

// `path` lies in `folder`, at any depth; false when either is empty.
bool LiesBelow(std::string_view folder, std::string_view path);

// Some folder of the path is named "temp" or "tmp".
bool LiesInTemporaryFolder(std::string_view path);

// What is before the last separator, and what is behind it.
std::string_view FolderOf(std::string_view path);
std::string_view FileNameOf(std::string_view path);

// The program of a command line: what stands in quotes, or up to the first ".exe", ".dll" or ".sys" that ends a word,
// or up to the first blank. Without the prefix "\??\" of driver paths.
std::string ProgramOf(std::string_view commandLine);

}  // namespace report
