#include "gui/language.h"

#include <map>

namespace qx {
namespace {

constexpr wchar_t kDefaultPage[] = L"support_tool_en";

// The only list.
const std::map<std::wstring, std::wstring, std::less<>>& Pages() {
  static const std::map<std::wstring, std::wstring, std::less<>> s_pages{
      {L"english", kDefaultPage},
      {L"romana", L"support_tool_ro"},
  };
  return s_pages;
}

}  // namespace

std::wstring PageForLanguage(std::wstring_view language) {
  const auto found = Pages().find(language);
  return found == Pages().end() ? std::wstring(kDefaultPage) : found->second;
}

std::wstring CatalogueOfPage(std::wstring_view page) {
  return std::wstring(page.substr(page.rfind(L'_') + 1));
}

}  // namespace qx
