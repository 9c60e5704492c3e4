// Where the running program lies. Both values are fixed for the life of the process.
#pragma once

#include <string>

std::wstring ProgramPath();    // full path of the executable, up to 32,767 characters
std::wstring ProgramFolder();  // its folder, without a trailing separator
