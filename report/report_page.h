// The report as one HTML file: the page that the program holds, with the data in the place that waits for it.
#pragma once

#include <string>
#include <string_view>

namespace report {

// The page, as UTF-8; empty when the program has none. Points into the program's resources.
std::string_view ReportPage();

// Replaces the page's only "<!--report-data-->" by an element that holds the data: of type "application/json", so that
// no browser runs it, and without any "<", ">" and "&", so that nothing in it ends the element. Empty when the page has
// not exactly one such place. `json` is ASCII, as DataDocument makes it.
std::string EmbedData(std::string_view page, std::string_view json);

}  // namespace report
