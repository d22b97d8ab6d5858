// The block behind the g_* names of device_state.h (see docs/shared-state.md). Private to the
// library: code outside uses the g_* names.
#pragma once

#include "navmisc/datactrl/device_state.h"
#include "navmisc/platform/per_root_block.h"

namespace navmisc::detail {

struct DeviceStateBlock {
  SharedBlockHeader header;
  char szGSMVersion[32];
  char szDeviceId[32];
  s_gps_info gps_info;
  CDataControlCmdBlkKVDevice11 devConfig11;
  CDataControlCmdBlkKVDevice devConfig;
  bool bDeviceConnected;
  bool bNetConnected;
  double dDeviceVersion;
  uint16_t wDeviceModelID;
  uint16_t wLastDeviceError;
  int32_t wDeviceSerialID;
  int32_t nDeviceTimeZone;
  bool bRTCWorking;
  bool bPwdChecked;
  int32_t nCountOfProgress;
  int32_t nCurrentOfProgress;
  bool bClearLog;
  int32_t lTotolMemory;
  int32_t lUsedMemory;
  int32_t nScanProgress;
};

// "NMSD" read as a little-endian word. Raise the version with every change of the layout or of
// a block type it holds.
inline constexpr SharedBlockType kDeviceStateType = {"device", 0x44534D4E, 1,
                                                     sizeof(DeviceStateBlock)};

PerRootBlock& DeviceState();
inline DeviceStateBlock& DeviceStateData() {
  return *static_cast<DeviceStateBlock*>(DeviceState().data());
}

}  // namespace navmisc::detail
