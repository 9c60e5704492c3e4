// A file that is written and renamed by the kernel's own functions, which, unlike the documented ones above them, never
// allocate. Names are in the kernel's form, "\??\C:\folder\file".
#pragma once

#include <windows.h>

#include <cstddef>
#include <span>
#include <string>
#include <string_view>

#include "core/scoped.h"

namespace crash {

// `extendedPath` begins with "\\?\".
std::wstring KernelPath(std::wstring extendedPath);

class KernelFile {
 public:
  // Makes an empty file, in the place of one that is there, which nobody else may open meanwhile.
  explicit KernelFile(const wchar_t* path) noexcept;

  explicit operator bool() const { return static_cast<bool>(m_file); }

  bool Write(std::span<const std::byte> bytes) noexcept;
  bool Rename(const wchar_t* path) noexcept;  // in the place of one that is there

 private:
  KernelHandle m_file;
};

// Major, minor and build number, which the documented functions hide from programs that do not state the version.
OSVERSIONINFOW SystemVersion();

}  // namespace crash
