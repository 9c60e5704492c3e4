// For the native build only, in place of the facade of the same name: a line is formatted, so that its format and its
// arguments are tried, and goes nowhere.
#pragma once

#include "core/format.h"

#define ST_LOG(function, ...)               \
  do {                                      \
    static_cast<void>(function);            \
    static_cast<void>(Format(__VA_ARGS__)); \
  } while (false)

#define LOG_FATAL(function, ...) ST_LOG(function, __VA_ARGS__)
#define LOG_CRITICAL(function, ...) ST_LOG(function, __VA_ARGS__)
#define LOG_ERROR(function, ...) ST_LOG(function, __VA_ARGS__)
#define LOG_WARNING(function, ...) ST_LOG(function, __VA_ARGS__)
#define LOG_INFO(function, ...) ST_LOG(function, __VA_ARGS__)
#define LOG_TRACE(function, ...) ST_LOG(function, __VA_ARGS__)
