#include "systeminfo/utils/registry_value.h"

#include <algorithm>

#include "core/ascii.h"

namespace utils {
namespace {

// The registry's own numbers.
enum RegistryType : uint32_t {
  kText = 1,
  kExpandableText = 2,
  kBinary = 3,
  kNumber = 4,
  kTextList = 7,
};

uint32_t ByteAt(std::string_view data, size_t index) {
  return static_cast<unsigned char>(data[index]);
}

// One element for each pair of bytes.
std::wstring Characters(std::string_view data) {
  std::wstring text(data.size() / 2, L'\0');
  for (size_t i = 0; i < text.size(); ++i)
    text[i] = static_cast<wchar_t>(ByteAt(data, 2 * i) | ByteAt(data, 2 * i + 1) << 8);
  return text;
}

std::wstring Hexadecimal(std::string_view data) {
  constexpr wchar_t kDigits[] = L"0123456789abcdef";
  std::wstring text;
  text.reserve(2 * data.size());
  for (size_t i = 0; i < data.size(); ++i) {
    const uint32_t byte = ByteAt(data, i);
    if (byte > 0xF) text += kDigits[byte >> 4];
    text += kDigits[byte & 0xF];
  }
  return text;
}

std::wstring Number(std::string_view data) {
  if (data.size() < sizeof(uint32_t)) return {};
  return std::to_wstring(ByteAt(data, 0) | ByteAt(data, 1) << 8 | ByteAt(data, 2) << 16 | ByteAt(data, 3) << 24);
}

std::wstring TextList(std::string_view data) {
  std::wstring text = Characters(data);
  std::replace(text.begin(), text.end(), L'\0', L' ');
  return text + L' ';
}

}  // namespace

std::wstring ValueText(const RegistryValue& value, TextExpander expand) {
  switch (value.type) {
    case kText:
      return StoredText(value.data);
    case kExpandableText:
      return expand(StoredText(value.data));
    case kBinary:
      return Hexadecimal(value.data);
    case kNumber:
      return Number(value.data);
    case kTextList:
      return TextList(value.data);
    default:
      return L"Not implemented";
  }
}

std::wstring StoredText(std::string_view data) {
  std::wstring text = Characters(data);
  text.resize(std::min(text.find(L'\0'), text.size()));
  return text;
}

std::wstring LowerCase(std::wstring_view text) {
  std::wstring lower(text);
  std::transform(lower.begin(), lower.end(), lower.begin(), &LowerAscii<wchar_t>);
  return lower;
}

}  // namespace utils
