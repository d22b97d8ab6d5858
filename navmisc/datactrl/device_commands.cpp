#include "navmisc/datactrl/device_commands.h"

#include <memory>

#include "navmisc/datactrl/navi_points.h"
#include "navmisc/datactrl/request_queue.h"

namespace {

void SendDeviceCommand(int32_t command) {
  CDataControlCmdBlkKVDevice block;
  InitDeviceBlockDefaults(block);
  block.nDeviceCmd = command;
  InsertRequestMessage(block);
}

}  // namespace

void DC_KVDEVICE_QueryDeviceStatus() {
  CDataControlConnectionStatus status{};
  status.nCmdType = DC_CMD_CONNECTION_STATUS;
  status.nSource = DC_SOURCE_DEVICE;
  InsertRequestMessage(status);
}

void DC_KVDEVICE_ReadLogData() { SendDeviceCommand(DC_DEVICE_READ_LOG); }
void DC_KVDEVICE_ClearLogData() { SendDeviceCommand(DC_DEVICE_CLEAR_LOG); }
void DC_KVDEVICE_ReadSetting() { SendDeviceCommand(DC_DEVICE_READ_SETTING); }
void DC_KVDEVICE_Reset() { SendDeviceCommand(DC_DEVICE_RESET); }
void DC_KVDEVICE_CancelRead() { SendDeviceCommand(DC_DEVICE_CANCEL_READ); }

void DC_KVDEVICE_WriteSetting(CDataControlCmdBlkKVDevice& config) { InsertRequestMessage(config); }
void DC_KVDEVICE_WriteSetting(CDataControlCmdBlkKVDevice11& config) { InsertRequestMessage(config); }

void DC_KVDEVICE_WriteNaviData(CxPtrList& points) {
  using namespace navmisc::datactrl;
  // About 30 KB: kept off the caller's stack.
  auto block = std::make_unique<CDataControlCmdBlkKVDevice11>();
  InitKV11BlockDefaults(*block);
  block->nDeviceCmd = DC_DEVICE_WRITE_NAVI;
  const int count = points.GetCount() < kNaviMaxEntries ? points.GetCount() : kNaviMaxEntries;
  POSITION pos = points.GetHeadPosition();
  for (int i = 0; i < count; ++i) {
    const auto* point = static_cast<const NAVI_POINT_INFO*>(points.GetNext(pos));
    if (point) PackNaviEntry(*point, block->NAVI + i * kNaviEntryBytes);
  }
  block->nNaviCount = count;
  InsertRequestMessage(*block);
}
