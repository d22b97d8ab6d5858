// Device commands (kind 1): handed to the device service of the product the process serves
// (tracer.cpp for the logger, dongle.cpp for the where-am-I receiver).
#include "device_service.h"
#include "logger_folder.h"
#include "navmisc/datactrl/dc_errors.h"

namespace gpsdc {

bool DeviceConnected(const Config& config) {
  if (DeviceService* service = RunningDeviceService()) return service->Connected();
  LoggerFolder logger;
  return logger.Open(FindLogger(config));
}

void RegisterDeviceHandlers(HandlerTable& table) {
  table.Set(DC_CMD_DEVICE, [](RequestContext& ctx) {
    if (DeviceService* service = RunningDeviceService()) {
      service->Handle(ctx);
      return;
    }
    CDataControlCmdBlkKVDevice device{};
    navmisc::datactrl::UnpackBlock(ctx.request, device);
    device.nLastError = DC_ERR_NOT_AVAILABLE;
    ctx.replies.Send(device);
  });
}

}  // namespace gpsdc
