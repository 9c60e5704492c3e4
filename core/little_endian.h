// Numbers in bytes from outside, at any offset: never a cast of memory that may not be aligned.
#pragma once

#include <concepts>
#include <cstddef>
#include <cstdint>
#include <string_view>

// The number at `offset`. The caller has made sure that all of its bytes are there.
template <std::unsigned_integral Number>
Number ReadLittleEndian(std::string_view bytes, size_t offset) {
  uint64_t number = 0;
  for (size_t i = 0; i < sizeof(Number); ++i)
    number |= uint64_t{static_cast<uint8_t>(bytes[offset + i])} << (8 * i);
  return static_cast<Number>(number);
}
