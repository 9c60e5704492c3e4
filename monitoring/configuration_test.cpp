#include "monitoring/configuration.h"

#include <gmock/gmock.h>

#include "core/json.h"
#include "core/text.h"
#include "monitoring/json_key.h"

namespace st::monitoring {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

// The texts of the notes that reading leaves, in their order.
struct Notes {
  std::vector<std::string> texts;
  NoteSink Sink() {
    return [this](const Note& note) { texts.push_back(ToUtf8(note.text)); };
  }
};

Json::Value Json(std::string_view text) {
  Json::Value value;
  std::string error;
  EXPECT_TRUE(ParseJson(text, value, error)) << text << error;
  return value;
}

constexpr char kCounter[] = R"({"id":"c", "query":"\\A\\B", "sampleInterval":1000, "triggers":["t","u"]})";
constexpr char kTrigger[] = R"({"id":"t", "triggerAfter":2, "counterValue":12.5, "condition":">=", "action":["a"]})";

// The document `json` with one member put to another value, which is JSON text; empty: without it.
Json::Value With(const char* json, const char* member, std::string_view value) {
  Json::Value document = Json(json);
  document.removeMember(member);
  if (!value.empty()) document[member] = Json("[" + std::string(value) + "]")[0];
  return document;
}

TEST(JsonKey, OnlyTheExactTypeIsThere) {
  const Json::Value value = Json(R"({"i":5, "r":5.0, "u":3000000000, "n":null, "s":"x"})");
  struct {
    const char* key;
    Json::ValueType type;
    bool exists;
    std::vector<std::string> notes;
  } const rows[] = {
      {"i", Json::intValue, true, {}},
      {"r", Json::intValue, false, {"expected 1 have 3"}},
      {"u", Json::intValue, false, {"expected 1 have 2"}},
      {"i", Json::realValue, false, {"expected 3 have 1"}},
      {"n", Json::intValue, false, {}},
      {"absent", Json::intValue, false, {}},
      {"s", Json::stringValue, true, {}},
      {"s", Json::arrayValue, false, {"expected 6 have 4"}},
  };
  for (const auto& row : rows) {
    Notes notes;
    EXPECT_EQ(util::JsonKeyWithValueTypeExists(value, row.key, row.type, notes.Sink()), row.exists) << row.key;
    EXPECT_EQ(notes.texts, row.notes) << row.key;
  }
  EXPECT_FALSE(util::JsonKeyWithValueTypeExists(Json::Value(3), "i", Json::intValue, [](const Note&) {}));
}

TEST(CounterSettings, AreReadInTheOrderOfTheDocument) {
  Notes notes;
  const auto counter = ReadCounter(Json(kCounter), notes.Sink());
  ASSERT_TRUE(counter);
  EXPECT_EQ(counter->id, L"c");
  EXPECT_EQ(counter->query, L"\\A\\B");
  EXPECT_EQ(counter->sampleInterval, 1000U);
  EXPECT_FALSE(counter->saveToFile);
  EXPECT_THAT(counter->triggerIds, ElementsAre(L"t", L"u"));
  EXPECT_THAT(notes.texts, IsEmpty());
  EXPECT_TRUE(ReadCounter(With(kCounter, "saveToFile", "true"), notes.Sink())->saveToFile);
  EXPECT_FALSE(ReadCounter(With(kCounter, "saveToFile", "1"), notes.Sink())->saveToFile);
}

TEST(CounterSettings, WhatIsWrongIsRefusedAndSaid) {
  struct {
    const char *member, *value;
    std::vector<std::string> notes;
  } const rows[] = {
      {"id", "", {"id", "Invalid format for performance counter"}},
      {"id", "7", {"expected 4 have 1", "id", "Invalid format for performance counter"}},
      {"query", "null", {"query", "Invalid format for performance counter"}},
      {"sampleInterval", "1000.0", {"expected 1 have 3", "sampleInterval", "Invalid format for performance counter"}},
      {"sampleInterval",
       "3000000000",
       {"expected 1 have 2", "sampleInterval", "Invalid format for performance counter"}},
      {"sampleInterval", "-3000000000", {"sampleInterval is out of range"}},
      {"triggers", "{}", {"expected 6 have 7", "triggers", "Invalid format for performance counter"}},
      {"triggers", R"(["t", 1])", {"not string value in triggers array"}},
  };
  for (const auto& row : rows) {
    Notes notes;
    EXPECT_FALSE(ReadCounter(With(kCounter, row.member, row.value), notes.Sink())) << row.member << row.value;
    EXPECT_EQ(notes.texts, row.notes) << row.member << row.value;
  }
  for (const char* element : {"7", "null", "[]", "\"x\""}) {
    Notes notes;
    EXPECT_FALSE(ReadCounter(With("{}", "x", element)["x"], notes.Sink())) << element;
    EXPECT_THAT(notes.texts, ElementsAre("id", "Invalid format for performance counter"));
  }
}

TEST(TriggerSettings, TheThresholdIsANumberAndARealOneLeavesANote) {
  Notes notes;
  const auto trigger = ReadTrigger(Json(kTrigger), notes.Sink());
  ASSERT_TRUE(trigger);
  EXPECT_EQ(trigger->counterValue, 12.5);
  EXPECT_EQ(trigger->triggerAfter, 2);
  EXPECT_THAT(trigger->actionIds, ElementsAre(L"a"));
  EXPECT_THAT(notes.texts, ElementsAre("expected 1 have 3"));

  const auto whole = ReadTrigger(With(kTrigger, "counterValue", "-7"), notes.Sink());
  ASSERT_TRUE(whole);
  EXPECT_EQ(whole->counterValue, -7.0);
  EXPECT_EQ(notes.texts.size(), 1U);
}

TEST(TriggerSettings, WhatIsWrongIsRefusedAndSaid) {
  struct {
    const char *member, *value;
    std::vector<std::string> notes;
  } const rows[] = {
      {"counterValue", "", {"counterValue", "Invalid format for trigger"}},
      {"counterValue",
       "\"NaN\"",
       {"expected 1 have 4", "expected 3 have 4", "counterValue", "Invalid format for trigger"}},
      {"counterValue",
       "3000000000",
       {"expected 1 have 2", "expected 3 have 2", "counterValue", "Invalid format for trigger"}},
      {"counterValue", "1e400", {"expected 1 have 3", "counterValue is out of range"}},
      {"counterValue", "-1e400", {"expected 1 have 3", "counterValue is out of range"}},
      {"triggerAfter", "-9000000000", {"triggerAfter is out of range"}},
      {"condition", "\"=\"", {"expected 1 have 3", "invalid condition"}},
      {"condition", "\"> \"", {"expected 1 have 3", "invalid condition"}},
      {"action", "[[]]", {"expected 1 have 3", "not string value in actions array"}},
  };
  for (const auto& row : rows) {
    Notes notes;
    EXPECT_FALSE(ReadTrigger(With(kTrigger, row.member, row.value), notes.Sink())) << row.member << row.value;
    std::vector<std::string> expected = row.notes;
    if (std::string_view(row.member) == "triggerAfter") expected.insert(expected.begin(), "expected 1 have 3");
    EXPECT_EQ(notes.texts, expected) << row.member << row.value;
  }
  for (const char* condition : {"<", ">", "<=", ">=", ""}) {
    EXPECT_TRUE(ReadTrigger(With(kTrigger, "condition", '"' + std::string(condition) + '"'), [](const Note&) {}));
  }
}

TEST(ActionSettings, OnlyDumpsAreKnownAndParametersAreKeptWhole) {
  Notes notes;
  const auto action = ReadAction(Json(R"({"id":"a", "type":"dump", "parameters":[1, {"x":null}]})"), notes.Sink());
  ASSERT_TRUE(action);
  EXPECT_EQ(action->parameters, Json(R"([1, {"x":null}])"));
  EXPECT_TRUE(ReadAction(Json(R"({"id":"a", "type":"dump"})"), notes.Sink())->parameters.isNull());
  EXPECT_FALSE(ReadAction(Json(R"({"id":"a", "type":"Dump"})"), notes.Sink()));
  EXPECT_FALSE(ReadAction(Json(R"({"id":"a"})"), notes.Sink()));
  EXPECT_THAT(notes.texts, ElementsAre("Invalid action type Dump", "type", "Invalid format for action"));
}

TEST(ConfigurationDocument, IsAnObjectWhateverTheBytesAre) {
  struct {
    std::string bytes;
    size_t members;
    bool isBad;
  } const rows[] = {
      {R"(/* comment */ {"triggers":[]})", 1, false},
      {"\xEF\xBB\xBF{}", 0, false},
      {R"({"triggers":1, "triggers":2})", 1, false},  // the last one counts
      {"", 0, true},
      {"[]", 0, true},
      {"7", 0, true},
      {R"({"triggers":[)", 0, true},
      {R"({"counterValue":NaN})", 0, true},
      {R"({"counterValue":Infinity})", 0, true},
      {std::string(100'000, '['), 0, true},
      {std::string("\0\xFF\xFE", 3), 0, true},
  };
  for (const auto& row : rows) {
    Notes notes;
    const Json::Value document = ParseConfiguration(row.bytes, L"m.json", notes.Sink());
    ASSERT_TRUE(document.isObject());
    EXPECT_EQ(document.size(), row.members) << row.bytes.substr(0, 40);
    ASSERT_EQ(notes.texts.size(), row.isBad ? 2U : 0U) << row.bytes.substr(0, 40);
    if (row.isBad) {
      EXPECT_EQ(notes.texts[0], "Invalid json format for configuration file m.json");
    }
  }
}

struct Thing {
  std::wstring id;
  std::vector<std::wstring> references;
  const std::wstring& Id() const { return id; }
  const std::vector<std::wstring>& References() const { return references; }
};

std::shared_ptr<Thing> MakeThing(const Json::Value& json) {
  return json.isString() ? std::make_shared<Thing>(Thing{ToWide(json.asString()), {}}) : nullptr;
}

TEST(ConfigurationSection, StopsAtTheFirstBadElementAndKeepsWhatCameBefore) {
  struct {
    const char* json;
    bool isWhole;
    size_t loaded;
    std::vector<std::string> notes;
  } const rows[] = {
      {"null", true, 0, {}},
      {"[]", true, 0, {}},
      {R"(["a","b","A",""])", true, 4, {}},
      {R"({"a":1})", false, 0, {"not an array"}},
      {R"("a")", false, 0, {"not an array"}},
      {R"(["a", 1, "c"])", false, 1, {"Failed to create trigger based on json"}},
      {R"(["a", "b", "a", "c"])", false, 2, {"found duplicate trigger; please change its id"}},
  };
  for (const auto& row : rows) {
    Notes notes;
    ById<Thing> things;
    const Json::Value elements = Json("[" + std::string(row.json) + "]")[0];
    EXPECT_EQ(LoadSection(elements, kTriggerSection, MakeThing, things, notes.Sink()), row.isWhole) << row.json;
    EXPECT_EQ(things.size(), row.loaded) << row.json;
    EXPECT_EQ(notes.texts, row.notes) << row.json;
  }
}

TEST(ConfigurationReferences, TheFirstOneThatLeadsNowhereIsFound) {
  ById<Thing> owners, targets;
  const auto owner = [&owners](const wchar_t* id, std::vector<std::wstring> references) {
    owners[id] = std::make_shared<Thing>(Thing{id, std::move(references)});
  };
  EXPECT_EQ(FindMissingReference(owners, &Thing::References, targets), nullptr);
  targets[L"t"] = nullptr;
  owner(L"b", {L"t", L"t", L"T", L"x"});
  owner(L"c", {L"y"});
  owner(L"a", {L"t"});
  const std::wstring* const missing = FindMissingReference(owners, &Thing::References, targets);
  ASSERT_NE(missing, nullptr);
  EXPECT_EQ(*missing, L"T");
}

TEST(Limits, AreWholeNumbersAndNothingElse) {
  struct {
    const char* json;
    const char* note;  // null: it is fine
  } const rows[] = {
      {"{}", nullptr},
      {R"({"limits":null})", nullptr},
      {R"({"limits":{"maxDumps":0, "maxDumpsPerProcess":1, "minFreeDiskBytes":18446744073709551615,
                     "$comment":"x"}})",
       nullptr},
      {R"({"limits":[]})", "limits is not an object"},
      {R"({"limits":{"maxDump":1}})", "there is no limit maxDump"},
      {R"({"limits":{"maxDumps":-1}})", "limit maxDumps is not a whole number from 0 on"},
      {R"({"limits":{"maxDumps":5.0}})", "limit maxDumps is not a whole number from 0 on"},
      {R"({"limits":{"maxTotalDumpBytes":"1"}})", "limit maxTotalDumpBytes is not a whole number from 0 on"},
      {R"({"limits":{"maxTotalDumpBytes":1e400}})", "limit maxTotalDumpBytes is not a whole number from 0 on"},
      {R"({"limits":{"maxSampleFileBytes":null}})", "limit maxSampleFileBytes is not a whole number from 0 on"},
  };
  for (const auto& row : rows) {
    Notes notes;
    Limits limits;
    EXPECT_EQ(ReadLimits(Json(row.json), limits, notes.Sink()), row.note == nullptr) << row.json;
    EXPECT_EQ(notes.texts, row.note == nullptr ? std::vector<std::string>() : std::vector<std::string>{row.note});
  }
  Limits limits;
  ASSERT_TRUE(ReadLimits(Json(rows[2].json), limits, [](const Note&) {}));
  EXPECT_EQ(limits.maxDumps, 0U);
  EXPECT_EQ(limits.minFreeDiskBytes, UINT64_MAX);
  EXPECT_FALSE(limits.maxTotalDumpBytes);
}

}  // namespace
}  // namespace st::monitoring
