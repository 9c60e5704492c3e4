// The plug-ins as the program gets them: the real libraries, which lie beside this test.
#include "gui/plugins.h"

#include <windows.h>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "core/program_path.h"
#include "core/text_table.h"

namespace {

using testing::ElementsAre;

template <class Plugin>
std::shared_ptr<Plugin> Get(const std::wstring& language = L"ro") {
  const qx::ComponentManager manager(language);
  return qx::ServPlugin<Plugin>::GetPlugin(&manager);
}

}  // namespace

TEST(Plugins, LanguageManagerTranslatesKeysAndEnglishTexts) {
  const auto manager = Get<qx::ILanguageManager>();
  ASSERT_NE(manager, nullptr);
  std::wstring text;
  EXPECT_EQ(manager->Translate(L"cancel", text), 0u);
  EXPECT_EQ(text, L"Anulare");
  EXPECT_EQ(manager->Translate(L"Start recording", text), 0u);
  EXPECT_EQ(text, L"Porne\u0219te \u00EEnregistrarea");
  for (const std::wstring& none : {std::wstring(), std::wstring(L"no such text"), std::wstring(1 << 20, L'x')}) {
    EXPECT_EQ(manager->Translate(none, text), static_cast<uint32_t>(ERROR_NOT_FOUND));
    EXPECT_EQ(text, L"");
  }
}

TEST(Plugins, EveryTextOfACatalogueComesWhole) {
  TextTable texts;
  std::string error;
  ASSERT_EQ(ReadTextTable(ProgramFolder() + L"\\language\\en.json", texts, error), 0u) << error;
  const auto manager = Get<qx::ILanguageManager>(L"en");
  ASSERT_NE(manager, nullptr);
  for (const auto& [key, text] : texts) {
    std::wstring translation;
    EXPECT_EQ(manager->Translate(key, translation), 0u);
    EXPECT_EQ(translation, text);
  }
}

TEST(Plugins, WhatCannotBeHadIsLoggedWithItsNumber) {
  logging::ErrorCapture errors;
  EXPECT_EQ(qx::ServPlugin<qx::ILanguageManager>::GetPlugin(nullptr), nullptr);
  EXPECT_EQ(Get<qx::ILanguageManager>(L"xx"), nullptr);
  EXPECT_EQ(Get<qx::ILanguageManager>(L"..\\language\\en"), nullptr);
  EXPECT_THAT(
      errors.Take(),
      ElementsAre(L"ServPlugin<class ILanguageManager>::GetPlugin: Null component manager",
                  L"ServPlugin<class ILanguageManager>::GetPlugin: Error 2 getting plugin \"LanguageManager\"",
                  L"ServPlugin<class ILanguageManager>::GetPlugin: Error 87 getting plugin \"LanguageManager\""));
}

TEST(Plugins, ProductConfigurationTellsWhatTheProductIs) {
  const auto config = Get<qx::IServConfig>();
  ASSERT_NE(config, nullptr);
  std::wstring text;
  EXPECT_EQ(config->GetText(L"product_name", text), 0u);
  EXPECT_EQ(text, L"Quorvex Guard Basic");
  EXPECT_EQ(config->GetText(L"none", text), static_cast<uint32_t>(ERROR_NOT_FOUND));
}

TEST(TextTable, OnlyAnObjectOfTextsIsOne) {
  TextTable table;
  std::string error;
  for (const char* text : {"", "[]", "{\"a\":1}", "{\"a\":null}", "{\"a\":{\"b\":\"c\"}}", "{\"a\":\"b\""}) {
    error.clear();
    EXPECT_FALSE(ParseTextTable(text, table, error)) << text;
    EXPECT_FALSE(error.empty()) << text;
    EXPECT_TRUE(table.empty()) << text;
  }
  EXPECT_TRUE(ParseTextTable("{\"a\":\"\xC8\x99\"}", table, error));
  EXPECT_EQ(table[L"a"], L"\u0219");
}

TEST(TextTable, TextsPassThroughACInterfaceWhatTheirLength) {
  for (const size_t length : {size_t{0}, size_t{511}, size_t{512}, size_t{100000}}) {
    const std::wstring original(length, L'x');
    std::wstring text;
    EXPECT_EQ(FetchText([&](wchar_t* buffer, uint32_t* chars) { return CopyText(original, buffer, chars); }, text), 0u);
    EXPECT_EQ(text, original);
  }
  std::wstring text;
  const auto lying = [](wchar_t*, uint32_t* chars) {
    *chars = 0xFFFFFFFF;
    return uint32_t{0};
  };
  EXPECT_EQ(FetchText(lying, text), static_cast<uint32_t>(ERROR_INVALID_DATA));
  uint32_t chars = 2;
  wchar_t buffer[2] = {L'?', L'?'};
  EXPECT_EQ(CopyText(L"ab", buffer, &chars), static_cast<uint32_t>(ERROR_INSUFFICIENT_BUFFER));
  EXPECT_EQ(chars, 3u);
  EXPECT_EQ(buffer[0], L'?');
}
