// Trust in a server by the certificates of one file, instead of by those that Windows trusts.
#pragma once

#include <windows.h>
// windows.h has to come first.
#include <wincrypt.h>

#include <string>
#include <string_view>
#include <vector>

#include "core/scoped.h"

namespace qxlink {

struct CertificateStoreTraits {
  using Type = HCERTSTORE;
  static bool IsValid(Type store) { return store != nullptr; }
  static void Close(Type store) { CertCloseStore(store, 0); }
};
using CertificateStore = Scoped<CertificateStoreTraits>;

struct CertificateTraits {
  using Type = PCCERT_CONTEXT;
  static bool IsValid(Type certificate) { return certificate != nullptr; }
  static void Close(Type certificate) { CertFreeCertificateContext(certificate); }
};
using Certificate = Scoped<CertificateTraits>;

struct ChainEngineTraits {
  using Type = HCERTCHAINENGINE;
  static bool IsValid(Type engine) { return engine != nullptr; }
  static void Close(Type engine) { CertFreeCertificateChainEngine(engine); }
};
using ChainEngine = Scoped<ChainEngineTraits>;

struct CertificateChainTraits {
  using Type = PCCERT_CHAIN_CONTEXT;
  static bool IsValid(Type chain) { return chain != nullptr; }
  static void Close(Type chain) { CertFreeCertificateChain(chain); }
};
using CertificateChain = Scoped<CertificateChainTraits>;

class ServerTrust {
 public:
  // Certificates as PEM, any number of them, or one as DER. Only authorities at the top of a chain (self-signed) count.
  // A Windows error number.
  DWORD Load(std::string_view bytes);

  // 0 when the certificate is for a server of this name, holds now and leads to a certificate of the file; else the
  // number of what is wrong (CERT_E_…).
  DWORD Check(PCCERT_CONTEXT certificate, const std::wstring& host) const;

 private:
  DWORD Add(const std::vector<BYTE>& der);

  CertificateStore m_store;
  ChainEngine m_engine;
};

}  // namespace qxlink
