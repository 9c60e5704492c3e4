#include "systeminfo/trust_check.h"

#include <softpub.h>

#include <algorithm>
#include <array>
#include <iterator>
#include <mutex>
#include <optional>
#include <string>

#include "core/files.h"
#include "core/hex.h"
#include "core/logging.h"
#include "core/text.h"
#include "systeminfo/catalog_loader.h"

namespace {

constexpr wchar_t kScope[] = L"CertVerifier::CertTrustVer";
constexpr size_t kLongestHash = 100;

// All of them have to be there, though a check takes only two: a library without the others is not the system's.
constexpr const char* kCryptographyExports[] = {"CertOpenStore", "CertCloseStore", "CertGetCertificateContextProperty",
                                                "CertFindCertificateInStore", "CertFreeCertificateContext"};
constexpr const char* kTrustExports[] = {"CryptCATAdminAcquireContext",
                                         "CryptCATAdminReleaseContext",
                                         "CryptCATAdminCalcHashFromFileHandle",
                                         "CryptCATAdminEnumCatalogFromHash",
                                         "CryptCATCatalogInfoFromContext",
                                         "CryptCATAdminReleaseCatalogContext",
                                         "WinVerifyTrust",
                                         "WTHelperProvDataFromStateData",
                                         "WTHelperGetProvSignerFromChain",
                                         "WTHelperGetProvCertFromChain"};

template <size_t count>
bool HasAll(const DynamicLibrary& library, const char* const (&names)[count]) {
  return std::all_of(std::begin(names), std::end(names), [&](const char* name) {
    if (library.Resolve<FARPROC>(name) != nullptr) return true;
    LOG_ERROR(kScope, L"%S is not to be had, no file counts as signed", name);
    return false;
  });
}

// Catalog hash and trust check read by the handle. One without the right to, as its opener may have wanted, would make
// every file look bad.
bool CanRead(HANDLE file) {
  char nothing = 0;
  DWORD count = 0;
  return file != nullptr && file != INVALID_HANDLE_VALUE && ReadFile(file, &nothing, 0, &count, nullptr);
}

std::optional<std::string> CatalogHash(const TrustCalls& calls, HANDLE file) {
  std::array<BYTE, kLongestHash> hash{};
  DWORD length = kLongestHash;
  if (!calls.hashOf(file, &length, hash.data(), 0) || length > hash.size()) return std::nullopt;
  return std::string(reinterpret_cast<const char*>(hash.data()), length);
}

}  // namespace

CertVerifier::CertVerifier(const TrustCalls& calls, std::unique_ptr<CatalogHashIndex> index)
    : m_state(State::kReady), m_calls(calls), m_index(std::move(index)) {}

bool CertVerifier::IsReady() {
  if (m_state == State::kNew) {
    const std::lock_guard lock(m_initialization);
    // cppcheck-suppress identicalInnerCondition ; another thread may have been here before this one had the lock
    if (m_state == State::kNew) {
      const bool isBound = BindLibraries();
      if (isBound) m_index = LoadCatalogHashIndex();
      m_state = isBound ? State::kReady : State::kFailed;
    }
  }
  return m_state == State::kReady;
}

bool CertVerifier::BindLibraries() {
  m_kernel = DynamicLibrary(L"KERNEL32.DLL");
  m_trust = DynamicLibrary(L"WINTRUST.DLL");
  m_cryptography = DynamicLibrary(L"CRYPT32.DLL");
  if (m_kernel && HasAll(m_cryptography, kCryptographyExports) && HasAll(m_trust, kTrustExports)) {
    m_calls.hashOf = m_trust.Resolve<decltype(m_calls.hashOf)>("CryptCATAdminCalcHashFromFileHandle");
    m_calls.verify = m_trust.Resolve<decltype(m_calls.verify)>("WinVerifyTrust");
    return true;
  }
  m_kernel = DynamicLibrary();
  m_trust = DynamicLibrary();
  m_cryptography = DynamicLibrary();
  return false;
}

bool CertVerifier::CertTrustVer(const wchar_t* path, HANDLE file) {
  if (!IsReady()) return false;
  if (path == nullptr && (file == nullptr || file == INVALID_HANDLE_VALUE)) {
    LOG_TRACE(kScope, L"Both file and hFile are null or invalid!");
    return false;
  }
  if (path != nullptr && !CanRead(file)) file = nullptr;
  if (!m_index) return VerifyFile(path, file);

  KernelHandle own;
  if (path != nullptr && file == nullptr) {
    LOG_TRACE(kScope, L"CreateFile(%s)", path);
    own.Reset(CreateFileW(ExtendedPath(path).c_str(), GENERIC_READ,
                          FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE, nullptr, OPEN_EXISTING,
                          FILE_ATTRIBUTE_NORMAL, nullptr));
    if (!own) return false;
  }
  const auto hash = CatalogHash(m_calls, own ? own.Get() : file);
  own.Reset();
  const std::wstring* const catalog = hash ? m_index->Find(*hash) : nullptr;
  return catalog != nullptr ? VerifyMember(path, file, *catalog, *hash) : VerifyFile(path, file);
}

bool CertVerifier::VerifyMember(const wchar_t* path, HANDLE file, const std::wstring& catalog,
                                std::string_view hash) const {
  std::string bytes(hash);
  auto* const first = reinterpret_cast<BYTE*>(bytes.data());
  const std::wstring tag = ToWide(HexText({first, bytes.size()}, HexCase::kUpper));
  WINTRUST_CATALOG_INFO info{};
  info.cbStruct = sizeof info;
  info.pcwszCatalogFilePath = catalog.c_str();
  info.pcwszMemberTag = tag.c_str();
  info.pcwszMemberFilePath = path;
  info.hMemberFile = file;
  info.pbCalculatedFileHash = first;
  info.cbCalculatedFileHash = static_cast<DWORD>(bytes.size());
  WINTRUST_DATA data{};
  data.dwUnionChoice = WTD_CHOICE_CATALOG;
  data.pCatalog = &info;
  data.dwProvFlags = WTD_SAFER_FLAG | WTD_CACHE_ONLY_URL_RETRIEVAL;
  return Verify(data);
}

bool CertVerifier::VerifyFile(const wchar_t* path, HANDLE file) const {
  WINTRUST_FILE_INFO info{};
  info.cbStruct = sizeof info;
  info.pcwszFilePath = path;
  info.hFile = file;
  WINTRUST_DATA data{};
  data.dwUnionChoice = WTD_CHOICE_FILE;
  data.pFile = &info;
  data.dwProvFlags = WTD_CACHE_ONLY_URL_RETRIEVAL;
  return Verify(data);
}

bool CertVerifier::Verify(WINTRUST_DATA& data) const {
  GUID action = WINTRUST_ACTION_GENERIC_VERIFY_V2;
  data.cbStruct = sizeof data;
  data.dwUIChoice = WTD_UI_NONE;
  data.fdwRevocationChecks = WTD_REVOKE_NONE;
  data.dwStateAction = WTD_STATEACTION_VERIFY;
  const LONG status = m_calls.verify(nullptr, &action, &data);
  data.dwStateAction = WTD_STATEACTION_CLOSE;
  m_calls.verify(static_cast<HWND>(INVALID_HANDLE_VALUE), &action, &data);
  return status == 0;
}
