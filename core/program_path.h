// Where the running program, and the module that this code is linked into, lie. The values are fixed for the life of
// the process. What the system does not say is logged, and empty.
#pragma once

#include <string>

std::wstring ProgramPath();    // full path of the executable, up to 32,767 characters
std::wstring ProgramFolder();  // its folder, without a trailing separator

// The folder of the library, or program, that the caller is linked into. A run-time library finds its own files there.
std::wstring OwnModuleFolder();
