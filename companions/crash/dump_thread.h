// A thread that writes the dump of a process. It is started while the process is sound, so that a thread that crashed,
// perhaps with no stack left, only has to wake it and wait.
#pragma once

#include <windows.h>

#include <atomic>

#include "companions/crash/dump_name.h"
#include "core/scoped.h"

namespace crash {

struct CrashedThread {
  DWORD id = 0;
  EXCEPTION_POINTERS* exception = nullptr;
};

inline DumpTime UtcNow() noexcept {
  SYSTEMTIME now;
  GetSystemTime(&now);
  return {now.wYear, now.wMonth, now.wDay, now.wHour, now.wMinute, now.wSecond};
}

// One way of writing a dump. It is made while the process is sound; Write then leaves one whole dump, or none and
// false.
class DumpWriter {
 public:
  virtual ~DumpWriter() = default;
  virtual bool Write(const CrashedThread& crashed) noexcept = 0;
};

class DumpThread {
 public:
  explicit DumpThread(DumpWriter& writer);  // which outlives the thread

  // Stops the thread, also under the loader lock. Not while a dump is being written.
  ~DumpThread();
  DumpThread(const DumpThread&) = delete;
  DumpThread& operator=(const DumpThread&) = delete;

  DWORD Start();  // 0 or a Windows error number

  // Has the dump written and returns when it is whole, has failed or takes longer than `limit` milliseconds. There is
  // one dump: who calls later waits for it. Allocates nothing and needs little stack. False: there is no dump.
  bool Write(const CrashedThread& crashed, DWORD limit) noexcept;

  DWORD Id() const { return m_id; }

 private:
  static DWORD WINAPI Main(void* self);

  DumpWriter& m_writer;
  KernelHandle m_ready;
  KernelHandle m_wanted;
  KernelHandle m_done;
  KernelHandle m_thread;
  DWORD m_id = 0;
  std::atomic<bool> m_isWanted{false};
  CrashedThread m_crashed;  // handed over by m_wanted
  bool m_written = false;   // handed over by m_done
};

}  // namespace crash
