#include "channel_run.h"

#include <cstdio>

#include "cli.h"
#include "navmisc/datactrl/request_queue.h"
#include "navmisc/platform/shared_globals.h"

namespace navmisc::cli {
namespace {
constexpr auto kStartWait = std::chrono::seconds(10);
constexpr auto kStopWait = std::chrono::seconds(30);
}  // namespace

bool PumpUntil(const std::function<bool()>& done, std::chrono::milliseconds wait) {
  const auto end = std::chrono::steady_clock::now() + wait;
  while (!done()) {
    if (std::chrono::steady_clock::now() >= end) return false;
    PumpMessagesUntil(done, 20);
  }
  return true;
}

ChannelRun::ChannelRun(CWnd& owner) {
  using namespace datactrl;
  g_bExit = false;
  const HWND hwnd = owner.GetSafeHwnd();
  thread_ = std::thread([this, &owner, hwnd] {
    ProcessCommand(&owner);
    finished_ = true;
    PostMessageW(hwnd, WM_NULL, 0, 0);
  });
  PumpUntil([this] { return GetChannelState() == ChannelState::kRunning || finished_; }, kStartWait);
  if (GetChannelState() != ChannelState::kRunning) {
    Stop();
    Fail("cannot start the data-control process " +
         DataControlArguments(DataControlCommandLine(g_szExecProgPath, g_nProductId))[0]);
  }
}

ChannelRun::~ChannelRun() { Stop(); }

void ChannelRun::Stop() {
  if (!thread_.joinable()) return;
  g_bExit = true;
  PumpUntil([this] { return finished_.load(); }, kStopWait);
  thread_.join();
  if (datactrl::DataControlProcessId() != 0) {
    std::fprintf(stderr, "navmisc: the data-control process did not end in time; stopped it\n");
    datactrl::EndKeptDataControlProcess();
  }
}

}  // namespace navmisc::cli
