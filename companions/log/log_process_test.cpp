#include <gmock/gmock.h>

#include <map>
#include <memory>

#include "core/program_path.h"
#include "core/walk_dir.h"
#include "tests/support/child_process.h"
#include "tests/support/log_text.h"
#include "tests/support/test_folder.h"

namespace {

// A folder with the program that logs, the library and its settings.
class Processes : public testing::Test {
 protected:
  Processes() {
    for (const wchar_t* name : {L"log_child.exe", L"log.dll"}) {
      CopyFileW((ProgramFolder() + L"\\" + name).c_str(), m_folder.Path(name).c_str(), FALSE);
    }
  }
  std::unique_ptr<ChildProcess> Start(const std::wstring& arguments) const {
    return std::make_unique<ChildProcess>(L"\"" + m_folder.Path(L"log_child.exe") + L"\" " + arguments);
  }

  // The lines of the child programs in all log files, by "<process>/<thread>", in the order of their numbers; anything
  // that is not one whole line is a failure.
  std::map<std::string, int> CountLines() const {
    std::map<std::string, int> counts;
    for (int slot = 1; slot <= 9; ++slot) {
      const std::wstring stem = L"logs\\log_child" + (slot == 1 ? std::wstring() : L"-" + std::to_wstring(slot));
      for (int number = 20; number >= 0; --number) {
        const std::wstring name = stem + (number == 0 ? std::wstring() : L"." + std::to_wstring(number)) + L".log";
        for (const std::string& line : Lines(LogText(m_folder.Path(name))))
          CountLine(line, counts);
      }
    }
    return counts;
  }

  TestFolder m_folder;

 private:
  static void CountLine(const std::string& line, std::map<std::string, int>& counts) {
    if (line.find("[logging::LoggerConfig::Init]") != std::string::npos) return;
    int number = -1;
    unsigned process = 0;
    unsigned thread = 0;
    const std::string text = TextOf(line);
    ASSERT_EQ(std::sscanf(text.c_str(), "line %d of %u/%u", &number, &process, &thread), 3) << line;
    EXPECT_TRUE(text.ends_with("shows: <0123456789abcdefghijklmnopqrstuvwxyz>")) << line;
    EXPECT_EQ(number, counts[std::to_string(process) + "/" + std::to_string(thread)]++) << line;
  }
};

TEST_F(Processes, EveryLineOfAKilledProgramIsThere) {
  m_folder.MakeFile(L"Logger.xml", "<configuration path='logs'/>");
  const auto child = Start(L"lines 1000000");
  std::string last;
  for (int i = 0; i < 200; ++i)
    last = child->ReadLine();
  child->Kill();
  for (std::string line = child->ReadLine(); !line.empty(); line = child->ReadLine())
    last = line;  // what it still said
  const auto counts = CountLines();
  ASSERT_EQ(counts.size(), 1u);
  EXPECT_GE(counts.begin()->second, std::stoi(last) + 1);
}

TEST_F(Processes, SeveralAtOnceLoseAndMixNothing) {
  // Several rotations of each, all of whose files are kept.
  m_folder.MakeFile(L"Logger.xml",
                    "<configuration path='logs'><maxSize>60 KB</maxSize><oldFiles>20</oldFiles></configuration>");
  std::vector<std::unique_ptr<ChildProcess>> children;
  children.reserve(4);
  for (int i = 0; i < 4; ++i)
    children.push_back(Start(L"threads 500"));
  for (const auto& child : children)
    EXPECT_EQ(child->Wait(), 0u);
  const auto counts = CountLines();
  EXPECT_EQ(counts.size(), 16u);
  for (const auto& [writer, count] : counts)
    EXPECT_EQ(count, 500) << writer;
}

TEST_F(Processes, ASecondInstanceTakesTheNextFileAndGivesItBack) {
  m_folder.MakeFile(L"Logger.xml", "<configuration path='logs'/>");
  const auto first = Start(L"lines 1000000");
  first->ReadLine();
  Start(L"lines 1")->Wait();
  Start(L"lines 1")->Wait();
  EXPECT_EQ(Lines(LogText(m_folder.Path(L"logs\\log_child-2.log"))).size(), 6u);
  EXPECT_FALSE(PathExists(m_folder.Path(L"logs\\log_child-3.log")));
}

}  // namespace
