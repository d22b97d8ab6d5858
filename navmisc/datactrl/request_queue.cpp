#include "navmisc/datactrl/request_queue.h"

#include <chrono>

#include "navmisc/datactrl/block_codec.h"
#include "navmisc/datactrl/detail/channel_state.h"
#include "navmisc/platform/package.h"

std::atomic<bool> g_bExit{false};

namespace navmisc::datactrl {
namespace detail {

ChannelShared& Channel() {
  // Never destroyed: a kept data-control process is ended by its own ChildProcess only when the
  // application asks (EndKeptDataControlProcess), not by static destruction order.
  static ChannelShared* const channel = new ChannelShared;
  return *channel;
}

void PublishRequestQueue(std::shared_ptr<CxSysMsgQueue> queue) {
  ChannelShared& c = Channel();
  std::lock_guard lock(c.mutex);
  c.requests = std::move(queue);
}

}  // namespace detail

namespace {

// How long one attempt to send waits for room in a full ring before it looks whether the
// channel still runs.
constexpr uint32_t kSendSliceMs = 200;

void SendRequest(const CPackageBlk& package) {
  if (package.GetPackageSize() > kSysMsgMaxMessage) return;
  detail::ChannelShared& c = detail::Channel();
  for (;;) {
    std::shared_ptr<CxSysMsgQueue> queue;
    {
      std::lock_guard lock(c.mutex);
      queue = c.requests;
    }
    // A full ring means the process is busy: wait for room as long as the channel runs. Once it
    // stops, the request has nowhere to go. A send that fails before its time is up found the
    // ring unusable, and waiting would not help.
    if (!queue) return;
    const auto started = std::chrono::steady_clock::now();
    if (queue->Send(package.GetPackagePtr(), package.GetPackageSize(), kSendSliceMs)) return;
    if (std::chrono::steady_clock::now() - started < std::chrono::milliseconds(kSendSliceMs))
      return;
  }
}

template <class Block>
void Insert(const Block& block) {
  CPackageBlk package(1);
  PackBlock(block, package);
  SendRequest(package);
}

}  // namespace

ChannelState GetChannelState() { return detail::Channel().state.load(); }

CString DataControlCommandLine(const wchar_t* folder, GPS_APP_PROG_TYPE product) {
  CString line = folder ? folder : L"";
  if (line.IsEmpty() || line.GetAt(line.GetLength() - 1) != L'/') line += L'/';
  line += kDataControlProgram;
  line += product == GPS_APP_WHEREAMI ? L" /Dongle" : L" /Tracer";
  return line;
}

std::vector<std::string> DataControlArguments(const CString& commandLine) {
  const std::string line = commandLine.ToUtf8();
  const size_t blank = line.rfind(' ');
  if (blank == std::string::npos) return {line};
  return {line.substr(0, blank), line.substr(blank + 1)};
}

int DataControlProcessId() { return detail::Channel().pid.load(); }

void EndKeptDataControlProcess() {
  detail::ChannelShared& c = detail::Channel();
  if (c.state.load() != ChannelState::kStopped) return;
  c.process.Kill();
  c.pid = 0;
}

}  // namespace navmisc::datactrl

void InsertRequestMessage(const CDataControlCmdBlk& b) { navmisc::datactrl::Insert(b); }
void InsertRequestMessage(const CDataControlExitCmdBlk& b) {
  navmisc::datactrl::Insert(static_cast<const CDataControlCmdBlk&>(b));
}
void InsertRequestMessage(const CDataControlConnectionStatus& b) { navmisc::datactrl::Insert(b); }
void InsertRequestMessage(const CDataControlProgressCmdBlk& b) { navmisc::datactrl::Insert(b); }
void InsertRequestMessage(const CDataControlCmdBlkKVDevice& b) { navmisc::datactrl::Insert(b); }
void InsertRequestMessage(const CDataControlCmdBlkKVDevice11& b) { navmisc::datactrl::Insert(b); }
void InsertRequestMessage(const CDataControlCmdBlkNet& b) { navmisc::datactrl::Insert(b); }
void InsertRequestMessage(const CDataControlCmdBlkFile& b) { navmisc::datactrl::Insert(b); }
