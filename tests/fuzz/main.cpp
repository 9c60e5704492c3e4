#include "tests/fuzz/fuzz.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  FuzzOne(std::string_view(reinterpret_cast<const char*>(data), size));
  return 0;
}
