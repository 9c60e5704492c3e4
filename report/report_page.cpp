#include "report/report_page.h"

#include <windows.h>

#include "report/page_resource.h"

namespace report {
namespace {

constexpr std::string_view kPlace = "<!--report-data-->";

// The three characters stand in a JSON document only within texts, where an escape means the same.
void AppendEscaped(std::string& html, std::string_view json) {
  while (!json.empty()) {
    const size_t special = json.find_first_of("<>&");
    html += json.substr(0, special);
    if (special == std::string_view::npos) return;
    html += json[special] == '<' ? "\\u003c" : json[special] == '>' ? "\\u003e" : "\\u0026";
    json.remove_prefix(special + 1);
  }
}

}  // namespace

std::string_view ReportPage() {
  const HRSRC resource = FindResourceW(nullptr, MAKEINTRESOURCEW(IDR_REPORT_PAGE), RT_RCDATA);
  const HGLOBAL loaded = resource == nullptr ? nullptr : LoadResource(nullptr, resource);
  const void* const bytes = loaded == nullptr ? nullptr : LockResource(loaded);
  return bytes == nullptr ? std::string_view()
                          : std::string_view(static_cast<const char*>(bytes), SizeofResource(nullptr, resource));
}

std::string EmbedData(std::string_view page, std::string_view json) {
  const size_t place = page.find(kPlace);
  if (place == std::string_view::npos || page.find(kPlace, place + 1) != std::string_view::npos) return {};
  std::string html;
  html.reserve(page.size() + json.size() + json.size() / 8);
  html += page.substr(0, place);
  html += "<script type=\"application/json\" id=\"report-data\">";
  AppendEscaped(html, json);
  html += "</script>";
  html += page.substr(place + kPlace.size());
  return html;
}

}  // namespace report
