// Minidumps as tests look at them: a whole dump in memory, read by the system's own reader.
#pragma once

#include <windows.h>

#include <dbghelp.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "core/paths.h"

inline bool HasStream(std::string& dump, ULONG kind) {
  MINIDUMP_DIRECTORY* directory = nullptr;
  void* stream = nullptr;
  ULONG size = 0;
  return MiniDumpReadDumpStream(dump.data(), kind, &directory, &stream, &size) != FALSE;
}

// Null, and a failure of the test, when there is no such stream.
template <class Stream>
const Stream* FindStream(std::string& dump, ULONG kind) {
  MINIDUMP_DIRECTORY* directory = nullptr;
  void* stream = nullptr;
  ULONG size = 0;
  const bool found = !dump.empty() && MiniDumpReadDumpStream(dump.data(), kind, &directory, &stream, &size);
  EXPECT_TRUE(found && size >= sizeof(Stream)) << "stream " << kind;
  return found ? static_cast<const Stream*>(stream) : nullptr;
}

// File names without their folders.
inline std::vector<std::wstring> ModuleNames(std::string& dump) {
  std::vector<std::wstring> names;
  const auto* const modules = FindStream<MINIDUMP_MODULE_LIST>(dump, ModuleListStream);
  for (ULONG i = 0; modules != nullptr && i < modules->NumberOfModules; ++i) {
    const auto* const text = reinterpret_cast<const MINIDUMP_STRING*>(dump.data() + modules->Modules[i].ModuleNameRva);
    names.emplace_back(LastPathComponent(std::wstring(text->Buffer, text->Length / sizeof(wchar_t))));
  }
  return names;
}
