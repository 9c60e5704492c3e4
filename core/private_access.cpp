#include "core/private_access.h"

#include <aclapi.h>
#include <sddl.h>

#include <string>
#include <vector>

#include "core/files.h"

namespace {

constexpr wchar_t kInheritedByAll[] = L"OICI";

// The token's user; empty when the system does not tell it.
std::vector<std::byte> CurrentUser() {
  KernelHandle token;
  if (!OpenProcessToken(GetCurrentProcess(), TOKEN_QUERY, token.Receive())) return {};
  DWORD size = 0;
  GetTokenInformation(token.Get(), TokenUser, nullptr, 0, &size);
  std::vector<std::byte> user(size);
  if (!GetTokenInformation(token.Get(), TokenUser, user.data(), size, &size)) return {};
  return user;
}

PSID SidOf(const std::vector<std::byte>& user) {
  return reinterpret_cast<const TOKEN_USER*>(user.data())->User.Sid;
}

// Whether the owner of a thing is one of those to whom its rights belong anyway.
bool IsTrustedOwner(PSID owner) {
  const std::vector<std::byte> user = CurrentUser();
  return !user.empty() && (EqualSid(owner, SidOf(user)) || IsWellKnownSid(owner, WinBuiltinAdministratorsSid) ||
                           IsWellKnownSid(owner, WinLocalSystemSid));
}

}  // namespace

PrivateAccess::PrivateAccess(const wchar_t* inheritance) {
  const std::vector<std::byte> user = CurrentUser();
  LocalMemory<wchar_t> sid;
  if (user.empty() || !ConvertSidToStringSidW(SidOf(user), sid.Receive())) {
    m_error = GetLastError();
    return;
  }
  std::wstring list = L"D:P";
  for (const wchar_t* trustee : {L"SY", L"BA", static_cast<const wchar_t*>(sid.Get())})
    list += std::wstring(L"(A;") + inheritance + L";FA;;;" + trustee + L")";
  if (!ConvertStringSecurityDescriptorToSecurityDescriptorW(list.c_str(), SDDL_REVISION_1, m_descriptor.Receive(),
                                                            nullptr)) {
    m_error = GetLastError();
  }
  m_attributes.lpSecurityDescriptor = m_descriptor.Get();
}

PrivateAccess PrivateAccess::OfFile() {
  return PrivateAccess(L"");
}

PrivateAccess PrivateAccess::OfFolder() {
  return PrivateAccess(kInheritedByAll);
}

DWORD CreatePrivateFolder(std::wstring_view path) {
  const PrivateAccess rights = PrivateAccess::OfFolder();
  if (rights.Error() != ERROR_SUCCESS) return rights.Error();
  return CreateDirectoryW(ExtendedPath(path).c_str(), rights.Attributes()) ? ERROR_SUCCESS : GetLastError();
}

DWORD CreatePrivateFolders(std::wstring_view path) {
  const std::wstring full = ExtendedPath(path);
  if (FolderExists(full)) return ERROR_SUCCESS;
  DWORD error = CreateFolders(full.substr(0, full.find_last_of(L'\\')));
  if (error == ERROR_SUCCESS) error = CreatePrivateFolder(full);
  return error == ERROR_ALREADY_EXISTS && FolderExists(full) ? ERROR_SUCCESS : error;
}

DWORD MakeFolderPrivate(std::wstring_view path) {
  const KernelHandle folder(CreateFileW(ExtendedPath(path).c_str(), READ_CONTROL | WRITE_DAC | FILE_READ_ATTRIBUTES,
                                        FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE, nullptr, OPEN_EXISTING,
                                        FILE_FLAG_BACKUP_SEMANTICS | FILE_FLAG_OPEN_REPARSE_POINT, nullptr));
  BY_HANDLE_FILE_INFORMATION info{};
  if (!folder || !GetFileInformationByHandle(folder.Get(), &info)) return GetLastError();
  constexpr DWORD kKind = FILE_ATTRIBUTE_DIRECTORY | FILE_ATTRIBUTE_REPARSE_POINT;
  if ((info.dwFileAttributes & kKind) != FILE_ATTRIBUTE_DIRECTORY) return ERROR_ACCESS_DENIED;
  PSID owner = nullptr;
  LocalMemory<void> descriptor;
  if (const DWORD error = GetSecurityInfo(folder.Get(), SE_FILE_OBJECT, OWNER_SECURITY_INFORMATION, &owner, nullptr,
                                          nullptr, nullptr, descriptor.Receive())) {
    return error;
  }
  if (owner == nullptr || !IsTrustedOwner(owner)) return ERROR_ACCESS_DENIED;
  const PrivateAccess rights = PrivateAccess::OfFolder();
  if (rights.Error() != ERROR_SUCCESS) return rights.Error();
  BOOL isPresent = FALSE;
  BOOL isDefaulted = FALSE;
  PACL list = nullptr;
  if (!GetSecurityDescriptorDacl(rights.Attributes()->lpSecurityDescriptor, &isPresent, &list, &isDefaulted)) {
    return GetLastError();
  }
  return SetSecurityInfo(folder.Get(), SE_FILE_OBJECT, DACL_SECURITY_INFORMATION | PROTECTED_DACL_SECURITY_INFORMATION,
                         nullptr, nullptr, list, nullptr);
}
