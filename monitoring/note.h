// What the readers of the configuration have to say to the log. They include no Windows header, so they hand their
// lines to a sink; in the program that sink is LogNote.
#pragma once

#include <cstdint>
#include <functional>
#include <string>

namespace st::monitoring {

struct Note {
  uint32_t level;           // LOG_LEVEL_... of interfaces/log_constants.h
  const wchar_t* function;  // a literal: the line's origin
  std::wstring text;
};

using NoteSink = std::function<void(const Note&)>;

void LogNote(const Note& note);

}  // namespace st::monitoring
