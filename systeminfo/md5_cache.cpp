#include "systeminfo/md5_cache.h"

#include "core/logging.h"
#include "systeminfo/utils/file_md5.h"

namespace systeminfo {

MD5Cache::~MD5Cache() {
  constexpr wchar_t kScope[] = L"systeminfo::MD5Cache::~MD5Cache";
  LOG_TRACE(kScope, L"_callCount %d", m_callCount);
  LOG_TRACE(kScope, L"_cacheHit %d", m_cacheHit);
}

std::vector<std::string> MD5Cache::Get(std::span<const std::string> paths, const std::atomic<bool>* cancel) {
  std::vector<std::string> unknown;
  for (const std::string& path : paths) {
    ++m_callCount;
    if (m_digests.try_emplace(path).second) {
      unknown.push_back(path);
    } else {
      ++m_cacheHit;
    }
  }
  std::vector<std::string> digests = utils::GetFileMD5s(unknown, cancel);
  for (size_t i = 0; i < unknown.size(); ++i)
    m_digests[unknown[i]] = std::move(digests[i]);

  std::vector<std::string> all;
  all.reserve(paths.size());
  for (const std::string& path : paths)
    all.push_back(m_digests[path]);
  return all;
}

}  // namespace systeminfo
