// The accounts that processes run under, as "domain\name". Asking for one can take long where the answer comes from
// another machine, so each security identifier is looked up once, also when the look-up fails. One thread at a time.
#pragma once

#include <windows.h>

#include <map>
#include <string>

namespace systeminfo {

class AccountNames {
 public:
  // Empty when the process or its token cannot be opened or the account has no name.
  std::wstring OfProcess(DWORD processId);

  // `sid` must be valid.
  const std::wstring& OfSid(PSID sid);

 private:
  std::map<std::string, std::wstring> m_names;  // by the bytes of the identifier
};

}  // namespace systeminfo
