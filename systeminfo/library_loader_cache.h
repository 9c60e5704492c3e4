// The message libraries of event sources. A source names its library in the registry; it is loaded as data, so that no
// code of it runs, once for all records of the source, and stays loaded until the cache goes.
#pragma once

#include <windows.h>

#include <functional>
#include <map>
#include <set>
#include <string>

#include "core/scoped.h"

namespace systeminfo {

// Used by one thread.
class LibraryLoaderCache {
 public:
  LibraryLoaderCache() = default;
  ~LibraryLoaderCache();
  LibraryLoaderCache(const LibraryLoaderCache&) = delete;
  LibraryLoaderCache& operator=(const LibraryLoaderCache&) = delete;

  // The event log whose sources are looked up from now on; "Application" at first. What is loaded serves both logs.
  void SetLogName(std::wstring logName);

  // True when the source's library is loaded. A source that has none, which is logged, is not asked for again until the
  // next SetLogName.
  bool Load(const std::wstring& source);

  // Loads one library under the source's name. One whose message table cannot be trusted is refused.
  bool TryLoad(const std::wstring& source, const std::wstring& path);

  // Null when the source has no library. It is freed with the cache.
  HMODULE Find(const std::wstring& source) const;

 private:
  bool LoadFromRegistry(const std::wstring& source);

  std::wstring m_logName = L"Application";
  std::map<std::wstring, ScopedModule> m_loaded;
  std::map<std::wstring, std::wstring> m_paths;
  std::set<std::wstring> m_absent;
};

// The text of a message of the library, or, when it has none of that number, of the system. Insertion markers ("%1")
// stay in it. Empty, which is logged, when there is no such message.
std::wstring GetMessageString(HMODULE module, DWORD eventId);

}  // namespace systeminfo
