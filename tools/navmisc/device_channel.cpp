#include "device_channel.h"

#include <stdlib.h>

#include <chrono>

#include "cli.h"
#include "navmisc/datactrl/block_codec.h"
#include "navmisc/datactrl/device_commands.h"
#include "navmisc/datactrl/device_errors.h"
#include "navmisc/datactrl/request_queue.h"
#include "navmisc/import/import_errors.h"
#include "navmisc/platform/console.h"
#include "navmisc/platform/shared_globals.h"

namespace navmisc::cli {
namespace {

constexpr unsigned kStartMs = 15000;

}  // namespace

LRESULT DeviceChannel::Window::WindowProc(UINT message, WPARAM wParam, LPARAM lParam) {
  if (message != WM_DATACTRL_RECEIVE) return 0;
  channel_.Take(*reinterpret_cast<const CDataControlCmdBlk*>(lParam));
  if (channel_.listener_) channel_.listener_->WindowProc(message, wParam, lParam);
  return 0;
}

void DeviceChannel::Take(const CDataControlCmdBlk& block) {
  switch (block.nCmdType) {
    case DC_CMD_CONNECTION_STATUS: {
      const auto& status = static_cast<const CDataControlConnectionStatus&>(block);
      if (status.nSource != DC_SOURCE_DEVICE) return;
      connected_ = status.bConnected;
      ++statuses_;
      return;
    }
    case DC_CMD_PROGRESS: {
      const auto& progress = static_cast<const CDataControlProgressCmdBlk&>(block);
      if (progress.nSource != DC_SOURCE_DEVICE) return;
      total_ = progress.nTotalOfProcess;
      done_ = progress.nProcessed;
      return;
    }
    case DC_CMD_DEVICE: {
      const auto& device = static_cast<const CDataControlCmdBlkKVDevice&>(block);
      if (replied_ || device.nDeviceCmd != waitingFor_) return;
      replied_ = true;
      lastError_ = device.nLastError;
      if (datactrl::UsesKV11Block(device.nDeviceCmd)) {
        *kv11_ = static_cast<const CDataControlCmdBlkKVDevice11&>(block);
      } else {
        device_ = device;
      }
      return;
    }
    default:
      return;
  }
}

DeviceChannel::DeviceChannel(GPS_APP_PROG_TYPE product, const std::string& logger)
    : previousProduct_(g_nProductId), kv11_(std::make_unique<CDataControlCmdBlkKVDevice11>()) {
  if (!logger.empty()) ::setenv("NAVMISC_LOGGER", logger.c_str(), 1);
  g_nProductId = product;
  session_.emplace(window_);
  // The process announces the device's state as soon as it serves.
  if (!WaitFor([this] { return statuses_ > 0 || ended(); }, kStartMs) || ended())
    Fail("the data-control process did not start (is GpsDataControl.exe beside navmisc?)");
}

DeviceChannel::~DeviceChannel() {
  session_.reset();
  g_nProductId = previousProduct_;
}

bool DeviceChannel::QueryStatus() {
  const int before = statuses_;
  DC_KVDEVICE_QueryDeviceStatus();
  if (!WaitFor([&] { return statuses_ > before; }, kStartMs))
    Fail("the data-control process does not answer");
  return connected_;
}

bool DeviceChannel::WaitFor(const std::function<bool()>& done, unsigned ms, bool* interrupted) {
  std::optional<InterruptWatch> watch;
  if (interrupted) watch.emplace();
  const auto end = std::chrono::steady_clock::now() + std::chrono::milliseconds(ms);
  while (!done()) {
    if (std::chrono::steady_clock::now() >= end) return false;
    if (watch && watch->Interrupted()) {
      *interrupted = true;
      return false;
    }
    // The command thread posts nothing when it ends; look again every few milliseconds.
    PumpMessagesUntil(done, 50);
  }
  return true;
}

void DeviceChannel::Request(int32_t deviceCmd, const std::function<void()>& send) {
  waitingFor_ = deviceCmd;
  replied_ = false;
  send();
}

bool DeviceChannel::WaitDeviceReply(unsigned ms, bool* interrupted) {
  if (!WaitFor([&] { return replied_ || ended(); }, ms, interrupted)) {
    if (interrupted && *interrupted) return false;
    Fail("the data-control process did not answer in time");
  }
  if (!replied_) Fail("the data-control process ended");
  return true;
}

std::string DeviceErrorMessage(int32_t code) {
  std::string text = datactrl::DeviceErrorText(code);
  if (text.empty()) text = import::ImportErrorText(code);
  if (text.empty()) text = "error";
  return text + " (" + std::to_string(code) + ")";
}

}  // namespace navmisc::cli
