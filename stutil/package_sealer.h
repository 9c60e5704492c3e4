// Encrypts one package, piece by piece and in place: what EncryptBuffer and Encrypt are both made of.
#pragma once

#include <string>
#include <string_view>

#include "stutil/crypto_handles.h"

namespace stutil {

// Functions return 0 or the system's error number; after an error the package is of no use.
class PackageSealer {
 public:
  // Generates the session key. `head` becomes the package's bytes before the cipher text.
  DWORD Begin(std::string_view publicKeyPem, std::string& head);

  // Turns the next plain bytes into cipher text, which is as long. `isLast` exactly once, at the end.
  DWORD EncryptInPlace(char* bytes, size_t count, bool isLast) const;

 private:
  CryptoProvider m_provider;
  CryptoKey m_publicKey;
  CryptoKey m_sessionKey;
};

}  // namespace stutil
