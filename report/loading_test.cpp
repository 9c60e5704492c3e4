#include "report/loading.h"

#include <gmock/gmock.h>

#include "tests/support/crafted_zip.h"
#include "tests/support/test_folder.h"

namespace report {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::Optional;
using testing::SizeIs;

constexpr char kManifest[] = R"({"start": "2024-03-04T12:00:00Z"})";

TEST(Loading, TheCollectionsFolderIsThatOfTheManifest) {
  EXPECT_THAT(CollectionFolder({{"settings/services.json"}, {"out put/collection_manifest.json"}}),
              Optional(std::string("out put/")));
  EXPECT_THAT(CollectionFolder({{"collection_manifest.json"}}), Optional(std::string()));
  EXPECT_THAT(CollectionFolder({{"Logs/x.log"}, {"collected/storage.json"}}), Optional(std::string("collected/")));
  EXPECT_EQ(CollectionFolder({{"a/b/collection_manifest.json"}, {"collected/unknown.json"}, {"services.jsonx"}}),
            std::nullopt);
  EXPECT_EQ(CollectionFolder({}), std::nullopt);
}

TEST(Loading, AnArchivesDocumentsAndNamesAreThere) {
  const std::string bytes = CraftZip({{"collected/collection_manifest.json", kManifest},
                                      {"collected/services.json", "[{}]"},
                                      {"collected/storage.json", "{"},
                                      {"collected/system_summary.json", "{}", 0, {}, 0xBAD},
                                      {"settings/system_drivers.json", "[]"},
                                      {"../x", ""}});
  std::string error;
  const auto archive = Archive::Open(bytes, error);
  ASSERT_NE(archive, nullptr) << error;
  const auto collection = LoadCollection(*archive);
  ASSERT_TRUE(collection);
  EXPECT_THAT(collection->Document("services"), SizeIs(1));
  EXPECT_TRUE(collection->Document("system_drivers").isNull());
  EXPECT_THAT(collection->collectedAt, Optional(1709553600.0));
  ASSERT_THAT(collection->unreadable, SizeIs(2));
  EXPECT_THAT(collection->unreadable[0].text, HasSubstr("is no JSON document"));
  EXPECT_THAT(collection->unreadable[1].text, HasSubstr("cannot be unpacked"));
  EXPECT_THAT(collection->leftOut, ElementsAre(Evidence{"../x", "", "leads out of its folder"}));
  EXPECT_THAT(collection->files, SizeIs(5));
}

TEST(Loading, ADocumentThatIsTooLargeIsNotRead) {
  bool wasRead = false;
  const auto collection = LoadCollection({{"services.json", kLargestDocument + 1}},
                                         [&](size_t, std::string&, std::string&) { return wasRead = true; });
  ASSERT_TRUE(collection);
  EXPECT_FALSE(wasRead);
  EXPECT_EQ(collection->unreadable[0].text, "is too large to be read");
}

TEST(Loading, AFolderIsReadWhetherItHoldsTheFilesOrTheirFolder) {
  const TestFolder folder;
  folder.MakeFile(L"collected\\collection_manifest.json", kManifest);
  folder.MakeFile(L"collected\\services.json", "[1, 2]");
  for (const std::wstring& path : {folder.Path(), folder.Path(L"collected"), folder.Path(L"collected\\")}) {
    const auto collection = LoadCollection(path);
    ASSERT_TRUE(collection);
    EXPECT_THAT(collection->Document("services"), SizeIs(2));
  }
  EXPECT_FALSE(LoadCollection(folder.MakeFolder(L"empty")));
}

}  // namespace
}  // namespace report
