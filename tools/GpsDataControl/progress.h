// Progress of long work, for the handlers: progress blocks on the reply queue and the shared
// progress counters.
#pragma once

#include <chrono>
#include <cstdint>

#include "handlers.h"

namespace gpsdc {

class ProgressReporter {
 public:
  // Blocks for `source` (1 device, 2 web service), at most one per `interval` besides the
  // first and the last.
  ProgressReporter(ReplyChannel& replies, int32_t source,
                   std::chrono::milliseconds interval = std::chrono::milliseconds(100));

  // The work has done `processed` of `total` items (and `dbProcessed` of `dbTotal` items
  // written to the local store). Sets g_nCountOfProgress and g_nCurrentOfProgress; sends a
  // progress block for the first report, when the interval has passed since the last block,
  // and when both counts are complete.
  void Report(int32_t total, int32_t processed, int32_t dbTotal = 0, int32_t dbProcessed = 0);

  int sent() const { return sent_; }

 private:
  ReplyChannel& replies_;
  int32_t source_;
  std::chrono::milliseconds interval_;
  std::chrono::steady_clock::time_point last_;
  int sent_ = 0;
};

}  // namespace gpsdc
