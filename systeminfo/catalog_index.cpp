#include "systeminfo/catalog_index.h"

#include <algorithm>
#include <utility>

namespace {

constexpr size_t kBytesOfHexByte = 4;  // two UTF-16 characters

bool IsBefore(std::string_view left, std::string_view right) {
  // Views compare as unsigned bytes.
  return left.size() != right.size() ? left.size() < right.size() : left < right;
}

unsigned HexDigit(char character) {
  if (character >= '0' && character <= '9') return static_cast<unsigned>(character - '0');
  if (character >= 'A' && character <= 'F') return static_cast<unsigned>(character - 'A') + 10;
  if (character >= 'a' && character <= 'f') return static_cast<unsigned>(character - 'a') + 10;
  return static_cast<unsigned char>(character);
}

}  // namespace

std::optional<SubjectForm> SubjectFormOf(std::string_view algorithm) {
  if (algorithm == "1.3.6.1.4.1.311.12.1.2") return SubjectForm::kHexText;
  if (algorithm == "1.3.6.1.4.1.311.12.1.3") return SubjectForm::kBytes;
  return std::nullopt;
}

std::string SubjectHash(std::string_view identifier, SubjectForm form) {
  if (form == SubjectForm::kBytes) return std::string(identifier);
  std::string hash(identifier.size() / kBytesOfHexByte, '\0');
  for (size_t i = 0; i < hash.size(); ++i) {
    // The low byte of each of the two characters.
    const unsigned high = HexDigit(identifier[kBytesOfHexByte * i]);
    const unsigned low = HexDigit(identifier[kBytesOfHexByte * i + 2]);
    hash[i] = static_cast<char>((high << 4) | low);
  }
  return hash;
}

void CatalogHashIndex::AddCatalog(std::wstring path) {
  m_paths.push_back(std::move(path));
}

void CatalogHashIndex::AddHash(std::string_view hash) {
  if (m_paths.empty()) return;
  m_entries.push_back({m_bytes.size(), static_cast<uint32_t>(hash.size()), static_cast<uint32_t>(m_paths.size() - 1)});
  m_bytes += hash;
}

void CatalogHashIndex::Sort() {
  std::sort(m_entries.begin(), m_entries.end(),
            [this](const Entry& left, const Entry& right) { return IsBefore(HashOf(left), HashOf(right)); });
}

const std::wstring* CatalogHashIndex::Find(std::string_view hash) const {
  const auto found =
      std::lower_bound(m_entries.begin(), m_entries.end(), hash,
                       [this](const Entry& entry, std::string_view key) { return IsBefore(HashOf(entry), key); });
  if (found == m_entries.end() || HashOf(*found) != hash) return nullptr;
  return &m_paths[found->catalog];
}
