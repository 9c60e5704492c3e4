#include "companions/engine/page_document.h"

#include <algorithm>

#include "core/ascii.h"

namespace engine {
namespace {

// The first place behind `at` that is neither space nor a comment.
size_t SkipSpaceAndComments(std::string_view html, size_t at) {
  for (;;) {
    at = std::min(html.find_first_not_of(" \t\r\n\f", at), html.size());
    if (!html.substr(at).starts_with("<!--")) return at;
    const size_t end = html.find("-->", at + 4);
    if (end == std::string_view::npos) return at;
    at = end + 3;
  }
}

}  // namespace

std::string WithLeadingScript(std::string_view html, std::string_view script) {
  static constexpr std::string_view kByteOrderMark = "\xEF\xBB\xBF";
  const size_t start = html.starts_with(kByteOrderMark) ? kByteOrderMark.size() : 0;
  size_t place = start;
  const size_t type = SkipSpaceAndComments(html, start);
  if (StartsWithIgnoringCase(html.substr(type), "<!doctype")) {
    const size_t end = html.find('>', type);
    if (end != std::string_view::npos) place = end + 1;
  }
  std::string document(html.substr(0, place));
  document += "<script>";
  document += script;
  document += "</script>";
  document += html.substr(place);
  return document;
}

}  // namespace engine
