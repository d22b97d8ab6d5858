// The state that every process of the suite shares: device connection and configuration,
// progress counters, the product type and the suite's paths. It lives in one block of per-user
// shared memory (see docs/shared-state.md); each name below is a reference to a field of that
// block, so a write through it is seen by every other process at once. Each value is written
// whole and read without locks.
#pragma once

#include <cstddef>
#include <cstdint>

#include "navmisc/datactrl/cmd_blocks.h"
#include "navmisc/platform/types.h"

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

// Version of the suite: four numbers, written as "%-d,%-d,%-d,%-d" into settings files.
struct VORLA_PC_VERSION_INFO {
  int32_t nMajor;
  int32_t nMinor;
  int32_t nBuild;
  int32_t nRevision;
};

namespace navmisc {
constexpr size_t kSharedPathChars = 4096;  // wide characters of each shared path text
constexpr size_t kSharedNameChars = 260;
}  // namespace navmisc

extern char (&g_szGSMVersion)[32];
extern char (&g_szDeviceId)[32];
extern s_gps_info& g_gps_info;
extern GPS_APP_PROG_TYPE& g_nProductId;
extern VORLA_PC_VERSION_INFO& g_sVersionInfo;
extern CDataControlCmdBlkKVDevice11& g_devConfig11;
extern CDataControlCmdBlkKVDevice& g_devConfig;
extern wchar_t (&g_szGapiInfo)[navmisc::kSharedNameChars];
extern wchar_t (&g_szExecProgPath)[navmisc::kSharedPathChars];
extern wchar_t (&g_szSoftwareCompanyname)[navmisc::kSharedNameChars];
extern wchar_t (&g_szAppDataPath)[navmisc::kSharedPathChars];
extern bool& g_bInitialFlag;
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

namespace navmisc {

// Copies a path into one of the shared wide texts (cut to its capacity, always terminated).
void SetSharedText(wchar_t* field, size_t capacity, const wchar_t* value);
template <size_t N>
void SetSharedText(wchar_t (&field)[N], const wchar_t* value) {
  SetSharedText(field, N, value);
}

// The name of the shared-memory object in use: "/navmisc-shared-<uid>-v<layout>" by default,
// the value of NAVMISC_SHM_NAME when that is set; "private" there gives a block that only this
// process (and children it forks) see, as tests need.
const char* SharedBlockName();

}  // namespace navmisc
