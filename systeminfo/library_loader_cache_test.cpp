#include "systeminfo/library_loader_cache.h"

#include <gmock/gmock.h>

#include <random>

#include "core/logging.h"
#include "core/program_path.h"
#include "tests/support/test_folder.h"
#include "tests/support/test_registry.h"

namespace systeminfo {
namespace {

using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;

// Of tests/children/messages.mc.
constexpr DWORD kInsertions = 0xC000'1000, kTwoLines = 4097, kHostile = 4098;

std::string ReadLibrary() {
  std::string bytes;
  ReadWholeFile(ProgramFolder() + L"\\message_library.dll", 64 << 20, bytes);
  return bytes;
}

template <class Number>
Number& At(std::string& bytes, size_t offset) {
  return *reinterpret_cast<Number*>(&bytes.at(offset));
}

// The same library for 32-bit Windows, as far as its resources go: the optional header is made anew.
std::string As32Bit(std::string bytes) {
  const size_t header = At<uint32_t>(bytes, 0x3C) + 4;
  const size_t optional = header + 20;
  const std::string tail = bytes.substr(optional + 104, 8 + 16 * 8);  // loader flags, directories
  At<uint16_t>(bytes, header) = IMAGE_FILE_MACHINE_I386;
  At<uint16_t>(bytes, optional) = IMAGE_NT_OPTIONAL_HDR32_MAGIC;
  At<uint32_t>(bytes, optional + 24) = 0;
  At<uint32_t>(bytes, optional + 28) = 0x1000'0000;
  for (size_t i = 0; i < 4; ++i)
    At<uint32_t>(bytes, optional + 72 + i * 4) = 0x1000;  // stack and heap
  return bytes.replace(optional + 88, tail.size(), tail);
}

class LibraryLoaderCacheTest : public testing::Test {
 protected:
  static constexpr wchar_t kSources[] = L"SYSTEM\\CurrentControlSet\\Services\\Eventlog\\";

  void AddSource(const std::wstring& logAndName, const std::wstring& file) const {
    m_machine.SetText(kSources + logAndName, L"EventMessageFile", file, REG_EXPAND_SZ);
  }

  TestFolder m_folder;
  TestRegistryKey m_machine;
  RedirectedHive m_hive{HKEY_LOCAL_MACHINE, m_machine.MakeKey({})};
  const std::wstring m_library = ProgramFolder() + L"\\message_library.dll";
  logging::ErrorCapture m_log{logging::Level::kTrace};
};

TEST_F(LibraryLoaderCacheTest, LibraryOfASourceIsFoundByItsLogAndStaysForBoth) {
  SetEnvironmentVariableW(L"ST_MESSAGES", ProgramFolder().c_str());
  AddSource(L"Application\\App", L"%ST_MESSAGES%\\message_library.dll");
  AddSource(L"System\\Sys", m_library);
  LibraryLoaderCache cache;
  EXPECT_EQ(cache.Find(L"App"), nullptr);
  EXPECT_TRUE(cache.Load(L"App"));
  EXPECT_FALSE(cache.Load(L"Sys"));
  cache.SetLogName(L"System");
  EXPECT_TRUE(cache.Load(L"Sys"));
  EXPECT_TRUE(cache.Load(L"App"));
  EXPECT_EQ(GetMessageString(cache.Find(L"App"), kTwoLines), L"First line\r\nsecond line%%\r\n");
  EXPECT_EQ(GetEnvironmentVariableW(L"ST_MESSAGE_LIBRARY_RAN", nullptr, 0), 0u) << "its code ran";
}

TEST_F(LibraryLoaderCacheTest, SourceWithoutALibraryIsLoggedOnceForEachLog) {
  m_machine.MakeKey(std::wstring(kSources) + L"Application\\NoValue");
  m_machine.SetNumber(std::wstring(kSources) + L"Application\\Number", L"EventMessageFile", 5);
  LibraryLoaderCache cache;
  const std::wstring scope = L"systeminfo::LibraryLoaderCache::Load: Failed to load regKey for source ";
  for (const std::wstring source : {L"NoKey", L"NoValue", L"Number", L"", L"a\\..\\b", L"x\nsource"}) {
    EXPECT_FALSE(cache.Load(source));
    EXPECT_FALSE(cache.Load(source));
    EXPECT_THAT(m_log.Take(), Contains(scope + source).Times(1));
  }
  cache.SetLogName(L"System");
  EXPECT_FALSE(cache.Load(L"NoKey"));
  EXPECT_THAT(m_log.Take(), ElementsAre(scope + L"NoKey"));
}

TEST_F(LibraryLoaderCacheTest, FilesThatAreNoLibrariesAreLogged) {
  const std::string library = ReadLibrary();
  const std::wstring paths[] = {m_folder.Path(L"absent.dll"),
                                m_folder.Path(),
                                m_folder.MakeFile(L"empty.dll"),
                                m_folder.MakeFile(L"text.dll", "no library at all"),
                                m_folder.MakeFile(L"start.dll", "MZ"),
                                m_folder.MakeFile(L"header.dll", library.substr(0, 0x90)),
                                m_folder.MakeFile(L"huge.dll", "MZ" + std::string(64 << 20, '\xFF')),
                                m_library + L";" + m_library,
                                std::wstring(40'000, L'x'),
                                L""};
  LibraryLoaderCache cache;
  for (const std::wstring& path : paths) {
    EXPECT_FALSE(cache.TryLoad(L"source", path)) << path.size();
    EXPECT_THAT(m_log.Take(),
                Contains(L"systeminfo::LibraryLoaderCache::TryLoad: Failed to load library from path " + path));
  }
  EXPECT_EQ(cache.Find(L"source"), nullptr);
}

TEST_F(LibraryLoaderCacheTest, LibraryFor32BitWindowsIsAsGood) {
  LibraryLoaderCache cache;
  ASSERT_TRUE(cache.TryLoad(L"source", m_folder.MakeFile(L"x86.dll", As32Bit(ReadLibrary()))));
  EXPECT_EQ(GetMessageString(cache.Find(L"source"), kTwoLines), L"First line\r\nsecond line%%\r\n");
}

TEST_F(LibraryLoaderCacheTest, DamagedMessageTablesAreRefusedOrHarmless) {
  const std::string library = ReadLibrary();
  const size_t text = library.find(std::string("F\0i\0r\0s\0t\0 ", 11));
  ASSERT_NE(text, std::string::npos);
  const size_t begin = text - 44 - 0x100;
  std::mt19937 random(11);
  size_t refused = 0;
  for (int round = 0; round < 150; ++round) {
    std::string bytes = library;
    for (int changes = 0; changes < 8; ++changes)
      bytes[begin + random() % 0x200] = static_cast<char>(random() % 3 == 0 ? 0xFF : random());
    const std::wstring path = m_folder.MakeFile(L"m" + std::to_wstring(round) + L".dll", bytes);
    LibraryLoaderCache cache;
    if (!cache.TryLoad(L"source", path)) {
      ++refused;
      continue;
    }
    for (const DWORD id : {kInsertions, kTwoLines, kHostile, DWORD{4099}})
      GetMessageString(cache.Find(L"source"), id);
  }
  EXPECT_GT(refused, 10u);
  EXPECT_THAT(m_log.Take(), Contains(HasSubstr(L"dll is damaged; it is not used")));
}

TEST_F(LibraryLoaderCacheTest, InsertionMarkersAndHostileFormatsStayInTheText) {
  LibraryLoaderCache cache;
  ASSERT_TRUE(cache.TryLoad(L"source", m_library));
  const HMODULE module = cache.Find(L"source");
  EXPECT_EQ(GetMessageString(module, kInsertions), L"The service %1 ended with %2!s!, %99 and %%4096.\r\n");
  EXPECT_THAT(GetMessageString(module, kHostile), HasSubstr(L"%1!s %1! %1!*.*s! %2!n! %100 %1!9999999999d! "));
  m_log.Take();
  EXPECT_EQ(GetMessageString(module, 0xDEAD'BEEF), L"");
  EXPECT_THAT(m_log.Take(), ElementsAre(L"systeminfo::GetMessageString: Format message failed with 317"));
  EXPECT_NE(GetMessageString(module, ERROR_ACCESS_DENIED), L"") << "a text of the system";
}

TEST_F(LibraryLoaderCacheTest, LibrariesAreFreedWithTheCache) {
  const std::wstring path = m_folder.MakeFile(L"own.dll", ReadLibrary());
  {
    LibraryLoaderCache cache;
    ASSERT_TRUE(cache.TryLoad(L"source", path));
    ASSERT_TRUE(cache.TryLoad(L"source", path));
  }
  EXPECT_TRUE(DeleteFileW(path.c_str()));
  EXPECT_THAT(m_log.Take(), ElementsAre(L"systeminfo::LibraryLoaderCache::~LibraryLoaderCache: Free loaded libraries"));
}

}  // namespace
}  // namespace systeminfo
