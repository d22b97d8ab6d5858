// The command thread: queues, the data-control process and the delivery of its replies.
#include <chrono>
#include <iterator>
#include <memory>

#include "navmisc/datactrl/block_codec.h"
#include "navmisc/datactrl/detail/channel_state.h"
#include "navmisc/datactrl/device_state.h"
#include "navmisc/datactrl/request_queue.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/package.h"
#include "navmisc/platform/shared_globals.h"

namespace navmisc::datactrl {
namespace {

using Clock = std::chrono::steady_clock;

constexpr uint32_t kReceiveWaitMs = 500;  // the longest wait for a reply in one pass
constexpr unsigned kIdleMs = 200;         // the idle wait after a pass without a reply
// Both waits are taken in slices of this length, so that g_bExit ends them soon: a program
// that is done with the channel should not wait out a pass before the process is told to end.
constexpr uint32_t kSliceMs = 50;
// A process that dies is started again after these delays, one per consecutive death; after
// the last one the channel gives up. A process that has run this long resets the count.
constexpr int kRestartDelaysMs[] = {250, 500, 1000, 2000, 4000};
constexpr auto kStableRun = std::chrono::seconds(30);

template <class Block>
void Deliver(HWND owner, Block& block) {
  SendMessageW(owner, WM_DATACTRL_RECEIVE, 0, reinterpret_cast<LPARAM>(&block));
}

// Unpacks one reply into the block of its kind, on this thread's stack, and hands it to the
// owner. A package that is not well-formed, or of a kind nobody knows, goes no further.
void DeliverReply(HWND owner, const uint8_t* data, uint32_t size) {
  CUnpackageBlk package(data, size);
  if (!package.IsValid()) return;
  CDataControlCmdBlk header{};
  UnpackHeader(package, header);
  switch (header.nCmdType) {
    case DC_CMD_DEVICE: {
      CDataControlCmdBlkKVDevice device{};
      UnpackBlock(package, device);
      if (UsesKV11Block(device.nDeviceCmd)) {
        CDataControlCmdBlkKVDevice11 kv11;
        InitKV11BlockDefaults(kv11);
        UnpackBlock(package, kv11);
        Deliver(owner, kv11);
      } else {
        Deliver(owner, device);
      }
      break;
    }
    case DC_CMD_NET: {
      CDataControlCmdBlkNet net;
      UnpackBlock(package, net);
      Deliver(owner, net);
      break;
    }
    case DC_CMD_FILE: {
      CDataControlCmdBlkFile file;
      UnpackBlock(package, file);
      Deliver(owner, file);
      break;
    }
    case DC_CMD_CONNECTION_STATUS: {
      CDataControlConnectionStatus status{};
      UnpackBlock(package, status);
      Deliver(owner, status);
      break;
    }
    case DC_CMD_PROGRESS: {
      CDataControlProgressCmdBlk progress{};
      UnpackBlock(package, progress);
      Deliver(owner, progress);
      break;
    }
    default:
      break;
  }
}

// Throws away whatever waits in the queue.
void Drain(CxSysMsgQueue& queue) {
  CxSysMsgInfo info;
  while (queue.Receive(0, &info, 1)) {
  }
}

bool StartProcess(detail::ChannelShared& c) {
  CString folder = g_szExecProgPath;
  if (folder.IsEmpty()) folder = GetCurrentExecPath();
  SpawnOptions hidden;
  hidden.nullStdin = hidden.nullStdout = true;
  const bool started =
      c.process.Start(DataControlArguments(DataControlCommandLine(folder, g_nProductId)), hidden);
  c.pid = started ? c.process.pid() : 0;
  return started;
}

// Watches the data-control process during the loop and starts it again when it dies.
class Supervisor {
 public:
  Supervisor(detail::ChannelShared& c, HWND owner, CxSysMsgQueue& replies)
      : c_(c), owner_(owner), replies_(replies), startedAt_(Clock::now()) {}

  // False when the channel has to give up: the process keeps dying or cannot be started.
  bool Check() {
    if (restartPending_) {
      if (Clock::now() < restartAt_) return true;
      restartPending_ = false;
      startedAt_ = Clock::now();
      return StartProcess(c_);
    }
    if (!c_.process.WaitFor(0)) return true;  // still running
    c_.pid = 0;
    // What the process said before it died still counts; then the owner learns that neither the
    // logger nor the web service can be reached now.
    CxSysMsgInfo info;
    while (auto reply = replies_.Receive(0, &info, 1)) DeliverReply(owner_, reply.get(), info.nSize);
    g_bDeviceConnected = false;
    g_bNetConnected = false;
    for (int32_t source : {DC_SOURCE_DEVICE, DC_SOURCE_NET}) {
      CDataControlConnectionStatus lost{};
      lost.nCmdType = DC_CMD_CONNECTION_STATUS;
      lost.nSource = source;
      Deliver(owner_, lost);
    }
    if (Clock::now() - startedAt_ >= kStableRun) deaths_ = 0;
    if (deaths_ >= static_cast<int>(std::size(kRestartDelaysMs))) return false;
    restartAt_ = Clock::now() + std::chrono::milliseconds(kRestartDelaysMs[deaths_++]);
    restartPending_ = true;
    return true;
  }

 private:
  detail::ChannelShared& c_;
  HWND owner_;
  CxSysMsgQueue& replies_;
  Clock::time_point startedAt_;
  bool restartPending_ = false;
  Clock::time_point restartAt_;
  int deaths_ = 0;
};

// Sends the exit block and gives the process its time to end. One that does not end in time is
// kept as it is.
void StopProcess(detail::ChannelShared& c) {
  if (!c.process.IsRunning()) return;
  CDataControlExitCmdBlk exit{};
  exit.nCmdType = DC_CMD_EXIT;
  InsertRequestMessage(exit);
  if (c.process.WaitFor(kExitWaitMs)) c.pid = 0;
}

}  // namespace
}  // namespace navmisc::datactrl

uint32_t ProcessCommand(void* owner) {
  using namespace navmisc::datactrl;
  detail::ChannelShared& c = detail::Channel();
  auto* window = static_cast<CWnd*>(owner);
  if (!window) return 0;
  const HWND hwnd = window->GetSafeHwnd();
  auto replies = std::make_unique<CxSysMsgQueue>(kReplyQueueName, kQueueCapacityKiB,
                                                 navmisc::kSysMsgOpenOrCreate);
  auto requests = std::make_shared<CxSysMsgQueue>(kRequestQueueName, kQueueCapacityKiB,
                                                  navmisc::kSysMsgOpenOrCreate);
  if (!replies->IsValid() || !requests->IsValid()) return 0;

  // Replies or requests left by an earlier run belong to nobody now.
  Drain(*replies);
  Drain(*requests);
  detail::PublishRequestQueue(requests);
  if (StartProcess(c)) {
    c.state = ChannelState::kRunning;
    Supervisor supervisor(c, hwnd, *replies);
    while (!g_bExit) {
      CxSysMsgInfo info;
      std::unique_ptr<uint8_t[]> reply;
      for (uint32_t waited = 0; !reply && waited < kReceiveWaitMs && !g_bExit; waited += kSliceMs) {
        reply = replies->Receive(kSliceMs, &info, 1);
      }
      if (reply) {
        DeliverReply(hwnd, reply.get(), info.nSize);
      } else {
        for (unsigned idle = 0; idle < kIdleMs && !g_bExit; idle += kSliceMs) ReleaseCPUTime(kSliceMs);
      }
      if (!supervisor.Check()) break;
    }
    c.state = ChannelState::kStopping;
    StopProcess(c);
  }
  c.state = ChannelState::kStopping;
  detail::PublishRequestQueue(nullptr);
  Drain(*replies);
  Drain(*requests);
  replies->Unlink();
  requests->Unlink();
  c.state = ChannelState::kStopped;
  return 0;
}
