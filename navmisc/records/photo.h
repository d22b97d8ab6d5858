// One photo of a trip, with its place on the trip's tracks and its web-publishing state.
#pragma once

#include <cstdint>

#include "navmisc/records/items.h"

class BLOG_ITEM_INFO;

class PHOTO_ITEM_INFO {
 public:
  // Kinds of located item in `dataType`.
  static constexpr int kTypePhoto = 0;
  static constexpr int kTypeMarker = 1;
  static constexpr int kTypeLandmark = 2;

  PHOTO_ITEM_INFO() = default;
  PHOTO_ITEM_INFO(const PHOTO_ITEM_INFO& other) = default;
  PHOTO_ITEM_INFO& operator=(const PHOTO_ITEM_INFO& other) = default;
  // A new photo of `trip`: a fresh "PH_" id, every other field at its default. The file names
  // are for the suite's photo import, which fills the record afterwards.
  PHOTO_ITEM_INFO(BLOG_ITEM_INFO* trip, const wchar_t* first, const wchar_t* second,
                  const wchar_t* third);
  // A copy of `from` for another trip: a fresh "PH_" id, the photo's files copied into the new
  // trip's folder, and the track association carried over to the new trip's matching track.
  PHOTO_ITEM_INFO(BLOG_ITEM_INFO* trip, PHOTO_ITEM_INFO* from);
  ~PHOTO_ITEM_INFO() = default;

  // Writes the photo's keys into `section` when `write` is non-zero; in every case adds one to
  // `*counter` when it is given.
  void WriteInfo(unsigned long handle, const wchar_t* section, int write, int* counter);
  void ReadInfo(unsigned long handle, const wchar_t* section);
  // The photo file in the trip's resource folder.
  CString GetFilePathName() const;
  // The photo as a file URL ("file:///..."), for pages that show it.
  CString GetURLPathName() const;
  // Title and description back to empty.
  void ResetTitleAndDescript();

  BLOG_ITEM_INFO* trip = nullptr;  // the trip the photo belongs to (not owned)
  CString itemName;                // file name in the trip's resource folder
  CString originalName;            // where the photo was imported from
  CString photoId;                 // "PH_" + 16 hex digits
  int32_t width = 0;               // pixels
  int32_t height = 0;
  int32_t originalWidth = 0;
  int32_t originalHeight = 0;
  int32_t dataType = kTypePhoto;
  CString title;
  CString description;
  CString embedded;
  CString markerIconId;
  double latitude = 0.0;           // degrees; 0/0 = not placed
  double longitude = 0.0;
  double altitude = 0.0;           // metres
  int32_t speed = 0;               // metres per hour
  CString trackItemId;             // the track the photo lies on
  int32_t playbackTime = 0;        // the photo's time on the track clock; below 1 = none
  int32_t originalTime = 0;        // the camera's time
  _PHOTO_ITEM_URL url;
};

// A new item id: `prefix` ("TK_" or "PH_") followed by the current time and GetUniqueID(), each
// as eight upper-case hexadecimal digits.
CString NewItemId(const wchar_t* prefix);
