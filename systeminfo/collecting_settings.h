// The collection settings of one run: one JSON document with keyed access. It is loaded from a file or filled by the
// collection driver, and then read by the runner and by the collectors that take parameters. Access never fails on a
// value of an unexpected type. Not synchronised: filled before the run, only read during it.
#pragma once

#include <json/value.h>

#include <chrono>
#include <string>
#include <string_view>

namespace systeminfo {

enum class OutputFolderStatus { kFound, kAbsent, kNotString };

class CollectingSettings {
 public:
  // Replaces the document by that of the file, or, when the file cannot be opened, by that of
  // "defaultCollectSystemInfoConfig.json" in the current directory. False, with a logged error, when neither can be
  // opened, or the one that was opened is no valid settings document; the document is then as it was.
  bool LoadFromFile(const std::wstring& path);

  // Writes the whole document to the log.
  void Print() const;

  bool HasKey(std::wstring_view key) const;
  Json::Value GetValue(std::wstring_view key) const;  // null when absent
  void SetValue(std::wstring_view key, const Json::Value& value);

  // True only when the member exists and is boolean true.
  bool IsTrue(std::wstring_view key) const;

  bool GetPrettyPrint() const { return IsTrue(L"pretty_print"); }

  // How long one collector may take; 0: as long as it takes. A member that means nothing is logged, and the default
  // taken.
  std::chrono::milliseconds GetCollectorTimeout() const;

  // The member "output_folder". `out` is set only when the result is kFound.
  OutputFolderStatus GetOutputFolderValue(std::wstring& out) const;

  // The document itself, for the rules of settings_document.h. An object, or null before anything was set.
  const Json::Value& Document() const { return m_document; }

 private:
  Json::Value m_document;
};

}  // namespace systeminfo
