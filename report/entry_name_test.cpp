#include "report/entry_name.h"

#include <gmock/gmock.h>

using namespace std::string_view_literals;

namespace report {
namespace {

TEST(EntryName, NamesThatBecomeJustThatPathAreTaken) {
  for (const std::string_view name :
       {"collected/services.json"sv, "a"sv, "install_logs/"sv, "a/b/c.d.e"sv, "console/con1/com/nul_"sv, ".hidden"sv,
        "COM10.txt"sv, "x con"sv, "\xC3\xB6\xE6\x9D\xB1/\xF0\x9F\x98\x80.log"sv, "..a/...b"sv, "qxinst.log__"sv}) {
    EXPECT_STREQ(EntryNameFault(name), nullptr) << name;
  }
}

TEST(EntryName, NamesThatWindowsTakesForSomethingElseAreRefused) {
  const std::pair<std::string_view, const char*> rows[] = {
      {""sv, "is empty"},
      {"/etc/passwd"sv, "begins at a root"},
      {"//server/share/x"sv, "begins at a root"},
      {"../x"sv, "leads out of its folder"},
      {"a/../../x"sv, "leads out of its folder"},
      {"a/.."sv, "leads out of its folder"},
      {"./x"sv, "leads out of its folder"},
      {"a//b"sv, "has an empty component"},
      {"a//"sv, "has an empty component"},
      {"a\\b"sv, "holds a backslash"},
      {"..\\x"sv, "holds a backslash"},
      {"C:/x"sv, "names a drive or an alternate stream"},
      {"C:x"sv, "names a drive or an alternate stream"},
      {"x.txt:stream"sv, "names a drive or an alternate stream"},
      {"x::$DATA"sv, "names a drive or an alternate stream"},
      {"CON"sv, "names a device"},
      {"a/NUL.txt"sv, "names a device"},
      {"nul .tar.gz/x"sv, "names a device"},
      {"aux/x"sv, "names a device"},
      {"LPT9"sv, "names a device"},
      {"com0.log"sv, "names a device"},
      {"COM\xC2\xB9.x"sv, "names a device"},
      {"CONIN$"sv, "names a device"},
      {"x."sv, "has a component that ends in a dot or a blank"},
      {"x /y"sv, "has a component that ends in a dot or a blank"},
      {".../y"sv, "has a component that ends in a dot or a blank"},
      {"a\nb"sv, "holds a control character"},
      {"a\0.txt"sv, "holds a control character"},
      {"a?b"sv, "holds a character that no file name can"},
      {"a|b"sv, "holds a character that no file name can"},
      {"a\xFF"sv, "is no UTF-8 text"},
      {"\xC0\xAE\xC0\xAE/x"sv, "is no UTF-8 text"},
  };
  for (const auto& [name, fault] : rows)
    EXPECT_STREQ(EntryNameFault(name), fault) << name;
}

TEST(EntryName, LengthAndDepthHaveLimits) {
  std::string deep(2 * kDeepestEntryName - 1, 'a');
  for (size_t i = 1; i < deep.size(); i += 2)
    deep[i] = '/';
  EXPECT_STREQ(EntryNameFault(deep), nullptr);
  EXPECT_STREQ(EntryNameFault(deep + "/a"), "is too deep");
  EXPECT_STREQ(EntryNameFault(std::string(kLongestNameComponent, 'a')), nullptr);
  EXPECT_STREQ(EntryNameFault(std::string(kLongestNameComponent + 1, 'a')), "has a component that is too long");
  EXPECT_STREQ(EntryNameFault(std::string(kLongestEntryName + 1, 'a')), "is too long");
}

TEST(EntryName, NamesOfOneFileHaveOneKey) {
  EXPECT_EQ(EntryNameKey("A/Report.JSON"), EntryNameKey("a/report.json"));
  EXPECT_EQ(EntryNameKey("logs/"), EntryNameKey("Logs"));
  EXPECT_NE(EntryNameKey("a/b"), EntryNameKey("ab"));
}

TEST(EntryName, BecomesAPathBelowTheFolder) {
  for (const wchar_t* folder : {L"C:\\out", L"C:\\out\\"}) {
    EXPECT_EQ(EntryPath(folder, "a/b.txt"), L"C:\\out\\a\\b.txt");
    EXPECT_EQ(EntryPath(folder, "logs/"), L"C:\\out\\logs");
  }
}

}  // namespace
}  // namespace report
