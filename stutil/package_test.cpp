#include "stutil/package.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <vector>

#include "core/format.h"
#include "core/logging.h"
#include "stutil/development_keys.h"
#include "stutil/package_format.h"
#include "tests/support/test_folder.h"

namespace {

using development_keys::kOtherPrivateKey;
using development_keys::kPrivateKey;
using development_keys::kPublicKey;
using stutil::DecryptBuffer;
using stutil::EncryptBuffer;
using testing::ElementsAre;

constexpr size_t kKeyBlobSize = 140;  // for a key of 1024 bits: 12 bytes of header and the wrapped key
constexpr size_t kHeadSize = stutil::kKeyBlobLengthSize + kKeyBlobSize;

std::string SomeBytes(size_t count) {
  std::string bytes(count, '\0');
  uint32_t state = 12345;
  for (char& byte : bytes)
    byte = static_cast<char>((state = state * 1103515245 + 12345) >> 16);
  return bytes;
}

std::string Sealed(std::string_view plain) {
  std::string package;
  EXPECT_EQ(EncryptBuffer(kPublicKey, plain, package), 0u);
  return package;
}

// With line breaks after every 64 characters of the body, as tools write PEM.
std::string WithLineBreaks(const std::string& pem, std::string_view lineEnd) {
  const size_t bodyBegin = pem.find("-----", 5) + 5;
  const size_t bodyEnd = pem.rfind("-----END");
  std::string result = pem.substr(0, bodyBegin);
  for (size_t at = bodyBegin; at < bodyEnd; at += 64) {
    result.append(lineEnd).append(pem, at, std::min<size_t>(64, bodyEnd - at));
  }
  return result.append(lineEnd).append(pem, bodyEnd).append(lineEnd);
}

std::string InOneLine(std::string pem) {
  std::erase(pem, '\n');
  return pem;
}

std::wstring FailureLine(const wchar_t* format, const std::wstring& path, DWORD error) {
  return L"stutil::Encrypt: " + Format(format, path.c_str(), error);
}

TEST(Package, ComesBackWholeAndIsLongerByTheKeyAlone) {
  for (const size_t size : {0, 1, 7, 8, 9, 4096, (3 << 20) + 1}) {
    const std::string plain = SomeBytes(size);
    const std::string package = Sealed(plain);
    EXPECT_EQ(package.size(), kHeadSize + size);
    EXPECT_EQ(package.substr(0, 8), stutil::PackageHeader(kKeyBlobSize));
    if (size > 8) {
      EXPECT_EQ(package.find(plain.substr(0, 9)), std::string::npos);
    }
    std::string back = "what was there before";
    ASSERT_EQ(DecryptBuffer(kPrivateKey, package, back), 0u) << size;
    EXPECT_TRUE(back == plain) << size;
  }
}

TEST(Package, HasAnotherSessionKeyEveryTime) {
  const std::string plain = SomeBytes(64);
  EXPECT_NE(Sealed(plain).substr(kHeadSize), Sealed(plain).substr(kHeadSize));
}

TEST(Package, TakesEveryPemFormOfItsKeys) {
  const std::string zeroTerminated(kPublicKey, sizeof kPublicKey);
  for (const auto& publicKey : {std::string(kPublicKey), zeroTerminated, WithLineBreaks(kPublicKey, "\n"),
                                WithLineBreaks(kPublicKey, "\r\n")}) {
    std::string package;
    ASSERT_EQ(EncryptBuffer(publicKey, "an archive", package), 0u) << publicKey;
    for (const auto& privateKey : {std::string(kPrivateKey), InOneLine(kPrivateKey),
                                   WithLineBreaks(InOneLine(kPrivateKey), "\r\n"), std::string(kPrivateKey) + '\0'}) {
      std::string plain;
      EXPECT_EQ(DecryptBuffer(privateKey, package, plain), 0u) << privateKey;
      EXPECT_EQ(plain, "an archive");
    }
  }
}

TEST(Package, RefusesWhatIsNoKeyOfTheRightKind) {
  const std::string publicKey = kPublicKey;
  const std::string texts[] = {"",
                               std::string(1, '\0'),
                               "not PEM at all",
                               publicKey.substr(26, 216),                         // the body alone
                               publicKey.substr(0, 100),                          // without an end
                               publicKey.substr(0, 100) + publicKey.substr(242),  // the body cut
                               publicKey.substr(0, 26) + "????" + publicKey.substr(30),
                               "-----BEGIN PUBLIC KEY----------END PUBLIC KEY-----",
                               std::string(1 << 20, 'A')};
  const std::string sealed = Sealed("an archive");
  std::string output;
  for (const auto& text : texts) {
    EXPECT_NE(EncryptBuffer(text, "an archive", output), 0u) << text.substr(0, 300);
    EXPECT_EQ(output, "");
    EXPECT_NE(DecryptBuffer(text, sealed, output), 0u) << text.substr(0, 300);
    EXPECT_EQ(output, "");
  }
  EXPECT_NE(EncryptBuffer(kPrivateKey, "an archive", output), 0u);
  EXPECT_NE(DecryptBuffer(kPublicKey, sealed, output), 0u);
}

TEST(Package, DoesNotOpenWithAnotherKey) {
  std::string plain = "what was there before";
  EXPECT_NE(DecryptBuffer(kOtherPrivateKey, Sealed("an archive"), plain), 0u);
  EXPECT_EQ(plain, "");
}

TEST(Package, RefusesEveryTruncationWithinTheKey) {
  const std::string package = Sealed("an archive");
  std::string plain;
  for (size_t size = 0; size < kHeadSize; ++size) {
    EXPECT_EQ(DecryptBuffer(kPrivateKey, package.substr(0, size), plain), static_cast<DWORD>(NTE_BAD_DATA)) << size;
    EXPECT_EQ(plain, "") << size;
  }
  EXPECT_EQ(DecryptBuffer(kPrivateKey, package.substr(0, kHeadSize + 2), plain), 0u);
  EXPECT_EQ(plain, "an");
}

TEST(Package, RefusesKeyLengthsThatDoNotFit) {
  const std::string package = Sealed(SomeBytes(1000));
  for (const uint64_t length :
       {uint64_t{0}, uint64_t{1}, uint64_t{kKeyBlobSize - 1}, uint64_t{package.size() - 7}, uint64_t{0x7FFFFFFF},
        uint64_t{0xFFFFFFFF}, uint64_t{1} << 32, (uint64_t{1} << 32) + kKeyBlobSize, UINT64_MAX - 7, UINT64_MAX}) {
    std::string damaged = package;
    for (size_t i = 0; i < 8; ++i)
      damaged[i] = static_cast<char>(length >> (8 * i));
    std::string plain;
    EXPECT_NE(DecryptBuffer(kPrivateKey, damaged, plain), 0u) << length;
    EXPECT_EQ(plain, "") << length;
  }
}

TEST(Package, SurvivesDamageToAnyByteOfTheKey) {
  const std::string plain = SomeBytes(100);
  const std::string package = Sealed(plain);
  for (size_t at = 0; at < kHeadSize; ++at) {
    for (const int flip : {0x01, 0x80, 0xFF}) {
      std::string damaged = package;
      damaged[at] = static_cast<char>(damaged[at] ^ flip);
      std::string back;
      const DWORD error = DecryptBuffer(kPrivateKey, damaged, back);
      // The format has no checksum: of the length and the key's header, not every damage can be noticed.
      EXPECT_TRUE(error != 0 || at < stutil::kKeyBlobLengthSize + 12) << at;
      EXPECT_TRUE(error == 0 || back.empty()) << at;
    }
  }
}

TEST(Package, DamageToTheCipherTextStaysWhereItIs) {
  const std::string plain = SomeBytes(100);
  std::string damaged = Sealed(plain);
  damaged[kHeadSize + 50] = static_cast<char>(damaged[kHeadSize + 50] ^ 0x01);
  std::string back;
  ASSERT_EQ(DecryptBuffer(kPrivateKey, damaged, back), 0u);
  std::string expected = plain;
  expected[50] = static_cast<char>(expected[50] ^ 0x01);
  EXPECT_EQ(back, expected);
}

TEST(BuiltInPublicKey, IsOneLineWithItsTerminatingZeroAndEncrypts) {
  const std::string key = stutil::GetBuiltInPublicKey();
  ASSERT_EQ(key.size(), 267u);
  EXPECT_EQ(key.find('\0'), 266u);
  EXPECT_TRUE(key.starts_with("-----BEGIN PUBLIC KEY-----MIG"));
  std::string package;
  EXPECT_EQ(EncryptBuffer(key, "an archive", package), 0u);
}

TEST(Encrypt, ReplacesTheArchiveByItsPackage) {
  const TestFolder folder;
  for (const size_t size : {0, 1, (9 << 20) + 1}) {  // the last one is written in several pieces
    const std::string plain = SomeBytes(size);
    const std::wstring path = folder.MakeFile(L"collected \u00e4.zip", plain);
    logging::ErrorCapture capture(logging::Level::kTrace);
    stutil::Encrypt(path, kPublicKey);
    EXPECT_THAT(capture.Take(),
                ElementsAre(L"stutil::Encrypt: -> encrypt",
                            L"stutil::Encrypt: compressed file was deleted after being read into memory",
                            L"stutil::Encrypt: writing encrypted buffer to file", L"stutil::Encrypt: <- encrypt"));
    std::string package;
    std::string back;
    ASSERT_EQ(ReadWholeFile(path, 64 << 20, package), 0u);
    EXPECT_EQ(package.size(), kHeadSize + size);
    ASSERT_EQ(DecryptBuffer(kPrivateKey, package, back), 0u);
    EXPECT_TRUE(back == plain) << size;
    EXPECT_FALSE(PathExists(path + kPartialSuffix));
  }
}

TEST(Encrypt, LeavesNoFileWhenEncryptingFails) {
  const TestFolder folder;
  const std::wstring path = folder.MakeFile(L"collected.zip", "an archive");
  logging::ErrorCapture capture;
  stutil::Encrypt(path, "not a key");
  EXPECT_THAT(capture.Take(), ElementsAre(L"stutil::Encrypt: Encrypt failed with 13"));
  EXPECT_FALSE(PathExists(path));
  EXPECT_FALSE(PathExists(path + kPartialSuffix));
}

TEST(Encrypt, WritesNothingWhenThereIsNoArchive) {
  const TestFolder folder;
  const std::wstring path = folder.Path(L"collected.zip");
  logging::ErrorCapture capture(logging::Level::kWarning);
  stutil::Encrypt(path, kPublicKey);
  EXPECT_THAT(capture.Take(),
              ElementsAre(FailureLine(L"failed to read compressed file %s err=%d", path, ERROR_FILE_NOT_FOUND)));
  EXPECT_FALSE(PathExists(path));
}

TEST(Encrypt, KeepsAnArchiveThatSomebodyHoldsOpenWhole) {
  const TestFolder folder;
  const std::wstring path = folder.MakeFile(L"collected.zip", "an archive");
  const KernelHandle holder(
      CreateFileW(path.c_str(), GENERIC_READ, FILE_SHARE_READ, nullptr, OPEN_EXISTING, 0, nullptr));
  ASSERT_TRUE(holder);
  logging::ErrorCapture capture(logging::Level::kWarning);
  stutil::Encrypt(path, kPublicKey);
  const auto lines = capture.Take();
  ASSERT_EQ(lines.size(), 2u);
  EXPECT_EQ(lines[0], FailureLine(L"failed to remove compressed file %s err=%d", path, ERROR_SHARING_VIOLATION));
  EXPECT_THAT(lines[1], testing::StartsWith(L"stutil::Encrypt: failed to write package " + path + L" err="));
  std::string bytes;
  EXPECT_EQ(ReadWholeFile(path, 100, bytes), 0u);
  EXPECT_EQ(bytes, "an archive");
  EXPECT_FALSE(PathExists(path + kPartialSuffix));
}

}  // namespace
