// The program tests/children/process_child.cpp at work: what it has said of itself.
#pragma once

#include <string>
#include <utility>
#include <vector>

#include "core/program_path.h"
#include "tests/support/child_process.h"

class ProcessChild {
 public:
  ProcessChild() : m_process(L"\"" + Path() + L"\"") {
    for (std::string line = m_process.ReadLine(); line != "ready"; line = m_process.ReadLine()) {
      const size_t blank = line.find(' ');
      if (blank == std::string::npos) throw std::runtime_error("the child program has ended");
      const std::string fact = line.substr(0, blank);
      const std::string value = line.substr(blank + 1);
      if (fact == "pid") processId = std::stoul(value);
      if (fact == "closed") closedHandle = std::stoull(value);
      if (fact == "module") modules.push_back(value);
      if (fact == "handle") handles.emplace_back(std::stoull(value), value.substr(value.find(' ') + 1));
    }
  }

  static std::wstring Path() { return ProgramFolder() + L"\\process_child.exe"; }

  void Kill() { m_process.Kill(); }

  DWORD processId = 0;
  uint64_t closedHandle = 0;                              // it had this one open and closed it
  std::vector<std::pair<uint64_t, std::string>> handles;  // some of those it has open: value and type
  std::vector<std::string> modules;                       // all of its modules, UTF-8, in the order of loading

 private:
  ChildProcess m_process;
};
