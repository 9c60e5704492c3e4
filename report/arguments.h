// The command line of support_report. Pure functions.
#pragma once

#include <string>
#include <vector>

namespace report {

struct Arguments {
  std::wstring input;
  std::wstring keyFile;        // empty: none
  std::wstring extractFolder;  // empty: nothing is unpacked
  std::wstring other;          // a collection to compare with; empty: none
  std::wstring reportFile;     // empty: no HTML report is written
  bool asJson = false;
  bool showHelp = false;
  bool showVersion = false;

  bool operator==(const Arguments&) const = default;
};

// Without the program's name. Empty when they are understood, else what is wrong with them. "--" ends the options.
std::string ParseArguments(const std::vector<std::wstring>& elements, Arguments& arguments);

std::string HelpText();

}  // namespace report
