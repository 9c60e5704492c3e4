#include "monitoring/stop_listener.h"

#include <gmock/gmock.h>

#include <atomic>

namespace st::monitoring {
namespace {

constexpr wchar_t kName[] = L"Local\\st_stop_listener_test";  // not the program's, which may be running

bool SignalStopEvent() {
  const KernelHandle event(OpenEventW(EVENT_MODIFY_STATE, FALSE, kName));
  return event && SetEvent(event.Get());
}

TEST(StopListener, TheNamedEventStopsAsOftenAsItIsSignaledWhileItListens) {
  EXPECT_FALSE(SignalStopEvent());
  const KernelHandle stopped(CreateEventW(nullptr, FALSE, FALSE, nullptr));
  {
    const StopListener listener([&stopped] { SetEvent(stopped.Get()); }, kName);
    for (int i = 0; i < 2; ++i) {
      ASSERT_TRUE(SignalStopEvent());
      EXPECT_EQ(WaitForSingleObject(stopped.Get(), 20'000), WAIT_OBJECT_0);
    }
  }
  EXPECT_FALSE(SignalStopEvent()) << "the event goes with the listener";

  // A signal from before the run does not count.
  const KernelHandle older(CreateEventW(nullptr, TRUE, TRUE, kName));
  std::atomic<int> stops{0};
  {
    const StopListener listener([&stops] { ++stops; }, kName);
    Sleep(50);
  }
  EXPECT_EQ(stops, 0);
}

}  // namespace
}  // namespace st::monitoring
