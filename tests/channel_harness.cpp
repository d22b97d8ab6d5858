#include "channel_harness.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <signal.h>
#include <stdlib.h>
#include <sys/socket.h>
#include <unistd.h>

#include "navmisc/datactrl/block_codec.h"
#include "navmisc/datactrl/device_state.h"
#include "navmisc/datactrl/request_queue.h"
#include "navmisc/platform/data_root.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/format.h"
#include "navmisc/platform/shared_globals.h"

namespace navmisc::testutil {

LRESULT ReplyLog::WindowProc(UINT message, WPARAM, LPARAM lParam) {
  if (message != WM_DATACTRL_RECEIVE) return 0;
  const auto& block = *reinterpret_cast<const CDataControlCmdBlk*>(lParam);
  switch (block.nCmdType) {
    case DC_CMD_DEVICE: {
      const auto& device = static_cast<const CDataControlCmdBlkKVDevice&>(block);
      if (datactrl::UsesKV11Block(device.nDeviceCmd))
        kv11.push_back(static_cast<const CDataControlCmdBlkKVDevice11&>(block));
      else
        devices.push_back(device);
      break;
    }
    case DC_CMD_CONNECTION_STATUS:
      statuses.push_back(static_cast<const CDataControlConnectionStatus&>(block));
      break;
    case DC_CMD_PROGRESS:
      progress.push_back(static_cast<const CDataControlProgressCmdBlk&>(block));
      break;
    default:
      break;
  }
  if (onReply) onReply(block);
  return 0;
}

std::vector<CDataControlCmdBlkKVDevice> ReplyLog::Devices(int32_t deviceCmd) const {
  std::vector<CDataControlCmdBlkKVDevice> out;
  for (const auto& d : devices)
    if (d.nDeviceCmd == deviceCmd) out.push_back(d);
  return out;
}

bool Until(const std::function<bool()>& done, int ms) {
  const auto end = std::chrono::steady_clock::now() + std::chrono::milliseconds(ms);
  while (!done()) {
    if (std::chrono::steady_clock::now() >= end) return false;
    PumpMessagesUntil(done, 10);
  }
  return true;
}

ChannelRun::ChannelRun(GPS_APP_PROG_TYPE product) : previousProg_(g_szExecProgPath) {
  ::unsetenv("NAVMISC_LOGGER");
  UseDataRoot(root_.path());
  SetSharedText(g_szExecProgPath, CString::FromUtf8(NAVMISC_TOOLS_DIR));
  g_nProductId = product;
  g_bClearLog = false;
}

ChannelRun::~ChannelRun() {
  Stop();
  datactrl::EndKeptDataControlProcess();
  RemovePerRootObjects(root_.path());
  SetSharedText(g_szExecProgPath, previousProg_);
}

void ChannelRun::Configure(const std::string& ini) {
  WriteFileBytes(PathJoin(root_.path(), L"GpsDataControl.ini"), ini);
}

void ChannelRun::Start(CWnd* owner) {
  g_bExit = false;
  finished_ = false;
  CWnd* window = owner ? owner : &log_;
  const HWND hwnd = window->GetSafeHwnd();
  thread_ = std::thread([this, window, hwnd] {
    ProcessCommand(window);
    finished_ = true;
    PostMessageW(hwnd, WM_NULL, 0, 0);
  });
  Until([] { return datactrl::GetChannelState() == datactrl::ChannelState::kRunning; }, 10000);
}

void ChannelRun::Stop() {
  if (!thread_.joinable()) return;
  g_bExit = true;
  Until([this] { return finished_.load(); }, 60000);
  thread_.join();
}

std::string SyntheticGpx(long start, int points) {
  std::string gpx =
      "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
      "<gpx version=\"1.1\" creator=\"navmisc tests\" xmlns=\"http://www.topografix.com/GPX/1/1\">\n"
      "<trk><name>log</name><trkseg>\n";
  for (int i = 0; i < points; ++i) {
    int y, mo, d, h, mi, s;
    GetDateTimeInfo(start + i, y, mo, d, h, mi, s);
    gpx += FormatA("<trkpt lat=\"%.7f\" lon=\"%.7f\"><ele>%.1f</ele>"
                   "<time>%04d-%02d-%02dT%02d:%02d:%02dZ</time></trkpt>\n",
                   47.0 + i * 1e-5, 8.0 + i * 1e-5, 400.0 + (i % 50), y, mo, d, h, mi, s);
  }
  gpx += "</trkseg></trk>\n</gpx>\n";
  return gpx;
}

int FreePort() {
  const int fd = ::socket(AF_INET, SOCK_STREAM, 0);
  sockaddr_in addr{};
  addr.sin_family = AF_INET;
  addr.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  socklen_t len = sizeof addr;
  ::bind(fd, reinterpret_cast<sockaddr*>(&addr), sizeof addr);
  ::getsockname(fd, reinterpret_cast<sockaddr*>(&addr), &len);
  ::close(fd);
  return ntohs(addr.sin_port);
}

bool GpsFake::Start(int port, const std::string& log) {
  SpawnOptions quiet;
  quiet.nullStdin = quiet.nullStdout = quiet.nullStderr = true;
  // setsid makes gpsfake the leader of a process group that its gpsd joins.
  return process_.Start({"/usr/bin/setsid", "gpsfake", "-q", "-1", "-c", "0.05", "-P",
                         std::to_string(port), log},
                        quiet);
}

void GpsFake::Stop() {
  if (!process_.IsRunning()) return;
  ::kill(-process_.pid(), SIGTERM);
  if (!process_.WaitFor(5000)) ::kill(-process_.pid(), SIGKILL);
  process_.Kill();
}

void MakeLogger(const CString& dir, int model, int serial, const std::string& extra) {
  MakeDir(PathJoin(dir, L"LOG"));
  WriteFileBytes(PathJoin(dir, L"GPSLOGGER.INI"),
                 FormatA("[LOGGER]\nModel=%d\nSerial=%d\nFirmware=7.02\nTotalMemory=16384\n", model,
                         serial) +
                     extra);
}

}  // namespace navmisc::testutil
