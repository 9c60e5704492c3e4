// The dump that is wanted: dbghelp's, with every thread and what the stacks point to. dbghelp needs a working heap.
#pragma once

#include <windows.h>

#include <dbghelp.h>

#include <cstdint>
#include <string>

#include "companions/crash/dump_name.h"
#include "companions/crash/dump_thread.h"

namespace crash {

class FullDump : public DumpWriter {
 public:
  // `surplus` is deleted when the dump is whole; may be empty.
  FullDump(DumpPath path, std::wstring surplus);

  bool Write(const CrashedThread& crashed) noexcept override;

  static constexpr DWORD kLimit = 20000;  // milliseconds; what takes longer is given up

 private:
  bool WriteFileOf(MINIDUMP_TYPE type, const CrashedThread& crashed) noexcept;

  DumpPath m_path;
  std::wstring m_surplus;
  uint64_t m_deadline = 0;  // of the system's tick count
};

}  // namespace crash
