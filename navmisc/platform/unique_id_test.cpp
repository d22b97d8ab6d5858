#include "navmisc/platform/unique_id.h"

#include <algorithm>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

namespace {

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
