// Real crashes of a small program, with the library, its settings and its dumps in a folder of the test's own.
#include <windows.h>

#include <dbghelp.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <ostream>
#include <string>
#include <vector>

#include "companions/crash/dump_name.h"
#include "core/dynamic_library.h"
#include "core/files.h"
#include "core/folder_entries.h"
#include "core/paths.h"
#include "core/program_path.h"
#include "core/text.h"
#include "interfaces/crash_handler_api.h"
#include "tests/support/dump_streams.h"
#include "tests/support/test_folder.h"

namespace {

constexpr DWORD kHeapCorruption = 0xC0000374;

class CrashFolder {
 public:
  explicit CrashFolder(const std::string& dumpPath = "made\\dumps") {
    const std::wstring library = ExtendedPath(ProgramFolder() + L"\\qxch.dll");
    EXPECT_TRUE(CopyFileW(library.c_str(), ExtendedPath(Library()).c_str(), TRUE));
    m_folder.MakeFile(L"qxch.xml", "<settings><qxreinit><DumpPath>" + dumpPath + "</DumpPath></qxreinit></settings>");
  }

  // The exit code; the arguments are those of tests/children/crash_child.cpp, without the library.
  DWORD RunChild(const std::wstring& arguments) const {
    std::wstring line = L"crash_child \"" + Library() + L"\" " + arguments;
    STARTUPINFOW startup{};
    startup.cb = sizeof startup;
    PROCESS_INFORMATION started{};
    const std::wstring program = ProgramFolder() + L"\\crash_child.exe";
    if (!CreateProcessW(program.c_str(), line.data(), nullptr, nullptr, FALSE, 0, nullptr, nullptr, &startup,
                        &started)) {
      ADD_FAILURE() << "the child cannot be started: " << GetLastError();
      return 0;
    }
    const KernelHandle process(started.hProcess), thread(started.hThread);
    constexpr DWORD kLimit = 60000;
    if (WaitForSingleObject(process.Get(), kLimit) != WAIT_OBJECT_0) {
      ADD_FAILURE() << "the child hangs";
      TerminateProcess(process.Get(), 0);
    }
    DWORD code = 0;
    GetExitCodeProcess(process.Get(), &code);
    return code;
  }

  const TestFolder& Files() const { return m_folder; }
  std::wstring Library() const { return m_folder.Path(L"qxch.dll"); }

  std::vector<std::wstring> DumpFolderNames() const {
    std::vector<std::wstring> names;
    ForEachEntry(ExtendedPath(m_folder.Path(L"made\\dumps")) + L"\\", [&](const WIN32_FIND_DATAW& entry) {
      names.emplace_back(entry.cFileName);
      return true;
    });
    return names;
  }

  // The only dump, read whole; empty if there is not exactly one.
  std::string OnlyDump() const {
    std::vector<std::wstring> names = DumpFolderNames();
    // A full dump that was given up leaves what there is of it; the next start removes that.
    std::erase_if(names, crash::IsPartialDumpName);
    EXPECT_EQ(names.size(), 1u);
    if (names.size() != 1) return {};
    EXPECT_TRUE(names[0].starts_with(L"crash_child_")) << names[0];
    EXPECT_TRUE(crash::IsDumpName(names[0])) << names[0];
    std::string bytes;
    EXPECT_EQ(ReadWholeFile(m_folder.Path(L"made\\dumps\\" + names[0]), uint64_t{1} << 30, bytes), 0u);
    return bytes;
  }

  // The id that the child left of the thread that was to fail.
  DWORD FailedThread() const {
    std::string text;
    EXPECT_EQ(ReadWholeFile(m_folder.Path(L"thread.txt"), 100, text), 0u);
    return std::stoul(text);
  }

 private:
  TestFolder m_folder;
};

// Null if the thread is not in the dump.
const MINIDUMP_THREAD* FindThread(std::string& dump, DWORD id) {
  const auto* const threads = FindStream<MINIDUMP_THREAD_LIST>(dump, ThreadListStream);
  for (ULONG i = 0; threads != nullptr && i < threads->NumberOfThreads; ++i) {
    if (threads->Threads[i].ThreadId == id) return &threads->Threads[i];
  }
  return nullptr;
}

template <class T>
bool Contains(const std::vector<T>& values, const T& value) {
  return std::find(values.begin(), values.end(), value) != values.end();
}

void ExpectOneDump(const CrashFolder& folder, DWORD code, DWORD threadId) {
  std::string dump = folder.OnlyDump();
  const auto* const exception = FindStream<MINIDUMP_EXCEPTION_STREAM>(dump, ExceptionStream);
  ASSERT_NE(exception, nullptr);
  EXPECT_EQ(exception->ExceptionRecord.ExceptionCode, code);
  EXPECT_EQ(exception->ThreadId, threadId);
  const auto* const context = reinterpret_cast<const CONTEXT*>(dump.data() + exception->ThreadContext.Rva);
  const MINIDUMP_THREAD* const thread = FindThread(dump, threadId);
  ASSERT_NE(thread, nullptr);
  const MINIDUMP_MEMORY_DESCRIPTOR& stack = thread->Stack;
  EXPECT_LE(stack.StartOfMemoryRange, context->Rsp);
  EXPECT_GT(stack.StartOfMemoryRange + stack.Memory.DataSize, context->Rsp);
  EXPECT_LE(uint64_t{stack.Memory.Rva} + stack.Memory.DataSize, dump.size());
  const std::vector<std::wstring> modules = ModuleNames(dump);
  EXPECT_TRUE(Contains<std::wstring>(modules, L"crash_child.exe"));
  EXPECT_TRUE(Contains<std::wstring>(modules, L"qxch.dll"));
}

struct Crash {
  const char* name;
  const wchar_t* arguments;
  DWORD code;
};

void PrintTo(const Crash& crash, std::ostream* stream) {
  *stream << crash.name;
}

class CrashOf : public testing::TestWithParam<Crash> {};

// What a compiler makes of an exception that nobody catches and of a pure virtual call. GCC calls std::terminate for
// the first; for the second it leaves, in a program that is linked statically, a null pointer where the function would
// be.
#ifdef _MSC_VER
constexpr DWORD kUncaught = 0xE06D7363;
constexpr DWORD kPureVirtual = CRASH_CODE_PURE_CALL;
#else
constexpr DWORD kUncaught = CRASH_CODE_TERMINATE;
constexpr DWORD kPureVirtual = EXCEPTION_ACCESS_VIOLATION;
#endif

constexpr Crash kCrashes[] = {
    {"AccessViolation", L"access-violation", EXCEPTION_ACCESS_VIOLATION},
    {"AccessViolationInASecondThread", L"access-violation second-thread", EXCEPTION_ACCESS_VIOLATION},
    {"AccessViolationWithASpoiltHeap", L"spoilt-heap", EXCEPTION_ACCESS_VIOLATION},
    {"AccessViolationWithoutAnyHeap", L"wrecked-heap", EXCEPTION_ACCESS_VIOLATION},
    {"AccessViolationWithoutAnyHeapInASecondThread", L"wrecked-heap second-thread", EXCEPTION_ACCESS_VIOLATION},
    {"Abort", L"abort own-hooks", CRASH_CODE_ABORT},
    {"AbortInASecondThread", L"abort own-hooks second-thread", CRASH_CODE_ABORT},
    {"Terminate", L"terminate own-hooks", CRASH_CODE_TERMINATE},
    {"UncaughtException", L"uncaught-exception own-hooks", kUncaught},
    {"UncaughtExceptionInASecondThread", L"uncaught-exception own-hooks second-thread", kUncaught},
    {"ExceptionOutOfNoexcept", L"noexcept own-hooks", CRASH_CODE_TERMINATE},
    {"PureVirtualCall", L"pure-virtual-call own-hooks", kPureVirtual},
    {"PureCallOfTheRuntimeLibrary", L"runtime-pure-call own-hooks", CRASH_CODE_PURE_CALL},
    {"InvalidParameter", L"invalid-parameter own-hooks", CRASH_CODE_INVALID_PARAMETER},
    {"CorruptHeapFoundByTheSystem", L"heap-corruption", kHeapCorruption},
    {"OverflowOnTheLastOfTheStack", L"overflow-raised second-thread", EXCEPTION_STACK_OVERFLOW},
#ifndef _MSC_VER
    // The run-time library is shared, so that the library's own hooks serve a program that installs none.
    {"AbortWithoutOwnHooks", L"abort", CRASH_CODE_ABORT},
    {"UncaughtExceptionWithoutOwnHooks", L"uncaught-exception second-thread", CRASH_CODE_ABORT},
#endif
};

}  // namespace

TEST_P(CrashOf, LeavesOneDumpAndItsExitCode) {
  const CrashFolder folder;
  EXPECT_EQ(folder.RunChild(GetParam().arguments), GetParam().code);
  ExpectOneDump(folder, GetParam().code, folder.FailedThread());
}

INSTANTIATE_TEST_SUITE_P(Every, CrashOf, testing::ValuesIn(kCrashes),
                         [](const auto& crash) { return std::string(crash.param.name); });

// Wine raises a stack overflow with less than 8 KB left, whatever the thread has asked to keep back, and ends the
// process or the thread silently on the way to the filter. Windows gets there; OverflowOnTheLastOfTheStack is what
// shows here that little stack is enough for the handler.
TEST(CrashHandler, StackOverflowLeavesADump) {
  if (GetProcAddress(GetModuleHandleW(L"ntdll.dll"), "wine_get_version") != nullptr) {
    GTEST_SKIP() << "this system does not let a stack overflow reach any filter";
  }
  for (const wchar_t* arguments : {L"stack-overflow", L"stack-overflow second-thread"}) {
    const CrashFolder folder;
    EXPECT_EQ(folder.RunChild(arguments), EXCEPTION_STACK_OVERFLOW);
    ExpectOneDump(folder, EXCEPTION_STACK_OVERFLOW, folder.FailedThread());
  }
}

TEST(CrashHandler, TwoThreadsThatCrashAtOnceLeaveOneDump) {
  const CrashFolder folder;
  EXPECT_EQ(folder.RunChild(L"two-threads"), EXCEPTION_ACCESS_VIOLATION);
  EXPECT_FALSE(folder.OnlyDump().empty());
}

// The heap's lock stays held, so that the full dump has to be waited for in vain first.
TEST(CrashHandler, AThreadThatCrashesWithTheHeapsLockHeldLeavesADump) {
  const CrashFolder folder;
  EXPECT_EQ(folder.RunChild(L"held-heap"), EXCEPTION_ACCESS_VIOLATION);
  ExpectOneDump(folder, EXCEPTION_ACCESS_VIOLATION, folder.FailedThread());
}

TEST(CrashHandler, AFolderThatCannotBeMadeStillEndsTheProcessWithTheCode) {
  const CrashFolder folder("qxch.xml\\dumps");  // below a file
  EXPECT_EQ(folder.RunChild(L"access-violation"), EXCEPTION_ACCESS_VIOLATION);
  EXPECT_FALSE(FolderExists(folder.Files().Path(L"qxch.xml\\dumps")));
}

TEST(CrashHandler, TheSixthDumpTakesThePlaceOfTheOldest) {
  const CrashFolder folder;
  const std::wstring dumps = L"made\\dumps\\";
  folder.Files().MakeFile(dumps + L"crash_child_1_20200101-000000.dmp");
  Sleep(20);  // the others are younger
  for (int i = 1; i < 5; ++i) {
    folder.Files().MakeFile(dumps + L"crash_child_1_20200101-00000" + std::to_wstring(i) + L".dmp");
  }
  EXPECT_EQ(folder.RunChild(L"access-violation"), EXCEPTION_ACCESS_VIOLATION);
  const std::vector<std::wstring> names = folder.DumpFolderNames();
  EXPECT_EQ(names.size(), 5u);
  EXPECT_FALSE(Contains<std::wstring>(names, L"crash_child_1_20200101-000000.dmp"));
  EXPECT_TRUE(Contains<std::wstring>(names, L"crash_child_1_20200101-000001.dmp"));
}

TEST(CrashHandler, AnEarlierFilterIsToldButDoesNotKeepTheProcessAlive) {
  const CrashFolder folder;
  EXPECT_EQ(folder.RunChild(L"earlier-filter"), EXCEPTION_ACCESS_VIOLATION);
  EXPECT_TRUE(PathExists(folder.Files().Path(L"earlier_filter.txt")));
  ExpectOneDump(folder, EXCEPTION_ACCESS_VIOLATION, folder.FailedThread());
}

TEST(CrashHandler, FreeingTheLibraryPutsEverythingBack) {
  const CrashFolder folder;
  EXPECT_EQ(folder.RunChild(L"load-and-free"), 0u);
}

TEST(CrashHandler, ReservedArgumentsAreRefused) {
  const CrashFolder folder;
  const DynamicLibrary library(folder.Library().c_str());
  const auto enable = library.Resolve<decltype(&EnableCrashHandler)>("EnableCrashHandler");
  ASSERT_NE(enable, nullptr);
  EXPECT_EQ(enable(1, nullptr, nullptr), ERROR_INVALID_PARAMETER);
  EXPECT_EQ(enable(0, &folder, nullptr), ERROR_INVALID_PARAMETER);
}
