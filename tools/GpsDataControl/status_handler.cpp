// Connection-status queries, and progress blocks that arrive as requests.
#include <algorithm>
#include <iterator>

#include "handlers.h"
#include "navmisc/datactrl/dc_errors.h"
#include "navmisc/datactrl/device_state.h"

namespace gpsdc {

CDataControlConnectionStatus CurrentStatus(int32_t source, const Config& config) {
  CDataControlConnectionStatus status{};
  status.nCmdType = DC_CMD_CONNECTION_STATUS;
  status.nSource = source;
  switch (source) {
    case DC_SOURCE_DEVICE:
      status.bConnected = DeviceConnected(config);
      g_bDeviceConnected = status.bConnected;
      break;
    case DC_SOURCE_NET:
      status.bConnected = WebServiceConnected(config);
      g_bNetConnected = status.bConnected;
      break;
    default:
      status.nLastError = DC_ERR_UNKNOWN_COMMAND;
      break;
  }
  return status;
}

void RegisterStatusHandlers(HandlerTable& table) {
  table.Set(DC_CMD_CONNECTION_STATUS, [](RequestContext& ctx) {
    CDataControlConnectionStatus asked{};
    navmisc::datactrl::UnpackBlock(ctx.request, asked);
    CDataControlConnectionStatus status = CurrentStatus(asked.nSource, ctx.config);
    std::copy(std::begin(asked.szDeviceId), std::end(asked.szDeviceId), status.szDeviceId);
    ctx.replies.Send(status);
  });
  // Progress travels from the process only; one that comes in is sent back with an error, so
  // that no request goes unanswered.
  table.Set(DC_CMD_PROGRESS, [](RequestContext& ctx) {
    CDataControlProgressCmdBlk progress{};
    navmisc::datactrl::UnpackBlock(ctx.request, progress);
    progress.nLastError = DC_ERR_NOT_A_REQUEST;
    ctx.replies.Send(progress);
  });
}

}  // namespace gpsdc
