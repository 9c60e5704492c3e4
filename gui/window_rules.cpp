#include "gui/window_rules.h"

#include "core/paths.h"
#include "interfaces/html_engine.h"

namespace qx::gui {
namespace {

constexpr size_t kLongestName = 260;

}  // namespace

RECT CentredPlace(SIZE page, const RECT& workArea) {
  const LONG x = (workArea.right - workArea.left) / 2 - page.cx / 2;
  const LONG y = (workArea.bottom - workArea.top) / 2 - page.cy / 2;
  return {x, y, x + page.cx, y + page.cy};
}

std::optional<ResourceAddress> ParseResourceAddress(std::wstring_view address) {
  constexpr std::wstring_view kResource = L"res:";
  if (address.starts_with(kResource)) {
    address.remove_prefix(kResource.size());
    if (address.starts_with(L"//")) address.remove_prefix(2);
  } else if (!address.starts_with(L"this://app/")) {
    return std::nullopt;
  }
  const std::wstring_view name = address.substr(0, kLongestName);
  const size_t point = name.rfind(L'.');
  const std::wstring_view extension = point == std::wstring_view::npos ? std::wstring_view() : name.substr(point + 1);
  const bool isHtml = !extension.empty() && (EqualNames(extension, L"html") || EqualNames(extension, L"htm"));
  return ResourceAddress{std::wstring(name), std::wstring(extension), isHtml};
}

const wchar_t* SubsystemName(uint32_t subsystem) {
  switch (subsystem) {
    case HTML_SUBSYSTEM_DOM:
      return L"DOM";
    case HTML_SUBSYSTEM_CSS_SCRIPT:
      return L"csss!";
    case HTML_SUBSYSTEM_CSS:
      return L"css";
    case HTML_SUBSYSTEM_SCRIPT:
      return L"script";
    default:
      return L"html";
  }
}

}  // namespace qx::gui
