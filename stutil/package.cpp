#include "stutil/package.h"

#include <cstddef>
#include <new>
#include <vector>

#include "core/files.h"
#include "core/logging.h"
#include "stutil/package_format.h"

namespace stutil {
namespace {

constexpr wchar_t kScope[] = L"stutil::Encrypt";
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

DWORD Seal(HCRYPTKEY publicKey, HCRYPTKEY sessionKey, std::string_view plain, std::string& package) {
  DWORD blobLength = 0;
  if (!CryptExportKey(sessionKey, publicKey, SIMPLEBLOB, CRYPT_OAEP, nullptr, &blobLength)) return FailedCall();
  const DWORD plainLength = static_cast<DWORD>(plain.size());
  DWORD cipherLength = plainLength;
  if (!CryptEncrypt(sessionKey, 0, TRUE, 0, nullptr, &cipherLength, plainLength)) return FailedCall();

  const size_t cipherOffset = kKeyBlobLengthSize + blobLength;
  package.reserve(cipherOffset + cipherLength);
  package = PackageHeader(blobLength);
  package.resize(cipherOffset);
  package += plain;
  package.resize(cipherOffset + cipherLength);

  DWORD exported = blobLength;
  BYTE* const bytes = reinterpret_cast<BYTE*>(package.data());
  if (!CryptExportKey(sessionKey, publicKey, SIMPLEBLOB, CRYPT_OAEP, bytes + kKeyBlobLengthSize, &exported)) {
    return FailedCall();
  }
  if (exported != blobLength) return static_cast<DWORD>(NTE_BAD_LEN);  // the package would not split where it says
  DWORD encrypted = plainLength;
  if (!CryptEncrypt(sessionKey, 0, TRUE, 0, bytes + cipherOffset, &encrypted, cipherLength)) return FailedCall();
  package.resize(cipherOffset + encrypted);
  return ERROR_SUCCESS;
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

DWORD EncryptBuffer(std::string_view publicKeyPem, std::string_view plain, std::string& package) {
  return FillOrEmpty(package, [&]() -> DWORD {
    if (plain.size() > MAXDWORD) return ERROR_FILE_TOO_LARGE;
    CryptoProvider provider;
    CryptoKey publicKey;
    CryptoKey sessionKey;
    DWORD error = OpenProvider(provider);
    if (error == ERROR_SUCCESS) error = ImportPublicKey(provider.Get(), publicKeyPem, publicKey);
    if (error == ERROR_SUCCESS) error = GenerateSessionKey(provider.Get(), sessionKey);
    if (error == ERROR_SUCCESS) error = Seal(publicKey.Get(), sessionKey.Get(), plain, package);
    return error;
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

namespace {

// Reads the archive and deletes it, even when it could not be read. False when there is nothing to encrypt.
bool TakeArchive(const std::wstring& path, std::string& bytes) {
  const DWORD readError = FillOrEmpty(bytes, [&] { return ReadWholeFile(path, MAXDWORD, bytes); });
  if (readError != ERROR_SUCCESS) {
    LOG_ERROR(kScope, L"failed to read compressed file %s err=%d", path.c_str(), readError);
    if (!PathExists(path)) return false;
  }
  const DWORD deleteError = DeleteFileW(ExtendedPath(path).c_str()) ? ERROR_SUCCESS : GetLastError();
  if (deleteError != ERROR_SUCCESS) {
    LOG_WARNING(kScope, L"failed to remove compressed file %s err=%d", path.c_str(), deleteError);
  } else if (readError == ERROR_SUCCESS) {
    LOG_TRACE(kScope, L"compressed file was deleted after being read into memory");
  }
  return readError == ERROR_SUCCESS;
}

}  // namespace

void Encrypt(const std::wstring& archivePath) {
  Encrypt(archivePath, GetBuiltInPublicKey());
}

void Encrypt(const std::wstring& archivePath, std::string_view publicKeyPem) {
  LOG_TRACE(kScope, L"-> encrypt");
  std::string plain;
  if (!TakeArchive(archivePath, plain)) return;
  std::string package;
  if (const DWORD error = EncryptBuffer(publicKeyPem, plain, package); error != ERROR_SUCCESS) {
    LOG_ERROR(kScope, L"Encrypt failed with %d", error);
    return;
  }
  LOG_TRACE(kScope, L"writing encrypted buffer to file");
  if (const DWORD error = WriteWholeFile(archivePath, package); error != ERROR_SUCCESS) {
    LOG_ERROR(kScope, L"failed to write package %s err=%d", archivePath.c_str(), error);
    return;
  }
  LOG_TRACE(kScope, L"<- encrypt");
}

}  // namespace stutil
