#include "navmisc/datactrl/block_codec.h"

#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "navmisc/datactrl/device_state.h"
#include "navmisc/datactrl/detail/value_codec.h"
#include "navmisc/platform/textconv.h"
#include "sample_blocks.h"

namespace {

using namespace navmisc::datactrl;
using navmisc::datactrl::testing::SampleDevice;
using navmisc::datactrl::testing::SampleKV11;
using navmisc::datactrl::testing::SampleNet;

template <class Block>
std::vector<std::string> Names(const Block& block) {
  CPackageBlk p;
  PackBlock(block, p);
  CUnpackageBlk u(p.GetPackagePtr(), p.GetPackageSize());
  std::vector<std::string> names;
  for (const auto& e : u.Entries()) names.emplace_back(e.name);
  return names;
}

template <class Block>
Block RoundTrip(const Block& in, Block out) {
  CPackageBlk p;
  PackBlock(in, p);
  CUnpackageBlk u(p.GetPackagePtr(), p.GetPackageSize());
  UnpackBlock(u, out);
  return out;
}

// The bytes of one packed value of `block`.
template <class Block>
std::string Packed(const Block& block, const char* name, const char* nested = nullptr) {
  CPackageBlk p;
  PackBlock(block, p);
  CUnpackageBlk u(p.GetPackagePtr(), p.GetPackageSize());
  CUnpackageBlk inner;
  if (nested && !detail::GetNested(u, nested, inner)) return "<no nested>";
  const uint8_t* data;
  uint32_t size;
  if (!(nested ? inner : u).GetData(name, data, size)) return "<absent>";
  return std::string(reinterpret_cast<const char*>(data), size);
}

const std::vector<std::string> kHeader = {"nCmdType", "szDeviceId", "nLastError"};

std::vector<std::string> operator+(std::vector<std::string> a, const std::vector<std::string>& b) {
  a.insert(a.end(), b.begin(), b.end());
  return a;
}

TEST(BlockCodec, EveryBlockPacksItsNamesInOrder) {
  EXPECT_EQ(Names(CDataControlCmdBlk{}), kHeader);
  EXPECT_EQ(Names(CDataControlConnectionStatus{}), (kHeader + std::vector<std::string>{"nSource", "bConnected"}));
  EXPECT_EQ(Names(CDataControlProgressCmdBlk{}),
            (kHeader + std::vector<std::string>{"nSource", "nTotalOfProcess", "nProcessed",
                                               "nTotalOfDatabaseProcess", "nDatabaseProcessed"}));
  EXPECT_EQ(Names(CDataControlCmdBlkKVDevice{}),
            (kHeader + std::vector<std::string>{
                          "nDeviceCmd", "nInterval", "nVelocity_Scale", "nVsleep", "bDebugMode",
                          "bTricklePower", "bDualMode", "bCycle", "bMotionDetect", "bAccOn",
                          "bEnableLED", "bEnableSchedule", "bEnableButton", "gpsSchedule",
                          "gpsSerurity", "tPointStartTime", "tPointEndTime"}));

  std::vector<std::string> kv11 = kHeader + std::vector<std::string>{
      "nDeviceCmd", "DEVICE_ID", "NAME", "GSM_APN", "CTRL_FLAG", "LANGUAGE", "ICON", "TEL", "PIN",
      "IMEI", "XXX_CODE", "SERVER_IP_ADDRESS", "SERVER_PORT", "NO_G_STOP", "MAX_MOTION_TIME",
      "GPS_NG_MIN_SLEEP"};
  for (int i = 0; i < 5; ++i) kv11 = kv11 + std::vector<std::string>{"admin_" + std::to_string(i),
                                                                   "admin_" + std::to_string(i) + "_flag"};
  for (int i = 0; i < 3; ++i)
    for (const char* v : {"NFI", "NFO", "NFV", "VLB"})
      kv11.push_back("volume_" + std::to_string(i) + "_AT_" + v);
  for (int i = 0; i < 10; ++i)
    for (const char* c : {"i32Lat1", "i32Lon1", "i32Lat2", "i32Lon2", "u32Flag"})
      kv11.push_back("POI_" + std::to_string(i) + "_" + c);
  kv11 = kv11 + std::vector<std::string>{"GSM_STANDBY_SEC", "RING_DURATION", "NOTIFY_VOLTAGE",
                                         "SHUTDOWN_VOLTAGE", "nLogInterval", "nReportInterval",
                                         "nSOSDuration", "nHeartBeat", "NAVI", "THRESH_ACT",
                                         "THRESH_INACT", "THRESH_FF", "TIME_FF"};
  CDataControlCmdBlkKVDevice11 k{};
  EXPECT_EQ(Names(k), kv11);

  EXPECT_EQ(Names(CDataControlCmdBlkNet{}),
            (kHeader + std::vector<std::string>{"nNetCmd", "userinfo", "trackinfo", "photoinfo",
                                               "fileinfo", "taginfo", "cellinfo",
                                               "tPointStartTime", "tPointEndTime"}));
  EXPECT_EQ(Names(CDataControlCmdBlkFile{}),
            (kHeader + std::vector<std::string>{"nFileCmd", "szFilePath", "tPointStartTime",
                                               "tPointEndTime", "nTimeZone", "trackinfo"}));

  // The nested records of the device and net blocks.
  const CDataControlCmdBlkNet net = SampleNet();
  CPackageBlk p;
  PackBlock(net, p);
  CUnpackageBlk u(p.GetPackagePtr(), p.GetPackageSize());
  auto nested = [&](const CUnpackageBlk& parent, const char* name) {
    const uint8_t* data;
    uint32_t size;
    EXPECT_TRUE(parent.GetData(name, data, size)) << name;
    CUnpackageBlk inner(data, size);
    std::vector<std::string> names;
    for (const auto& e : inner.Entries()) names.emplace_back(e.name);
    return names;
  };
  EXPECT_EQ(nested(u, "userinfo"), (std::vector<std::string>{"szUid", "szOwnerId", "szToken",
                                                             "szUserName", "szPassword",
                                                             "szDisplayName"}));
  EXPECT_EQ(nested(u, "trackinfo"),
            (std::vector<std::string>{"szTrackId", "szOwnerId", "szSubject", "szAuthKey", "szTag",
                                      "szURL", "bListed", "nMode", "lTimeZone", "nStyle",
                                      "nPageId", "tUploadTime", "ptrPtList_Count", "ptrPtList_0",
                                      "ptrPtList_1", "ptrPOIList_Count", "ptrPOIList_0",
                                      "szMetaInfo", "szDesc", "szModelId", "szLang",
                                      "szTrackData", "szTimeZone", "ptStart", "ptEnd",
                                      "nCoverId"}));
  EXPECT_EQ(nested(u, "photoinfo"), (std::vector<std::string>{"ptrPhotoList_Count", "ptrPhotoList_0"}));
  EXPECT_EQ(nested(u, "fileinfo"), (std::vector<std::string>{"sTrackId", "sName", "sType",
                                                             "sFilePath", "nWidth", "nHeight"}));
  EXPECT_EQ(nested(u, "taginfo"), (std::vector<std::string>{"Tag_Lang", "Tag_Count", "lstTag_0"}));
  EXPECT_EQ(nested(u, "cellinfo"), (std::vector<std::string>{"CountCellInfo", "CellInfo_0",
                                                             "CellInfo_1", "CountGpsInfo",
                                                             "GpsInfo_0"}));
  CUnpackageBlk track, photos, photo;
  ASSERT_TRUE(detail::GetNested(u, "trackinfo", track));
  EXPECT_EQ(nested(track, "ptrPtList_0"),
            (std::vector<std::string>{"oleTime", "dLatitude", "dLongitude", "dAltitude", "nSpeed",
                                      "nPushToLog"}));
  EXPECT_EQ(nested(track, "ptStart"), nested(track, "ptrPtList_0"));
  EXPECT_EQ(nested(track, "ptrPOIList_0"),
            (std::vector<std::string>{"szPoiId", "szTrackId", "szIcon", "szTitle", "szDesc",
                                      "dLatitude", "dLongitude", "dAltitude", "nSegment", "tTime",
                                      "sEmbeddedCode"}));
  ASSERT_TRUE(detail::GetNested(u, "photoinfo", photos));
  ASSERT_TRUE(detail::GetNested(photos, "ptrPhotoList_0", photo));
  EXPECT_EQ(nested(photos, "ptrPhotoList_0"),
            (std::vector<std::string>{"szPhotoId", "szOwnerId", "szTrackId", "szTrackPhotoId",
                                      "szName", "szAuthKey", "szType", "szFilePath", "szTitle",
                                      "szDesc", "szIcon", "time", "bListed", "nSegment", "dwSize",
                                      "nWidth", "nHeight", "nFlags", "dLat", "dLong", "dAlt",
                                      "thumbInfo"}));
  EXPECT_EQ(nested(photo, "thumbInfo"),
            (std::vector<std::string>{"szDownloadURL", "szURL_0", "dwSize_0", "szURL_1",
                                      "dwSize_1", "szURL_2", "dwSize_2"}));
  EXPECT_EQ(nested(u, "tPointStartTime").size(), 0u);  // a text, not a package

  CPackageBlk device;
  PackBlock(SampleDevice(), device);
  CUnpackageBlk d(device.GetPackagePtr(), device.GetPackageSize());
  EXPECT_EQ(nested(d, "gpsSchedule"),
            (std::vector<std::string>{"tDestStartScheduleTimeUTC", "bTimeTable"}));
  EXPECT_EQ(nested(d, "gpsSerurity"), (std::vector<std::string>{"cVersion", "bOnOff", "szPassword"}));
}

TEST(BlockCodec, ValueEncodings) {
  CDataControlCmdBlkKVDevice device = SampleDevice();
  device.bDebugMode = 2;  // any non-zero flag is packed as 1
  device.sSecurity.bOnOff = 1;
  device.tPointEndTime = COleDateTime();  // 1899: before 1970, so no text
  const struct {
    const char* name;
    const char* nested;
    std::string expected;
  } cases[] = {
      {"nCmdType", nullptr, std::string("\x01\x00\x00\x00", 4)},
      {"nInterval", nullptr, std::string("\x0F\x00\x00\x00", 4)},
      {"nVelocity_Scale", nullptr, std::string("\xFE\xFF\xFF\xFF", 4)},  // -2
      {"bDebugMode", nullptr, std::string("\x01\x00\x00\x00", 4)},
      {"bTricklePower", nullptr, std::string("\x00\x00\x00\x00", 4)},
      {"szDeviceId", nullptr, std::string("d\0v\0\0\0", 6)},
      {"tPointEndTime", nullptr, std::string("\0\0", 2)},
      {"cVersion", "gpsSerurity", std::string("\x03", 1)},
      {"bOnOff", "gpsSerurity", std::string("\x01\x00\x00\x00", 4)},
  };
  for (const auto& c : cases) EXPECT_EQ(Packed(device, c.name, c.nested), c.expected) << c.name;
  // A date-time is its time in the standard text form, as UTF-16.
  std::string text;
  navmisc::AppendUtf16Le(L"2024-05-01T08:30:15", text);
  EXPECT_EQ(Packed(device, "tPointStartTime"), text + std::string(2, '\0'));
  // Fixed sizes whatever the content.
  EXPECT_EQ(Packed(device, "szPassword", "gpsSerurity").size(), 253u);
  EXPECT_EQ(Packed(device, "bTimeTable", "gpsSchedule").size(), 10080u);
  EXPECT_EQ(Packed(device, "bConnected"), "<absent>");
  CDataControlConnectionStatus status{};
  status.bConnected = 9;
  EXPECT_EQ(Packed(status, "bConnected"), std::string("\x01\x00\x00\x00", 4));

  CDataControlCmdBlkKVDevice11 kv11 = SampleKV11();
  EXPECT_EQ(Packed(kv11, "DEVICE_ID").size(), 32u);
  EXPECT_EQ(Packed(kv11, "GSM_APN").size(), 64u);
  EXPECT_EQ(Packed(kv11, "NAVI").size(), 28800u);
  EXPECT_EQ(Packed(kv11, "TEL"), "+491701234567");  // a byte text: its length, no terminator
  EXPECT_EQ(Packed(kv11, "admin_1_flag"), std::string("\x02\x00", 2));
  EXPECT_EQ(Packed(kv11, "NOTIFY_VOLTAGE"), "\x21");
  EXPECT_EQ(Packed(kv11, "POI_9_u32Flag"), std::string("\xFF\xFF\xFF\xFF", 4));
}

TEST(BlockCodec, EveryBlockReadsBackWhatWasPacked) {
  const CDataControlCmdBlkKVDevice device = SampleDevice();
  EXPECT_TRUE(RoundTrip(device, CDataControlCmdBlkKVDevice{}) == device);
  const CDataControlCmdBlkKVDevice11 kv11 = SampleKV11();
  CDataControlCmdBlkKVDevice11 zero{};
  EXPECT_TRUE(RoundTrip(kv11, zero) == kv11);
  const CDataControlCmdBlkNet net = SampleNet();
  EXPECT_TRUE(RoundTrip(net, CDataControlCmdBlkNet{}) == net);
  CDataControlCmdBlkFile file;
  file.nFileCmd = DC_FILE_IMPORT;
  file.szFilePath = L"/home/ann/Tracks/Ostsee 2024.gpx";
  file.nTimeZone = -3600;
  file.tPointStartTime = CovertTimeTToOleDateTime(1714550400);
  file.trackInfo = net.trackInfo;
  EXPECT_TRUE(RoundTrip(file, CDataControlCmdBlkFile{}) == file);
  CDataControlProgressCmdBlk progress{5, L"logger", 0, 1, 1000, 250, 7, 3};
  EXPECT_TRUE(RoundTrip(progress, CDataControlProgressCmdBlk{}) == progress);
  CDataControlConnectionStatus status{4, L"", 61, 2, 1};
  EXPECT_TRUE(RoundTrip(status, CDataControlConnectionStatus{}) == status);
}

TEST(BlockCodec, WhatTheReaderDoesWithMissingShortAndLongValues) {
  // A reply with the header alone leaves every other field zero.
  CPackageBlk header;
  PackBlock(CDataControlCmdBlk{1, L"id", 7}, header);
  CUnpackageBlk h(header.GetPackagePtr(), header.GetPackageSize());
  CDataControlCmdBlkKVDevice device{};
  UnpackBlock(h, device);
  CDataControlCmdBlkKVDevice expected{};
  static_cast<CDataControlCmdBlk&>(expected) = {1, L"id", 7};
  EXPECT_TRUE(device == expected);
  CDataControlCmdBlkNet net;
  UnpackBlock(h, net);
  CDataControlCmdBlkNet emptyNet;
  static_cast<CDataControlCmdBlk&>(emptyNet) = {1, L"id", 7};
  EXPECT_TRUE(net == emptyNet);

  // A device reply without nInterval leaves the options, schedule and security untouched.
  CPackageBlk p;
  detail::PutInt32(p, "nCmdType", 1);
  detail::PutInt32(p, "nDeviceCmd", DC_DEVICE_RESET);
  detail::PutInt32(p, "nVsleep", 99);
  CUnpackageBlk r(p.GetPackagePtr(), p.GetPackageSize());
  CDataControlCmdBlkKVDevice kept = SampleDevice();
  UnpackBlock(r, kept);
  CDataControlCmdBlkKVDevice sample = SampleDevice();
  sample.nDeviceCmd = DC_DEVICE_RESET;  // nVsleep stays: no option is read without nInterval
  EXPECT_TRUE(kept == sample);

  // Values of the wrong size count as absent; flags read from their first byte; texts are cut.
  CPackageBlk odd;
  detail::PutText(odd, "szDeviceId", L"0123456789012345678901234567890123456789");
  odd.Add("nLastError", "\x01\x02", 2);
  detail::PutInt32(odd, "nInterval", 1);
  odd.Add("bDebugMode", "\x00\x01\x00\x00", 4);      // first byte 0: not set
  odd.Add("bCycle", "\x05", 1);                      // a first byte above 0: set, as 1
  odd.Add("bEnableLED", "\x07\x00\x00\x00", 4);      // read as the raw byte
  odd.Add("nVsleep", "\x01\x00\x00\x00\x00", 5);
  CPackageBlk security;
  security.Add("szPassword", "secret", 6);           // shorter than 253: the rest is zero
  security.Add("bOnOff", "\x01", 1);
  odd.Add("gpsSerurity", security);
  detail::PutText(odd, "tPointStartTime", L"");       // empty: no date-time
  detail::PutText(odd, "tPointEndTime", L"yesterday"); // not a date-time: an invalid one
  CUnpackageBlk o(odd.GetPackagePtr(), odd.GetPackageSize());
  CDataControlCmdBlkKVDevice read{};
  read.nLastError = 5;
  read.nVsleep = 6;
  UnpackBlock(o, read);
  EXPECT_EQ(std::wstring(read.szDeviceId), L"01234567890123456789012345678901");
  EXPECT_EQ(read.nLastError, 5);
  EXPECT_EQ(read.nVsleep, 6);
  EXPECT_EQ(read.bDebugMode, 0);
  EXPECT_EQ(read.bCycle, 1);
  EXPECT_EQ(read.bEnableLED, 7);
  EXPECT_EQ(std::string(reinterpret_cast<char*>(read.sSecurity.szPassword)), "secret");
  EXPECT_EQ(read.sSecurity.bOnOff, 1);
  EXPECT_TRUE(read.tPointStartTime == COleDateTime());
  EXPECT_EQ(read.tPointEndTime.GetStatus(), COleDateTime::invalid);

  // KV-11 texts are cut to their capacity and terminated.
  CPackageBlk texts;
  texts.Add("TEL", std::string(40, '7').c_str(), 40);
  texts.Add("PIN", "12345678901234567", 17);
  texts.Add("admin_4", "00491701234567890123", 20);
  texts.Add("IMEI", "35\0garbage", 10);
  texts.Add("GSM_APN", std::string(70, 'a').c_str(), 70);
  CUnpackageBlk t(texts.GetPackagePtr(), texts.GetPackageSize());
  CDataControlCmdBlkKVDevice11 k;
  InitKV11BlockDefaults(k);
  UnpackBlock(t, k);
  EXPECT_EQ(std::string(k.TEL), std::string(31, '7'));
  EXPECT_EQ(std::string(k.PIN), "1234567890123");
  EXPECT_EQ(std::string(k.ADMIN[4].number), "0049170123456789");
  EXPECT_EQ(std::string(k.IMEI), "35");
  EXPECT_EQ(std::string(k.GSM_APN), std::string(64, 'a'));
  EXPECT_EQ(k.SERVER_PORT, 8018);  // absent: the default stays
}

TEST(BlockCodec, ListsBelieveTheirCountOnlyAsFarAsTheEntriesGo) {
  CDataControlCmdBlkNet net;
  CPackageBlk cells;
  detail::PutInt32(cells, "CountCellInfo", 2000000000);
  detail::PutText(cells, "CellInfo_0", L"262-01-1234-5678");
  detail::PutText(cells, "CellInfo_2", L"262-01-1234-5680");  // the second is missing
  detail::PutInt32(cells, "CountGpsInfo", -5);
  CPackageBlk p;
  p.Add("cellinfo", cells);
  CUnpackageBlk u(p.GetPackagePtr(), p.GetPackageSize());
  UnpackBlock(u, net);
  EXPECT_EQ(net.cellInfo.CellInfo,
            (std::vector<CString>{L"262-01-1234-5678", L"", L"262-01-1234-5680", L""}));
  EXPECT_TRUE(net.cellInfo.GpsInfo.empty());
}

TEST(BlockCodec, KV11FormForTheFamilysSettingsOnly) {
  const uint16_t before = g_wDeviceModelID;
  for (uint16_t model : {0, 7, 8, 9, 18, 20, 21, 22, 23}) {
    g_wDeviceModelID = model;
    const bool family = model == 8 || model == 9 || model == 18 || (model >= 20 && model <= 22);
    EXPECT_EQ(IsKV11Model(model), family) << model;
    for (int32_t cmd = 0; cmd <= 9; ++cmd)
      EXPECT_EQ(UsesKV11Block(cmd), family && (cmd == 3 || cmd == 4 || cmd == 8)) << model << " " << cmd;
  }
  g_wDeviceModelID = before;
}

}  // namespace
