// The state of the logger and of the running device operation, shared by every process of one
// user working on one data root: the applications and the data-control process see the same
// connection state, configuration and progress at once (see docs/shared-state.md). Each name
// below is a reference to a field of a shared block; each value is written whole and read
// without locks.
#pragma once

#include <cstdint>

#include "navmisc/datactrl/cmd_blocks.h"

// Last position information of the logger.
struct s_gps_info {
  int32_t nFixQuality;  // 0 = no fix
  int32_t nSatellites;
  double dLatitude;     // degrees, north positive
  double dLongitude;    // degrees, east positive
  double dAltitude;     // metres
  int32_t nSpeed;       // metres per hour
  int32_t nCourse;      // whole degrees, -1 unknown
  int32_t tTime;        // seconds since 1970
};

extern char (&g_szGSMVersion)[32];
extern char (&g_szDeviceId)[32];
extern s_gps_info& g_gps_info;
extern CDataControlCmdBlkKVDevice11& g_devConfig11;
extern CDataControlCmdBlkKVDevice& g_devConfig;
extern bool& g_bDeviceConnected;
extern bool& g_bNetConnected;
extern double& g_dDeviceVersion;
extern uint16_t& g_wDeviceModelID;
extern uint16_t& g_wLastDeviceError;
extern int32_t& g_wDeviceSerialID;
extern int32_t& g_nDeviceTimeZone;
extern bool& g_bRTCWorking;
extern bool& g_bPwdChecked;
extern int32_t& g_nCountOfProgress;
extern int32_t& g_nCurrentOfProgress;
extern bool& g_bClearLog;
extern int32_t& g_lTotolMemory;
extern int32_t& g_lUsedMemory;
extern int32_t& g_nScanProgress;

namespace navmisc::datactrl {

// g_gps_info as one value. The writer marks the time 0 while it changes the other fields, so a
// reader that finds the same non-zero time before and after its copy holds one position whole
// (readers that look at the fields directly may see a mix of two positions, or time 0 for a
// moment).
void PublishGpsInfo(const s_gps_info& info);
// False when there is no position (time 0) or it kept changing while it was copied.
bool ReadGpsInfo(s_gps_info& out);

}  // namespace navmisc::datactrl
