// Collections for the tests of the report, from one JSON object whose members are the documents.
#pragma once

#include <gtest/gtest.h>
#include <json/writer.h>

#include <functional>
#include <string>

#include "core/json.h"
#include "report/collection.h"

namespace report {

inline Json::Value Parse(const std::string& text) {
  Json::Value value;
  std::string error;
  EXPECT_TRUE(ParseJson(text, value, error)) << error << text;
  return value;
}

inline Collection MakeCollection(const Json::Value& documents) {
  Collection collection;
  for (const std::string& name : documents.getMemberNames()) {
    collection.documents[name] = documents[name];
    collection.files.push_back({"collected/" + name + ".json", 10});
  }
  SetCollectionTime(collection);
  return collection;
}

// Calls `visit` for the value and everything in it.
inline void ForEachNode(Json::Value& value, const std::function<void(Json::Value& node)>& visit) {
  visit(value);
  if (!value.isArray() && !value.isObject()) return;
  for (Json::Value& child : value)
    ForEachNode(child, visit);
}

// Calls `visit` with the documents, each value of which in turn is replaced by each type of value there is.
inline void ForEachReplacement(const Json::Value& original,
                               const std::function<void(const Json::Value& changed)>& visit) {
  const Json::Value replacements[] = {Json::Value(),
                                      Json::Value(true),
                                      Json::Value(-1),
                                      Json::Value(1e308),
                                      Json::Value(""),
                                      Json::Value("\"\\..\xFF"),
                                      Json::Value(Json::arrayValue),
                                      Json::Value(Json::objectValue),
                                      Parse("[[null, {\"name\": []}]]")};
  size_t count = 0;
  Json::Value counted = original;
  ForEachNode(counted, [&](Json::Value&) { ++count; });
  for (size_t target = 1; target < count; ++target) {  // 0 is the object around the documents
    for (const Json::Value& replacement : replacements) {
      Json::Value changed = original;
      size_t index = 0;
      Json::Value* node = nullptr;
      ForEachNode(changed, [&](Json::Value& value) { node = index++ == target ? &value : node; });
      *node = replacement;
      visit(changed);
    }
  }
}

}  // namespace report
