// One instance of the program for each user session, marked by a named event.
#pragma once

#include "core/scoped.h"

inline constexpr wchar_t kInstanceEventName[] = L"Local\\4BD8558C-BBF3-4B69-86E3-9A7E77D2EC94";

struct SingleInstance {
  KernelHandle event;  // others are refused for as long as it is open; empty when this is not the single one
  bool isSingle = false;
};

// An event that cannot be made counts as not single.
SingleInstance CheckSingleInstance(const wchar_t* eventName = kInstanceEventName);
