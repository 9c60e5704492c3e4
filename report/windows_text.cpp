#include "report/windows_text.h"

#include <algorithm>

#include "core/text.h"

namespace report {
namespace {

bool IsSeparator(char c) {
  return c == '\\' || c == '/';
}

// Behind the extension of the first program in the text; npos when there is none.
size_t EndOfProgram(std::string_view lower) {
  for (size_t i = 0; i + 4 <= lower.size(); ++i) {
    const std::string_view extension = lower.substr(i, 4);
    const bool isProgram = extension == ".exe" || extension == ".dll" || extension == ".sys";
    const size_t end = i + 4;
    if (isProgram && (end == lower.size() || lower[end] == ' ' || lower[end] == ',')) return end;
  }
  return std::string_view::npos;
}

}  // namespace

std::string LowerAscii(std::string_view text) {
  std::string lower(text);
  for (char& c : lower) {
    if (c >= 'A' && c <= 'Z') c = static_cast<char>(c - 'A' + 'a');
  }
  return lower;
}

bool ContainsNoCase(std::string_view text, std::string_view part) {
  return !part.empty() && LowerAscii(text).find(LowerAscii(part)) != std::string::npos;
}

bool LiesBelow(std::string_view folder, std::string_view path) {
  while (!folder.empty() && IsSeparator(folder.back()))
    folder.remove_suffix(1);
  if (folder.empty() || path.size() <= folder.size() + 1 || !IsSeparator(path[folder.size()])) return false;
  return LowerAscii(path.substr(0, folder.size())) == LowerAscii(folder);
}

bool LiesInTemporaryFolder(std::string_view path) {
  std::string lower = LowerAscii(FolderOf(path));
  std::replace(lower.begin(), lower.end(), '/', '\\');
  lower += '\\';
  return lower.find("\\temp\\") != std::string::npos || lower.find("\\tmp\\") != std::string::npos;
}

std::string_view FolderOf(std::string_view path) {
  const size_t separator = path.find_last_of("\\/");
  return separator == std::string_view::npos ? std::string_view() : path.substr(0, separator);
}

std::string_view FileNameOf(std::string_view path) {
  const size_t separator = path.find_last_of("\\/");
  return separator == std::string_view::npos ? path : path.substr(separator + 1);
}

std::string ProgramOf(std::string_view commandLine) {
  constexpr std::string_view kDevicePrefix = "\\??\\";
  std::string_view rest = Trimmed(commandLine);
  if (rest.starts_with('"')) {
    rest.remove_prefix(1);
    return std::string(rest.substr(0, rest.find('"')));
  }
  if (rest.starts_with(kDevicePrefix)) rest.remove_prefix(kDevicePrefix.size());
  const size_t end = EndOfProgram(LowerAscii(rest));
  return std::string(rest.substr(0, end == std::string_view::npos ? rest.find(' ') : end));
}

}  // namespace report
