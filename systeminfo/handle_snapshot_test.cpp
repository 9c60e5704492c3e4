#include "systeminfo/handle_snapshot.h"

#include <gmock/gmock.h>

#include <algorithm>
#include <atomic>

#include "core/logging.h"
#include "core/text.h"
#include "tests/support/process_child.h"

namespace {

using testing::Contains;
using testing::Each;
using testing::ElementsAre;
using testing::Field;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

TEST(HandleSnapshot, OpenHandlesOfAnotherProcessAreFoundWithTheirTypes) {
  const ProcessChild child;
  ProcessHandlerHelper helper;
  std::vector<HandleInfo> handles;
  helper.GetHandleInformationForProcess(child.processId, handles);
  EXPECT_EQ(child.handles.size(), 4u);
  for (const auto& open : child.handles) {
    EXPECT_EQ(std::count_if(handles.begin(), handles.end(),
                            [&](const HandleInfo& handle) {
                              return handle.value == open.first && handle.type == ToWide(open.second);
                            }),
              1)
        << open.first << ' ' << open.second;
  }
  EXPECT_THAT(handles, Not(Contains(Field(&HandleInfo::value, child.closedHandle))));
}

TEST(HandleSnapshot, NamesStayEmpty) {
  const KernelHandle named(CreateEventW(nullptr, TRUE, FALSE, L"Local\\st handle with a name"));
  ProcessHandlerHelper helper;
  std::vector<HandleInfo> handles;
  helper.GetHandleInformationForProcess(GetCurrentProcessId(), handles);
  EXPECT_THAT(handles, Contains(Field(&HandleInfo::value, reinterpret_cast<uintptr_t>(named.Get()))));
  EXPECT_THAT(handles, Each(Field(&HandleInfo::name, IsEmpty())));
}

TEST(HandleSnapshot, LaterHandlesAreNotSeenAndResultsAreAppended) {
  ProcessHandlerHelper helper;
  const KernelHandle later(CreateEventW(nullptr, TRUE, FALSE, nullptr));
  std::vector<HandleInfo> handles = {{0xABCDE, L"kept", L"kept"}};
  helper.GetHandleInformationForProcess(GetCurrentProcessId(), handles);
  EXPECT_GT(handles.size(), 1u);
  EXPECT_EQ(handles[0].value, 0xABCDEu);
  EXPECT_THAT(handles, Not(Contains(Field(&HandleInfo::value, reinterpret_cast<uintptr_t>(later.Get())))));
}

TEST(HandleSnapshot, ProcessThatEndedOrIsTheSystemsHasNoHandles) {
  ProcessChild child;
  ProcessHandlerHelper helper;
  child.Kill();
  logging::ErrorCapture capture(logging::Level::kTrace);
  std::vector<HandleInfo> handles;
  helper.GetHandleInformationForProcess(child.processId, handles);
  helper.GetHandleInformationForProcess(4, handles);
  EXPECT_THAT(handles, IsEmpty());
  EXPECT_THAT(
      capture.Take(),
      Contains(L"ProcessHandlerHelper::GetHandleInformationForProcess: Could not open PID 4!(Don't try to open a "
               L"system process.)\n"));
}

// A kernel of the tests' own: a table of this process's handles 1 to s_handles, each of the type "File", with some that
// misbehave.
constexpr uintptr_t kClosed = 3, kBlocking = 5, kUntyped = 7, kOutside = 9;
uint32_t s_handles = 0;
ULONG s_smallestReply = 0;
std::atomic<bool> s_areBlockedFreed{false};
NTSTATUS s_tableStatus = 0;

NTSTATUS NTAPI FakeQuerySystem(SYSTEM_INFORMATION_CLASS kind, void* reply, ULONG size, ULONG*) {
  EXPECT_EQ(static_cast<int>(kind), 16);
  if (size < s_smallestReply) return static_cast<NTSTATUS>(0xC0000004);
  auto* const bytes = static_cast<char*>(reply);
  memcpy(bytes, &s_handles, sizeof s_handles);
  const uint32_t owner = GetCurrentProcessId();
  for (uint16_t i = 1; i <= s_handles && 8u + 24u * i <= size; ++i) {
    char* const entry = bytes + 8 + size_t{24} * (i - 1u);
    memcpy(entry, &owner, sizeof owner);
    memcpy(entry + 6, &i, sizeof i);
  }
  return s_tableStatus;
}

// The duplicate carries the value of its source, as an event's name would.
thread_local uintptr_t t_source = 0;

NTSTATUS NTAPI FakeDuplicate(HANDLE, HANDLE source, HANDLE, HANDLE* target, ACCESS_MASK access, ULONG attributes,
                             ULONG options) {
  EXPECT_EQ(access | attributes | options, 0u);
  t_source = reinterpret_cast<uintptr_t>(source);
  if (t_source == kClosed) return static_cast<NTSTATUS>(0xC0000008);
  while (t_source % 100 == kBlocking && !s_areBlockedFreed)
    Sleep(1);
  *target = CreateEventW(nullptr, TRUE, FALSE, nullptr);
  return 0;
}

NTSTATUS NTAPI FakeQueryObject(HANDLE, OBJECT_INFORMATION_CLASS kind, void* reply, ULONG size, ULONG*) {
  EXPECT_EQ(static_cast<int>(kind), 2);
  EXPECT_EQ(size, 4096u);
  if (t_source == kUntyped) return static_cast<NTSTATUS>(0xC0000022);
  auto* const bytes = static_cast<char*>(reply);
  const uint16_t length = 8;
  const uint64_t address = reinterpret_cast<uintptr_t>(bytes) + (t_source == kOutside ? size : 0x60);
  memcpy(bytes, &length, sizeof length);
  memcpy(bytes + 8, &address, sizeof address);
  memcpy(bytes + 0x60, L"File", 8);
  return 0;
}

class FakeKernel : public testing::Test {
 protected:
  FakeKernel() { s_areBlockedFreed = false; }
  ~FakeKernel() override { s_areBlockedFreed = true; }

  std::vector<uint64_t> Values(ProcessHandlerHelper& helper) {
    std::vector<HandleInfo> handles;
    helper.GetHandleInformationForProcess(GetCurrentProcessId(), handles);
    EXPECT_THAT(handles, Each(Field(&HandleInfo::type, L"File")));
    std::vector<uint64_t> values;
    values.reserve(handles.size());
    for (const HandleInfo& handle : handles)
      values.push_back(handle.value);
    return values;
  }

  logging::ErrorCapture m_capture{logging::Level::kTrace};
  const HandleCalls m_calls{&FakeQuerySystem, {&FakeDuplicate, &FakeQueryObject}};
};

TEST_F(FakeKernel, HandleThatFailsOrBlocksCostsOnlyItself) {
  s_handles = 11;
  s_smallestReply = 40000;  // several doublings
  ProcessHandlerHelper helper(m_calls, std::chrono::milliseconds(250));
  EXPECT_THAT(Values(helper), ElementsAre(1, 2, 4, 6, 8, 10, 11));
  const std::wstring scope = L"ProcessHandlerHelper::GetHandleInformationForProcess: ";
  EXPECT_THAT(m_capture.Take(),
              ElementsAre(scope + L"handle 0x5 does not answer and is given up", scope + L"Erorr m_ntQueryObject",
                          scope + L"the type of handle 0x9 lies outside of the reply"));
}

TEST_F(FakeKernel, ManyBlockingHandlesEndTheQuestions) {
  s_handles = 1600;  // 16 of them block
  s_smallestReply = 8 + 24 * s_handles;
  ProcessHandlerHelper helper(m_calls, std::chrono::milliseconds(250));
  const auto values = Values(helper);
  EXPECT_EQ(values.back(), 704u) << "705 is the eighth that blocks";
  EXPECT_THAT(Values(helper), IsEmpty());
  EXPECT_THAT(m_capture.Take(), Contains(HasSubstr(L"too many handles do not answer")).Times(1));
}

TEST_F(FakeKernel, TableThatCannotBeTakenLeavesNoHandles) {
  s_handles = 5;
  s_tableStatus = static_cast<NTSTATUS>(0xC0000005);
  ProcessHandlerHelper helper(m_calls);
  s_tableStatus = 0;
  EXPECT_THAT(Values(helper), IsEmpty());
  ProcessHandlerHelper unbound{HandleCalls()};
  EXPECT_THAT(Values(unbound), IsEmpty());
}

}  // namespace
