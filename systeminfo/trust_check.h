// Whether the system trusts a file: as a member of one of the system's catalogs, or by the signature in the file
// itself.
#pragma once

#include <windows.h>
// windows.h leaves it out under WIN32_LEAN_AND_MEAN; the others need it.
#include <wincrypt.h>
// After both.
#include <mscat.h>
#include <wintrust.h>

#include <atomic>
#include <memory>
#include <string_view>

#include "core/dynamic_library.h"
#include "core/lock.h"
#include "systeminfo/catalog_index.h"

// The two calls that a check makes.
struct TrustCalls {
  decltype(&CryptCATAdminCalcHashFromFileHandle) hashOf = nullptr;
  decltype(&WinVerifyTrust) verify = nullptr;
};

class CertVerifier {
 public:
  // Loads the libraries and the index of the catalogs when it is first asked. That takes a while, and is done once,
  // whether it succeeds or not.
  CertVerifier() = default;

  // Uses these calls, and no catalogs when `index` is null.
  CertVerifier(const TrustCalls& calls, std::unique_ptr<CatalogHashIndex> index);

  // True only when the system says so. One of the two may be missing (`path` null, `file` null or
  // INVALID_HANDLE_VALUE); the file is then found by the other. A handle without the right to read counts as missing.
  // The handle stays the caller's and open. Any number of threads at a time.
  bool CertTrustVer(const wchar_t* path, HANDLE file);

 private:
  enum class State { kNew, kReady, kFailed };

  bool IsReady();
  bool BindLibraries();
  bool VerifyMember(const wchar_t* path, HANDLE file, const std::wstring& catalog, std::string_view hash) const;
  bool VerifyFile(const wchar_t* path, HANDLE file) const;
  bool Verify(WINTRUST_DATA& data) const;

  std::atomic<State> m_state{State::kNew};
  SharedLock m_initialization;
  DynamicLibrary m_kernel, m_trust, m_cryptography;
  TrustCalls m_calls;
  std::unique_ptr<CatalogHashIndex> m_index;
};
