// Where the running program and its libraries lie. The program's values are fixed for the life of the process.
#pragma once

#include <string>

std::wstring ProgramPath();    // full path of the executable, up to 32,767 characters
std::wstring ProgramFolder();  // its folder, without a trailing separator

// The folder, without a trailing separator, of the program or library that a function or global object belongs to.
std::wstring ModuleFolder(const void* address);
