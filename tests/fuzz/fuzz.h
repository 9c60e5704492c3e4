// What every fuzz target is made of. A target defines FuzzOne and checks, beyond that nothing crashes, what its parser
// promises; docs/security.md says how one is added.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <string_view>
#include <vector>

// Called for each input, on one thread. The bytes end where the memory ends.
void FuzzOne(std::string_view bytes);

// A promise that is broken ends the program, which the fuzzer takes for a crash and keeps the input.
#define PROMISE(condition)                                                         \
  do {                                                                             \
    if (!(condition)) {                                                            \
      std::fprintf(stderr, "%s:%d: broken: %s\n", __FILE__, __LINE__, #condition); \
      std::abort();                                                                \
    }                                                                              \
  } while (false)

// Takes parameters of a call off the front of an input; an input that is too short has zeros.
class Input {
 public:
  explicit Input(std::string_view bytes) : m_bytes(bytes) {}

  template <class Number>
  Number Take() {
    uint64_t number = 0;
    for (size_t i = 0; i < sizeof(Number) && !m_bytes.empty(); ++i) {
      number |= uint64_t{static_cast<uint8_t>(m_bytes.front())} << (8 * i);
      m_bytes.remove_prefix(1);
    }
    return static_cast<Number>(number);
  }
  // Up to the next line feed, which is dropped, or to the end.
  std::string_view TakeLine() {
    const std::string_view line = m_bytes.substr(0, m_bytes.find('\n'));
    m_bytes.remove_prefix(std::min(line.size() + 1, m_bytes.size()));
    return line;
  }
  std::string_view Rest() const { return m_bytes; }
  bool IsEmpty() const { return m_bytes.empty(); }

 private:
  std::string_view m_bytes;
};
