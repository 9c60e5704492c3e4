// Finds the logging configuration at start-up and hands it to the logging library.
#pragma once

#include <string>
#include <string_view>

namespace logging {

class LoggerConfig {
 public:
  // Takes "<program>.logger.xml" beside the program when it is there, else "Logger.xml" in the same folder, and puts it
  // to use; changes of the file are then applied while the program runs. False when there is no configuration or it
  // cannot be read: the library stays at its defaults. Works, as a check of the file, without the library too.
  //
  // The caller holds a reference from CLogDLL::Get() for as long as it wants to log: when the last one goes, the
  // library is freed and forgets its settings.
  static bool Init();
};

// The path of the program with its extension replaced by ".logger.xml".
std::wstring ProgramLoggerPath(std::wstring_view programPath);

}  // namespace logging
