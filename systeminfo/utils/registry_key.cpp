#include "systeminfo/utils/registry_key.h"

#include <algorithm>
#include <iterator>

#include "core/logging.h"

namespace utils {
namespace {

constexpr wchar_t kGetValues[] = L"utils::RegistryKey::GetValues";
constexpr wchar_t kGetValue[] = L"utils::RegistryKey::GetValue";
constexpr wchar_t kWalkSubkeys[] = L"utils::RegistryKey::WalkSubkeys";

// What somebody else writes meanwhile may need a larger buffer again and again; not for ever.
constexpr int kMostRetries = 16;

struct Hive {
  std::wstring_view name;
  std::wstring_view shortName;  // empty: none
  HKEY key;
};

const Hive* FindHive(std::wstring_view name) {
  static const Hive kHives[] = {
      {L"HKEY_CLASSES_ROOT", L"HKCR", HKEY_CLASSES_ROOT},     {L"HKEY_CURRENT_USER", L"HKCU", HKEY_CURRENT_USER},
      {L"HKEY_LOCAL_MACHINE", L"HKLM", HKEY_LOCAL_MACHINE},   {L"HKEY_USERS", {}, HKEY_USERS},
      {L"HKEY_CURRENT_CONFIG", L"HKCC", HKEY_CURRENT_CONFIG},
  };
  if (name.empty()) return nullptr;
  const auto* const found = std::find_if(std::begin(kHives), std::end(kHives), [name](const Hive& hive) {
    return hive.name == name || hive.shortName == name;
  });
  return found == std::end(kHives) ? nullptr : found;
}

HKEY HiveKey(std::wstring_view path) {
  const Hive* const hive = FindHive(path.substr(0, path.find(L'\\')));
  return hive == nullptr ? nullptr : hive->key;
}

std::wstring_view PathBelowHive(std::wstring_view path) {
  const size_t separator = path.find(L'\\');
  return separator == std::wstring_view::npos ? std::wstring_view() : path.substr(separator + 1);
}

REGSAM AccessFor(RegistryView view) {
  switch (view) {
    case RegistryView::k64Bit:
      return KEY_READ | KEY_WOW64_64KEY;
    case RegistryView::k32Bit:
      return KEY_READ | KEY_WOW64_32KEY;
    case RegistryView::kNative:
      break;
  }
  return KEY_READ;
}

// The buffers that RegEnumValue fills, and how much of them it filled.
class ValueBuffers {
 public:
  ValueBuffers(DWORD longestName, DWORD largestData) : m_name(longestName + 1, L'\0'), m_data(largestData, '\0') {}

  LSTATUS Read(HKEY key, DWORD index) {
    m_nameLength = static_cast<DWORD>(m_name.size());
    m_dataSize = static_cast<DWORD>(m_data.size());
    return RegEnumValueW(key, index, m_name.data(), &m_nameLength, nullptr, &m_type,
                         reinterpret_cast<BYTE*>(m_data.data()), &m_dataSize);
  }

  // After ERROR_MORE_DATA, which does not say which buffer is too small.
  void Grow() {
    constexpr size_t kLongestName = 16383, kLeastData = 4096;
    m_name.resize(kLongestName + 1);
    m_data.resize(std::max({size_t{m_dataSize}, m_data.size() * 2, kLeastData}));
  }

  RegistryValue Value() const {
    const std::wstring_view name(m_name.data(), std::min<size_t>(m_nameLength, m_name.size()));
    return {LowerCase(name), m_type, m_data.substr(0, m_dataSize)};
  }

 private:
  std::wstring m_name;
  std::string m_data;
  DWORD m_nameLength = 0;
  DWORD m_dataSize = 0;
  DWORD m_type = 0;
};

}  // namespace

RegistryKey::RegistryKey(std::wstring_view path, RegistryView view)
    : RegistryKey(HiveKey(path), PathBelowHive(path), AccessFor(view), 0) {}

RegistryKey::RegistryKey(HKEY hive, std::wstring_view path, RegistryView view)
    : RegistryKey(hive, path, AccessFor(view), 0) {}

RegistryKey::RegistryKey(HKEY parent, std::wstring_view path, REGSAM access, DWORD options) : m_access(access) {
  // A zero character would cut the path: another key than the one that was meant.
  if (parent == nullptr || path.find(L'\0') != std::wstring_view::npos) {
    m_openError = ERROR_INVALID_NAME;
    return;
  }
  const std::wstring terminated(path);
  m_openError = static_cast<DWORD>(RegOpenKeyExW(parent, terminated.c_str(), options, access, m_key.Receive()));
}

void RegistryKey::LogUnlessAbsent(const wchar_t* function, std::wstring_view path) const {
  constexpr DWORD kAbsence[] = {ERROR_FILE_NOT_FOUND, ERROR_PATH_NOT_FOUND, ERROR_INVALID_NAME};
  if (std::find(std::begin(kAbsence), std::end(kAbsence), m_openError) != std::end(kAbsence)) return;
  LOG_WARNING(function, L"The key %s cannot be opened, error %u", std::wstring(path).c_str(), m_openError);
}

std::vector<RegistryValue> RegistryKey::GetValues() const {
  std::vector<RegistryValue> values;
  if (!m_key) return values;
  DWORD count = 0, longestName = 0, largestData = 0;
  LSTATUS status = RegQueryInfoKeyW(m_key.Get(), nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, &count,
                                    &longestName, &largestData, nullptr, nullptr);
  if (status != ERROR_SUCCESS) {
    LOG_ERROR(kGetValues, L"RegQueryInfoKey failed with %u", static_cast<DWORD>(status));
    return values;
  }
  ValueBuffers buffers(longestName, largestData);
  values.reserve(count);
  for (DWORD i = 0; i < count; ++i) {
    status = buffers.Read(m_key.Get(), i);
    for (int retry = 0; status == ERROR_MORE_DATA && retry < kMostRetries; ++retry) {
      buffers.Grow();
      status = buffers.Read(m_key.Get(), i);
    }
    if (status == ERROR_NO_MORE_ITEMS) break;  // some were deleted meanwhile
    if (status != ERROR_SUCCESS) {
      LOG_ERROR(kGetValues, L"RegEnumValue failed with code %u", static_cast<DWORD>(status));
      break;
    }
    values.push_back(buffers.Value());
  }
  return values;
}

std::optional<RegistryValue> RegistryKey::GetValue(std::wstring_view name) const {
  if (!m_key || name.find(L'\0') != std::wstring_view::npos) return std::nullopt;
  const std::wstring terminated(name);
  RegistryValue value{LowerCase(name), 0, std::string(256, '\0')};
  LSTATUS status = ERROR_MORE_DATA;
  for (int retry = 0; status == ERROR_MORE_DATA && retry < kMostRetries; ++retry) {
    DWORD type = 0;
    DWORD size = static_cast<DWORD>(value.data.size());
    status = RegQueryValueExW(m_key.Get(), terminated.c_str(), nullptr, &type,
                              reinterpret_cast<BYTE*>(value.data.data()), &size);
    value.type = type;
    value.data.resize(size);
  }
  if (status == ERROR_SUCCESS) return value;
  if (status != ERROR_FILE_NOT_FOUND) {
    LOG_ERROR(kGetValue, L"RegQueryValueEx of %s failed with code %u", terminated.c_str(), static_cast<DWORD>(status));
  }
  return std::nullopt;
}

std::vector<std::wstring> RegistryKey::SubkeyNames() const {
  std::vector<std::wstring> names;
  constexpr DWORD kLongestName = 255;
  for (DWORD i = 0;; ++i) {
    wchar_t name[kLongestName + 1] = {};
    DWORD length = kLongestName + 1;
    const LSTATUS status = RegEnumKeyExW(m_key.Get(), i, name, &length, nullptr, nullptr, nullptr, nullptr);
    if (status == ERROR_NO_MORE_ITEMS) break;
    if (status != ERROR_SUCCESS) {
      LOG_ERROR(kWalkSubkeys, L"RegEnumKeyEx failed with code %u", static_cast<DWORD>(status));
      break;
    }
    names.emplace_back(name, length);
  }
  return names;
}

void RegistryKey::WalkSubkeys(const SubkeyCallback& callback) const {
  if (!m_key) return;
  for (const std::wstring& name : SubkeyNames()) {
    if (!callback(name)) return;
  }
}

RegistryKey RegistryKey::OpenSubkey(std::wstring_view name) const {
  return {m_key.Get(), name, m_access, 0};
}

bool RegistryKey::IsLink(std::wstring_view name) const {
  const RegistryKey subkey(m_key.Get(), name, m_access, REG_OPTION_OPEN_LINK);
  DWORD type = REG_NONE;
  return subkey.m_key &&
         RegQueryValueExW(subkey.m_key.Get(), L"SymbolicLinkValue", nullptr, &type, nullptr, nullptr) ==
             ERROR_SUCCESS &&
         type == REG_LINK;
}

}  // namespace utils
