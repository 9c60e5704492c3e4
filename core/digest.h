// A digest (MD5, SHA-256, …) of bytes that come piece by piece, made by the system's own cryptography. One object may
// make many digests, one after another; it is used by one thread at a time.
#pragma once

#include <windows.h>
// windows.h has to come first.
#include <bcrypt.h>

#include <string>
#include <string_view>

#include "core/scoped.h"

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
  // `algorithm` by its name: BCRYPT_MD5_ALGORITHM, BCRYPT_SHA256_ALGORITHM, …
  explicit Digest(const wchar_t* algorithm);

  // Of at most 4 GiB.
  void Add(std::string_view bytes);

  // In lower-case hexadecimal digits, empty when the system failed at any step. The next Add begins the next digest.
  std::string Finish();

 private:
  bool Begin();

  HashAlgorithm m_algorithm;
  Hash m_hash;
  bool m_isGood = false;
};
