// The action "dump": a minidump of one process by its id, or of every process whose image path contains a text.
#pragma once

#include <windows.h>

#include <dbghelp.h>

#include <mutex>
#include <string>

#include "monitoring/action.h"
#include "monitoring/process_info_cache.h"

namespace st::monitoring {

class ActionDumpProcess : public Action {
 public:
  ActionDumpProcess(ActionSettings settings, const ActionContext& context);

  void Run() override;

  // Writes "<name>_<pid>.dmp" into the current directory, replacing an older one; characters of the name that a file
  // name cannot hold are replaced (utils::DumpFileName). The file stands under its name only when it is whole and the
  // limits allow it.
  void DumpProcess(HANDLE process, DWORD processId, const std::wstring& name);

 private:
  void DumpByPid(DWORD processId);
  void DumpByName(const std::wstring& name);
  bool WriteDump(HANDLE process, DWORD processId, const std::wstring& path, uint64_t& countedBytes);

  const ActionContext m_context;
  std::mutex m_running;  // two triggers may run this action at one time: the second waits
  ProcessInfoCache m_cache;
};

// The minidump callback of this action.
BOOL CALLBACK MyMiniDumpCallback(void* parameter, PMINIDUMP_CALLBACK_INPUT input, PMINIDUMP_CALLBACK_OUTPUT output);

// Writes by the program's minidump rules.
DWORD WriteProcessDump(HANDLE process, DWORD processId, HANDLE file);

}  // namespace st::monitoring
