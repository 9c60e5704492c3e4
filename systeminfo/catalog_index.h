// Which catalog lists the hash of a file. Filled once, sorted, then only read, by any number of threads. Also the rules
// by which a catalog's subject identifiers are hashes. Pure.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

// How a catalog writes the hashes that it lists.
enum class SubjectForm {
  kBytes,    // as they are
  kHexText,  // as UTF-16 hexadecimal digits
};

// By the object identifier of the catalog's subject algorithm; nothing when its subjects are no hashes.
std::optional<SubjectForm> SubjectFormOf(std::string_view algorithm);

// The hash in a subject identifier. A character that is no hexadecimal digit counts as its own code, and digits that do
// not fill a byte are left out; both kept.
std::string SubjectHash(std::string_view identifier, SubjectForm form);

class CatalogHashIndex {
 public:
  // The catalog that the hashes added from now on belong to.
  void AddCatalog(std::wstring path);
  void AddHash(std::string_view hash);  // ignored before the first catalog
  void Sort();                          // last, before the first Find

  // The path of a catalog that lists the hash; null when none does. Valid as long as the index.
  const std::wstring* Find(std::string_view hash) const;

  size_t Catalogs() const { return m_paths.size(); }
  size_t Hashes() const { return m_entries.size(); }

 private:
  struct Entry {
    size_t offset;  // of the hash, in m_bytes
    uint32_t length;
    uint32_t catalog;
  };

  std::string_view HashOf(const Entry& entry) const {
    return std::string_view(m_bytes).substr(entry.offset, entry.length);
  }

  std::vector<std::wstring> m_paths;
  std::vector<Entry> m_entries;  // shorter hashes first, equally long ones by their bytes
  std::string m_bytes;
};
