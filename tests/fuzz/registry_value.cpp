// The data of a registry value as text. The first byte is the type.
#include "systeminfo/utils/registry_value.h"

#include "core/text.h"
#include "tests/fuzz/fuzz.h"

namespace {

bool IsUtf16(std::wstring_view text) {
  return std::all_of(text.begin(), text.end(), [](wchar_t c) { return c >= 0 && c <= 0xFFFF; });
}

}  // namespace

void FuzzOne(std::string_view bytes) {
  Input input(bytes);
  const uint32_t type = input.Take<uint8_t>();
  const std::string data(input.Rest());
  const std::wstring text = utils::ValueText({L"name", type, data});
  PROMISE(IsUtf16(text));
  PROMISE(text.size() <= std::max<size_t>(2 * data.size() + 1, std::string_view("Not implemented").size()));
  if (type != 7) PROMISE(text.find(L'\0') == std::wstring::npos);
  PROMISE(utils::StoredText(data).size() <= data.size() / 2);
  PROMISE(utils::LowerCase(text).size() == text.size());
}
