// The library as a caller sees it: the built qxlink.dll, copied into a folder of the test together with a
// configuration.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <json/value.h>

#include <algorithm>
#include <atomic>
#include <memory>
#include <set>
#include <thread>
#include <vector>

#include "core/dynamic_library.h"
#include "core/files.h"
#include "core/json.h"
#include "core/program_path.h"
#include "core/text.h"
#include "interfaces/qxlink_api.h"
#include "tests/support/test_folder.h"

namespace {

using testing::MatchesRegex;

std::vector<std::wstring> FilesIn(const std::wstring& folder) {
  std::vector<std::wstring> names;
  WIN32_FIND_DATAW data{};
  const FindHandle find(FindFirstFileW(ExtendedPath(folder + L"\\*").c_str(), &data));
  if (!find) return names;
  do {
    const std::wstring name = data.cFileName;
    if (name != L"." && name != L"..") names.push_back(name);
  } while (FindNextFileW(find.Get(), &data));
  std::sort(names.begin(), names.end());
  return names;
}

class QxlinkTest : public testing::Test {
 protected:
  // `configuration` null: there is no file.
  int32_t Start(const char* configuration) {
    if (configuration != nullptr) m_folder.MakeFile(L"qxlink.json", configuration);
    const std::wstring path = m_folder.Path(L"qxlink.dll");
    CopyFileW((ProgramFolder() + L"\\qxlink.dll").c_str(), path.c_str(), FALSE);
    m_library = DynamicLibrary(path.c_str());
    if (!m_library) throw std::runtime_error("the library cannot be loaded");
    return Call<decltype(&qxskylane_init)>("qxskylane_init")(&m_context);
  }

  ~QxlinkTest() override {
    if (m_context != nullptr) Call<decltype(&qxskylane_uninit)>("qxskylane_uninit")(m_context);
    m_library = DynamicLibrary();  // before its file is deleted
  }

  template <class Function>
  Function Call(const char* name) const {
    const auto function = m_library.Resolve<Function>(name);
    if (function == nullptr) throw std::runtime_error(std::string("no export ") + name);
    return function;
  }

  static QxskylaneUpload Request(const std::string& path) {
    QxskylaneUpload upload{};
    upload.size = sizeof upload;
    upload.file_path = path.c_str();
    upload.category = "kvsetuplogs";
    return upload;
  }

  int32_t Upload(const std::wstring& path, const char* tags = nullptr) const {
    const std::string narrow = ToUtf8(path);
    QxskylaneUpload upload = Request(narrow);
    upload.tags_json = tags;
    return Call<decltype(&qxskylane_file_upload)>("qxskylane_file_upload")(m_context, &upload);
  }

  std::string Content(const std::wstring& name) const {
    std::string bytes;
    EXPECT_EQ(ReadWholeFile(m_folder.Path(name), 64 << 20, bytes), 0u);
    return bytes;
  }

  const TestFolder m_folder;
  DynamicLibrary m_library;
  QxskylaneContext* m_context = nullptr;
};

TEST_F(QxlinkTest, PutsTheWholeFileIntoTheOutboxWithItsDescription) {
  ASSERT_EQ(Start(R"({"outbox": "deep\\out box"})"), QXSKYLANE_OK);
  std::string bytes((3 << 20) + 7, 'x');
  for (size_t i = 0; i < bytes.size(); i += 1000)
    bytes[i] = static_cast<char>(i);
  const std::wstring source = m_folder.MakeFile(L"source\\collected \u00e4.zip", bytes);
  ASSERT_EQ(Upload(source, R"({"tags":["one","two"]})"), QXSKYLANE_OK);

  const auto names = FilesIn(m_folder.Path(L"deep\\out box"));
  ASSERT_EQ(names.size(), 2u);
  EXPECT_THAT(ToUtf8(names[0]), MatchesRegex("\\d+-\\d+-\\w+-collected .+\\.zip"));
  EXPECT_EQ(names[0].substr(32), L"-collected \u00e4.zip");
  EXPECT_TRUE(Content(L"deep\\out box\\" + names[0]) == bytes);
  EXPECT_TRUE(PathExists(source));

  EXPECT_EQ(names[1], names[0] + L".json");
  Json::Value description;
  std::string error;
  ASSERT_TRUE(ParseJson(Content(L"deep\\out box\\" + names[1]), description, error));
  EXPECT_EQ(description["category"].asString(), "kvsetuplogs");
  EXPECT_EQ(description["size"].asUInt64(), bytes.size());
  EXPECT_EQ(description["tags"]["tags"][1].asString(), "two");
  EXPECT_EQ(description["sha256"].asString().size(), 64u);
}

TEST_F(QxlinkTest, DescribesTheFileByTheRightHash) {
  ASSERT_EQ(Start(R"({"outbox": "out"})"), QXSKYLANE_OK);
  ASSERT_EQ(Upload(m_folder.MakeFile(L"abc.zip", "abc")), QXSKYLANE_OK);
  EXPECT_NE(Content(L"out\\" + FilesIn(m_folder.Path(L"out")).back())
                .find("ba7816bf8f01cfea414140de5dae2223b00361a396177a9cb410ff61f20015ad"),
            std::string::npos);
}

TEST_F(QxlinkTest, UsesTheFolderOfTheUserWithoutAConfiguration) {
  SetEnvironmentVariableW(L"LOCALAPPDATA", m_folder.Path(L"local").c_str());
  ASSERT_EQ(Start(nullptr), QXSKYLANE_OK);
  EXPECT_EQ(Upload(m_folder.MakeFile(L"a.zip", "")), QXSKYLANE_OK);
  EXPECT_EQ(FilesIn(m_folder.Path(L"local\\Quorvex\\SupportTool\\Outbox")).size(), 2u);
}

TEST_F(QxlinkTest, ShipsAConfigurationThatIsTheDefault) {
  std::string shipped;
  ASSERT_EQ(ReadWholeFile(ProgramFolder() + L"\\qxlink.json", 10000, shipped), 0u);
  SetEnvironmentVariableW(L"LOCALAPPDATA", m_folder.Path(L"local").c_str());
  ASSERT_EQ(Start(shipped.c_str()), QXSKYLANE_OK);
  EXPECT_EQ(Upload(m_folder.MakeFile(L"a.zip", "a")), QXSKYLANE_OK);
  EXPECT_EQ(FilesIn(m_folder.Path(L"local\\Quorvex\\SupportTool\\Outbox")).size(), 2u);
}

TEST_F(QxlinkTest, UploadsAtTheSameMomentDoNotCollide) {
  ASSERT_EQ(Start(R"({"outbox": "out"})"), QXSKYLANE_OK);
  const std::wstring source = m_folder.MakeFile(L"a.zip", "bytes");
  std::vector<std::thread> threads;
  threads.reserve(4);
  for (int i = 0; i < 4; ++i) {
    threads.emplace_back([&] {
      for (int k = 0; k < 3; ++k)
        EXPECT_EQ(Upload(source), QXSKYLANE_OK);
    });
  }
  for (auto& thread : threads)
    thread.join();
  EXPECT_EQ(FilesIn(m_folder.Path(L"out")).size(), 24u);
}

TEST_F(QxlinkTest, TakesBytesInMemoryAsAFile) {
  ASSERT_EQ(Start(R"({"outbox": "out"})"), QXSKYLANE_OK);
  const auto upload = Call<decltype(&qxskylane_mem_upload)>("qxskylane_mem_upload");
  const QxskylaneUpload request = Request("report.txt");
  EXPECT_EQ(upload(m_context, &request, "hello", 5), QXSKYLANE_OK);
  EXPECT_EQ(upload(m_context, &request, nullptr, 5), QXSKYLANE_BAD_ARGUMENT);
  const auto names = FilesIn(m_folder.Path(L"out"));
  ASSERT_EQ(names.size(), 2u);
  EXPECT_TRUE(names[0].ends_with(L"-report.txt"));
  EXPECT_EQ(Content(L"out\\" + names[0]), "hello");
}

TEST_F(QxlinkTest, LeavesNothingBehindWhenAnUploadFails) {
  ASSERT_EQ(Start(R"({"outbox": "out"})"), QXSKYLANE_OK);
  EXPECT_EQ(Upload(m_folder.Path(L"missing.zip")), QXSKYLANE_FILE_UNREADABLE);
  EXPECT_EQ(Upload(m_folder.MakeFolder(L"folder")), QXSKYLANE_FILE_UNREADABLE);
  const std::string path = ToUtf8(m_folder.MakeFile(L"a.zip", std::string(3 << 20, 'a')));
  QxskylaneUpload upload = Request(path);
  upload.progress = [](void*, uint64_t, uint64_t) -> int32_t { return 1; };
  EXPECT_EQ(Call<decltype(&qxskylane_file_upload)>("qxskylane_file_upload")(m_context, &upload), QXSKYLANE_CANCELLED);
  EXPECT_TRUE(FilesIn(m_folder.Path(L"out")).empty());
}

TEST_F(QxlinkTest, ProgressEndsWithTheWholeFile) {
  ASSERT_EQ(Start(R"({"outbox": "out"})"), QXSKYLANE_OK);
  const std::string path = ToUtf8(m_folder.MakeFile(L"a.zip", std::string(2'500'000, 'a')));
  std::pair<uint64_t, uint64_t> last{};
  QxskylaneUpload upload = Request(path);
  upload.user = &last;
  upload.progress = [](void* user, uint64_t sent, uint64_t total) -> int32_t {
    *static_cast<std::pair<uint64_t, uint64_t>*>(user) = {sent, total};
    return 0;
  };
  EXPECT_EQ(Call<decltype(&qxskylane_file_upload)>("qxskylane_file_upload")(m_context, &upload), QXSKYLANE_OK);
  EXPECT_EQ(last, std::make_pair(uint64_t{2'500'000}, uint64_t{2'500'000}));
}

TEST_F(QxlinkTest, AnOutboxThatCannotBeIsAnErrorOfItsOwn) {
  m_folder.MakeFile(L"file", "in the way");
  ASSERT_EQ(Start(R"({"outbox": "file"})"), QXSKYLANE_OK);
  const std::wstring source = m_folder.MakeFile(L"a.zip", "a");
  EXPECT_EQ(Upload(source), QXSKYLANE_OUTBOX_UNWRITABLE);
  const auto setText = Call<decltype(&qxskylane_set_optionv)>("qxskylane_set_optionv");
  for (const std::string outbox : {"file\\below", "%ST_TEST_NOTHING%\\out", "other"}) {
    ASSERT_EQ(setText(m_context, QXSKYLANE_OPTION_OUTBOX, outbox.data(), outbox.size()), QXSKYLANE_OK);
    const int32_t expected = outbox == "other"  ? QXSKYLANE_OK
                             : outbox[0] == '%' ? QXSKYLANE_CONFIGURATION_INVALID
                                                : QXSKYLANE_OUTBOX_UNWRITABLE;
    EXPECT_EQ(Upload(source), expected) << outbox;
  }
  EXPECT_EQ(Content(L"file"), "in the way");
}

TEST_F(QxlinkTest, NeverCallsAnUploadDoneThatNobodyReceived) {
  ASSERT_EQ(Start(R"({"endpoint": "https://nobody.invalid/files", "outbox": "out", "retries": 0, "proxy": "none"})"),
            QXSKYLANE_OK);
  EXPECT_EQ(Upload(m_folder.MakeFile(L"a.zip", "a")), QXSKYLANE_NO_CONNECTION);
  EXPECT_FALSE(PathExists(m_folder.Path(L"out")));
}

TEST_F(QxlinkTest, DeletesOnlyPartsThatNobodyWritesAnyMore) {
  ASSERT_EQ(Start(R"({"outbox": "out"})"), QXSKYLANE_OK);
  const wchar_t* const kNames[] = {L"out\\20200101-000000-0123456789abcdef-old.zip.partial",
                                   L"out\\20200101-000000-0123456789abcdef-new.zip.partial", L"out\\notes.partial"};
  for (const wchar_t* name : kNames) {
    const std::wstring path = m_folder.MakeFile(name, "part");
    if (name == kNames[1]) continue;
    const KernelHandle file(CreateFileW(path.c_str(), FILE_WRITE_ATTRIBUTES, 0, nullptr, OPEN_EXISTING, 0, nullptr));
    const FILETIME longAgo{0, 0x01D00000};
    SetFileTime(file.Get(), nullptr, nullptr, &longAgo);
  }
  ASSERT_EQ(Upload(m_folder.MakeFile(L"a.zip", "a")), QXSKYLANE_OK);
  EXPECT_FALSE(PathExists(m_folder.Path(kNames[0])));
  EXPECT_TRUE(PathExists(m_folder.Path(kNames[1])));
  EXPECT_TRUE(PathExists(m_folder.Path(kNames[2])));
}

TEST_F(QxlinkTest, DoesNotStartWithAConfigurationThatCannotBe) {
  EXPECT_EQ(Start(R"({"outbox": 5})"), QXSKYLANE_CONFIGURATION_INVALID);
  EXPECT_EQ(m_context, nullptr);
  m_folder.MakeFile(L"qxlink.json", std::string(100'000, ' ') + "{}");
  EXPECT_EQ(Start(nullptr), QXSKYLANE_CONFIGURATION_INVALID);
}

TEST_F(QxlinkTest, PlainHttpNeedsThePermissionOfTheConfiguration) {
  for (const bool isAllowed : {false, true}) {
    const std::string configuration = std::string(R"({"allow_plain_http": )") + (isAllowed ? "true}" : "false}");
    ASSERT_EQ(Start(configuration.c_str()), QXSKYLANE_OK);
    const auto set = Call<decltype(&qxskylane_set_option)>("qxskylane_set_option");
    const auto get = Call<decltype(&qxskylane_get_option)>("qxskylane_get_option");
    int64_t value = -1;
    EXPECT_EQ(set(m_context, 20, 1), isAllowed ? QXSKYLANE_OK : QXSKYLANE_OPTION_REFUSED);
    EXPECT_EQ(get(m_context, 20, &value), QXSKYLANE_OK);
    EXPECT_EQ(value, isAllowed ? 1 : 0);
    EXPECT_EQ(set(m_context, 20, 0), QXSKYLANE_OK);
    EXPECT_EQ(set(m_context, 20, 2), QXSKYLANE_BAD_ARGUMENT);
    EXPECT_EQ(set(m_context, 21, 1), QXSKYLANE_OPTION_UNKNOWN);
    EXPECT_EQ(set(m_context, QXSKYLANE_OPTION_OUTBOX, 1), QXSKYLANE_OPTION_UNKNOWN);
    EXPECT_EQ(get(m_context, QXSKYLANE_OPTION_OUTBOX, &value), QXSKYLANE_OPTION_UNKNOWN);
    EXPECT_EQ(get(m_context, 20, nullptr), QXSKYLANE_BAD_ARGUMENT);
    Call<decltype(&qxskylane_uninit)>("qxskylane_uninit")(std::exchange(m_context, nullptr));
    m_library = DynamicLibrary();
  }
}

TEST_F(QxlinkTest, RefusesRequestsThatCannotBe) {
  ASSERT_EQ(Start(R"({"outbox": "out"})"), QXSKYLANE_OK);
  const auto upload = Call<decltype(&qxskylane_file_upload)>("qxskylane_file_upload");
  const std::string path = ToUtf8(m_folder.MakeFile(L"a.zip", "a"));
  const QxskylaneUpload good = Request(path);
  std::vector<QxskylaneUpload> bad(6, good);
  bad[0].size = sizeof good - 1;
  bad[1].size = 0;
  bad[2].file_path = nullptr;
  bad[3].file_path = "";
  bad[4].category = nullptr;
  bad[5].tags_json = "[\"not an object\"]";
  for (const auto& request : bad)
    EXPECT_EQ(upload(m_context, &request), QXSKYLANE_BAD_ARGUMENT);
  EXPECT_EQ(upload(m_context, nullptr), QXSKYLANE_BAD_ARGUMENT);
  EXPECT_EQ(upload(nullptr, &good), QXSKYLANE_BAD_ARGUMENT);
  EXPECT_FALSE(PathExists(m_folder.Path(L"out")));
  QxskylaneUpload longer = good;
  longer.size += 64;
  EXPECT_EQ(upload(m_context, &longer), QXSKYLANE_OK);
}

TEST_F(QxlinkTest, AnswersFromItsThreadInTheOrderOfTheCalls) {
  ASSERT_EQ(Start(R"({"outbox": "out"})"), QXSKYLANE_OK);
  struct Answers {
    std::vector<std::pair<int32_t, std::string>> seen;
    DWORD caller = GetCurrentThreadId();
  } answers;
  const QxskylaneDone done = [](void* user, int32_t result, const QxskylaneResponse* response) {
    auto& seen = *static_cast<Answers*>(user);
    EXPECT_NE(GetCurrentThreadId(), seen.caller);
    seen.seen.emplace_back(result, response == nullptr ? "" : response->location);
  };
  const auto uploadFile = Call<decltype(&qxskylane_file_upload_async)>("qxskylane_file_upload_async");
  const auto uploadMemory = Call<decltype(&qxskylane_mem_upload_async)>("qxskylane_mem_upload_async");
  std::string path = ToUtf8(m_folder.MakeFile(L"a.zip", "a"));
  QxskylaneUpload request = Request(path);
  ASSERT_EQ(uploadFile(m_context, &request, done, &answers), QXSKYLANE_OK);
  path.assign("overwritten by its owner");  // the library has its copy
  const std::string missing = ToUtf8(m_folder.Path(L"missing.zip"));
  request = Request(missing);
  ASSERT_EQ(uploadFile(m_context, &request, done, &answers), QXSKYLANE_OK);
  EXPECT_EQ(uploadFile(m_context, &request, nullptr, nullptr), QXSKYLANE_BAD_ARGUMENT);
  std::atomic<bool> isSent = false;
  const QxskylaneDone last = [](void* user, int32_t, const QxskylaneResponse*) {
    *static_cast<std::atomic<bool>*>(user) = true;
  };
  ASSERT_EQ(uploadMemory(m_context, &request, "hello", 5, last, &isSent), QXSKYLANE_OK);
  for (int i = 0; i < 500 && !isSent; ++i)
    Sleep(10);
  ASSERT_EQ(answers.seen.size(), 2u);
  EXPECT_EQ(answers.seen[0].first, QXSKYLANE_OK);
  EXPECT_TRUE(answers.seen[0].second.ends_with("-a.zip")) << answers.seen[0].second;
  EXPECT_EQ(answers.seen[1], std::make_pair(int32_t{QXSKYLANE_FILE_UNREADABLE}, std::string()));
  EXPECT_EQ(FilesIn(m_folder.Path(L"out")).size(), 4u);
}

TEST_F(QxlinkTest, MessagesNeedAServiceForThem) {
  ASSERT_EQ(Start("{}"), QXSKYLANE_OK);
  const auto ask = Call<decltype(&qxskylane_ask_json)>("qxskylane_ask_json");
  const auto free = Call<decltype(&qxskylane_free_response)>("qxskylane_free_response");
  QxskylaneResponse garbage{};
  QxskylaneResponse* response = &garbage;
  EXPECT_EQ(ask(m_context, "topic", "{}", &response), QXSKYLANE_NOT_SUPPORTED);
  EXPECT_EQ(response, nullptr);
  free(response);
  EXPECT_EQ(ask(m_context, "topic", "{}", nullptr), QXSKYLANE_BAD_ARGUMENT);
  EXPECT_EQ(ask(m_context, "a\r\nHost: b", "{}", &response), QXSKYLANE_BAD_ARGUMENT);
  EXPECT_EQ(ask(m_context, "topic", "{no json", &response), QXSKYLANE_BAD_ARGUMENT);
  EXPECT_EQ(ask(m_context, nullptr, "{}", &response), QXSKYLANE_BAD_ARGUMENT);
}

TEST_F(QxlinkTest, EveryResultHasATextOfItsOwn) {
  ASSERT_EQ(Start("{}"), QXSKYLANE_OK);
  const auto text = Call<decltype(&qxskylane_text)>("qxskylane_text");
  std::set<std::string> texts{text(-1)};
  for (int32_t result = QXSKYLANE_OK; result <= QXSKYLANE_INTERNAL_ERROR; ++result)
    texts.insert(text(result));
  for (int32_t result = QXSKYLANE_NO_CONNECTION; result <= QXSKYLANE_SERVICE_FAILED; ++result)
    texts.insert(text(result));
  EXPECT_EQ(texts.size(), 1u + 11 + 5);
  EXPECT_STREQ(text(1006), text(-1));
}

}  // namespace
