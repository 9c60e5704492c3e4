#include "companions/crash/dump_thread.h"

namespace crash {
namespace {

// All of it committed at once: the thread must not run out of memory when the process has.
constexpr SIZE_T kStackSize = SIZE_T{256} << 10;

constexpr DWORD kStartLimit = 20000;  // milliseconds

}  // namespace

DumpThread::DumpThread(DumpWriter& writer)
    : m_writer(writer),
      m_ready(CreateEventW(nullptr, TRUE, FALSE, nullptr)),
      m_wanted(CreateEventW(nullptr, TRUE, FALSE, nullptr)),
      m_done(CreateEventW(nullptr, TRUE, FALSE, nullptr)) {}

DumpThread::~DumpThread() {
  if (!m_thread) return;
  // The end of a thread takes the loader lock, which the caller may hold, so it cannot be asked to leave and be waited
  // for. It sits in the wait of Main, where it owns nothing, and it must not return from there to code that is gone.
  TerminateThread(m_thread.Get(), 0);
  WaitForSingleObject(m_thread.Get(), INFINITE);
}

DWORD DumpThread::Start() {
  if (!m_ready || !m_wanted || !m_done) return ERROR_NOT_ENOUGH_MEMORY;
  m_thread.Reset(CreateThread(nullptr, kStackSize, &Main, this, 0, &m_id));
  if (!m_thread) return GetLastError();
  return WaitForSingleObject(m_ready.Get(), kStartLimit) == WAIT_OBJECT_0 ? ERROR_SUCCESS : ERROR_TIMEOUT;
}

bool DumpThread::Write(const CrashedThread& crashed, DWORD limit) noexcept {
  if (!m_isWanted.exchange(true)) {
    m_crashed = crashed;
    SetEvent(m_wanted.Get());
  }
  return WaitForSingleObject(m_done.Get(), limit) == WAIT_OBJECT_0 && m_written;
}

DWORD WINAPI DumpThread::Main(void* self) {
  DumpThread& thread = *static_cast<DumpThread*>(self);
  SetEvent(thread.m_ready.Get());
  WaitForSingleObject(thread.m_wanted.Get(), INFINITE);
  thread.m_written = thread.m_writer.Write(thread.m_crashed);
  SetEvent(thread.m_done.Get());
  Sleep(INFINITE);  // whoever waits ends the process
  return 0;
}

}  // namespace crash
