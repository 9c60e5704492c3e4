#include "systeminfo/trust_check.h"

#include <gmock/gmock.h>

#include <thread>

#include "core/files.h"
#include "core/logging.h"
#include "core/program_path.h"
#include "tests/support/test_folder.h"

namespace {

using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;

// Executables signed by a certificate authority of the build's own, and that authority's certificate; see
// tests/support/signed_files.py. The build makes them where it can.
std::wstring SignedFolder() {
  return ProgramFolder() + L"\\signed_files\\";
}

KernelHandle OpenForReading(const std::wstring& path) {
  return KernelHandle(CreateFileW(path.c_str(), GENERIC_READ, FILE_SHARE_READ, nullptr, OPEN_EXISTING, 0, nullptr));
}

// Trusts the authority for the current user as long as it lives.
class TrustedAuthority {
 public:
  TrustedAuthority() {
    std::string certificate;
    if (ReadWholeFile(SignedFolder() + L"trusted_ca.der", 1 << 20, certificate) != ERROR_SUCCESS) return;
    const HCERTSTORE store = CertOpenStore(CERT_STORE_PROV_SYSTEM_W, 0, 0, CERT_SYSTEM_STORE_CURRENT_USER, L"ROOT");
    m_isTrusted = CertAddEncodedCertificateToStore(
                      store, X509_ASN_ENCODING, reinterpret_cast<const BYTE*>(certificate.data()),
                      static_cast<DWORD>(certificate.size()), CERT_STORE_ADD_ALWAYS, nullptr) != FALSE;
    CertCloseStore(store, 0);
  }

  bool IsTrusted() const { return m_isTrusted; }

 private:
  bool m_isTrusted = false;
};

class SignedFiles : public testing::Test {
 protected:
  void SetUp() override {
    if (!PathExists(SignedFolder() + L"trusted_ca.der")) GTEST_SKIP() << "the build had nothing to sign files with";
    static const TrustedAuthority authority;
    ASSERT_TRUE(authority.IsTrusted());
  }
};

TEST_F(SignedFiles, OnlyAnIntactFileOfATrustedSignerIsTrusted) {
  CertVerifier verifier;
  for (const wchar_t* name : {L"trusted.exe", L"untrusted.exe", L"tampered.exe", L"unsigned.exe", L"absent.exe"}) {
    const std::wstring path = SignedFolder() + name;
    const bool expected = std::wstring(name) == L"trusted.exe";
    EXPECT_EQ(verifier.CertTrustVer(path.c_str(), nullptr), expected) << path;
    EXPECT_EQ(verifier.CertTrustVer(path.c_str(), INVALID_HANDLE_VALUE), expected) << path;
    const KernelHandle file = OpenForReading(path);
    EXPECT_EQ(verifier.CertTrustVer(path.c_str(), file.Get()), expected) << path;
    // A handle without any right, as one opens it to see whether the file is there.
    const KernelHandle bare(CreateFileW(path.c_str(), 0, 0, nullptr, OPEN_EXISTING, 0, nullptr));
    EXPECT_EQ(verifier.CertTrustVer(path.c_str(), bare.Get()), expected) << path;
    EXPECT_EQ(file && GetFileType(file.Get()) == FILE_TYPE_DISK, std::wstring(name) != L"absent.exe")
        << "the caller's handle stays open";
  }
}

TEST_F(SignedFiles, ManyThreadsMayAskAtOnceAlsoFirst) {
  CertVerifier verifier;
  std::atomic<int> trusted{0};
  std::vector<std::thread> threads;
  threads.reserve(4);
  for (int i = 0; i < 4; ++i) {
    threads.emplace_back([&] {
      if (verifier.CertTrustVer((SignedFolder() + L"trusted.exe").c_str(), nullptr)) ++trusted;
      if (verifier.CertTrustVer((SignedFolder() + L"unsigned.exe").c_str(), nullptr)) trusted += 100;
    });
  }
  for (std::thread& thread : threads)
    thread.join();
  EXPECT_EQ(trusted, 4);
}

// What the system was asked, by calls that stand in its place.
struct Asked {
  DWORD choice = 0;
  DWORD flags = 0;
  std::wstring catalog, tag, path;
  HANDLE file = nullptr;
  std::string hash;
};
std::vector<Asked> s_asked;
int s_closed = 0;
std::string s_hash;
LONG s_verdict = 0;
HANDLE s_hashedHandle = nullptr;

BOOL WINAPI FakeHash(HANDLE file, DWORD* length, BYTE* hash, DWORD flags) {
  EXPECT_EQ(*length, 100u);
  EXPECT_EQ(flags, 0u);
  char byte = 0;
  DWORD count = 0;
  EXPECT_TRUE(ReadFile(file, &byte, 1, &count, nullptr)) << "the hash reads by the handle";
  s_hashedHandle = file;
  if (s_hash.empty()) return FALSE;
  std::copy(s_hash.begin(), s_hash.end(), hash);
  *length = static_cast<DWORD>(s_hash.size());
  return TRUE;
}

LONG WINAPI FakeVerify(HWND window, GUID* action, void* argument) {
  constexpr GUID kGenericVerify2 = {0x00AAC56B, 0xCD44, 0x11D0, {0x8C, 0xC2, 0x00, 0xC0, 0x4F, 0xC2, 0x95, 0xEE}};
  const auto& data = *static_cast<const WINTRUST_DATA*>(argument);
  EXPECT_TRUE(IsEqualGUID(*action, kGenericVerify2));
  EXPECT_EQ(data.dwUIChoice, 2u);
  EXPECT_EQ(data.fdwRevocationChecks, 0u);
  if (data.dwStateAction == 2) {
    EXPECT_EQ(window, static_cast<HWND>(INVALID_HANDLE_VALUE));
    ++s_closed;
    return 0;
  }
  EXPECT_EQ(data.dwStateAction, 1u);
  EXPECT_EQ(window, nullptr);
  const auto text = [](const wchar_t* value) { return value == nullptr ? std::wstring() : std::wstring(value); };
  Asked asked{data.dwUnionChoice, data.dwProvFlags, {}, {}, {}, nullptr, {}};
  if (data.dwUnionChoice == WTD_CHOICE_CATALOG) {
    const WINTRUST_CATALOG_INFO& info = *data.pCatalog;
    asked.catalog = text(info.pcwszCatalogFilePath);
    asked.tag = text(info.pcwszMemberTag);
    asked.path = text(info.pcwszMemberFilePath);
    asked.file = info.hMemberFile;
    asked.hash.assign(reinterpret_cast<const char*>(info.pbCalculatedFileHash), info.cbCalculatedFileHash);
  } else {
    EXPECT_EQ(data.pFile->pgKnownSubject, nullptr);
    asked.path = text(data.pFile->pcwszFilePath);
    asked.file = data.pFile->hFile;
  }
  s_asked.push_back(asked);
  return s_verdict;
}

class CatalogStep : public testing::Test {
 protected:
  CatalogStep() {
    s_asked.clear();
    s_closed = 0;
    s_hash = "\x0A\xFF";
    s_verdict = 0;
    s_hashedHandle = nullptr;
  }

  static CertVerifier Verifier() {
    auto index = std::make_unique<CatalogHashIndex>();
    index->AddCatalog(L"C:\\catalogs\\listed.cat");
    index->AddHash("\x0A\xFF");
    index->Sort();
    return CertVerifier({&FakeHash, &FakeVerify}, std::move(index));
  }

  const TestFolder m_folder;
  const std::wstring m_path = m_folder.MakeFile(L"file.exe", "some bytes");
  logging::ErrorCapture m_capture{logging::Level::kTrace};
};

TEST_F(CatalogStep, ListedFileIsVerifiedAsAMemberOfItsCatalog) {
  CertVerifier verifier = Verifier();
  EXPECT_TRUE(verifier.CertTrustVer(m_path.c_str(), nullptr));
  ASSERT_EQ(s_asked.size(), 1u);
  EXPECT_EQ(s_asked[0].choice, static_cast<DWORD>(WTD_CHOICE_CATALOG));
  EXPECT_EQ(s_asked[0].flags, 0x1100u);
  EXPECT_EQ(s_asked[0].catalog, L"C:\\catalogs\\listed.cat");
  EXPECT_EQ(s_asked[0].tag, L"0AFF");
  EXPECT_EQ(s_asked[0].path, m_path);
  EXPECT_EQ(s_asked[0].file, nullptr);
  EXPECT_EQ(s_asked[0].hash, "\x0A\xFF");
  EXPECT_EQ(s_closed, 1);
  EXPECT_THAT(m_capture.Take(), ElementsAre(L"CertVerifier::CertTrustVer: CreateFile(" + m_path + L")"));
}

TEST_F(CatalogStep, HandleOfTheCallerIsUsedAndStaysOpen) {
  CertVerifier verifier = Verifier();
  const KernelHandle file = OpenForReading(m_path);
  for (const wchar_t* path : {m_path.c_str(), static_cast<const wchar_t*>(nullptr)}) {
    EXPECT_TRUE(verifier.CertTrustVer(path, file.Get()));
    EXPECT_EQ(s_hashedHandle, file.Get());
    EXPECT_EQ(s_asked.back().file, file.Get());
    EXPECT_EQ(GetFileType(file.Get()), static_cast<DWORD>(FILE_TYPE_DISK));
  }
  EXPECT_THAT(m_capture.Take(), IsEmpty());
}

TEST_F(CatalogStep, FileThatIsNotListedIsVerifiedByItsOwnSignature) {
  CertVerifier verifier = Verifier();
  for (const char* hash : {"\x0B", ""}) {  // another one, and none
    s_hash = hash;
    EXPECT_TRUE(verifier.CertTrustVer(m_path.c_str(), nullptr));
    EXPECT_EQ(s_asked.back().choice, static_cast<DWORD>(WTD_CHOICE_FILE));
    EXPECT_EQ(s_asked.back().flags, 0x1000u);
    EXPECT_EQ(s_asked.back().path, m_path);
  }
  CertVerifier withoutIndex({&FakeHash, &FakeVerify}, nullptr);
  s_hashedHandle = nullptr;
  EXPECT_TRUE(withoutIndex.CertTrustVer(m_path.c_str(), nullptr));
  EXPECT_EQ(s_hashedHandle, nullptr) << "no index, no hash";
  EXPECT_EQ(s_asked.back().choice, static_cast<DWORD>(WTD_CHOICE_FILE));
}

TEST_F(CatalogStep, OnlyStatusZeroIsTrust) {
  CertVerifier verifier = Verifier();
  for (const LONG verdict : {1L, -1L, static_cast<LONG>(TRUST_E_NOSIGNATURE)}) {
    s_verdict = verdict;
    EXPECT_FALSE(verifier.CertTrustVer(m_path.c_str(), nullptr)) << verdict;
  }
  EXPECT_EQ(s_closed, 3);
}

TEST_F(CatalogStep, WhatCannotBeOpenedIsNotTrustedAndNothingIsAsked) {
  CertVerifier verifier = Verifier();
  EXPECT_FALSE(verifier.CertTrustVer(m_folder.Path(L"absent").c_str(), nullptr));
  EXPECT_FALSE(verifier.CertTrustVer(nullptr, nullptr));
  EXPECT_FALSE(verifier.CertTrustVer(nullptr, INVALID_HANDLE_VALUE));
  EXPECT_THAT(s_asked, IsEmpty());
  EXPECT_THAT(m_capture.Take(),
              Contains(L"CertVerifier::CertTrustVer: Both file and hFile are null or invalid!").Times(2));
}

}  // namespace
