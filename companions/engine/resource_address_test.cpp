#include "companions/engine/resource_address.h"

#include <gtest/gtest.h>

#include "companions/engine/browser_command.h"
#include "companions/engine/page_document.h"

namespace engine {
namespace {

TEST(ResourceAddress, PagesComeBackUnderTheirOwnAddress) {
  const struct {
    const wchar_t* address;
    const wchar_t* uri;
    const wchar_t* folder;
  } cases[] = {
      {L"file://C:\\Program Files\\tool\\page.htm", L"file://C:/Program Files/tool/page.htm",
       L"C:\\Program Files\\tool"},
      {L"file:///C:/a/p.htm", L"file://C:/a/p.htm", L"C:\\a"},
      {L"C:\\a#b\\100%?.htm", L"file://C:/a#b/100%?.htm", L"C:\\a#b"},
      {L"\\\\server\\share\\\u00e4.htm", L"file:////server/share/\u00e4.htm", L"\\\\server\\share"},
      {L"res:page.htm", L"res:page.htm", L""},
      {L"RES://page.htm", L"res:page.htm", L""},
      {L"this://app/a/b.htm", L"this://app/a/b.htm", L""},
  };
  for (const auto& one : cases) {
    const auto page = ToPageAddress(one.address);
    ASSERT_TRUE(page) << one.address;
    EXPECT_EQ(page->folder, one.folder);
    EXPECT_EQ(ToEngineUri(page->browserUrl), one.uri) << page->browserUrl;
    EXPECT_EQ(ToEngineUri(page->browserUrl + "?query#part"), one.uri);
  }
}

TEST(ResourceAddress, NoPageIsElsewhere) {
  for (const wchar_t* address : {L"", L"http://x/p.htm", L"page.htm", L"C:\\a\\..\\b\\p.htm", L"res:", L"file://p.htm"})
    EXPECT_FALSE(ToPageAddress(address)) << address;
  for (const char* url :
       {"https://example.com/", "http://file.engine.invalid/C:/a", "https://file.engine.invalid.x/a",
        "https://res.engine.invalid/", "https://res.engine.invalid/%zz", "https://res.engine.invalid/a%00b",
        "https://res.engine.invalid/a%4", "data:text/html,x", "file:///etc/passwd"}) {
    EXPECT_FALSE(ToEngineUri(url)) << url;
  }
  EXPECT_EQ(ToEngineUri("res:style.css"), L"res:style.css");
  EXPECT_EQ(ToEngineUri("this://app/a%20b.css"), L"this://app/a b.css");
}

TEST(ResourceAddress, OnlyWhatLiesInThePagesFolderIsReadFromTheDisk) {
  const wchar_t* folder = L"C:\\pages";
  EXPECT_EQ(PathInside(L"file://C:/pages/sub/a.css", folder), L"C:\\pages\\sub\\a.css");
  EXPECT_EQ(PathInside(L"file://c:/PAGES/a.css", folder), L"c:\\PAGES\\a.css");
  for (const wchar_t* uri : {L"file://C:/pages", L"file://C:/pages/", L"file://C:/pagesx/a", L"file://C:/pages/../a",
                             L"file://C:/pages/x/../../a", L"file://C:/pages/..\\a", L"file://C:/pages/a.txt:stream",
                             L"file://D:/pages/a", L"res:a"}) {
    EXPECT_FALSE(PathInside(uri, folder)) << uri;
  }
  EXPECT_FALSE(PathInside(L"file://C:/a", L""));
}

TEST(ResourceAddress, KnowsTheTypesThatPagesUse) {
  EXPECT_EQ(MimeTypeOf(L"res:A.HTM"), "text/html; charset=utf-8");
  EXPECT_EQ(MimeTypeOf(L"file://C:/a.b/c.js"), "text/javascript; charset=utf-8");
  EXPECT_EQ(MimeTypeOf(L"file://C:/a.css/noextension"), "application/octet-stream");
}

TEST(PageDocument, TheScriptStandsBehindTheDocumentType) {
  EXPECT_EQ(WithLeadingScript("<html>", "s"), "<script>s</script><html>");
  EXPECT_EQ(WithLeadingScript("\xEF\xBB\xBF\n<!-- > --><!DocType html><p>", "s"),
            "\xEF\xBB\xBF\n<!-- > --><!DocType html><script>s</script><p>");
  EXPECT_EQ(WithLeadingScript("", "s"), "<script>s</script>");
  EXPECT_EQ(WithLeadingScript("<!-- no end", "s"), "<script>s</script><!-- no end");
  EXPECT_EQ(WithLeadingScript("<!doctype", "s"), "<script>s</script><!doctype");
}

TEST(BrowserCommand, ArgumentsAreQuotedAsProgramsReadThem) {
  EXPECT_EQ(QuoteArgument(L"plain\\path\\"), L"plain\\path\\");
  EXPECT_EQ(QuoteArgument(L""), L"\"\"");
  EXPECT_EQ(QuoteArgument(L"a b\\"), L"\"a b\\\\\"");
  EXPECT_EQ(QuoteArgument(L"say \"hi\\\""), L"\"say \\\"hi\\\\\\\"\"");
}

TEST(BrowserCommand, AWindowsBrowserGetsPipesAndKeepsItsSandbox) {
  const std::wstring line =
      BrowserCommandLine({L"C:\\Program Files\\b\\msedge.exe", L"C:\\Temp\\profile", L"", 0x10, 0x14, true});
  EXPECT_TRUE(line.starts_with(L"\"C:\\Program Files\\b\\msedge.exe\" --headless "));
  EXPECT_NE(line.find(L" --remote-debugging-pipe --remote-debugging-io-pipes=16,20 "), std::wstring::npos);
  EXPECT_NE(line.find(L" --user-data-dir=C:\\Temp\\profile "), std::wstring::npos);
  EXPECT_EQ(line.find(L"--no-sandbox"), std::wstring::npos);
  EXPECT_EQ(line.find(L"--remote-debugging-port"), std::wstring::npos);
}

TEST(BrowserCommand, AUnixBrowserGetsUnixPathsAndAWatch) {
  const std::wstring line =
      BrowserCommandLine({L"Z:\\usr\\bin\\chromium", L"Z:\\tmp\\profile", L"Z:\\tmp\\profile.life", 0, 0, false});
  EXPECT_TRUE(line.starts_with(L"Z:\\bin\\sh -c "));
  EXPECT_NE(line.find(L" /tmp/profile.life /tmp/profile /usr/bin/chromium --headless "), std::wstring::npos);
  EXPECT_NE(line.find(L" --user-data-dir=/tmp/profile "), std::wstring::npos);
  EXPECT_NE(line.find(L" --remote-debugging-port=0 "), std::wstring::npos);
  EXPECT_NE(line.find(L" --no-sandbox "), std::wstring::npos);
}

}  // namespace
}  // namespace engine
