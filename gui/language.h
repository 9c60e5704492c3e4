// Which page, and which texts, belong to the language that the user chose when the product was installed.
#pragma once

#include <string>
#include <string_view>

namespace qx {

inline constexpr wchar_t kDefaultLanguage[] = L"english";

// The page for a language as the installer writes it, compared exactly; the English page for one without a page.
std::wstring PageForLanguage(std::wstring_view language);

// The name of the catalogue of texts that belongs to a page: what stands behind its last "_".
std::wstring CatalogueOfPage(std::wstring_view page);

}  // namespace qx
