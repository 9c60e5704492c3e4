#include "systeminfo/catalog_loader.h"

#include <vector>

#include "core/dynamic_library.h"
#include "core/files.h"
#include "core/logging.h"
#include "core/paths.h"
#include "core/scope_exit.h"

namespace {

constexpr wchar_t kScope[] = L"CatalogHashIndex::Load";
constexpr wchar_t kGuidPattern[] = L"{????????????????????????????????????}";
constexpr DWORD kTrustListContext = CERT_STORE_CTL_CONTEXT;
constexpr DWORD kEncoding = X509_ASN_ENCODING | PKCS_7_ASN_ENCODING;
constexpr DWORD kFlags = CERT_CREATE_CONTEXT_NOCOPY_FLAG | CERT_CREATE_CONTEXT_SORTED_FLAG;
constexpr LONGLONG kLargestCatalog = LONGLONG{256} << 20;

std::vector<std::wstring> Find(const std::wstring& folder, const wchar_t* pattern, bool wantFolders) {
  std::vector<std::wstring> paths;
  WIN32_FIND_DATAW entry;
  const std::wstring search = ExtendedPath(JoinPath(folder, pattern));
  const FindHandle listing(FindFirstFileExW(search.c_str(), FindExInfoBasic, &entry, FindExSearchNameMatch, nullptr,
                                            FIND_FIRST_EX_LARGE_FETCH));
  if (!listing) return paths;
  do {
    const bool isFolder = (entry.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0;
    if (isFolder == wantFolders) paths.emplace_back(JoinPath(folder, entry.cFileName));
  } while (FindNextFileW(listing.Get(), &entry));
  return paths;
}

bool ReadCatalog(const std::wstring& path, std::vector<BYTE>& bytes) {
  // Open-always is kept: a catalog that is removed in this moment becomes an empty file where the rights allow it.
  const KernelHandle file(CreateFileW(ExtendedPath(path).c_str(), GENERIC_READ,
                                      FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE, nullptr, OPEN_ALWAYS,
                                      FILE_ATTRIBUTE_NORMAL, nullptr));
  LARGE_INTEGER size{};
  if (!file || !GetFileSizeEx(file.Get(), &size)) return false;
  if (size.QuadPart > kLargestCatalog) {
    LOG_WARNING(kScope, L"%s is too large for a catalog", path.c_str());
    return false;
  }
  bytes.resize(static_cast<size_t>(size.QuadPart));
  DWORD count = 0;
  return ReadFile(file.Get(), bytes.data(), static_cast<DWORD>(bytes.size()), &count, nullptr) && count == bytes.size();
}

void AddSubjects(const CatalogCalls& calls, const CTL_CONTEXT& catalog, SubjectForm form, CatalogHashIndex& index) {
  void* next = nullptr;
  CRYPT_DER_BLOB subject{};
  while (calls.nextSubject(&catalog, &next, &subject, nullptr)) {
    const std::string_view identifier(reinterpret_cast<const char*>(subject.pbData), subject.cbData);
    index.AddHash(SubjectHash(identifier, form));
  }
}

void AddCatalogFile(const CatalogCalls& calls, const std::wstring& path, CatalogHashIndex& index) {
  std::vector<BYTE> bytes;
  if (!ReadCatalog(path, bytes)) return;
  // The context points into the bytes.
  const auto* const catalog = static_cast<const CTL_CONTEXT*>(calls.createContext(
      kTrustListContext, kEncoding, bytes.data(), static_cast<DWORD>(bytes.size()), kFlags, nullptr));
  if (catalog == nullptr) return;
  const ScopeExit free([&] { calls.freeContext(catalog); });
  if (catalog->pCtlInfo == nullptr || catalog->pCtlInfo->SubjectAlgorithm.pszObjId == nullptr) return;
  const auto form = SubjectFormOf(catalog->pCtlInfo->SubjectAlgorithm.pszObjId);
  if (!form) return;
  index.AddCatalog(path);
  AddSubjects(calls, *catalog, *form, index);
}

}  // namespace

std::unique_ptr<CatalogHashIndex> LoadCatalogHashIndex(const std::wstring& root, const CatalogCalls& calls) {
  auto index = std::make_unique<CatalogHashIndex>();
  for (const std::wstring& folder : Find(root, kGuidPattern, true)) {
    for (const std::wstring& path : Find(folder, L"*.cat", false))
      AddCatalogFile(calls, path, *index);
  }
  index->Sort();
  LOG_TRACE(kScope, L"%llu hashes in %llu catalogs", static_cast<unsigned long long>(index->Hashes()),
            static_cast<unsigned long long>(index->Catalogs()));
  return index;
}

std::unique_ptr<CatalogHashIndex> LoadCatalogHashIndex() {
  const DynamicLibrary library(L"crypt32.dll");
  CatalogCalls calls;
  calls.createContext = library.Resolve<decltype(calls.createContext)>("CertCreateContext");
  calls.freeContext = library.Resolve<decltype(calls.freeContext)>("CertFreeCTLContext");
  calls.nextSubject = library.Resolve<decltype(calls.nextSubject)>("CertEnumSubjectInSortedCTL");
  if (calls.createContext == nullptr || calls.freeContext == nullptr || calls.nextSubject == nullptr) {
    LOG_WARNING(kScope,
                L"crypt32.dll lacks what reading catalogs takes; files are checked by their own signature only");
    return nullptr;
  }
  std::wstring systemFolder(GetSystemDirectoryW(nullptr, 0), L'\0');
  systemFolder.resize(GetSystemDirectoryW(systemFolder.data(), static_cast<UINT>(systemFolder.size())));
  return LoadCatalogHashIndex(std::wstring(JoinPath(systemFolder, L"CatRoot\\")), calls);
}
