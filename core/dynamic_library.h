// A library loaded at run time, freed by its owner's destructor. Entry points get their type from the declaration in
// interfaces/, never from a retyped signature:
//   auto* init = library.Resolve<decltype(&LogInit)>("LogInit");
#pragma once

#include "core/scoped.h"

// LoadLibraryExW without the system's "Bad Image" box for a file that is no library for this machine. Null when it
// fails; the system's last error says why.
inline ScopedModule LoadLibraryQuietly(const wchar_t* name, DWORD flags) {
  DWORD oldMode = 0;
  SetThreadErrorMode(SEM_FAILCRITICALERRORS | SEM_NOOPENFILEERRORBOX, &oldMode);
  ScopedModule module(LoadLibraryExW(name, nullptr, flags));
  const DWORD error = GetLastError();
  SetThreadErrorMode(oldMode, nullptr);
  SetLastError(error);
  return module;
}

class DynamicLibrary {
 public:
  DynamicLibrary() = default;

  // `name` is a bare file name (found in the program's and the system's folder only, see RestrictLibrarySearch) or a
  // full path. Check with operator bool; the system's last error says why it failed.
  // `flags` are those of LoadLibraryEx.
  explicit DynamicLibrary(const wchar_t* name, DWORD flags = 0) : m_module(LoadLibraryQuietly(name, flags)) {}

  explicit operator bool() const { return static_cast<bool>(m_module); }
  HMODULE Module() const { return m_module.Get(); }

  // Null when the library is not loaded or has no such export.
  template <class Function>
  Function Resolve(const char* name) const {
    if (!m_module) return nullptr;
    // By way of void*: compilers warn of casts between function types.
    return reinterpret_cast<Function>(reinterpret_cast<void*>(GetProcAddress(m_module.Get(), name)));
  }

 private:
  ScopedModule m_module;
};

// Takes the current directory and PATH out of the library search of this process. Called once, before any thread.
inline void RestrictLibrarySearch() {
  SetDefaultDllDirectories(LOAD_LIBRARY_SEARCH_APPLICATION_DIR | LOAD_LIBRARY_SEARCH_SYSTEM32 |
                           LOAD_LIBRARY_SEARCH_USER_DIRS);
}
