#include "stutil/retry_copy.h"

#include <windows.h>

#include <algorithm>
#include <string>
#include <thread>

#include "core/files.h"
#include "core/own_files.h"
#include "stutil/entry_assembler.h"

namespace stutil {
namespace {

using std::chrono::milliseconds;

constexpr milliseconds kPatienceForOneFile{250};
constexpr milliseconds kPause{25};

// Deletes a copy that was made.
class ScopedCopy {
 public:
  explicit ScopedCopy(const std::wstring& path) : m_path(path) {}
  ~ScopedCopy() { DeleteFileW(m_path.c_str()); }
  ScopedCopy(const ScopedCopy&) = delete;
  ScopedCopy& operator=(const ScopedCopy&) = delete;

 private:
  const std::wstring& m_path;
};

}  // namespace

bool CopyRetrier::Add(const FileRecord& file) {
  const std::wstring copyPath = file.path + L"__";
  const std::wstring extendedCopyPath = ExtendedPath(copyPath);
  if (!CopyPatiently(ExtendedPath(file.path), extendedCopyPath)) return false;
  const ScopedCopy copy(extendedCopyPath);
  return AddFile(m_archive, {copyPath, file.entryName, file.size, file.lastWriteTime});
}

bool CopyRetrier::CopyPatiently(const std::wstring& source, const std::wstring& target) {
  milliseconds left = std::min(m_patience, kPatienceForOneFile);
  while (const DWORD error = CopyToFreshFile(source.c_str(), target.c_str())) {
    const bool isHeld = error == ERROR_SHARING_VIOLATION || error == ERROR_LOCK_VIOLATION;
    if (!isHeld || left <= milliseconds::zero()) return false;
    std::this_thread::sleep_for(kPause);
    left -= kPause;
    m_patience -= kPause;
  }
  return true;
}

}  // namespace stutil
