// Start of the crash handler, a library of its own ("qxch.dll").
#pragma once

#include "core/dynamic_library.h"

// Loads the library and switches it on. The owner keeps it loaded for as long as crashes are to be reported. Empty,
// with a logged error, when any of that fails; the program goes on without.
DynamicLibrary InitQxch();
