#include "systeminfo/utils/registry_value.h"

#include <gtest/gtest.h>

namespace utils {
namespace {

using namespace std::string_literals;

std::wstring InBrackets(std::wstring_view text) {
  return L"[" + std::wstring(text) + L"]";
}

TEST(RegistryValue, BytesOfEveryTypeBecomeText) {
  const struct {
    uint32_t type;
    std::string data;
    std::wstring expected;
  } cases[] = {
      {1, "a\0b\0\0\0"s, L"ab"},
      {1, "a\0b\0"s, L"ab"},   // not terminated
      {1, "a\0b\0c"s, L"ab"},  // an odd byte
      {1, "a"s, L""},          // nothing but an odd byte
      {1, ""s, L""},
      {1, "a\0\0\0b\0\0\0"s, L"a"},                             // more behind the end
      {1, "\xac\x20\x3d\xd8\x00\xde"s, L"\x20ac\xd83d\xde00"},  // a character of two units
      {2, "%\0x\0%\0\0\0"s, L"[%x%]"},
      {2, ""s, L"[]"},
      {3, "\x0A\xFF"s, L"aff"},
      {3, "\0\x80\x10\x01"s, L"080101"},
      {3, ""s, L""},
      {4, "\xFF\xFF\xFF\xFF"s, L"4294967295"},
      {4, "\x01\x02\0\0"s, L"513"},
      {4, "\0\0\0\0"s, L"0"},
      {4, "\x07\0\0\0\x01"s, L"7"},  // longer than a number
      {4, "\x01\0\0"s, L""},         // shorter than one
      {4, ""s, L""},
      {7, "a\0\0\0b\0\0\0\0\0"s, L"a b   "},  // both ends of the list and one blank
      {7, "a\0b"s, L"a "},
      {7, ""s, L" "},
      {0, "a\0"s, L"Not implemented"},
      {5, "\0\0\0\x01"s, L"Not implemented"},
      {6, "a\0"s, L"Not implemented"},
      {11, "\0\0\0\0\0\0\0\x01"s, L"Not implemented"},
      {99, ""s, L"Not implemented"},
      {0xFFFFFFFF, "x"s, L"Not implemented"},
  };
  for (const auto& row : cases) {
    EXPECT_EQ(ValueText({L"", row.type, row.data}, &InBrackets), row.expected)
        << row.type << " of " << row.data.size() << " bytes";
  }
}

TEST(RegistryValue, AMegabyteOfEveryTypeIsTakenWhole) {
  constexpr size_t kSize = size_t{1} << 20;
  const std::string data(kSize, 'A');
  EXPECT_EQ(ValueText({L"", 1, data}).size(), kSize / 2);
  EXPECT_EQ(ValueText({L"", 2, data}).size(), kSize / 2);
  EXPECT_EQ(ValueText({L"", 3, data}).size(), kSize * 2);
  EXPECT_EQ(ValueText({L"", 7, data}).size(), kSize / 2 + 1);
}

TEST(RegistryValue, OnlyAsciiLettersBecomeLowerCase) {
  EXPECT_EQ(LowerCase(L"DisplayNAME [Z@`{] \x00C4\x0130"), L"displayname [z@`{] \x00C4\x0130");
}

}  // namespace
}  // namespace utils
