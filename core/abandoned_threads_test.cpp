#include "core/abandoned_threads.h"

#include <gtest/gtest.h>

#include "core/program_path.h"
#include "tests/support/child_process.h"

namespace {

// The child's second thread holds a lock that every end of a process waits for, or uses what static destructors
// destroy, and never comes back.
TEST(EndingCode, ProcessWithAThreadThatWasLeftBehindEndsWithItsCode) {
  for (const wchar_t* what : {L"loader", L"statics"}) {
    ChildProcess child(L"\"" + ProgramFolder() + L"\\hanging_child.exe\" " + what);
    EXPECT_EQ(child.ReadLine(), "hanging");
    EXPECT_EQ(child.Wait(), 7u) << what;
  }
}

TEST(EndingCode, WithoutSuchAThreadTheProcessEndsAsEver) {
  ChildProcess child(L"\"" + ProgramFolder() + L"\\hanging_child.exe\" none");
  EXPECT_EQ(child.ReadLine(), "static objects are destroyed");
  EXPECT_EQ(child.Wait(), 7u);
}

}  // namespace
