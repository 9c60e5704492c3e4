// The functions of the table that make, read and change values. They need no window and no page, but for invoking.
#pragma once

#include "companions/engine/script_value.h"
#include "interfaces/html_engine.h"

namespace engine {

void FillValueTable(HtmlEngineApi& api);

// Between the record of the interface and the value that it stands for.
ScriptValue ReadValue(const HtmlValue& value);
void WriteValue(const ScriptValue& from, HtmlValue& value);  // `value` is initialised; what it held is cleared
void ClearValue(HtmlValue& value) noexcept;

}  // namespace engine
