// Minidumps of other processes: what goes into one, and the call that writes it. Whoever dumps processes does it by
// these rules, each with a callback function of its own that gives its own name to the log:
//
//   BOOL CALLBACK MyMiniDumpCallback(void*, PMINIDUMP_CALLBACK_INPUT input, PMINIDUMP_CALLBACK_OUTPUT output) {
//     return utils::FilterMiniDump({L"st::monitoring::MyMiniDumpCallback", logging::Level::kInfo}, input, output);
//   }
#pragma once

#include <windows.h>

#include <dbghelp.h>

#include <cstdint>
#include <string>
#include <string_view>

#include "core/logging.h"

namespace utils {

// "<name>_<id>.dmp", made fit for a file name (SafeFileName): a process may be named by a part of its path.
std::wstring DumpFileName(std::wstring_view name, uint32_t processId);

// Data segments, handles, unloaded modules, process and thread data, private read-write memory, memory and thread
// information.
inline constexpr auto kMiniDumpType = static_cast<MINIDUMP_TYPE>(
    MiniDumpWithDataSegs | MiniDumpWithHandleData | MiniDumpWithUnloadedModules | MiniDumpWithProcessThreadData |
    MiniDumpWithPrivateReadWriteMemory | MiniDumpWithFullMemoryInfo | MiniDumpWithThreadInfo);
static_assert(kMiniDumpType == 0x1B25);

struct MiniDumpLog {
  const wchar_t* function;
  logging::Level level;  // of the lines about excluded modules
};

// The answer of a minidump callback: leaves out the data sections (else the code sections) of modules, and mapped or
// image memory that cannot be written to. Changes `output` in place.
BOOL FilterMiniDump(const MiniDumpLog& log, const MINIDUMP_CALLBACK_INPUT* input, MINIDUMP_CALLBACK_OUTPUT* output);

// What the answer to IncludeVmRegionCallback holds, at the beginning of the output record. Some headers declare it
// behind the other members of that record, where the system never looks.
struct VmRegionAnswer {
  MINIDUMP_MEMORY_INFO region;
  BOOL proceed;
};

// Writes a minidump of the process to a file that is open for reading and writing. 0, or the error code of the system,
// which may be an HRESULT; the file may hold a part of a dump then. Any thread may
// call it; dumps are written one after another.
DWORD WriteMiniDump(HANDLE process, DWORD processId, HANDLE file, MINIDUMP_CALLBACK_ROUTINE callback);

}  // namespace utils
