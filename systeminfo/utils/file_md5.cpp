#include "systeminfo/utils/file_md5.h"

#include <algorithm>
#include <cstdio>
#include <thread>

#include "core/digest.h"
#include "core/files.h"
#include "core/logging.h"
#include "core/text.h"

namespace systeminfo::utils {
namespace {

constexpr wchar_t kScope[] = L"systeminfo::utils::GetFileMD5";
constexpr size_t kBufferSize = size_t{256} << 10;  // larger ones gain nothing
constexpr size_t kMostThreads = 4;                 // the disk is the limit before more are of use

// Hashes files one after another, with one buffer and one digest for all of them.
class FileHasher {
 public:
  // `visit` (HANDLE ->) is called with the file still open.
  template <class Visit>
  std::string Hash(const std::string& path, Visit visit) {
    const KernelHandle file(CreateFileW(ExtendedPath(ToWide(path)).c_str(), GENERIC_READ,
                                        FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE, nullptr, OPEN_EXISTING,
                                        FILE_ATTRIBUTE_NORMAL | FILE_FLAG_SEQUENTIAL_SCAN, nullptr));
    if (!file) {
      // The name of the call in the text is kept; the code is the system's.
      if (const DWORD error = GetLastError(); error != ERROR_SUCCESS) {
        LOG_TRACE(kScope, L"fopen_s %s fails with %d", ToWide(path).c_str(), static_cast<int>(error));
      } else {
        std::printf("%s can't be opened.\n", path.c_str());
      }
      return {};
    }
    const bool isRead = AddAll(file.Get(), path);
    std::string digest = m_digest.Finish();
    if (!isRead) digest.clear();
    visit(file.Get());
    return digest;
  }

 private:
  bool AddAll(HANDLE file, const std::string& path) {
    for (;;) {
      DWORD count = 0;
      if (!ReadFile(file, m_buffer.data(), static_cast<DWORD>(m_buffer.size()), &count, nullptr)) {
        LOG_ERROR(kScope, L"%s cannot be read to its end, error %u", ToWide(path).c_str(), GetLastError());
        return false;
      }
      if (count == 0) return true;
      m_digest.Add(std::string_view(m_buffer.data(), count));
    }
  }

  std::vector<char> m_buffer = std::vector<char>(kBufferSize);
  Digest m_digest{BCRYPT_MD5_ALGORITHM};
};

class Batch {
 public:
  Batch(std::span<const std::string> paths, const std::atomic<bool>* cancel, const FileVisitor& whileOpen)
      : m_paths(paths), m_cancel(cancel), m_whileOpen(whileOpen), m_digests(paths.size()) {}

  std::vector<std::string> Run() {
    const size_t threads = std::min<size_t>({std::thread::hardware_concurrency(), kMostThreads, m_paths.size()});
    std::vector<std::thread> helpers;
    try {
      while (helpers.size() + 1 < threads)
        helpers.emplace_back(&Batch::Work, this);
    } catch (const std::system_error&) {
      // With fewer threads it only takes longer.
    }
    Work();
    for (std::thread& helper : helpers)
      helper.join();
    return std::move(m_digests);
  }

 private:
  void Work() noexcept {
    FileHasher hasher;
    while (m_cancel == nullptr || !m_cancel->load()) {
      const size_t index = m_next++;
      if (index >= m_paths.size()) return;
      m_digests[index] = hasher.Hash(m_paths[index], [&](HANDLE file) {
        if (m_whileOpen) m_whileOpen(index, file);
      });
    }
  }

  const std::span<const std::string> m_paths;
  const std::atomic<bool>* const m_cancel;
  const FileVisitor& m_whileOpen;
  std::atomic<size_t> m_next{0};
  std::vector<std::string> m_digests;  // each element is written by one thread only
};

}  // namespace

std::string GetFileMD5(std::string_view path) {
  return FileHasher().Hash(std::string(path), [](HANDLE) {});
}

std::vector<std::string> GetFileMD5s(std::span<const std::string> paths, const std::atomic<bool>* cancel,
                                     const FileVisitor& whileOpen) {
  return Batch(paths, cancel, whileOpen).Run();
}

}  // namespace systeminfo::utils
