// Signals the event of the name that it is given; 1 when there is none.
#include <windows.h>

#include "core/scoped.h"

int wmain(int count, wchar_t** arguments) {
  if (count != 2) return 2;
  const KernelHandle event(OpenEventW(EVENT_MODIFY_STATE, FALSE, arguments[1]));
  return event && SetEvent(event.Get()) ? 0 : 1;
}
