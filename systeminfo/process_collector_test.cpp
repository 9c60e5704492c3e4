#include "systeminfo/process_collector.h"

#include <gmock/gmock.h>
#include <sddl.h>

#include "core/json.h"
#include "core/logging.h"
#include "core/scope_exit.h"
#include "core/text.h"
#include "systeminfo/utils/file_md5.h"
#include "tests/support/fake_wmi.h"
#include "tests/support/process_child.h"
#include "tests/support/test_folder.h"

namespace systeminfo {
namespace {

using fake_wmi::Failure;
using fake_wmi::Number;
using fake_wmi::Text;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;

const std::wstring kStart = L"systeminfo::ProcessCollector::Start: ";

fake_wmi::Property Null() {
  return [](VARIANT* value) {
    value->vt = VT_NULL;
    return WBEM_S_NO_ERROR;
  };
}

fake_wmi::Instance Process(DWORD id, fake_wmi::Property path = Null()) {
  return {{L"ProcessId", Number(static_cast<int32_t>(id))},
          {L"Name", Text(L"name of " + std::to_wstring(id))},
          {L"ExecutablePath", std::move(path)},
          {L"CommandLine", Text(L"command line")},
          {L"ParentProcessId", Number(1)},
          {L"Priority", Number(8)},
          {L"Description", Text(L"description")}};
}

// The id of a process that has ended. The system forgets an ended one only after a moment.
DWORD EndedProcess() {
  const DWORD id = ProcessChild().processId;
  for (int i = 0; i < 500 && KernelHandle(OpenProcess(PROCESS_QUERY_INFORMATION, FALSE, id)); ++i)
    Sleep(10);
  return id;
}

class Processes : public testing::Test {
 protected:
  Json::Value Collect(const std::atomic<bool>* cancel = nullptr) {
    ProcessCollector collector(L"running_tasks");
    collector.Start(nullptr, std::make_shared<WMIWrapper>(m_fake.Services()), cancel);
    return collector.GetData();
  }

  FakeWmi m_fake;
  std::vector<fake_wmi::Instance>& m_instances = m_fake.answers[L"SELECT * FROM Win32_Process"].instances;
  logging::ErrorCapture m_capture{logging::Level::kTrace};
};

TEST_F(Processes, RunningProcessHasItsFacts) {
  const ProcessChild child;
  m_instances = {Process(child.processId, Text(ProcessChild::Path()))};
  const Json::Value processes = Collect()["processes"];
  ASSERT_EQ(processes.size(), 1u);
  const Json::Value& process = processes[0];
  EXPECT_EQ(process["ProcessId"], static_cast<Json::UInt>(child.processId));
  EXPECT_EQ(process["Name"], "name of " + std::to_string(child.processId));
  EXPECT_EQ(process["ExecutablePath"], ToUtf8(ProcessChild::Path()));
  EXPECT_EQ(process["CommandLine"], "command line");
  EXPECT_EQ(process["ParentProcessId"], 1u);
  EXPECT_EQ(process["Priority"], 8u);
  EXPECT_EQ(process["Description"], "description");
  EXPECT_EQ(process["signed"], false);
  EXPECT_EQ(process["md5"], utils::GetFileMD5(ToUtf8(ProcessChild::Path())));
  EXPECT_THAT(process["User"].asString(), testing::MatchesRegex(".+\\\\.+"));
  EXPECT_EQ(process["imageType"], "x32") << "the label of a 64-bit image";
  ASSERT_EQ(process["modules"].size(), child.modules.size());
  for (Json::ArrayIndex i = 0; i < process["modules"].size(); ++i)
    EXPECT_EQ(process["modules"][i]["name"], child.modules[i]);
  for (const auto& [value, type] : child.handles) {
    Json::Value expected;
    expected["name"] = "";
    expected["type"] = type;
    char text[20] = {};
    std::snprintf(text, sizeof text, "[0x%llx]", static_cast<unsigned long long>(value));
    expected["value"] = text;
    EXPECT_EQ(std::count(process["handles"].begin(), process["handles"].end(), expected), 1)
        << WriteCompactJson(expected);
  }
}

TEST_F(Processes, RowsKeepTheirOrderAndEachCostsOnlyItsOwnFacts) {
  const DWORD ended = EndedProcess();
  fake_wmi::Instance unreadable = Process(0);
  unreadable[L"ProcessId"] = Text(L"12x");
  m_instances = {Process(0), unreadable, Process(ended, Text(ProcessChild::Path())),
                 Process(GetCurrentProcessId(), Text(L"Z:\\absent.exe"))};
  const Json::Value processes = Collect()["processes"];
  ASSERT_EQ(processes.size(), 4u);

  const Json::Value& idle = processes[0];
  EXPECT_TRUE(idle["ExecutablePath"].isNull());
  EXPECT_FALSE(idle.isMember("signed"));
  EXPECT_EQ(idle["User"], "");
  EXPECT_EQ(idle["imageType"], "");
  EXPECT_EQ(idle["modules"], Json::Value(Json::arrayValue));
  EXPECT_EQ(idle["handles"], Json::Value(Json::arrayValue));

  EXPECT_EQ(processes[1]["Name"], "name of 0");
  EXPECT_FALSE(processes[1].isMember("User"));

  EXPECT_EQ(processes[2]["signed"], false);
  EXPECT_EQ(processes[2]["md5"].asString().size(), 32u);
  EXPECT_EQ(processes[2]["imageType"], "");
  EXPECT_EQ(processes[2]["modules"].size(), 0u);

  EXPECT_EQ(processes[3]["signed"], false);
  EXPECT_EQ(processes[3]["md5"], "");
  EXPECT_GT(processes[3]["modules"].size(), 0u);

  const auto lines = m_capture.Take();
  EXPECT_THAT(lines, Contains(kStart + L"exePath is null").Times(2));
  EXPECT_THAT(lines, Contains(kStart + L"Failed to get pid 12x"));
  EXPECT_THAT(lines, Contains(HasSubstr(L"Could not open PID " + std::to_wstring(ended) + L"!")));
  EXPECT_THAT(lines, Contains(L"systeminfo::ProcessCollector::IsSigned: Invalid file handle when checking if it's "
                              L"signed"));
}

TEST_F(Processes, SuspendedProcessHoldsNothingUp) {
  const std::wstring path = ProcessChild::Path();
  STARTUPINFOW startup{};
  startup.cb = sizeof startup;
  PROCESS_INFORMATION started{};
  ASSERT_TRUE(CreateProcessW(path.c_str(), nullptr, nullptr, nullptr, FALSE, CREATE_SUSPENDED, nullptr, nullptr,
                             &startup, &started));
  const KernelHandle process(started.hProcess);
  const KernelHandle thread(started.hThread);
  const ScopeExit end([&] { TerminateProcess(process.Get(), 1); });
  m_instances = {Process(started.dwProcessId, Text(path)), Process(GetCurrentProcessId())};
  const Json::Value processes = Collect()["processes"];
  ASSERT_EQ(processes.size(), 2u);
  EXPECT_NE(processes[0]["User"], "");
  EXPECT_EQ(processes[0]["imageType"], "x32");
  EXPECT_GT(processes[1]["modules"].size(), 0u);
  EXPECT_GT(processes[1]["handles"].size(), 0u);
}

TEST_F(Processes, RowWithoutAllPropertiesEndsWithoutData) {
  m_instances = {Process(4), Process(8)};
  m_instances[1][L"Priority"] = Failure(WBEM_E_FAILED);
  EXPECT_TRUE(Collect().isNull());
  EXPECT_THAT(m_capture.Take(), Contains(kStart + L"propertyNames.size() != propertyValues.size()").Times(1));
}

TEST_F(Processes, FailedQueryGivesNoDataAndNoProcessesAnEmptyList) {
  m_fake.answers[L"SELECT * FROM Win32_Process"].queryStatus = WBEM_E_FAILED;
  EXPECT_TRUE(Collect().isNull());
  m_fake.answers[L"SELECT * FROM Win32_Process"].queryStatus = WBEM_S_NO_ERROR;
  EXPECT_EQ(Collect()["processes"], Json::Value(Json::arrayValue));
}

TEST_F(Processes, SharedExecutableIsHashedOnceAndCancellingKeepsTheFinishedProcesses) {
  const TestFolder folder;
  const std::wstring path = folder.MakeFile(L"shared.exe", "abc");
  m_instances = {Process(0, Text(path)), Process(0, Text(path)), Process(0), Process(0, Text(path))};
  EXPECT_EQ(Collect()["processes"][3]["md5"], "900150983cd24fb0d6963f7d28e17f72");
  const auto lines = m_capture.Take();
  EXPECT_THAT(lines, Contains(L"systeminfo::MD5Cache::~MD5Cache: _callCount 3"));
  EXPECT_THAT(lines, Contains(L"systeminfo::MD5Cache::~MD5Cache: _cacheHit 2"));

  const std::atomic<bool> cancelled{true};
  EXPECT_EQ(Collect(&cancelled)["processes"].size(), 0u);
}

TEST(ProcessRules, ImageTypeLabelsAreTheWrongWayRound) {
  EXPECT_STREQ(ImageTypeLabel(1), L"x64");
  EXPECT_STREQ(ImageTypeLabel(0), L"x32");
  EXPECT_STREQ(ImageTypeLabel(2), L"x32");
}

TEST(ProcessRules, PropertyThatTheClassLacksIsNullInEveryRow) {
  const auto processes =
      ProcessObjects({{"a", 1u}, {"b", 2u}}, {L"Name", L"ProcessId"}, {L"ProcessId", L"Name", L"Priority"});
  ASSERT_TRUE(processes);
  ASSERT_EQ(processes->size(), 2u);
  EXPECT_EQ((*processes)[1]["Name"], "b");
  EXPECT_EQ((*processes)[1]["ProcessId"], 2u);
  EXPECT_TRUE((*processes)[1].isMember("Priority") && (*processes)[1]["Priority"].isNull());
}

TEST(ProcessRules, ProcessIdIsAWholeNumberInRange) {
  const struct {
    Json::Value value;
    std::optional<DWORD> expected;
  } rows[] = {
      {4u, 4},
      {0u, 0},
      {0xFFFF'FFFCu, 0xFFFF'FFFC},
      {"1234", 1234},
      {"", {}},
      {"12x", {}},
      {" 1", {}},
      {"4294967296", {}},
      {"-4", {}},
      {-4, {}},
      {Json::Value(), {}},
      {Json::Value(Json::arrayValue), {}},
  };
  for (const auto& row : rows)
    EXPECT_EQ(ProcessIdOf(row.value), row.expected) << WriteCompactJson(row.value);
}

TEST(ProcessRules, HandleValuesAreShownInHexadecimal) {
  const Json::Value handles = HandlesToJson({{0x1A4, L"", L"File"}, {0xFFFF'FFFF'FFFF'FFFF, L"", L"T\u00fcr"}});
  EXPECT_EQ(handles[0]["value"], "[0x1a4]");
  EXPECT_EQ(handles[0]["name"], "");
  EXPECT_EQ(handles[1]["value"], "[0xffffffffffffffff]");
  EXPECT_EQ(handles[1]["type"], "T\xC3\xBCr");
}

TEST(AccountNames, KnownAccountsAndUnknownOnes) {
  const auto nameOf = [](AccountNames& names, const wchar_t* text) {
    LocalMemory<void> sid;
    EXPECT_TRUE(ConvertStringSidToSidW(text, sid.Receive()));
    return names.OfSid(sid.Get());
  };
  AccountNames names;
  EXPECT_EQ(nameOf(names, L"S-1-5-18"), L"NT AUTHORITY\\SYSTEM");
  logging::ErrorCapture capture(logging::Level::kTrace);
  EXPECT_EQ(nameOf(names, L"S-1-5-21-1-2-3-4444"), L"");
  EXPECT_EQ(nameOf(names, L"S-1-5-21-1-2-3-4444"), L"");
  EXPECT_EQ(names.OfProcess(4), L"");
  EXPECT_THAT(capture.Take(),
              ElementsAre(L"systeminfo::ProcessCollector::GetProcessUserName: LookupAccountSid Error 1332\n",
                          HasSubstr(L"the token of process 4 cannot be opened, error ")));
}

}  // namespace
}  // namespace systeminfo
