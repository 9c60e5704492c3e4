// The program's own values: made from JSON text, changed, and made into text.
#include "core/json.h"
#include "core/text.h"
#include "core/value.h"
#include "tests/fuzz/fuzz.h"

namespace {

// Whoever asks for what a value is not gets an exception, and nothing else happens.
template <class Call>
void Try(Call call) {
  try {
    call();
  } catch (const qx::ValueException& exception) {
    PROMISE(std::string_view(exception.what()).starts_with("exception: "));
  }
}

}  // namespace

void FuzzOne(std::string_view bytes) {
  Json::Value json;
  std::string error;
  if (!ParseJson(bytes, json, error)) return;
  qx::Value value = qx::Value::FromJson(json);
  const std::wstring text = value.ToText();
  PROMISE(qx::Value(value).ToText() == text);
  PROMISE(qx::Value::FromJson(value.ToJson()).ToText() == text);

  value.IsTrue();
  Try([&] { value.AsNumber(); });
  Try([&] { value.AsString(); });
  Try([&] { value.Member(L"m"); });
  Try([&] { value.SetMember(L"m", value); });
  Try([&] { value.Append(value); });
  Try([&] {
    for (const qx::String& key : value.Keys())
      PROMISE(value.HasMember(key) && value.Keys().size() == value.Size());
  });
  const std::string written = value.ToJsonText();
  PROMISE(written.ends_with('\n'));
}
