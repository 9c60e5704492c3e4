// Encrypted packages: an archive encrypted with a fresh RC4 session key, which travels in the package, wrapped with an
// RSA public key. Only the holder of the private key can open one. All cryptography is the CryptoAPI provider
// "Microsoft Base Cryptographic Provider v1.0"; stutil/package_format.h describes the bytes.
//
// The functions are independent of each other and may run on any thread. Those that return a DWORD return 0 or the
// system's error number, leave their output empty then, and do not log: their callers do, in their own words.
#pragma once

#include <string>
#include <string_view>

#include "stutil/crypto_handles.h"

namespace stutil {

// A PEM text with or without line breaks; a terminating zero may be counted in its length.
DWORD ImportPublicKey(HCRYPTPROV provider, std::string_view pem, CryptoKey& key);   // "PUBLIC KEY", X.509
DWORD ImportPrivateKey(HCRYPTPROV provider, std::string_view pem, CryptoKey& key);  // "RSA PRIVATE KEY", PKCS #1

// `plain` must be shorter than 4 GiB. Besides the output nothing of the size of the input is allocated.
DWORD EncryptBuffer(std::string_view publicKeyPem, std::string_view plain, std::string& package);

// There is no checksum: damage to the cipher text cannot be noticed. Damage to the wrapped key, a length that does not
// fit the package (NTE_BAD_DATA) and a wrong private key are.
DWORD DecryptBuffer(std::string_view privateKeyPem, std::string_view package, std::string& plain);

// Replaces the archive by the package for the built-in public key. The archive is deleted before it is encrypted, on
// purpose: when something fails there is no file at all, so that a plain archive can never be sent in a package's
// place.
void Encrypt(const std::wstring& archivePath);
void Encrypt(const std::wstring& archivePath, std::string_view publicKeyPem);  // the same with another key

inline constexpr size_t kBuiltInPublicKeySize = 267;  // the PEM text in one line and its terminating zero

// The key that the build was configured with (ST_PUBLIC_KEY_FILE), terminating zero included.
std::string GetBuiltInPublicKey();

}  // namespace stutil
