#include "core/log_folder.h"

#include <tinyxml2.h>

#include "core/paths.h"
#include "core/text.h"

namespace logging {
namespace {

constexpr char kPath[] = "path";

}  // namespace

std::string ConfiguredLogFolder(const tinyxml2::XMLElement& configuration) {
  std::string folder(Trimmed(configuration.Attribute(kPath)));
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
