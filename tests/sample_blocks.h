// Blocks of every kind with every field set, for the channel's tests.
#pragma once

#include <cstring>

#include "navmisc/datactrl/cmd_blocks.h"

namespace navmisc::datactrl::testing {

// 2024-05-01T08:30:15Z and 2024-05-01T10:00:00Z.
constexpr long kStart = 1714552215;
constexpr long kEnd = 1714557600;

inline CDataControlCmdBlkKVDevice SampleDevice() {
  CDataControlCmdBlkKVDevice b;
  InitDeviceBlockDefaults(b);
  std::wcscpy(b.szDeviceId, L"dv");
  b.nDeviceCmd = DC_DEVICE_WRITE_SETTING;
  b.nInterval = 15;
  b.nVelocity_Scale = -2;
  b.nVsleep = 30;
  b.bDebugMode = 1;
  b.bDualMode = 1;
  b.bEnableLED = 1;
  b.bEnableButton = 1;
  b.bAccOn = 0;
  b.sSchedule.tDestStartScheduleTimeUTC = CovertTimeTToOleDateTime(kStart - 86400);
  for (int i = 0; i < kKVMinutesPerWeek; ++i) b.sSchedule.bTimeTable[i] = static_cast<uint8_t>(i % 3 == 0);
  b.sSecurity.cVersion = 3;
  b.sSecurity.bOnOff = 1;
  std::memcpy(b.sSecurity.szPassword, "pass\xC3\xA9", 6);
  b.tPointStartTime = CovertTimeTToOleDateTime(kStart);
  b.tPointEndTime = CovertTimeTToOleDateTime(kEnd);
  return b;
}

inline CDataControlCmdBlkKVDevice11 SampleKV11() {
  CDataControlCmdBlkKVDevice11 b;
  InitKV11BlockDefaults(b);
  std::wcscpy(b.szDeviceId, L"kv11");
  b.nDeviceCmd = DC_DEVICE_WRITE_SETTING;
  std::memset(b.DEVICE_ID, 'D', sizeof b.DEVICE_ID);  // all 32 bytes, no terminator
  std::strcpy(b.NAME, "Anns Tracker");
  std::strcpy(b.GSM_APN, "internet.example");
  b.CTRL_FLAG = 0x1234;
  b.LANGUAGE = 2;
  b.ICON = 5;
  std::strcpy(b.TEL, "+491701234567");
  std::strcpy(b.PIN, "1234");
  std::strcpy(b.IMEI, "356938035643809");
  std::strcpy(b.SERVER_IP_ADDRESS, "192.0.2.7");
  for (int i = 0; i < 5; ++i) {
    b.ADMIN[i].number[0] = static_cast<char>('1' + i);
    b.ADMIN[i].flag = static_cast<uint16_t>(i + 1);
  }
  for (int i = 0; i < 3; ++i) b.VOLUME[i] = {i, i + 1, i + 2, -i};
  for (int i = 0; i < 10; ++i) b.AREA[i] = {511234567 + i, 73456789 - i, -i, i * 1000, 0u - 1u};
  b.NOTIFY_VOLTAGE = 0x21;
  b.SHUTDOWN_VOLTAGE = 0x1E;
  for (int i = 0; i < 28800; ++i) b.NAVI[i] = static_cast<uint8_t>(i * 7);
  b.THRESH_ACT = 16;
  b.THRESH_INACT = 4;
  b.THRESH_FF = 9;
  b.TIME_FF = 2;
  return b;
}

inline DC_NET_POINT_INFO SamplePoint(int i) {
  DC_NET_POINT_INFO p;
  p.oleTime = CovertTimeTToOleDateTime(kStart + 5 * i);
  p.dLatitude = 54.3233 + i * 1e-5;
  p.dLongitude = 10.1228 - i * 1e-5;
  p.dAltitude = -1.5 + i;
  p.nSpeed = 18000 + i;
  p.nPushToLog = i;
  return p;
}

inline CDataControlCmdBlkNet SampleNet() {
  CDataControlCmdBlkNet b;
  std::wcscpy(b.szDeviceId, L"net");
  b.nNetCmd = 4;
  b.userInfo = {L"u1", L"o1", L"token", L"ann", L"geheim", L"Ann \U0001F6B2"};
  DC_NET_TRACK_INFO& t = b.trackInfo;
  t.szTrackId = L"TK_0000000100000002";
  t.szOwnerId = L"o1";
  t.szSubject = L"Kieler Förde";
  t.szAuthKey = L"k";
  t.szTag = L"sea";
  t.szURL = L"https://example.org/t/1";
  t.bListed = 1;
  t.nMode = 2;
  t.lTimeZone = 7200;
  t.nStyle = 3;
  t.nPageId = 44;
  t.tUploadTime = CovertTimeTToOleDateTime(kEnd);
  t.ptrPtList = {SamplePoint(0), SamplePoint(1)};
  DC_NET_POI_INFO poi;
  poi.szPoiId = L"p";
  poi.szTrackId = t.szTrackId;
  poi.szIcon = L"flag";
  poi.szTitle = L"Pier";
  poi.szDesc = L"line 1\nline 2";
  poi.dLatitude = 54.1;
  poi.dLongitude = 10.2;
  poi.dAltitude = 3;
  poi.nSegment = 1;
  poi.tTime = CovertTimeTToOleDateTime(kStart + 60);
  poi.sEmbeddedCode = L"<b>x</b>";
  t.ptrPOIList = {poi};
  t.szMetaInfo = L"meta";
  t.szDesc = L"desc";
  t.szModelId = L"8";
  t.szLang = L"DEU";
  t.szTrackData = std::wstring(3000, L'x');
  t.szTimeZone = L"Europe/Berlin";
  t.ptStart = SamplePoint(0);
  t.ptEnd = SamplePoint(1);
  t.nCoverId = 12;
  DC_NET_PHOTO_INFO photo;
  photo.szPhotoId = L"PH_1";
  photo.szOwnerId = L"o1";
  photo.szTrackId = t.szTrackId;
  photo.szTrackPhotoId = L"tp";
  photo.szName = L"pier.jpg";
  photo.szAuthKey = L"a";
  photo.szType = L"image/jpeg";
  photo.szFilePath = L"/home/ann/Bilder/pier.jpg";
  photo.szTitle = L"Pier";
  photo.szDesc = L"";
  photo.szIcon = L"cam";
  photo.time = CovertTimeTToOleDateTime(kStart + 120);
  photo.bListed = 1;
  photo.nSegment = 0;
  photo.dwSize = 3000000000u;
  photo.nWidth = 4000;
  photo.nHeight = 3000;
  photo.nFlags = 5;
  photo.dLat = 54.2;
  photo.dLong = 10.3;
  photo.dAlt = 4.25;
  photo.thumbInfo.szDownloadURL = L"https://example.org/p/1";
  for (int i = 0; i < kNetThumbCount; ++i)
    photo.thumbInfo.thumbs[i] = {L"https://example.org/p/1/" + std::to_wstring(i), 100u * (i + 1)};
  b.photoInfo = {photo};
  b.fileInfo = {L"TK_1", L"notes.html", L"html", L"/tmp/notes.html", 640, 480};
  b.tagInfo.Tag_Lang = L"ENG";
  b.tagInfo.lstTag = {{L"t1", L"Cycling", 3}};
  b.cellInfo.CellInfo = {L"262-01-1234-5678", L"262-01-1234-5679"};
  b.cellInfo.GpsInfo = {L"54.32,10.12"};
  b.tPointStartTime = CovertTimeTToOleDateTime(kStart);
  b.tPointEndTime = CovertTimeTToOleDateTime(kEnd);
  return b;
}

}  // namespace navmisc::datactrl::testing
