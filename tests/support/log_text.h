// Log files as tests look at them.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "core/files.h"

// Empty when there is no such file.
inline std::string LogText(const std::wstring& path) {
  std::string text;
  ReadWholeFile(path, uint64_t{1} << 30, text);
  return text;
}

// The lines of a text, without their ends; what follows the last line end counts as a line when it is not empty.
inline std::vector<std::string> Lines(std::string_view text) {
  std::vector<std::string> lines;
  while (!text.empty()) {
    const size_t end = text.find("\r\n");
    lines.emplace_back(text.substr(0, end));
    text.remove_prefix(end == std::string_view::npos ? text.size() : end + 2);
  }
  return lines;
}

// What stands behind "[function] ", the indentation included.
inline std::string TextOf(std::string_view line) {
  const size_t end = line.find("] ");
  return end == std::string_view::npos ? std::string() : std::string(line.substr(end + 2));
}
