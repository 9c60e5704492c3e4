// The folder of the crash dumps, made ready while the process is still sound.
#pragma once

#include <windows.h>

#include <cstdint>
#include <string>

namespace crash {

struct PreparedFolder {
  DWORD error = ERROR_SUCCESS;  // why the folder cannot be used; a Windows error number
  std::wstring surplus;         // path of the dump that is one too many once another is there; empty: there is room
};

// Makes `folder` (an ExtendedPath), readable for the current user, the administrators and the system, and those of its
// parents that are missing. Deletes what is left of dumps that were never finished and the oldest of more than `keep`
// dumps. Another process's dump that is being written stays: its writer does not share it.
PreparedFolder PrepareFolder(const std::wstring& folder, uint32_t keep);

}  // namespace crash
