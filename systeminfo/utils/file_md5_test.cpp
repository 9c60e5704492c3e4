#include "systeminfo/utils/file_md5.h"

#include <gmock/gmock.h>

#include "core/logging.h"
#include "core/text.h"
#include "tests/support/test_folder.h"

namespace systeminfo::utils {
namespace {

using testing::ElementsAre;

std::string MakeFile(const TestFolder& folder, std::wstring_view name, std::string_view bytes) {
  return ToUtf8(folder.MakeFile(name, bytes));
}

TEST(FileMd5, KnownFilesWhateverTheirSizeAndName) {
  const TestFolder folder;
  EXPECT_EQ(GetFileMD5(MakeFile(folder, L"empty", "")), "d41d8cd98f00b204e9800998ecf8427e");
  EXPECT_EQ(GetFileMD5(MakeFile(folder, L"S\u00fcd \u6771.bin", "abc")), "900150983cd24fb0d6963f7d28e17f72");
  // Several buffers and a rest; the expected digest is of `yes a | tr -d '\n' | head -c 1000000 | md5sum`.
  EXPECT_EQ(GetFileMD5(MakeFile(folder, L"long", std::string(1000000, 'a'))), "7707d6ae4e027c70eea2a935c2296f21");
}

TEST(FileMd5, FileThatIsWrittenToElsewhereIsHashed) {
  const TestFolder folder;
  const std::wstring path = folder.MakeFile(L"log", "abc");
  const KernelHandle writer(
      CreateFileW(path.c_str(), GENERIC_WRITE, FILE_SHARE_READ, nullptr, OPEN_EXISTING, 0, nullptr));
  ASSERT_TRUE(writer);
  EXPECT_EQ(GetFileMD5(ToUtf8(path)), "900150983cd24fb0d6963f7d28e17f72");
}

TEST(FileMd5, FileThatCannotBeOpenedIsEmptyAndLoggedWithItsCode) {
  const TestFolder folder;
  const KernelHandle exclusive(
      CreateFileW(folder.MakeFile(L"locked").c_str(), GENERIC_WRITE, 0, nullptr, OPEN_EXISTING, 0, nullptr));
  logging::ErrorCapture capture(logging::Level::kTrace);
  EXPECT_EQ(GetFileMD5(ToUtf8(folder.Path(L"absent"))), "");
  EXPECT_EQ(GetFileMD5(ToUtf8(folder.Path(L"locked"))), "");
  EXPECT_EQ(GetFileMD5(ToUtf8(folder.Path())), "");
  EXPECT_EQ(GetFileMD5(""), "");
  const std::wstring prefix = L"systeminfo::utils::GetFileMD5: fopen_s ";
  EXPECT_THAT(capture.Take(), ElementsAre(prefix + folder.Path(L"absent") + L" fails with 2",
                                          prefix + folder.Path(L"locked") + L" fails with 32",
                                          prefix + folder.Path() + L" fails with 5", prefix + L" fails with 3"));
}

TEST(FileMd5, BatchKeepsTheOrderAndGoesOnBehindAFailure) {
  const TestFolder folder;
  std::vector<std::string> paths;
  std::vector<std::string> expected;
  for (int i = 0; i < 50; ++i) {
    paths.push_back(MakeFile(folder, std::to_wstring(i), std::string(static_cast<size_t>(i) * 1000, 'x')));
    expected.push_back(GetFileMD5(paths.back()));
  }
  paths[20] = "Z:\\absent";
  expected[20].clear();
  EXPECT_EQ(GetFileMD5s(paths), expected);
  EXPECT_THAT(GetFileMD5s({}), ElementsAre());

  std::vector<LONGLONG> sizes(paths.size(), -1);
  EXPECT_EQ(GetFileMD5s(paths, nullptr,
                        [&sizes](size_t index, HANDLE file) {
                          LARGE_INTEGER size{};
                          GetFileSizeEx(file, &size);
                          sizes[index] = size.QuadPart;
                        }),
            expected);
  for (size_t i = 0; i < sizes.size(); ++i)
    EXPECT_EQ(sizes[i], i == 20 ? -1 : static_cast<LONGLONG>(i) * 1000);

  const std::atomic<bool> cancelled{true};
  EXPECT_EQ(GetFileMD5s(paths, &cancelled), std::vector<std::string>(paths.size()));
}

}  // namespace
}  // namespace systeminfo::utils
