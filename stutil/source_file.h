// A file that is packed while others may read, write, rename and delete it.
#pragma once

#include <cstdint>
#include <string_view>
#include <vector>

#include "core/scoped.h"

namespace stutil {

class SourceFile {
 public:
  explicit SourceFile(std::wstring_view path);

  // Both append up to `size` bytes, fewer only where the file ends. The Windows error number of opening or reading the
  // file, or 0; nothing is appended on an error.
  //
  // Read goes on where the last one ended. ReadAt may be called by several threads at once; it costs more.
  DWORD Read(uint64_t size, std::vector<uint8_t>& bytes);
  DWORD ReadAt(uint64_t offset, uint64_t size, std::vector<uint8_t>& bytes) const;

 private:
  // `offset` null: at the file position.
  DWORD ReadFrom(const uint64_t* offset, uint64_t size, std::vector<uint8_t>& bytes) const;

  KernelHandle m_file;
  DWORD m_openError = ERROR_SUCCESS;
};

}  // namespace stutil
