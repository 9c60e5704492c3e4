// What support_report does, apart from the process around it: arguments in, texts and an exit code out.
#pragma once

#include <functional>
#include <string>
#include <string_view>
#include <vector>

#include "report/package_input.h"

namespace report {

struct ProgramOutput {
  std::string text;      // for the standard output
  std::string messages;  // for the standard error output
  ExitCode code = ExitCode::kNothingFound;
};

// Is told what is done next, in a few words.
using Progress = std::function<void(std::string_view step)>;

// Never throws; running out of memory is bad input too.
ProgramOutput RunProgram(
    const std::vector<std::wstring>& arguments, const Progress& progress = [](std::string_view) {});

}  // namespace report
