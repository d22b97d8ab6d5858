// `navmisc channel status`: the data-control channel as an application runs it. Starts the
// command thread (which starts GpsDataControl.exe), asks for the logger's and the web service's
// connection state, prints the replies and ends the channel.
#include <chrono>
#include <cstdio>
#include <map>

#include <CLI/CLI.hpp>

#include "channel_session.h"
#include "cli.h"
#include "navmisc/datactrl/device_commands.h"
#include "navmisc/datactrl/net_commands.h"
#include "navmisc/datactrl/reply_dialog.h"
#include "navmisc/datactrl/request_queue.h"
#include "navmisc/records/user_profile.h"
#include "terminal_view.h"

namespace navmisc::cli {
namespace {

using namespace navmisc::datactrl;

// How long the command waits for the process to start and for its replies.
constexpr auto kReplyWait = std::chrono::seconds(10);

const char* SourceName(int32_t source) {
  return source == DC_SOURCE_DEVICE ? "device" : source == DC_SOURCE_NET ? "web service" : "source";
}

const char* KindName(int32_t kind) {
  switch (kind) {
    case DC_CMD_DEVICE: return "device";
    case DC_CMD_NET: return "web service";
    case DC_CMD_FILE: return "file";
    case DC_CMD_CONNECTION_STATUS: return "connection status";
    case DC_CMD_PROGRESS: return "progress";
    default: return "unknown";
  }
}

// The window that gets the channel's replies: keeps the last connection state of each source
// and, when asked to, prints every block.
class StatusWindow : public CDataCtrlReplyDlg {
 public:
  StatusWindow(TerminalDialogView& view, CString language, bool verbose)
      : CDataCtrlReplyDlg(view, std::move(language)), verbose_(verbose) {}

  LRESULT WindowProc(UINT message, WPARAM wParam, LPARAM lParam) override {
    if (message == WM_DATACTRL_RECEIVE && verbose_) Print(*reinterpret_cast<CDataControlCmdBlk*>(lParam));
    return CDataCtrlReplyDlg::WindowProc(message, wParam, lParam);
  }
  long ProcessConnectionStatus(CDataControlCmdBlk* block) override {
    const auto& status = *static_cast<CDataControlConnectionStatus*>(block);
    ++count_[status.nSource];
    last_[status.nSource] = status;
    return CDataCtrlReplyDlg::ProcessConnectionStatus(block);
  }

  int Count(int32_t source) const {
    const auto it = count_.find(source);
    return it == count_.end() ? 0 : it->second;
  }
  const CDataControlConnectionStatus& Last(int32_t source) { return last_[source]; }

 private:
  static void Print(const CDataControlCmdBlk& b) {
    std::printf("block: kind %d (%s), device id \"%s\", error %d", b.nCmdType, KindName(b.nCmdType),
                CString(b.szDeviceId).ToUtf8().c_str(), b.nLastError);
    switch (b.nCmdType) {
      case DC_CMD_CONNECTION_STATUS: {
        const auto& s = static_cast<const CDataControlConnectionStatus&>(b);
        std::printf(", source %d, connected %d", s.nSource, s.bConnected);
        break;
      }
      case DC_CMD_PROGRESS: {
        const auto& p = static_cast<const CDataControlProgressCmdBlk&>(b);
        std::printf(", source %d, %d of %d, stored %d of %d", p.nSource, p.nProcessed,
                    p.nTotalOfProcess, p.nDatabaseProcessed, p.nTotalOfDatabaseProcess);
        break;
      }
      case DC_CMD_DEVICE:
        std::printf(", command %d", static_cast<const CDataControlCmdBlkKVDevice&>(b).nDeviceCmd);
        break;
      case DC_CMD_NET:
        std::printf(", command %d", static_cast<const CDataControlCmdBlkNet&>(b).nNetCmd);
        break;
      case DC_CMD_FILE:
        std::printf(", command %d", static_cast<const CDataControlCmdBlkFile&>(b).nFileCmd);
        break;
    }
    std::printf("\n");
    std::fflush(stdout);
  }

  bool verbose_;
  std::map<int32_t, int> count_;
  std::map<int32_t, CDataControlConnectionStatus> last_;
};

void ChannelStatus(bool verbose) {
  TerminalDialogView view;
  StatusWindow window(view, GetUserMapInfo(GPS_APP_TRIP)->localize, verbose);
  ChannelSession channel(window);
  // The process announces both states when it starts; the replies to these questions follow.
  DC_KVDEVICE_QueryDeviceStatus();
  DC_NET_QueryNetStatus();
  const bool answered = PumpUntil(
      [&] { return window.Count(DC_SOURCE_DEVICE) >= 2 && window.Count(DC_SOURCE_NET) >= 2; }, kReplyWait);
  for (int32_t source : {DC_SOURCE_DEVICE, DC_SOURCE_NET}) {
    if (window.Count(source) == 0) continue;
    const CDataControlConnectionStatus& s = window.Last(source);
    std::printf("%-16s %s", (std::string(SourceName(source)) + ":").c_str(),
                s.bConnected ? "connected" : "not connected");
    if (s.nLastError) std::printf(" (error %d)", s.nLastError);
    std::printf("\n");
  }
  if (!answered) Fail("no answer from the data-control process");
}

}  // namespace

void AddChannelCommand(CLI::App& app) {
  CLI::App* channel = app.add_subcommand("channel", "the channel to the data-control process");
  channel->require_subcommand(1);
  channel->footer("Commands: status. Global options: --data-root DIR (see navmisc --help)");
  auto verbose = std::make_shared<bool>(false);
  CLI::App* status = AddCommand(
      *channel, "status", "start the data-control process and show the logger's and web service's state",
      "Starts the data-control channel as an application does (the command thread and\n"
      "GpsDataControl.exe beside this program), asks whether the logger and the web service can be\n"
      "reached, prints the answers and ends the channel. The process reads its settings from\n"
      "GpsDataControl.ini in the data root.",
      [verbose] { ChannelStatus(*verbose); });
  status->add_flag("--verbose,-v", *verbose, "print every block the channel delivers");
}

}  // namespace navmisc::cli
