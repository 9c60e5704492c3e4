// Rules on the text of paths; nothing here asks the system. Both separators, "\" and "/", are known.
#pragma once

#include <string_view>

#include "core/path_string.h"

// Adds a backslash to a base that is not empty and does not end in a separator, then `part` without its leading
// separators.
qx::PathString JoinPath(std::wstring_view base, std::wstring_view part);

// The text behind the last separator; separators at the end are passed over. Empty for "" and "\". Points into `path`.
std::wstring_view LastPathComponent(std::wstring_view path);

// The text before the last separator; empty without one. Points into `path`.
std::wstring_view ParentFolder(std::wstring_view path);

// Names its place without a current directory: "C:\x", or what begins with two separators. Not so "C:x" and "\x".
bool IsAbsolutePath(std::wstring_view path);

// Points into `path`.
std::wstring_view WithoutEndSeparators(std::wstring_view path);

// For an ExtendedPath: the root of a drive, a volume or a network share, with or without separators at the end.
bool IsVolumeRoot(std::wstring_view extendedPath);

// Names of files and of what else the system compares without their case.
bool EqualNames(std::wstring_view a, std::wstring_view b);

// `inner` is `outer` or lies in it, as the system compares names. Both absolute and in one form (both as ExtendedPath
// gives them, say); separators at the end do not count.
bool FolderContains(std::wstring_view outer, std::wstring_view inner);
