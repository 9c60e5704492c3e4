// The texts of the pages: every language has all of them, and the pages reach no other address.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <regex>
#include <set>

#include "core/files.h"
#include "core/program_path.h"
#include "core/text.h"
#include "core/text_table.h"
#include "gui/window_messages.h"

namespace {

using Names = std::set<std::string>;

std::string Read(const std::wstring& path) {
  std::string bytes;
  EXPECT_EQ(ReadWholeFile(path, 1 << 20, bytes), static_cast<DWORD>(ERROR_SUCCESS)) << ToUtf8(path);
  return bytes;
}

std::string Source(const char* name) {
  return Read(ToWide(std::string(ST_SOURCE_DIR "/gui/new/") + name));
}

Names Matches(const std::string& text, const char* expression) {
  const std::regex compiled(expression);
  Names names;
  for (std::sregex_iterator match(text.begin(), text.end(), compiled), end; match != end; ++match)
    names.insert((*match)[1].str());
  return names;
}

TextTable Catalogue(const wchar_t* language) {
  TextTable texts;
  std::string error;
  EXPECT_EQ(ReadTextTable(ProgramFolder() + L"\\language\\" + language + L".json", texts, error), 0u) << error;
  return texts;
}

Names Keys(const TextTable& texts) {
  Names keys;
  for (const auto& [key, text] : texts)
    keys.insert(ToUtf8(key));
  return keys;
}

}  // namespace

TEST(Catalogues, LanguagesHaveTheSameTextsWithTheSamePlaceholders) {
  const TextTable english = Catalogue(L"en");
  const TextTable romanian = Catalogue(L"ro");
  EXPECT_EQ(Keys(romanian), Keys(english));
  size_t same = 0;
  for (const auto& [key, text] : english) {
    const auto found = romanian.find(key);
    if (found == romanian.end()) continue;
    EXPECT_FALSE(text.empty() || found->second.empty()) << ToUtf8(key);
    EXPECT_EQ(Matches(ToUtf8(found->second), "\\{(\\w+)\\}"), Matches(ToUtf8(text), "\\{(\\w+)\\}")) << ToUtf8(key);
    same += text == found->second ? 1 : 0;
  }
  EXPECT_LE(same, 1u) << "texts that nobody has translated";  // one is made of placeholders only
}

TEST(Catalogues, HaveExactlyTheTextsThatThePagesUse) {
  const std::string html = Source("support_tool.html.in");
  const std::string script = Source("support_tool.js");
  const Names keys = Keys(Catalogue(L"en"));
  Names used = Matches(html, "\\{\\{(\\w+)\\}\\}");
  for (const std::string& word : Matches(script, "\"(\\w+)\""))
    if (keys.count(word) != 0) used.insert(word);
  // Made up by the script: an outcome and its help, an issue by its value, a stage of the progress.
  for (const std::string& outcome : Matches(script, "\"((?:collect|compression|submission)_\\w+)\""))
    used.insert(outcome + "_help");
  used.insert("unknown");
  used.insert("unknown_help");
  for (const std::string& issue : Matches(html, "name=\"issue\" value=\"(\\w+)\""))
    used.insert("issue_" + issue);
  for (const std::string& stage : Matches(html, "data-stage=\"(\\w+)\""))
    used.insert("progress_" + stage);
  for (const std::string& word : Matches(script, "texts\\.(\\w+)"))
    used.insert(word);
  // The program's own, which it looks up by their English text.
  const TextTable english = Catalogue(L"en");
  EXPECT_EQ(english.at(L"page_failed"), qx::kPageFailedText);
  EXPECT_EQ(english.at(L"page_lost"), qx::kPageLostText);
  used.insert({"page_failed", "page_lost"});
  EXPECT_EQ(used, keys);
}

TEST(Pages, AreFilledAndReachNoAddressOutsideTheirFolder) {
  for (const wchar_t* name :
       {L"support_tool_en.html", L"support_tool_ro.html", L"support_tool.js", L"support_tool.css", L"engine.js"}) {
    const std::string text = Read(ProgramFolder() + L"\\gui\\new\\" + name);
    EXPECT_EQ(text.find("{{"), std::string::npos) << ToUtf8(name);
    for (const char* outside : {"://", "url(", "@import", "src=\"/", "href=\"/", "..", "fetch(", "XMLHttpRequest"})
      EXPECT_EQ(text.find(outside), std::string::npos) << ToUtf8(name) << " has " << outside;
  }
  EXPECT_NE(Read(ProgramFolder() + L"\\gui\\new\\support_tool_ro.html").find("<html lang=\"ro\">"), std::string::npos);
}
