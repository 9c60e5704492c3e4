// Values of the page's script, and their translation to and from the program's own. The translation is exact: numbers
// keep their value, texts every character, members their order. Whatever a page sends is bounded first.
#pragma once

#include <cstddef>
#include <stdexcept>

#include "core/value.h"
#include "interfaces/html_engine.h"

namespace qx::gui {

// Owns one value of the engine. For the window's thread only.
class EngineValue {
 public:
  explicit EngineValue(const HtmlEngineApi& engine) : m_engine(engine) { m_engine.ValueInit(&m_value); }
  EngineValue(const HtmlEngineApi& engine, const HtmlValue& original) : EngineValue(engine) {
    m_engine.ValueCopy(&m_value, &original);
  }
  ~EngineValue() { m_engine.ValueClear(&m_value); }
  EngineValue(const EngineValue&) = delete;
  EngineValue& operator=(const EngineValue&) = delete;

  const HtmlValue* Get() const { return &m_value; }
  HtmlValue* Receive() { return &m_value; }

  // Calls the script function that this is. False when it is none, or fails.
  bool Invoke(const HtmlValue& argument) const;

 private:
  const HtmlEngineApi& m_engine;
  HtmlValue m_value{};
};

// What a message may have at most. Far beyond what the pages send.
inline constexpr size_t kMostMessageLevels = 256;
inline constexpr size_t kMostMessageValues = 200'000;
inline constexpr size_t kMostMessageCharacters = 16 << 20;
inline constexpr size_t kMostObjectMembers = 4096;  // of one object: looking one up is a linear search

// A page's value cannot become one of the program's. The text is for the page.
class ConversionError : public std::runtime_error {
  using std::runtime_error::runtime_error;
};

// Undefined, functions and raw bytes become null, dates their text. Throws ConversionError beyond the limits.
Value FromEngine(const HtmlEngineApi& engine, const HtmlValue& value);

// Sets `target`, which is initialised. Throws ConversionError when the value has more than kMostMessageLevels or the
// engine refuses it.
void ToEngine(const HtmlEngineApi& engine, const Value& value, HtmlValue& target);

// A function of the page's script, as it arrives in an argument.
bool IsScriptFunction(const HtmlEngineApi& engine, const HtmlValue& value);

}  // namespace qx::gui
