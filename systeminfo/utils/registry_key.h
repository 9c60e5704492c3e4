// Read access to the registry: a key named by one path, its values, its subkeys. Whoever reads the registry does it
// through here, so that one place knows how values that change while they are read are handled. A key may be used by
// one thread at a time.
#pragma once

#include <windows.h>

#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "core/scoped.h"
#include "systeminfo/utils/registry_value.h"

namespace utils {

// Whose registry is seen where 32-bit programs have one of their own. kNative: the view of this program, which is a
// 64-bit one; the other part shows as "Wow6432Node" there.
enum class RegistryView { kNative, k64Bit, k32Bit };

class RegistryKey {
 public:
  // `path` is a hive, a backslash and the path below it: "HKLM\Software\x". The hives, exactly as written here:
  // HKEY_CLASSES_ROOT or HKCR, HKEY_CURRENT_USER or HKCU, HKEY_LOCAL_MACHINE or HKLM, HKEY_USERS,
  // HKEY_CURRENT_CONFIG or HKCC. A hive alone is the hive itself.
  explicit RegistryKey(std::wstring_view path, RegistryView view = RegistryView::kNative);

  // Below a predefined key.
  RegistryKey(HKEY hive, std::wstring_view path, RegistryView view = RegistryView::kNative);

  // False when the key could not be opened; it has no values and no subkeys then. Nothing is logged of it: whether
  // that is an error, the caller knows.
  explicit operator bool() const { return m_openError == ERROR_SUCCESS; }
  DWORD OpenError() const { return m_openError; }
  // For who takes an absent key for an ordinary thing: logs any other reason why this one, `path`, is not open.
  void LogUnlessAbsent(const wchar_t* function, std::wstring_view path) const;

  // All values, their names in lower case, in the system's order. A failure is logged, and what was read until then is
  // returned.
  std::vector<RegistryValue> GetValues() const;

  // One value; `name` in any case, empty for the default value. Empty when there is none, or, which is logged, when it
  // cannot be read.
  std::optional<RegistryValue> GetValue(std::wstring_view name) const;

  // Hands the name of every subkey to the callback until it returns false. The names are read before the first call,
  // so that the callback may do with the key what it likes. A failure is logged.
  using SubkeyCallback = std::function<bool(const std::wstring& name)>;
  void WalkSubkeys(const SubkeyCallback& callback) const;

  // In the same view.
  RegistryKey OpenSubkey(std::wstring_view name) const;

  // The subkey is a symbolic link to another key, which is what OpenSubkey opens.
  bool IsLink(std::wstring_view name) const;

 private:
  RegistryKey(HKEY parent, std::wstring_view path, REGSAM access, DWORD options);
  std::vector<std::wstring> SubkeyNames() const;

  RegistryKeyHandle m_key;
  REGSAM m_access = KEY_READ;
  DWORD m_openError = ERROR_SUCCESS;
};

}  // namespace utils
