// A message library of an event source. Its code must never run: it is loaded as data.
#include <windows.h>

BOOL WINAPI DllMain(HINSTANCE, DWORD, void*) {
  SetEnvironmentVariableW(L"ST_MESSAGE_LIBRARY_RAN", L"1");
  return TRUE;
}
