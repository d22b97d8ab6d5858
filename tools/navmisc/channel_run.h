// The data-control channel for one command of the tool, run as an application runs it: the
// command thread with a window of this thread as its owner, and GpsDataControl.exe behind it.
#pragma once

#include <atomic>
#include <chrono>
#include <functional>
#include <thread>

#include "navmisc/platform/window.h"

namespace navmisc::cli {

// Handles this thread's messages (the channel's replies among them) until `done` holds or
// `wait` has passed; true when `done` held.
bool PumpUntil(const std::function<bool()>& done, std::chrono::milliseconds wait);

class ChannelRun {
 public:
  // Starts the command thread and waits until the channel runs; fails the command (Fail) when
  // the data-control process cannot be started.
  explicit ChannelRun(CWnd& owner);
  // Stops the channel and joins the thread, whatever happened; a process that did not end in
  // time is ended.
  ~ChannelRun();
  ChannelRun(const ChannelRun&) = delete;
  ChannelRun& operator=(const ChannelRun&) = delete;

  // The command thread has ended (the channel gave up on its process).
  bool finished() const { return finished_; }

 private:
  void Stop();

  std::atomic<bool> finished_{false};
  std::thread thread_;
};

}  // namespace navmisc::cli
