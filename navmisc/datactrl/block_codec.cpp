#include "navmisc/datactrl/block_codec.h"

#include <cstring>

#include "navmisc/datactrl/detail/kv11_fields.h"
#include "navmisc/datactrl/detail/value_codec.h"
#include "navmisc/datactrl/device_state.h"

namespace navmisc::datactrl {

using namespace detail;

// ---- header, status, progress -----------------------------------------------------------------

void PackBlock(const CDataControlCmdBlk& b, CPackageBlk& out) {
  PutInt32(out, "nCmdType", b.nCmdType);
  PutText(out, "szDeviceId", b.szDeviceId);
  PutInt32(out, "nLastError", b.nLastError);
}

void UnpackHeader(const CUnpackageBlk& in, CDataControlCmdBlk& b) {
  GetInt32(in, "nCmdType", b.nCmdType);
  GetText(in, "szDeviceId", b.szDeviceId);
  GetInt32(in, "nLastError", b.nLastError);
}

void PackBlock(const CDataControlConnectionStatus& b, CPackageBlk& out) {
  PackBlock(static_cast<const CDataControlCmdBlk&>(b), out);
  PutInt32(out, "nSource", b.nSource);
  PutFlag(out, "bConnected", b.bConnected);
}

void UnpackBlock(const CUnpackageBlk& in, CDataControlConnectionStatus& b) {
  UnpackHeader(in, b);
  GetInt32(in, "nSource", b.nSource);
  GetFirstByte(in, "bConnected", b.bConnected);
}

void PackBlock(const CDataControlProgressCmdBlk& b, CPackageBlk& out) {
  PackBlock(static_cast<const CDataControlCmdBlk&>(b), out);
  PutInt32(out, "nSource", b.nSource);
  PutInt32(out, "nTotalOfProcess", b.nTotalOfProcess);
  PutInt32(out, "nProcessed", b.nProcessed);
  PutInt32(out, "nTotalOfDatabaseProcess", b.nTotalOfDatabaseProcess);
  PutInt32(out, "nDatabaseProcessed", b.nDatabaseProcessed);
}

void UnpackBlock(const CUnpackageBlk& in, CDataControlProgressCmdBlk& b) {
  UnpackHeader(in, b);
  GetInt32(in, "nSource", b.nSource);
  GetInt32(in, "nTotalOfProcess", b.nTotalOfProcess);
  GetInt32(in, "nProcessed", b.nProcessed);
  GetInt32(in, "nTotalOfDatabaseProcess", b.nTotalOfDatabaseProcess);
  GetInt32(in, "nDatabaseProcessed", b.nDatabaseProcessed);
}

// ---- device -------------------------------------------------------------------------------------

void PackBlock(const CDataControlCmdBlkKVDevice& b, CPackageBlk& out) {
  PackBlock(static_cast<const CDataControlCmdBlk&>(b), out);
  PutInt32(out, "nDeviceCmd", b.nDeviceCmd);
  PutInt32(out, "nInterval", b.nInterval);
  PutInt32(out, "nVelocity_Scale", b.nVelocity_Scale);
  PutInt32(out, "nVsleep", b.nVsleep);
  PutFlag(out, "bDebugMode", b.bDebugMode);
  PutFlag(out, "bTricklePower", b.bTricklePower);
  PutFlag(out, "bDualMode", b.bDualMode);
  PutFlag(out, "bCycle", b.bCycle);
  PutFlag(out, "bMotionDetect", b.bMotionDetect);
  PutFlag(out, "bAccOn", b.bAccOn);
  PutFlag(out, "bEnableLED", b.bEnableLED);
  PutFlag(out, "bEnableSchedule", b.bEnableSchedule);
  PutFlag(out, "bEnableButton", b.bEnableButton);
  CPackageBlk schedule;
  PutDateTime(schedule, "tDestStartScheduleTimeUTC", b.sSchedule.tDestStartScheduleTimeUTC);
  PutBytes(schedule, "bTimeTable", b.sSchedule.bTimeTable, sizeof b.sSchedule.bTimeTable);
  out.Add("gpsSchedule", schedule);
  CPackageBlk security;
  PutUInt8(security, "cVersion", b.sSecurity.cVersion);
  PutInt32(security, "bOnOff", b.sSecurity.bOnOff);
  PutBytes(security, "szPassword", b.sSecurity.szPassword, sizeof b.sSecurity.szPassword);
  out.Add("gpsSerurity", security);
  PutDateTime(out, "tPointStartTime", b.tPointStartTime);
  PutDateTime(out, "tPointEndTime", b.tPointEndTime);
}

void UnpackBlock(const CUnpackageBlk& in, CDataControlCmdBlkKVDevice& b) {
  UnpackHeader(in, b);
  GetInt32(in, "nDeviceCmd", b.nDeviceCmd);
  // A reply without options (the answer to a reset, say) leaves the block's options, schedule
  // and security record as they were.
  if (!GetInt32(in, "nInterval", b.nInterval)) return;
  GetInt32(in, "nVelocity_Scale", b.nVelocity_Scale);
  GetInt32(in, "nVsleep", b.nVsleep);
  GetFlag(in, "bDebugMode", b.bDebugMode);
  GetFlag(in, "bTricklePower", b.bTricklePower);
  GetFlag(in, "bDualMode", b.bDualMode);
  GetFlag(in, "bCycle", b.bCycle);
  GetFlag(in, "bMotionDetect", b.bMotionDetect);
  GetFlag(in, "bAccOn", b.bAccOn);
  GetFirstByte(in, "bEnableLED", b.bEnableLED);
  GetFirstByte(in, "bEnableSchedule", b.bEnableSchedule);
  GetFirstByte(in, "bEnableButton", b.bEnableButton);
  CUnpackageBlk nested;
  if (GetNested(in, "gpsSchedule", nested)) {
    GetDateTime(nested, "tDestStartScheduleTimeUTC", b.sSchedule.tDestStartScheduleTimeUTC);
    GetBytes(nested, "bTimeTable", b.sSchedule.bTimeTable, sizeof b.sSchedule.bTimeTable);
  }
  if (GetNested(in, "gpsSerurity", nested)) {
    GetFirstByte(nested, "cVersion", b.sSecurity.cVersion);
    GetFirstByte(nested, "bOnOff", b.sSecurity.bOnOff);
    GetBytes(nested, "szPassword", b.sSecurity.szPassword, sizeof b.sSecurity.szPassword);
  }
  GetDateTime(in, "tPointStartTime", b.tPointStartTime);
  GetDateTime(in, "tPointEndTime", b.tPointEndTime);
}

// ---- KV-11 device -------------------------------------------------------------------------------

namespace {

template <class T>
T Load(const void* p) {
  T v;
  std::memcpy(&v, p, sizeof v);
  return v;
}

}  // namespace

void PackBlock(const CDataControlCmdBlkKVDevice11& b, CPackageBlk& out) {
  PackBlock(static_cast<const CDataControlCmdBlk&>(b), out);
  PutInt32(out, "nDeviceCmd", b.nDeviceCmd);
  ForEachKV11Field(b, [&](const char* name, Kind kind, const void* p, size_t capacity,
                          size_t packed) {
    switch (kind) {
      case Kind::kBytes: PutBytes(out, name, p, packed); break;
      case Kind::kByteText: PutByteText(out, name, static_cast<const char*>(p), capacity); break;
      case Kind::kInt32: PutInt32(out, name, Load<int32_t>(p)); break;
      case Kind::kUInt32: PutUInt32(out, name, Load<uint32_t>(p)); break;
      case Kind::kUInt16: PutUInt16(out, name, Load<uint16_t>(p)); break;
      case Kind::kUInt8: PutUInt8(out, name, Load<uint8_t>(p)); break;
    }
  });
}

void UnpackBlock(const CUnpackageBlk& in, CDataControlCmdBlkKVDevice11& b) {
  UnpackHeader(in, b);
  GetInt32(in, "nDeviceCmd", b.nDeviceCmd);
  ForEachKV11Field(b, [&](const char* name, Kind kind, void* p, size_t capacity,
                          size_t packed) {
    switch (kind) {
      case Kind::kBytes: GetBytes(in, name, p, packed); break;
      case Kind::kByteText: GetByteText(in, name, static_cast<char*>(p), capacity); break;
      case Kind::kInt32: GetInt32(in, name, *static_cast<int32_t*>(p)); break;
      case Kind::kUInt32: GetUInt32(in, name, *static_cast<uint32_t*>(p)); break;
      case Kind::kUInt16: GetUInt16(in, name, *static_cast<uint16_t*>(p)); break;
      case Kind::kUInt8: GetUInt8(in, name, *static_cast<uint8_t*>(p)); break;
    }
  });
}

bool IsKV11Model(uint16_t modelId) {
  switch (modelId) {
    case 8: case 9: case 18: case 20: case 21: case 22: return true;
    default: return false;
  }
}

bool UsesKV11Block(int32_t nDeviceCmd) {
  return IsKV11Model(g_wDeviceModelID) &&
         (nDeviceCmd == DC_DEVICE_READ_SETTING || nDeviceCmd == DC_DEVICE_WRITE_SETTING ||
          nDeviceCmd == DC_DEVICE_WRITE_NAVI);
}

}  // namespace navmisc::datactrl
