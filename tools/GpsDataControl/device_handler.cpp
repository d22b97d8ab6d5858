// Device commands (kind 1): handed to the device service of the product the process serves
// (tracer.cpp for the logger, dongle.cpp for the where-am-I receiver).
#include "device_service.h"
#include "logger_folder.h"
#include "navmisc/datactrl/dc_errors.h"

namespace gpsdc {
namespace {

int32_t NotAvailable(CDataControlCmdBlkKVDevice&, RequestContext&) { return DC_ERR_NOT_AVAILABLE; }

}  // namespace

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
    AnswerInPlace(ctx, device, NotAvailable);
  });
}

}  // namespace gpsdc
