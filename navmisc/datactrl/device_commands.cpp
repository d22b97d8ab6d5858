#include "navmisc/datactrl/device_commands.h"

#include "navmisc/datactrl/cmd_blocks.h"
#include "navmisc/datactrl/request_queue.h"

void DC_KVDEVICE_QueryDeviceStatus() {
  CDataControlConnectionStatus status{};
  status.nCmdType = DC_CMD_CONNECTION_STATUS;
  status.nSource = DC_SOURCE_DEVICE;
  InsertRequestMessage(status);
}

void DC_KVDEVICE_ClearLogData() {
  CDataControlCmdBlkKVDevice block;
  InitDeviceBlockDefaults(block);
  block.nDeviceCmd = DC_DEVICE_CLEAR_LOG;
  InsertRequestMessage(block);
}
