// What support_report does, apart from the process around it: arguments in, texts and an exit code out.
#pragma once

#include <string>
#include <vector>

#include "report/package_input.h"

namespace report {

struct ProgramOutput {
  std::string text;      // for the standard output
  std::string messages;  // for the standard error output
  ExitCode code = ExitCode::kNothingFound;
};

// Never throws; running out of memory is bad input too.
ProgramOutput RunProgram(const std::vector<std::wstring>& arguments);

}  // namespace report
