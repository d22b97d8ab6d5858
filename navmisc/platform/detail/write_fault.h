// The injected write fault that tests switch on with testing::FailAtomicWritesAfter: one byte
// budget for every file the platform layer writes (atomic files and exported documents).
#pragma once

#include <algorithm>
#include <atomic>
#include <cstddef>

namespace navmisc::detail {

// Bytes that may still be written before the injected fault; negative = no fault.
inline std::atomic<long long> g_write_budget{-1};

// How many of `wanted` bytes the fault injection lets through (all of them when it is off).
inline size_t TakeWriteBudget(size_t wanted) {
  long long budget = g_write_budget.load(std::memory_order_relaxed);
  for (;;) {
    if (budget < 0) return wanted;
    const long long granted = std::min<long long>(budget, static_cast<long long>(wanted));
    if (g_write_budget.compare_exchange_weak(budget, budget - granted, std::memory_order_relaxed)) {
      return static_cast<size_t>(granted);
    }
  }
}

}  // namespace navmisc::detail
