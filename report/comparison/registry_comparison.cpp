#include <map>
#include <string>

#include "report/comparison/change_list.h"
#include "report/json_access.h"
#include "report/windows_text.h"

namespace report {
namespace {

// Members by their names, whose case the registry does not tell apart.
std::map<std::string, std::pair<std::string, const Json::Value*>> MembersOf(const Json::Value& object) {
  std::map<std::string, std::pair<std::string, const Json::Value*>> members;
  ForEachMember(object, [&](const std::string& name, const Json::Value& value) {
    members.insert_or_assign(LowerAscii(name), std::pair(name, &value));
  });
  return members;
}

class RegistryPair {
 public:
  RegistryPair(const std::string& title, ChangeList& changes) : m_title(title), m_changes(changes) {}

  // Of a key that is in both. A key that is in one only is one change, whatever is below it.
  // NOLINTNEXTLINE(misc-no-recursion): as deep as a document, which has at most 1,000 levels
  void CompareKeys(const Json::Value& before, const Json::Value& after) {
    ForEachPair(before, after, [this](const Json::Value* old, const Json::Value* young) {  // NOLINT(misc-no-recursion)
      if (old == nullptr || young == nullptr) return AddWhole(old == nullptr, "");
      CompareValues(Member(*old, "values"), Member(*young, "values"));
      CompareKeys(Member(*old, "subkeys"), Member(*young, "subkeys"));
    });
  }

 private:
  template <class Visit>
  void ForEachPair(const Json::Value& before, const Json::Value& after, Visit visit) {
    const auto old = MembersOf(before);
    const auto young = MembersOf(after);
    const size_t length = m_path.size();
    const auto call = [&](const std::string& name, const Json::Value* first, const Json::Value* second) {
      m_path += (m_path.empty() ? "" : "\\") + name;
      visit(first, second);
      m_path.resize(length);
    };
    for (const auto& [key, member] : old) {
      const auto found = young.find(key);
      call(member.first, member.second, found == young.end() ? nullptr : found->second.second);
    }
    for (const auto& [key, member] : young) {
      if (!old.contains(key)) call(member.first, nullptr, member.second);
    }
  }

  void CompareValues(const Json::Value& before, const Json::Value& after) {
    ForEachPair(before, after, [this](const Json::Value* old, const Json::Value* young) {
      if (old == nullptr || young == nullptr) return AddWhole(old == nullptr, Text(old == nullptr ? *young : *old));
      if (*old == *young) return;
      m_changes.Add(
          {ChangeKind::kChanged, m_title, Shortened(m_path, kLongestChangeText), "Value", Text(*old), Text(*young)});
    });
  }

  void AddWhole(bool isAdded, const std::string& text) {
    m_changes.Add({isAdded ? ChangeKind::kAdded : ChangeKind::kRemoved, m_title, Shortened(m_path, kLongestChangeText),
                   "", isAdded ? "" : text, isAdded ? text : ""});
  }

  static std::string Text(const Json::Value& value) { return TextOf(TextCell(value)); }

  const std::string& m_title;
  ChangeList& m_changes;
  std::string m_path;
};

}  // namespace

void CompareRegistries(const Json::Value& older, const Json::Value& newer, const std::string& title,
                       ChangeList& changes) {
  RegistryPair(title, changes).CompareKeys(older, newer);
}

}  // namespace report
