// Opening a file for writing without ending up in somebody else's: whoever may write into a folder can plant a link
// under a name that is about to be written. Paths are extended (see ExtendedPath). Nothing here allocates, so that a
// crashed process may use it; the crash handler does.
#pragma once

#include <windows.h>

#include "core/scoped.h"

// Creates an empty file. What stands under the name, a link too, is deleted before, never opened. Invalid, with
// GetLastError set, when that cannot be deleted or stands there again at once. `security` may be null: the rights that
// the folder gives.
KernelHandle CreateFreshFile(const wchar_t* path, DWORD access, DWORD share, SECURITY_ATTRIBUTES* security = nullptr);

// Opens a file for writing at its end, whatever the position, and for reading; it is created when it is missing.
// Invalid, with GetLastError set, when the name is a symbolic link, or one of several names of a file.
KernelHandle OpenForAppending(const wchar_t* path, DWORD share);

// Copies a file's content to a fresh one. 0 or the system's error; nothing is left under `target` on failure.
DWORD CopyToFreshFile(const wchar_t* source, const wchar_t* target);
