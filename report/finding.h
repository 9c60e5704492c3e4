// What a rule finds in a collection, and where. Plain data; everything is UTF-8. Text that comes from the package is as
// it stands there: who shows it to people takes out what would steer their terminal.
#pragma once

#include <cstddef>
#include <string>
#include <utility>
#include <vector>

namespace report {

enum class Severity { kInfo, kWarning, kError };

struct Evidence {
  std::string file;  // in the package
  std::string path;  // within the file, "processes[3].signed" say; empty for the file itself
  std::string text;

  bool operator==(const Evidence&) const = default;
};

// Keeps the first ones and counts the rest: a hostile or broken document must not drown the other findings.
class EvidenceList {
 public:
  static constexpr size_t kMost = 20;

  void Add(std::string file, std::string path, std::string text) {
    ++m_count;
    if (m_kept.size() < kMost) m_kept.push_back({std::move(file), std::move(path), std::move(text)});
  }
  const std::vector<Evidence>& Kept() const { return m_kept; }
  size_t Count() const { return m_count; }  // with those that were not kept

 private:
  std::vector<Evidence> m_kept;
  size_t m_count = 0;
};

struct Rule;

struct Finding {
  const Rule* rule = nullptr;
  EvidenceList evidence;
};

}  // namespace report
