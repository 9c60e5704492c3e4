// What is walked: pieces of work of the program, each repeatable within one process. The current directory is the
// folder of the walk; tests/e2e/fault_table_test.py stages it.
#pragma once

#include <functional>
#include <string>
#include <vector>

namespace faults {

struct Scenario {
  std::string name;
  std::function<void()> prepare;  // before each run; nothing fails there
  std::function<int()> run;
  int good = 0;                 // the result of a run in which nothing fails
  std::vector<int> documented;  // all results that a run may have
  std::string clears;           // what runs leave: names in the current directory, separated by blanks
};

// All of them. The two uploads differ in where qxlink.json sends to.
std::vector<Scenario> AllScenarios();

}  // namespace faults
