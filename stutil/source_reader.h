// Reads the files that jobs ask for. Others may read, write, rename and delete them meanwhile: what is read is what was
// there, at most as much as the file's record says.
#pragma once

#include <cstdint>
#include <span>
#include <string_view>
#include <vector>

#include "core/scoped.h"
#include "stutil/pack_plan.h"
#include "stutil/zip_selection.h"

namespace stutil {

// A file of a run, or a piece.
struct InputPart {
  DWORD error = ERROR_SUCCESS;  // of opening or reading, a Windows error number; the part has no bytes then
  size_t size = 0;              // bytes that were read: fewer than planned when the file shrank
};

struct JobInput {
  std::vector<uint8_t> bytes;  // of all parts, one behind the other
  std::vector<InputPart> parts;
};

// Belongs to one thread.
class SourceReader {
 public:
  // Replaces `input`. The pieces of a file come in order; the file is opened for the first and closed after the last
  // one, so that all of them are of the same file whatever becomes of its name. Throws when memory runs out.
  void Read(const PackJob& job, std::span<const FileRecord> files, JobInput& input);

 private:
  void Open(std::wstring_view path);
  void ReadPart(uint64_t offset, uint64_t size, JobInput& input);

  KernelHandle m_file;
  DWORD m_openError = ERROR_SUCCESS;
};

}  // namespace stutil
