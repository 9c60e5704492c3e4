// The library as the program has it: loaded at run time, by its exports only.
#pragma once

#include <gtest/gtest.h>

#include <string>

#include "core/dynamic_library.h"
#include "core/program_path.h"
#include "interfaces/log_api.h"

struct LogLibrary {
  DynamicLibrary library{(ProgramFolder() + L"\\log.dll").c_str()};

// NOLINTNEXTLINE(bugprone-macro-parentheses): the name declares a member
#define ST_EXPORT(name) decltype(&::name) name = library.Resolve<decltype(&::name)>(#name)
  ST_EXPORT(LogInit);
  ST_EXPORT(LogDeinit);
  ST_EXPORT(LogSetSettingsFile);
  ST_EXPORT(LogApplySettings);
  ST_EXPORT(LogMonitorSettings);
  ST_EXPORT(LogEnable);
  ST_EXPORT(LogSetLevel);
  ST_EXPORT(LogSetPath);
  ST_EXPORT(LogSetType);
  ST_EXPORT(LogSetMode);
  ST_EXPORT(LogSetMaxSize);
  ST_EXPORT(LogSetDepth);
  ST_EXPORT(LogGetLevel);
  ST_EXPORT(LogIsEnabled);
  ST_EXPORT(LogWrite);
  ST_EXPORT(LogTrackEvent);
  ST_EXPORT(LogTrackEventData);
  ST_EXPORT(LogUninitDeskMetrics);
  ST_EXPORT(LogRemoveModule);
#undef ST_EXPORT

  void Write(uint32_t level, const std::wstring& text, int16_t step = 0, HMODULE module = nullptr) const {
    const LogRecord record{level};
    LogWrite(step, &record, module, L"test::Function", L"%s", text.c_str());
  }
};
