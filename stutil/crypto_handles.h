// Owners for the handles of CryptoAPI 1.
#pragma once

#include <windows.h>
// windows.h leaves it out under WIN32_LEAN_AND_MEAN; it has to come second.
#include <wincrypt.h>

#include "core/scoped.h"

namespace stutil {

struct CryptoProviderTraits {
  using Type = HCRYPTPROV;
  static bool IsValid(HCRYPTPROV provider) { return provider != 0; }
  static void Close(HCRYPTPROV provider) { CryptReleaseContext(provider, 0); }
};
using CryptoProvider = Scoped<CryptoProviderTraits>;

struct CryptoKeyTraits {
  using Type = HCRYPTKEY;
  static bool IsValid(HCRYPTKEY key) { return key != 0; }
  static void Close(HCRYPTKEY key) { CryptDestroyKey(key); }
};
using CryptoKey = Scoped<CryptoKeyTraits>;  // destroy before the provider: declare it later

}  // namespace stutil
