// "monitoring.json": its sections, its limits, the targets of its dumps, and the file names made from its texts.
#include <cmath>

#include "core/safe_file_name.h"
#include "monitoring/configuration.h"
#include "monitoring/dump_rules.h"
#include "tests/fuzz/fuzz.h"

namespace {

using namespace st::monitoring;

void CheckFileName(const std::wstring& text) {
  const std::wstring name = SafeFileName(text, L".csv");
  PROMISE(name.size() <= 255 && name.ends_with(L".csv"));
  PROMISE(name.find_first_of(L"\\/:*?\"<>|") == std::wstring::npos);
  PROMISE(std::none_of(name.begin(), name.end(), [](wchar_t c) { return c < L' '; }));
}

}  // namespace

void FuzzOne(std::string_view bytes) {
  size_t notes = 0;
  const NoteSink note = [&notes](const Note& line) {
    PROMISE(line.function != nullptr && line.level != 0);
    ++notes;
  };
  const Json::Value document = ParseConfiguration(bytes, L"monitoring.json", note);
  PROMISE(document.isObject());
  PROMISE(notes != 1);  // a failure has two

  Limits limits;
  ReadLimits(document, limits, note);
  for (const auto& member : document) {
    if (!member.isArray()) continue;
    for (const Json::Value& element : member) {
      notes = 0;
      const auto counter = ReadCounter(element, note);
      const auto trigger = ReadTrigger(element, note);
      const auto action = ReadAction(element, note);
      PROMISE(counter || trigger || action || notes > 0);
      if (counter) CheckFileName(counter->id);
      if (trigger) PROMISE(std::isfinite(trigger->counterValue) && trigger->condition.size() <= 2);
      if (action) ReadDumpTarget(action->parameters, note);
    }
  }
}
