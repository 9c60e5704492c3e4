#include "core/digest.h"

#include <gtest/gtest.h>

namespace {

TEST(Digest, KnownMessagesInPiecesOfAnySizeOneAfterAnother) {
  // From RFC 1321 and FIPS 180-2.
  const struct {
    const wchar_t* algorithm;
    const char* message;
    const char* expected;
  } rows[] = {
      {BCRYPT_MD5_ALGORITHM, "", "d41d8cd98f00b204e9800998ecf8427e"},
      {BCRYPT_MD5_ALGORITHM, "message digest", "f96b697d7cb7938d525a2f31aaf161d0"},
      {BCRYPT_MD5_ALGORITHM, "12345678901234567890123456789012345678901234567890123456789012345678901234567890",
       "57edf4a22be3c955ac49da2e2107b67a"},
      {BCRYPT_SHA1_ALGORITHM, "abc", "a9993e364706816aba3e25717850c26c9cd0d89d"},
      {BCRYPT_SHA256_ALGORITHM, "abcdbcdecdefdefgefghfghighijhijkijkljklmklmnlmnomnopnopq",
       "248d6a61d20638b8e5c026930c3e6039a33ce45964ff2167f6ecedd419db06c1"},
  };
  for (const auto& row : rows) {
    Digest digest(row.algorithm);
    const std::string_view message = row.message;
    for (const size_t piece : {size_t{1}, size_t{7}, size_t{64}, size_t{1000}}) {
      for (size_t at = 0; at < message.size(); at += piece)
        digest.Add(message.substr(at, piece));
      EXPECT_EQ(digest.Finish(), row.expected) << row.message << " in pieces of " << piece;
    }
  }
}

TEST(Digest, UnknownAlgorithmGivesNoText) {
  Digest digest(L"no such algorithm");
  digest.Add("abc");
  EXPECT_EQ(digest.Finish(), "");
}

}  // namespace
