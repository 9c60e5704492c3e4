// Lets the windows of a test's thread receive their messages.
#pragma once

#include <windows.h>

#include <functional>

// Until the condition holds; false when it does not within ten seconds.
inline bool PumpUntil(const std::function<bool()>& condition) {
  for (const ULONGLONG end = GetTickCount64() + 10000; !condition();) {
    if (GetTickCount64() > end) return false;
    MSG message;
    while (PeekMessageW(&message, nullptr, 0, 0, PM_REMOVE))
      DispatchMessageW(&message);
    MsgWaitForMultipleObjects(0, nullptr, FALSE, 5, QS_ALLINPUT);
  }
  return true;
}
