// A digest (MD5, SHA-256, …) of bytes that come piece by piece, made by the system's own cryptography. Its library is
// loaded with the first digest: loading it takes longer than a short run of the program. One object may make many
// digests, one after another; it is used by one thread at a time.
#pragma once

#include <windows.h>
// windows.h has to come first.
#include <bcrypt.h>

#include <string>
#include <string_view>

#include "core/dynamic_library.h"
#include "core/scoped.h"

// Handles of the library, each with the library's own function to close it.
struct HashAlgorithmTraits {
  struct Type {
    BCRYPT_ALG_HANDLE handle = nullptr;
    decltype(&BCryptCloseAlgorithmProvider) close = nullptr;
  };
  static bool IsValid(Type algorithm) { return algorithm.handle != nullptr; }
  static void Close(Type algorithm) { algorithm.close(algorithm.handle, 0); }
};
using HashAlgorithm = Scoped<HashAlgorithmTraits>;

struct HashTraits {
  struct Type {
    BCRYPT_HASH_HANDLE handle = nullptr;
    decltype(&BCryptDestroyHash) close = nullptr;
  };
  static bool IsValid(Type hash) { return hash.handle != nullptr; }
  static void Close(Type hash) { hash.close(hash.handle); }
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
  // The same as bytes.
  std::string FinishBytes();

 private:
  // The entry points of the library.
  struct Calls {
    decltype(&BCryptOpenAlgorithmProvider) open = nullptr;
    decltype(&BCryptCloseAlgorithmProvider) close = nullptr;
    decltype(&BCryptGetProperty) property = nullptr;
    decltype(&BCryptCreateHash) create = nullptr;
    decltype(&BCryptHashData) add = nullptr;
    decltype(&BCryptFinishHash) finish = nullptr;
    decltype(&BCryptDestroyHash) destroy = nullptr;
  };

  bool Bind();
  bool Open(const wchar_t* algorithm);
  bool Begin();

  DynamicLibrary m_library;
  Calls m_calls;
  HashAlgorithm m_algorithm;
  Hash m_hash;
  bool m_isGood = false;
};
