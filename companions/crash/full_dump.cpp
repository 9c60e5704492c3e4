#include "companions/crash/full_dump.h"

#include <utility>

#include "core/own_files.h"
#include "core/scoped.h"

namespace crash {
namespace {

// More than the plain type: what the stacks point to, and what was loaded and running.
constexpr MINIDUMP_TYPE kFullType =
    static_cast<MINIDUMP_TYPE>(MiniDumpWithIndirectlyReferencedMemory | MiniDumpWithProcessThreadData |
                               MiniDumpWithThreadInfo | MiniDumpWithUnloadedModules);

// Everything is wanted, but not for ever. The thread that waits for the dump cannot see to that: it is suspended.
BOOL CALLBACK OnProgress(void* deadline, const PMINIDUMP_CALLBACK_INPUT input, PMINIDUMP_CALLBACK_OUTPUT output) {
  switch (input->CallbackType) {
    case ModuleCallback:
    case ThreadCallback:
    case ThreadExCallback:
    case IncludeThreadCallback:
    case IncludeModuleCallback:
      return TRUE;
    case CancelCallback:
      output->CheckCancel = TRUE;
      output->Cancel = GetTickCount64() > *static_cast<const uint64_t*>(deadline);
      return TRUE;
    default:
      return FALSE;  // as without a callback
  }
}

}  // namespace

FullDump::FullDump(DumpPath path, std::wstring surplus) : m_path(std::move(path)), m_surplus(std::move(surplus)) {}

bool FullDump::Write(const CrashedThread& crashed) noexcept {
  m_deadline = GetTickCount64() + kLimit;
  m_path.SetTime(UtcNow());
  // An older system does not know every type, and a process short of memory may only manage the plain one.
  const bool written = WriteFileOf(kFullType, crashed) || WriteFileOf(MiniDumpNormal, crashed);
  if (!written || !MoveFileExW(m_path.PartialPath(), m_path.Path(), MOVEFILE_REPLACE_EXISTING)) {
    DeleteFileW(m_path.PartialPath());
    return false;
  }
  if (!m_surplus.empty()) DeleteFileW(m_surplus.c_str());
  return true;
}

bool FullDump::WriteFileOf(MINIDUMP_TYPE type, const CrashedThread& crashed) noexcept {
  const KernelHandle file = CreateFreshFile(m_path.PartialPath(), GENERIC_READ | GENERIC_WRITE, 0);
  if (!file) return false;
  MINIDUMP_EXCEPTION_INFORMATION exception{crashed.id, crashed.exception, FALSE};
  MINIDUMP_CALLBACK_INFORMATION progress{&OnProgress, &m_deadline};
  return MiniDumpWriteDump(GetCurrentProcess(), GetCurrentProcessId(), file.Get(), type, &exception, nullptr,
                           &progress) != FALSE &&
         FlushFileBuffers(file.Get()) != FALSE;
}

}  // namespace crash
