// The file behind an archive while it is written: buffered, at any offset, and unseen under its final name until
// Publish.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "core/scoped.h"

namespace stutil {

class ArchiveFile {
 public:
  // Deletes an archive that is there already and creates "<path>.partial". The Windows error number, or 0.
  DWORD Create(std::wstring_view path);

  // Closes and deletes what was not published.
  ~ArchiveFile();

  // False when the write failed, now or before: a file with a hole in it never recovers.
  bool Write(uint64_t offset, const void* bytes, size_t size);

  // Cuts the file to `size` bytes and gives it its final name. On failure there is no file.
  DWORD Publish(uint64_t size);

  bool IsOpen() const { return static_cast<bool>(m_file); }
  DWORD Error() const { return m_error; }  // of the first write that failed, else 0
  const std::wstring& PartialPath() const { return m_partialPath; }

 private:
  bool Flush();
  bool WriteThrough(uint64_t offset, const void* bytes, size_t size);
  DWORD Truncate(uint64_t size);

  std::wstring m_path;
  std::wstring m_partialPath;
  KernelHandle m_file;
  DWORD m_error = ERROR_SUCCESS;
  std::vector<char> m_buffer;  // what stands in the file from m_bufferOffset on, but was not written yet
  uint64_t m_bufferOffset = 0;
};

}  // namespace stutil
