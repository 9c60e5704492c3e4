// The directory of a written minidump.
#include "monitoring/dump_rules.h"
#include "tests/fuzz/fuzz.h"

void FuzzOne(std::string_view bytes) {
  Input input(bytes);
  const uint64_t size = input.Take<uint64_t>();
  const bool isWhole = st::monitoring::IsWholeDump(input.Rest(), size);
  PROMISE(!isWhole || input.Rest().starts_with("MDMP"));
  // Of what was there already a larger file loses nothing.
  PROMISE(!isWhole || st::monitoring::IsWholeDump(input.Rest(), UINT64_MAX));
}
