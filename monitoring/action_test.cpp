#include "monitoring/action.h"

#include <gmock/gmock.h>

#include "core/json.h"
#include "core/logging.h"
#include "core/program_path.h"
#include "core/text.h"
#include "monitoring/action_dump_process.h"
#include "monitoring/dump_rules.h"
#include "systeminfo/utils/mini_dump.h"
#include "tests/support/child_process.h"
#include "tests/support/log_text.h"
#include "tests/support/test_folder.h"

namespace st::monitoring {
namespace {

using testing::ElementsAre;
using testing::EndsWith;
using testing::HasSubstr;

// Runs actions in a folder of their own, which is the current one.
class DumpActionTest : public testing::Test {
 protected:
  DumpActionTest() : m_in(m_folder.Path()) {}

  // A child whose program is called `name`.exe, inside the folder.
  ChildProcess StartChild(const std::wstring& name) {
    const std::wstring program = m_folder.Path(name + L".exe");
    CopyFileW((ProgramFolder() + L"\\cpu_child.exe").c_str(), program.c_str(), FALSE);
    return ChildProcess(L"\"" + program + L"\" 60");
  }

  void Run(const Json::Value& parameters) {
    Json::Value json;
    json["id"] = "a";
    json["type"] = "dump";
    json["parameters"] = parameters;
    const std::shared_ptr<Action> action = Action::Create(json, {m_budget, m_stop, m_writer});
    ASSERT_TRUE(action);
    action->Run();
  }
  void RunByPid(DWORD pid) {
    Json::Value parameters;
    parameters["pid"] = Json::UInt(pid);
    Run(parameters);
  }
  void RunByName(const std::wstring& name) {
    Json::Value parameters;
    parameters["name"] = ToUtf8(name);
    Run(parameters);
  }

  std::vector<std::wstring> Dumps() const { return Find(L"*.dmp"); }
  std::vector<std::wstring> Find(const wchar_t* pattern) const {
    std::vector<std::wstring> names;
    WIN32_FIND_DATAW found;
    const FindHandle search(FindFirstFileW(m_folder.Path(pattern).c_str(), &found));
    for (BOOL more = search ? TRUE : FALSE; more; more = FindNextFileW(search.Get(), &found))
      names.emplace_back(found.cFileName);
    return names;
  }

  const TestFolder m_folder;
  const CurrentFolder m_in;
  Limits m_limits;
  DumpBudget m_budget{m_limits};
  std::atomic<bool> m_stop{false};
  MiniDumpWriter m_writer = WriteProcessDump;
};

TEST_F(DumpActionTest, AProcessGivenByItsIdIsDumpedUnderItsFileName) {
  const ChildProcess child = StartChild(L"busy \u6771");
  logging::ErrorCapture lines(logging::Level::kTrace);
  RunByPid(child.Id());
  const std::wstring name = ::utils::DumpFileName(L"busy \u6771.exe", child.Id());
  EXPECT_THAT(Dumps(), ElementsAre(name));
  const std::string dump = LogText(m_folder.Path(name));
  EXPECT_TRUE(IsWholeDump(dump.substr(0, kDumpBeginning), dump.size()));
  const std::vector<std::wstring> logged = lines.Take();
  EXPECT_THAT(logged, testing::Contains(EndsWith(L"Dump process completed for pid " + std::to_wstring(child.Id()))));
  EXPECT_THAT(logged, testing::Contains(HasSubstr(L"Running action with id='a' and parameters='{\"pid\":")));
  EXPECT_EQ(logged.back(), L"st::monitoring::ActionDumpProcess::Run: action finished");
}

TEST_F(DumpActionTest, EveryProcessWhosePathHasTheNameIsDumpedAndAnOlderDumpIsReplaced) {
  const ChildProcess one = StartChild(L"twin");
  const ChildProcess two = StartChild(L"twin");
  const std::wstring first = ::utils::DumpFileName(L"twin", one.Id());
  m_folder.MakeFile(first, "older");
  RunByName(L"twin");
  EXPECT_THAT(Dumps(), testing::UnorderedElementsAre(first, ::utils::DumpFileName(L"twin", two.Id())));
  EXPECT_GT(LogText(m_folder.Path(first)).size(), 1000U);
}

TEST_F(DumpActionTest, ANameThatNoFileCanHaveIsReplacedNotRefused) {
  const ChildProcess child = StartChild(L"target");
  RunByName(L"\\target.exe");
  EXPECT_THAT(Dumps(), ElementsAre(::utils::DumpFileName(L"\\target.exe", child.Id())));
}

TEST_F(DumpActionTest, WhoIsNotThereIsLogged) {
  logging::ErrorCapture lines(logging::Level::kWarning);
  RunByPid(0xFFFFFFFE);
  RunByName(L"no such program");
  Run(Json::Value("text"));
  EXPECT_THAT(lines.Take(), ElementsAre(EndsWith(L"Could not find valid process data for pid -2"),
                                        EndsWith(L"no process has no such program in its path"),
                                        EndsWith(L"the parameters are not an object")));
  EXPECT_THAT(Dumps(), testing::IsEmpty());
}

TEST_F(DumpActionTest, AProcessThatEndsBeforeOrWhileItIsDumpedLeavesNoFile) {
  ChildProcess child = StartChild(L"short-lived");
  ProcessInfoCache cache;
  ASSERT_TRUE(cache.TakeProceessesSnapshot());
  const ProcessRecord* const record = cache.GetProcessDataByPid(child.Id());
  ASSERT_NE(record, nullptr);
  const auto dump = [&] {
    ActionDumpProcess({L"a", "dump", {}}, {m_budget, m_stop, m_writer})
        .DumpProcess(record->handle.Get(), child.Id(), L"short-lived");
  };
  logging::ErrorCapture errors;
  m_writer = [&child](HANDLE, DWORD, HANDLE file) -> DWORD {
    DWORD written = 0;
    WriteFile(file, "MDMP", 4, &written, nullptr);
    child.Kill();
    return ERROR_PARTIAL_COPY;
  };
  dump();
  dump();
  EXPECT_THAT(errors.Take(),
              ElementsAre(EndsWith(L"MiniDumpWriteDump fails with code 299"), EndsWith(L" has ended before its dump")));
  EXPECT_THAT(Find(L"*.dmp*"), testing::IsEmpty());
}

TEST_F(DumpActionTest, AFullDiskLeavesNoFileHoweverTheWriterTellsOfIt) {
  struct {
    DWORD result;
    const wchar_t* line;
  } const rows[] = {
      {ERROR_DISK_FULL, L"MiniDumpWriteDump fails with code 112"},
      {ERROR_SUCCESS, L"is cut off after 36 bytes and is not kept"},
  };
  for (const auto& row : rows) {
    m_writer = [&row](HANDLE, DWORD, HANDLE file) {
      // One stream that is longer than the file.
      const DWORD dump[] = {0x504D444D, 0xA793, 1, 24, 0, 0, 4, 1000, 36};
      DWORD written = 0;
      WriteFile(file, dump, sizeof dump, &written, nullptr);
      return row.result;
    };
    logging::ErrorCapture errors;
    RunByPid(GetCurrentProcessId());
    EXPECT_THAT(errors.Take(), ElementsAre(EndsWith(row.line)));
    EXPECT_THAT(Find(L"*.dmp*"), testing::IsEmpty());
  }
}

TEST_F(DumpActionTest, AFileThatCannotBeMadeIsLoggedWithTheReason) {
  const std::wstring name =
      ::utils::DumpFileName(std::wstring(LastPathComponent(ProgramPath())), GetCurrentProcessId());
  m_folder.MakeFolder(name + L".partial");
  logging::ErrorCapture errors;
  RunByPid(GetCurrentProcessId());
  EXPECT_THAT(errors.Take(), ElementsAre(EndsWith(L"Could not create file " + name + L" for dump"),
                                         EndsWith(L"CreateFile failed with error code : 5")));
}

TEST_F(DumpActionTest, LimitsRefuseADumpOrThrowItAway) {
  m_limits.maxTotalDumpBytes = 100;
  DumpBudget small(m_limits);
  m_limits = {};
  m_limits.maxDumpsPerProcess = 1;
  DumpBudget once(m_limits);
  const DWORD own = GetCurrentProcessId();
  Json::Value json;
  json["id"] = "a";
  json["type"] = "dump";
  json["parameters"]["pid"] = Json::UInt(own);
  logging::ErrorCapture errors;
  m_writer = [](HANDLE, DWORD, HANDLE file) -> DWORD {
    std::string dump("MDMP\x93\xA7\0\0\1\0\0\0\x20\0\0\0", 16);
    dump.resize(200);
    DWORD written = 0;
    return WriteFile(file, dump.data(), 200, &written, nullptr) ? ERROR_SUCCESS : GetLastError();
  };
  Action::Create(json, {small, m_stop, m_writer})->Run();
  EXPECT_THAT(errors.Take(), ElementsAre(HasSubstr(L"is not kept: maxTotalDumpBytes is 100, there are 0 and this dump "
                                                   L"has 200")));
  EXPECT_THAT(Find(L"*.dmp*"), testing::IsEmpty());
  const std::shared_ptr<Action> action = Action::Create(json, {once, m_stop, m_writer});
  action->Run();
  action->Run();
  EXPECT_THAT(errors.Take(),
              ElementsAre(HasSubstr(L"no dump of process " + std::to_wstring(own) + L": maxDumpsPerProcess is 1")));
  EXPECT_EQ(Dumps().size(), 1U);
}

}  // namespace
}  // namespace st::monitoring
