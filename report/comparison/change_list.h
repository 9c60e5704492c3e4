// Collects the changes that a comparison comes across.
#pragma once

#include <string>

#include "report/comparison/comparison.h"

namespace report {

class ChangeList {
 public:
  explicit ChangeList(Comparison& comparison) : m_comparison(comparison) {}

  void Add(Change change) {
    ++m_comparison.count;
    if (m_comparison.changes.size() >= kMostChanges) return;
    for (std::string* text : {&change.item, &change.before, &change.after})
      *text = Shortened(*text, kLongestChangeText);
    m_comparison.changes.push_back(std::move(change));
  }

 private:
  Comparison& m_comparison;
};

// The keys and values that differ; `title` is that of the table.
void CompareRegistries(const Json::Value& older, const Json::Value& newer, const std::string& title,
                       ChangeList& changes);

}  // namespace report
