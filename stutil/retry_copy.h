// The second chance of a file that could not be packed: a copy beside it, "<path>__", is packed in its place.
#pragma once

#include <chrono>
#include <string>

#include "stutil/scoped_zip_archive.h"
#include "stutil/zip_selection.h"

namespace stutil {

class CopyRetrier {
 public:
  explicit CopyRetrier(ScopedZipArchive& archive) : m_archive(archive) {}

  // Copies the file (over an older copy), packs the copy under the file's entry name and deletes it. False, silently,
  // when either does not work. While somebody else holds the file it waits for a moment: a quarter of a second for one
  // file, two seconds for all files together.
  bool Add(const FileRecord& file);

 private:
  bool CopyPatiently(const std::wstring& source, const std::wstring& target);

  ScopedZipArchive& m_archive;
  std::chrono::milliseconds m_patience{2000};  // what is left of it
};

}  // namespace stutil
