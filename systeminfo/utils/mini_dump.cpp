#include "systeminfo/utils/mini_dump.h"

#include <mutex>

#include "core/dynamic_library.h"
#include "core/format.h"
#include "core/lock.h"
#include "core/safe_file_name.h"

namespace utils {
namespace {

// A module that has both loses its data sections only; this asymmetry is kept.
void ExcludeSections(const MiniDumpLog& log, const wchar_t* module, ULONG& writeFlags) {
  if ((writeFlags & ModuleWriteDataSeg) != 0) {
    ST_LOG(log.level, log.function, L"Excluding module data sections: [%s]", module);
    writeFlags &= ~static_cast<ULONG>(ModuleWriteDataSeg);
  } else if ((writeFlags & ModuleWriteCodeSegs) != 0) {
    ST_LOG(log.level, log.function, L"Excluding module code sections: [%s]", module);
    writeFlags &= ~static_cast<ULONG>(ModuleWriteCodeSegs);
  }
}

void ExcludeReadOnlyRegion(VmRegionAnswer& answer) {
  MINIDUMP_MEMORY_INFO& region = answer.region;
  const bool isWritable = (region.Protect & PAGE_READWRITE) != 0;
  if (region.Type == MEM_MAPPED && !isWritable) {
    region.RegionSize = 0;
  } else if (region.Type == MEM_IMAGE && !isWritable) {
    OutputDebugStringW(Format(L"Ex2 : vm = %I64x, prot: = %d", region.BaseAddress, region.Protect).c_str());
    region.RegionSize = 0;
  }
  answer.proceed = TRUE;
}

}  // namespace

std::wstring DumpFileName(std::wstring_view name, uint32_t processId) {
  return SafeFileName(name, Format(L"_%u.dmp", processId));
}

BOOL FilterMiniDump(const MiniDumpLog& log, const MINIDUMP_CALLBACK_INPUT* input, MINIDUMP_CALLBACK_OUTPUT* output) {
  if (input == nullptr || output == nullptr) return FALSE;
  switch (input->CallbackType) {
    case ModuleCallback:
      ExcludeSections(log, input->Module.FullPath, output->ModuleWriteFlags);
      return TRUE;
    case CancelCallback:
      return FALSE;
    case IncludeVmRegionCallback:
      ExcludeReadOnlyRegion(*reinterpret_cast<VmRegionAnswer*>(output));
      return TRUE;
    default:
      return TRUE;
  }
}

DWORD WriteMiniDump(HANDLE process, DWORD processId, HANDLE file, MINIDUMP_CALLBACK_ROUTINE callback) {
  // Loaded for the first dump, so that runs without one start faster.
  static const DynamicLibrary library(L"dbghelp.dll");
  static const auto writeDump = library.Resolve<decltype(&MiniDumpWriteDump)>("MiniDumpWriteDump");
  if (writeDump == nullptr) return ERROR_PROC_NOT_FOUND;

  static SharedLock lock;  // the library serves one thread at a time
  const std::lock_guard guard(lock);
  MINIDUMP_CALLBACK_INFORMATION information{callback, nullptr};
  if (writeDump(process, processId, file, kMiniDumpType, nullptr, nullptr, &information)) return ERROR_SUCCESS;
  const DWORD error = GetLastError();
  return error == ERROR_SUCCESS ? ERROR_GEN_FAILURE : error;
}

}  // namespace utils
