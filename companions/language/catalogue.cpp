#include "companions/language/catalogue.h"

#include <algorithm>
#include <utility>

namespace language {

Catalogue::Catalogue(TextTable texts, const TextTable& english) : m_texts(std::move(texts)) {
  for (const auto& [key, text] : english)
    m_keys.emplace(text, key);
}

std::optional<std::wstring> Catalogue::Find(std::wstring_view keyOrEnglish) const {
  auto found = m_texts.find(keyOrEnglish);
  if (found == m_texts.end()) {
    const auto key = m_keys.find(keyOrEnglish);
    if (key != m_keys.end()) found = m_texts.find(key->second);
  }
  if (found == m_texts.end()) return std::nullopt;
  return found->second;
}

bool IsCatalogueName(std::wstring_view name) {
  constexpr size_t kLongest = 16;
  return !name.empty() && name.size() <= kLongest && std::all_of(name.begin(), name.end(), [](wchar_t c) {
    return (c >= L'a' && c <= L'z') || (c >= L'A' && c <= L'Z') || c == L'-';
  });
}

}  // namespace language
