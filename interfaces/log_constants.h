// The numbers of the logging library's C interface (interfaces/log_api.h), usable without a Windows header.
#pragma once

// Level bits. A record has one of them; a mask has any.
enum {
  LOG_LEVEL_FATAL = 1,
  LOG_LEVEL_CRITICAL = 2,
  LOG_LEVEL_ERROR = 4,
  LOG_LEVEL_WARNING = 8,
  LOG_LEVEL_INFO = 16,
  LOG_LEVEL_TRACE = 32,
  LOG_LEVEL_ALL = 63
};

// How finely the log is divided into files. A second instance of the program adds "-2" to <program>, and so on.
enum {
  LOG_DEPTH_EXE = 0,    // one file for each program:             <program>.log
  LOG_DEPTH_MODULE = 1  // one file for each module of a program: <program>.<module>.log
};

// Where lines go; bits.
enum {
  LOG_TYPE_FILE = 1,     // log files
  LOG_TYPE_DEBUGGER = 2  // OutputDebugString
};

// What the first write of a process does with a log file that is already there.
enum {
  LOG_MODE_APPEND = 0,    // goes on behind its last line
  LOG_MODE_OVERWRITE = 1  // moves it aside as if it were full, and begins anew
};
