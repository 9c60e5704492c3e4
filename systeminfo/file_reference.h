// Finds files by what NTFS calls them itself: a volume's serial number and a file reference number.
#pragma once

#include <cstdint>
#include <map>
#include <optional>
#include <string>

#include "core/scoped.h"

namespace systeminfo {

// Holds the root folder of each volume that was asked for, until it is destroyed. Used by one thread.
class FileReferences {
 public:
  // The full path that the file has now, without prefix. None when no fixed or removable drive has that serial number
  // (logged once for each number), or the volume has no such file, or may not be asked for it.
  std::optional<std::wstring> PathOf(uint32_t volumeSerialNumber, uint64_t fileReferenceNumber);

 private:
  // The root of the volume; invalid when there is none.
  const KernelHandle& RootOf(uint32_t volumeSerialNumber);

  std::map<uint32_t, KernelHandle> m_roots;
};

}  // namespace systeminfo
