#include "progress.h"

#include "navmisc/datactrl/device_state.h"

namespace gpsdc {

ProgressReporter::ProgressReporter(ReplyChannel& replies, int32_t source,
                                   std::chrono::milliseconds interval)
    : replies_(replies), source_(source), interval_(interval) {}

void ProgressReporter::Report(int32_t total, int32_t processed, int32_t dbTotal,
                              int32_t dbProcessed) {
  g_nCountOfProgress = total;
  g_nCurrentOfProgress = processed;
  const auto now = std::chrono::steady_clock::now();
  const bool complete = processed >= total && dbProcessed >= dbTotal;
  if (sent_ > 0 && !complete && now - last_ < interval_) return;
  CDataControlProgressCmdBlk block{};
  block.nCmdType = DC_CMD_PROGRESS;
  block.nSource = source_;
  block.nTotalOfProcess = total;
  block.nProcessed = processed;
  block.nTotalOfDatabaseProcess = dbTotal;
  block.nDatabaseProcessed = dbProcessed;
  replies_.Send(block);
  last_ = now;
  ++sent_;
}

}  // namespace gpsdc
