#include <cstdarg>
#include <cstdio>

#include "core/format.h"
#include "core/text.h"
#include "interfaces/log_api.h"

// Lines go to the standard output.
void LogWrite(int16_t step, const LogRecord* record, HMODULE, const wchar_t* function, const wchar_t* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  std::printf("%d %u %s: %s\n", step, static_cast<unsigned>(record->level), ToUtf8(function).c_str(),
              ToUtf8(FormatV(format, arguments)).c_str());
  va_end(arguments);
}
