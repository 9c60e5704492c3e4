// Hashes of bytes that come piece by piece.
#pragma once

#include <windows.h>
// windows.h has to come first.
#include <bcrypt.h>

#include <string>
#include <string_view>

#include "core/scoped.h"

namespace qxlink {

struct HashAlgorithmTraits {
  using Type = BCRYPT_ALG_HANDLE;
  static bool IsValid(Type algorithm) { return algorithm != nullptr; }
  static void Close(Type algorithm) { BCryptCloseAlgorithmProvider(algorithm, 0); }
};
using HashAlgorithm = Scoped<HashAlgorithmTraits>;

struct HashTraits {
  using Type = BCRYPT_HASH_HANDLE;
  static bool IsValid(Type hash) { return hash != nullptr; }
  static void Close(Type hash) { BCryptDestroyHash(hash); }
};
using Hash = Scoped<HashTraits>;

class Digest {
 public:
  // BCRYPT_SHA256_ALGORITHM, BCRYPT_SHA1_ALGORITHM
  explicit Digest(const wchar_t* algorithm);

  void Add(std::string_view bytes);

  // The bytes of the hash, once; empty when the system failed at any step.
  std::string Finish();

 private:
  HashAlgorithm m_algorithm;
  Hash m_hash;
  bool m_isGood = false;
};

}  // namespace qxlink
