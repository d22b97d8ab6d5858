// Device commands (kind 1). The logger work plugs in here: give a command its function and
// call it from RunDeviceCommand (or RunKV11Command for the KV-11 family's settings); the reply
// is the request's block as the function leaves it, with the code it returns in nLastError.
#include "handlers.h"
#include "navmisc/datactrl/dc_errors.h"
#include "navmisc/platform/files.h"

namespace gpsdc {
namespace {

int32_t RunDeviceCommand(CDataControlCmdBlkKVDevice& block, RequestContext& /*ctx*/) {
  switch (block.nDeviceCmd) {
    case DC_DEVICE_READ_LOG:
    case DC_DEVICE_CLEAR_LOG:
    case DC_DEVICE_READ_SETTING:
    case DC_DEVICE_WRITE_SETTING:
    case DC_DEVICE_RESET:
    case DC_DEVICE_CANCEL_READ:
      return DC_ERR_NOT_AVAILABLE;
    default:
      return DC_ERR_UNKNOWN_COMMAND;
  }
}

int32_t RunKV11Command(CDataControlCmdBlkKVDevice11& block, RequestContext& /*ctx*/) {
  switch (block.nDeviceCmd) {
    case DC_DEVICE_READ_SETTING:
    case DC_DEVICE_WRITE_SETTING:
    case DC_DEVICE_WRITE_NAVI:
      return DC_ERR_NOT_AVAILABLE;
    default:
      return DC_ERR_UNKNOWN_COMMAND;
  }
}

}  // namespace

bool DeviceConnected(const Config& config) {
  return !config.devicePath.IsEmpty() && FileExists(config.devicePath);
}

void RegisterDeviceHandlers(HandlerTable& table) {
  table.Set(DC_CMD_DEVICE, [](RequestContext& ctx) {
    // The KV-11 family's settings travel in their own form; both sides decide it the same way.
    CDataControlCmdBlkKVDevice device{};
    navmisc::datactrl::UnpackBlock(ctx.request, device);
    if (navmisc::datactrl::UsesKV11Block(device.nDeviceCmd)) {
      CDataControlCmdBlkKVDevice11 kv11;
      InitKV11BlockDefaults(kv11);
      AnswerInPlace(ctx, kv11, RunKV11Command);
    } else {
      AnswerInPlace(ctx, device, RunDeviceCommand);
    }
  });
}

}  // namespace gpsdc
