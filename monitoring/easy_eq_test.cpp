#include "monitoring/easy_eq.h"

#include <gmock/gmock.h>

#include <atomic>
#include <stdexcept>

#include "core/logging.h"
#include "core/program_path.h"
#include "tests/support/test_folder.h"

namespace st::monitoring {
namespace {

std::wstring Library(const wchar_t* name) {
  return ProgramFolder() + L"\\" + name;
}

class CountingItem : public EqWorkItem {
 public:
  CountingItem(std::atomic<int>& runs, std::atomic<int>& gone, HANDLE ran) : m_runs(runs), m_gone(gone), m_ran(ran) {}
  ~CountingItem() override { ++m_gone; }
  void Run() override {
    if (++m_runs == 3) SetEvent(m_ran);
    throw std::runtime_error("a run that fails");
  }

 private:
  std::atomic<int>&m_runs, &m_gone;
  HANDLE m_ran;
};

TEST(EasyEQ, ItemsRunPeriodicallyAlsoWhenARunFailsAndGoWhenTheyAreCancelled) {
  std::atomic<int> runs{0}, gone{0};
  const KernelHandle ran(CreateEventW(nullptr, TRUE, FALSE, nullptr));
  EasyEQ queue;
  ASSERT_EQ(queue.Init(Library(L"framework.dll")), 0);
  EventQueueHandle first = 0, second = 0;
  ASSERT_TRUE(queue.Schedule(L"test", 5, std::make_unique<CountingItem>(runs, gone, ran.Get()), first));
  ASSERT_TRUE(queue.Schedule(L"test", 100'000, std::make_unique<CountingItem>(runs, gone, ran.Get()), second));
  EXPECT_NE(first, 0U);
  EXPECT_EQ(WaitForSingleObject(ran.Get(), 20'000), WAIT_OBJECT_0);
  queue.Cancel(first);
  EXPECT_EQ(gone, 1);
  queue.Cancel(first);  // no harm
  queue.Close();
  EXPECT_EQ(gone, 2);
}

TEST(EasyEQ, AnItemThatTheQueueRefusesIsLoggedAndReleased) {
  std::atomic<int> runs{0}, gone{0};
  EasyEQ queue;
  ASSERT_EQ(queue.Init(Library(L"framework.dll")), 0);
  for (const int32_t period : {0, -1, INT32_MIN}) {
    logging::ErrorCapture errors;
    EventQueueHandle handle = 1;
    EXPECT_FALSE(queue.Schedule(L"test", period, std::make_unique<CountingItem>(runs, gone, nullptr), handle));
    EXPECT_EQ(handle, 0U);
    EXPECT_EQ(errors.Take().size(), 1U) << period;
  }
  EXPECT_EQ(gone, 3);
}

TEST(EasyEQ, ALibraryThatCannotMakeTheQueueIsUnloadedWithAnError) {
  const TestFolder folder;
  folder.MakeFile(L"text.dll", "this is no library");
  struct {
    std::wstring path;
    const wchar_t* behaviour;
    int32_t code;  // 0: any
    const wchar_t* line;
  } const rows[] = {
      {folder.Path(L"absent.dll"), L"", 0, L"error loading"},
      {folder.Path(L"text.dll"), L"", 0, L"error loading"},
      {Library(L"log_partial.dll"), L"", ERROR_PROC_NOT_FOUND, L"does not export QxCreateObject"},
      {Library(L"fake_framework.dll"), L"7", 7, L"QxCreateObject GlobalEventQueue returned 7"},
      {Library(L"fake_framework.dll"), L"-2147467259", -2147467259, L"returned -2147467259"},
      {Library(L"fake_framework.dll"), L"null", EVENT_QUEUE_UNKNOWN_OBJECT, L"returned 0"},
  };
  for (const auto& row : rows) {
    _wputenv_s(L"ST_FAKE_FRAMEWORK", row.behaviour);
    logging::ErrorCapture errors;
    EasyEQ queue;
    const int32_t code = queue.Init(row.path);
    EXPECT_NE(code, 0);
    if (row.code != 0) {
      EXPECT_EQ(code, row.code);
    }
    EXPECT_THAT(errors.Take(), testing::ElementsAre(testing::HasSubstr(row.line)));
  }
  EXPECT_EQ(GetModuleHandleW(L"fake_framework.dll"), nullptr);
}

}  // namespace
}  // namespace st::monitoring
