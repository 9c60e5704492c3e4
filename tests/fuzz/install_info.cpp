// The installer's "install_info.yaml".
#include "gui/install_info.h"

#include "tests/fuzz/fuzz.h"

void FuzzOne(std::string_view bytes) {
  qx::Value value;
  std::string error;
  const bool isParsed = qx::ParseYaml(bytes, value, error);
  PROMISE(isParsed == error.empty());
  PROMISE(isParsed || value.GetType() == qx::Value::kNull);
  // Scalars are text, whatever they look like.
  PROMISE(value.GetType() != qx::Value::kNumber && value.GetType() != qx::Value::kBool);
  const std::string json = value.ToJsonText();
  PROMISE(json.ends_with('\n') && std::count(json.begin(), json.end(), '\n') == 1);
}
