// Command blocks of the data-control channel: the fixed-size records that the programs of the
// suite exchange about a logger, and the two device configurations kept in shared memory
// (g_devConfig, g_devConfig11).
//
// Every block is plain data: no virtual functions, no pointers, trivially copyable and of
// standard layout, so it can live in shared memory and travel through the channel as bytes.
// Fields have their natural alignment; the layout is the same for every program built for one
// platform (docs/shared-state.md lists it). Changing a block changes the device state block's
// layout version.
#pragma once

#include <cstdint>
#include <cstring>
#include <type_traits>

#include "navmisc/platform/datetime.h"

// What every block starts with.
struct CDataControlCmdBlk {
  int32_t nCmdType;
  wchar_t szDeviceId[33];  // terminated wide text
  int32_t nLastError;
};

// A device or the network came or went.
struct CDataControlConnectionStatus : CDataControlCmdBlk {
  int32_t nSource;
  uint8_t bConnected;
};

// Progress of a long operation: items of the transfer and of the database update.
struct CDataControlProgressCmdBlk : CDataControlCmdBlk {
  int32_t nSource;
  int32_t nTotalOfProcess;
  int32_t nProcessed;
  int32_t nTotalOfDatabaseProcess;
  int32_t nDatabaseProcessed;
};

// Asks the data-control process to end; the header says everything.
struct CDataControlExitCmdBlk : CDataControlCmdBlk {};

// Minutes of one week.
constexpr int kKVMinutesPerWeek = 7 * 24 * 60;

// When the logger records: from a start time, one flag byte per minute of a week.
struct KVDeviceSchedule {
  COleDateTime tDestStartScheduleTimeUTC;
  uint8_t bTimeTable[kKVMinutesPerWeek];
};

// Password protection of the logger.
struct KVDeviceSecurity {
  uint8_t cVersion;
  uint8_t bOnOff;
  uint8_t szPassword[253];  // terminated narrow text
};

// Configuration of a data logger.
struct CDataControlCmdBlkKVDevice : CDataControlCmdBlk {
  int32_t nDeviceCmd;
  int32_t nInterval;
  int32_t nVelocity_Scale;
  int32_t nVsleep;
  uint8_t bDebugMode;
  uint8_t bTricklePower;
  uint8_t bDualMode;
  uint8_t bCycle;
  uint8_t bEnableLED;
  uint8_t bEnableSchedule;
  uint8_t bEnableButton;
  uint8_t bMotionDetect;
  uint8_t bAccOn;
  KVDeviceSchedule sSchedule;
  KVDeviceSecurity sSecurity;
  COleDateTime tPointStartTime;
  COleDateTime tPointEndTime;
};

// A number allowed to command a tracker, with its rights.
struct KV11Admin {
  char number[17];
  uint16_t flag;
};

// One volume profile of a tracker.
struct KV11Volume {
  int32_t AT_NFI;
  int32_t AT_NFO;
  int32_t AT_NFV;
  int32_t AT_VLB;
};

// A watched rectangle: two corners in the tracker's integer coordinates, and its flags.
struct KV11Area {
  int32_t i32Lat1;
  int32_t i32Lon1;
  int32_t i32Lat2;
  int32_t i32Lon2;
  uint32_t u32Flag;
};

// Configuration of a GSM tracker.
struct CDataControlCmdBlkKVDevice11 : CDataControlCmdBlk {
  int32_t nDeviceCmd;
  char DEVICE_ID[32];
  char NAME[64];
  char GSM_APN[65];
  int32_t CTRL_FLAG;
  int32_t LANGUAGE;
  int32_t ICON;
  char TEL[32];
  char PIN[14];
  char IMEI[32];
  char XXX_CODE[32];
  char SERVER_IP_ADDRESS[64];
  int32_t SERVER_PORT;
  int32_t NO_G_STOP;
  int32_t MAX_MOTION_TIME;
  int32_t GPS_NG_MIN_SLEEP;
  KV11Admin ADMIN[5];
  KV11Volume VOLUME[3];
  KV11Area AREA[10];
  int32_t GSM_STANDBY_SEC;
  uint16_t RING_DURATION;
  uint8_t NOTIFY_VOLTAGE;
  uint8_t SHUTDOWN_VOLTAGE;
  int32_t nLogInterval;
  int32_t nReportInterval;
  int32_t nSOSDuration;
  int32_t nHeartBeat;
  uint8_t NAVI[28800];
  int32_t nNaviCount;
  uint8_t THRESH_ACT;
  uint8_t THRESH_INACT;
  uint8_t THRESH_FF;
  uint8_t TIME_FF;
};

// The state of a freshly made device block: everything zero, command type 1, motion detection
// and the accelerometer on.
inline void InitDeviceBlockDefaults(CDataControlCmdBlkKVDevice& block) {
  std::memset(static_cast<void*>(&block), 0, sizeof block);
  block.nCmdType = 1;
  block.bMotionDetect = 1;
  block.bAccOn = 1;
}

// The blocks derive from the header so that any block can be handled as a CDataControlCmdBlk.
// C++ calls a class with data members both in a base and in itself "not standard-layout", but a
// derived block without virtual functions is still trivially copyable and, under the platform
// ABI, lays out as the header followed by its own fields (no field ever reuses the header's tail
// padding, the header being plain old data). The header and every record are standard-layout.
namespace navmisc::detail {
template <class T>
constexpr bool kIsPlainRecord = std::is_trivially_copyable_v<T> && std::is_standard_layout_v<T>;
template <class T>
constexpr bool kIsPlainBlock = std::is_trivially_copyable_v<T> && std::is_aggregate_v<T> &&
                               !std::is_polymorphic_v<T> &&
                               std::is_base_of_v<CDataControlCmdBlk, T>;
}  // namespace navmisc::detail

static_assert(navmisc::detail::kIsPlainRecord<COleDateTime>);
static_assert(navmisc::detail::kIsPlainRecord<CDataControlCmdBlk>);
static_assert(navmisc::detail::kIsPlainRecord<KVDeviceSchedule>);
static_assert(navmisc::detail::kIsPlainRecord<KVDeviceSecurity>);
static_assert(navmisc::detail::kIsPlainRecord<KV11Admin>);
static_assert(navmisc::detail::kIsPlainRecord<KV11Volume>);
static_assert(navmisc::detail::kIsPlainRecord<KV11Area>);
static_assert(navmisc::detail::kIsPlainBlock<CDataControlConnectionStatus>);
static_assert(navmisc::detail::kIsPlainBlock<CDataControlProgressCmdBlk>);
static_assert(navmisc::detail::kIsPlainBlock<CDataControlExitCmdBlk>);
static_assert(navmisc::detail::kIsPlainBlock<CDataControlCmdBlkKVDevice>);
static_assert(navmisc::detail::kIsPlainBlock<CDataControlCmdBlkKVDevice11>);
