// Tells the work of a context that it has to end. Set by one thread, looked at and waited for by others.
#pragma once

#include <windows.h>

#include "core/logging.h"
#include "core/scoped.h"

namespace qxlink {

class CancelSignal {
 public:
  CancelSignal() : m_event(CreateEventW(nullptr, TRUE, FALSE, nullptr)) {
    if (!m_event) LOG_WARNING(L"qxlink::CancelSignal", L"nothing can be cancelled, error %u", GetLastError());
  }

  void Set() { SetEvent(m_event.Get()); }
  bool IsSet() const { return Wait(0); }
  // True when it is set, false when `milliseconds` are over before.
  bool Wait(DWORD milliseconds) const { return WaitForSingleObject(m_event.Get(), milliseconds) == WAIT_OBJECT_0; }
  HANDLE Event() const { return m_event.Get(); }  // manual-reset; still this object's

 private:
  KernelHandle m_event;
};

}  // namespace qxlink
