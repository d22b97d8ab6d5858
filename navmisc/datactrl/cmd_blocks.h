// Command blocks of the data-control channel: the records that the programs of the suite
// exchange with the data-control process, and the two device configurations kept in shared
// memory (g_devConfig, g_devConfig11). Their packed form is in datactrl/block_codec.h.
//
// The header, status, progress, exit and device blocks are plain data: no virtual functions, no
// pointers, trivially copyable and of standard layout, so they can live in shared memory.
// Fields have their natural alignment; the layout is the same for every program built for one
// platform (docs/shared-state.md lists it). Changing a block changes the device state block's
// layout version.
#pragma once

#include <cstdint>
#include <cstring>
#include <type_traits>
#include <vector>

#include "navmisc/platform/cstring.h"
#include "navmisc/platform/datetime.h"

// What every block starts with.
struct CDataControlCmdBlk {
  int32_t nCmdType;        // kind of block, DC_CMD_* below
  wchar_t szDeviceId[33];  // terminated wide text
  int32_t nLastError;      // 0 on a request; the outcome on a reply (DC_ERR_*, datactrl/dc_errors.h)
  friend bool operator==(const CDataControlCmdBlk&, const CDataControlCmdBlk&) = default;
};

// Kinds of block (nCmdType).
enum : int32_t {
  DC_CMD_DEVICE = 1,             // CDataControlCmdBlkKVDevice or CDataControlCmdBlkKVDevice11
  DC_CMD_NET = 2,                // CDataControlCmdBlkNet
  DC_CMD_FILE = 3,               // CDataControlCmdBlkFile
  DC_CMD_CONNECTION_STATUS = 4,  // CDataControlConnectionStatus
  DC_CMD_PROGRESS = 5,           // CDataControlProgressCmdBlk
  DC_CMD_EXIT = 6,               // CDataControlExitCmdBlk
};

// Sources of connection status and progress (nSource).
enum : int32_t {
  DC_SOURCE_DEVICE = 1,
  DC_SOURCE_NET = 2,
};

// A device or the network came or went.
struct CDataControlConnectionStatus : CDataControlCmdBlk {
  int32_t nSource;
  uint8_t bConnected;
  friend bool operator==(const CDataControlConnectionStatus&,
                         const CDataControlConnectionStatus&) = default;
};

// Progress of a long operation: items of the transfer and of the database update.
struct CDataControlProgressCmdBlk : CDataControlCmdBlk {
  int32_t nSource;
  int32_t nTotalOfProcess;
  int32_t nProcessed;
  int32_t nTotalOfDatabaseProcess;
  int32_t nDatabaseProcessed;
  friend bool operator==(const CDataControlProgressCmdBlk&,
                         const CDataControlProgressCmdBlk&) = default;
};

// Asks the data-control process to end; the header says everything.
struct CDataControlExitCmdBlk : CDataControlCmdBlk {};

// Minutes of one week.
constexpr int kKVMinutesPerWeek = 7 * 24 * 60;

// When the logger records: from a start time, one flag byte per minute of a week.
struct KVDeviceSchedule {
  COleDateTime tDestStartScheduleTimeUTC;
  uint8_t bTimeTable[kKVMinutesPerWeek];
  friend bool operator==(const KVDeviceSchedule&, const KVDeviceSchedule&) = default;
};

// Password protection of the logger.
struct KVDeviceSecurity {
  uint8_t cVersion;
  uint8_t bOnOff;
  uint8_t szPassword[253];  // terminated narrow text
  friend bool operator==(const KVDeviceSecurity&, const KVDeviceSecurity&) = default;
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
  friend bool operator==(const CDataControlCmdBlkKVDevice&,
                         const CDataControlCmdBlkKVDevice&) = default;
};

// Device commands (nDeviceCmd).
enum : int32_t {
  DC_DEVICE_READ_LOG = 1,
  DC_DEVICE_CLEAR_LOG = 2,
  DC_DEVICE_READ_SETTING = 3,
  DC_DEVICE_WRITE_SETTING = 4,
  DC_DEVICE_RESET = 5,
  DC_DEVICE_CANCEL_READ = 6,
  DC_DEVICE_WRITE_NAVI = 8,
};

// A number allowed to command a tracker, with its rights.
struct KV11Admin {
  char number[17];
  uint16_t flag;
  friend bool operator==(const KV11Admin&, const KV11Admin&) = default;
};

// One volume profile of a tracker.
struct KV11Volume {
  int32_t AT_NFI;
  int32_t AT_NFO;
  int32_t AT_NFV;
  int32_t AT_VLB;
  friend bool operator==(const KV11Volume&, const KV11Volume&) = default;
};

// A watched rectangle: two corners in the tracker's integer coordinates, and its flags.
struct KV11Area {
  int32_t i32Lat1;
  int32_t i32Lon1;
  int32_t i32Lat2;
  int32_t i32Lon2;
  uint32_t u32Flag;
  friend bool operator==(const KV11Area&, const KV11Area&) = default;
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
  friend bool operator==(const CDataControlCmdBlkKVDevice11&,
                         const CDataControlCmdBlkKVDevice11&) = default;
};

// The state of a freshly made device block: everything zero, command type 1, motion detection
// and the accelerometer on.
inline void InitDeviceBlockDefaults(CDataControlCmdBlkKVDevice& block) {
  std::memset(static_cast<void*>(&block), 0, sizeof block);
  block.nCmdType = 1;
  block.bMotionDetect = 1;
  block.bAccOn = 1;
}

// The state of a freshly made KV-11 block (reading settings, writing navigation points, and
// the start of every KV-11 reply read): everything zero, command type 1, and the family's usual
// settings: logging every 5 s, a report every 300 s, an SOS call of 600 s, a heartbeat every
// 3600 s, 120 s of modem standby, a stop after 30 s without motion, at most 360 s of motion
// time, 20 s of sleep after a failed fix, a ring of 16 s, the tracking server's port 8018 and
// the device code "$R#" (the framing characters of the tracker's text commands around its
// report letter).
inline void InitKV11BlockDefaults(CDataControlCmdBlkKVDevice11& block) {
  std::memset(static_cast<void*>(&block), 0, sizeof block);
  block.nCmdType = 1;
  block.nLogInterval = 5;
  block.nReportInterval = 300;
  block.nSOSDuration = 600;
  block.nHeartBeat = 3600;
  block.GSM_STANDBY_SEC = 120;
  block.NO_G_STOP = 30;
  block.MAX_MOTION_TIME = 360;
  block.GPS_NG_MIN_SLEEP = 20;
  block.RING_DURATION = 16;
  block.SERVER_PORT = 8018;
  std::memcpy(block.XXX_CODE, "$R#", 4);
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

// ---- Web-service and file blocks --------------------------------------------------------------
// These carry texts and lists of any length, so they are ordinary objects (they never live in
// shared memory). A block's lists are freed with the block.

// A point of a track exchanged with the web service.
struct DC_NET_POINT_INFO {
  COleDateTime oleTime;
  double dLatitude = 0;   // degrees
  double dLongitude = 0;  // degrees
  double dAltitude = 0;   // metres
  int32_t nSpeed = 0;     // metres per hour
  int32_t nPushToLog = 0;
  friend bool operator==(const DC_NET_POINT_INFO&, const DC_NET_POINT_INFO&) = default;
};

// A marker of a track.
struct DC_NET_POI_INFO {
  CString szPoiId;
  CString szTrackId;
  CString szIcon;
  CString szTitle;
  CString szDesc;
  double dLatitude = 0;   // degrees
  double dLongitude = 0;  // degrees
  double dAltitude = 0;   // metres
  int32_t nSegment = 0;
  COleDateTime tTime;
  CString sEmbeddedCode;
  friend bool operator==(const DC_NET_POI_INFO&, const DC_NET_POI_INFO&) = default;
};

// A track as the web service knows it.
struct DC_NET_TRACK_INFO {
  CString szTrackId;
  CString szOwnerId;
  CString szSubject;
  CString szAuthKey;
  CString szTag;
  CString szURL;
  uint8_t bListed = 0;
  int32_t nMode = 0;
  int32_t lTimeZone = 0;
  int32_t nStyle = 0;
  int32_t nPageId = 0;
  COleDateTime tUploadTime;
  std::vector<DC_NET_POINT_INFO> ptrPtList;
  std::vector<DC_NET_POI_INFO> ptrPOIList;
  CString szMetaInfo;
  CString szDesc;
  CString szModelId;
  CString szLang;
  CString szTrackData;
  CString szTimeZone;
  DC_NET_POINT_INFO ptStart;
  DC_NET_POINT_INFO ptEnd;
  int32_t nCoverId = 0;
  friend bool operator==(const DC_NET_TRACK_INFO&, const DC_NET_TRACK_INFO&) = default;
};

// One thumbnail of a photo on the web service.
struct DC_NET_THUMB {
  CString szURL;
  uint32_t dwSize = 0;  // bytes
  friend bool operator==(const DC_NET_THUMB&, const DC_NET_THUMB&) = default;
};

// The thumbnails of a photo: a fixed set of sizes, small to large.
constexpr int kNetThumbCount = 3;
struct DC_NET_THUMB_INFO {
  CString szDownloadURL;
  DC_NET_THUMB thumbs[kNetThumbCount];
  friend bool operator==(const DC_NET_THUMB_INFO&, const DC_NET_THUMB_INFO&) = default;
};

struct DC_NET_PHOTO_INFO {
  CString szPhotoId;
  CString szOwnerId;
  CString szTrackId;
  CString szTrackPhotoId;
  CString szName;
  CString szAuthKey;
  CString szType;
  CString szFilePath;
  CString szTitle;
  CString szDesc;
  CString szIcon;
  COleDateTime time;
  uint8_t bListed = 0;
  int32_t nSegment = 0;
  uint32_t dwSize = 0;  // bytes of the image file
  int32_t nWidth = 0;   // pixels
  int32_t nHeight = 0;  // pixels
  uint32_t nFlags = 0;
  double dLat = 0;   // degrees
  double dLong = 0;  // degrees
  double dAlt = 0;   // metres
  DC_NET_THUMB_INFO thumbInfo;
  friend bool operator==(const DC_NET_PHOTO_INFO&, const DC_NET_PHOTO_INFO&) = default;
};

// A file attached to a track.
struct DC_NET_FILE_INFO {
  CString sTrackId;
  CString sName;
  CString sType;
  CString sFilePath;
  int32_t nWidth = 0;   // pixels, for images
  int32_t nHeight = 0;
  friend bool operator==(const DC_NET_FILE_INFO&, const DC_NET_FILE_INFO&) = default;
};

struct DC_NET_TAG_ITEM {
  CString sTagId;
  CString sDisplayName;
  int32_t count = 0;
  friend bool operator==(const DC_NET_TAG_ITEM&, const DC_NET_TAG_ITEM&) = default;
};

struct DC_NET_TAG_INFO {
  CString Tag_Lang;
  std::vector<DC_NET_TAG_ITEM> lstTag;
  friend bool operator==(const DC_NET_TAG_INFO&, const DC_NET_TAG_INFO&) = default;
};

// Mobile-cell and GPS descriptions, as texts.
struct DC_NET_CELL_INFO {
  std::vector<CString> CellInfo;
  std::vector<CString> GpsInfo;
  friend bool operator==(const DC_NET_CELL_INFO&, const DC_NET_CELL_INFO&) = default;
};

// The user's account.
struct DC_NET_USER_INFO {
  CString szUid;
  CString szOwnerId;
  CString szToken;
  CString szUserName;
  CString szPassword;
  CString szDisplayName;
  friend bool operator==(const DC_NET_USER_INFO&, const DC_NET_USER_INFO&) = default;
};

// A web-service command or reply. A new block is empty: kind 2, no texts, no lists.
struct CDataControlCmdBlkNet : CDataControlCmdBlk {
  CDataControlCmdBlkNet() : CDataControlCmdBlk{DC_CMD_NET, {}, 0} {}
  int32_t nNetCmd = 0;
  DC_NET_USER_INFO userInfo;
  DC_NET_TRACK_INFO trackInfo;
  std::vector<DC_NET_PHOTO_INFO> photoInfo;
  DC_NET_FILE_INFO fileInfo;
  DC_NET_TAG_INFO tagInfo;
  DC_NET_CELL_INFO cellInfo;
  COleDateTime tPointStartTime;
  COleDateTime tPointEndTime;
  friend bool operator==(const CDataControlCmdBlkNet&, const CDataControlCmdBlkNet&) = default;
};

// File commands (nFileCmd).
enum : int32_t {
  DC_FILE_IMPORT = 1,
};

// A file import or export. A new block is empty: kind 3.
struct CDataControlCmdBlkFile : CDataControlCmdBlk {
  CDataControlCmdBlkFile() : CDataControlCmdBlk{DC_CMD_FILE, {}, 0} {}
  int32_t nFileCmd = 0;
  CString szFilePath;
  COleDateTime tPointStartTime;
  COleDateTime tPointEndTime;
  int32_t nTimeZone = 0;  // time zone of the file's times
  DC_NET_TRACK_INFO trackInfo;
  friend bool operator==(const CDataControlCmdBlkFile&, const CDataControlCmdBlkFile&) = default;
};
