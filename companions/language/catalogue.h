// A catalogue of texts: from a key, or from the text as the English catalogue has it, to the text in one language.
#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "core/text_table.h"

namespace language {

class Catalogue {
 public:
  // `english` may be empty: then only keys are found.
  Catalogue(TextTable texts, const TextTable& english);

  // Nothing when the language has no such text.
  std::optional<std::wstring> Find(std::wstring_view keyOrEnglish) const;

 private:
  TextTable m_texts;
  TextTable m_keys;  // from English text to key
};

// A name of a catalogue is a few letters, never a path.
bool IsCatalogueName(std::wstring_view name);

}  // namespace language
