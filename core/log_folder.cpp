#include "core/log_folder.h"

#include <tinyxml2.h>

#include "core/paths.h"

namespace logging {
namespace {

constexpr char kPath[] = "path";

std::string Trimmed(const char* text) {
  if (text == nullptr) return {};
  const std::string_view all(text);
  const size_t first = all.find_first_not_of(" \t\r\n");
  if (first == std::string_view::npos) return {};
  return std::string(all.substr(first, all.find_last_not_of(" \t\r\n") - first + 1));
}

}  // namespace

std::string ConfiguredLogFolder(const tinyxml2::XMLElement& configuration) {
  std::string folder = Trimmed(configuration.Attribute(kPath));
  if (folder.empty()) {
    const tinyxml2::XMLElement* child = configuration.FirstChildElement(kPath);
    if (child != nullptr) folder = Trimmed(child->GetText());
  }
  return folder.empty() ? kDefaultLogFolder : folder;
}

std::wstring ResolveLogFolder(std::wstring_view folder, std::wstring_view settingsFolder) {
  if (IsAbsolutePath(folder)) return std::wstring(folder);
  return std::wstring(settingsFolder) + L"\\" + std::wstring(folder);
}

}  // namespace logging
