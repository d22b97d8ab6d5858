// The data-control channel for tests: the command thread on a fresh data root with the real
// GpsDataControl.exe, and a window that keeps every reply.
#pragma once

#include <atomic>
#include <chrono>
#include <functional>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "navmisc/datactrl/cmd_blocks.h"
#include "navmisc/platform/cstring.h"
#include "navmisc/platform/process.h"
#include "navmisc/platform/types.h"
#include "navmisc/platform/window.h"
#include "testutil.h"

namespace navmisc::testutil {

// An owner window that keeps a copy of every reply (KV-11 replies by the model code the command
// thread unpacked them for).
class ReplyLog : public CWnd {
 public:
  LRESULT WindowProc(UINT message, WPARAM wParam, LPARAM lParam) override;
  // Called for every reply after it is kept (tests that act on a reply).
  std::function<void(const CDataControlCmdBlk&)> onReply;

  // The device replies to `deviceCmd`, in order.
  std::vector<CDataControlCmdBlkKVDevice> Devices(int32_t deviceCmd) const;
  std::vector<CDataControlConnectionStatus> statuses;
  std::vector<CDataControlProgressCmdBlk> progress;
  std::vector<CDataControlCmdBlkKVDevice> devices;
  std::vector<CDataControlCmdBlkKVDevice11> kv11;
};

class ChannelRun {
 public:
  // A fresh data root, chosen for this process, with `product` as the suite's product and the
  // tools folder of the build as the program folder.
  explicit ChannelRun(GPS_APP_PROG_TYPE product = GPS_APP_TRIP);
  // Stops the channel and removes the data root's shared objects.
  ~ChannelRun();
  ChannelRun(const ChannelRun&) = delete;
  ChannelRun& operator=(const ChannelRun&) = delete;

  const CString& root() const { return root_.path(); }
  // root()/name
  CString Path(const wchar_t* name) const { return root_ / name; }
  // Writes "GpsDataControl.ini" of the data root.
  void Configure(const std::string& ini);
  // Starts the command thread with `owner` (default: log()) and waits until it runs.
  void Start(CWnd* owner = nullptr);
  // Sets g_bExit and waits (handling messages) until the command thread has ended.
  void Stop();
  ReplyLog& log() { return log_; }
  const ReplyLog& log() const { return log_; }

 private:
  TempDir root_;
  ReplyLog log_;
  std::thread thread_;
  std::atomic<bool> finished_{false};
  CString previousProg_;
};

// Handles the calling thread's messages until `done` holds or `ms` pass; true when it held.
bool Until(const std::function<bool()>& done, int ms = 30000);

// A GPX 1.1 track of `points` points, one a second from `start`, heading north-east from
// latitude 47, longitude 8.
std::string SyntheticGpx(long start, int points);

// A TCP port of 127.0.0.1 that nobody uses now.
int FreePort();

// gpsfake (which replays an NMEA log through a gpsd of its own on `port`) in a session of its
// own, ended with that gpsd whatever happens. Needs gpsfake and setsid on PATH.
class GpsFake {
 public:
  GpsFake() = default;
  ~GpsFake() { Stop(); }
  GpsFake(const GpsFake&) = delete;
  GpsFake& operator=(const GpsFake&) = delete;
  // Replays `log` once, a sentence every 50 ms, once a client has connected.
  bool Start(int port, const std::string& log);
  // Ends gpsfake and its gpsd: politely, then for sure.
  void Stop();

 private:
  ChildProcess process_;
};

// Makes a logger folder at `dir`: the description file with `model` and `serial` (and
// `extra`, more lines of its [LOGGER] section) and the log folder.
void MakeLogger(const CString& dir, int model, int serial, const std::string& extra = {});

}  // namespace navmisc::testutil
