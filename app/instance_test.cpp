#include "app/instance.h"

#include <gtest/gtest.h>

#include <string>

TEST(CheckSingleInstance, OthersAreRefusedForAsLongAsTheFirstKeepsItsEvent) {
  const std::wstring name = L"Local\\st_instance_test_" + std::to_wstring(GetCurrentProcessId());
  {
    const SingleInstance first = CheckSingleInstance(name.c_str());
    EXPECT_TRUE(first.isSingle);
    for (int i = 0; i < 2; ++i) {  // a refused one leaves nothing behind
      const SingleInstance second = CheckSingleInstance(name.c_str());
      EXPECT_FALSE(second.isSingle);
      EXPECT_FALSE(second.event);
    }
  }
  EXPECT_TRUE(CheckSingleInstance(name.c_str()).isSingle);
}

TEST(CheckSingleInstance, AnEventThatCannotBeMadeCountsAsNotSingle) {
  const std::wstring name = L"Local\\st_instance_mutex_" + std::to_wstring(GetCurrentProcessId());
  const KernelHandle otherKind(CreateMutexW(nullptr, FALSE, name.c_str()));
  EXPECT_FALSE(CheckSingleInstance(name.c_str()).isSingle);
}
