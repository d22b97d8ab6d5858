// The KV-11 block's values by their package names. Private to the library: the block codec packs
// them, the device settings texts (datactrl/device_fields.h) name them.
#pragma once

#include <cstddef>

#include "navmisc/datactrl/cmd_blocks.h"
#include "navmisc/datactrl/detail/value_codec.h"

namespace navmisc::datactrl::detail {

// The KV-11 block's values after nDeviceCmd, in package order. One list serves both directions
// (Block is the block, const for packing), so packing and unpacking cannot drift apart.
enum class Kind { kBytes, kByteText, kInt32, kUInt32, kUInt16, kUInt8 };

template <class Block, class Visit>
void ForEachKV11Field(Block& b, Visit visit) {
  // `packed`: bytes in the package for raw byte fields (GSM_APN keeps its 65th byte as the
  // terminator); other kinds have their type's size.
  auto field = [&](const char* name, Kind kind, auto& member, size_t packed = 0) {
    visit(name, kind, &member, sizeof member, packed);
  };
  field("DEVICE_ID", Kind::kBytes, b.DEVICE_ID, 32);
  field("NAME", Kind::kBytes, b.NAME, 64);
  field("GSM_APN", Kind::kBytes, b.GSM_APN, 64);
  field("CTRL_FLAG", Kind::kInt32, b.CTRL_FLAG);
  field("LANGUAGE", Kind::kInt32, b.LANGUAGE);
  field("ICON", Kind::kInt32, b.ICON);
  field("TEL", Kind::kByteText, b.TEL);
  field("PIN", Kind::kByteText, b.PIN);
  field("IMEI", Kind::kByteText, b.IMEI);
  field("XXX_CODE", Kind::kByteText, b.XXX_CODE);
  field("SERVER_IP_ADDRESS", Kind::kByteText, b.SERVER_IP_ADDRESS);
  field("SERVER_PORT", Kind::kInt32, b.SERVER_PORT);
  field("NO_G_STOP", Kind::kInt32, b.NO_G_STOP);
  field("MAX_MOTION_TIME", Kind::kInt32, b.MAX_MOTION_TIME);
  field("GPS_NG_MIN_SLEEP", Kind::kInt32, b.GPS_NG_MIN_SLEEP);
  for (int i = 0; i < 5; ++i) {
    field(NumberedName("admin_%d", i), Kind::kByteText, b.ADMIN[i].number);
    field(NumberedName("admin_%d_flag", i), Kind::kUInt16, b.ADMIN[i].flag);
  }
  for (int i = 0; i < 3; ++i) {
    field(NumberedName("volume_%d_AT_NFI", i), Kind::kInt32, b.VOLUME[i].AT_NFI);
    field(NumberedName("volume_%d_AT_NFO", i), Kind::kInt32, b.VOLUME[i].AT_NFO);
    field(NumberedName("volume_%d_AT_NFV", i), Kind::kInt32, b.VOLUME[i].AT_NFV);
    field(NumberedName("volume_%d_AT_VLB", i), Kind::kInt32, b.VOLUME[i].AT_VLB);
  }
  for (int i = 0; i < 10; ++i) {
    field(NumberedName("POI_%d_i32Lat1", i), Kind::kInt32, b.AREA[i].i32Lat1);
    field(NumberedName("POI_%d_i32Lon1", i), Kind::kInt32, b.AREA[i].i32Lon1);
    field(NumberedName("POI_%d_i32Lat2", i), Kind::kInt32, b.AREA[i].i32Lat2);
    field(NumberedName("POI_%d_i32Lon2", i), Kind::kInt32, b.AREA[i].i32Lon2);
    field(NumberedName("POI_%d_u32Flag", i), Kind::kUInt32, b.AREA[i].u32Flag);
  }
  field("GSM_STANDBY_SEC", Kind::kInt32, b.GSM_STANDBY_SEC);
  field("RING_DURATION", Kind::kUInt16, b.RING_DURATION);
  field("NOTIFY_VOLTAGE", Kind::kUInt8, b.NOTIFY_VOLTAGE);
  field("SHUTDOWN_VOLTAGE", Kind::kUInt8, b.SHUTDOWN_VOLTAGE);
  field("nLogInterval", Kind::kInt32, b.nLogInterval);
  field("nReportInterval", Kind::kInt32, b.nReportInterval);
  field("nSOSDuration", Kind::kInt32, b.nSOSDuration);
  field("nHeartBeat", Kind::kInt32, b.nHeartBeat);
  field("NAVI", Kind::kBytes, b.NAVI, sizeof b.NAVI);
  field("THRESH_ACT", Kind::kUInt8, b.THRESH_ACT);
  field("THRESH_INACT", Kind::kUInt8, b.THRESH_INACT);
  field("THRESH_FF", Kind::kUInt8, b.THRESH_FF);
  field("TIME_FF", Kind::kUInt8, b.TIME_FF);
}

}  // namespace navmisc::datactrl::detail
