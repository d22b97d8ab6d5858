#include "navmisc/platform/window.h"

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <future>
#include <mutex>
#include <thread>
#include <vector>

#include "navmisc/platform/process.h"

namespace {

constexpr UINT kPing = WM_USER + 1;
constexpr UINT kAsk = WM_USER + 2;

// Records every message with the thread that handled it; kPing answers wParam + 1, kAsk sends
// kPing to the window in lParam and answers its result.
class Recorder : public CWnd {
 public:
  struct Seen {
    UINT message;
    WPARAM wParam;
    unsigned long thread;
  };
  LRESULT WindowProc(UINT message, WPARAM wParam, LPARAM lParam) override {
    {
      std::lock_guard lock(mutex_);
      seen_.push_back({message, wParam, navmisc::GetCurrentThreadId()});
    }
    if (message == kPing) return static_cast<LRESULT>(wParam + 1);
    if (message == kAsk) return SendMessageW(reinterpret_cast<HWND>(lParam), kPing, wParam, 0);
    return 0;
  }
  std::vector<Seen> seen() {
    std::lock_guard lock(mutex_);
    return seen_;
  }

 private:
  std::mutex mutex_;
  std::vector<Seen> seen_;
};

TEST(Window, MessagesRunOnTheOwningThreadInOrder) {
  Recorder main;
  const unsigned long me = navmisc::GetCurrentThreadId();
  auto result = std::async(std::launch::async, [&] {
    for (WPARAM i = 1; i <= 3; ++i) PostMessageW(main.GetSafeHwnd(), WM_USER + 7, i, 0);
    return SendMessageW(main.GetSafeHwnd(), kPing, 41, 0);  // waits until handled
  });
  ASSERT_TRUE(navmisc::PumpMessagesUntil([&] { return main.seen().size() == 4; }, 10000));
  EXPECT_EQ(result.get(), 42);
  std::vector<WPARAM> posted;
  for (const auto& s : main.seen()) {
    EXPECT_EQ(s.thread, me);
    if (s.message != kPing) posted.push_back(s.wParam);
  }
  EXPECT_EQ(posted, std::vector<WPARAM>({1, 2, 3}));
  // On its own thread a send is a call.
  EXPECT_EQ(SendMessageW(main.GetSafeHwnd(), kPing, 1, 0), 2);
}

TEST(Window, ThreadsSendingToEachOtherDoNotDeadlock) {
  Recorder main;
  std::promise<HWND> workerWindow;
  std::atomic<bool> finish{false};
  std::atomic<LRESULT> answer{0};
  std::thread worker([&] {
    Recorder mine;
    workerWindow.set_value(mine.GetSafeHwnd());
    // The main thread's handler sends back to this thread while it waits here.
    answer = SendMessageW(main.GetSafeHwnd(), kAsk, 9, reinterpret_cast<LPARAM>(mine.GetSafeHwnd()));
    PostMessageW(main.GetSafeHwnd(), WM_NULL, 0, 0);  // wakes the main thread's loop
    while (!finish) ReleaseCPUTime(10);
  });
  const HWND other = workerWindow.get_future().get();
  EXPECT_TRUE(navmisc::PumpMessagesUntil([&] { return answer != 0; }, 10000));
  EXPECT_EQ(answer, 10);
  finish = true;
  worker.join();
  EXPECT_FALSE(IsWindow(other));
}

TEST(Window, TimersTickOnTheOwningThreadUntilKilled) {
  Recorder main;
  ASSERT_EQ(SetTimer(main.GetSafeHwnd(), 1002, 20), 1002u);
  ReleaseCPUTime(300);
  const size_t ticks = main.seen().size();
  EXPECT_GE(ticks, 2u);
  for (const auto& s : main.seen()) EXPECT_EQ(std::pair(s.message, s.wParam), std::pair(WM_TIMER, WPARAM{1002}));
  EXPECT_TRUE(KillTimer(main.GetSafeHwnd(), 1002));
  EXPECT_FALSE(KillTimer(main.GetSafeHwnd(), 1002));
  ReleaseCPUTime(100);
  EXPECT_EQ(main.seen().size(), ticks);
}

TEST(Window, GoneWindowsAndEndedThreadsAnswerZero) {
  HWND gone;
  {
    Recorder temporary;
    gone = temporary.GetSafeHwnd();
  }
  EXPECT_FALSE(IsWindow(gone));
  EXPECT_EQ(SendMessageW(gone, kPing, 1, 0), 0);
  EXPECT_FALSE(PostMessageW(gone, kPing, 1, 0));
  EXPECT_EQ(SetTimer(gone, 1, 10), 0u);

  // A thread that never handles its messages and then ends: the sender is released with 0.
  std::promise<HWND> window;
  std::promise<void> release;
  std::thread silent([&] {
    Recorder mine;
    window.set_value(mine.GetSafeHwnd());
    release.get_future().wait();
  });
  const HWND hwnd = window.get_future().get();
  auto sent = std::async(std::launch::async, [&] { return SendMessageW(hwnd, kPing, 5, 0); });
  std::this_thread::sleep_for(std::chrono::milliseconds(50));
  release.set_value();
  silent.join();
  EXPECT_EQ(sent.get(), 0);
}

}  // namespace
