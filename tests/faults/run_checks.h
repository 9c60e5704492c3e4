// What is looked at before and after each run of a walk: the process's handles, the files, and what the log says.
#pragma once

#include <cstdint>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "tests/faults/fault_table.h"

namespace faults {

// Open handles of this process.
size_t CountHandles();

// The paths of the files below a folder, relative to it.
std::set<std::wstring> FilesBelow(const std::wstring& folder);

// Why a file is not whole; empty when it is, or when its name says that it is not finished.
std::string FileProblem(const std::wstring& path);

// The log files of a folder.
class LogReader {
 public:
  explicit LogReader(std::wstring folder) : m_folder(std::move(folder)) {}

  // The records that were added since the last call: "LEVEL [function] text".
  std::vector<std::string> NewRecords();

 private:
  const std::wstring m_folder;
  std::vector<std::pair<std::wstring, uint64_t>> m_read;
};

// A record without what differs from run to run.
std::string WithoutDigits(std::string_view record);

// Whether the record tells the error: its number, decimal or hexadecimal, or its name.
bool TellsError(std::string_view record, FailsAs failsAs, uint32_t error);

}  // namespace faults
