#include "companions/upload/tus_protocol.h"

#include <gtest/gtest.h>

namespace {

using namespace qxlink;

TEST(JudgeStatus, DependsOnTheQuestion) {
  constexpr auto kCreate = TusRequest::Create;
  constexpr auto kOffset = TusRequest::Offset;
  constexpr auto kChunk = TusRequest::Chunk;
  struct {
    TusRequest request;
    unsigned status;
    TusNext next;
    int32_t result;
  } const rows[] = {
      {kCreate, 201, TusNext::Proceed, QXSKYLANE_OK},
      {kCreate, 200, TusNext::GiveUp, QXSKYLANE_SERVICE_FAILED},
      {kChunk, 204, TusNext::Proceed, QXSKYLANE_OK},
      {kOffset, 200, TusNext::Proceed, QXSKYLANE_OK},
      {kCreate, 404, TusNext::GiveUp, QXSKYLANE_SERVICE_REFUSED},
      {kOffset, 404, TusNext::BeginAnew, QXSKYLANE_SERVICE_REFUSED},
      {kChunk, 410, TusNext::BeginAnew, QXSKYLANE_SERVICE_REFUSED},
      {kChunk, 422, TusNext::BeginAnew, QXSKYLANE_SERVICE_REFUSED},
      {kCreate, 422, TusNext::GiveUp, QXSKYLANE_SERVICE_REFUSED},
      {kChunk, 409, TusNext::AskOffset, QXSKYLANE_SERVICE_FAILED},
      {kChunk, 460, TusNext::AskOffset, QXSKYLANE_SERVICE_FAILED},
      {kCreate, 409, TusNext::GiveUp, QXSKYLANE_SERVICE_REFUSED},
      {kOffset, 423, TusNext::Retry, QXSKYLANE_SERVICE_FAILED},
      {kCreate, 408, TusNext::Retry, QXSKYLANE_TIMED_OUT},
      {kChunk, 502, TusNext::Retry, QXSKYLANE_SERVICE_FAILED},
      {kCreate, 307, TusNext::GiveUp, QXSKYLANE_SERVICE_FAILED},
      {kCreate, 600, TusNext::GiveUp, QXSKYLANE_SERVICE_FAILED},
      {kCreate, 0, TusNext::GiveUp, QXSKYLANE_SERVICE_FAILED},
  };
  for (const auto& row : rows) {
    const TusVerdict verdict = JudgeStatus(row.request, row.status);
    EXPECT_EQ(verdict.next, row.next) << row.status;
    EXPECT_EQ(verdict.result, row.result) << row.status;
  }
}

TEST(RetryDelay, DoublesUpToAMinuteAndVariesByAHalf) {
  EXPECT_EQ(RetryDelay(1, 1000, 0), 1000u);
  EXPECT_EQ(RetryDelay(4, 1000, 0), 8000u);
  EXPECT_EQ(RetryDelay(4, 1000, 4000), 4000u);
  EXPECT_EQ(RetryDelay(4, 1000, 4001), 8000u);
  EXPECT_EQ(RetryDelay(1000, 1000, 0), 60'000u);
  EXPECT_EQ(RetryDelay(3, 10'000'000, 0), 60'000u);
  EXPECT_EQ(RetryDelay(5, 0, 7), 0u);
}

}  // namespace
