#include "report/findings_output.h"

#include "core/json.h"
#include "core/text.h"
#include "report/rules.h"

namespace report {
namespace {

bool SteersTerminal(wchar_t c) {
  const bool isControl = c < 0x20 || (c >= 0x7F && c < 0xA0);
  const bool turnsDirection = (c >= 0x200E && c <= 0x200F) || (c >= 0x202A && c <= 0x202E) ||
                              (c >= 0x2066 && c <= 0x2069) || c == 0x2028 || c == 0x2029;
  return isControl || turnsDirection;
}

}  // namespace

std::string Printable(std::string_view text) {
  std::wstring wide = ToWide(text);
  for (wchar_t& c : wide) {
    if (SteersTerminal(c)) c = L'?';
  }
  return ToUtf8(wide);
}

std::string FindingsAsText(const std::vector<Finding>& findings) {
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

std::string FindingsAsJson(const std::vector<Finding>& findings) {
  Json::Value document(Json::objectValue);
  Json::Value& list = document["findings"] = Json::Value(Json::arrayValue);
  for (const Finding& finding : findings) {
    Json::Value& entry = list.append(Json::Value(Json::objectValue));
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
  }
  return WriteStyledJson(document);
}

}  // namespace report
