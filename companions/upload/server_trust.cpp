#include "companions/upload/server_trust.h"

#include <algorithm>

namespace qxlink {
namespace {

constexpr std::string_view kPemBegin = "-----BEGIN CERTIFICATE-----";
constexpr std::string_view kPemEnd = "-----END CERTIFICATE-----";

DWORD DecodePem(std::string_view pem, std::vector<BYTE>& der) {
  DWORD size = 0;
  const auto length = static_cast<DWORD>(pem.size());
  if (!CryptStringToBinaryA(pem.data(), length, CRYPT_STRING_BASE64HEADER, nullptr, &size, nullptr, nullptr)) {
    return GetLastError();
  }
  der.resize(size);
  const BOOL done =
      CryptStringToBinaryA(pem.data(), length, CRYPT_STRING_BASE64HEADER, der.data(), &size, nullptr, nullptr);
  der.resize(size);
  return done ? ERROR_SUCCESS : GetLastError();
}

}  // namespace

DWORD ServerTrust::Add(const std::vector<BYTE>& der) {
  const BOOL done =
      CertAddEncodedCertificateToStore(m_store.Get(), X509_ASN_ENCODING, der.data(), static_cast<DWORD>(der.size()),
                                       CERT_STORE_ADD_USE_EXISTING, nullptr);
  return done ? ERROR_SUCCESS : GetLastError();
}

DWORD ServerTrust::Load(std::string_view bytes) {
  m_engine.Reset();
  m_store.Reset(CertOpenStore(CERT_STORE_PROV_MEMORY, 0, 0, 0, nullptr));
  if (!m_store) return GetLastError();
  size_t begin = bytes.find(kPemBegin);
  if (begin == std::string_view::npos) {
    if (const DWORD error = Add({bytes.begin(), bytes.end()}); error != ERROR_SUCCESS) return error;
  }
  while (begin != std::string_view::npos) {
    const size_t end = bytes.find(kPemEnd, begin);
    if (end == std::string_view::npos) return ERROR_INVALID_DATA;
    std::vector<BYTE> der;
    DWORD error = DecodePem(bytes.substr(begin, end + kPemEnd.size() - begin), der);
    if (error == ERROR_SUCCESS) error = Add(der);
    if (error != ERROR_SUCCESS) return error;
    begin = bytes.find(kPemBegin, end);
  }
  CERT_CHAIN_ENGINE_CONFIG config{};
  config.cbSize = FIELD_OFFSET(CERT_CHAIN_ENGINE_CONFIG, dwExclusiveFlags);  // the form of Windows 7: no flags
  config.hExclusiveRoot = m_store.Get();
  return CertCreateCertificateChainEngine(&config, m_engine.Receive()) ? ERROR_SUCCESS : GetLastError();
}

DWORD ServerTrust::Check(PCCERT_CONTEXT certificate, const std::wstring& host) const {
  char serverAuthentication[] = szOID_PKIX_KP_SERVER_AUTH;
  LPSTR usages[] = {serverAuthentication};
  CERT_CHAIN_PARA parameters{};
  parameters.cbSize = sizeof parameters;
  parameters.RequestedUsage.dwType = USAGE_MATCH_TYPE_AND;
  parameters.RequestedUsage.Usage.cUsageIdentifier = 1;
  parameters.RequestedUsage.Usage.rgpszUsageIdentifier = usages;
  CertificateChain chain;
  if (!CertGetCertificateChain(m_engine.Get(), certificate, nullptr, certificate->hCertStore, &parameters, 0, nullptr,
                               chain.Receive())) {
    return GetLastError();
  }
  // Also what the policy below might let pass: a chain that does not reach the file's certificates.
  if (chain.Get()->TrustStatus.dwErrorStatus != CERT_TRUST_NO_ERROR) return static_cast<DWORD>(CERT_E_CHAINING);
  std::wstring name = host;  // the interface is not const-correct
  SSL_EXTRA_CERT_CHAIN_POLICY_PARA server{};
  server.cbSize = sizeof server;
  server.dwAuthType = AUTHTYPE_SERVER;
  server.pwszServerName = name.data();
  CERT_CHAIN_POLICY_PARA policy{};
  policy.cbSize = sizeof policy;
  policy.pvExtraPolicyPara = &server;
  CERT_CHAIN_POLICY_STATUS status{};
  status.cbSize = sizeof status;
  if (!CertVerifyCertificateChainPolicy(CERT_CHAIN_POLICY_SSL, chain.Get(), &policy, &status)) return GetLastError();
  return status.dwError;
}

}  // namespace qxlink
