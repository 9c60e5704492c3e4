// The collector "process_dumps": a minidump of each process that the settings name, by a piece of its image path or by
// its id. It has no data; its result are the files "<name>_<id>.dmp" in the output folder of the run, from where they
// go into the package like everything else there.
#pragma once

#include <windows.h>

#include <dbghelp.h>

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "systeminfo/collector.h"
#include "systeminfo/process_snapshot.h"

namespace systeminfo {

class ProcessDumpCollector : public ICollector {
 public:
  // Takes the snapshot of the running processes in which every target is looked for.
  explicit ProcessDumpCollector(std::wstring name);

  // Dumps the targets in their order until it is cancelled. Without an output folder in the settings the files lie in
  // the current directory.
  void Start(const std::shared_ptr<CollectingSettings>& settings, const std::shared_ptr<WMIWrapper>& wmi,
             const std::atomic<bool>* cancel) override;

 private:
  void DumpTarget(const Json::Value& target, const std::atomic<bool>* cancel) const;
  void DumpProcess(uint32_t processId) const;
  // The file gets its name when it is whole; what there is of a dump that failed stays with ".partial" behind its name.
  void DumpProcess(const std::wstring& name, HANDLE process, uint32_t processId) const;

  ProcessInfoCache m_processes;
  std::wstring m_folder;  // of the dump files; empty: the current directory
};

// A number, or a boolean as 0 or 1, that is an id; the fraction of a number does not count. Empty for anything else.
std::optional<uint32_t> DumpTargetId(const Json::Value& value);

// For MiniDumpWriteDump; see utils::FilterMiniDump.
BOOL CALLBACK MyMiniDumpCallback(void* param, PMINIDUMP_CALLBACK_INPUT input, PMINIDUMP_CALLBACK_OUTPUT output);

}  // namespace systeminfo
