#include "stutil/zip.h"

#include <gmock/gmock.h>
#include <miniz.h>

#include <algorithm>
#include <thread>

#include "core/logging.h"
#include "core/scoped.h"
#include "core/text.h"
#include "stutil/entry_assembler.h"
#include "stutil/retry_copy.h"
#include "tests/support/test_folder.h"

namespace stutil {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::Pair;
using testing::SizeIs;

using Entries = std::vector<std::pair<std::wstring, std::string>>;  // name and content, in the archive's order

// Reads an archive back. One entry {"", reason} when it is no sound archive.
Entries ReadArchive(const std::wstring& path) {
  std::string bytes;
  if (ReadWholeFile(path, UINT64_MAX, bytes) != ERROR_SUCCESS) return {{L"", "cannot be read"}};
  mz_zip_archive zip{};
  if (!mz_zip_reader_init_mem(&zip, bytes.data(), bytes.size(), 0)) return {{L"", "is no archive"}};
  Entries entries;
  if (!mz_zip_validate_archive(&zip, 0)) entries.emplace_back(L"", "local headers and directory disagree");
  for (mz_uint i = 0; i < mz_zip_reader_get_num_files(&zip); ++i) {
    mz_zip_archive_file_stat stat{};
    mz_zip_reader_file_stat(&zip, i, &stat);
    std::string content(static_cast<size_t>(stat.m_uncomp_size), '\0');
    if (!mz_zip_reader_extract_to_mem(&zip, i, content.data(), content.size(), 0)) content = "is damaged";
    // The library leaves the sizes of an entry without bytes out of its local header: there must be none.
    if (stat.m_uncomp_size == 0 && stat.m_comp_size != 0) content = "is empty, but has data";
    entries.emplace_back(ToWide(stat.m_filename), std::move(content));
  }
  mz_zip_reader_end(&zip);
  return entries;
}

std::vector<std::wstring> NamesOf(const Entries& entries) {
  std::vector<std::wstring> names;
  for (const auto& [name, content] : entries)
    names.push_back(name);
  return names;
}

// The `age`th newest of a test's files, in minutes.
void SetAge(const std::wstring& path, unsigned age) {
  const KernelHandle file(CreateFileW(ExtendedPath(path).c_str(), FILE_WRITE_ATTRIBUTES, FILE_SHARE_READ, nullptr,
                                      OPEN_EXISTING, 0, nullptr));
  ULARGE_INTEGER time{};
  time.QuadPart = 133'444'736'000'000'000 - age * 600'000'000ULL;
  const FILETIME written{time.LowPart, time.HighPart};
  ASSERT_TRUE(SetFileTime(file.Get(), nullptr, nullptr, &written));
}

// A file of zeros.
void MakeSizedFile(const std::wstring& path, uint64_t size, unsigned age) {
  {
    const KernelHandle file(
        CreateFileW(ExtendedPath(path).c_str(), GENERIC_WRITE, 0, nullptr, CREATE_ALWAYS, 0, nullptr));
    LARGE_INTEGER end{};
    end.QuadPart = static_cast<LONGLONG>(size);
    ASSERT_TRUE(SetFilePointerEx(file.Get(), end, nullptr, FILE_BEGIN));
    ASSERT_TRUE(SetEndOfFile(file.Get()));
  }
  SetAge(path, age);
}

std::string Text(size_t size) {
  std::string text;
  for (unsigned i = 0; text.size() < size; i = i * 1'664'525 + 1'013'904'223)
    text += "line " + std::to_string(i) + "\n";
  text.resize(size);
  return text;
}

KernelHandle Hold(const std::wstring& path) {
  return KernelHandle(CreateFileW(path.c_str(), GENERIC_READ, 0, nullptr, OPEN_EXISTING, 0, nullptr));
}

TEST(CompressWithSizeLimit, PacksFoldersUnderTheirOwnNamesNewestFirst) {
  const TestFolder test;
  SetAge(test.MakeFile(L"logs\\old.txt", "old"), 3);
  SetAge(test.MakeFile(L"logs\\sub\\new.txt", Text(5000)), 1);
  SetAge(test.MakeFile(L"logs\\empty", ""), 2);
  const std::wstring archive = test.Path(L"a.zip");
  ASSERT_TRUE(CompressWithSizeLimit_MostRecentFirst({test.Path(L"logs")}, archive));
  EXPECT_THAT(ReadArchive(archive), ElementsAre(Pair(L"logs/sub/new.txt", Text(5000)), Pair(L"logs/empty", ""),
                                                Pair(L"logs/old.txt", "old")));
  EXPECT_FALSE(PathExists(archive + kPartialSuffix));
}

TEST(CompressWithSizeLimit, PacksNamesThatAreHardToOpen) {
  const TestFolder test;
  std::wstring deep = L"logs";
  while (test.Path(deep).size() < 320)
    deep += L"\\a rather long folder name";
  const std::wstring names[] = {deep + L"\\file.txt", L"logs\\ends in dots...",
                                L"logs\\\x0160\x010D\x0151 \x65E5\x672C.txt", L"logs\\\xD83D\xDE00.bin"};
  std::vector<std::wstring> expected;
  for (const std::wstring& name : names) {
    test.MakeFile(name, "content");
    expected.push_back(name);
    std::replace(expected.back().begin(), expected.back().end(), L'\\', L'/');
  }
  const std::wstring archive = test.Path(L"a.zip");
  ASSERT_TRUE(CompressWithSizeLimit_MostRecentFirst({test.Path(L"logs")}, archive));
  const Entries entries = ReadArchive(archive);
  EXPECT_THAT(NamesOf(entries), testing::UnorderedElementsAreArray(expected));
  for (const auto& [name, content] : entries)
    EXPECT_EQ(content, "content") << ToUtf8(name);
}

TEST(CompressWithSizeLimit, FillsTheArchiveToTheLastByteOfTheLimit) {
  const TestFolder test;
  test.MakeFolder(L"f");
  const std::wstring archive = test.Path(L"a.zip");
  MakeSizedFile(test.Path(L"f\\over the limit"), kArchiveSizeLimit + 1, 1);
  MakeSizedFile(test.Path(L"f\\big"), kArchiveSizeLimit - 10, 2);
  MakeSizedFile(test.Path(L"f\\rest"), 10, 3);
  ASSERT_TRUE(CompressWithSizeLimit_MostRecentFirst({test.Path(L"f")}, archive));
  EXPECT_THAT(NamesOf(ReadArchive(archive)), ElementsAre(L"f/big", L"f/rest"));

  MakeSizedFile(test.Path(L"f\\rest"), 11, 3);
  MakeSizedFile(test.Path(L"f\\small"), 10, 4);
  ASSERT_TRUE(CompressWithSizeLimit_MostRecentFirst({test.Path(L"f")}, archive));
  EXPECT_THAT(NamesOf(ReadArchive(archive)), ElementsAre(L"f/big", L"f/small"));
}

TEST(CompressWithSizeLimit, KeepsEqualNamesOfTwoFolders) {
  const TestFolder test;
  SetAge(test.MakeFile(L"one\\logs\\x.txt", "first"), 1);
  SetAge(test.MakeFile(L"two\\logs\\x.txt", "second"), 2);
  const std::wstring archive = test.Path(L"a.zip");
  ASSERT_TRUE(CompressWithSizeLimit_MostRecentFirst({test.Path(L"one\\logs"), test.Path(L"two\\logs")}, archive));
  EXPECT_THAT(ReadArchive(archive), ElementsAre(Pair(L"logs/x.txt", "first"), Pair(L"logs/x.txt", "second")));
}

TEST(CompressWithSizeLimit, NothingToPackGivesAnEmptyArchive) {
  const TestFolder test;
  const std::wstring archive = test.Path(L"a.zip");
  logging::ErrorCapture errors;
  ASSERT_TRUE(CompressWithSizeLimit_MostRecentFirst({}, archive));
  EXPECT_THAT(ReadArchive(archive), IsEmpty());
  EXPECT_THAT(errors.Take(), IsEmpty());
  ASSERT_TRUE(CompressWithSizeLimit_MostRecentFirst({test.Path(L"missing")}, archive));
  EXPECT_THAT(ReadArchive(archive), IsEmpty());
  EXPECT_THAT(errors.Take(), ElementsAre(L"stutil::CompressWithSizeLimit_MostRecentFirst: "
                                         L"compression source does not exist"));
}

TEST(CompressWithSizeLimit, DoesNotPackTheArchiveItself) {
  const TestFolder test;
  test.MakeFile(L"f\\x.txt", "x");
  const std::wstring archive = test.Path(L"f\\a.zip");
  for (int run = 0; run < 2; ++run) {
    ASSERT_TRUE(CompressWithSizeLimit_MostRecentFirst({test.Path(L"f")}, archive));
    EXPECT_THAT(NamesOf(ReadArchive(archive)), ElementsAre(L"f/x.txt"));
  }
}

TEST(CompressWithSizeLimit, AnArchiveThatCannotBeCreatedIsReported) {
  const TestFolder test;
  const std::wstring folder = test.MakeFolder(L"a folder.zip");
  const std::wstring held = test.MakeFile(L"held.zip", "older archive");
  const KernelHandle hold = Hold(held);
  for (const std::wstring& archive : {test.Path(L"missing\\a.zip"), folder, held, std::wstring()}) {
    logging::ErrorCapture errors;
    EXPECT_FALSE(CompressWithSizeLimit_MostRecentFirst({test.Path()}, archive));
    EXPECT_THAT(errors.Take(),
                ElementsAre(L"stutil::ScopedZipArchive::ScopedZipArchive: error creating zip file " + archive));
    EXPECT_FALSE(PathExists(archive + kPartialSuffix));
  }
}

TEST(CompressWithSizeLimit, AHeldFileCostsOnlyItself) {
  const TestFolder test;
  const std::wstring held = test.MakeFile(L"f\\held.txt", Text(2'500'000));  // in pieces, like the next one
  SetAge(held, 1);
  SetAge(test.MakeFile(L"f\\free.txt", Text(1'500'000)), 2);
  const std::wstring archive = test.Path(L"a.zip");
  const KernelHandle hold = Hold(held);
  logging::ErrorCapture errors;
  EXPECT_TRUE(CompressWithSizeLimit_MostRecentFirst({test.Path(L"f")}, archive));
  EXPECT_THAT(ReadArchive(archive), ElementsAre(Pair(L"f/free.txt", Text(1'500'000))));
  EXPECT_THAT(errors.Take(),
              ElementsAre(L"stutil::CompressWithSizeLimit_MostRecentFirst: cannot add file f/held.txt : " + held));
  EXPECT_FALSE(PathExists(held + L"__"));
}

TEST(CompressWithSizeLimit, AFileHeldForAMomentIsPackedThroughItsCopy) {
  const TestFolder test;
  const std::wstring held = test.MakeFile(L"f\\held.txt", Text(3'000'000));
  const std::wstring archive = test.Path(L"a.zip");
  logging::ErrorCapture errors;
  KernelHandle hold = Hold(held);
  std::thread holder([&] {  // lets go once the first attempt has failed
    while (errors.Take().empty())
      Sleep(1);
    hold.Reset();
  });
  EXPECT_TRUE(CompressWithSizeLimit_MostRecentFirst({test.Path(L"f")}, archive));
  holder.join();
  EXPECT_THAT(ReadArchive(archive), ElementsAre(Pair(L"f/held.txt", Text(3'000'000))));
  EXPECT_FALSE(PathExists(held + L"__"));
}

TEST(CopyRetrier, ReplacesAnOlderCopyAndDeletesItsOwn) {
  const TestFolder test;
  const std::wstring archivePath = test.Path(L"a.zip");
  const std::wstring source = test.MakeFile(L"x.txt", "new");
  test.MakeFile(L"x.txt__", "an older copy");
  SetFileAttributesW(source.c_str(), FILE_ATTRIBUTE_READONLY);  // which the copy inherits
  {
    ScopedZipArchive archive(archivePath);
    EXPECT_TRUE(CopyRetrier(archive).Add({source, L"root/x.txt", 3, 0}));
    EXPECT_FALSE(CopyRetrier(archive).Add({test.Path(L"missing"), L"root/missing", 3, 0}));
  }
  EXPECT_THAT(ReadArchive(archivePath), ElementsAre(Pair(L"root/x.txt", "new")));
  EXPECT_FALSE(PathExists(source + L"__"));
}

TEST(AddFile, PacksWhatIsThereUpToTheRecordedSize) {
  const TestFolder test;
  struct {
    uint64_t recorded;
    size_t actual;
    size_t packed;
  } const rows[] = {
      {10, 10, 10},
      {10, 25, 10},
      {10, 4, 4},
      {10, 0, 0},
      {0, 5, 0},
      {2'500'000, 2'500'000, 2'500'000},
      {2'500'000, 4'000'000, 2'500'000},
      {2'500'000, 1'200'000, 1'200'000},
      {2'500'000, 300, 300},
      {2'500'000, 0, 0},
  };
  const std::wstring archivePath = test.Path(L"a.zip");
  {
    ScopedZipArchive archive(archivePath);
    for (const auto& row : rows) {
      EXPECT_TRUE(AddFile(archive, {test.MakeFile(L"x", Text(row.actual)), L"x", row.recorded, 0}));
    }
    EXPECT_FALSE(AddFile(archive, {test.Path(L"vanished"), L"x", 10, 0}));
    EXPECT_FALSE(AddFile(archive, {test.Path(L"vanished"), L"x", 2'500'000, 0}));
  }
  const Entries entries = ReadArchive(archivePath);
  ASSERT_THAT(entries, SizeIs(std::size(rows)));
  for (size_t i = 0; i < entries.size(); ++i)
    EXPECT_TRUE(entries[i].second == Text(rows[i].packed)) << "row " << i;
}

TEST(ScopedZipArchive, AForgottenEntryLeavesNoTrace) {
  const TestFolder test;
  const std::wstring archivePath = test.Path(L"a.zip");
  const std::vector<uint8_t> bytes(3'000'000, 1);
  {
    ScopedZipArchive archive(archivePath);
    archive.BeginEntry(L"forgotten");
    ASSERT_TRUE(archive.Append(bytes));
  }
  EXPECT_THAT(ReadArchive(archivePath), IsEmpty());
  std::string whole;
  ASSERT_EQ(ReadWholeFile(archivePath, 1000, whole), DWORD{ERROR_SUCCESS});
  EXPECT_EQ(whole.size(), 22U);  // the end record alone
}

TEST(ScopedZipArchive, KeepsTimesInsideWhatAZipCanSay) {
  const TestFolder test;
  const std::wstring archivePath = test.Path(L"a.zip");
  const uint64_t times[] = {1'700'000'000, 0, UINT64_MAX - 11'644'473'599, UINT64_MAX / 4};
  {
    ScopedZipArchive archive(archivePath);
    for (const uint64_t time : times)
      EXPECT_TRUE(archive.Add({L"x", time}, {}));
  }
  std::string bytes;
  ASSERT_EQ(ReadWholeFile(archivePath, 10'000, bytes), DWORD{ERROR_SUCCESS});
  mz_zip_archive zip{};
  ASSERT_TRUE(mz_zip_reader_init_mem(&zip, bytes.data(), bytes.size(), 0));
  int years[std::size(times)] = {};
  mz_zip_archive_file_stat stat{};
  for (mz_uint i = 0; i < std::size(times); ++i) {
    mz_zip_reader_file_stat(&zip, i, &stat);
    years[i] = 1970 + static_cast<int>(stat.m_time / 31'556'952);
    EXPECT_NE(stat.m_bit_flag & 0x800, 0) << "the name is UTF-8";
    EXPECT_TRUE(i != 0 || stat.m_time == 1'700'000'000) << stat.m_time;
  }
  mz_zip_reader_end(&zip);
  EXPECT_THAT(years, ElementsAre(2023, 1980, 1980, 2107));
}

TEST(ScopedZipArchive, HoldsMoreEntriesThanSixteenBitsCount) {
  const TestFolder test;
  const std::wstring archivePath = test.Path(L"a.zip");
  constexpr unsigned kCount = 70'000;
  {
    ScopedZipArchive archive(archivePath);
    for (unsigned i = 0; i < kCount; ++i)
      ASSERT_TRUE(archive.Add({L"folder/" + std::to_wstring(i), 0}, {}));
  }
  const Entries entries = ReadArchive(archivePath);
  ASSERT_THAT(entries, SizeIs(kCount));
  EXPECT_EQ(entries.back().first, L"folder/69999");
}

TEST(ScopedZipArchive, AFailedFinalizeLeavesNoFile) {
  const TestFolder test;
  const std::wstring archivePath = test.Path(L"a.zip");
  logging::ErrorCapture errors;
  {
    ScopedZipArchive archive(archivePath);
    EXPECT_TRUE(archive.Add({L"x", 0}, {}));
    test.MakeFolder(L"a.zip");  // a folder cannot be replaced
  }
  EXPECT_THAT(errors.Take(), ElementsAre(L"stutil::ScopedZipArchive::~ScopedZipArchive: error on archive finalize"));
  EXPECT_TRUE(FolderExists(archivePath));
  EXPECT_FALSE(PathExists(archivePath + kPartialSuffix));
}

}  // namespace
}  // namespace stutil
