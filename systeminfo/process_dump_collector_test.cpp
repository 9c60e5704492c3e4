#include "systeminfo/process_dump_collector.h"

#include <gmock/gmock.h>

#include <algorithm>
#include <limits>
#include <memory>
#include <stdexcept>
#include <utility>

#include "core/files.h"
#include "core/folder_entries.h"
#include "core/format.h"
#include "core/logging.h"
#include "core/paths.h"
#include "core/program_path.h"
#include "core/text.h"
#include "systeminfo/collecting_settings.h"
#include "systeminfo/utils/mini_dump.h"
#include "tests/support/child_process.h"
#include "tests/support/dump_streams.h"
#include "tests/support/log_text.h"
#include "tests/support/test_folder.h"

namespace systeminfo {
namespace {

using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::UnorderedElementsAre;
using utils::DumpFileName;

constexpr wchar_t kStart[] = L"systeminfo::ProcessDumpCollector::Start: ";

TEST(DumpTargetId, OnlyNumbersAndBooleansThatAreIdsCount) {
  const struct {
    Json::Value value;
    std::optional<uint32_t> expected;
  } cases[] = {
      {12, 12},
      {12u, 12},
      {12.9, 12},
      {true, 1},
      {false, 0},
      {0, 0},
      {4294967295u, 4294967295u},
      {4294967295.5, 4294967295u},
      {4294967296.0, {}},
      {Json::Value(Json::UInt64{1} << 63), {}},
      {-1, {}},
      {-1e300, {}},
      {std::numeric_limits<double>::infinity(), {}},
      {std::numeric_limits<double>::quiet_NaN(), {}},
      {"12", {}},
      {Json::Value(), {}},
      {Json::arrayValue, {}},
      {Json::objectValue, {}},
  };
  int index = 0;
  for (const auto& row : cases)
    EXPECT_EQ(DumpTargetId(row.value), row.expected) << "case " << index++;
}

// A program that waits in a folder of the test, so that a piece of its path names nobody else.
class WaitingProgram {
 public:
  WaitingProgram(const TestFolder& folder, std::wstring_view name)
      : m_process(L"\"" + Copy(folder.Path(name)) + L"\"") {
    for (std::string line = m_process.ReadLine(); line != "ready"; line = m_process.ReadLine()) {
      if (line.empty()) throw std::runtime_error("the child program has ended");
      if (line.starts_with("pid ")) m_id = std::stoul(line.substr(4));
    }
  }

  DWORD Id() const { return m_id; }
  Json::UInt JsonId() const { return static_cast<Json::UInt>(m_id); }
  void Kill() { m_process.Kill(); }

 private:
  static std::wstring Copy(const std::wstring& path) {
    EXPECT_TRUE(CopyFileW((ProgramFolder() + L"\\process_child.exe").c_str(), path.c_str(), FALSE));
    return path;
  }

  ChildProcess m_process;
  DWORD m_id = 0;
};

class ProcessDumpCollectorTest : public testing::Test {
 protected:
  void Collect(const Json::Value& targets, const std::atomic<bool>* cancel = nullptr) {
    ProcessDumpCollector collector(L"process_dumps");
    Start(collector, targets, m_output, cancel);
  }
  static void Start(ProcessDumpCollector& collector, const Json::Value& targets, const std::wstring& outputFolder,
                    const std::atomic<bool>* cancel = nullptr) {
    const auto settings = std::make_shared<CollectingSettings>();
    if (!outputFolder.empty()) settings->SetValue(L"output_folder", ToUtf8(outputFolder));
    settings->SetValue(L"process_dumps", targets);
    collector.Start(settings, nullptr, cancel);
    EXPECT_TRUE(collector.Data().isNull());
  }

  // The last folder of the programs and the beginning of a name, as settings may have it.
  std::string Piece(std::wstring_view name) const {
    return ToUtf8(std::wstring(LastPathComponent(m_programs.Path())) + L"\\" + std::wstring(name));
  }

  static std::vector<std::wstring> FileNames(const std::wstring& folder) {
    std::vector<std::wstring> names;
    ForEachEntry(ExtendedPath(folder) + L"\\", [&](const WIN32_FIND_DATAW& entry) {
      names.emplace_back(entry.cFileName);
      return true;
    });
    return names;
  }

  static Json::Value Target(const char* key, const Json::Value& value) {
    Json::Value target;
    target[key] = value;
    return target;
  }
  static Json::Value List(std::initializer_list<Json::Value> targets) {
    Json::Value list(Json::arrayValue);
    for (const Json::Value& target : targets)
      list.append(target);
    return list;
  }

  TestFolder m_folder;
  TestFolder m_programs;
  std::wstring m_output = m_folder.MakeFolder(L"output");
  logging::ErrorCapture m_log{logging::Level::kTrace};
};

TEST_F(ProcessDumpCollectorTest, EveryProcessOfANameIsDumpedIntoTheOutputFolder) {
  const WaitingProgram first(m_programs, L"svc_one.exe"), second(m_programs, L"svc_two.exe");
  const WaitingProgram third(m_programs, L"other.exe");
  const std::wstring name = std::wstring(LastPathComponent(m_programs.Path())) + L"\\svc_";
  const std::wstring names[] = {DumpFileName(name, first.Id()), DumpFileName(name, second.Id())};
  m_folder.MakeFile(L"output\\" + names[0], "an older one");
  Json::Value both = Target("name", Piece(L"svc_"));
  both["pid"] = third.JsonId();  // the name counts
  Collect(List({both}));

  EXPECT_THAT(FileNames(m_output), UnorderedElementsAre(names[0], names[1]));
  for (const std::wstring& file : names)
    EXPECT_TRUE(LogText(m_output + L"\\" + file).starts_with("MDMP")) << file;
}

TEST_F(ProcessDumpCollectorTest, ADumpHasTheStreamsOfItsTypeButNotTheImages) {
  const WaitingProgram child(m_programs, L"svc.exe");
  const CurrentFolder current(m_output);
  ProcessDumpCollector collector(L"process_dumps");
  Json::Value target = Target("pid", child.JsonId());
  target["name"] = Json::Value();  // as if it were absent
  Start(collector, List({target}), {});
  std::string dump = LogText(m_output + L"\\" + DumpFileName(L"svc.exe", child.Id()));
  ASSERT_GT(dump.size(), sizeof(MINIDUMP_HEADER));

  EXPECT_EQ(reinterpret_cast<const MINIDUMP_HEADER*>(dump.data())->Flags, 0x1B25u);
  EXPECT_THAT(ModuleNames(dump), Contains(L"svc.exe"));
  EXPECT_NE(FindStream<MINIDUMP_SYSTEM_INFO>(dump, SystemInfoStream), nullptr);
  const auto* const threads = FindStream<MINIDUMP_THREAD_LIST>(dump, ThreadListStream);
  ASSERT_TRUE(threads != nullptr && threads->NumberOfThreads > 0);
  EXPECT_GT(threads->Threads[0].Stack.Memory.DataSize, 0u);
  EXPECT_FALSE(HasStream(dump, ExceptionStream));
  EXPECT_FALSE(HasStream(dump, CommentStreamA));
  EXPECT_THAT(dump, Not(HasSubstr("handle %llu %s")));  // a text of the image that nobody writes
  EXPECT_THAT(m_log.Take(), Contains(L"systeminfo::MyMiniDumpCallback: Excluding module data sections: [" +
                                     m_programs.Path(L"svc.exe") + L"]"));
}

TEST_F(ProcessDumpCollectorTest, AProcessThatEndsOrAFileThatCannotBeMadeCostsOnlyItsOwnDump) {
  WaitingProgram ended(m_programs, L"ended.exe");
  const WaitingProgram blocked(m_programs, L"blocked.exe"), taken(m_programs, L"taken.exe"), last(m_programs, L"z.exe");
  ProcessDumpCollector collector(L"process_dumps");
  ended.Kill();
  m_folder.MakeFolder(L"output\\" + DumpFileName(L"blocked.exe", blocked.Id()) + kPartialSuffix);
  m_folder.MakeFolder(L"output\\" + DumpFileName(L"taken.exe", taken.Id()));
  Json::Value targets(Json::arrayValue);
  for (const WaitingProgram* program : {&std::as_const(ended), &blocked, &taken, &last})
    targets.append(Target("pid", program->JsonId()));
  logging::ErrorCapture errors;
  Start(collector, targets, m_output);

  const auto couldNot = [&](const std::wstring& name) {
    return L"systeminfo::ProcessDumpCollector::DumpProcess: Could not create file " + m_output + L"\\" + name +
           L" for dump";
  };
  EXPECT_THAT(errors.Take(), ElementsAre(HasSubstr(L"MiniDumpWriteDump fails with code "),
                                         couldNot(DumpFileName(L"blocked.exe", blocked.Id())), HasSubstr(L"error "),
                                         couldNot(DumpFileName(L"taken.exe", taken.Id())), HasSubstr(L"error ")));
  EXPECT_THAT(FileNames(m_output), Contains(DumpFileName(L"z.exe", last.Id())));
  EXPECT_FALSE(PathExists(m_output + L"\\" + DumpFileName(L"ended.exe", ended.Id())));
}

TEST_F(ProcessDumpCollectorTest, ABadTargetIsLoggedAndTheNextIsDumped) {
  const WaitingProgram child(m_programs, L"svc.exe");
  Collect(List({7, Target("pid", "12"), Json::objectValue, Target("name", Json::arrayValue), Target("pid", -1),
                Target("name", "st_test_no_such_program"), Target("pid", 0xFFFFFFF0u), Target("pid", child.JsonId())}));
  EXPECT_THAT(FileNames(m_output), ElementsAre(DumpFileName(L"svc.exe", child.Id())));
  const std::vector<std::wstring> lines = m_log.Take();
  const std::wstring start = kStart;
  EXPECT_EQ(std::count(lines.begin(), lines.end(), start + L"need numeric value"), 3);
  EXPECT_THAT(lines, Contains(start + L"Expecting a json array of objects"));
  EXPECT_THAT(lines, Contains(start + L"need text value for a name"));
  EXPECT_THAT(lines, Contains(HasSubstr(L"Could not find valid process data for pid -16")));
  EXPECT_THAT(lines, Contains(L"systeminfo::ProcessDumpCollector::DumpProcess: strippedName svc.exe"));
  EXPECT_THAT(lines, Contains(HasSubstr(Format(L"pid %u", child.Id()))));
}

TEST_F(ProcessDumpCollectorTest, ASettingThatIsNoListIsLogged) {
  const std::wstring start = kStart;
  Collect(Json::Value());
  EXPECT_THAT(m_log.Take(), Contains(start + L"no processes to dump were configured"));
  for (const Json::Value& setting : {Json::Value(true), Json::Value("x"), Target("pid", 1)}) {
    Collect(setting);
    EXPECT_THAT(m_log.Take(), Contains(start + L"Expecting a json array of objects"));
  }
  Collect(Json::arrayValue);
  EXPECT_THAT(FileNames(m_output), IsEmpty());
}

TEST_F(ProcessDumpCollectorTest, CancelStopsBeforeTheNextDump) {
  const WaitingProgram child(m_programs, L"svc.exe");
  const std::atomic<bool> cancel{true};
  Collect(List({Target("name", Piece(L"svc"))}), &cancel);
  EXPECT_THAT(FileNames(m_output), IsEmpty());
}

}  // namespace
}  // namespace systeminfo
