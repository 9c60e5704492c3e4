#include "systeminfo/utils/registry_json.h"

#include "core/logging.h"
#include "core/text.h"

namespace utils {
namespace {

constexpr wchar_t kDumpKey[] = L"utils::DumpKey";

class Dumper {
 public:
  explicit Dumper(const std::atomic<bool>* cancel) : m_cancel(cancel) {}

  Json::Value Dump(const RegistryKey& key, int depth, bool isBelowLink) {
    Json::Value dump(Json::objectValue);
    Json::Value values = ValuesAsJson(key);
    if (!values.empty()) dump["values"].swap(values);
    Json::Value subkeys(Json::objectValue);
    key.WalkSubkeys([&](const std::wstring& name) {
      if (IsCancelled()) return false;
      if (depth < kDeepestDump) {
        AddSubkey(key, name, depth, isBelowLink, subkeys);
        return true;
      }
      LOG_WARNING(kDumpKey, L"The subkeys of a key %d levels down are left out", depth);
      return false;
    });
    if (!subkeys.empty()) dump["subkeys"].swap(subkeys);
    return dump;
  }

 private:
  bool IsCancelled() const { return m_cancel != nullptr && m_cancel->load(); }

  void AddSubkey(const RegistryKey& key, const std::wstring& name, int depth, bool isBelowLink, Json::Value& subkeys) {
    const bool isLink = key.IsLink(name);
    if (isLink && isBelowLink) {
      LOG_INFO(kDumpKey, L"The link %s is not followed", name.c_str());
      return;
    }
    const RegistryKey subkey = key.OpenSubkey(name);
    if (!subkey) {
      LOG_WARNING(kDumpKey, L"The subkey %s cannot be opened, error %u", name.c_str(), subkey.OpenError());
      return;
    }
    Json::Value dump = Dump(subkey, depth + 1, isBelowLink || isLink);
    subkeys[ToUtf8(name)].swap(dump);
  }

  const std::atomic<bool>* m_cancel;
};

}  // namespace

Json::Value ValuesAsJson(const RegistryKey& key) {
  Json::Value values(Json::objectValue);
  for (const RegistryValue& value : key.GetValues())
    values[ToUtf8(value.name)] = ToUtf8(ValueText(value));
  return values;
}

Json::Value DumpKey(const RegistryKey& key, const std::atomic<bool>* cancel) {
  return Dumper(cancel).Dump(key, 0, false);
}

}  // namespace utils
