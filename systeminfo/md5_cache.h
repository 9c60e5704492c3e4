// MD5 of files by path, each file hashed once however many processes share it. One thread at a time.
#pragma once

#include <atomic>
#include <span>
#include <string>
#include <unordered_map>
#include <vector>

namespace systeminfo {

class MD5Cache {
 public:
  MD5Cache() = default;
  ~MD5Cache();  // logs how often it was asked and how often it knew the answer
  MD5Cache(const MD5Cache&) = delete;
  MD5Cache& operator=(const MD5Cache&) = delete;

  // The digests of the files in the order of the paths (UTF-8), which may repeat; empty where a file cannot be read.
  // Those that are not known yet are hashed together. After `*cancel` is set the rest stays empty.
  std::vector<std::string> Get(std::span<const std::string> paths, const std::atomic<bool>* cancel);

  int CallCount() const { return m_callCount; }
  int CacheHit() const { return m_cacheHit; }

 private:
  std::unordered_map<std::string, std::string> m_digests;
  int m_callCount = 0;
  int m_cacheHit = 0;
};

}  // namespace systeminfo
