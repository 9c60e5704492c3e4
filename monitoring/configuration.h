// Reads "monitoring.json": bytes in, plain settings and notes for the log out. Nothing here includes a Windows header.
// What a user may write into that file is decided here and nowhere else; docs/monitoring.md is the reference.
#pragma once

#include <json/value.h>

#include <cstdint>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "interfaces/log_constants.h"
#include "monitoring/limits.h"
#include "monitoring/note.h"

namespace st::monitoring {

// A longer configuration is refused unread.
inline constexpr uint64_t kLargestConfiguration = uint64_t{64} << 20;

struct CounterSettings {
  std::wstring id;
  std::wstring query;           // a PDH counter path
  uint32_t sampleInterval = 0;  // milliseconds, as written; the event queue refuses what is no period
  bool saveToFile = false;
  std::vector<std::wstring> triggerIds;
};

struct TriggerSettings {
  std::wstring id;
  int32_t triggerAfter = 0;  // matching samples
  double counterValue = 0;   // finite
  std::wstring condition;    // "<", ">", "<=", ">=" or empty
  std::vector<std::wstring> actionIds;
};

struct ActionSettings {
  std::wstring id;
  std::string type;        // "dump"
  Json::Value parameters;  // any value
};

// One element of a section. Nothing when it is not as it has to be; the notes say why.
std::optional<CounterSettings> ReadCounter(const Json::Value& element, const NoteSink& note);
std::optional<TriggerSettings> ReadTrigger(const Json::Value& element, const NoteSink& note);
std::optional<ActionSettings> ReadAction(const Json::Value& element, const NoteSink& note);

// The document, always an object: bytes that are no JSON object make an empty one, with notes that name `path`.
Json::Value ParseConfiguration(std::string_view bytes, const std::wstring& path, const NoteSink& note);

struct Section {
  const char* member;
  const wchar_t* absent;  // note, for LoadConfigurationFromFile
  const wchar_t* function;
  const wchar_t* createFailed;
  const wchar_t* duplicate;
};
inline constexpr wchar_t kLoadFunction[] = L"st::monitoring::MonitoringManager::LoadConfigurationFromFile";
inline constexpr Section kCounterSection = {"performanceCounters", L"No performance counters specified",
                                            L"st::monitoring::MonitoringManager::LoadPerformanceCounters",
                                            L"Failed to create performance counter based on json",
                                            L"found duplicate performance counter; please change its id"};
inline constexpr Section kTriggerSection = {
    "triggers", L"No triggers specified", L"st::monitoring::MonitoringManager::LoadTriggers",
    L"Failed to create trigger based on json", L"found duplicate trigger; please change its id"};
// "No triggers specified" is kept for this section too.
inline constexpr Section kActionSection = {
    "actions", L"No triggers specified", L"st::monitoring::MonitoringManager::LoadActions",
    L"Failed to create action based on json", L"found duplicate action; please change its id"};

template <class Object>
using ById = std::map<std::wstring, std::shared_ptr<Object>>;

// Fills `objects` with what `create` makes of the section's elements, in their order, up to the first bad one or the
// first whose id is taken. False when it stopped early; what was loaded before stays.
template <class Object, class Create>
bool LoadSection(const Json::Value& elements, const Section& section, const Create& create, ById<Object>& objects,
                 const NoteSink& note) {
  const auto fail = [&](const wchar_t* text) {
    note({LOG_LEVEL_TRACE, section.function, text});
    return false;
  };
  if (elements.isNull()) return true;
  if (!elements.isArray()) return fail(L"not an array");
  for (const Json::Value& element : elements) {
    const std::shared_ptr<Object> object = create(element);
    if (!object) return fail(section.createFailed);
    if (!objects.emplace(object->Id(), object).second) return fail(section.duplicate);
  }
  return true;
}

// The first id in the lists of `owners`, in the order of the owners' ids, that `targets` does not have; else null.
template <class Owner, class Target>
const std::wstring* FindMissingReference(const ById<Owner>& owners,
                                         const std::vector<std::wstring>& (Owner::*references)() const,
                                         const ById<Target>& targets) {
  for (const auto& [id, owner] : owners) {
    for (const std::wstring& reference : ((*owner).*references)()) {
      if (targets.count(reference) == 0) return &reference;
    }
  }
  return nullptr;
}

}  // namespace st::monitoring
