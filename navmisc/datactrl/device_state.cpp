#include "navmisc/datactrl/device_state.h"

#include "navmisc/datactrl/detail/device_state_block.h"

#include <atomic>
#include <cstring>

namespace navmisc::detail {

static_assert(std::is_trivially_copyable_v<DeviceStateBlock>);

// Everything starts zeroed, both configurations included: a configuration means something only
// once it has been read from a logger.
PerRootBlock& DeviceState() {
  static PerRootBlock block(kDeviceStateType, {});
  return block;
}

}  // namespace navmisc::detail

// Each name refers to its field of the block, whose address never changes (see
// shared_globals.cpp).
using navmisc::detail::DeviceStateData;
char (&g_szGSMVersion)[32] = DeviceStateData().szGSMVersion;
char (&g_szDeviceId)[32] = DeviceStateData().szDeviceId;
s_gps_info& g_gps_info = DeviceStateData().gps_info;
CDataControlCmdBlkKVDevice11& g_devConfig11 = DeviceStateData().devConfig11;
CDataControlCmdBlkKVDevice& g_devConfig = DeviceStateData().devConfig;
bool& g_bDeviceConnected = DeviceStateData().bDeviceConnected;
bool& g_bNetConnected = DeviceStateData().bNetConnected;
double& g_dDeviceVersion = DeviceStateData().dDeviceVersion;
uint16_t& g_wDeviceModelID = DeviceStateData().wDeviceModelID;
uint16_t& g_wLastDeviceError = DeviceStateData().wLastDeviceError;
int32_t& g_wDeviceSerialID = DeviceStateData().wDeviceSerialID;
int32_t& g_nDeviceTimeZone = DeviceStateData().nDeviceTimeZone;
bool& g_bRTCWorking = DeviceStateData().bRTCWorking;
bool& g_bPwdChecked = DeviceStateData().bPwdChecked;
int32_t& g_nCountOfProgress = DeviceStateData().nCountOfProgress;
int32_t& g_nCurrentOfProgress = DeviceStateData().nCurrentOfProgress;
bool& g_bClearLog = DeviceStateData().bClearLog;
int32_t& g_lTotolMemory = DeviceStateData().lTotolMemory;
int32_t& g_lUsedMemory = DeviceStateData().lUsedMemory;
int32_t& g_nScanProgress = DeviceStateData().nScanProgress;

namespace navmisc::datactrl {

void PublishGpsInfo(const s_gps_info& info) {
  std::atomic_ref<int32_t> time(g_gps_info.tTime);
  time.store(0, std::memory_order_relaxed);
  std::atomic_thread_fence(std::memory_order_release);
  s_gps_info body = info;
  body.tTime = 0;
  std::memcpy(static_cast<void*>(&g_gps_info), &body, sizeof body);
  time.store(info.tTime, std::memory_order_release);
}

bool ReadGpsInfo(s_gps_info& out) {
  std::atomic_ref<int32_t> time(g_gps_info.tTime);
  for (int attempt = 0; attempt < 100; ++attempt) {
    const int32_t before = time.load(std::memory_order_acquire);
    if (before == 0) continue;
    s_gps_info copy;
    std::memcpy(&copy, static_cast<const void*>(&g_gps_info), sizeof copy);
    std::atomic_thread_fence(std::memory_order_acquire);
    if (time.load(std::memory_order_relaxed) != before) continue;
    copy.tTime = before;
    out = copy;
    return true;
  }
  return false;
}

}  // namespace navmisc::datactrl
