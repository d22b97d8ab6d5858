#include "navmisc/platform/unique_id.h"

#include <time.h>

#include <atomic>

namespace {

// Milliseconds since an arbitrary fixed point (boot), cut to 32 bits like the original tick
// count: it wraps after about 49.7 days.
uint32_t TickCountMs() {
  struct timespec ts;
  ::clock_gettime(CLOCK_MONOTONIC, &ts);
  const uint64_t ms = static_cast<uint64_t>(ts.tv_sec) * 1000u +
                      static_cast<uint64_t>(ts.tv_nsec) / 1000000u;
  return static_cast<uint32_t>(ms);
}

std::atomic<uint32_t> g_lastId{0};

}  // namespace

uint32_t GetUniqueID() {
  const uint32_t tick = TickCountMs();
  uint32_t last = g_lastId.load(std::memory_order_relaxed);
  uint32_t next;
  // Whoever stores first wins; the others see the newer value and step past it, so no value is
  // handed out twice.
  do {
    next = last < tick ? tick : last + 1;
  } while (!g_lastId.compare_exchange_weak(last, next, std::memory_order_relaxed));
  return next;
}
