// The access list of what holds collected data: the current user, the administrators and the system may do everything,
// nobody else anything, whatever the folder around it would grant.
#pragma once

#include <windows.h>

#include <string_view>

#include "core/scoped.h"

// For functions that create something.
class PrivateAccess {
 public:
  static PrivateAccess OfFile();
  static PrivateAccess OfFolder();  // what is made in it gets the same rights

  PrivateAccess() = default;  // no list of its own: inherited rights

  DWORD Error() const { return m_error; }  // why there is no list; 0 when there is one, or none was asked for

  // Valid as long as this object; null for inherited rights. The system only reads it.
  SECURITY_ATTRIBUTES* Attributes() const { return m_descriptor ? &m_attributes : nullptr; }

 private:
  explicit PrivateAccess(const wchar_t* inheritance);

  DWORD m_error = ERROR_SUCCESS;
  LocalMemory<void> m_descriptor;
  mutable SECURITY_ATTRIBUTES m_attributes{sizeof(SECURITY_ATTRIBUTES), nullptr, FALSE};
};

// One level, no parents. Only the current user, the administrators and the system may enter it.
DWORD CreatePrivateFolder(std::wstring_view path);

// The same with the parents that are missing, which inherit their rights. A folder that is there is fine, and keeps its
// rights.
DWORD CreatePrivateFolders(std::wstring_view path);

// Gives a folder that is there the rights of a private one. ERROR_ACCESS_DENIED when it is a link, or belongs to
// somebody who could take the rights back.
DWORD MakeFolderPrivate(std::wstring_view path);
