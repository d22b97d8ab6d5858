#include "navmisc/records/photo.h"

#include "navmisc/platform/datetime.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/settings.h"
#include "navmisc/platform/unique_id.h"
#include "navmisc/records/photo_keys.h"
#include "navmisc/records/trip.h"

namespace k = navmisc::photo_keys;

namespace {

CString Key(const wchar_t* pattern, int n) { return FormatString(pattern, n); }

// Copies one of the photo's files between two trip folders when it exists.
void CopyPhotoFile(const CString& fromFolder, const CString& toFolder, const wchar_t* sub,
                   const CString& name) {
  CString from = sub ? PathJoin(PathJoin(fromFolder, sub), name) : PathJoin(fromFolder, name);
  CString to = sub ? PathJoin(PathJoin(toFolder, sub), name) : PathJoin(toFolder, name);
  if (FileExists(from)) CopyFile(from, to, false);
}

}  // namespace

CString NewItemId(const wchar_t* prefix) {
  const unsigned long now = static_cast<unsigned long>(GetCurDateTime());
  return FormatString(L"%s%08X%08X", prefix, static_cast<unsigned>(now), GetUniqueID());
}

PHOTO_ITEM_INFO::PHOTO_ITEM_INFO(BLOG_ITEM_INFO* owner, const wchar_t*, const wchar_t*,
                                 const wchar_t*)
    : trip(owner), photoId(NewItemId(L"PH_")) {}

PHOTO_ITEM_INFO::PHOTO_ITEM_INFO(BLOG_ITEM_INFO* owner, PHOTO_ITEM_INFO* from) {
  if (from) *this = *from;
  trip = owner;
  photoId = NewItemId(L"PH_");
  if (!from) return;
  trackItemId.Empty();
  if (owner) {
    if (const wchar_t* id = owner->_GetAssociateTrackID(from)) trackItemId = id;
  }
  if (owner && from->trip && IsPlainPathComponent(itemName)) {
    const CString src = from->trip->GetResourcePath();
    const CString dst = owner->GetResourcePath();
    CopyPhotoFile(src, dst, nullptr, itemName);
    CopyPhotoFile(src, dst, L"Thumbnail", itemName);
    CopyPhotoFile(src, dst, L"MiddleImg", itemName);
  }
}

void PHOTO_ITEM_INFO::WriteInfo(unsigned long h, const wchar_t* s, int write, int* counter) {
  if (write) {
    WR_STRING(h, s, k::kItemName, itemName);
    WR_STRING(h, s, k::kOriginalName, originalName);
    WR_STRING(h, s, k::kItemId, photoId);
    WR_INT(h, s, k::kWidth, width);
    WR_INT(h, s, k::kHeight, height);
    WR_INT(h, s, k::kOriginalWidth, originalWidth);
    WR_INT(h, s, k::kOriginalHeight, originalHeight);
    WR_INT(h, s, k::kDataType, dataType);
    WR_STRING(h, s, k::kTitle, title);
    WR_STRING(h, s, k::kDescription, description);
    WR_STRING(h, s, k::kEmbedded, embedded);
    WR_STRING(h, s, k::kMarkerIconId, markerIconId);
    WR_FLOAT(h, s, k::kLatitude, latitude);
    WR_FLOAT(h, s, k::kLongitude, longitude);
    WR_FLOAT(h, s, k::kAltitude, altitude);
    WR_INT(h, s, k::kSpeed, speed);
    WR_STRING(h, s, k::kTrackItemId, trackItemId);
    WR_INT(h, s, k::kPlaybackTime, playbackTime);
    WR_INT(h, s, k::kOriginalTime, originalTime);
    WR_INT(h, s, k::kNetDirty, url.dirty ? 1 : 0);
    WR_INT(h, s, k::kPublic, url.isPublic ? 1 : 0);
    WR_STRING(h, s, k::kServerId, url.serverId);
    for (int i = 0; i < 5; ++i) WR_STRING(h, s, Key(k::kNetUrl, i), url.url[i]);
    for (int i = 0; i < 5; ++i) WR_INT(h, s, Key(k::kDimensionW, i), url.width[i]);
    WR_INT(h, s, k::kDimensionH0Written, url.height[0]);
    for (int i = 1; i < 5; ++i) WR_INT(h, s, Key(k::kDimensionH, i), url.height[i]);
    WR_INT(h, s, k::k2ndDirty, url.dirty2 ? 1 : 0);
    WR_INT(h, s, k::k2ndPublic, url.isPublic2 ? 1 : 0);
    WR_INT(h, s, k::k2ndServer, url.server2);
    WR_STRING(h, s, k::k2ndServerId, url.serverId2);
    for (int i = 0; i < 4; ++i) WR_STRING(h, s, Key(k::k2ndNetUrl, i), url.url2[i]);
    for (int i = 0; i < 4; ++i) WR_INT(h, s, Key(k::k2ndDimensionW, i), url.width2[i]);
    for (int i = 0; i < 4; ++i) WR_INT(h, s, Key(k::k2ndDimensionH, i), url.height2[i]);
  }
  if (counter) ++*counter;
}

void PHOTO_ITEM_INFO::ReadInfo(unsigned long h, const wchar_t* s) {
  itemName = RD_STRING(h, s, k::kItemName, itemName);
  originalName = RD_STRING(h, s, k::kOriginalName, originalName);
  photoId = RD_STRING(h, s, k::kItemId, photoId);
  width = RD_INT(h, s, k::kWidth, width);
  height = RD_INT(h, s, k::kHeight, height);
  originalWidth = RD_INT(h, s, k::kOriginalWidth, originalWidth);
  originalHeight = RD_INT(h, s, k::kOriginalHeight, originalHeight);
  dataType = RD_INT(h, s, k::kDataType, dataType);
  title = RD_STRING(h, s, k::kTitle, title);
  description = RD_STRING(h, s, k::kDescription, description);
  embedded = RD_STRING(h, s, k::kEmbedded, embedded);
  markerIconId = RD_STRING(h, s, k::kMarkerIconId, markerIconId);
  trackItemId = RD_STRING(h, s, k::kTrackItemId, trackItemId);
  playbackTime = RD_INT(h, s, k::kPlaybackTime, playbackTime);
  originalTime = RD_INT(h, s, k::kOriginalTime, originalTime);
  latitude = RD_FLOAT(h, s, k::kLatitude, latitude);
  longitude = RD_FLOAT(h, s, k::kLongitude, longitude);
  altitude = RD_FLOAT(h, s, k::kAltitude, altitude);
  speed = RD_INT(h, s, k::kSpeed, speed);
  url.dirty = RD_INT(h, s, k::kNetDirty, url.dirty) != 0;
  url.isPublic = RD_INT(h, s, k::kPublic, url.isPublic) != 0;
  url.serverId = RD_STRING(h, s, k::kServerId, url.serverId);
  for (int i = 0; i < 5; ++i) url.url[i] = RD_STRING(h, s, Key(k::kNetUrl, i), url.url[i]);
  for (int i = 0; i < 5; ++i) url.width[i] = RD_INT(h, s, Key(k::kDimensionW, i), url.width[i]);
  for (int i = 0; i < 5; ++i) url.height[i] = RD_INT(h, s, Key(k::kDimensionH, i), url.height[i]);
  url.dirty2 = RD_INT(h, s, k::k2ndDirty, url.dirty2) != 0;
  url.isPublic2 = RD_INT(h, s, k::k2ndPublic, url.isPublic2) != 0;
  url.server2 = static_cast<uint8_t>(RD_INT(h, s, k::k2ndServer, url.server2));
  url.serverId2 = RD_STRING(h, s, k::k2ndServerId, url.serverId2);
  for (int i = 0; i < 4; ++i) url.url2[i] = RD_STRING(h, s, Key(k::k2ndNetUrl, i), url.url2[i]);
  for (int i = 0; i < 4; ++i) url.width2[i] = RD_INT(h, s, Key(k::k2ndDimensionW, i), url.width2[i]);
  for (int i = 0; i < 4; ++i) url.height2[i] = RD_INT(h, s, Key(k::k2ndDimensionH, i), url.height2[i]);
}

CString PHOTO_ITEM_INFO::GetFilePathName() const {
  if (itemName.IsEmpty()) return {};
  // A name that would leave the trip's folder is not a photo of this trip.
  if (!IsPlainPathComponent(itemName)) return {};
  return trip ? PathJoin(trip->GetResourcePath(), itemName) : itemName;
}

CString PHOTO_ITEM_INFO::GetURLPathName() const {
  CString path = GetFilePathName();
  return path.IsEmpty() ? path : CString(L"file://") + path;
}

void PHOTO_ITEM_INFO::ResetTitleAndDescript() {
  title.Empty();
  description.Empty();
}
