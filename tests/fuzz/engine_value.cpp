// A page's message: from the wire into the engine's values, from those into the program's, and back.
#include "gui/engine_value.h"

#include "companions/engine/value_json.h"
#include "companions/engine/value_table.h"
#include "core/json.h"
#include "tests/fuzz/fuzz.h"

namespace {

const HtmlEngineApi& Api() {
  static const HtmlEngineApi s_api = [] {
    HtmlEngineApi api{};
    engine::FillValueTable(api);
    return api;
  }();
  return s_api;
}

}  // namespace

void FuzzOne(std::string_view bytes) {
  Json::Value wire;
  std::string error;
  if (!ParseJson(bytes, wire, error)) return;
  const engine::ScriptValue script = engine::FromWire(wire, {});
  engine::FromPlainText(engine::ToPlainText(script));
  // What went over the wire once is in its form, and keeps it.
  const std::string form = WriteCompactJson(engine::ToWire(script));
  PROMISE(WriteCompactJson(engine::ToWire(engine::FromWire(engine::ToWire(script), {}))) == form);

  const qx::gui::EngineValue held(Api());
  qx::gui::EngineValue target(Api());
  engine::WriteValue(script, *target.Receive());
  qx::Value value;
  try {
    value = qx::gui::FromEngine(Api(), *target.Get());
  } catch (const qx::gui::ConversionError&) {
    return;  // too deep, too large
  }
  qx::gui::EngineValue copy(Api());
  qx::gui::ToEngine(Api(), value, *copy.Receive());
  PROMISE(qx::gui::FromEngine(Api(), *copy.Get()).ToText() == value.ToText());
}
