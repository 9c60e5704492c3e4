#include "report/archive.h"

#include <gmock/gmock.h>

#include <stdexcept>

#include "tests/support/crafted_zip.h"

namespace report {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

constexpr uint32_t kUnixLink = 0120777u << 16;
constexpr uint32_t kUnixPipe = 0010644u << 16;
constexpr uint32_t kUnixFile = 0100644u << 16;
constexpr uint32_t kReparsePoint = 0x400;

std::vector<std::string> NamesOf(const Archive& archive) {
  std::vector<std::string> names;
  for (const ArchiveEntry& entry : archive.Entries())
    names.push_back(entry.name);
  return names;
}

std::unique_ptr<Archive> Open(const std::string& bytes) {
  std::string error;
  auto archive = Archive::Open(bytes, error);
  if (!archive) throw std::runtime_error(error);
  return archive;
}

TEST(Archive, EntriesCanBeRead) {
  const std::string bytes = CraftZip({{"a/x.json", "{}", kUnixFile}, {"a/", ""}, {"empty", ""}});
  const auto archive = Open(bytes);
  ASSERT_THAT(NamesOf(*archive), ElementsAre("a/x.json", "a/", "empty"));
  EXPECT_THAT(archive->LeftOut(), IsEmpty());
  std::string content;
  std::string error;
  ASSERT_TRUE(archive->Read(archive->Entries()[0], content, error)) << error;
  EXPECT_EQ(content, "{}");
  ASSERT_TRUE(archive->Read(archive->Entries()[2], content, error)) << error;
  EXPECT_EQ(content, "");
}

TEST(Archive, EntriesThatAreNotSafeAreLeftOutAndTheOthersStay) {
  const std::string bytes = CraftZip({{"../evil", "x"},
                                      {"Link", "target", kUnixLink},
                                      {"pipe", "", kUnixPipe},
                                      {"junction", "", kReparsePoint},
                                      {"bomb", std::string(10, 'x'), 0, uint32_t{200} << 20},
                                      {"good", "1"},
                                      {"GOOD", "2"},
                                      {std::string("a\0b", 3), "x"},
                                      {"good", "3"}});
  const auto archive = Open(bytes);
  EXPECT_THAT(NamesOf(*archive), ElementsAre("good"));
  EXPECT_THAT(
      archive->LeftOut(),
      ElementsAre(
          Evidence{"../evil", "", "leads out of its folder"}, Evidence{"Link", "", "is a link or a special file"},
          Evidence{"pipe", "", "is a link or a special file"}, Evidence{"junction", "", "is a link or a special file"},
          Evidence{"bomb", "", "is compressed too strongly to be genuine"}, Evidence{"GOOD", "", "is there twice"},
          Evidence{std::string("a\0b", 3), "", "holds a control character"}, Evidence{"good", "", "is there twice"}));
}

TEST(Archive, ContentBeyondTheLimitIsLeftOut) {
  // Claimed sizes count, so that nothing large has to be made. Each is just plausible for what it takes packed.
  const std::string packed(200'000, 'x');
  const uint32_t claimed = uint32_t{90} << 20;
  const std::string bytes =
      CraftZip({{"a", packed, 0, claimed}, {"b", packed, 0, claimed}, {"c", packed, 0, claimed}, {"d", "small"}});
  const auto archive = Open(bytes);
  EXPECT_THAT(NamesOf(*archive), ElementsAre("a", "b", "d"));
  EXPECT_THAT(archive->LeftOut(), ElementsAre(Evidence{"c", "", "does not fit the limit of content"}));
}

TEST(Archive, TooManyEntriesRefuseTheArchive) {
  // The count of a plain directory has 16 bits; one entry more than the limit fits.
  const std::string bytes = CraftZip(std::vector<CraftedEntry>(kMostEntries + 1, {"a", ""}));
  std::string error;
  EXPECT_EQ(Archive::Open(bytes, error), nullptr);
  EXPECT_THAT(error, HasSubstr("more than 50000 entries"));
}

TEST(Archive, SizesAndChecksumsThatLieFailTheReadOnly) {
  const std::string bytes = CraftZip({{"longer", "0123456789", 0, 1000},
                                      {"shorter", "0123456789", 0, 3},
                                      {"damaged", "0123456789", 0, {}, 0xBADBAD},
                                      {"good", "0123456789"}});
  const auto archive = Open(bytes);
  for (const ArchiveEntry& entry : archive->Entries()) {
    std::string content;
    std::string error;
    EXPECT_EQ(archive->Read(entry, content, error), entry.name == "good") << entry.name;
    EXPECT_EQ(content, entry.name == "good" ? "0123456789" : "");
    EXPECT_EQ(error.empty(), entry.name == "good");
  }
}

// Whatever is cut off or changed, nothing but a refusal or other entries may come of it.
TEST(Archive, DamagedArchivesDoNoHarm) {
  const std::string bytes = CraftZip({{"a/x.json", "{}", kUnixFile}, {"b", "0123456789"}});
  const auto readAll = [](const std::string& damaged) {
    std::string error;
    const auto archive = Archive::Open(damaged, error);
    EXPECT_EQ(archive == nullptr, !error.empty());
    if (!archive) return;
    for (const ArchiveEntry& entry : archive->Entries()) {
      std::string content;
      archive->Read(entry, content, error);
    }
  };
  for (size_t i = 0; i < bytes.size(); ++i) {
    readAll(bytes.substr(0, i));
    for (const int value : {0x00, 0x7F, 0xFF}) {
      std::string changed = bytes;
      changed[i] = static_cast<char>(value);
      readAll(changed);
    }
  }
  std::string error;
  EXPECT_EQ(Archive::Open(bytes.substr(0, bytes.size() - 1), error), nullptr);
}

}  // namespace
}  // namespace report
