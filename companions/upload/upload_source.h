// Where the bytes of an upload come from: a file, or memory.
#pragma once

#include <windows.h>

#include <cstdint>
#include <span>
#include <string>
#include <string_view>

#include "core/scoped.h"

namespace qxlink {

class UploadSource {
 public:
  virtual ~UploadSource() = default;
  virtual uint64_t Size() const = 0;
  // Fills the buffer from `offset` on, as far as there are bytes; `count` 0 is the end. A Windows error number.
  virtual DWORD ReadAt(uint64_t offset, std::span<char> buffer, size_t& count) = 0;
};

class FileSource : public UploadSource {
 public:
  // Nobody can write to the file while it is open.
  DWORD Open(const std::wstring& path);
  // Nobody else can even read it, and Delete works.
  DWORD OpenForMe(const std::wstring& path);
  // Deletes the file as soon as this object goes.
  DWORD Delete();

  uint64_t Size() const override { return m_size; }
  DWORD ReadAt(uint64_t offset, std::span<char> buffer, size_t& count) override;

 private:
  DWORD Open(const std::wstring& path, DWORD access, DWORD share);

  KernelHandle m_file;
  uint64_t m_size = 0;
};

class MemorySource : public UploadSource {
 public:
  explicit MemorySource(std::string_view bytes) : m_bytes(bytes) {}

  uint64_t Size() const override { return m_bytes.size(); }
  DWORD ReadAt(uint64_t offset, std::span<char> buffer, size_t& count) override;

 private:
  const std::string_view m_bytes;
};

}  // namespace qxlink
