#include "systeminfo/catalog_loader.h"

#include <gmock/gmock.h>

#include <map>

#include "tests/support/test_folder.h"

namespace {

using testing::IsNull;
using testing::Pointee;

// A trust list reader of the tests' own. The bytes of a catalog are a line with the name of its algorithm, then one
// line for each subject.
struct FakeContext : CTL_CONTEXT {
  CTL_INFO info{};
  std::string algorithm;
  std::vector<std::string> subjects;
};
int s_liveContexts = 0;
std::map<std::string, std::string> s_algorithms = {
    {"bytes", "1.3.6.1.4.1.311.12.1.3"}, {"text", "1.3.6.1.4.1.311.12.1.2"}, {"other", "1.3.6.1.4.1.311.12.1.9"}};

const void* WINAPI FakeCreate(DWORD kind, DWORD encoding, const BYTE* bytes, DWORD size, DWORD flags,
                              PCERT_CREATE_CONTEXT_PARA) {
  EXPECT_EQ(kind, 3u);
  EXPECT_EQ(encoding, 0x10001u);
  EXPECT_EQ(flags, 3u);
  std::vector<std::string> lines(1);
  for (DWORD i = 0; i < size; ++i) {
    if (bytes[i] == '\n') {
      lines.emplace_back();
    } else {
      lines.back() += static_cast<char>(bytes[i]);
    }
  }
  if (s_algorithms.count(lines[0]) == 0) return nullptr;
  auto* const context = new FakeContext();
  context->algorithm = s_algorithms[lines[0]];
  context->subjects.assign(lines.begin() + 1, lines.end());
  context->info.SubjectAlgorithm.pszObjId = context->algorithm.data();
  context->pCtlInfo = &context->info;
  ++s_liveContexts;
  return static_cast<const CTL_CONTEXT*>(context);
}

BOOL WINAPI FakeFree(PCCTL_CONTEXT context) {
  --s_liveContexts;
  delete static_cast<const FakeContext*>(context);
  return TRUE;
}

BOOL WINAPI FakeNext(PCCTL_CONTEXT context, void** next, PCRYPT_DER_BLOB subject, PCRYPT_DER_BLOB attributes) {
  EXPECT_EQ(attributes, nullptr);
  const auto& subjects = static_cast<const FakeContext*>(context)->subjects;
  const auto index = reinterpret_cast<uintptr_t>(*next);
  if (index == subjects.size()) return FALSE;
  subject->cbData = static_cast<DWORD>(subjects[index].size());
  subject->pbData = reinterpret_cast<BYTE*>(const_cast<char*>(subjects[index].data()));
  *next = reinterpret_cast<void*>(index + 1);
  return TRUE;
}

constexpr wchar_t kGuid[] = L"{F750E6C3-38EE-11D1-85E5-00C04FC295EE}";
const CatalogCalls kFakes = {&FakeCreate, &FakeFree, &FakeNext};

TEST(CatalogLoader, HashesOfTheCatalogsInGuidFoldersAreIndexed) {
  const TestFolder root;
  const std::wstring folder = std::wstring(kGuid) + L"\\";
  const std::wstring one = root.MakeFile(folder + L"one.cat", "bytes\nhash of one\nsecond");
  const std::wstring two = root.MakeFile(folder + L"two.cat", std::string("text\n4\0a\0", 9));
  const std::wstring third = root.MakeFile(L"{11111111-2222-3333-4444-555555555555}\\3.cat", "bytes\nthird");
  root.MakeFile(folder + L"other.cat", "other\nnot a hash");
  root.MakeFile(folder + L"damaged.cat", "damaged\nnothing");
  root.MakeFile(folder + L"empty.cat", "");
  root.MakeFile(folder + L"note.txt", "bytes\nno catalog");
  root.MakeFile(L"{short}\\one.cat", "bytes\nnot there");
  root.MakeFile(L"loose.cat", "bytes\nnot there either");
  root.MakeFolder(folder + L"folder.cat");

  const auto index = LoadCatalogHashIndex(root.Path() + L"\\", kFakes);
  EXPECT_THAT(index->Find("hash of one"), Pointee(one));
  EXPECT_THAT(index->Find("second"), Pointee(one));
  EXPECT_THAT(index->Find("\x4A"), Pointee(two));
  EXPECT_THAT(index->Find("third"), Pointee(third));
  EXPECT_EQ(index->Hashes(), 4u);
  EXPECT_EQ(index->Catalogs(), 3u);
  EXPECT_EQ(s_liveContexts, 0);
}

TEST(CatalogLoader, SystemWithoutCatalogsHasAnEmptyIndex) {
  const TestFolder root;
  const auto index = LoadCatalogHashIndex(root.Path(L"absent"), kFakes);
  EXPECT_EQ(index->Hashes(), 0u);
  EXPECT_THAT(index->Find("x"), IsNull());
}

}  // namespace
