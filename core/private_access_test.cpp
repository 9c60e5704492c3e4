#include "core/private_access.h"

#include <aclapi.h>
#include <gmock/gmock.h>
#include <sddl.h>

#include <string>
#include <vector>

#include "core/files.h"
#include "tests/support/folder_link.h"
#include "tests/support/test_folder.h"

namespace {

using testing::Contains;
using testing::Each;
using testing::Not;

// The accounts to which the access list of a file or folder grants anything.
std::vector<std::wstring> Trustees(const std::wstring& path) {
  PACL list = nullptr;
  LocalMemory<void> descriptor;
  EXPECT_EQ(GetNamedSecurityInfoW(const_cast<wchar_t*>(path.c_str()), SE_FILE_OBJECT, DACL_SECURITY_INFORMATION,
                                  nullptr, nullptr, &list, nullptr, descriptor.Receive()),
            static_cast<DWORD>(ERROR_SUCCESS));
  std::vector<std::wstring> trustees;
  for (DWORD i = 0; list != nullptr && i < list->AceCount; ++i) {
    void* ace = nullptr;
    LocalMemory<wchar_t> sid;
    if (GetAce(list, i, &ace) &&
        ConvertSidToStringSidW(&static_cast<ACCESS_ALLOWED_ACE*>(ace)->SidStart, sid.Receive()))
      trustees.emplace_back(sid.Get());
  }
  return trustees;
}

// What belongs to one user, to the administrators or to the system; groups of users do not.
MATCHER(IsPrivate, "") {
  return arg == L"S-1-5-18" || arg == L"S-1-5-32-544" || arg.starts_with(L"S-1-5-21-");
}

TEST(CreatePrivateFolder, MakesOneLevelThatItsCreatorCanUse) {
  const TestFolder folder;
  const std::wstring path = folder.Path(L"private");
  EXPECT_EQ(CreatePrivateFolder(path), ERROR_SUCCESS);
  EXPECT_EQ(WriteWholeFile(path + L"\\file", std::string_view("mine")), ERROR_SUCCESS);
  EXPECT_EQ(CreatePrivateFolder(path), static_cast<DWORD>(ERROR_ALREADY_EXISTS));
  EXPECT_EQ(CreatePrivateFolder(folder.Path(L"no\\parent")), static_cast<DWORD>(ERROR_PATH_NOT_FOUND));
}

TEST(PrivateAccess, NobodyElseGetsIntoPrivateFoldersAndFiles) {
  const TestFolder folder;
  const std::wstring shared = folder.MakeFolder(L"shared");
  if (Trustees(shared).size() == Trustees(folder.Path()).size()) {
    EXPECT_THAT(Trustees(shared), Contains(Not(IsPrivate()))) << "this machine shows no difference";
  }
  ASSERT_EQ(CreatePrivateFolder(folder.Path(L"private")), ERROR_SUCCESS);
  ASSERT_EQ(CreatePrivateFolders(folder.Path(L"deep\\er\\private")), ERROR_SUCCESS);
  ASSERT_EQ(WriteWholeFile(folder.Path(L"file"), std::string_view("x"), FileRights::kPrivate), ERROR_SUCCESS);
  for (const wchar_t* name : {L"private", L"deep\\er\\private", L"file"}) {
    EXPECT_THAT(Trustees(folder.Path(name)), Each(IsPrivate())) << name;
    EXPECT_FALSE(Trustees(folder.Path(name)).empty()) << name;
  }
}

TEST(PrivateAccess, FolderOfOnesOwnCanBeTakenOverButNothingElse) {
  const TestFolder folder;
  EXPECT_EQ(MakeFolderPrivate(folder.MakeFolder(L"own")), ERROR_SUCCESS);
  EXPECT_EQ(MakeFolderPrivate(folder.MakeFile(L"file")), static_cast<DWORD>(ERROR_ACCESS_DENIED));
  EXPECT_EQ(MakeFolderPrivate(folder.Path(L"absent")), static_cast<DWORD>(ERROR_FILE_NOT_FOUND));
  const FolderLink link(folder.Path(L"link"), folder.MakeFolder(L"elsewhere"));
  if (link.IsRemovable()) {  // Wine opens what it leads to
    EXPECT_EQ(MakeFolderPrivate(folder.Path(L"link")), static_cast<DWORD>(ERROR_ACCESS_DENIED));
  }
}

}  // namespace
