// The data-control channel as the command-line tool uses it: the command thread runs with a
// window of the calling thread, the real GpsDataControl.exe answers, and the caller waits for
// replies while that thread handles its messages.
#pragma once

#include <atomic>
#include <chrono>
#include <functional>
#include <memory>
#include <optional>
#include <string>

#include "channel_session.h"

#include "navmisc/datactrl/cmd_blocks.h"
#include "navmisc/platform/types.h"
#include "navmisc/platform/window.h"

namespace navmisc::cli {

class DeviceChannel {
 public:
  // Starts the channel for `product` (its "/Tracer" or "/Dongle" process) on the chosen data
  // root and waits for the process's first word on the device. Fails when it does not start.
  // `logger`, when given, names the logger folder for the process (NAVMISC_LOGGER).
  explicit DeviceChannel(GPS_APP_PROG_TYPE product, const std::string& logger = {});
  // Stops the channel and puts the product type back.
  ~DeviceChannel();
  DeviceChannel(const DeviceChannel&) = delete;
  DeviceChannel& operator=(const DeviceChannel&) = delete;

  // The device's connection state as the process last reported it.
  bool connected() const { return connected_; }
  // Asks the process for the device state and waits for the answer; the connection state.
  bool QueryStatus();

  // Handles this thread's messages until `done` holds (true) or `ms` pass (false). Ctrl-C ends
  // the wait early when `interrupted` is given, setting it.
  bool WaitFor(const std::function<bool()>& done, unsigned ms, bool* interrupted = nullptr);

  // Sends a device request through `send` (a DC_KVDEVICE_* call) and makes WaitDeviceReply wait
  // for the reply to `deviceCmd`.
  void Request(int32_t deviceCmd, const std::function<void()>& send);
  // Waits for that reply; fails after `ms`. False only when Ctrl-C came first (`interrupted`
  // set). KV-11 replies come as kv11Reply(), the others as deviceReply().
  bool WaitDeviceReply(unsigned ms = 60000, bool* interrupted = nullptr);
  const CDataControlCmdBlkKVDevice& deviceReply() const { return device_; }
  const CDataControlCmdBlkKVDevice11& kv11Reply() const { return *kv11_; }
  int32_t lastError() const { return lastError_; }
  // Whether the awaited reply has come; whether the command thread has ended.
  bool replied() const { return replied_; }
  bool ended() const { return session_ && session_->ended(); }

  // Progress of the running device operation (source 1), from its progress blocks.
  int32_t progressTotal() const { return total_; }
  int32_t progressDone() const { return done_; }

  // Every reply is also handed to `listener` (a dialog of the library, say) while it is set.
  void SetListener(CWnd* listener) { listener_ = listener; }

 private:
  class Window : public CWnd {
   public:
    explicit Window(DeviceChannel& channel) : channel_(channel) {}
    LRESULT WindowProc(UINT message, WPARAM wParam, LPARAM lParam) override;

   private:
    DeviceChannel& channel_;
  };
  void Take(const CDataControlCmdBlk& block);

  GPS_APP_PROG_TYPE previousProduct_;
  Window window_{*this};
  std::optional<ChannelSession> session_;
  CWnd* listener_ = nullptr;
  bool connected_ = false;
  int statuses_ = 0;
  int32_t waitingFor_ = 0;
  bool replied_ = false;
  int32_t lastError_ = 0;
  CDataControlCmdBlkKVDevice device_{};
  std::unique_ptr<CDataControlCmdBlkKVDevice11> kv11_;
  std::atomic<int32_t> total_{0};
  std::atomic<int32_t> done_{0};
};

// The English text of a device reply's error code.
std::string DeviceErrorMessage(int32_t code);

}  // namespace navmisc::cli
