#include "stutil/package.h"

#include <cstddef>
#include <new>
#include <vector>

#include "stutil/package_format.h"
#include "stutil/package_sealer.h"

namespace stutil {
namespace {

constexpr wchar_t kProviderName[] = L"Microsoft Base Cryptographic Provider v1.0";
constexpr size_t kSaltSize = 11;  // of a 40-bit key: key and salt are 16 bytes together

// The error of the call that just failed; never 0, which would pass for success.
DWORD FailedCall() {
  const DWORD error = GetLastError();
  return error == ERROR_SUCCESS ? static_cast<DWORD>(NTE_FAIL) : error;
}

// Bytes of a decoded key. Wiped when they go: a private key does not stay behind in freed memory.
class KeyBytes {
 public:
  KeyBytes() = default;
  KeyBytes(const KeyBytes&) = delete;
  KeyBytes& operator=(const KeyBytes&) = delete;
  ~KeyBytes() { SecureZeroMemory(m_bytes.data(), m_bytes.size()); }

  void Resize(DWORD size) { m_bytes.resize(size); }
  BYTE* Data() { return m_bytes.data(); }
  DWORD Size() const { return static_cast<DWORD>(m_bytes.size()); }

 private:
  std::vector<BYTE> m_bytes;
};

DWORD OpenProvider(CryptoProvider& provider) {
  // Verify-only: without a key container on the disk, which would outlive the program.
  if (!CryptAcquireContextW(provider.Receive(), nullptr, kProviderName, PROV_RSA_FULL, CRYPT_VERIFYCONTEXT)) {
    return FailedCall();
  }
  return ERROR_SUCCESS;
}

DWORD DecodePem(std::string_view pem, KeyBytes& der) {
  if (pem.empty()) return ERROR_INVALID_DATA;  // Windows would take a length of 0 for "zero-terminated"
  if (pem.size() > MAXDWORD) return ERROR_FILE_TOO_LARGE;
  const DWORD length = static_cast<DWORD>(pem.size());
  DWORD size = 0;
  if (!CryptStringToBinaryA(pem.data(), length, CRYPT_STRING_BASE64HEADER, nullptr, &size, nullptr, nullptr)) {
    return FailedCall();
  }
  der.Resize(size);
  if (!CryptStringToBinaryA(pem.data(), length, CRYPT_STRING_BASE64HEADER, der.Data(), &size, nullptr, nullptr)) {
    return FailedCall();
  }
  der.Resize(size);
  return ERROR_SUCCESS;
}

// `type` is one of the system's numbered structures; `decoded` holds it and whatever it points to.
DWORD DecodePemAs(LPCSTR type, std::string_view pem, KeyBytes& decoded) {
  KeyBytes der;
  if (const DWORD error = DecodePem(pem, der); error != ERROR_SUCCESS) return error;
  DWORD size = 0;
  if (!CryptDecodeObjectEx(X509_ASN_ENCODING, type, der.Data(), der.Size(), 0, nullptr, nullptr, &size)) {
    return FailedCall();
  }
  decoded.Resize(size);
  if (!CryptDecodeObjectEx(X509_ASN_ENCODING, type, der.Data(), der.Size(), 0, nullptr, decoded.Data(), &size)) {
    return FailedCall();
  }
  decoded.Resize(size);
  return ERROR_SUCCESS;
}

DWORD GenerateSessionKey(HCRYPTPROV provider, CryptoKey& key) {
  // No key length in the upper half of the flags: the provider's own, 40 bits.
  if (!CryptGenKey(provider, CALG_RC4, CRYPT_EXPORTABLE, key.Receive())) return FailedCall();
  // This provider's keys of 40 bits are salted with 11 zero bytes, and the salt does not travel with the exported key.
  // Saying so here makes every package open everywhere, also when the system gives a generated key a random salt.
  constexpr BYTE kZeroSalt[kSaltSize] = {};
  if (!CryptSetKeyParam(key.Get(), KP_SALT, kZeroSalt, 0)) return FailedCall();
  return ERROR_SUCCESS;
}

// The length of the wrapped session key and the wrapped session key.
DWORD WriteHead(HCRYPTKEY publicKey, HCRYPTKEY sessionKey, std::string& head) {
  DWORD blobLength = 0;
  if (!CryptExportKey(sessionKey, publicKey, SIMPLEBLOB, CRYPT_OAEP, nullptr, &blobLength)) return FailedCall();
  head = PackageHeader(blobLength);
  head.resize(kKeyBlobLengthSize + blobLength);
  DWORD exported = blobLength;
  BYTE* const blob = reinterpret_cast<BYTE*>(head.data()) + kKeyBlobLengthSize;
  if (!CryptExportKey(sessionKey, publicKey, SIMPLEBLOB, CRYPT_OAEP, blob, &exported)) return FailedCall();
  // Otherwise the package would not split where it says.
  return exported == blobLength ? ERROR_SUCCESS : static_cast<DWORD>(NTE_BAD_LEN);
}

DWORD Open(HCRYPTPROV provider, HCRYPTKEY privateKey, const PackageParts& parts, std::string& plain) {
  if (parts.cipherText.size() > MAXDWORD) return ERROR_FILE_TOO_LARGE;
  CryptoKey sessionKey;
  if (!CryptImportKey(provider, reinterpret_cast<const BYTE*>(parts.keyBlob.data()),
                      static_cast<DWORD>(parts.keyBlob.size()), privateKey, CRYPT_OAEP, sessionKey.Receive())) {
    return FailedCall();
  }
  plain = parts.cipherText;
  DWORD length = static_cast<DWORD>(plain.size());
  // CRYPT_OAEP means nothing to a stream cipher; it belongs to the format's description and is kept.
  if (!CryptDecrypt(sessionKey.Get(), 0, TRUE, CRYPT_OAEP, reinterpret_cast<BYTE*>(plain.data()), &length)) {
    return FailedCall();
  }
  plain.resize(length);
  return ERROR_SUCCESS;
}

// Runs `work`, which fills `output`; makes running out of memory an error number, and a failure's output empty.
template <class Work>
DWORD FillOrEmpty(std::string& output, Work work) {
  DWORD error = ERROR_NOT_ENOUGH_MEMORY;
  output.clear();
  try {
    error = work();
  } catch (const std::bad_alloc&) {
    error = ERROR_NOT_ENOUGH_MEMORY;
  }
  if (error != ERROR_SUCCESS) std::string().swap(output);
  return error;
}

}  // namespace

DWORD ImportPublicKey(HCRYPTPROV provider, std::string_view pem, CryptoKey& key) {
  KeyBytes decoded;
  if (const DWORD error = DecodePemAs(X509_PUBLIC_KEY_INFO, pem, decoded); error != ERROR_SUCCESS) return error;
  auto* const info = reinterpret_cast<CERT_PUBLIC_KEY_INFO*>(decoded.Data());
  return CryptImportPublicKeyInfo(provider, X509_ASN_ENCODING, info, key.Receive()) ? ERROR_SUCCESS : FailedCall();
}

DWORD ImportPrivateKey(HCRYPTPROV provider, std::string_view pem, CryptoKey& key) {
  KeyBytes blob;
  if (const DWORD error = DecodePemAs(PKCS_RSA_PRIVATE_KEY, pem, blob); error != ERROR_SUCCESS) return error;
  return CryptImportKey(provider, blob.Data(), blob.Size(), 0, 0, key.Receive()) ? ERROR_SUCCESS : FailedCall();
}

DWORD PackageSealer::Begin(std::string_view publicKeyPem, std::string& head) {
  DWORD error = OpenProvider(m_provider);
  if (error == ERROR_SUCCESS) error = ImportPublicKey(m_provider.Get(), publicKeyPem, m_publicKey);
  if (error == ERROR_SUCCESS) error = GenerateSessionKey(m_provider.Get(), m_sessionKey);
  if (error == ERROR_SUCCESS) error = WriteHead(m_publicKey.Get(), m_sessionKey.Get(), head);
  return error;
}

DWORD PackageSealer::EncryptInPlace(char* bytes, size_t count, bool isLast) const {
  if (count > MAXDWORD) return ERROR_FILE_TOO_LARGE;
  const DWORD length = static_cast<DWORD>(count);
  DWORD encrypted = length;
  // A stream cipher: the buffer need not be larger than the plain bytes.
  if (!CryptEncrypt(m_sessionKey.Get(), 0, isLast, 0, reinterpret_cast<BYTE*>(bytes), &encrypted, length)) {
    return FailedCall();
  }
  return encrypted == length ? ERROR_SUCCESS : static_cast<DWORD>(NTE_BAD_LEN);
}

DWORD EncryptBuffer(std::string_view publicKeyPem, std::string_view plain, std::string& package) {
  return FillOrEmpty(package, [&] {
    PackageSealer sealer;
    std::string head;
    if (const DWORD error = sealer.Begin(publicKeyPem, head); error != ERROR_SUCCESS) return error;
    package.reserve(head.size() + plain.size());
    package.append(head).append(plain);
    return sealer.EncryptInPlace(package.data() + head.size(), plain.size(), true);
  });
}

DWORD DecryptBuffer(std::string_view privateKeyPem, std::string_view package, std::string& plain) {
  return FillOrEmpty(plain, [&]() -> DWORD {
    CryptoProvider provider;
    CryptoKey privateKey;
    DWORD error = OpenProvider(provider);
    if (error == ERROR_SUCCESS) error = ImportPrivateKey(provider.Get(), privateKeyPem, privateKey);
    if (error != ERROR_SUCCESS) return error;
    const auto parts = SplitPackage(package);
    // What the import says to a key blob that is cut off. It cannot be asked: it would read behind the package.
    if (!parts) return static_cast<DWORD>(NTE_BAD_DATA);
    return Open(provider.Get(), privateKey.Get(), *parts, plain);
  });
}

}  // namespace stutil
