// The dump of last resort, for a process whose heap is spoilt or whose heap's lock is held: the system, the exception,
// the crashed thread with its stack, the modules. It needs neither the heap nor the loader nor dbghelp; all memory is
// its own and prepared, and files are named the way that the system needs no memory for.
#pragma once

#include <windows.h>

#include <dbghelp.h>

#include <cstddef>
#include <cstdint>
#include <span>

#include "companions/crash/dump_name.h"
#include "companions/crash/dump_thread.h"

namespace crash {

class PlainDump : public DumpWriter {
 public:
  // The folder of `path` in the kernel's own form: "\??\C:\dumps".
  explicit PlainDump(DumpPath path);

  bool Write(const CrashedThread& crashed) noexcept override;

 private:
  // Everything of the file but the stack is laid out here; modules that do not fit are left out.
  static constexpr size_t kSpace = size_t{512} << 10;
  static constexpr size_t kMostModules = 512;

  template <class T>
  T* Add(size_t count = 1) noexcept;  // zeroes at the end of what is laid out; null: no room
  RVA OffsetOf(const void* placed) const noexcept;
  MINIDUMP_LOCATION_DESCRIPTOR LocationOf(const void* placed, size_t size) const noexcept;
  RVA AddString(std::span<const wchar_t> text) noexcept;  // 0: no room

  std::span<const std::byte> LayOut(const CrashedThread& crashed) noexcept;  // returns the stack, which goes behind it
  void AddSystem(MINIDUMP_DIRECTORY& entry) noexcept;
  void AddException(MINIDUMP_DIRECTORY& entry, const CrashedThread& crashed) noexcept;
  void AddModules(MINIDUMP_DIRECTORY& entry) noexcept;
  bool AddModule(MINIDUMP_MODULE& module, const std::byte* image) noexcept;

  DumpPath m_path;
  SYSTEM_INFO m_system{};
  OSVERSIONINFOW m_version{};
  size_t m_used = 0;
  std::byte m_space[kSpace];
};

}  // namespace crash
