#include "channel_session.h"

#include <cstdio>

#include "cli.h"
#include "navmisc/datactrl/request_queue.h"
#include "navmisc/platform/shared_globals.h"

namespace navmisc::cli {
namespace {
constexpr auto kStartWait = std::chrono::seconds(10);
constexpr auto kStopWait = std::chrono::seconds(30);
}  // namespace

bool PumpUntil(const std::function<bool()>& done, std::chrono::steady_clock::duration wait) {
  const auto end = std::chrono::steady_clock::now() + wait;
  while (!done()) {
    if (std::chrono::steady_clock::now() >= end) return false;
    PumpMessagesUntil(done, 20);
  }
  return true;
}

ChannelSession::ChannelSession(CWnd& owner) : hwnd_(owner.GetSafeHwnd()) {
  using namespace navmisc::datactrl;
  g_bExit = false;
  thread_ = std::thread([this, &owner] {
    ProcessCommand(&owner);
    finished_ = true;
    PostMessageW(hwnd_, WM_NULL, 0, 0);
  });
  PumpUntil([&] { return GetChannelState() == ChannelState::kRunning || finished_; }, kStartWait);
  if (GetChannelState() != ChannelState::kRunning) {
    const auto program = DataControlArguments(DataControlCommandLine(g_szExecProgPath, g_nProductId));
    Stop();  // a constructor that throws gets no destructor
    Fail("cannot start the data-control process " + program[0]);
  }
  pid_ = DataControlProcessId();
}

ChannelSession::~ChannelSession() { Stop(); }

void ChannelSession::Stop() {
  using namespace navmisc::datactrl;
  if (!thread_.joinable()) return;
  g_bExit = true;
  PumpUntil([&] { return finished_.load(); }, kStopWait);
  thread_.join();
  if (DataControlProcessId() != 0) {
    std::fprintf(stderr, "navmisc: the data-control process did not end in time; stopped it\n");
    EndKeptDataControlProcess();
  }
}

}  // namespace navmisc::cli
