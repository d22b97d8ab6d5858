// What the command thread shares with the threads that make requests. Private to the library.
#pragma once

#include <atomic>
#include <memory>
#include <mutex>

#include "navmisc/datactrl/request_queue.h"
#include "navmisc/platform/msg_queue.h"
#include "navmisc/platform/process.h"

namespace navmisc::datactrl::detail {

struct ChannelShared {
  std::atomic<ChannelState> state{ChannelState::kStopped};
  std::mutex mutex;                          // guards `requests`
  std::shared_ptr<CxSysMsgQueue> requests;   // set while requests are accepted
  // The data-control process: started, watched and stopped by the command thread only (and
  // ended by EndKeptDataControlProcess while no command thread runs). `pid` mirrors it for the
  // other threads.
  ChildProcess process;
  std::atomic<int> pid{0};
};

ChannelShared& Channel();

// Makes `queue` the destination of requests (null: requests are dropped from now on).
void PublishRequestQueue(std::shared_ptr<CxSysMsgQueue> queue);

}  // namespace navmisc::datactrl::detail
