// The data-control channel for one command, run as an application runs it: the command thread
// with the command's window as its owner, which starts GpsDataControl.exe beside this program.
#pragma once

#include <atomic>
#include <chrono>
#include <functional>
#include <thread>

#include "navmisc/platform/window.h"

namespace navmisc::cli {

// Handles the calling thread's window messages (the channel's replies) until `done` holds or
// `wait` has passed; true when it held.
bool PumpUntil(const std::function<bool()>& done, std::chrono::steady_clock::duration wait);

class ChannelSession {
 public:
  // Starts the channel with `owner` (a window of the calling thread) and waits until the
  // data-control process runs; fails the command (Fail) when it cannot be started.
  explicit ChannelSession(CWnd& owner);
  // Ends the channel however the command ends: the exit block, the wait for the process, the
  // queues removed; a process that did not end in time is stopped.
  ~ChannelSession();
  ChannelSession(const ChannelSession&) = delete;
  ChannelSession& operator=(const ChannelSession&) = delete;

  // The data-control process's id when the channel started it. The command thread starts a
  // new process when this one dies, so a different DataControlProcessId() means the process
  // was lost (with whatever it was working on).
  int processId() const { return pid_; }
  // Whether the command thread has ended (the process is gone for good).
  bool ended() const { return finished_; }

 private:
  void Stop();

  HWND hwnd_;
  std::atomic<bool> finished_{false};
  std::thread thread_;
  int pid_ = 0;
};

}  // namespace navmisc::cli
