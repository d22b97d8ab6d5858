// The packed form of the web-service and file blocks and of the records nested in them. Each
// record lists its fields once, in package order (Fields below); packing and unpacking are two
// visitors over that one list, so the two directions cannot drift apart.
#include <algorithm>
#include <type_traits>
#include <vector>

#include "navmisc/datactrl/block_codec.h"
#include "navmisc/datactrl/detail/value_codec.h"

namespace navmisc::datactrl {

using namespace detail;

namespace {

template <class R, class T>
constexpr bool kIs = std::is_same_v<std::remove_const_t<R>, T>;

// A list in the package: its count under `count`, entry i under `entry` with i from 0.
template <class V>
struct List {
  const char* count;
  const char* entry;
  V& items;  // a std::vector of records or of texts, const when packing
};
template <class V>
List(const char*, const char*, V&) -> List<V>;

// Fields of each record, in package order. `R` is the record, const for packing; `v` is called
// with a name and a field, or with a List.
template <class R, class Visit>
  requires kIs<R, DC_NET_POINT_INFO>
void Fields(R& r, Visit&& v) {
  v("oleTime", r.oleTime);
  v("dLatitude", r.dLatitude);
  v("dLongitude", r.dLongitude);
  v("dAltitude", r.dAltitude);
  v("nSpeed", r.nSpeed);
  v("nPushToLog", r.nPushToLog);
}

template <class R, class Visit>
  requires kIs<R, DC_NET_POI_INFO>
void Fields(R& r, Visit&& v) {
  v("szPoiId", r.szPoiId);
  v("szTrackId", r.szTrackId);
  v("szIcon", r.szIcon);
  v("szTitle", r.szTitle);
  v("szDesc", r.szDesc);
  v("dLatitude", r.dLatitude);
  v("dLongitude", r.dLongitude);
  v("dAltitude", r.dAltitude);
  v("nSegment", r.nSegment);
  v("tTime", r.tTime);
  v("sEmbeddedCode", r.sEmbeddedCode);
}

template <class R, class Visit>
  requires kIs<R, DC_NET_TRACK_INFO>
void Fields(R& r, Visit&& v) {
  v("szTrackId", r.szTrackId);
  v("szOwnerId", r.szOwnerId);
  v("szSubject", r.szSubject);
  v("szAuthKey", r.szAuthKey);
  v("szTag", r.szTag);
  v("szURL", r.szURL);
  v("bListed", r.bListed);
  v("nMode", r.nMode);
  v("lTimeZone", r.lTimeZone);
  v("nStyle", r.nStyle);
  v("nPageId", r.nPageId);
  v("tUploadTime", r.tUploadTime);
  v(List{"ptrPtList_Count", "ptrPtList_%d", r.ptrPtList});
  v(List{"ptrPOIList_Count", "ptrPOIList_%d", r.ptrPOIList});
  v("szMetaInfo", r.szMetaInfo);
  v("szDesc", r.szDesc);
  v("szModelId", r.szModelId);
  v("szLang", r.szLang);
  v("szTrackData", r.szTrackData);
  v("szTimeZone", r.szTimeZone);
  v("ptStart", r.ptStart);
  v("ptEnd", r.ptEnd);
  v("nCoverId", r.nCoverId);
}

template <class R, class Visit>
  requires kIs<R, DC_NET_THUMB_INFO>
void Fields(R& r, Visit&& v) {
  v("szDownloadURL", r.szDownloadURL);
  for (int i = 0; i < kNetThumbCount; ++i) {
    v(NumberedName("szURL_%d", i), r.thumbs[i].szURL);
    v(NumberedName("dwSize_%d", i), r.thumbs[i].dwSize);
  }
}

template <class R, class Visit>
  requires kIs<R, DC_NET_PHOTO_INFO>
void Fields(R& r, Visit&& v) {
  v("szPhotoId", r.szPhotoId);
  v("szOwnerId", r.szOwnerId);
  v("szTrackId", r.szTrackId);
  v("szTrackPhotoId", r.szTrackPhotoId);
  v("szName", r.szName);
  v("szAuthKey", r.szAuthKey);
  v("szType", r.szType);
  v("szFilePath", r.szFilePath);
  v("szTitle", r.szTitle);
  v("szDesc", r.szDesc);
  v("szIcon", r.szIcon);
  v("time", r.time);
  v("bListed", r.bListed);
  v("nSegment", r.nSegment);
  v("dwSize", r.dwSize);
  v("nWidth", r.nWidth);
  v("nHeight", r.nHeight);
  v("nFlags", r.nFlags);
  v("dLat", r.dLat);
  v("dLong", r.dLong);
  v("dAlt", r.dAlt);
  v("thumbInfo", r.thumbInfo);
}

template <class R, class Visit>
  requires kIs<R, DC_NET_USER_INFO>
void Fields(R& r, Visit&& v) {
  v("szUid", r.szUid);
  v("szOwnerId", r.szOwnerId);
  v("szToken", r.szToken);
  v("szUserName", r.szUserName);
  v("szPassword", r.szPassword);
  v("szDisplayName", r.szDisplayName);
}

template <class R, class Visit>
  requires kIs<R, DC_NET_FILE_INFO>
void Fields(R& r, Visit&& v) {
  v("sTrackId", r.sTrackId);
  v("sName", r.sName);
  v("sType", r.sType);
  v("sFilePath", r.sFilePath);
  v("nWidth", r.nWidth);
  v("nHeight", r.nHeight);
}

template <class R, class Visit>
  requires kIs<R, DC_NET_TAG_ITEM>
void Fields(R& r, Visit&& v) {
  v("sTagId", r.sTagId);
  v("sDisplayName", r.sDisplayName);
  v("count", r.count);
}

template <class R, class Visit>
  requires kIs<R, DC_NET_TAG_INFO>
void Fields(R& r, Visit&& v) {
  v("Tag_Lang", r.Tag_Lang);
  v(List{"Tag_Count", "lstTag_%d", r.lstTag});
}

template <class R, class Visit>
  requires kIs<R, DC_NET_CELL_INFO>
void Fields(R& r, Visit&& v) {
  v(List{"CountCellInfo", "CellInfo_%d", r.CellInfo});
  v(List{"CountGpsInfo", "GpsInfo_%d", r.GpsInfo});
}

// The photo list sits in a package of its own.
template <class Photos>
struct PhotoInfo {
  Photos& photos;
};
template <class R, class Visit>
  requires kIs<R, PhotoInfo<const std::vector<DC_NET_PHOTO_INFO>>> ||
           kIs<R, PhotoInfo<std::vector<DC_NET_PHOTO_INFO>>>
void Fields(R& r, Visit&& v) {
  v(List{"ptrPhotoList_Count", "ptrPhotoList_%d", r.photos});
}

// The web-service and file blocks after their header.
template <class R, class Visit>
  requires kIs<R, CDataControlCmdBlkNet>
void Fields(R& b, Visit&& v) {
  v("nNetCmd", b.nNetCmd);
  v("userinfo", b.userInfo);
  v("trackinfo", b.trackInfo);
  auto photos = PhotoInfo<std::remove_reference_t<decltype((b.photoInfo))>>{b.photoInfo};
  v("photoinfo", photos);
  v("fileinfo", b.fileInfo);
  v("taginfo", b.tagInfo);
  v("cellinfo", b.cellInfo);
  v("tPointStartTime", b.tPointStartTime);
  v("tPointEndTime", b.tPointEndTime);
}

template <class R, class Visit>
  requires kIs<R, CDataControlCmdBlkFile>
void Fields(R& b, Visit&& v) {
  v("nFileCmd", b.nFileCmd);
  v("szFilePath", b.szFilePath);
  v("tPointStartTime", b.tPointStartTime);
  v("tPointEndTime", b.tPointEndTime);
  v("nTimeZone", b.nTimeZone);
  v("trackinfo", b.trackInfo);
}

// Writes each field in its encoding; a record becomes a nested package.
struct Packer {
  CPackageBlk& out;

  void operator()(const char* name, const CString& text) const { PutText(out, name, text); }
  void operator()(const char* name, const COleDateTime& time) const { PutDateTime(out, name, time); }
  void operator()(const char* name, double value) const { PutDouble(out, name, value); }
  void operator()(const char* name, int32_t value) const { PutInt32(out, name, value); }
  void operator()(const char* name, uint32_t value) const { PutUInt32(out, name, value); }
  void operator()(const char* name, uint8_t flag) const { PutFlag(out, name, flag); }
  template <class Record>
  void operator()(const char* name, const Record& record) const {
    CPackageBlk nested;
    Fields(record, Packer{nested});
    out.Add(name, nested);
  }
  template <class V>
  void operator()(const List<V>& list) const {
    PutInt32(out, list.count, static_cast<int32_t>(list.items.size()));
    for (size_t i = 0; i < list.items.size(); ++i)
      (*this)(NumberedName(list.entry, static_cast<int>(i)), list.items[i]);
  }
};

// Reads each field that is present; a record from its nested package.
struct Unpacker {
  const CUnpackageBlk& in;

  void operator()(const char* name, CString& text) const { GetText(in, name, text); }
  void operator()(const char* name, COleDateTime& time) const { GetDateTime(in, name, time); }
  void operator()(const char* name, double& value) const { GetDouble(in, name, value); }
  void operator()(const char* name, int32_t& value) const { GetInt32(in, name, value); }
  void operator()(const char* name, uint32_t& value) const { GetUInt32(in, name, value); }
  void operator()(const char* name, uint8_t& flag) const { GetFirstByte(in, name, flag); }
  template <class Record>
  void operator()(const char* name, Record& record) const {
    CUnpackageBlk nested;
    if (GetNested(in, name, nested)) Fields(record, Unpacker{nested});
  }
  // The count is believed only as far as the package holds entries (a count of a billion in a
  // small package costs nothing); a missing or malformed entry keeps its place as an empty
  // record, so later entries keep their positions.
  template <class V>
  void operator()(const List<V>& list) const {
    int32_t count = 0;
    if (!GetInt32(in, list.count, count) || count <= 0) return;
    const uint32_t n = std::min<uint32_t>(static_cast<uint32_t>(count), in.GetCount());
    list.items.assign(n, typename V::value_type{});
    for (uint32_t i = 0; i < n; ++i) (*this)(NumberedName(list.entry, static_cast<int>(i)), list.items[i]);
  }
};

}  // namespace

void PackBlock(const CDataControlCmdBlkNet& b, CPackageBlk& out) {
  PackBlock(static_cast<const CDataControlCmdBlk&>(b), out);
  Fields(b, Packer{out});
}

void UnpackBlock(const CUnpackageBlk& in, CDataControlCmdBlkNet& b) {
  UnpackHeader(in, b);
  Fields(b, Unpacker{in});
}

void PackBlock(const CDataControlCmdBlkFile& b, CPackageBlk& out) {
  PackBlock(static_cast<const CDataControlCmdBlk&>(b), out);
  Fields(b, Packer{out});
}

void UnpackBlock(const CUnpackageBlk& in, CDataControlCmdBlkFile& b) {
  UnpackHeader(in, b);
  Fields(b, Unpacker{in});
}

}  // namespace navmisc::datactrl
