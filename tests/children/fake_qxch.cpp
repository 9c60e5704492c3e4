// A crash handler that installs nothing. The environment variable ST_FAKE_QXCH_RESULT is what it answers; arguments
// that are not zero are answered with 99.
#define ST_CRASH_HANDLER_EXPORTS
#include <cstdlib>

#include "interfaces/crash_handler_api.h"

int32_t EnableCrashHandler(uint32_t reserved, const void* reservedOptions, void* reservedContext) {
  if (reserved != 0 || reservedOptions != nullptr || reservedContext != nullptr) return 99;
  const char* result = std::getenv("ST_FAKE_QXCH_RESULT");
  return result == nullptr ? 0 : std::atoi(result);
}
