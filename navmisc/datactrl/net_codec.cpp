// The packed form of the web-service and file blocks and of the records nested in them.
#include <algorithm>
#include <type_traits>
#include <vector>

#include "navmisc/datactrl/block_codec.h"
#include "navmisc/datactrl/detail/value_codec.h"

namespace navmisc::datactrl {

using namespace detail;

namespace {

// Each record has one Pack and one Unpack; a nested record is a package of its own added under
// its name.

void Pack(const DC_NET_POINT_INFO& r, CPackageBlk& out) {
  PutDateTime(out, "oleTime", r.oleTime);
  PutDouble(out, "dLatitude", r.dLatitude);
  PutDouble(out, "dLongitude", r.dLongitude);
  PutDouble(out, "dAltitude", r.dAltitude);
  PutInt32(out, "nSpeed", r.nSpeed);
  PutInt32(out, "nPushToLog", r.nPushToLog);
}

void Unpack(const CUnpackageBlk& in, DC_NET_POINT_INFO& r) {
  GetDateTime(in, "oleTime", r.oleTime);
  GetDouble(in, "dLatitude", r.dLatitude);
  GetDouble(in, "dLongitude", r.dLongitude);
  GetDouble(in, "dAltitude", r.dAltitude);
  GetInt32(in, "nSpeed", r.nSpeed);
  GetInt32(in, "nPushToLog", r.nPushToLog);
}

void Pack(const DC_NET_POI_INFO& r, CPackageBlk& out) {
  PutText(out, "szPoiId", r.szPoiId);
  PutText(out, "szTrackId", r.szTrackId);
  PutText(out, "szIcon", r.szIcon);
  PutText(out, "szTitle", r.szTitle);
  PutText(out, "szDesc", r.szDesc);
  PutDouble(out, "dLatitude", r.dLatitude);
  PutDouble(out, "dLongitude", r.dLongitude);
  PutDouble(out, "dAltitude", r.dAltitude);
  PutInt32(out, "nSegment", r.nSegment);
  PutDateTime(out, "tTime", r.tTime);
  PutText(out, "sEmbeddedCode", r.sEmbeddedCode);
}

void Unpack(const CUnpackageBlk& in, DC_NET_POI_INFO& r) {
  GetText(in, "szPoiId", r.szPoiId);
  GetText(in, "szTrackId", r.szTrackId);
  GetText(in, "szIcon", r.szIcon);
  GetText(in, "szTitle", r.szTitle);
  GetText(in, "szDesc", r.szDesc);
  GetDouble(in, "dLatitude", r.dLatitude);
  GetDouble(in, "dLongitude", r.dLongitude);
  GetDouble(in, "dAltitude", r.dAltitude);
  GetInt32(in, "nSegment", r.nSegment);
  GetDateTime(in, "tTime", r.tTime);
  GetText(in, "sEmbeddedCode", r.sEmbeddedCode);
}

void Pack(const DC_NET_THUMB_INFO& r, CPackageBlk& out) {
  PutText(out, "szDownloadURL", r.szDownloadURL);
  for (int i = 0; i < kNetThumbCount; ++i) {
    PutText(out, NumberedName("szURL_%d", i), r.thumbs[i].szURL);
    PutUInt32(out, NumberedName("dwSize_%d", i), r.thumbs[i].dwSize);
  }
}

void Unpack(const CUnpackageBlk& in, DC_NET_THUMB_INFO& r) {
  GetText(in, "szDownloadURL", r.szDownloadURL);
  for (int i = 0; i < kNetThumbCount; ++i) {
    GetText(in, NumberedName("szURL_%d", i), r.thumbs[i].szURL);
    GetUInt32(in, NumberedName("dwSize_%d", i), r.thumbs[i].dwSize);
  }
}

void Pack(const DC_NET_PHOTO_INFO& r, CPackageBlk& out) {
  PutText(out, "szPhotoId", r.szPhotoId);
  PutText(out, "szOwnerId", r.szOwnerId);
  PutText(out, "szTrackId", r.szTrackId);
  PutText(out, "szTrackPhotoId", r.szTrackPhotoId);
  PutText(out, "szName", r.szName);
  PutText(out, "szAuthKey", r.szAuthKey);
  PutText(out, "szType", r.szType);
  PutText(out, "szFilePath", r.szFilePath);
  PutText(out, "szTitle", r.szTitle);
  PutText(out, "szDesc", r.szDesc);
  PutText(out, "szIcon", r.szIcon);
  PutDateTime(out, "time", r.time);
  PutFlag(out, "bListed", r.bListed);
  PutInt32(out, "nSegment", r.nSegment);
  PutUInt32(out, "dwSize", r.dwSize);
  PutInt32(out, "nWidth", r.nWidth);
  PutInt32(out, "nHeight", r.nHeight);
  PutUInt32(out, "nFlags", r.nFlags);
  PutDouble(out, "dLat", r.dLat);
  PutDouble(out, "dLong", r.dLong);
  PutDouble(out, "dAlt", r.dAlt);
  CPackageBlk thumbs;
  Pack(r.thumbInfo, thumbs);
  out.Add("thumbInfo", thumbs);
}

void Unpack(const CUnpackageBlk& in, DC_NET_PHOTO_INFO& r) {
  GetText(in, "szPhotoId", r.szPhotoId);
  GetText(in, "szOwnerId", r.szOwnerId);
  GetText(in, "szTrackId", r.szTrackId);
  GetText(in, "szTrackPhotoId", r.szTrackPhotoId);
  GetText(in, "szName", r.szName);
  GetText(in, "szAuthKey", r.szAuthKey);
  GetText(in, "szType", r.szType);
  GetText(in, "szFilePath", r.szFilePath);
  GetText(in, "szTitle", r.szTitle);
  GetText(in, "szDesc", r.szDesc);
  GetText(in, "szIcon", r.szIcon);
  GetDateTime(in, "time", r.time);
  GetFirstByte(in, "bListed", r.bListed);
  GetInt32(in, "nSegment", r.nSegment);
  GetUInt32(in, "dwSize", r.dwSize);
  GetInt32(in, "nWidth", r.nWidth);
  GetInt32(in, "nHeight", r.nHeight);
  GetUInt32(in, "nFlags", r.nFlags);
  GetDouble(in, "dLat", r.dLat);
  GetDouble(in, "dLong", r.dLong);
  GetDouble(in, "dAlt", r.dAlt);
  CUnpackageBlk thumbs;
  if (GetNested(in, "thumbInfo", thumbs)) Unpack(thumbs, r.thumbInfo);
}

void Pack(const DC_NET_TAG_ITEM& r, CPackageBlk& out) {
  PutText(out, "sTagId", r.sTagId);
  PutText(out, "sDisplayName", r.sDisplayName);
  PutInt32(out, "count", r.count);
}

void Unpack(const CUnpackageBlk& in, DC_NET_TAG_ITEM& r) {
  GetText(in, "sTagId", r.sTagId);
  GetText(in, "sDisplayName", r.sDisplayName);
  GetInt32(in, "count", r.count);
}

void PackNested(const char* name, const DC_NET_POINT_INFO& r, CPackageBlk& out) {
  CPackageBlk nested;
  Pack(r, nested);
  out.Add(name, nested);
}

void UnpackNested(const CUnpackageBlk& in, const char* name, DC_NET_POINT_INFO& r) {
  CUnpackageBlk nested;
  if (GetNested(in, name, nested)) Unpack(nested, r);
}

// A list: its count under `countName`, then entry i under `entryFormat` with i from 0, each a
// nested package (or, for texts, the text itself).
template <class T>
void PackList(const std::vector<T>& list, const char* countName, const char* entryFormat,
              CPackageBlk& out) {
  PutInt32(out, countName, static_cast<int32_t>(list.size()));
  for (size_t i = 0; i < list.size(); ++i) {
    if constexpr (std::is_same_v<T, CString>) {
      PutText(out, NumberedName(entryFormat, static_cast<int>(i)), list[i]);
    } else {
      CPackageBlk entry;
      Pack(list[i], entry);
      out.Add(NumberedName(entryFormat, static_cast<int>(i)), entry);
    }
  }
}

// Reads a list. The count is believed only as far as the package holds entries (a count of a
// billion in a small package costs nothing); a missing or malformed entry keeps its place as an
// empty record, so later entries keep their positions.
template <class T>
void UnpackList(const CUnpackageBlk& in, const char* countName, const char* entryFormat,
                std::vector<T>& list) {
  int32_t count = 0;
  if (!GetInt32(in, countName, count) || count <= 0) return;
  const uint32_t n = std::min<uint32_t>(static_cast<uint32_t>(count), in.GetCount());
  list.assign(n, T{});
  for (uint32_t i = 0; i < n; ++i) {
    const NumberedName name(entryFormat, static_cast<int>(i));
    if constexpr (std::is_same_v<T, CString>) {
      GetText(in, name, list[i]);
    } else {
      CUnpackageBlk entry;
      if (GetNested(in, name, entry)) Unpack(entry, list[i]);
    }
  }
}

void Pack(const DC_NET_TRACK_INFO& r, CPackageBlk& out) {
  PutText(out, "szTrackId", r.szTrackId);
  PutText(out, "szOwnerId", r.szOwnerId);
  PutText(out, "szSubject", r.szSubject);
  PutText(out, "szAuthKey", r.szAuthKey);
  PutText(out, "szTag", r.szTag);
  PutText(out, "szURL", r.szURL);
  PutFlag(out, "bListed", r.bListed);
  PutInt32(out, "nMode", r.nMode);
  PutInt32(out, "lTimeZone", r.lTimeZone);
  PutInt32(out, "nStyle", r.nStyle);
  PutInt32(out, "nPageId", r.nPageId);
  PutDateTime(out, "tUploadTime", r.tUploadTime);
  PackList(r.ptrPtList, "ptrPtList_Count", "ptrPtList_%d", out);
  PackList(r.ptrPOIList, "ptrPOIList_Count", "ptrPOIList_%d", out);
  PutText(out, "szMetaInfo", r.szMetaInfo);
  PutText(out, "szDesc", r.szDesc);
  PutText(out, "szModelId", r.szModelId);
  PutText(out, "szLang", r.szLang);
  PutText(out, "szTrackData", r.szTrackData);
  PutText(out, "szTimeZone", r.szTimeZone);
  PackNested("ptStart", r.ptStart, out);
  PackNested("ptEnd", r.ptEnd, out);
  PutInt32(out, "nCoverId", r.nCoverId);
}

void Unpack(const CUnpackageBlk& in, DC_NET_TRACK_INFO& r) {
  GetText(in, "szTrackId", r.szTrackId);
  GetText(in, "szOwnerId", r.szOwnerId);
  GetText(in, "szSubject", r.szSubject);
  GetText(in, "szAuthKey", r.szAuthKey);
  GetText(in, "szTag", r.szTag);
  GetText(in, "szURL", r.szURL);
  GetFirstByte(in, "bListed", r.bListed);
  GetInt32(in, "nMode", r.nMode);
  GetInt32(in, "lTimeZone", r.lTimeZone);
  GetInt32(in, "nStyle", r.nStyle);
  GetInt32(in, "nPageId", r.nPageId);
  GetDateTime(in, "tUploadTime", r.tUploadTime);
  UnpackList(in, "ptrPtList_Count", "ptrPtList_%d", r.ptrPtList);
  UnpackList(in, "ptrPOIList_Count", "ptrPOIList_%d", r.ptrPOIList);
  GetText(in, "szMetaInfo", r.szMetaInfo);
  GetText(in, "szDesc", r.szDesc);
  GetText(in, "szModelId", r.szModelId);
  GetText(in, "szLang", r.szLang);
  GetText(in, "szTrackData", r.szTrackData);
  GetText(in, "szTimeZone", r.szTimeZone);
  UnpackNested(in, "ptStart", r.ptStart);
  UnpackNested(in, "ptEnd", r.ptEnd);
  GetInt32(in, "nCoverId", r.nCoverId);
}

void PackTrack(const DC_NET_TRACK_INFO& track, CPackageBlk& out) {
  CPackageBlk nested;
  Pack(track, nested);
  out.Add("trackinfo", nested);
}

void UnpackTrack(const CUnpackageBlk& in, DC_NET_TRACK_INFO& track) {
  CUnpackageBlk nested;
  if (GetNested(in, "trackinfo", nested)) Unpack(nested, track);
}

}  // namespace

void PackBlock(const CDataControlCmdBlkNet& b, CPackageBlk& out) {
  PackBlock(static_cast<const CDataControlCmdBlk&>(b), out);
  PutInt32(out, "nNetCmd", b.nNetCmd);

  CPackageBlk user;
  PutText(user, "szUid", b.userInfo.szUid);
  PutText(user, "szOwnerId", b.userInfo.szOwnerId);
  PutText(user, "szToken", b.userInfo.szToken);
  PutText(user, "szUserName", b.userInfo.szUserName);
  PutText(user, "szPassword", b.userInfo.szPassword);
  PutText(user, "szDisplayName", b.userInfo.szDisplayName);
  out.Add("userinfo", user);

  PackTrack(b.trackInfo, out);

  CPackageBlk photos;
  PackList(b.photoInfo, "ptrPhotoList_Count", "ptrPhotoList_%d", photos);
  out.Add("photoinfo", photos);

  CPackageBlk file;
  PutText(file, "sTrackId", b.fileInfo.sTrackId);
  PutText(file, "sName", b.fileInfo.sName);
  PutText(file, "sType", b.fileInfo.sType);
  PutText(file, "sFilePath", b.fileInfo.sFilePath);
  PutInt32(file, "nWidth", b.fileInfo.nWidth);
  PutInt32(file, "nHeight", b.fileInfo.nHeight);
  out.Add("fileinfo", file);

  CPackageBlk tags;
  PutText(tags, "Tag_Lang", b.tagInfo.Tag_Lang);
  PackList(b.tagInfo.lstTag, "Tag_Count", "lstTag_%d", tags);
  out.Add("taginfo", tags);

  CPackageBlk cells;
  PackList(b.cellInfo.CellInfo, "CountCellInfo", "CellInfo_%d", cells);
  PackList(b.cellInfo.GpsInfo, "CountGpsInfo", "GpsInfo_%d", cells);
  out.Add("cellinfo", cells);

  PutDateTime(out, "tPointStartTime", b.tPointStartTime);
  PutDateTime(out, "tPointEndTime", b.tPointEndTime);
}

void UnpackBlock(const CUnpackageBlk& in, CDataControlCmdBlkNet& b) {
  UnpackHeader(in, b);
  GetInt32(in, "nNetCmd", b.nNetCmd);
  CUnpackageBlk nested;
  if (GetNested(in, "userinfo", nested)) {
    GetText(nested, "szUid", b.userInfo.szUid);
    GetText(nested, "szOwnerId", b.userInfo.szOwnerId);
    GetText(nested, "szToken", b.userInfo.szToken);
    GetText(nested, "szUserName", b.userInfo.szUserName);
    GetText(nested, "szPassword", b.userInfo.szPassword);
    GetText(nested, "szDisplayName", b.userInfo.szDisplayName);
  }
  UnpackTrack(in, b.trackInfo);
  if (GetNested(in, "photoinfo", nested))
    UnpackList(nested, "ptrPhotoList_Count", "ptrPhotoList_%d", b.photoInfo);
  if (GetNested(in, "fileinfo", nested)) {
    GetText(nested, "sTrackId", b.fileInfo.sTrackId);
    GetText(nested, "sName", b.fileInfo.sName);
    GetText(nested, "sType", b.fileInfo.sType);
    GetText(nested, "sFilePath", b.fileInfo.sFilePath);
    GetInt32(nested, "nWidth", b.fileInfo.nWidth);
    GetInt32(nested, "nHeight", b.fileInfo.nHeight);
  }
  if (GetNested(in, "taginfo", nested)) {
    GetText(nested, "Tag_Lang", b.tagInfo.Tag_Lang);
    UnpackList(nested, "Tag_Count", "lstTag_%d", b.tagInfo.lstTag);
  }
  if (GetNested(in, "cellinfo", nested)) {
    UnpackList(nested, "CountCellInfo", "CellInfo_%d", b.cellInfo.CellInfo);
    UnpackList(nested, "CountGpsInfo", "GpsInfo_%d", b.cellInfo.GpsInfo);
  }
  GetDateTime(in, "tPointStartTime", b.tPointStartTime);
  GetDateTime(in, "tPointEndTime", b.tPointEndTime);
}

void PackBlock(const CDataControlCmdBlkFile& b, CPackageBlk& out) {
  PackBlock(static_cast<const CDataControlCmdBlk&>(b), out);
  PutInt32(out, "nFileCmd", b.nFileCmd);
  PutText(out, "szFilePath", b.szFilePath);
  PutDateTime(out, "tPointStartTime", b.tPointStartTime);
  PutDateTime(out, "tPointEndTime", b.tPointEndTime);
  PutInt32(out, "nTimeZone", b.nTimeZone);
  PackTrack(b.trackInfo, out);
}

void UnpackBlock(const CUnpackageBlk& in, CDataControlCmdBlkFile& b) {
  UnpackHeader(in, b);
  GetInt32(in, "nFileCmd", b.nFileCmd);
  GetText(in, "szFilePath", b.szFilePath);
  GetDateTime(in, "tPointStartTime", b.tPointStartTime);
  GetDateTime(in, "tPointEndTime", b.tPointEndTime);
  GetInt32(in, "nTimeZone", b.nTimeZone);
  UnpackTrack(in, b.trackInfo);
}

}  // namespace navmisc::datactrl
