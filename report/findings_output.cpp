#include "report/findings_output.h"

#include "core/json.h"
#include "core/text.h"
#include "report/rules.h"

namespace report {
namespace {

constexpr size_t kLongestLine = 1024;  // bytes of what is shown of a change

bool SteersTerminal(wchar_t c) {
  const bool isControl = c < 0x20 || (c >= 0x7F && c < 0xA0);
  const bool turnsDirection = (c >= 0x200E && c <= 0x200F) || (c >= 0x202A && c <= 0x202E) ||
                              (c >= 0x2066 && c <= 0x2069) || c == 0x2028 || c == 0x2029;
  return isControl || turnsDirection;
}

std::string ChangeLine(const Change& change) {
  const std::string of = change.table + ": " + change.item;
  const bool isChanged = change.kind == ChangeKind::kChanged;
  const std::string& state = change.kind == ChangeKind::kRemoved ? change.before : change.after;
  const std::string what = isChanged       ? ", " + change.field + ": " + change.before + " -> " + change.after
                           : state.empty() ? ""
                                           : ", " + state;
  return Shortened(of + what, kLongestLine);
}

std::string ComparisonAsText(const Comparison& comparison) {
  std::string text;
  for (const std::string& warning : comparison.warnings)
    text += "warning: " + Printable(warning) + "\n";
  text += "The other collection is " + std::string(comparison.isOtherOlder ? "older" : "newer") +
          (comparison.otherTime.empty() ? "" : ", of " + Printable(comparison.otherTime)) + ".\n";
  for (const Change& change : comparison.changes)
    text += "  - " + std::string(ChangeKindName(change.kind)) + ": " + Printable(ChangeLine(change)) + "\n";
  const size_t more = comparison.count - comparison.changes.size();
  if (more > 0) text += "  - and " + std::to_string(more) + " more\n";
  for (const LabelledText& part : comparison.notCompared)
    text += "Not compared: " + Printable(part.label + ", " + part.text) + "\n";
  return text + "\nChanges: " + std::to_string(comparison.count) + "\n";
}

Json::Value ComparisonAsJson(const Comparison& comparison) {
  Json::Value member(Json::objectValue);
  member["otherIsOlder"] = comparison.isOtherOlder;
  member["otherTime"] = comparison.otherTime;
  member["count"] = Json::UInt64{comparison.count};
  for (const char* name : {"warnings", "changes", "notCompared"})
    member[name] = Json::Value(Json::arrayValue);
  for (const std::string& warning : comparison.warnings)
    member["warnings"].append(ToUtf8(ToWide(warning)));
  for (const Change& change : comparison.changes) {
    Json::Value& entry = member["changes"].append(Json::Value(Json::objectValue));
    entry["kind"] = ChangeKindName(change.kind);
    entry["table"] = change.table;
    entry["item"] = ToUtf8(ToWide(change.item));
    entry["field"] = change.field;
    entry["before"] = ToUtf8(ToWide(change.before));
    entry["after"] = ToUtf8(ToWide(change.after));
  }
  for (const LabelledText& part : comparison.notCompared) {
    Json::Value& entry = member["notCompared"].append(Json::Value(Json::objectValue));
    entry["table"] = part.label;
    entry["why"] = part.text;
  }
  return member;
}

std::string FindingListAsText(const std::vector<Finding>& findings) {
  if (findings.empty()) return "Nothing found.\n";
  std::string text;
  for (const Finding& finding : findings) {
    text += std::string(SeverityName(finding.rule->severity)) + ": " + finding.rule->title + " [" + finding.rule->id +
            "]\n  " + finding.rule->explanation + "\n";
    for (const Evidence& evidence : finding.evidence.Kept()) {
      const std::string place = evidence.path.empty() ? "" : " " + evidence.path;
      text += "  - " + Printable(evidence.file + place + ": " + evidence.text) + "\n";
    }
    const size_t more = finding.evidence.Count() - finding.evidence.Kept().size();
    if (more > 0) text += "  - and " + std::to_string(more) + " more\n";
    text += "\n";
  }
  return text + "Findings: " + std::to_string(findings.size()) + "\n";
}

}  // namespace

std::string Printable(std::string_view text) {
  std::wstring wide = ToWide(text);
  for (wchar_t& c : wide) {
    if (SteersTerminal(c)) c = L'?';
  }
  return ToUtf8(wide);
}

std::string FindingsAsText(const std::vector<Finding>& findings, const Comparison* comparison) {
  return FindingListAsText(findings) + (comparison == nullptr ? "" : "\n" + ComparisonAsText(*comparison));
}

Json::Value FindingAsJson(const Finding& finding) {
  Json::Value entry(Json::objectValue);
  entry["id"] = finding.rule->id;
  entry["severity"] = SeverityName(finding.rule->severity);
  entry["title"] = finding.rule->title;
  entry["explanation"] = finding.rule->explanation;
  entry["count"] = Json::UInt64{finding.evidence.Count()};
  Json::Value& shown = entry["evidence"] = Json::Value(Json::arrayValue);
  for (const Evidence& evidence : finding.evidence.Kept()) {
    Json::Value& item = shown.append(Json::Value(Json::objectValue));
    item["file"] = ToUtf8(ToWide(evidence.file));
    item["path"] = ToUtf8(ToWide(evidence.path));
    item["text"] = ToUtf8(ToWide(evidence.text));
  }
  return entry;
}

std::string FindingsAsJson(const std::vector<Finding>& findings, const Comparison* comparison) {
  Json::Value document(Json::objectValue);
  Json::Value& list = document["findings"] = Json::Value(Json::arrayValue);
  for (const Finding& finding : findings)
    list.append(FindingAsJson(finding));
  if (comparison != nullptr) document["comparison"] = ComparisonAsJson(*comparison);
  return WriteStyledJson(document);
}

}  // namespace report
