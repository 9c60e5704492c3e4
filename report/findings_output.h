// Findings as text for people and as JSON for scripts. UTF-8.
#pragma once

#include <json/value.h>

#include <string>
#include <string_view>
#include <vector>

#include "report/comparison/comparison.h"
#include "report/finding.h"

namespace report {

// One line of text that a terminal shows as it is: control characters, also those of the upper range, and those that
// turn the direction of writing, become "?". What is no UTF-8 becomes U+FFFD.
std::string Printable(std::string_view text);

// Without a comparison, null, nothing is said of one.
std::string FindingsAsText(const std::vector<Finding>& findings, const Comparison* comparison = nullptr);

// {"id", "severity", "title", "explanation", "count", "evidence": [{"file", "path", "text"}]}; "count" is that of all
// evidence, of which the first 20 are shown.
Json::Value FindingAsJson(const Finding& finding);

// {"findings": [as above]}, and with a comparison {"findings", "comparison": {"otherIsOlder", "otherTime", "warnings":
// [text], "count", "changes": [{"kind", "table", "item", "field", "before", "after"}], "notCompared": [{"table",
// "why"}]}}.
std::string FindingsAsJson(const std::vector<Finding>& findings, const Comparison* comparison = nullptr);

}  // namespace report
