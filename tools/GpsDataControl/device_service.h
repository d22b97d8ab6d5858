// The device side of the data-control process: the logger of "/Tracer" (a folder, see
// logger_folder.h) or the live receiver of "/Dongle" (through gpsd). A service lives while the
// server serves; it keeps the shared device globals in step with the device and announces
// changes of the connection on its own.
#pragma once

#include <functional>
#include <memory>

#include "handlers.h"

namespace gpsdc {

class DeviceService {
 public:
  virtual ~DeviceService() = default;
  // Whether the device is connected now; brings the shared device globals up to date.
  virtual bool Connected() = 0;
  // Handles a device request (kind 1) and replies. A read of the log asks
  // ctx.stopRequested() between points: CancelRead (or the exit block) stops it.
  virtual void Handle(RequestContext& ctx) = 0;
};

std::unique_ptr<DeviceService> MakeTracerService(ReplyChannel& replies, const Config& config);
std::unique_ptr<DeviceService> MakeDongleService(ReplyChannel& replies, const Config& config);

// The service of the running server; null while none runs.
DeviceService* RunningDeviceService();

// Sets g_bDeviceConnected with the globals that describe the device (written by `describe`) in
// the order another process may read them without a lock: a connected device is described
// before it shows as connected, a lost one stops showing as connected before its description
// is cleared.
void PublishDeviceConnection(bool connected, const std::function<void()>& describe);

// A connection-status reply for the device source.
CDataControlConnectionStatus DeviceStatusBlock(bool connected, const wchar_t* deviceId);

}  // namespace gpsdc
