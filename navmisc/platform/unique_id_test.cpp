#include "navmisc/platform/unique_id.h"

#include <time.h>

#include <algorithm>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

namespace {

uint32_t TickNow() {
  struct timespec ts;
  clock_gettime(CLOCK_MONOTONIC, &ts);
  return static_cast<uint32_t>(static_cast<uint64_t>(ts.tv_sec) * 1000u +
                               static_cast<uint64_t>(ts.tv_nsec) / 1000000u);
}

TEST(GetUniqueID, FollowsTheMillisecondTick) {
  // Values run ahead of the tick only after bursts of calls; wait until the tick has caught up.
  const uint32_t last = GetUniqueID();
  const int32_t ahead = static_cast<int32_t>(last - TickNow());
  if (ahead > 1000) GTEST_SKIP() << "earlier calls in this process ran " << ahead << " ms ahead";
  struct timespec pause = {0, (std::max(ahead, 0) + 20) * 1000000L};
  nanosleep(&pause, nullptr);

  // Once the tick has moved past the last value, the value is the tick itself.
  const uint32_t before = TickNow();
  const uint32_t id = GetUniqueID();
  const uint32_t after = TickNow();
  EXPECT_GE(static_cast<int32_t>(id - before), 0);
  EXPECT_LE(static_cast<int32_t>(id - after), 0);
  EXPECT_GT(static_cast<int32_t>(id - last), 0);
}

TEST(GetUniqueID, StrictlyIncreasingAcrossThreads) {
  constexpr int kThreads = 4;
  constexpr int kCalls = 100000;
  std::vector<std::vector<uint32_t>> seen(kThreads, std::vector<uint32_t>(kCalls));
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t) {
    threads.emplace_back([&seen, t] {
      for (uint32_t& id : seen[t]) id = GetUniqueID();
    });
  }
  for (std::thread& th : threads) th.join();

  std::vector<uint32_t> all;
  for (const std::vector<uint32_t>& ids : seen) {
    for (size_t i = 1; i < ids.size(); ++i) ASSERT_LT(ids[i - 1], ids[i]) << "at call " << i;
    all.insert(all.end(), ids.begin(), ids.end());
  }
  std::sort(all.begin(), all.end());
  EXPECT_EQ(std::adjacent_find(all.begin(), all.end()), all.end()) << "a value was handed out twice";
}

}  // namespace
