#include "systeminfo/account_name.h"

#include <vector>

#include "core/logging.h"
#include "core/scoped.h"

namespace systeminfo {
namespace {

constexpr wchar_t kScope[] = L"systeminfo::ProcessCollector::GetProcessUserName";
constexpr DWORD kLongestName = 512;  // of an account or a domain, with the terminator

std::wstring LookUp(PSID sid) {
  wchar_t name[kLongestName] = {};
  wchar_t domain[kLongestName] = {};
  DWORD nameSize = kLongestName;
  DWORD domainSize = kLongestName;
  SID_NAME_USE use{};
  if (!LookupAccountSidW(nullptr, sid, name, &nameSize, domain, &domainSize, &use)) {
    LOG_TRACE(kScope, L"LookupAccountSid Error %u\n", GetLastError());
    return {};
  }
  return domain[0] == L'\0' ? std::wstring(name) : std::wstring(domain) + L'\\' + name;
}

}  // namespace

const std::wstring& AccountNames::OfSid(PSID sid) {
  const std::string key(static_cast<const char*>(sid), GetLengthSid(sid));
  const auto known = m_names.find(key);
  return known != m_names.end() ? known->second : m_names.emplace(key, LookUp(sid)).first->second;
}

std::wstring AccountNames::OfProcess(DWORD processId) {
  const KernelHandle process(OpenProcess(PROCESS_QUERY_LIMITED_INFORMATION, FALSE, processId));
  KernelHandle token;
  if (!process || !OpenProcessToken(process.Get(), TOKEN_QUERY, token.Receive())) {
    LOG_TRACE(kScope, L"the token of process %u cannot be opened, error %u", processId, GetLastError());
    return {};
  }
  DWORD size = 0;
  GetTokenInformation(token.Get(), TokenUser, nullptr, 0, &size);
  std::vector<TOKEN_USER> user(size / sizeof(TOKEN_USER) + 1);  // the identifier stands behind the first element
  if (!GetTokenInformation(token.Get(), TokenUser, user.data(), static_cast<DWORD>(user.size() * sizeof user[0]),
                           &size)) {
    LOG_TRACE(kScope, L"the token of process %u does not tell its user, error %u", processId, GetLastError());
    return {};
  }
  return OfSid(user[0].User.Sid);
}

}  // namespace systeminfo
