#include "systeminfo/library_loader_cache.h"

#include <cstddef>
#include <optional>
#include <string_view>
#include <utility>

#include "core/dynamic_library.h"
#include "core/logging.h"
#include "systeminfo/message_table.h"
#include "systeminfo/utils/folder_variables.h"
#include "systeminfo/utils/registry_key.h"

namespace systeminfo {
namespace {

constexpr wchar_t kLoad[] = L"systeminfo::LibraryLoaderCache::Load";
constexpr wchar_t kTryLoad[] = L"systeminfo::LibraryLoaderCache::TryLoad";

// All of the memory can be read.
bool IsReadable(const char* memory, size_t size) {
  for (size_t checked = 0; checked < size;) {
    MEMORY_BASIC_INFORMATION region{};
    if (VirtualQuery(memory + checked, &region, sizeof region) == 0) return false;
    if (region.State != MEM_COMMIT || (region.Protect & (PAGE_NOACCESS | PAGE_GUARD)) != 0) return false;
    checked = static_cast<size_t>(static_cast<const char*>(region.BaseAddress) + region.RegionSize - memory);
  }
  return true;
}

BOOL CALLBACK CheckMessageTable(HMODULE module, LPCWSTR type, LPCWSTR name, WORD language, LONG_PTR isSound) {
  const HRSRC resource = FindResourceExW(module, type, name, language);
  const HGLOBAL loaded = resource == nullptr ? nullptr : LoadResource(module, resource);
  const auto* bytes = loaded == nullptr ? nullptr : static_cast<const char*>(LockResource(loaded));
  if (bytes == nullptr) return TRUE;  // the system does not find it either
  const std::string_view table(bytes, SizeofResource(module, resource));
  if (IsReadable(table.data(), table.size()) && IsSoundMessageTable(table)) return TRUE;
  *reinterpret_cast<bool*>(isSound) = false;
  return FALSE;
}

// FormatMessage looks at the table of number 1 in some language, of the library or of its language file.
bool HasSoundMessageTables(HMODULE module) {
  bool isSound = true;
  EnumResourceLanguagesExW(module, MAKEINTRESOURCEW(11) /* RT_MESSAGETABLE */, MAKEINTRESOURCEW(1), &CheckMessageTable,
                           reinterpret_cast<LONG_PTR>(&isSound), RESOURCE_ENUM_LN | RESOURCE_ENUM_MUI, 0);
  return isSound;
}

}  // namespace

LibraryLoaderCache::~LibraryLoaderCache() {
  LOG_TRACE(L"systeminfo::LibraryLoaderCache::~LibraryLoaderCache", L"Free loaded libraries");
}

void LibraryLoaderCache::SetLogName(std::wstring logName) {
  m_logName = std::move(logName);
  m_absent.clear();
}

bool LibraryLoaderCache::Load(const std::wstring& source) {
  if (m_loaded.contains(source)) return true;
  if (m_absent.contains(source)) return false;
  if (LoadFromRegistry(source)) return true;
  m_absent.insert(source);
  return false;
}

bool LibraryLoaderCache::LoadFromRegistry(const std::wstring& source) {
  const utils::RegistryKey key(HKEY_LOCAL_MACHINE,
                               L"SYSTEM\\CurrentControlSet\\Services\\Eventlog\\" + m_logName + L"\\" + source);
  const std::optional<utils::RegistryValue> file = key.GetValue(L"EventMessageFile");
  if (!file || (file->type != REG_SZ && file->type != REG_EXPAND_SZ)) {
    LOG_TRACE(kLoad, L"Failed to load regKey for source %s", source.c_str());
    return false;
  }
  const std::wstring& path = m_paths[source] = utils::ExpandFolderVariables(utils::StoredText(file->data));
  return TryLoad(source, path);
}

bool LibraryLoaderCache::TryLoad(const std::wstring& source, const std::wstring& path) {
  ScopedModule module = LoadLibraryQuietly(path.c_str(), LOAD_LIBRARY_AS_DATAFILE | LOAD_LIBRARY_AS_IMAGE_RESOURCE);
  if (!module) {
    const DWORD error = GetLastError();
    LOG_TRACE(kTryLoad, L"Failed to load library from path %s", path.c_str());
    LOG_TRACE(kTryLoad, L"error %u", error);
    return false;
  }
  if (!HasSoundMessageTables(module.Get())) {
    LOG_WARNING(kTryLoad, L"The message table of %s is damaged; it is not used", path.c_str());
    return false;
  }
  m_loaded.insert_or_assign(source, std::move(module));
  return true;
}

HMODULE LibraryLoaderCache::Find(const std::wstring& source) const {
  const auto found = m_loaded.find(source);
  return found == m_loaded.end() ? nullptr : found->second.Get();
}

std::wstring GetMessageString(HMODULE module, DWORD eventId) {
  constexpr DWORD kFlags = FORMAT_MESSAGE_ALLOCATE_BUFFER | FORMAT_MESSAGE_IGNORE_INSERTS |
                           FORMAT_MESSAGE_FROM_HMODULE | FORMAT_MESSAGE_FROM_SYSTEM;
  LocalMemory<wchar_t> text;
  // With the flag ALLOCATE_BUFFER the parameter is where the address of the text goes, whatever its type says.
  const DWORD length =
      FormatMessageW(kFlags, module, eventId, 0, reinterpret_cast<wchar_t*>(text.Receive()), 0, nullptr);
  if (length == 0) {
    const DWORD error = GetLastError();
    LOG_TRACE(L"systeminfo::GetMessageString", L"Format message failed with %lu", error);
    return {};
  }
  return {text.Get(), length};
}

}  // namespace systeminfo
